#include "DSP/Pitch/VoicePitchAnalysis.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <numbers>

#include "DSP/Parts/Correlation.h"
#include "DSP/Parts/SharedTables.h"

namespace Corvo::DSP {
namespace {

// Times are laid out for 48 kHz and scale with the rate.
constexpr double kReferenceRate = 48000.0, kHopAtReference = 256.0, kStepAtReference = 32.0;
constexpr int kLongestStep = 32, kLeastSteps = 3;

constexpr double kLimit = 1e9;     // of a sample: its square still is a float
constexpr double kHighPass = 0.6;  // of the lowest pitch
constexpr double kLowPassHz = 2500.0;
constexpr double kAliasHz = 7000.0;  // for the full band, of which 5000 Hz are used

constexpr float kMeanShare = 0.9f;  // of the mean, by which the spectrum is flattened

constexpr double kLeastPeak = 0.2, kFlatNeutral = 0.3;
constexpr double kOctaveCost = 0.02, kHighOctaveCost = 0.14, kHighHz = 500.0;

// The second measurement: over so many periods, at least this share of the longest.
constexpr double kMeasuredPeriods = 2.5, kMeasuredLeast = 0.8, kMeasuredUse = 0.6, kMeasuredDrop = 0.12;
constexpr double kMeasuredReach = 0.06, kMeasuredReachNext = 0.03;  // of a period
constexpr int kMeasuredMultiples = 4;

constexpr double kTiny = 1e-12;
constexpr float kLeastPower = 1e-30f;

// Written so that NaN takes a limit.
double Within(double value, double least, double most) {
    return value > least ? std::min(value, most) : least;
}

double OctaveCost(double seconds, double lowestHz) {
    double cost = kOctaveCost * std::log2(seconds * lowestHz);
    if (seconds * kHighHz < 1.0) cost += kHighOctaveCost * std::log2(seconds * kHighHz);
    return cost;
}

// x^0.2 to 1e-5, x above 0: a fifth of the exponent, then Newton's steps.
float FifthRoot(float x) {
    constexpr float kExponent = 0.2f;
    constexpr std::int32_t kBias = 0x32CCCCCD;
    const auto fifth =
        static_cast<std::int32_t>(static_cast<float>(std::bit_cast<std::int32_t>(x)) * kExponent);
    float root = std::bit_cast<float>(fifth + kBias);
    for (int step = 0; step < 2; ++step) {
        const float square = root * root;
        root = root * (1.0f - kExponent) + x * kExponent / (square * square);
    }
    return root;
}

}  // namespace

VoicePitchAnalysis::VoicePitchAnalysis(const VoicePitchSettings& settings)
    : m_rate(Within(settings.rate, 1000.0, 768000.0)),
      m_lowestHz(Within(settings.lowestHz, 20.0, 1000.0)),
      m_tables(SharedTables<VoicePitchTables>(m_rate, m_lowestHz)),
      m_analysisRate(m_tables->analysisRate),
      m_decimation(m_tables->decimation),
      m_length(m_tables->length),
      m_longestPiece(m_length * m_decimation) {
    const double reference = m_rate / kReferenceRate;
    m_step = std::clamp(static_cast<int>(std::lround(kStepAtReference * reference)), 1, kLongestStep);
    const double hop = kHopAtReference * reference * (settings.shortHop ? 0.5 : 1.0);
    m_hop = m_step * std::max(static_cast<int>(std::lround(hop / m_step)), kLeastSteps);

    m_highPass = Biquad::HighPass(kHighPass * m_lowestHz, std::numbers::sqrt2 / 2.0, m_rate);
    m_low1 = Biquad::LowPass(kLowPassHz, Biquad::kFirstOfFour, m_rate);
    m_low2 = Biquad::LowPass(kLowPassHz, Biquad::kSecondOfFour, m_rate);
    m_alias1 = Biquad::LowPass(kAliasHz, Biquad::kFirstOfFour, m_rate);
    m_alias2 = Biquad::LowPass(kAliasHz, Biquad::kSecondOfFour, m_rate);
    SetHighest(settings.highestHz);
    SetSilence(settings.silence);
}

void VoicePitchAnalysis::Prepare(Arena& arena) {
    const auto floats = [&](auto count) {
        return std::span(arena.Take(static_cast<std::size_t>(count)), static_cast<std::size_t>(count));
    };
    const auto doubles = [&](int count) { return arena.Take<double>(static_cast<std::size_t>(count)); };
    m_low.Prepare(arena, m_longestPiece + (kDecideStep + 1) * m_step);
    m_lowSlow.Prepare(arena, m_length);
    m_full.Prepare(arena, m_length);
    m_work = arena.Take(Fft::WorkValues(m_tables->Transform().points));
    m_magnitudes = floats(m_tables->band.size());
    m_spectrum = floats(m_tables->size);
    m_nsdf = floats(m_tables->lags);
    m_flat = floats(m_tables->lags);
    m_sums = doubles(m_length + 1);
    m_pieceSums = doubles(m_longestPiece + 1);
    m_frames = arena.Take<VoicePitchFrame>(kKept);
}

void VoicePitchAnalysis::Clear() {
    for (auto* filter : {&m_highPass, &m_low1, &m_low2, &m_alias1, &m_alias2}) filter->Clear();
    m_low.Clear();
    m_lowSlow.Clear();
    m_full.Clear();
    if (m_given > 0) std::ranges::fill(m_flat, 0.0f);
    m_given = m_frameEnd = 0;
    m_untilDecimated = m_decimation;
    m_untilStep = m_step;
    m_stepInHop = 0;
    m_loud = false;
    m_path.Clear();
    m_count = 0;
    m_made = m_taken = 0;
}

void VoicePitchAnalysis::SetHighest(double hz) { m_highestHz = Within(hz, 2.0 * m_lowestHz, 2000.0); }
void VoicePitchAnalysis::SetSilence(double decibels) {
    m_silencePower = std::pow(10.0, Within(decibels, -200.0, 0.0) / 10.0);
}

bool VoicePitchAnalysis::TakeFrame(VoicePitchFrame& frame) {
    if (m_taken == m_made) return false;
    frame = m_frames[m_taken++ % kKept];
    return true;
}

void VoicePitchAnalysis::Take(double sample) {
    const double full = m_highPass(std::isfinite(sample) ? std::clamp(sample, -kLimit, kLimit) : 0.0);
    const double low = m_low2(m_low1(full));
    const double limited = m_decimation > 1 ? m_alias2(m_alias1(full)) : full;
    m_low.Push(static_cast<float>(low));
    ++m_given;
    if (--m_untilDecimated > 0) return;
    m_untilDecimated = m_decimation;
    m_lowSlow.Push(static_cast<float>(low));
    m_full.Push(static_cast<float>(limited));
}

void VoicePitchAnalysis::Work() {
    const int steps = m_hop / m_step;
    m_stepInHop = (m_stepInHop + 1) % steps;
    if (m_stepInHop == 0) TransformLow();
    if (m_stepInHop == 1 && m_loud) CorrelateLow();
    if (m_stepInHop == kDecideStep) Decide();
    // The spectrum is free again: the low band's has become its correlation.
    if (m_stepInHop == steps - 2 && m_stepInHop != 1) TransformFull();
    if (m_stepInHop == steps - 1) CorrelateFull();
}

void VoicePitchAnalysis::Forward() {
    const auto& plan = m_tables->Transform();
    plan.kernels->realForward(plan, m_spectrum.data(), m_spectrum.data(), m_work);
}

void VoicePitchAnalysis::Inverse() {
    const auto& plan = m_tables->Transform();
    plan.kernels->realInverse(plan, m_spectrum.data(), m_spectrum.data(), m_work);
}

void VoicePitchAnalysis::TransformFull() {
    const float* const samples = m_full.At(m_full.End() - m_length);
    const auto& window = m_tables->window;
    for (std::size_t i = 0; i < window.size(); ++i) m_spectrum[i] = samples[i] * window[i];
    std::fill(m_spectrum.begin() + m_length, m_spectrum.end(), 0.0f);
    Forward();
}

void VoicePitchAnalysis::CorrelateFull() {
    if (m_hop / m_step == kLeastSteps) TransformFull();  // it had no step of its own
    Flatten();
    Inverse();
    const float scale = 1.0f / (m_spectrum[0] + static_cast<float>(kTiny));
    for (std::size_t lag = 0; lag < m_flat.size(); ++lag)
        m_flat[lag] = m_spectrum[lag] * scale / m_tables->overlap[lag];
}

// The spectrum without its formants: what is above the mean around it.
void VoicePitchAnalysis::Flatten() {
    const auto& band = m_tables->band;
    const auto end = static_cast<std::ptrdiff_t>(band.size());
    const auto s = m_spectrum;
    const auto magnitudes = m_magnitudes;
    for (std::size_t bin = 0; bin < band.size(); ++bin)
        magnitudes[bin] = s[2 * bin] * s[2 * bin] + s[2 * bin + 1] * s[2 * bin + 1];
    for (std::size_t bin = 0; bin < band.size(); ++bin)
        magnitudes[bin] = FifthRoot(std::max(magnitudes[bin], kLeastPower)) * band[bin];
    std::ranges::fill(s, 0.0f);
    const auto at = [&](std::ptrdiff_t bin) { return magnitudes[static_cast<std::size_t>(bin)]; };
    const std::ptrdiff_t reach = m_tables->meanBins;
    const float share = kMeanShare / static_cast<float>(2 * reach + 1);
    double sum = 0.0;
    for (std::ptrdiff_t bin = 0; bin < std::min(reach, end); ++bin) sum += static_cast<double>(at(bin));
    for (std::ptrdiff_t bin = 0; bin < end; ++bin) {
        if (bin + reach < end) sum += static_cast<double>(at(bin + reach));
        if (bin > reach) sum -= static_cast<double>(at(bin - reach - 1));
        if (bin > 0)
            s[static_cast<std::size_t>(2 * bin)] = std::max(at(bin) - share * static_cast<float>(sum), 0.0f);
    }
}

void VoicePitchAnalysis::TransformLow() {
    m_frameEnd = m_given;
    const float* const samples = m_lowSlow.At(m_lowSlow.End() - m_length);
    const auto length = static_cast<std::size_t>(m_length);
    for (std::size_t i = 0; i < length; ++i)
        m_sums[i + 1] = m_sums[i] + static_cast<double>(samples[i]) * static_cast<double>(samples[i]);
    m_loud = m_sums[length] > m_length * m_silencePower;
    if (!m_loud) return;
    std::copy_n(samples, length, m_spectrum.begin());
    std::fill(m_spectrum.begin() + m_length, m_spectrum.end(), 0.0f);
    Forward();
}

void VoicePitchAnalysis::CorrelateLow() {
    const auto s = m_spectrum;
    s[0] *= s[0];
    s[1] *= s[1];
    for (std::size_t i = 2; i < s.size(); i += 2) {
        s[i] = s[i] * s[i] + s[i + 1] * s[i + 1];
        s[i + 1] = 0.0f;
    }
    Inverse();
    const auto length = static_cast<std::size_t>(m_length);
    for (std::size_t lag = 0; lag < m_nsdf.size(); ++lag) {
        const double energies = m_sums[length - lag] + (m_sums[length] - m_sums[lag]);
        m_nsdf[lag] = static_cast<float>(2.0 * static_cast<double>(s[lag]) / (energies + kTiny));
    }
}

PeriodCandidate VoicePitchAnalysis::CandidateAt(int lag) const {
    const auto at = static_cast<std::size_t>(lag), last = m_nsdf.size() - 2;
    const ParabolaTop top(m_nsdf[at - 1], m_nsdf[at], m_nsdf[at + 1]);
    const double place = lag + top.offset;
    const auto flat = m_flat;
    auto near = std::clamp<std::size_t>(static_cast<std::size_t>(std::lround(place)), 1, last);
    if (flat[near - 1] > flat[near])
        --near;
    else if (flat[near + 1] > flat[near])
        ++near;
    near = std::clamp<std::size_t>(near, 1, last);
    double flattened = flat[near];
    if (flat[near] >= flat[near - 1] && flat[near] >= flat[near + 1])
        flattened = ParabolaTop(flat[near - 1], flat[near], flat[near + 1]).height;
    PeriodCandidate candidate;
    candidate.seconds = place / m_analysisRate;
    candidate.log2Seconds = std::log2(candidate.seconds);
    candidate.value = std::min(top.height, 1.0) + flattened - kFlatNeutral;
    candidate.cost = 1.0 - (candidate.value - OctaveCost(candidate.seconds, m_lowestHz));
    return candidate;
}

void VoicePitchAnalysis::FindCandidates() {
    struct Maximum {
        int lag;
        double worth;
    };
    std::array<Maximum, kMostPeriods> best{};
    m_count = 0;
    if (!m_loud) return;
    for (int lag = std::max(static_cast<int>(m_analysisRate / m_highestHz), 2); lag < m_tables->lags - 1;
         ++lag) {
        const auto at = static_cast<std::size_t>(lag);
        const float here = m_nsdf[at];
        const bool isPeak =
            here > m_nsdf[at - 1] && here >= m_nsdf[at + 1] && here > static_cast<float>(kLeastPeak);
        if (!isPeak) continue;
        const Maximum found{lag, static_cast<double>(here) - OctaveCost(lag / m_analysisRate, m_lowestHz)};
        if (m_count < best.size()) {
            best[m_count++] = found;
            continue;
        }
        auto* const least = std::ranges::min_element(best, {}, &Maximum::worth);
        if (least->worth >= found.worth) continue;
        std::move(least + 1, best.end(), least);  // they stay in order
        best.back() = found;
    }
    for (std::size_t i = 0; i < m_count; ++i) {
        m_periods[i] = CandidateAt(best[i].lag);
        m_candidates[i] = {1.0 / m_periods[i].seconds, m_periods[i].value};
    }
}

void VoicePitchAnalysis::Decide() {
    FindCandidates();
    const double hops = m_hop / (kHopAtReference * m_rate / kReferenceRate);
    const int chosen = m_path.Advance({m_periods.data(), m_count}, hops);
    VoicePitchFrame& frame = m_frames[m_made++ % kKept];
    m_taken = std::max(m_taken, m_made - std::min<std::uint64_t>(m_made, kKept));
    frame = {m_frameEnd, m_longestPiece / 2.0, 0.0, 0.0};
    if (chosen < 0) return;
    const auto& candidate = m_periods[static_cast<std::size_t>(chosen)];
    const auto [period, piece] = Measure(candidate.seconds * m_rate);
    frame.hz = m_rate / period;
    frame.age = piece / 2.0;
    frame.value = candidate.value;
}

std::pair<double, int> VoicePitchAnalysis::Measure(double period) {
    const int least = static_cast<int>(kMeasuredLeast * m_rate / m_lowestHz);
    const int piece = std::min(std::max(static_cast<int>(kMeasuredPeriods * period), least), m_longestPiece);
    const float* const x = m_low.At(m_frameEnd - piece);
    for (int i = 0; i < piece; ++i) {
        const auto at = static_cast<std::size_t>(i);
        m_pieceSums[at + 1] = m_pieceSums[at] + static_cast<double>(x[i]) * static_cast<double>(x[i]);
    }
    const auto sum = [&](int samples) { return m_pieceSums[static_cast<std::size_t>(samples)]; };
    const auto similarity = [&](int lag) {
        const double energies = sum(piece - lag) + sum(piece) - sum(lag);
        return 2.0 * DotProduct(x, x + lag, piece - lag) / (energies + kTiny);
    };
    const int multiples = std::clamp(static_cast<int>(kMeasuredUse * piece / period), 1, kMeasuredMultiples);
    double best = period, first = 0.0;
    for (int k = 1; k <= multiples; ++k) {
        const double centre = best * k, share = k > 1 ? kMeasuredReachNext : kMeasuredReach;
        const int reach = std::max(2, static_cast<int>(std::lround(share * period))) + 1;
        const int from = static_cast<int>(centre) - reach, to = static_cast<int>(centre) + reach + 1;
        if (from < 2 || to >= piece - 8) break;
        const Peak peak = FindPeak(from, to, m_decimation, similarity);
        if (!peak.inside || (k > 1 && peak.height < first - kMeasuredDrop)) break;
        if (k == 1) first = peak.height;
        best = peak.place / k;
    }
    return {best, piece};
}

}  // namespace Corvo::DSP
