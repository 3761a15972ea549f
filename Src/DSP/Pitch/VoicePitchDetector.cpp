#include "DSP/Pitch/VoicePitchDetector.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <numbers>
#include <vector>

#include "DSP/Parts/Biquad.h"
#include "DSP/Parts/Correlation.h"
#include "DSP/Parts/SampleHistory.h"
#include "DSP/Pitch/VoicePitchPath.h"
#include "Platform/DenormalGuard.h"
#include "Spectrum/Fft/CorvoFFT.h"

namespace Corvo::DSP {
namespace {

using Batch = xsimd::make_sized_batch_t<float, 4>;

// Times are laid out for 48 kHz and scale with the rate.
constexpr double kReferenceRate = 48000.0, kHopAtReference = 256.0, kStepAtReference = 32.0;
constexpr int kLongestStep = 32;
constexpr double kAnalysisRate = 24000.0;  // about the rate of what is transformed
constexpr double kFramePeriods = 2.2;      // length of a frame, in longest periods
constexpr int kFrameExtra = 32;

constexpr double kHighPass = 0.6;  // of the lowest pitch
constexpr double kLowPassHz = 2500.0;
constexpr double kAliasHz = 7000.0;  // for what is flattened, which ends at 5000 Hz

// The flattened spectrum: power^0.2 between these edges, less most of its mean over 400 Hz to either side.
constexpr float kFlatten = 0.2f;
constexpr double kFadeInHz = 30.0, kFadedInHz = 60.0, kFadeOutHz = 3500.0, kEndHz = 5000.0;
constexpr double kMeanHz = 400.0;
constexpr float kMeanShare = 0.9f;

constexpr double kLeastPeak = 0.2, kFlatNeutral = 0.3, kLeastOverlap = 0.25;
constexpr double kOctaveCost = 0.02, kHighOctaveCost = 0.14, kHighHz = 500.0;

// The second measurement: over so many periods, at least this share of the longest.
constexpr double kMeasuredPeriods = 2.5, kMeasuredLeast = 0.8, kMeasuredUse = 0.6, kMeasuredDrop = 0.12;
constexpr int kMeasuredMultiples = 4;

constexpr std::size_t kKept = 64;
constexpr double kTiny = 1e-12;

double OctaveCost(double seconds, double lowestHz) {
    double cost = kOctaveCost * std::log2(seconds * lowestHz);
    if (seconds * kHighHz < 1.0) cost += kHighOctaveCost * std::log2(seconds * kHighHz);
    return cost;
}

// Work that is due at a step.
enum class Stage { Idle, Correlate, Decide };

}  // namespace

struct VoicePitchDetector::State {
    explicit State(const VoicePitchSettings& settings);
    void Clear();

    template <typename Sample>
    void Push(const Sample* samples, int count);
    void Work();
    void Transform();
    void Correlate();
    void Flatten();
    void Decide();
    void FindCandidates();
    PeriodCandidate CandidateAt(int lag) const;
    // Period in samples, and the length of the piece that it was measured on.
    std::pair<double, int> Measure(double period) const;

    VoicePitchSettings settings;
    double rate, analysisRate;
    int decimation, step, hop;
    int length, lags, size;  // of frame and transform, in decimated samples
    int longestPiece;        // of the second measurement, in samples

    Biquad highPass, low1, low2, alias1, alias2;
    SampleHistory<float> low;                // below 2500 Hz, at full rate
    SampleHistory<float> lowSlow, fullSlow;  // decimated: that, and the whole band
    std::int64_t given = 0, frameEnd = 0;
    int untilDecimated = 0, untilStep = 0, untilHop = 0;
    Stage stage = Stage::Idle;
    bool loud = false;

    CorvoFFT fft;
    std::vector<float> window, overlap, band;      // overlap: the window's own autocorrelation
    std::vector<float> lowSpectrum, fullSpectrum;  // packed spectra, then autocorrelations
    std::vector<float> flat;                       // flattened magnitudes
    std::vector<double> sums;                      // of squares before each sample of the frame
    std::vector<float> nsdf;
    mutable std::vector<double> pieceSums;
    int bandBins = 0, meanBins = 1;

    VoicePitchPath path;
    std::array<PeriodCandidate, kMostPeriods> periods{};
    std::array<VoicePitchCandidate, kMostPeriods> candidates{};
    std::size_t count = 0;
    std::array<VoicePitchFrame, kKept> frames{};
    std::uint64_t made = 0, taken = 0;
};

VoicePitchDetector::State::State(const VoicePitchSettings& wanted) : settings(wanted) {
    // Written so that NaN takes a limit.
    const auto within = [](double value, double least, double most) {
        return value > least ? std::min(value, most) : least;
    };
    settings.rate = rate = within(wanted.rate, 1000.0, 768000.0);
    settings.lowestHz = within(wanted.lowestHz, 20.0, 1000.0);
    decimation = std::max(static_cast<int>(std::lround(rate / kAnalysisRate)), 1);
    analysisRate = rate / decimation;
    step =
        std::clamp(static_cast<int>(std::lround(kStepAtReference * rate / kReferenceRate)), 1, kLongestStep);
    const double hopSamples = kHopAtReference * rate / kReferenceRate * (settings.shortHop ? 0.5 : 1.0);
    hop = step * std::max(static_cast<int>(std::lround(hopSamples / step)), 3);
    length = static_cast<int>(kFramePeriods * analysisRate / settings.lowestHz) + kFrameExtra;
    lags = static_cast<int>(analysisRate / settings.lowestHz) + 3;
    size = static_cast<int>(std::bit_ceil(static_cast<unsigned>(length + lags)));
    longestPiece = length * decimation;
    fft.AllocateReal(size, 1);

    highPass = Biquad::HighPass(kHighPass * settings.lowestHz, std::numbers::sqrt2 / 2.0, rate);
    low1 = Biquad::LowPass(kLowPassHz, Biquad::kFirstOfFour, rate);
    low2 = Biquad::LowPass(kLowPassHz, Biquad::kSecondOfFour, rate);
    alias1 = Biquad::LowPass(kAliasHz, Biquad::kFirstOfFour, rate);
    alias2 = Biquad::LowPass(kAliasHz, Biquad::kSecondOfFour, rate);
    low.Allocate(longestPiece + 4 * hop);
    lowSlow.Allocate(length);
    fullSlow.Allocate(length);

    const auto frame = static_cast<std::size_t>(length);
    window.resize(frame);
    for (std::size_t i = 0; i < frame; ++i)
        window[i] = static_cast<float>(
            0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * static_cast<double>(i) / (length - 1)));
    overlap.resize(static_cast<std::size_t>(lags));
    const double whole = DotProduct(window.data(), window.data(), length);
    for (int lag = 0; lag < lags; ++lag)
        overlap[static_cast<std::size_t>(lag)] = static_cast<float>(
            std::max(DotProduct(window.data(), window.data() + lag, length - lag) / whole, kLeastOverlap));
    const double binHz = analysisRate / size;
    bandBins = std::min(static_cast<int>(kEndHz / binHz) + 1, size / 2);
    meanBins = std::max(static_cast<int>(kMeanHz / binHz), 8);
    for (int bin = 0; bin < bandBins; ++bin) {
        const double hz = bin * binHz;
        const double in = (hz - kFadeInHz) / (kFadedInHz - kFadeInHz);
        const double out = (kEndHz - hz) / (kEndHz - kFadeOutHz);
        band.push_back(static_cast<float>(std::clamp(in, 0.0, 1.0) * std::clamp(out, 0.0, 1.0)));
    }
    lowSpectrum.resize(static_cast<std::size_t>(size));
    fullSpectrum.resize(static_cast<std::size_t>(size));
    flat.resize(static_cast<std::size_t>(bandBins) + 4);
    sums.resize(frame + 1);
    nsdf.resize(static_cast<std::size_t>(lags));
    pieceSums.resize(static_cast<std::size_t>(longestPiece) + 1);
    Clear();
}

void VoicePitchDetector::State::Clear() {
    for (auto* filter : {&highPass, &low1, &low2, &alias1, &alias2}) filter->Clear();
    low.Clear();
    lowSlow.Clear();
    fullSlow.Clear();
    given = 0;
    untilDecimated = decimation;
    untilStep = step;
    untilHop = hop;
    stage = Stage::Idle;
    path.Clear();
    count = 0;
    made = taken = 0;
}

template <typename Sample>
void VoicePitchDetector::State::Push(const Sample* samples, int samplesGiven) {
    while (samplesGiven > 0) {
        const int piece = std::min(samplesGiven, untilStep);
        for (int i = 0; i < piece; ++i) {
            const double sample = samples[i];
            const double full = highPass(std::isfinite(sample) ? sample : 0.0);
            const double lowPassed = low2(low1(full));
            const double limited = decimation > 1 ? alias2(alias1(full)) : full;
            low.Push(static_cast<float>(lowPassed));
            if (--untilDecimated > 0) continue;
            untilDecimated = decimation;
            lowSlow.Push(static_cast<float>(lowPassed));
            fullSlow.Push(static_cast<float>(limited));
        }
        samples += piece;
        samplesGiven -= piece;
        given += piece;
        untilHop -= piece;
        if ((untilStep -= piece) > 0) continue;
        untilStep = step;
        Work();
    }
}

// One step's share: a frame is transformed, correlated and decided at three steps in turn.
void VoicePitchDetector::State::Work() {
    if (untilHop == 0) {
        untilHop = hop;
        frameEnd = given;
        Transform();
        stage = Stage::Correlate;
    } else if (stage == Stage::Correlate) {
        if (loud) Correlate();
        stage = Stage::Decide;
    } else if (stage == Stage::Decide) {
        Decide();
        stage = Stage::Idle;
    }
}

void VoicePitchDetector::State::Transform() {
    const float* const lows = lowSlow.At(lowSlow.End() - length);
    const float* const fulls = fullSlow.At(fullSlow.End() - length);
    const auto frame = static_cast<std::size_t>(length);
    for (std::size_t i = 0; i < frame; ++i)
        sums[i + 1] = sums[i] + static_cast<double>(lows[i]) * static_cast<double>(lows[i]);
    loud = sums[frame] > length * std::pow(10.0, settings.silence / 10.0);
    if (!loud) return;
    std::copy_n(lows, frame, lowSpectrum.begin());
    std::fill(lowSpectrum.begin() + length, lowSpectrum.end(), 0.0f);
    for (std::size_t i = 0; i < frame; ++i) fullSpectrum[i] = fulls[i] * window[i];
    std::fill(fullSpectrum.begin() + length, fullSpectrum.end(), 0.0f);
    fft.DoFFTReal(lowSpectrum.data(), size, 0);
    fft.DoFFTReal(fullSpectrum.data(), size, 0);
}

void VoicePitchDetector::State::Correlate() {
    auto& s = lowSpectrum;
    s[0] *= s[0];
    s[1] *= s[1];
    for (std::size_t i = 2; i < s.size(); i += 2) {
        s[i] = s[i] * s[i] + s[i + 1] * s[i + 1];
        s[i + 1] = 0.0f;
    }
    fft.DoIFFTReal(lowSpectrum.data(), size, 0);
    Flatten();
    fft.DoIFFTReal(fullSpectrum.data(), size, 0);
    for (int lag = 0; lag < lags; ++lag) {
        const auto at = static_cast<std::size_t>(lag), last = static_cast<std::size_t>(length);
        const double energies = sums[last - at] + (sums[last] - sums[at]);
        nsdf[at] = static_cast<float>(2.0 * static_cast<double>(lowSpectrum[at]) / (energies + kTiny));
    }
    const float whole = fullSpectrum[0] + static_cast<float>(kTiny);
    for (std::size_t lag = 0; lag < overlap.size(); ++lag) fullSpectrum[lag] /= whole * overlap[lag];
}

// The spectrum without its formants: what is above the mean around it.
void VoicePitchDetector::State::Flatten() {
    const auto bins = static_cast<std::size_t>(bandBins);
    auto& s = fullSpectrum;
    flat[0] = s[0] * s[0];
    for (std::size_t bin = 1; bin < bins; ++bin)
        flat[bin] = s[2 * bin] * s[2 * bin] + s[2 * bin + 1] * s[2 * bin + 1];
    for (std::size_t bin = 0; bin < bins; bin += 4) {
        const Batch power = xsimd::max(Batch::load_unaligned(flat.data() + bin), Batch(1e-30f));
        xsimd::exp2(xsimd::log2(power) * Batch(kFlatten)).store_unaligned(flat.data() + bin);
    }
    for (std::size_t bin = 0; bin < bins; ++bin) flat[bin] *= band[bin];
    std::ranges::fill(s, 0.0f);
    const auto reach = static_cast<std::ptrdiff_t>(meanBins), end = static_cast<std::ptrdiff_t>(bins);
    const float share = kMeanShare / static_cast<float>(2 * meanBins + 1);
    double sum = 0.0;
    for (std::ptrdiff_t bin = 0; bin < std::min(reach, end); ++bin)
        sum += static_cast<double>(flat[static_cast<std::size_t>(bin)]);
    for (std::ptrdiff_t bin = 0; bin < end; ++bin) {
        if (bin + reach < end) sum += static_cast<double>(flat[static_cast<std::size_t>(bin + reach)]);
        if (bin > reach) sum -= static_cast<double>(flat[static_cast<std::size_t>(bin - reach - 1)]);
        const auto at = static_cast<std::size_t>(bin);
        if (bin > 0) s[2 * at] = std::max(flat[at] - share * static_cast<float>(sum), 0.0f);
    }
}

PeriodCandidate VoicePitchDetector::State::CandidateAt(int lag) const {
    const auto at = static_cast<std::size_t>(lag);
    const ParabolaTop top(nsdf[at - 1], nsdf[at], nsdf[at + 1]);
    const double place = lag + top.offset;
    const auto& g = fullSpectrum;
    auto near = std::clamp<std::size_t>(static_cast<std::size_t>(std::lround(place)), 1, nsdf.size() - 2);
    if (g[near - 1] > g[near])
        --near;
    else if (g[near + 1] > g[near])
        ++near;
    near = std::clamp<std::size_t>(near, 1, nsdf.size() - 2);
    double flattened = g[near];
    if (g[near] >= g[near - 1] && g[near] >= g[near + 1])
        flattened = ParabolaTop(g[near - 1], g[near], g[near + 1]).height;
    PeriodCandidate candidate;
    candidate.seconds = place / analysisRate;
    candidate.log2Seconds = std::log2(candidate.seconds);
    candidate.value = std::min(top.height, 1.0) + flattened - kFlatNeutral;
    candidate.cost = 1.0 - (candidate.value - OctaveCost(candidate.seconds, settings.lowestHz));
    return candidate;
}

void VoicePitchDetector::State::FindCandidates() {
    struct Maximum {
        int lag;
        double worth;
    };
    std::array<Maximum, kMostPeriods> best{};
    count = 0;
    if (!loud) return;
    for (int lag = std::max(static_cast<int>(analysisRate / settings.highestHz), 2); lag < lags - 1; ++lag) {
        const auto at = static_cast<std::size_t>(lag);
        const float here = nsdf[at];
        if (!(here > nsdf[at - 1] && here >= nsdf[at + 1] && here > static_cast<float>(kLeastPeak))) continue;
        const Maximum found{lag,
                            static_cast<double>(here) - OctaveCost(lag / analysisRate, settings.lowestHz)};
        if (count < best.size()) {
            best[count++] = found;
            continue;
        }
        auto* const least = std::ranges::min_element(best, {}, &Maximum::worth);
        if (least->worth >= found.worth) continue;
        std::move(least + 1, best.end(), least);  // they stay in order
        best.back() = found;
    }
    for (std::size_t i = 0; i < count; ++i) {
        periods[i] = CandidateAt(best[i].lag);
        candidates[i] = {1.0 / periods[i].seconds, periods[i].value};
    }
}

void VoicePitchDetector::State::Decide() {
    FindCandidates();
    const int chosen = path.Advance({periods.data(), count}, hop / (kHopAtReference * rate / kReferenceRate));
    VoicePitchFrame& frame = frames[made++ % kKept];
    frame = {frameEnd, longestPiece / 2.0, 0.0, 0.0};
    taken = std::max(taken, made - std::min<std::uint64_t>(made, kKept));
    if (chosen < 0) return;
    const auto& candidate = periods[static_cast<std::size_t>(chosen)];
    const auto [period, piece] = Measure(candidate.seconds * rate);
    frame.hz = rate / period;
    frame.age = piece / 2.0;
    frame.value = candidate.value;
}

std::pair<double, int> VoicePitchDetector::State::Measure(double period) const {
    const int piece = std::min(std::max(static_cast<int>(kMeasuredPeriods * period),
                                        static_cast<int>(kMeasuredLeast * rate / settings.lowestHz)),
                               longestPiece);
    const float* const x = low.At(frameEnd - piece);
    for (int i = 0; i < piece; ++i) {
        const auto at = static_cast<std::size_t>(i);
        pieceSums[at + 1] = pieceSums[at] + static_cast<double>(x[i]) * static_cast<double>(x[i]);
    }
    const double all = pieceSums[static_cast<std::size_t>(piece)];
    const auto similarity = [&](int lag) {
        const double energies =
            pieceSums[static_cast<std::size_t>(piece - lag)] + all - pieceSums[static_cast<std::size_t>(lag)];
        return 2.0 * DotProduct(x, x + lag, piece - lag) / (energies + kTiny);
    };
    const int multiples = std::clamp(static_cast<int>(kMeasuredUse * piece / period), 1, kMeasuredMultiples);
    double best = period, first = -1.0;
    for (int k = 1; k <= multiples; ++k) {
        const double centre = best * k;
        const int reach = std::max(2, static_cast<int>(std::lround((k > 1 ? 0.03 : 0.06) * period)));
        const int from = static_cast<int>(centre) - reach, to = static_cast<int>(centre) + reach + 1;
        if (from < 3 || to >= piece - 9) break;
        const Peak peak = FindPeak(from - 1, to + 1, decimation, similarity);
        if (!peak.inside) break;
        if (k == 1)
            first = peak.height;
        else if (peak.height < first - kMeasuredDrop)
            break;
        best = peak.place / k;
    }
    return {best, piece};
}

VoicePitchDetector::VoicePitchDetector(const VoicePitchSettings& settings)
    : m_state(std::make_unique<State>(settings)) {
    SetHighest(settings.highestHz);
    SetSilence(settings.silence);
}
VoicePitchDetector::~VoicePitchDetector() = default;

void VoicePitchDetector::Clear() { m_state->Clear(); }
void VoicePitchDetector::SetHighest(double hz) {
    const double least = 2.0 * m_state->settings.lowestHz;
    m_state->settings.highestHz = hz > least ? std::min(hz, 2000.0) : least;
}
void VoicePitchDetector::SetSilence(double decibels) {
    m_state->settings.silence = decibels > -200.0 ? std::min(decibels, 0.0) : -200.0;
}

int VoicePitchDetector::HopSamples() const { return m_state->hop; }
int VoicePitchDetector::DelaySamples() const { return 2 * m_state->step; }
int VoicePitchDetector::StepSamples() const { return m_state->step; }

void VoicePitchDetector::Push(const float* samples, int count) {
    const DenormalGuard guard;
    m_state->Push(samples, count);
}
void VoicePitchDetector::Push(const double* samples, int count) {
    const DenormalGuard guard;
    m_state->Push(samples, count);
}

bool VoicePitchDetector::Take(VoicePitchFrame& frame) {
    if (m_state->taken == m_state->made) return false;
    frame = m_state->frames[m_state->taken++ % kKept];
    return true;
}

std::span<const VoicePitchCandidate> VoicePitchDetector::Candidates() const {
    return {m_state->candidates.data(), m_state->count};
}

}  // namespace Corvo::DSP
