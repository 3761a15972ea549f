#include "Support/AudioThreadRules.h"

#include <array>
#include <cerrno>
#include <cstddef>

#include "Support/Sanitizers.h"

// The sanitizer's own functions stand behind malloc; operator new is replaced alone.
#define REPLACES_NEW WITH_ADDRESS_SANITIZER
#if defined(__linux__) && !WITH_ADDRESS_SANITIZER && !WITH_THREAD_SANITIZER
#define COUNTS_CALLS 1
#else
#define COUNTS_CALLS 0
#endif

#if REPLACES_NEW
#include <sanitizer/lsan_interface.h>

#include <cstdlib>
#include <new>
#elif COUNTS_CALLS
#include <dlfcn.h>
#include <pthread.h>
#include <sys/mman.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

#include <typeinfo>
#endif

namespace TestSupport {
namespace {

enum Kind { kAllocation, kFree, kLock, kWait, kThrow, kKinds };
constexpr std::array<const char*, kKinds> kNames{"allocations", "frees", "locks", "waits", "throws"};

thread_local bool t_counting = false;
thread_local int t_untilFailure = -1;  // allocations; below 0 none fails
thread_local bool t_failureLasts = false, t_failed = false;
thread_local std::array<int, kKinds> t_counts{};

#if COUNTS_CALLS || REPLACES_NEW
void Note(Kind kind) {
    if (t_counting) ++t_counts[kind];
}

// An allocation, if it may be had.
template <typename Allocate>
void* Allocated(Allocate allocate) {
    Note(kAllocation);
    if (t_untilFailure == 0) {
        t_failed = true;
        if (!t_failureLasts) t_untilFailure = -1;
        errno = ENOMEM;
        return nullptr;
    }
    if (t_untilFailure > 0) --t_untilFailure;
    return allocate();
}
#endif

#if REPLACES_NEW
constexpr std::size_t kUsualAlignment = __STDCPP_DEFAULT_NEW_ALIGNMENT__;

void* NewOrNull(std::size_t size, std::size_t alignment = kUsualAlignment) {
    return Allocated([=] {
        void* place = nullptr;
        return posix_memalign(&place, alignment, size) == 0 ? place : nullptr;
    });
}
void* New(std::size_t size, std::size_t alignment = kUsualAlignment) {
    if (void* const memory = NewOrNull(size, alignment)) return memory;
    throw std::bad_alloc();
}
#endif

#if COUNTS_CALLS

// Notes it and goes on with the system's own function.
template <typename Function>
auto Pass(Kind kind, const char* name, auto... arguments) {
    static const auto next = reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
    Note(kind);
    return next(arguments...);
}
#endif

}  // namespace

AudioThreadRules::AudioThreadRules() {
    t_counts = {};
    t_counting = true;
}

AudioThreadRules::~AudioThreadRules() { t_counting = false; }

std::string AudioThreadRules::Broken() const {
    t_counting = false;
    std::string text;
    for (std::size_t kind = 0; kind < kKinds; ++kind)
        if (t_counts[kind] > 0)
            text += (text.empty() ? "" : ", ") + std::to_string(t_counts[kind]) + " " + kNames[kind];
    t_counting = true;
    return text;
}

FailingAllocations::FailingAllocations(int after, bool lasting, bool losesMemory)
    : m_losesMemory(losesMemory) {
#if REPLACES_NEW
    if (m_losesMemory) __lsan_disable();
#endif
    t_untilFailure = after;
    t_failureLasts = lasting;
    t_failed = false;
}

FailingAllocations::~FailingAllocations() {
    t_untilFailure = -1;
#if REPLACES_NEW
    if (m_losesMemory) __lsan_enable();
#endif
}

bool FailingAllocations::Reached() const { return t_failed; }

bool AudioThreadRules::CanCount() { return COUNTS_CALLS; }
bool FailingAllocations::CanFail() { return REPLACES_NEW || COUNTS_CALLS; }

}  // namespace TestSupport

#if REPLACES_NEW
using TestSupport::New;
using TestSupport::NewOrNull;
void* operator new(std::size_t size) { return New(size); }
void* operator new[](std::size_t size) { return New(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept { return NewOrNull(size); }
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept { return NewOrNull(size); }
void* operator new(std::size_t size, std::align_val_t alignment) {
    return New(size, static_cast<std::size_t>(alignment));
}
void* operator new[](std::size_t size, std::align_val_t alignment) {
    return New(size, static_cast<std::size_t>(alignment));
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete(void* memory, std::align_val_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::align_val_t) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t, std::align_val_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t, std::align_val_t) noexcept { std::free(memory); }
#endif

#if COUNTS_CALLS
using namespace TestSupport;

extern "C" {
void* __libc_malloc(std::size_t);
void* __libc_calloc(std::size_t, std::size_t);
void* __libc_realloc(void*, std::size_t);
void* __libc_memalign(std::size_t, std::size_t);
void __libc_free(void*);

void* malloc(std::size_t size) {
    return Allocated([=] { return __libc_malloc(size); });
}
void* calloc(std::size_t count, std::size_t size) {
    return Allocated([=] { return __libc_calloc(count, size); });
}
void* realloc(void* memory, std::size_t size) {
    return Allocated([=] { return __libc_realloc(memory, size); });
}
void* aligned_alloc(std::size_t alignment, std::size_t size) {
    return Allocated([=] { return __libc_memalign(alignment, size); });
}
int posix_memalign(void** memory, std::size_t alignment, std::size_t size) {
    *memory = Allocated([=] { return __libc_memalign(alignment, size); });
    return *memory ? 0 : ENOMEM;
}
void free(void* memory) {
    if (memory) Note(kFree);
    __libc_free(memory);
}
// Large pieces are mapped. What the C library maps for itself does not come by here.
void* mmap(void* address, std::size_t bytes, int protection, int flags, int file, off_t offset) noexcept {
    const auto map = [=] {
        return reinterpret_cast<void*>(syscall(SYS_mmap, address, bytes, protection, flags, file, offset));
    };
    if (!(flags & MAP_ANONYMOUS) || !(flags & MAP_PRIVATE)) return map();
    void* const memory = Allocated(map);
    return memory ? memory : MAP_FAILED;
}
int munmap(void* memory, std::size_t bytes) noexcept {
    Note(kFree);
    return static_cast<int>(syscall(SYS_munmap, memory, bytes));
}

// Trying a lock is allowed; only a lock that can wait counts. A condition is waited for under such a lock.
int pthread_mutex_lock(pthread_mutex_t* mutex) {
    return Pass<int(pthread_mutex_t*)>(kLock, "pthread_mutex_lock", mutex);
}
int clock_nanosleep(clockid_t clock, int flags, const timespec* time, timespec* rest) {
    using Sleep = int(clockid_t, int, const timespec*, timespec*);
    return Pass<Sleep>(kWait, "clock_nanosleep", clock, flags, time, rest);
}
int nanosleep(const timespec* time, timespec* rest) {
    return Pass<int(const timespec*, timespec*)>(kWait, "nanosleep", time, rest);
}
int sched_yield() noexcept { return Pass<int()>(kWait, "sched_yield"); }
[[noreturn]] void __cxa_throw(void* object, std::type_info* type, void (*destroy)(void*)) {
    Pass<void(void*, std::type_info*, void (*)(void*))>(kThrow, "__cxa_throw", object, type, destroy);
    __builtin_unreachable();
}
}
#endif
