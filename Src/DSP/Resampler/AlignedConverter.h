#pragma once

#include <cstdint>

#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Platform/Export.h"

// How one sample is stored, little-endian, channels interleaved.
enum class StoredSample : int { Int16, Int24, Float, Double };

// A sample-rate conversion whose output stands where the input stood: the filter's delay is taken out, and a
// recording of n frames becomes round(n * factor) frames. Equal rates are copied from one sample format to
// the other.
//
// Construct, Convert block by block, then Finish until it returns 0. One thread at a time; Convert and
// Finish neither allocate nor throw, and take some nanoseconds a frame.
class DSP_API AlignedConverter {
public:
    // What is converted into what.
    struct Settings {
        int inRate = 48000, outRate = 48000;                                 // Hz, 1000..768000
        int channels = 2;                                                    // 1..48
        StoredSample in = StoredSample::Double, out = StoredSample::Double;  // in the buffers
        // Any ratio of whole numbers. Else the nearest with factors up to 49, which is quicker where the
        // exact ones are large, but may miss the rate: compare Up() / Down().
        bool exact = true;
        // For `ditherBits`, 16 or 24, which may be fewer than the output has: for a host that shortens words
        // itself. 0: as many as the output has.
        DitherCurve dither = DitherCurve::None;
        int ditherBits = 0;
    };

    // Throws std::invalid_argument with a sentence for settings outside their ranges, and std::bad_alloc.
    explicit AlignedConverter(const Settings& settings);
    ~AlignedConverter();
    AlignedConverter(const AlignedConverter&) = delete;
    AlignedConverter& operator=(const AlignedConverter&) = delete;

    // Output frames for one frame of input, as `Up() / Down()`.
    int Up() const { return m_up; }
    int Down() const { return m_down; }
    // How many frames a recording of so many becomes.
    std::int64_t FramesOut(std::int64_t framesIn) const;
    // The most that Convert writes for a block of so many.
    std::int64_t MostFrames(std::int64_t frames) const;

    // Converts `frames` frames and returns how many were written, at most MostFrames(frames); fewer at the
    // beginning, while the filter fills. The buffers must not overlap. Nothing for frames below 1.
    int Convert(const void* in, int frames, void* out);
    // What is left after the last block, at most `frames` frames; 0 when everything has come.
    int Finish(void* out, int frames);

private:
    int Store(const void* in, int frames, void* out);
    int Limited(int written);

    Settings m_settings;
    SamplingFrequencyConverter m_core;
    CDither<double> m_dither[SamplingFrequencyConverter::kMaxChannels];
    int m_up = 1, m_down = 1;
    std::int64_t m_taken = 0, m_given = 0;
    bool m_finished = false;
};
