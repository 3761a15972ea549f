#include "DSP/Equalizer/BiquadDesign.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <utility>
#include <vector>

namespace {

using namespace Corvo::DSP;

constexpr double kPi = std::numbers::pi;

double Linear(double dB) { return std::pow(10.0, dB / 20.0); }

using Design = coeff<SmoothCoefficient>;

Design Designed(int type, double dB, long freq, long Q, int rate) {
    Design design;
    CalcolaCoefficientiBiquad(static_cast<EQFilterType>(type), Linear(dB), freq, Q, &design, rate, true);
    return design;
}

// Gain at w radians per sample. Close to 0 and pi the powers of 1/z nearly cancel: half angles keep it exact.
double Gain(const Design& d, double w) {
    const auto squared = [w](double c0, double c1, double c2) {
        const double s = std::sin(w / 2), phi = s * s;
        const double sum = c0 + c1 + c2;
        return std::max(
            0.0, sum * sum - 4.0 * (c0 * c1 + 4.0 * c0 * c2 + c1 * c2) * phi + 16.0 * c0 * c2 * phi * phi);
    };
    return std::sqrt(squared(d.b0.value, d.b1.value, d.b2.value) / squared(1.0, d.a1.value, d.a2.value));
}

void ExpectGain(double gain, double expected) { EXPECT_NEAR(gain / expected, 1.0, 1e-6); }

void ExpectDesign(int type, long freq, long Q, double dB, int rate) {
    const auto d = Designed(type, dB, freq, Q, rate);
    const double angle = kPi * static_cast<double>(freq) / rate, down = 10.0 * std::log10(2.0);
    const bool highShelf = type == EQ_HIGHSHELF || type == EQ_HIGHSHELF_BUTTERWORTH;
    const double plateau = Gain(d, highShelf ? kPi : 0.0), other = Gain(d, highShelf ? 0.0 : kPi);
    const double corner = Gain(d, 2.0 * angle);
    switch (type) {
        case EQ_HIGHSHELF:
        case EQ_LOWSHELF:
            ExpectGain(plateau, Linear(dB));
            ExpectGain(other, 1.0);
            if (Q <= 50)
                ExpectGain(corner, Linear(dB / 2.0));  // steeper ones may have no damping left at all
            return;
        case EQ_HIGHSHELF_BUTTERWORTH:
        case EQ_LOWSHELF_BUTTERWORTH: {
            ExpectGain(plateau, Linear(dB));
            ExpectGain(other, 1.0);
            const double fromPlateau = std::abs(dB) < 6.0 ? dB / 2.0 : dB > 0.0 ? dB - down : dB + down;
            // The high shelf is the low one turned over: its corner counts from the unity side.
            ExpectGain(corner, Linear(highShelf ? dB - fromPlateau : fromPlateau));
            EXPECT_EQ(d.b1.value, Designed(type, dB, freq, 500, rate).b1.value) << "takes no Q";
            break;
        }
        case EQ_PEAK: {
            // Peak and edges on the axis that the bilinear transform makes of an analogue one, where the
            // edges, at half the height in dB, lie symmetrically around the centre.
            const double w = 2.0 * std::atan(angle);
            const double octaves = static_cast<double>(Q) / 133.0 * w / std::sin(w);
            ExpectGain(Gain(d, w), Linear(dB));
            for (const double side : {-0.5, 0.5})
                ExpectGain(Gain(d, 2.0 * std::atan(angle * std::exp2(side * octaves))), Linear(dB / 2.0));
            ExpectGain(plateau, 1.0);
            ExpectGain(other, 1.0);
            return;
        }
        default:  // unknown types are high-passes
            ExpectGain(type == 4 ? plateau : other, Linear(dB));
            EXPECT_NEAR(type == 4 ? other : plateau, 0.0, 1e-6);
            // Butterworth at Q = 50: 3 dB down; otherwise the resonance scales with Q.
            ExpectGain(corner, Linear(dB) * static_cast<double>(Q) * 0.02 / std::sqrt(2.0));
    }
    EXPECT_TRUE(std::abs(d.a2.value) < 1.0 && std::abs(d.a1.value) < 1.0 + d.a2.value) << "stable";
}

TEST(BiquadDesign, GainsAreThoseOfEveryType) {
    const std::vector<long> passes{10, 50, 400}, shelves{10, 50, 150, 1000};
    const std::pair<int, std::vector<long>> types[] = {{0, passes},
                                                       {4, passes},
                                                       {7, passes},
                                                       {200, passes},
                                                       {EQ_LOWSHELF, shelves},
                                                       {EQ_HIGHSHELF, shelves},
                                                       {EQ_PEAK, {25, 133, 400}},
                                                       {EQ_LOWSHELF_BUTTERWORTH, {1}},
                                                       {EQ_HIGHSHELF_BUTTERWORTH, {1}}};
    for (const auto& [type, qualities] : types)
        for (const long Q : qualities)
            for (const int rate : {8000, 44100, 192000})
                for (const long freq : {20, 1000, 3500, 20000})
                    for (const double dB : {-24.0, -6.1, -5.9, -0.1, 0.0, 3.0, 5.9, 6.1, 18.0}) {
                        SCOPED_TRACE(testing::Message() << type << ", Q " << Q << ", " << rate << " Hz, "
                                                        << freq << " Hz, " << dB << " dB");
                        if (2 * freq < rate) ExpectDesign(type, freq, Q, dB, rate);
                        if (HasFailure()) return;
                    }
    EXPECT_EQ(Designed(EQ_LOWSHELF, 3.0, 1000, 150, 44100).a1.value,
              Designed(EQ_LOWSHELF, 3.0, 1000, 9999, 44100).a1.value)
        << "the slope is limited to 3";
}

}  // namespace
