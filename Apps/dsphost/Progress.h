#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

namespace dsphost {

// One line on standard error that renews itself: how much is done, time left, speed as a multiple of real
// time. Silent where standard error is no terminal, and with -q.
class Progress {
public:
    // `totalFrames`: nothing when the length is unknown.
    Progress(std::string what, int rate, std::optional<std::int64_t> totalFrames, bool quiet);
    ~Progress();  // clears the line

    void Update(std::int64_t frames);

private:
    using Clock = std::chrono::steady_clock;

    std::string m_what;
    int m_rate;
    std::optional<std::int64_t> m_total;
    bool m_visible;
    Clock::time_point m_start = Clock::now(), m_next = m_start;
};

}  // namespace dsphost
