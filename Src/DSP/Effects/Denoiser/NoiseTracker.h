#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <vector>

#include "DSP/Effects/Denoiser/HumFinder.h"
#include "DSP/Effects/Denoiser/SizeReducer.h"
#include "DSP/Effects/Denoiser/SizeSets.h"
#include "DSP/Effects/Denoiser/SpectrumConversion.h"
#include "DSP/Effects/Denoiser/TrackerTables.h"

namespace Corvo::DSP::Denoising {

// Follows the noise's level in a stream that holds signal too.
//
// Per band the quiet half of the bins, by their mean over the last ten frames, is looked at. If their powers
// scatter like noise, their level is the noise's and is followed; if they are uneven there is signal among
// them, and the level only creeps up. On its own the tracker follows a smooth spectrum, and HumFinder adds
// the lines; over a learned profile it moves that profile's band levels.
class NoiseTracker {
public:
    void Prepare(Arena& arena, WindowTables& track, const TrackerTables& tables,
                 std::span<SpectrumConversion* const> sizes, double rate);
    // Follows `profile` (power per bin of the track length; null: on its own) and starts afresh.
    void Start(const float* profile);
    void SetMaterial(bool music);
    void SetWhitening(bool wanted) { m_wantsReference = wanted; }

    // A frame's work is a number of steps, as in SizeReducer.
    int Steps() const { return kFixedSteps + static_cast<int>(m_sizes.size()); }
    float Cost(int step) const;
    void Run(int step, std::int64_t frame, const SampleRing& input);

    bool Ready() const { return m_done >= 0; }
    // As a frame of window `size` (by the order of Prepare) sees it whose middle lies at `centre`. Only while
    // Ready; where the tracker has not got that far, its newest value.
    NoiseAt At(std::size_t size, std::int64_t centre) const;
    // The middle one of the logarithms of the noise's powers.
    float LogReference() const { return m_logReference; }

private:
    enum Step {
        kAnalyse,
        kGather,
        kShape,
        kFirstBands,
        kLastBands = kFirstBands + 3,
        kLevels,
        kListen,
        kLook,
        kFinish,
        kFixedSteps
    };
    static constexpr std::int64_t kMemory = 10, kKept = 4;

    void Analyse(std::int64_t frame, const SampleRing& input);
    void Gather(std::int64_t frame);
    void Shape();
    void Compare(std::size_t group);
    void Update();
    void Begin();
    bool Settling() const { return !m_profile && m_frames <= kMemory; }
    void LevelsToBins(const std::vector<float>& levels, float* logarithms) const;

    const SpectrumKernels* m_kernels = nullptr;
    WindowTables* m_track = nullptr;
    const TrackerTables* m_tables = nullptr;
    std::vector<SpectrumConversion*> m_sizes;
    double m_hopSeconds = 0.0;
    HumFinder m_hum;
    const float* m_profile = nullptr;
    bool m_wantsReference = false;
    std::int64_t m_started = 0, m_frames = 0;  // frames gathered since Start
    std::int64_t m_done = -1;
    float m_logReference = 0.0f;

    FrameRing m_power, m_logPower, m_noise;
    std::array<FrameRing, 4> m_converted;
    float *m_re = nullptr, *m_im = nullptr, *m_meanPower = nullptr, *m_meanLog = nullptr;
    float *m_logShape = nullptr, *m_white = nullptr, *m_logWhite = nullptr, *m_logProfile = nullptr;
    float *m_order = nullptr, *m_level = nullptr;
    std::vector<float> m_levels, m_smooth, m_candidates, m_flatness, m_follow;
};

}  // namespace Corvo::DSP::Denoising
