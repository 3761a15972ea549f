#include "DSP/Effects/Denoiser/NoiseTracker.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::Denoising {
namespace {

constexpr double kUpSeconds = 0.25, kDownSeconds = 0.12, kShapeSeconds = 1.0;
constexpr double kPerDb = 0.23025850929940457;  // natural logarithm of a power
constexpr double kCreepDbPerSecond = 0.1;
constexpr float kFollowRange = static_cast<float>(15.0 * kPerDb), kSteepestSlope = 3.0f;
constexpr float kTrustRange = 0.08f;
constexpr float kMostWhite = 1e30f;  // what the sum over a band leaves finite

// clang-format off
// Over fewer frames, as at the start, the quiet half is that much quieter.
constexpr std::array kFewFrames{0.506f, 0.620f, 0.711f, 0.785f, 0.838f, 0.883f, 0.918f, 0.950f, 0.979f, 1.0f};
// clang-format on

float Logarithm(double x) { return static_cast<float>(std::log(x)); }

}  // namespace

void NoiseTracker::Prepare(Arena& arena, WindowTables& track, const TrackerTables& tables,
                           std::span<SpectrumConversion* const> sizes, double rate) {
    m_kernels = &BestSpectrumKernels();
    m_track = &track;
    m_tables = &tables;
    m_sizes.assign(sizes.begin(), sizes.end());
    m_hopSeconds = track.length / kOverlap / rate;
    const std::size_t values = track.Values();
    for (auto* ring : {&m_power, &m_logPower}) ring->Take(arena, kMemory, values);
    m_noise.Take(arena, kKept, values);
    for (std::size_t i = 0; i < m_sizes.size(); ++i)
        if (m_sizes[i]) m_converted[i].Take(arena, kKept, m_sizes[i]->Bins() + 16);
    for (auto* each : {&m_re, &m_im, &m_meanPower, &m_meanLog, &m_logShape, &m_white, &m_logWhite,
                       &m_logProfile, &m_order, &m_level})
        *each = arena.Take(values);
    m_hum.Prepare(arena, track.Bins(), values);
    for (auto* each : {&m_levels, &m_smooth, &m_candidates, &m_flatness, &m_follow})
        each->resize(tables.bands.size());
    m_done = -1;
    m_frames = 0;
}

void NoiseTracker::Start(const float* profile) {
    m_profile = profile;
    m_frames = 0;
    m_hum.Start();
    std::ranges::fill(m_follow, 1.0f);
    if (!profile) return;
    m_kernels->logarithm(profile, m_logProfile, m_track->Values());
    // A band that holds lines is none whose level could be told from the gaps.
    constexpr float kTonal = -0.7f, kTonalRange = 0.4f;
    for (std::size_t i = 0; i < m_follow.size(); ++i) {
        const auto& band = m_tables->bands[i];
        double mean = 0.0, meanLog = 0.0;
        for (std::size_t bin = band.first; bin < band.end; ++bin) {
            mean += profile[bin];
            meanLog += m_logProfile[bin];
        }
        const auto bins = static_cast<double>(band.end - band.first);
        m_follow[i] = std::clamp(
            (static_cast<float>(meanLog / bins) - Logarithm(mean / bins) - kTonal) / kTonalRange, 0.0f, 1.0f);
    }
}

void NoiseTracker::SetMaterial(bool music) { m_hum.SetMaterial(music, m_hopSeconds); }

float NoiseTracker::Cost(int step) const {
    constexpr float kNanoseconds[kFixedSteps]{2.8f, 2.0f, 1.5f, 1.0f, 1.0f, 1.0f,
                                              1.0f, 1.2f, 0.6f, 2.0f, 1.0f};
    const auto bins = static_cast<float>(m_track->Bins());
    if (step < kFixedSteps) return kNanoseconds[step] * bins;
    const auto* const size = m_sizes[static_cast<std::size_t>(step - kFixedSteps)];
    return size ? 0.5f * bins + 0.7f * static_cast<float>(size->Bins()) : 0.0f;
}

void NoiseTracker::Run(int step, std::int64_t frame, const SampleRing& input) {
    if (step == kAnalyse) return Analyse(frame, input);
    if (step == kGather) return Gather(frame);
    if (m_frames == 0 && (step < kListen || step > kFinish)) return;
    if (step == kShape) {
        if (m_frames == 1) Begin();
        Shape();
    } else if (step < kLevels) {
        Compare(static_cast<std::size_t>(step - kFirstBands));
    } else if (step == kLevels) {
        Update();
        float* const noise = m_noise[frame];
        LevelsToBins(m_levels, m_order);
        m_kernels->exponential(m_order, m_level, m_track->Values());
        for (std::size_t i = 0; i < m_track->Bins(); ++i)
            noise[i] = m_profile ? m_level[i] * m_profile[i] : m_level[i];
    } else if (step == kListen) {
        if (!m_profile) m_hum.Listen(m_power[frame]);
    } else if (step == kLook) {
        if (!m_profile) m_hum.Look(m_level);
    } else if (step == kFinish) {
        float* const noise = m_noise[frame];
        if (!m_profile) m_hum.Raise(noise);
        std::fill(noise + m_track->Bins(), noise + m_track->Values(), 1.0f);
        if (m_wantsReference) {
            const std::size_t bins = m_track->Bins();
            m_kernels->logarithm(noise, m_order, m_track->Values());
            std::nth_element(m_order, m_order + bins / 2, m_order + bins);
            m_logReference = m_order[bins / 2];
        }
    } else {
        const auto size = static_cast<std::size_t>(step - kFixedSteps);
        if (m_sizes[size]) {
            float* const converted = m_converted[size][frame];
            m_sizes[size]->Run(m_noise[frame], converted);
            std::fill_n(converted + m_sizes[size]->Bins(), 15, 1.0f);
        }
        if (size + 1 == m_sizes.size()) m_done = frame;
    }
}

NoiseAt NoiseTracker::At(std::size_t size, std::int64_t centre) const {
    const FrameRing& ring = m_sizes[size] ? m_converted[size] : m_noise;
    // The middle of frame k lies at (k - 1) hops.
    const std::int64_t hop = m_track->length / kOverlap;
    const std::int64_t above = (centre + hop - 1) / hop + 1;  // the first whose middle is not before `centre`
    // After a new start m_done is from before, until the first frame since is complete.
    const std::int64_t oldest = std::min(std::max(m_started, m_done - kKept + 1), m_done);
    if (above > m_done) return {ring[m_done], ring[m_done], 0.0f};
    if (above <= oldest) return {ring[oldest], ring[oldest], 0.0f};
    const auto share = static_cast<float>(centre - (above - 2) * hop) / static_cast<float>(hop);
    return {ring[above - 1], ring[above], share};
}

void NoiseTracker::Analyse(std::int64_t frame, const SampleRing& input) {
    auto& track = *m_track;
    const std::int64_t start = (frame - (kOverlap - 1)) * (track.length / kOverlap);
    Transform(*m_kernels, track, input, start, m_re, m_im);
    m_kernels->power(m_re, m_im, m_power[frame], track.Half());
    std::fill(m_power[frame] + track.Bins(), m_power[frame] + track.Values(), 1.0f);
    m_kernels->logarithm(m_power[frame], m_logPower[frame], track.Values());
    // The first windows of a stream are not full yet.
    if (frame < kOverlap - 1) return;
    if (m_frames == 0) m_started = frame;
    ++m_frames;
}

void NoiseTracker::Gather(std::int64_t frame) {
    const std::size_t bins = m_track->Bins();
    const auto count = std::min(m_frames, kMemory);
    if (count == 0) return;
    std::fill_n(m_meanPower, bins, 0.0f);
    std::fill_n(m_meanLog, bins, 0.0f);
    for (std::int64_t i = frame - count + 1; i <= frame; ++i) {
        const float *const power = m_power[i], *const logPower = m_logPower[i];
        for (std::size_t bin = 0; bin < bins; ++bin) {
            m_meanPower[bin] += power[bin];
            m_meanLog[bin] += logPower[bin];
        }
    }
    const float share = 1.0f / static_cast<float>(count);
    for (std::size_t bin = 0; bin < bins; ++bin) {
        m_meanPower[bin] *= share;
        m_meanLog[bin] *= share;
    }
}

// The first levels: those of the profile, or a guess that the first frames make better.
void NoiseTracker::Begin() {
    std::ranges::fill(m_levels, 0.0f);
    std::ranges::fill(m_smooth, 0.0f);
    if (m_profile) return;
    for (std::size_t i = 0; i < m_levels.size(); ++i) {
        const auto& band = m_tables->bands[i];
        const std::size_t bins = band.end - band.first;
        std::copy_n(m_meanPower + band.first, bins, m_order);
        const auto quiet = m_kernels->quiet(m_order, m_meanLog + band.first, bins, band.quiet);
        m_levels[i] = Logarithm(static_cast<double>(quiet.sum / quiet.count));
    }
}

// Takes the smooth slope across the bands out of the spectrum, so that the quiet half is not just its lower
// end.
void NoiseTracker::Shape() {
    const std::size_t bands = m_levels.size(), bins = m_track->Bins();
    const auto keep = Settling() ? 0.0f : static_cast<float>(std::exp(-m_hopSeconds / kShapeSeconds));
    for (std::size_t i = 0; i < bands; ++i) {
        float sum = 0.0f;
        for (const int offset : {-2, -1, 0, 1, 2}) {
            const auto at = std::clamp<std::ptrdiff_t>(static_cast<std::ptrdiff_t>(i) + offset, 0,
                                                       static_cast<std::ptrdiff_t>(bands) - 1);
            sum += static_cast<float>(3 - std::abs(offset)) * m_levels[static_cast<std::size_t>(at)];
        }
        m_smooth[i] = keep * m_smooth[i] + (1.0f - keep) * sum / 9.0f;
    }
    LevelsToBins(m_smooth, m_logShape);
    if (m_profile)
        for (std::size_t i = 0; i < bins; ++i) m_order[i] = -(m_logShape[i] + m_logProfile[i]);
    else
        for (std::size_t i = 0; i < bins; ++i) m_order[i] = -m_logShape[i];
    m_kernels->exponential(m_order, m_white, m_track->Values());
    for (std::size_t i = 0; i < bins; ++i) {
        m_white[i] = std::min(m_white[i] * m_meanPower[i], kMostWhite);
        m_logWhite[i] = m_meanLog[i] + m_order[i];
    }
}

// Level and flatness of the quiet half of a quarter of the bands.
void NoiseTracker::Compare(std::size_t group) {
    const float few = kFewFrames[static_cast<std::size_t>(std::min(m_frames, kMemory)) - 1];
    const auto& groups = m_tables->groups;
    for (std::size_t i = groups[group]; i < groups[group + 1]; ++i) {
        const auto& band = m_tables->bands[i];
        const std::size_t bins = band.end - band.first;
        std::copy_n(m_white + band.first, bins, m_order);
        const auto quiet = m_kernels->quiet(m_order, m_logWhite + band.first, bins, band.quiet);
        const float mean = Logarithm(static_cast<double>(quiet.sum / quiet.count));
        const float reference =
            m_logShape[band.below] + (m_logShape[band.below + 1] - m_logShape[band.below]) * band.share;
        m_candidates[i] = mean - Logarithm(static_cast<double>(band.whiteLevel * few)) + reference;
        m_flatness[i] = quiet.logSum / quiet.count - mean - band.whiteFlatness;
    }
}

void NoiseTracker::Update() {
    if (Settling()) {
        m_levels = m_candidates;
        return;
    }
    const auto up = static_cast<float>(1.0 - std::exp(-m_hopSeconds / kUpSeconds)),
               down = static_cast<float>(1.0 - std::exp(-m_hopSeconds / kDownSeconds)),
               creep = static_cast<float>(kCreepDbPerSecond * kPerDb * m_hopSeconds);
    for (std::size_t i = 0; i < m_levels.size(); ++i) {
        const float trust = std::clamp((m_flatness[i] + kTrustRange) / kTrustRange, 0.0f, 1.0f);
        const float missing = (m_candidates[i] - m_levels[i]) * m_follow[i];
        if (missing > 0.0f)
            m_levels[i] += std::max(up * missing * trust, std::min(creep, up * missing));
        else
            m_levels[i] += (trust > 0.5f ? up : down) * missing;
        if (m_profile) m_levels[i] = std::clamp(m_levels[i], -kFollowRange, kFollowRange);
    }
}

// Linear in the logarithm of the power over that of the frequency. Below the first band the slope goes on.
void NoiseTracker::LevelsToBins(const std::vector<float>& levels, float* logarithms) const {
    const auto& t = *m_tables;
    for (std::size_t bin = 0; bin < t.logBin.size(); ++bin) {
        const float below = levels[t.bandBelow[bin]];
        logarithms[bin] = below + (levels[t.bandBelow[bin] + 1u] - below) * t.bandShare[bin];
    }
    if (m_profile) return;
    const float first = t.bands[0].logCentre;
    const float slope =
        std::clamp((levels[2] - levels[0]) / (t.bands[2].logCentre - first), -kSteepestSlope, kSteepestSlope);
    for (std::size_t bin = 0; bin < t.belowFirst; ++bin)
        logarithms[bin] = levels[0] + slope * (std::max(t.logBin[bin], 0.0f) - first);
}

}  // namespace Corvo::DSP::Denoising
