#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "Drawing/Backends/SlotCache.h"

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
    Corvo::SlotCache<Key, int, 8> cache;
    std::vector<int> alive;  // the one used last at the end
    const auto release = [&](int resource) {
        ASSERT_EQ(resource, alive.at(0));
        alive.erase(alive.begin());
    };
    std::uint32_t seed = 1;
    for (int i = 0; i < 5000; ++i) {
        seed = seed * 1664525u + 1013904223u;
        const int key = static_cast<int>(seed >> 24) % 13;
        const bool hit = std::ranges::count(alive, key) > 0;
        bool made = false;
        EXPECT_EQ(cache.Find(
                      {key}, [&] { return made = true, key; }, release),
                  key);
        EXPECT_NE(made, hit) << i;
        std::erase(alive, key);
        alive.push_back(key);
        ASSERT_LE(alive.size(), 8u);
    }
    cache.Clear([&](int resource) { EXPECT_EQ(std::erase(alive, resource), 1u); });
    EXPECT_TRUE(alive.empty());
}
