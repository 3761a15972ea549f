#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>

namespace Corvo {

// Keeps a few of a back-end's resources by key; a new one takes the place of the one that was used longest
// ago. Found by the key's hash, so that a large cache costs no more per look-up than a small one; only making
// a resource looks at all of them. Allocates nothing itself.
template <typename Key, typename Resource, std::size_t Size>
class SlotCache {
public:
    SlotCache() { m_first.fill(kNone); }

    // The key's resource: kept, or make()'s result, for which release(resource) may free an older one.
    template <typename Make, typename Release>
    Resource& Find(const Key& key, Make make, Release release) {
        ++m_now;
        Link& first = FirstOf(key);
        for (Link at = first; at != kNone; at = m_next[at])
            if (m_slots[at].key == key) {
                m_used[at] = m_now;
                return m_slots[at].resource;
            }
        const Link free = Free(release);
        m_slots[free].resource = make();
        m_slots[free].key = key;
        m_used[free] = m_now;
        m_next[free] = first;
        first = free;
        return m_slots[free].resource;
    }

    template <typename Release>
    void Clear(Release release) {
        for (std::size_t i = 0; i < Size; ++i)
            if (m_used[i] != 0) release(m_slots[i].resource);
        m_slots.fill(Slot{});
        m_used.fill(0);
        m_first.fill(kNone);
    }

private:
    using Link = std::uint16_t;  // the index of a slot
    static constexpr Link kNone = 0xFFFF;
    static_assert(Size > 0 && Size < kNone);

    struct Slot {
        Key key{};
        Resource resource{};
    };

    // Where the slots of all keys with this hash begin.
    Link& FirstOf(const Key& key) { return m_first[std::hash<Key>{}(key) % Size]; }

    // The slot used longest ago, emptied; it stays free should the making of a resource throw.
    template <typename Release>
    Link Free(Release release) {
        const auto oldest =
            static_cast<Link>(std::min_element(m_used.begin(), m_used.end()) - m_used.begin());
        if (m_used[oldest] == 0) return oldest;
        Link* link = &FirstOf(m_slots[oldest].key);
        while (*link != oldest) link = &m_next[*link];
        *link = m_next[oldest];
        m_used[oldest] = 0;
        release(m_slots[oldest].resource);
        return oldest;
    }

    std::array<Slot, Size> m_slots{};
    std::array<std::uint64_t, Size> m_used{};  // when last; 0: free
    std::array<Link, Size> m_first;            // of the slots whose keys share a hash
    std::array<Link, Size> m_next{};
    std::uint64_t m_now = 0;
};

}  // namespace Corvo
