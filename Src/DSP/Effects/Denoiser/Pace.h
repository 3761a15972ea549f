#pragma once

#include <algorithm>
#include <array>
#include <cstdint>

namespace Corvo::DSP::Denoising {

// Spreads the steps of a job that comes back every `period` samples over the ticks after it is due, by what
// the steps cost.
class Pace {
public:
    // `cost(step)` in any unit. The first job is due at `first`; it takes `ticks` ticks of `tick` samples.
    template <typename Cost>
    void Set(std::int64_t first, std::int64_t period, int ticks, int tick, int steps, Cost cost) {
        m_first = first;
        m_period = period;
        m_ticks = std::min<int>(ticks, kMostTicks);
        m_tick = tick;
        m_job = -1;
        m_end = {};
        double total = 0.0, done = 0.0;
        for (int step = 0; step < steps; ++step) total += static_cast<double>(cost(step));
        for (int step = 0; step < steps; ++step) {
            const double each = static_cast<double>(cost(step));
            const double middle = total > 0.0 ? (done + 0.5 * each) / total : 0.0;
            done += each;
            const int at = std::min(static_cast<int>(middle * m_ticks), m_ticks - 1);
            for (int later = at; later < m_ticks; ++later) m_end[static_cast<std::size_t>(later)] = step + 1;
        }
    }
    // Drops the job at hand; the next one begins when it is due.
    void Drop() { m_job = -1; }

    // Calls `run(job, step)` for the steps that belong to the tick at `now`.
    template <typename Run>
    void Tick(std::int64_t now, Run run) {
        if (now < m_first) return;
        const std::int64_t job = (now - m_first) / m_period;
        const auto tick = static_cast<std::size_t>((now - m_first) % m_period / m_tick);
        if (tick == 0) m_job = job;
        if (job != m_job || tick >= static_cast<std::size_t>(m_ticks)) return;
        for (int step = tick > 0 ? m_end[tick - 1] : 0; step < m_end[tick]; ++step) run(job, step);
    }

private:
    static constexpr int kMostTicks = 32;

    std::int64_t m_first = 0, m_period = 1, m_job = -1;
    int m_ticks = 1, m_tick = 1;
    std::array<int, kMostTicks> m_end{};  // after each tick
};

}  // namespace Corvo::DSP::Denoising
