#include "DSP/Effects/Denoiser/SizeReducer.h"

#include <cmath>

#include "DSP/Effects/Denoiser/HannWeights.h"

namespace Corvo::DSP::Denoising {
namespace {

constexpr float kPrior = 0.2f, kPriorLow = 0.0001f, kPriorHigh = 0.8f;
constexpr int kSupportBefore = 3;       // frames, of the presences that make the prior
constexpr int kSmoothHalf = 7;          // bins to either side
constexpr float kMostWhitening = 4.6f;  // natural logarithm of a power

const std::array<float, kSmoothHalf + 1>& BinWeights() {
    static const std::array<float, kSmoothHalf + 1> weights = [] {
        std::array<float, 2 * kSmoothHalf + 1> all;
        HannWeights(all);
        std::array<float, kSmoothHalf + 1> half;
        std::copy_n(all.begin() + kSmoothHalf, half.size(), half.begin());
        return half;
    }();
    return weights;
}

}  // namespace

void SizeReducer::Prepare(Arena& arena, const SizePlan& plan, WindowTables& tables, std::size_t channels) {
    m_kernels = &BestSpectrumKernels();
    m_plan = plan;
    m_tables = &tables;
    m_channels = channels;
    m_values = tables.Values();
    m_pieces = (m_values + kPiece - 1) / kPiece;
    const auto frames = [](int count) { return static_cast<std::size_t>(count); };
    for (std::size_t c = 0; c < channels; ++c)
        for (auto* ring : {&m_re[c], &m_im[c]}) ring->Take(arena, frames(Delay() + 1), tables.Half());
    m_ratio.Take(arena, frames(std::max(Delay(), plan.kernel / 2 + plan.ahead) + 1), m_values);
    for (auto* ring : {&m_evidence, &m_unlikely}) ring->Take(arena, frames(2 * SupportAhead() + 1), m_values);
    for (auto& ring : m_support) ring.Take(arena, frames(kSupportBefore + 1 + SupportAhead()), m_values);
    m_presence.Take(arena, frames(EstimateAhead() + 1), m_values);
    m_estimate.Take(arena, 3, m_values);
    m_risks.Take(arena, static_cast<std::size_t>(kRisks), kRiskBands);
    for (auto& raw : m_raw) raw = arena.Take(m_values + 2 * kEdge);
    for (auto& power : m_power) power = arena.Take(m_values);
    for (auto* values : {&m_meanNoise, &m_gain, &m_risk, &m_whiteFloor, &m_logWhiteFloor})
        *values = arena.Take(m_values);
    if (arena.Counting()) return;
    HannWeights(std::span(m_evidenceWeights).first(static_cast<std::size_t>(plan.kernel)),
                static_cast<std::size_t>(plan.ahead));
    HannWeights(m_supportWeights, static_cast<std::size_t>(SupportAhead()));
    HannWeights(m_estimateWeights, static_cast<std::size_t>(EstimateAhead()));
}

SizeReducer::Step SizeReducer::At(int step) const {
    auto rest = static_cast<std::size_t>(step);
    const std::pair<Stage, std::size_t> order[] = {
        {Stage::Analyse, m_channels},   {Stage::Ratio, m_pieces}, {Stage::Presence, m_pieces},
        {Stage::Gain, m_pieces},        {Stage::Mask, 1},         {Stage::Risk, m_pieces},
        {Stage::Synthesise, m_channels}};
    for (const auto& [stage, count] : order) {
        if (rest < count) return {stage, rest};
        rest -= count;
    }
    return {Stage::Synthesise, m_channels - 1};
}

float SizeReducer::Cost(int step) const {
    const Step place = At(step);
    const auto bins = [&](float each) {
        return each * static_cast<float>(To(place.index) - From(place.index));
    };
    switch (place.stage) {
        case Stage::Analyse:
        case Stage::Synthesise:
            return 1.6f * static_cast<float>(m_tables->length);
        case Stage::Ratio:
            return bins(1.4f + 0.5f * static_cast<float>(m_channels));
        case Stage::Presence:
            return bins(0.9f);
        case Stage::Gain:
            return bins(2.6f);
        case Stage::Mask:
            return 0.0f;
        case Stage::Risk:
            return bins(0.5f);
    }
    return 0.0f;
}

void SizeReducer::Run(int step, const Job& job) {
    if (step == 0) m_settings = m_next;
    const auto [stage, index] = At(step);
    const std::int64_t evidence = job.frame - m_plan.ahead, gains = job.frame - Delay();
    switch (stage) {
        case Stage::Analyse:
            return Analyse(index, job);
        case Stage::Ratio:
            Ratios(index, job);
            if (index + 1 == m_pieces && evidence >= 0) PadEdges(Padded(m_raw[0]));
            return;
        case Stage::Presence:
            return Presences(index, evidence);
        case Stage::Gain:
            return Gains(index, evidence - SupportAhead());
        case Stage::Mask:
            if (gains >= 0) Mask(gains);
            return;
        case Stage::Risk:
            if (gains >= 0) Risks(index, gains);
            return;
        case Stage::Synthesise:
            if (gains >= 0) Synthesise(index, job);
            return;
    }
}

void SizeReducer::PadEdges(float* padded) const {
    const std::size_t bins = m_tables->Bins();
    std::fill_n(padded - kEdge, kEdge, padded[0]);
    std::fill(padded + bins, padded + m_values + kEdge, padded[bins - 1]);
}

void SizeReducer::Analyse(std::size_t channel, const Job& job) {
    auto& tables = *m_tables;
    Transform(*m_kernels, tables, job.input[channel], (job.frame - (kOverlap - 1)) * Hop(),
              m_re[channel][job.frame], m_im[channel][job.frame]);
    float* const power = m_power[channel];
    m_kernels->power(m_re[channel][job.frame], m_im[channel][job.frame], power, tables.Half());
    std::fill(power + tables.Bins(), power + m_values, 1.0f);
}

// The ratios of this frame, then how present signal is in an earlier one.
void SizeReducer::Ratios(std::size_t piece, const Job& job) {
    const std::size_t from = From(piece), to = To(piece);
    for (std::size_t c = 0; c < m_channels; ++c)
        m_kernels->ratio({.power = m_power[c],
                          .before = job.noise[c].before ? job.noise[c].before : m_power[c],
                          .after = job.noise[c].after ? job.noise[c].after : m_power[c],
                          .curve = m_curve,
                          .share = job.noise[c].share,
                          .weight = 1.0f / static_cast<float>(m_channels),
                          .first = c == 0,
                          .last = c + 1 == m_channels,
                          .ratio = m_ratio[job.frame],
                          .meanNoise = m_meanNoise},
                         from, to);
    if (m_settings.whitening > 0.0f) Whiten(from, to, job.logReference);
    const std::int64_t frame = job.frame - m_plan.ahead;
    if (frame < 0) return;

    std::array<const float*, 32> ratios;
    const int first = m_plan.kernel / 2, count = first + m_plan.ahead + 1;
    for (int i = 0; i < count; ++i) ratios[static_cast<std::size_t>(i)] = m_ratio[frame + i - first];
    const float detail = std::pow(10.0f, 0.1f * m_settings.detailDb);
    m_kernels->evidence({.ratios = {ratios.data(), m_evidenceWeights.data(), count},
                         .slope = 0.5f * m_plan.degrees * detail / (1.0f + detail),
                         .offset = 0.5f * m_plan.degrees * std::log1p(detail),
                         .prior = kPrior,
                         .evidence = m_evidence[frame],
                         .unlikely = m_unlikely[frame],
                         .presence = Padded(m_raw[0])},
                        from, to);
}

// The floor rises where the noise is weak and sinks where it is strong, so that the residual tends to white.
void SizeReducer::Whiten(std::size_t from, std::size_t to, float reference) {
    m_kernels->logarithm(m_meanNoise + from, m_logWhiteFloor + from, to - from);
    for (std::size_t i = from; i < to; ++i) {
        const float above = std::clamp(m_logWhiteFloor[i] - reference, -kMostWhitening, kMostWhitening);
        m_logWhiteFloor[i] = std::min(m_logFloor[i] - 0.5f * m_settings.whitening * above, 0.0f);
    }
    m_kernels->exponential(m_logWhiteFloor + from, m_whiteFloor + from, to - from);
}

// Smooths the presences of frame `newest` over bins and makes them, with those of the frames before, the
// prior of an earlier frame, whose presences are the result.
void SizeReducer::Support(std::size_t pass, std::size_t piece, std::int64_t newest, float* presence) {
    if (newest < 0) return;
    m_kernels->smoothBins(Padded(m_raw[pass]), m_support[pass][newest], BinWeights().data(), kSmoothHalf,
                          From(piece), To(piece));
    const std::int64_t frame = newest - SupportAhead();
    if (frame < 0) return;
    std::array<const float*, 7> frames;
    const int count = kSupportBefore + 1 + SupportAhead();
    for (int i = 0; i < count; ++i)
        frames[static_cast<std::size_t>(i)] = m_support[pass][frame + i - kSupportBefore];
    m_kernels->presence({.smoothed = {frames.data(), m_supportWeights.data(), count},
                         .unlikely = m_unlikely[frame],
                         .low = kPriorLow,
                         .span = kPriorHigh - kPriorLow,
                         .presence = presence},
                        From(piece), To(piece));
}

void SizeReducer::Presences(std::size_t piece, std::int64_t newest) {
    Support(0, piece, newest, Padded(m_raw[1]));
    if (piece + 1 == m_pieces && newest >= SupportAhead()) PadEdges(Padded(m_raw[1]));
}

void SizeReducer::Gains(std::size_t piece, std::int64_t newest) {
    const std::size_t from = From(piece), to = To(piece);
    const std::int64_t second = newest - SupportAhead();
    Support(1, piece, newest, m_presence[second]);
    if (second < 0) return;
    m_kernels->firstEstimate(m_presence[second], m_evidence[second], m_ratio[second], m_estimate[second],
                             from, to);
    const std::int64_t frame = second - EstimateAhead();
    if (frame < 0) return;
    const std::array<const float*, 3> estimates{m_estimate[frame - 1], m_estimate[frame],
                                                m_estimate[frame + EstimateAhead()]};
    const bool white = m_settings.whitening > 0.0f;
    m_kernels->gain({.estimates = {estimates.data(), m_estimateWeights.data(), 2 + EstimateAhead()},
                     .presence = m_presence[frame],
                     .floor = white ? m_whiteFloor : m_floor,
                     .logFloor = white ? m_logWhiteFloor : m_logFloor,
                     .gain = m_gain},
                    from, to);
}

void SizeReducer::Mask(std::int64_t frame) {
    if (m_settings.keepMasked)
        m_tables->bins->masking.Apply(m_gain, m_ratio[frame], m_meanNoise, m_curve,
                                      m_settings.maskingOffsetDb);
}

// Summed up over the bands of the blend.
void SizeReducer::Risks(std::size_t piece, std::int64_t frame) {
    m_kernels->risk(m_ratio[frame], m_gain, m_risk, From(piece), To(piece));
    for (std::size_t band = 0; band < kRiskBands; ++band) {
        const auto [first, last] = m_tables->bins->riskRanges[band];
        const std::size_t from = std::max(first, From(piece)), to = std::min(last, To(piece));
        float& sum = m_risks[frame][band];
        if (piece == 0) sum = 0.0f;
        if (from < to) sum += m_kernels->dot(m_risk + from, m_tables->bins->RiskBand(band) + from, to - from);
    }
}

void SizeReducer::Synthesise(std::size_t channel, const Job& job) {
    auto& tables = *m_tables;
    const std::int64_t frame = job.frame - Delay(), start = (frame - (kOverlap - 1)) * Hop();
    float *const re = m_re[channel][frame], *const im = m_im[channel][frame];
    m_kernels->applyGain(re, im, m_gain, tables.Half());
    tables.Inverse(re, im);
    OverlapAdd(*m_kernels, tables, job.output[channel], start);
}

}  // namespace Corvo::DSP::Denoising
