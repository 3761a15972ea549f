#pragma once

#include <cstddef>
#include <new>
#include <utility>
#include <vector>

namespace Corvo {

// Zeroed memory, aligned to a cache line; of a large piece the system gives a page when it is first used.
// Null when there is none left. It is given back with the size it was asked for.
void* ZeroedAllocate(std::size_t bytes) noexcept;
void ZeroedFree(void* memory, std::size_t bytes) noexcept;

template <typename T>
struct ZeroedAllocator {
    using value_type = T;
    ZeroedAllocator() = default;
    template <typename U>
    ZeroedAllocator(const ZeroedAllocator<U>&) noexcept {}
    T* allocate(std::size_t count) {
        if (count > static_cast<std::size_t>(-1) / sizeof(T)) throw std::bad_array_new_length();
        if (void* const memory = ZeroedAllocate(count * sizeof(T))) return static_cast<T*>(memory);
        throw std::bad_alloc();
    }
    void deallocate(T* memory, std::size_t count) noexcept { ZeroedFree(memory, count * sizeof(T)); }
    // What a vector makes without a value is zero already.
    template <typename U>
    void construct(U*) const noexcept {}
    template <typename U, typename Value>
    void construct(U* place, Value&& value) const {
        new (static_cast<void*>(place)) U(std::forward<Value>(value));
    }
    template <typename U>
    bool operator==(const ZeroedAllocator<U>&) const noexcept {
        return true;
    }
};

// Many zeros, of which most may never be used. Another number of them is made anew: `resize` would leave what
// was there before.
template <typename T>
using UntouchedZeros = std::vector<T, ZeroedAllocator<T>>;

}  // namespace Corvo
