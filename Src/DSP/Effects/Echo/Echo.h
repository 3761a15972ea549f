#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace EchoPrivate {

// The settings, the chunk after its first word, and a row of the preset table; pairs are left, right.
struct _transform_props {
    // Left, right.
    using Pair = std::array<std::int32_t, 2>;
    Pair decay;      // feedback gain, -300..100 tenths of dB, silent at -300
    Pair mix;        // 0..2000; times 0.0005 the wet fraction
    Pair depth;      // 0..10000, the delay time as the mode reads it; milliseconds in a preset
    Pair delayGain;  // gain of the echoes, -300..100 tenths of dB, silent at -300
    std::array<std::int32_t, 10> reserved;  // kept
    Pair outGain;                           // -960..200 tenths of dB, silent at -960
    Pair reserved2;                         // kept
    std::int32_t mode;                      // 0..4, see Echo
    std::int32_t modeCopy;                  // the same, for the right side
};
static_assert(sizeof(_transform_props) == 96);

struct Delay;

}  // namespace EchoPrivate

// Stereo delay with feedback; the two sides have their own time, gains and mix, and share the mode.
//
// Modes, parameters 2 and 3 ("Depth mode"; only 2 sets it): 0 "Time (linear)" 0..10 s, 1 "Time (log)"
// 20..4999 ms, 2 to 4 "Tempo (straight)", "(triplet)", "(dotted)": a part of the host's beat, from 1/256
// of it to a whole measure. Entering a time mode keeps the delay that is heard.
//
// Blocks are interleaved, mono or stereo; 64-bit samples are double, every other width is taken for
// float. Channels after the second pass unchanged, and so does everything when there was no memory for
// the ring. No latency. A delay is at least 10 samples, counted over both channels: a stereo stream is
// delayed by HALF the time that the control shows, in frames rounded up on the left and down on the right.
// A recursive comb filter: M. R. Schroeder, "Natural Sounding Artificial Reverberation", J. Audio Eng. Soc.
// 10 (1962).
//
// Memory: InitProcessing makes the ring for the largest time, 10 s, without touching it: a page of it is
// touched by the block whose sound first gets there. Only a tempo so slow that a note is longer grows it, up
// to 60 s, in the block that first needs it.
//
// Settings chunk: 100 bytes, the chunk tag and the settings, 24 words. Older layouts: exactly 92 bytes,
// without the mode, which becomes "Time (linear)"; and the oldest of 180 bytes, likewise.
//
// Feedback above 0 dB grows without bound.
class DSP_API Echo : public CorvoEffect {
public:
    Echo();
    ~Echo() override;
    using CorvoEffect::FitsOldChunk;

    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void Cleanup() override;                             // frees the ring; the next cook makes a new one
    void InitResetProcessingLight(bool reset) override;  // clears the ring, whatever `reset`
    std::wstring GetParameterFormattedText(int index, double value) override;
    float GetParamValueNormalizedFromText(int index, std::string text) override;
    // A preset's settings, with the delays in milliseconds. `preset` is 0..NumPresets()-1.
    static const EchoPrivate::_transform_props& GetPresetData(int preset);

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;

private:
    int Sides() const;
    bool InitState(bool reset);
    std::array<int, 2> PassFrames() const;
    bool LayRing(std::array<int, 2> lengths, bool reset);
    double DelayMs(std::int32_t mode, std::int32_t depth) const;
    void SetMode(std::int32_t mode);
    template <typename Sample>
    void Run(Sample* samples, std::array<int, 2> frames);

    EchoPrivate::_transform_props m_settings{};  // shared between the threads
    tWAVEFORMATEX m_format{};
    std::unique_ptr<EchoPrivate::Delay> m_delay;
    std::unique_ptr<float[]> m_ring;
    int m_capacity = 0;                // samples the ring can hold
    std::array<int, 2> m_lengths{};    // delays in samples, both channels counted
    std::array<int, 2> m_tail_left{};  // frames
};

}  // namespace Corvo::DSP
