#pragma once

#include <array>
#include <memory>

#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace PitchShiftPrivate {

// The settings, and the body of the chunk.
struct _transform_props {
    std::array<std::int32_t, 2> pitch;      // frequency ratio * 3000 per side; 3000 leaves the pitch alone
    std::array<std::int32_t, 2> carried2;   // kept
    std::int32_t quality;                   // PitchAdapter::SetQuality
    std::int32_t carried5;                  // kept
    std::int32_t fftSize;                   // PitchAdapter::SetFFTSize
    std::array<std::int32_t, 14> carried7;  // kept
    std::int32_t backEnd;                   // PitchAdapter::CreateAdapter
};
static_assert(sizeof(_transform_props) == 88);

}  // namespace PitchShiftPrivate

// Transposes a stream by a fixed ratio per side. The work is done by a pitch-shift back-end, which the
// settings choose: "New" (SoundTouch, one ratio for all channels; overlap-add as in W. Verhelst and M.
// Roelands, "An overlap-add technique based on waveform similarity (WSOLA) for high quality time-scale
// modification of speech", ICASSP 1993) or "Classic" (a ratio per side, float only; see PitchAdapter).
//
// Blocks are interleaved, 1 to 16 channels; 64-bit blocks are double, all others float. The start of the
// stream is silence until the back-end is full, so the output depends on how the stream is cut. "New"
// takes a lock in every block, against edits, and allocates in two cases: for each step of an automated
// pitch, and for blocks of more than 16384 samples, all channels counted.
//
// Left and right are one external parameter, "Pitch". A new instance has an empty record, at the lowest
// pitch: load a preset or a chunk first.
//
// Threads: as in CorvoEffectBase. An edit reaches the back-end at once, again with the next block when a cook
// overtook it, and restarts "New" under that engine's own lock, which a block may wait for briefly; the
// effect has no lock. Back-ends are made, configured for the format last prepared and freed on the
// user-interface thread, except for one that a block makes after Cleanup. Settings that come whole send their
// pitch at once, too. Latency is asked for on one of the two threads. Cleanup and InitProcessing are not
// called while a block is processed.
//
// Settings chunk: 92 bytes, the chunk tag and the settings, 22 words; the oldest layout has 180 bytes.
class DSP_API PitchShift : public CorvoEffect {
public:
    PitchShift();
    ~PitchShift() override;

    int GetLatency() override;  // of the back-end; 0 without one
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    // As the base does, but for the tag, which is left alone.
    bool FitsOldChunk(const std::vector<std::uint8_t>& chunk);
    // Frees the back-end; the next cook or block makes a new one.
    void Cleanup() override;
    void SetPreset(int preset) override;
    int SeparateLeftRightControls() override;
    // Of either side, 0 or 1, though both are one external parameter.
    std::wstring GetParameterFormattedText(int index, double value) override;
    float GetParamValueNormalizedFromText(int index, std::string text) override;  // not limited
    bool AllowChangeParamFromInputBox(int index) override;

    // Configures the back-end that the record names for the format; it is made on the spot when another one
    // is in use. Not while another thread edits. False without memory. `force` makes no difference.
    bool InitState(const PitchShiftPrivate::_transform_props& record, const tWAVEFORMATEX* format,
                   bool force);
    // Derives the pitch factors and sends them to the newest back-end, if there is one. On the user-interface
    // thread.
    void CookPitchShift(const PitchShiftPrivate::_transform_props& record, int channels);
    // Limited to the presets there are.
    static PitchShiftPrivate::_transform_props GetPresetData(int preset);

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;

private:
    struct BackEnds;

    // User-interface side: stores a record and hands over the back-end it asks for.
    void TakeRecord(const PitchShiftPrivate::_transform_props& record);

    PitchShiftPrivate::_transform_props m_record{};  // shared between the threads
    std::unique_ptr<BackEnds> m_back_ends;
};

}  // namespace Corvo::DSP
