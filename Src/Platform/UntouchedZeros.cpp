#include "Platform/UntouchedZeros.h"

#include <cstring>

#include "Platform/AlignedMemory.h"
#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
#else
#include <sys/mman.h>
#endif

namespace Corvo {
namespace {

// Larger pieces come straight from the system, which hands out zeroed pages; memory that the heap uses again
// would have to be cleared.
constexpr std::size_t kLarge = 64 * 1024;

#if defined(_WIN32)
void* Map(std::size_t bytes) {
    return VirtualAlloc(nullptr, bytes, MEM_RESERVE | MEM_COMMIT, PAGE_READWRITE);
}
void Unmap(void* memory, std::size_t) { VirtualFree(memory, 0, MEM_RELEASE); }
#else
void* Map(std::size_t bytes) {
    void* const memory = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    return memory == MAP_FAILED ? nullptr : memory;
}
void Unmap(void* memory, std::size_t bytes) { munmap(memory, bytes); }
#endif

}  // namespace

void* ZeroedAllocate(std::size_t bytes) noexcept {
    if (bytes >= kLarge) return Map(bytes);
    void* const memory = AlignedAllocate(bytes);
    return memory ? std::memset(memory, 0, bytes) : nullptr;
}

void ZeroedFree(void* memory, std::size_t bytes) noexcept {
    if (bytes >= kLarge)
        Unmap(memory, bytes);
    else
        AlignedFree(memory);
}

}  // namespace Corvo
