#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <type_traits>
#include <utility>
#include <vector>

#include "DSP/Effects/Denoiser/NoiseLearner.h"
#include "DSP/Effects/Denoiser/NoiseTracker.h"
#include "DSP/Effects/Denoiser/Pace.h"
#include "DSP/Effects/Denoiser/SizeBlend.h"
#include "Platform/UntouchedZeros.h"

namespace Corvo::DSP::Denoising {

enum class ProfileMode { Learned, Following, Adaptive };

// What the parameters come to.
struct EngineSettings {
    ProfileMode profile = ProfileMode::Adaptive;
    int sizeSet = 0;
    bool learn = false, music = false, residue = false;
    float reductionDb = 25.0f, sensitivityDb = 0.7f, mix = 1.0f;
    GainSettings gains;
    std::array<float, kGainBands> gainDb{};   // of the profile
    std::array<float, kGainBands> rangeDb{};  // deepest attenuation
};

// The noise reducer without the effect around it: one or two channels, audio in, delayed and cleaned audio
// out. Only Prepare allocates.
//
// All work is counted from the stream's first sample and done in pieces every kUnit samples or less, so the
// output does not depend on how the stream is cut. A window's work is spread over several pieces, but one
// transform is never divided: a short block may have to do a whole one of the longest window.
class DenoiserEngine {
public:
    // Makes all memory for a rate and any settings, and starts a stream with nothing learned; with settings
    // of another size set it would start again.
    void Prepare(double rate, std::size_t channels, int sizeSet);
    // Starts a stream in another format; a passage still open ends. Window lengths stay as they were
    // prepared. At another rate than the prepared one nothing is learned, and what was learned is not used.
    void SetFormat(double rate, std::size_t channels);
    // Takes settings from the next sample on. The first ones after a start apply without a glide.
    void Apply(const EngineSettings& settings);

    // Processes one sample per channel after the other. `at(channel, frame)` refers to a sample.
    template <typename At>
    void Run(int frames, At at);

    // The learned noise, at the prepared rate. A passage still open is dropped.
    void Adopt(const NoiseProfile& profile);
    void Forget() { Adopt(NoiseProfile{}); }
    // Ends a passage still open, which becomes part of what was learned.
    void EndPassage() {
        if (m_learner.Active()) EndLearning();
    }
    // True once after a passage has been learned.
    bool TakeNewlyLearned() { return std::exchange(m_newlyLearned, false); }
    // Into memory for as much as can be learned.
    void Export(LearnedNoise& learned) const;

    const Format_t& Format() const { return m_format; }

private:
    // The profile's offset as a factor, the floor and its logarithm.
    struct Curves {
        float *offset = nullptr, *floor = nullptr, *logFloor = nullptr;
    };
    struct Glide {
        double value = 0.0, target = 0.0, step = 0.0;
        int left = 0;
        void Set(double to, int frames);
        double Next() {
            if (left > 0) value = --left == 0 ? target : value + step;
            return value;
        }
    };

    void Start(bool afterSound);
    void LayoutTables(Arena& arena);
    void ReserveMemory(double rate, int sizeSet);
    void Layout(Arena& arena);
    void PlacePaces();
    void CookCurves(std::size_t size);
    void AimOutput(bool glide);
    void EndLearning();
    void FinishLearned();
    void FindReference();
    void MixLearned();
    void ChooseMode(bool restart);
    bool HasLearned() const { return m_learnedSeconds > 0.0; }
    bool AtPreparedRate() const { return m_rate == m_preparedRate; }
    bool UsesLearned() const { return HasLearned() && AtPreparedRate(); }
    bool Tracks() const { return m_mode != ProfileMode::Learned; }
    void Tick();
    NoiseAt NoiseFor(std::size_t channel, std::size_t size, std::int64_t centre) const;
    const SampleRing& Wet(std::size_t channel) const {
        return m_set->count > 1 ? m_blended[channel] : m_sized[0][channel];
    }
    std::size_t LengthIndex(std::size_t size) const;

    Scale m_scale;
    double m_rate = 0.0, m_preparedRate = 0.0;
    std::size_t m_channels = 0;
    Format_t m_format;
    EngineSettings m_settings;
    const SizeSet* m_set = &kSizeSets[0];
    ProfileMode m_mode = ProfileMode::Adaptive;  // in use: "Learned" needs a profile
    bool m_fresh = true;                         // no settings yet

    std::shared_ptr<const ReducerTables> m_tables;  // for the prepared rate
    std::array<WindowTables, kLengths> m_windows;
    std::array<SpectrumConversion, kLengths> m_conversions;
    std::array<Curves, kLengths> m_curves;
    std::array<bool, 3> m_curvesDue{};  // of the sizes in use
    NoiseLearner m_learner;
    // Only written to when something is learned.
    std::array<std::array<std::span<float>, kLengths>, kMostChannels> m_learned;
    std::array<float, kMostChannels> m_learnedReference{};
    bool m_referenceDue = false;
    std::array<std::span<float>, 2> m_passage;
    std::span<float> m_order;
    double m_learnedSeconds = 0.0;
    std::size_t m_learnedChannels = 0;
    bool m_newlyLearned = false;

    Arena m_tableMemory, m_arena;
    UntouchedZeros<double> m_dry;  // rings, one after the other
    std::array<SampleRing, kMostChannels> m_input, m_blended;
    std::array<std::array<SampleRing, kMostChannels>, 3> m_sized;
    std::array<NoiseTracker, kMostChannels> m_trackers;
    std::array<SizeReducer, 3> m_reducers;
    SizeBlend m_blend;
    std::array<Pace, 3> m_reducerPaces;
    std::array<Pace, kMostChannels> m_trackerPaces;
    Pace m_blendPace;
    std::array<SizeReducer::Job, 3> m_jobs;

    int m_tick = kUnit;
    std::int64_t m_time = 0, m_dryTime = 0, m_wetFrom = 0;
    Glide m_dryGain, m_wetGain;
    // Where the latency changes, the sound moves over from the one delay to the other.
    Glide m_jump;
    std::int64_t m_latencyBefore = 0;
};

template <typename At>
void DenoiserEngine::Run(int frames, At at) {
    constexpr double kMost = 1048576.0;  // +120 dB: nothing that could not be squared and summed
    const std::size_t mask = m_dry.size() / kMostChannels - 1;
    const std::int64_t latency = m_format.latency;
    for (int done = 0; done < frames;) {
        const int count = std::min(frames - done, m_tick - static_cast<int>(m_time % m_tick));
        for (int i = done; i < done + count; ++i, ++m_time, ++m_dryTime) {
            const double dryGain = m_dryGain.Next(), wetGain = m_wetGain.Next(), jump = m_jump.Next();
            for (std::size_t c = 0; c < m_channels; ++c) {
                auto& sample = at(c, i);
                double* const dry = m_dry.data() + c * (mask + 1);
                const double in = static_cast<double>(sample);
                dry[static_cast<std::size_t>(m_dryTime) & mask] = in;
                m_input[c][m_time] = static_cast<float>(std::clamp(in, -kMost, kMost));
                double delayed = dry[static_cast<std::size_t>(m_dryTime - latency) & mask];
                if (jump != 0.0)
                    delayed +=
                        jump * (dry[static_cast<std::size_t>(m_dryTime - m_latencyBefore) & mask] - delayed);
                const double wet = m_time < latency ? 0.0 : static_cast<double>(Wet(c)[m_time - latency]);
                sample =
                    static_cast<std::remove_reference_t<decltype(sample)>>(dryGain * delayed + wetGain * wet);
            }
        }
        done += count;
        if (m_time % m_tick == 0) Tick();
    }
}

}  // namespace Corvo::DSP::Denoising
