#pragma once

#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
#else
#include <mutex>
#endif

namespace Corvo {

// A re-entrant lock: the Windows critical section there, a recursive mutex elsewhere.
// The operations are named so that std::lock_guard and std::unique_lock take it.
class CriticalSection {
public:
#if defined(_WIN32)
    CriticalSection() { InitializeCriticalSection(&m_section); }
    ~CriticalSection() { DeleteCriticalSection(&m_section); }
    void lock() { EnterCriticalSection(&m_section); }
    bool try_lock() { return TryEnterCriticalSection(&m_section) != 0; }
    void unlock() { LeaveCriticalSection(&m_section); }
#else
    CriticalSection() = default;
    ~CriticalSection() = default;
    void lock() { m_section.lock(); }
    bool try_lock() { return m_section.try_lock(); }
    void unlock() { m_section.unlock(); }
#endif
    CriticalSection(const CriticalSection&) = delete;
    CriticalSection& operator=(const CriticalSection&) = delete;

private:
#if defined(_WIN32)
    CRITICAL_SECTION m_section;
#else
    std::recursive_mutex m_section;
#endif
};

}  // namespace Corvo
