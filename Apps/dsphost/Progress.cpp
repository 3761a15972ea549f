#include "Progress.h"

#include <algorithm>
#include <cstdio>

#include "Process.h"

namespace dsphost {
namespace {

constexpr auto kInterval = std::chrono::milliseconds(100);

std::string Clocked(double seconds) {
    const auto whole = static_cast<long long>(seconds + 0.5);
    char text[48];
    if (whole >= 3600)
        std::snprintf(text, sizeof text, "%lld:%02lld:%02lld", whole / 3600, whole / 60 % 60, whole % 60);
    else
        std::snprintf(text, sizeof text, "%lld:%02lld", whole / 60, whole % 60);
    return text;
}

}  // namespace

Progress::Progress(std::string what, int rate, std::optional<std::int64_t> totalFrames, bool quiet)
    : m_what(std::move(what)), m_rate(rate), m_total(totalFrames), m_visible(!quiet && IsTerminal(stderr)) {}

Progress::~Progress() { ClearProgress(); }

void Progress::Update(std::int64_t frames) {
    if (!m_visible) return;
    const auto now = Clock::now();
    if (now < m_next) return;
    m_next = now + kInterval;
    const double elapsed = std::chrono::duration<double>(now - m_start).count();
    const double done = static_cast<double>(frames);
    std::string line = m_what + ": " + Clocked(done / m_rate);
    if (m_total && *m_total > 0) {
        const double part = std::min(done / static_cast<double>(*m_total), 1.0);
        line += " of " + Clocked(static_cast<double>(*m_total) / m_rate) + ", " +
                std::to_string(static_cast<int>(100.0 * part)) + " %";
        if (part > 0.0) line += ", " + Clocked(elapsed / part - elapsed) + " left";
    }
    if (elapsed > 0.0) {
        char speed[48];
        std::snprintf(speed, sizeof speed, ", %.0fx real time", done / m_rate / elapsed);
        line += speed;
    }
    ShowProgress(line);
}

}  // namespace dsphost
