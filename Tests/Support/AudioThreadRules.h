#pragma once

#include <string>

namespace TestSupport {

// Counts what the audio thread must not do: while one of these lives, every allocation, free, lock, sleep
// and throw of its thread is noted. The counters sit in front of the C library's own functions.
class AudioThreadRules {
public:
    AudioThreadRules();
    ~AudioThreadRules();
    AudioThreadRules(const AudioThreadRules&) = delete;
    AudioThreadRules& operator=(const AudioThreadRules&) = delete;

    // What was done, for example "2 allocations, 1 lock"; empty when nothing was.
    std::string Broken() const;

    // False where the counters cannot be put in front of the system's functions: under a sanitizer, which
    // has its own in that place, and on Windows.
    static bool CanCount();
};

// What a call does of it.
std::string BrokenBy(const auto& call) {
    const AudioThreadRules rules;
    call();
    return rules.Broken();
}

// While one of these lives, the allocations of its thread fail: one of them, after so many that do not, or it
// and all that follow. What is then lost for good is a leak that the address sanitizer reports, unless that
// is expected.
class FailingAllocations {
public:
    FailingAllocations(int after, bool lasting, bool losesMemory);
    ~FailingAllocations();
    FailingAllocations(const FailingAllocations&) = delete;
    FailingAllocations& operator=(const FailingAllocations&) = delete;

    bool Reached() const;  // whether one has failed

    // Where AudioThreadRules::CanCount, and under the address sanitizer.
    static bool CanFail();

private:
    [[maybe_unused]] bool m_losesMemory;
};

}  // namespace TestSupport
