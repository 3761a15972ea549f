#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>

#include "DSP/Parts/Arena.h"

namespace Corvo::DSP {

// What is known of the voice and what is to become of it, frame by frame; the newest 256 frames.
class PitchTrack {
public:
    struct Frame {
        double place = 0.0;       // in the stream, in samples
        double hz = 0.0;          // 0: unvoiced
        double cents = 0.0;       // see PitchScale; of a voiced frame
        double correction = 0.0;  // cents
        int note = -1;            // MIDI number; -1: none decided
        double noteCents = 0.0;   // where the note stands
        double steady = 0.0;      // the cents without outliers
    };

    explicit PitchTrack(double rate) : m_rate(rate) {}
    void Prepare(Arena& arena) { m_frames = {arena.Take<Frame>(kKept), kKept}; }
    void Clear() { m_count = 0; }
    Frame& Add(const Frame& frame) { return At(m_count++) = frame; }
    std::int64_t Count() const { return m_count; }
    // Frame `index` of all since Clear, one of the newest.
    Frame& At(std::int64_t index) { return m_frames[static_cast<std::size_t>(index) % m_frames.size()]; }
    const Frame& At(std::int64_t index) const {
        return m_frames[static_cast<std::size_t>(index) % m_frames.size()];
    }
    // Place of the newest frame; -1 before the first.
    double Known() const { return m_count > 0 ? At(m_count - 1).place : -1.0; }
    void Rebase(double samples) {
        for (auto& frame : m_frames) frame.place -= samples;
    }

    bool IsVoiced(double place) const { return m_count > 0 && At(Before(place)).hz > 0.0; }

    // In samples; of the newest voiced frame where the place is not voiced.
    double Period(double place) const {
        if (m_count == 0) return m_rate / kAnyHz;
        const std::int64_t index = Before(place);
        if (At(index).hz > 0.0) {
            const double here = m_rate / At(index).hz;
            if (index + 1 == m_count || At(index + 1).hz <= 0.0) return here;
            const double share = Share(index, place);
            return here * (1.0 - share) + m_rate / At(index + 1).hz * share;
        }
        for (std::int64_t i = m_count; i-- > Oldest();)
            if (At(i).hz > 0.0) return m_rate / At(i).hz;
        return m_rate / kAnyHz;
    }

    // In cents. Behind the newest frame it goes on as it moved within the note.
    double Correction(double place) const {
        if (m_count == 0) return 0.0;
        const std::int64_t index = Before(place);
        const Frame& here = At(index);
        if (index + 1 < m_count) {
            const double share = Share(index, place);
            return here.correction * (1.0 - share) + At(index + 1).correction * share;
        }
        if (m_count <= kSlopeFrames) return here.correction;
        const Frame& before = At(index - kSlopeFrames);
        const bool sameNote =
            before.hz > 0.0 && here.hz > 0.0 && before.note >= 0 && before.note == here.note;
        if (!sameNote || here.place <= before.place) return here.correction;
        const double perReferenceSample = m_rate / kReferenceRate;
        const double steepest = kSteepest / perReferenceSample;
        const double slope = std::clamp((here.correction - before.correction) / (here.place - before.place),
                                        -steepest, steepest);
        return here.correction + slope * std::clamp(place - here.place, 0.0, kFarthest * perReferenceSample);
    }

private:
    static constexpr std::size_t kKept = 256;
    static constexpr double kReferenceRate = 48000.0, kAnyHz = 120.0;
    static constexpr int kSlopeFrames = 3;
    static constexpr double kSteepest = 0.06, kFarthest = 400.0;  // cents per sample and samples at 48 kHz

    std::int64_t Oldest() const {
        return std::max<std::int64_t>(m_count - static_cast<std::int64_t>(m_frames.size()), 0);
    }
    // The newest frame that is not behind `place`, or the oldest.
    std::int64_t Before(double place) const {
        std::int64_t index = m_count - 1;
        while (index > Oldest() && At(index).place > place) --index;
        return index;
    }
    // How far `place` is on the way from a frame to the next.
    double Share(std::int64_t index, double place) const {
        const double distance = std::max(At(index + 1).place - At(index).place, 1.0);
        return std::clamp((place - At(index).place) / distance, 0.0, 1.0);
    }

    double m_rate;
    std::span<Frame> m_frames;
    std::int64_t m_count = 0;
};

}  // namespace Corvo::DSP
