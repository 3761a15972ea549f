#pragma once

#include <memory>

#include "DSP/Effects/Framework/CorvoEffect.h"
#include "DSP/Effects/Tube/VirtualTubeAmp.h"

namespace Corvo::DSP {

// Tube-style distortion, "Valvex" to the user: per side a low-pass of order 4, a boost and one of four
// shaping functions, which may run at up to 16 times the stream's rate.
//
// Blocks are interleaved, mono or stereo, and float unless they are 64 bits wide; a block of any other
// channel count passes unchanged, and so do planar blocks. A mono stream takes the left values.
//
// Parameters are normalised, left and right in turn: 0 and 1 boost, 2 and 3 drive, 4 and 5 tone, 6 and 7
// function, 8 and 9 oversampling. "Oversampling R" decides for both sides; the left one is kept and shown.
//
// Threads: parameters, presets and chunks belong to the user-interface thread, automation to the audio
// thread. Filters for a new oversampling factor are prepared beside those in use, and the audio thread
// exchanges them with its next block, without waiting and without a gap in the sound: the new filters first
// run over the newest input. Cleanup and InitProcessing are not called while a block is processed.
//
// Settings chunk: 44 bytes, the leading word and the ten values as floats. They are stored as they come; out
// of range, drive, function and oversampling act like the nearest end, a boost like none, and the tone like
// none unless its corner, 0.35 + 3.15 tone radians per sample, lies within 0.1..3.
//
// A boost v multiplies by 1 + 10 v. The tone's low-pass is four equal sections of first order, designed by
// the bilinear transform with k = tan(corner / 2). Without drive no function acts, and samples are not
// limited.
class DSP_API TubeDistorsion : public CorvoEffect {
public:
    TubeDistorsion();
    ~TubeDistorsion() override;

    // In frames: what the two converters delay low frequencies by, rounded; 0 without oversampling.
    int GetLatency() override;
    void SetMaximumFramesPerBuffer(int frames) override;
    // With force: makes the buffers and starts from silence.
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    // Clears the filters and frees the buffers; until the next InitProcessing blocks take longer.
    void Cleanup() override;
    void SetPreset(int preset) override;
    bool AllowChangeParamFromInputBox(int index) override;

    // The memory for oversampled blocks of the largest size announced. InitProcessing and Cleanup call them.
    void AllocateBuffers();
    void FreeBuffers();

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;

private:
    using Values = VirtualTubeAmp::Values;
    struct Processing;

    int WantedFactor() const;
    void PrepareOversampling(float wanted);
    void InitState(bool fromSilence);

    Values m_params{};  // shared between the threads
    int m_max_frames = 0;
    int m_prepared_factor = 1;  // the user-interface thread's: what it handed over last
    std::unique_ptr<Processing> m_processing;
};

}  // namespace Corvo::DSP
