#include "DSP/Resampler/Dither.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <span>

namespace {

constexpr int kRandomMax = 32767;

#if defined(_WIN32)
static_assert(RAND_MAX == kRandomMax);
int PlatformRandom() { return std::rand(); }
#else
// rand() takes a lock here and has another range: a counter, hashed, is as good and never waits.
int PlatformRandom() {
    static std::atomic<std::uint64_t> counter{0};
    constexpr std::uint64_t kStep = 0x9E3779B97F4A7C15u;
    std::uint64_t bits = counter.fetch_add(kStep, std::memory_order_relaxed) + kStep;
    bits = (bits ^ (bits >> 30)) * 0xBF58476D1CE4E5B9u;
    bits = (bits ^ (bits >> 27)) * 0x94D049BB133111EBu;
    return static_cast<int>((bits ^ (bits >> 31)) >> 49);
}
#endif

std::atomic<DitherRandom> randomSource{PlatformRandom};

// clang-format off
// Minimum-phase curves after the ear's threshold at 44.1 kHz (Lipshitz, Vanderkooy and Wannamaker,
// "Minimally audible noise shaping", 1991), in the sign of CDither::coefficients.
constexpr double kGentle[] = {-2.033, 2.165, -1.959, 1.590, -0.6149};
constexpr double kStrong[] = {-2.412, 3.370, -3.937, 4.174, -3.353, 2.205, -1.281, 0.569, -0.0847};
// clang-format on

std::span<const double> Coefficients(DitherCurve curve) {
    if (curve == DitherCurve::Gentle) return kGentle;
    if (curve == DitherCurve::Strong) return kStrong;
    return {};
}

}  // namespace

CDither<double> MakeDither(DitherCurve curve, int bits) {
    CDither<double> dither;
    if (curve == DitherCurve::None || (bits != 16 && bits != 24)) return dither;
    const auto coefficients = Coefficients(curve);
    dither.enabled = true;
    dither.noiseShaping = !coefficients.empty();
    dither.shapingOrder = static_cast<int>(coefficients.size());
    std::ranges::copy(coefficients, dither.coefficients.begin());
    dither.scale = 1 << (bits - 1);
    dither.amplitude = 1.0 / (static_cast<double>(kRandomMax) * dither.scale);
    return dither;
}

double ApplyDither(CDither<double>& dither, double sample) {
    if (!dither.enabled) return sample;
    const DitherRandom random = randomSource.load(std::memory_order_relaxed);
    const auto triangular = [&] {
        const int first = random();
        return (first + random() - kRandomMax) * dither.amplitude;
    };
    if (!dither.noiseShaping) return sample + triangular();

    const auto order =
        static_cast<std::size_t>(std::clamp(dither.shapingOrder, 0, CDither<double>::kMaxOrder));
    auto& quantised = dither.quantisedHistory;
    auto& shaped = dither.shapedHistory;
    double error = 0.0;
    for (std::size_t k = 0; k < order; ++k) error += dither.coefficients[k] * (quantised[k] - shaped[k]);
    std::shift_right(quantised.begin(), quantised.end(), 1);
    std::shift_right(shaped.begin(), shaped.end(), 1);
    dither.lastShaped = shaped[0] = sample + error;
    const double dithered = dither.lastShaped + triangular();
    dither.lastQuantised = quantised[0] = std::trunc(dither.scale * dithered) / dither.scale;
    return dithered;
}

DitherRandom SetDitherRandom(DitherRandom source) {
    return randomSource.exchange(source ? source : PlatformRandom);
}
