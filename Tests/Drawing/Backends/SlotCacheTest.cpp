#include <gtest/gtest.h>

#include <map>
#include <stdexcept>
#include <vector>

#include "Drawing/Backends/ResourceKeys.h"
#include "Drawing/Backends/SlotCache.h"

using namespace Corvo;

namespace {

// Many keys share each hash.
struct Key {
    int value = -1;
    bool operator==(const Key&) const = default;
};

}  // namespace

template <>
struct std::hash<Key> {
    std::size_t operator()(const Key& key) const { return static_cast<std::size_t>(key.value % 3); }
};

// Catches a chain that loses or repeats a slot, the wrong one freed, and one freed twice or never: against a
// list of what was used last.
TEST(SlotCache, KeepsWhatWasUsedLast) {
    constexpr std::size_t kSize = 8;
    SlotCache<Key, int, kSize> cache;
    std::vector<int> latest, alive;  // keys, the newest last
    std::uint32_t seed = 1;
    for (int i = 0; i < 5000; ++i) {
        seed = seed * 1664525u + 1013904223u;
        const int key = static_cast<int>(seed >> 24) % 13;
        const auto known = std::ranges::find(latest, key);
        const bool hit = known != latest.end();
        if (hit) latest.erase(known);
        const bool fails = !hit && i % 17 == 0;
        bool made = false;
        const auto find = [&] {
            return cache.Find(
                {key},
                [&] {
                    if (fails) throw std::runtime_error("no memory");
                    made = true;
                    alive.push_back(key);
                    return 100 + key;
                },
                [&](int resource) {
                    ASSERT_FALSE(latest.empty());
                    EXPECT_EQ(resource, 100 + latest.front());
                    latest.erase(latest.begin());
                    std::erase(alive, resource - 100);
                });
        };
        if (fails) {
            EXPECT_THROW(find(), std::runtime_error);
            continue;
        }
        EXPECT_EQ(find(), 100 + key);
        EXPECT_NE(made, hit) << i;
        latest.push_back(key);
        EXPECT_EQ(alive.size(), latest.size());
        EXPECT_LE(alive.size(), kSize);
    }
    cache.Clear([&](int resource) { EXPECT_EQ(std::erase(alive, resource - 100), 1u); });
    EXPECT_TRUE(alive.empty());
}

// Catches hashes that put the texts of a picture on one heap, where every look-up would compare them all.
TEST(SlotCache, TextsSpread) {
    std::map<std::size_t, int> sharing;
    int most = 0;
    for (int number = 0; number < 256; ++number)
        for (const float size : {11.0f, 22.0f}) {
            const TextKey key(std::to_string(number), size);
            most = std::max(most, ++sharing[std::hash<TextKey>{}(key) % kKeptTexts]);
        }
    EXPECT_LE(most, 10);
}
