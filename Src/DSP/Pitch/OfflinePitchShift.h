#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "DSP/Pitch/PitchAdapter.h"
#include "Platform/Export.h"

namespace Corvo::DSP {

// Shifts the pitch of a whole recording: what comes out stands where it stood and, but for the speed, is as
// long as what went in.
//
// Construct, Feed block by block, Finish; in between and afterwards Take what is there. Interleaved floats.
// Allocates as it goes: for offline use. One thread at a time. Cost: its engine's, see PitchAdapter, and
// memory for what was not taken yet.
class DSP_API OfflinePitchShift {
public:
    // As in PitchAdapterInfo::GetPitchAdapters().
    enum class Engine { Classic, New };
    // What is done to the recording.
    struct Settings {
        int rate = 48000;             // Hz, 1000..768000; above 192000 it counts as that
        int channels = 2;             // 1 or 2
        double semitones = 0.0;       // -36..36
        Engine engine = Engine::New;  // which back-end does the work
        int quality = 0;              // from 0, fastest first: PitchAdapterInfo::GetQualities
        double speed = 1.0;           // 0.1..10, for New only: how fast it plays, pitch along with it
    };

    // Throws std::invalid_argument with a sentence for settings outside their ranges.
    explicit OfflinePitchShift(const Settings& settings);
    ~OfflinePitchShift();
    OfflinePitchShift(const OfflinePitchShift&) = delete;
    OfflinePitchShift& operator=(const OfflinePitchShift&) = delete;

    // Takes the next `frames` frames, copied; none for 0 or below. Throws std::bad_alloc.
    void Feed(const float* samples, int frames);
    // The recording has ended; after that nothing is fed.
    void Finish();
    // Frames that can be taken now. All of them after Finish: the frames fed, divided by the speed; one fewer
    // where rounding has it so.
    std::int64_t Available() const;
    // Takes at most `frames` frames and returns how many they were.
    int Take(float* samples, int frames);

private:
    void Keep(const float* samples, int frames);

    std::unique_ptr<PitchAdapter> m_adapter;
    std::size_t m_channels;
    float m_speed;
    std::int64_t m_delay;  // frames still to be left out
    int m_padding;         // of silence, which makes up for them at the end
    std::int64_t m_fed = 0, m_kept = 0;
    std::vector<float> m_block, m_ready;
    std::size_t m_taken = 0;  // samples of m_ready
};

}  // namespace Corvo::DSP
