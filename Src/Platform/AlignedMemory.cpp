#include "Platform/AlignedMemory.h"

#if defined(_WIN32)
#include <malloc.h>
#else
#include <cstdlib>
#endif

namespace Corvo {
namespace {
constexpr std::size_t kAlignment = 64;
}

#if defined(_WIN32)
void* AlignedAllocate(std::size_t bytes) noexcept { return _aligned_malloc(bytes ? bytes : 1, kAlignment); }
void AlignedFree(void* memory) noexcept { _aligned_free(memory); }
#else
void* AlignedAllocate(std::size_t bytes) noexcept {
    // aligned_alloc wants a multiple of the alignment.
    const std::size_t rounded = (bytes + kAlignment - 1) / kAlignment * kAlignment;
    if (rounded < bytes) return nullptr;
    return std::aligned_alloc(kAlignment, rounded ? rounded : kAlignment);
}
void AlignedFree(void* memory) noexcept { std::free(memory); }
#endif

}  // namespace Corvo
