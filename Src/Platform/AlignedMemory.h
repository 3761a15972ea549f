#pragma once

#include <cstddef>
#include <memory>
#include <new>

#include "Platform/Export.h"

namespace Corvo {

// Memory aligned to a cache line (64 bytes) from the platform's aligned allocator. Null when there is
// none left; freeing null does nothing.
DSP_API void* AlignedAllocate(std::size_t bytes) noexcept;
DSP_API void AlignedFree(void* memory) noexcept;

// For std::vector and its kin; throws std::bad_alloc as they expect.
template <typename T>
struct AlignedAllocator {
    using value_type = T;
    AlignedAllocator() = default;
    template <typename U>
    AlignedAllocator(const AlignedAllocator<U>&) noexcept {}
    T* allocate(std::size_t count) {
        if (count > static_cast<std::size_t>(-1) / sizeof(T)) throw std::bad_array_new_length();
        if (void* memory = AlignedAllocate(count * sizeof(T))) return static_cast<T*>(memory);
        throw std::bad_alloc();
    }
    void deallocate(T* memory, std::size_t) noexcept { AlignedFree(memory); }
    template <typename U>
    bool operator==(const AlignedAllocator<U>&) const noexcept {
        return true;
    }
};

}  // namespace Corvo
