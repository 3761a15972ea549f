#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace Corvo {

// Keeps a few of a back-end's resources by key; a new one takes the place of the one that was used longest
// ago. Allocates nothing itself.
template <typename Key, typename Resource, std::size_t Size>
class SlotCache {
public:
    // The key's resource: kept, or make()'s result, for which release(resource) may free an older one.
    template <typename Make, typename Release>
    Resource& Find(const Key& key, Make make, Release release) {
        ++m_now;
        Slot* oldest = &m_slots[0];
        for (Slot& slot : m_slots) {
            if (slot.used != 0 && slot.key == key) {
                slot.used = m_now;
                return slot.resource;
            }
            if (slot.used < oldest->used) oldest = &slot;
        }
        if (oldest->used != 0) release(oldest->resource);
        oldest->used = 0;  // stays free should make() throw
        oldest->resource = make();
        oldest->key = key;
        oldest->used = m_now;
        return oldest->resource;
    }

    template <typename Release>
    void Clear(Release release) {
        for (Slot& slot : m_slots) {
            if (slot.used != 0) release(slot.resource);
            slot = Slot{};
        }
    }

private:
    struct Slot {
        Key key{};
        Resource resource{};
        std::uint64_t used = 0;  // 0: free
    };
    std::array<Slot, Size> m_slots{};
    std::uint64_t m_now = 0;
};

}  // namespace Corvo
