#pragma once

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "OtherBuild/Recording.h"

namespace OtherBuild {

// In float a last bit of the double computation shows as a last bit that falls the other way, and that comes
// back through feedback.
constexpr double kFloatLimit = 4.0 * std::numeric_limits<float>::epsilon();
constexpr double kLevelLimitDb = 0.5, kPitchLimit = 0.005;

template <typename T>
std::vector<T> Values(const Take& take) {
    std::vector<T> values(take.bytes.size() / sizeof(T));
    if (!values.empty()) std::memcpy(values.data(), take.bytes.data(), values.size() * sizeof(T));
    return values;
}

// The largest difference, relative to the largest sample; where the output grows past full scale, to the
// largest so far, as the end of such a take would hide everything before it. Infinite when one side stops
// being a number before the other; where both stop at the same sample, nothing after it is compared.
template <typename Sample>
double Deviation(const std::vector<Sample>& reference, const std::vector<Sample>& other) {
    double scale = 0.0, worst = 0.0;
    for (const double sample : reference)
        if (std::isfinite(sample)) scale = std::max(scale, std::min(std::abs(sample), 1.0));
    for (std::size_t i = 0; i < reference.size(); ++i) {
        const double a = reference[i], b = other[i];
        if (!std::isfinite(a) && !std::isfinite(b)) break;
        if (!std::isfinite(a) || !std::isfinite(b)) return std::numeric_limits<double>::infinity();
        scale = std::max(scale, std::abs(a));
        if (a != b) worst = std::max(worst, std::abs(a - b) / std::max(scale, std::abs(b)));
    }
    return worst;
}

// The left channel of the tone's second half, where every effect has settled.
template <typename Sample>
std::vector<double> SettledTone(const std::vector<Sample>& samples) {
    std::vector<double> tone;
    for (std::size_t i = kToneFrames / 2; i < kToneFrames; ++i) tone.push_back(samples[i * kChannels]);
    return tone;
}

inline double LevelDb(const std::vector<double>& tone) {
    double power = 1e-20;
    for (const double sample : tone) power += sample * sample / static_cast<double>(tone.size());
    return 10.0 * std::log10(power);
}

// In Hz, from the first strong peak of the autocorrelation, between its samples; 0 for what has no pitch.
inline double Pitch(const std::vector<double>& tone) {
    constexpr std::size_t kLongest = 2000, kShortest = 12;
    std::vector<double> correlation(kLongest + 1);
    for (std::size_t lag = 0; lag <= kLongest; ++lag)
        for (std::size_t i = 0; i + kLongest < tone.size(); ++i) correlation[lag] += tone[i] * tone[i + lag];
    const double strong = 0.8 * *std::max_element(correlation.begin() + kShortest, correlation.end());
    for (std::size_t lag = kShortest; lag < kLongest; ++lag) {
        const double before = correlation[lag - 1], here = correlation[lag], after = correlation[lag + 1];
        if (here <= 0.0 || here < strong || here < before || here < after) continue;
        const double curvature = before - 2.0 * here + after;
        const double shift = curvature != 0.0 ? 0.5 * (before - after) / curvature : 0.0;
        return kRate / (static_cast<double>(lag) + shift);
    }
    return 0.0;
}

}  // namespace OtherBuild
