#include "Spectrum/Sonogram/SonogramHistory.h"

#include <algorithm>

namespace Corvo {
namespace {

std::int64_t DividedUp(std::int64_t a, std::int64_t b) { return a / b + (a % b > 0 ? 1 : 0); }

}  // namespace

ColumnRange SonogramStretch::Within(std::int64_t since, std::int64_t to) const {
    const std::int64_t twice = 2 * std::int64_t{scale.ticks}, columns = Columns();
    const auto firstFrom = [&](std::int64_t tick) {
        return std::clamp<std::int64_t>(DividedUp(2 * (tick - begin) - scale.ticks, twice), 0, columns);
    };
    const std::int64_t first = firstFrom(since), end = firstFrom(to), middle = since + to - 2 * begin;
    if (first < end) return {static_cast<int>(first), static_cast<int>(end)};
    if (middle < 0 || middle >= twice * columns) return {0, 0};
    const auto at = static_cast<int>(middle / twice);
    return {at, at + 1};
}

float SonogramHistory::Hear(float hz) {
    const auto since = m_trace.Hear(hz, m_now);
    if (!since) return -hz;
    for (auto past = m_stretches.rbegin(); past != m_stretches.rend() && past->End() > *since; ++past)
        for (int i = past->Columns();
             i-- > 0 && past->begin + std::int64_t{i} * past->scale.ticks >= *since;) {
            float& pitch = past->pitches[static_cast<std::size_t>(i)];
            if (pitch > 0.0f) return hz;  // and so is what came before
            pitch = -pitch;
        }
    return hz;
}

std::uint8_t* SonogramHistory::Add(const SonogramScale& scale, float pitch) {
    const auto height = static_cast<std::size_t>(scale.axis.height);
    if (m_stretches.empty() || m_stretches.back().scale != scale || m_stretches.back().End() != m_now ||
        m_stretches.back().Columns() == SonogramStretch::kMostColumns) {
        SonogramStretch next{scale, m_now, {}, {}};
        // The memory of what goes.
        while (!m_stretches.empty() && Surplus() >= m_stretches.front().Columns()) {
            SonogramStretch& oldest = m_stretches.front();
            m_levels -= oldest.levels.size();
            next.levels = std::move(oldest.levels);
            next.pitches = std::move(oldest.pitches);
            m_stretches.pop_front();
        }
        next.levels.clear();
        next.pitches.clear();
        if (!m_stretches.empty()) m_stretches.back().levels.shrink_to_fit();
        next.levels.reserve(height * SonogramStretch::kMostColumns);
        next.pitches.reserve(SonogramStretch::kMostColumns);
        m_stretches.push_back(std::move(next));
    }
    SonogramStretch& newest = m_stretches.back();
    const std::size_t before = newest.levels.size();
    newest.levels.resize(before + height);
    newest.pitches.push_back(pitch);
    m_levels += height;
    m_now += scale.ticks;
    return newest.levels.data() + before;
}

void SonogramHistory::Clear() {
    m_stretches.clear();
    m_levels = 0;
    m_trace = {};
}

// Columns of the oldest stretch that need not be kept.
int SonogramHistory::Surplus() const {
    const SonogramStretch& oldest = m_stretches.front();
    if (m_levels <= m_kept) return 0;
    const auto height = static_cast<std::size_t>(std::max(oldest.scale.axis.height, 1));
    return static_cast<int>(std::min((m_levels - m_kept) / height, oldest.pitches.size()));
}

std::int64_t SonogramHistory::Oldest() const {
    if (m_stretches.empty()) return m_now;
    const SonogramStretch& oldest = m_stretches.front();
    return oldest.begin + std::int64_t{Surplus()} * oldest.scale.ticks;
}

}  // namespace Corvo
