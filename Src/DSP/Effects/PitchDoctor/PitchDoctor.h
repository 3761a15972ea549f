#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "DSP/Effects/PitchDoctor/PitchReadings.h"

namespace Corvo::DSP {

// The settings, the chunk after its first two words, and a row of the preset table: plain values.
struct PitchDoctorSettings {
    float scaleRoot;              // 0 C to 11 B
    float scaleMode;              // 0 chromatic to 12 whole tone
    std::array<float, 12> notes;  // 1 allowed, 0 not; C to B
    float retune, transition;     // ms
    float ratio;                  // %
    float tolerance;              // cents
    float keepVibrato;            // %
    float hysteresis;             // cents
    float hold;                   // ms
    float formantsKept;           // %
    float formantShift;           // semitones
    float transpose;              // semitones, whole
    float offset;                 // cents
    float lowest, highest;        // Hz
    float silence;                // dB
    float followTuner;            // 1 on, 0 off
    float concertPitch;           // Hz
    float temperament;            // 0 equal to 10 Vallotti, in the tuner's order
    float mix;                    // %
};
static_assert(sizeof(PitchDoctorSettings) == 4 * 32);

// Pitch correction for one voice or monophonic instrument: hears the pitch, decides which note of a scale is
// meant, and moves the voice there, formants staying where they are.
//
// The voice's cycles are laid at another distance: E. Moulines and F. Charpentier, "Pitch-synchronous
// waveform processing techniques for text-to-speech synthesis using diphones", Speech Communication 9 (1990).
//
// The notes allowed are those of the scale whose switch is on; without any nothing is corrected. The
// correction follows with the retune speed, leaves a mean error within the tolerance alone and keeps as much
// of the vibrato as is asked for. Transposition and offset come on top. What is not voiced passes unchanged.
//
// Blocks are interleaved or planar, mono or stereo; 64-bit samples are double, every other width is taken for
// float. Both channels are corrected alike, by the pitch of their mean, so that the image stays;
// what has opposite phase in them (L = -R) cancels in the mean and is not corrected. Channels after the
// second pass unchanged and without the delay. The output does not depend on how a stream is cut.
//
// GetLatency follows the lowest pitch: 1.6 of its periods, rounded up to 64 frames (at 48 kHz 1408, 1024, 704
// and 512). When it changes, WantRefreshAllParams is raised, and the output begins anew from silence. The
// lowest pitch is not automated.
//
// "Follow tuner" takes concert pitch and notes from the tuner's class-wide calibration and temperament, which
// are read when the effect derives its state: in front of the first block after an edit.
//
// Cost: blocks in which a pitch is worked out take longer than the others. The slowest block of 64 frames
// takes 2 times as long as the median one at 48 kHz, 5 times at 96 kHz and 9 times at 192 kHz (9 % of the
// time it lasts), of 32 frames 2, 9 and 18 times (22 %).
//
// Settings chunk: 136 bytes, the number 1, the number of settings (32), the settings. A chunk of fewer
// settings leaves the others at their defaults, of more the rest is not read. Values out of range are kept,
// and limited where they are used. Memory: 1.3 MB at 48 kHz, and in proportion to the rate, which counts as
// 768 kHz above that. Its pages are used while sound plays, by the lowest pitch chosen: 240 to 430 KB. A
// format that InitProcessing did not announce makes its own memory in the first block that has it.
class DSP_API PitchDoctor : public CorvoEffectBase {
public:
    PitchDoctor();
    ~PitchDoctor() override;

    bool HasSeparateLeftRightSettings() override;
    int GetLatency() override;  // 0 before a format is known
    // While an editor is set, readings are kept for it; nothing is called on it.
    void SetEditor(BuiltinEditor* editor) override;
    bool SupportsNoninterleaved() override;
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void GetSettingsChunk(std::vector<std::uint8_t>& chunk) override;
    int GetSettingsChunkSize() override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    void Cleanup() override;
    void SetPreset(int preset) override;
    float GetParam(int index) override;
    int GetParamCountReal() override;
    std::string GetName() override;
    bool IsCantrix() override;
    EffectParameterType GetParameterTypeAutomatable(int index) override;
    bool AllowChangeParamFromInputBox(int index) override;
    void InitResetProcessingLight(bool reset) override;

    // Appends what was heard since the last call, oldest first, of the newest 512 readings (2.7 s, 1.4 s from
    // a lowest pitch of 110 Hz on). The editor's thread; never waits. Empty while no editor is set.
    void TakeReadings(std::vector<PitchReading>& readings);

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;
    void ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                       ProcessFlags& flags) override;

private:
    struct Engines;

    // Runs an edit of the user-interface thread and tells the host when it changed the latency.
    template <typename Edit>
    void WatchingLatency(Edit edit);

    PitchDoctorSettings m_settings{};  // shared between the threads
    tWAVEFORMATEX m_format{};
    std::atomic<std::uint32_t> m_rate{0};
    std::unique_ptr<Engines> m_engines;
};

}  // namespace Corvo::DSP
