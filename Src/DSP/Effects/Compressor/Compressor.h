#pragma once

#include <memory>

#include "DSP/Effects/Compressor/CompressorCurve.h"
#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace CompressorPrivate {

// Everything but the curves, left and right. `Word` is 32 bits wide in today's records, 64 in old ones.
template <typename Word>
struct TRANSFORM_PARAMETERS {
    std::array<Word, 2> attack{}, release{};  // hundredths of a millisecond, 1..100000
    std::array<Word, 2> outGain{};            // tenths of a decibel, -960 (silence)..200
    Word stereoLink = 0, makeUp = 0;          // 0 or 1
    Word flags = 0;                           // bit 0: monitor the side-chain; the others are kept
    std::array<Word, 15> reserved{};          // kept
};

// All settings of a compressor.
template <typename Word>
struct TTRANSFORM_PROPS {
    TRANSFORM_PARAMETERS<Word> parameters;  // everything but the curves
    CompMapStereo map;                      // the curves
};

// Which channel's curve the host's editor edits.
enum class EditChannelMode { Both, Left, Right };

struct UserInterfaceSide;
struct AudioSide;
struct HandOver;
struct GlidingMap;
struct CoreState;

}  // namespace CompressorPrivate

// Compressor, limiter, gate and expander in one: an envelope follower and, per channel, a transfer curve.
//
// Blocks are interleaved, mono or stereo, 32- or 64-bit float; anything else passes unchanged. No latency.
// With "Stereo Link" both channels of a stereo block follow one envelope, with the left attack and release;
// otherwise each has its own. In n + 1 frames the envelope covers nine tenths of its way: each frame it moves
// by 1 - 10^(-1 / (n + 1)) of what is left. n is the attack time or ten times the release time: the release
// acts ten times as long as it says. A feed-forward design with a peak detector; cf. D. Giannoulis, M.
// Massberg and J. D. Reiss, "Digital Dynamic Range Compressor Design", J. Audio Eng. Soc. 60 (2012). Edits of
// the curve and of the out gain glide in; InitProcessing starts from silence without a glide, Cleanup does
// nothing.
//
// Parameters, left and right each: attack, release, out gain, threshold, ratio, and as pairs that share one
// switch "Stereo Link", "Auto Make-up Gain" (full scale comes out at full scale, +40 dB at most) and "Monitor
// sidechain" (the detector's signal is the output).
//
// Threshold and ratio are edits of the curve: above the threshold it becomes a straight line in decibels, a
// soft knee keeps its width, and a value that the curve shows already changes nothing. Texts and GetParam are
// read from each side's own curve. A ratio between two steps reads as the lowest step with the same text.
//
// Side-chain: bus 0. The block after SetSidechainBuffer takes its detector signal from there. A mono
// side-chain serves both channels; a mono block listens to the mean of a stereo one. A null buffer, or none,
// means the block itself.
//
// Threads: the user-interface thread edits its own copy of the settings under a critical section and
// publishes it whole; the audio thread takes the newest at the next block and neither waits, allocates nor
// frees. Automation edits the audio thread's copy, and changed curves travel back.
class DSP_API Compressor : public CorvoEffect {
public:
    // The records in today's layout.
    using Parameters = CompressorPrivate::TRANSFORM_PARAMETERS<std::int32_t>;
    using Settings = CompressorPrivate::TTRANSFORM_PROPS<std::int32_t>;
    using CompMapStereo = CompressorPrivate::CompMapStereo;

    Compressor();
    ~Compressor() override;

    bool HasNativeEditor() override;
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    // 16112 bytes, little-endian: tag, record (24 words of parameters, 2 counts, 2 reserved words, 666
    // points of x, y, slope as floats per channel), preset, last threshold, last ratio step.
    void GetSettingsChunk(std::vector<std::uint8_t>& chunk) override;
    int GetSettingsChunkSize() override;
    // Below 16100 bytes a chunk is ignored; of the last three words those that are missing keep their
    // values. Values out of range are limited, curves that are none are repaired.
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    // The older layout: 16208 bytes, a word that is not read, the record with words of 8 bytes, then the
    // same three words. False, with nothing changed, below 16196 bytes.
    bool FitsOldChunk(const std::vector<std::uint8_t>& chunk);
    void Cleanup() override;
    void SetPreset(int preset) override;
    std::wstring GetParameterFormattedText(int index, double value) override;
    float GetParam(int index) override;
    void SetParam(int index, float normalised, bool fromAutomation) override;
    int GetNumSidechainBusses() override;
    int GetSidechainBusNumChannelsMax(int bus) override;
    void SetSidechainBuffer(int bus, double* const* channels) override;

    // User-interface thread: stores one parameter and, with `submit`, hands the settings to the audio side.
    void SetParamFromUi(int index, float normalised, bool submit);
    // Hands over what was stored without `submit`.
    void SubmitUiSettingsChange();
    // User-interface thread: takes over curves that automation changed. Every call that reads or edits
    // settings does so first.
    void ApplyEnvelopeToUi();

    // Stores one parameter in settings of the caller's, on the caller's thread. A null map stands for the
    // user interface's own, here and in the curve edits below.
    void SetParamInternal(int index, float normalised, Parameters& parameters, CompMapStereo* map);
    void AdjustThreshold(std::int32_t tenths, std::size_t channel, CompMapStereo* map);
    void AdjustRatio(std::int32_t step, std::size_t channel, CompMapStereo* map);
    // Sees to it that the channels which have the ratio last set show it still after the threshold moved.
    void ApplyRatioToMap(CompMapStereo* map);

    // The settings of a preset, of the nearest one for a number out of range.
    static Settings GetPresetData(int preset);

    // Which channel's curve the host's editor edits: kept for it, and nothing here depends on it. Any thread
    // but the audio thread.
    CompressorPrivate::EditChannelMode GetEditChannelMode() const;
    void SetEditChannelMode(CompressorPrivate::EditChannelMode mode);
    // Whether a side-chain was handed over for the last block; any thread.
    bool IsUsingSideChain() const;

    // Any thread. While the meter is on, GetGainReduction is the factor that the curve applies to a
    // channel (0 or 1), smoothed for the eye; 1 means no reduction.
    void SetGainMeterOn(bool on);
    bool IsGainMeterOn() const;
    double GetGainReduction(int channel) const;

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;

    // The cook routine. Forced, it also starts envelopes, gains and meters afresh, without a glide.
    void InitState(bool forced);

    // The core. Accessors say whether the curve and the out gain stand (getters) or glide (smoothers); a
    // parameter smoother comes back as far as it got.
    template <typename Sample, typename ParameterAccessor, typename GainAccessor>
    void ProcessStereoLinked(Sample* output, const Sample* detectorRight, const Sample* detector, int frames,
                             int outputChannels, int detectorStride, const CompressorPrivate::GlidingMap& map,
                             CompressorPrivate::CoreState& state, ParameterAccessor& parameters,
                             GainAccessor gains);
    template <typename Sample, typename ParameterAccessor, typename GainAccessor>
    void ProcessChannelMono(Sample* output, const Sample* detector, std::size_t channel, int frames,
                            int outputStride, int detectorStride, const CompressorPrivate::GlidingMap& map,
                            CompressorPrivate::CoreState& state, ParameterAccessor& parameters,
                            GainAccessor gains);

private:
    // A null map stands for the user interface's own.
    template <typename Edit>
    void EditCurves(CompMapStereo* map, Edit edit);
    template <typename Word>
    bool LoadChunk(const std::vector<std::uint8_t>& chunk, std::int32_t& tag);

    void TakeUiSettings();
    template <typename Sample>
    void ProcessBlock(Sample* block, int frames, int channels);
    template <typename Sample>
    void RunPiece(Sample* block, const Sample* const* detector, int detectorStride, int frames, int channels);

    std::unique_ptr<CompressorPrivate::UserInterfaceSide> m_ui;
    std::unique_ptr<CompressorPrivate::AudioSide> m_audio;
    std::unique_ptr<CompressorPrivate::HandOver> m_hand_over;
};

}  // namespace Corvo::DSP
