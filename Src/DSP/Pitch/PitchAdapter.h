#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Platform/Export.h"

namespace Corvo::DSP {

// Describes one pitch-shift back-end. The library's two are statics that live as long as it does.
class DSP_API PitchAdapterInfo {
public:
    static constexpr int kCount = 2;            // of the library's own
    static PitchAdapterInfo* const OldCorvo;    // "Classic"
    static PitchAdapterInfo* const SoundTouch;  // "New"

    explicit PitchAdapterInfo(const std::string& name);  // no choice of sizes or qualities

    // As users see it.
    std::string GetName() const;
    // The values that PitchAdapter::SetFFTSize and SetQuality index; empty where there is no choice.
    virtual std::vector<int> GetFFTSizes() const;
    virtual std::vector<int> GetQualities() const;

    // "Classic", then "New".
    static std::vector<PitchAdapterInfo*> GetPitchAdapters();

private:
    std::string m_name;
};

// A pitch-shift back-end: changes the pitch of an interleaved stream, block by block, in place.
//
// Order of calls: create; SetChannelsNum, SetSampleRate, SetPitchFactor per channel, SetFFTSize, SetQuality,
// CookFactors; then ProcessInPlace per block. For offline rendering that returns as many frames as it was
// given: ProcessInPlaceNoPadding per block, Flush, then ReceiveSamples for what GetNumSamplesAvailable says.
// A block is `frames` frames of as many samples as there are channels. Pitch factors are frequency ratios.
//
// "New" is overlap-add, done by the library SoundTouch: W. Verhelst and M. Roelands, "An overlap-add
// technique based on waveform similarity (WSOLA) for high quality time-scale modification of speech", ICASSP
// 1993. "Classic" keeps frequencies by their phases as a phase vocoder does (J. L. Flanagan and R. M. Golden,
// "Phase Vocoder", Bell System Technical Journal 45, 1966), but takes the windowed samples themselves for
// bins, without a transform; that is its sound, 60 to 70 dB below the input.
//
// Cost of a stereo frame: "New" 10 to 20 ns at quality 0, 90 to 190 at quality 9, most where the pitch moves
// far. "Classic" 7 ns at the lowest quality, 13 at an overlap of 4, 24 at 8 and 90 at 32, a seventh more
// while the pitch moves; it works once in a step, so that some blocks take many times as long as others.
// Configuring fills tables and buffers: of "New" 1.2 MB in stereo at 48 kHz, half of it for what the lowest
// pitch holds, and more with rate and channels.
//
// Threads: "New" may be configured from one thread while another processes; it holds a lock for the length of
// each call, and every configuration call drops the audio it holds. "Classic" takes pitch factors from
// another thread; all else must not run at the same time.
//
// Memory: configuration calls allocate and may throw std::bad_alloc; the next ones try again, and until then
// blocks are silent or unchanged. Once configured in the order above, processing allocates only in "New", and
// there only for blocks of more than 16384 samples (all channels counted) and for pitches above an octave.
//
// The order of the virtual operations is part of the contract.
class DSP_API PitchAdapter {
public:
    // The caller owns the adapter. Null for an unknown descriptor.
    static PitchAdapter* CreateAdapter(PitchAdapterInfo* info);
    // By place in PitchAdapterInfo::GetPitchAdapters(), limited to it.
    static PitchAdapter* CreateAdapter(int index);

    PitchAdapter();
    // Copies take over the number of channels only.
    PitchAdapter(const PitchAdapter&);
    PitchAdapter& operator=(const PitchAdapter&);

    // Drops the audio held.
    virtual void Clear();
    // Configuration. "New" takes 1 to 16 channels (16 without the anti-alias filter) and lets its engine's
    // std::runtime_error out for others. Its rates from 1 to 999 Hz count as 1000, those above 192000 as
    // that; from 0 down there is no rate, and it stays silent.
    virtual void SetSampleRate(int rate) = 0;
    virtual void SetChannelsNum(int channels);
    // "New" shifts all channels by channel 0's factor, at least 0.02; "Classic" has one for each of two.
    virtual void SetPitchFactor(int channel, float factor) = 0;
    // "New" only: playback speed, 0.01 to 100, which moves the pitch along. What is not above 0 is ignored.
    virtual void SetSpeed(float speed);
    // "Classic" only: derives everything from the configuration and starts afresh.
    virtual void CookFactors();
    // Indices into the descriptor's lists, limited to them.
    virtual void SetFFTSize(int index);
    virtual void SetQuality(int index);
    // Processing. The first frames of "New" are silence until its engine is full; "Classic" leaves double
    // buffers as they are. Samples that are not finite count as 0.
    virtual void ProcessInPlace(double* buffer, int frames) = 0;
    virtual void ProcessInPlace(float* buffer, int frames) = 0;
    // Without that silence: returns how many frames, at most those given, it put at the start of the buffer.
    virtual int ProcessInPlaceNoPadding(double* buffer, int frames);
    virtual int ProcessInPlaceNoPadding(float* buffer, int frames);
    // The end of a stream processed without padding: pushes the rest through.
    virtual void Flush();
    // Frames that can be received; after Flush at most those owed for the input, negative when more than that
    // have been taken.
    virtual int GetNumSamplesAvailable();
    // Takes `frames` frames; where there are fewer, the rest of the buffer is zeroed.
    virtual void ReceiveSamples(double* buffer, int frames);
    virtual void ReceiveSamples(float* buffer, int frames);
    virtual ~PitchAdapter();
    virtual int GetLatency();  // in frames

    // Shifts every channel by semitones.
    void SetTranspose(float semitones);

protected:
    std::int32_t m_channels = 0;  // as set; 0 before
};

// Library-wide length of the short fader; adapters made afterwards take it.
DSP_API void SetShortFaderNumSamples(std::int64_t samples);

}  // namespace Corvo::DSP
