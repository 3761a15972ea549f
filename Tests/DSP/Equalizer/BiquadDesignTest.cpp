#include "DSP/Equalizer/BiquadDesign.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <numbers>

namespace {

using namespace Corvo::DSP;

constexpr double kPi = std::numbers::pi;
constexpr int kRates[] = {8000, 44100, 192000};
constexpr double kDecibels[] = {-24.0, -6.1, -5.9, -0.1, 0.0, 3.0, 5.9, 6.1, 18.0};

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

bool Stable(const Design& d) { return std::abs(d.a2.value) < 1.0 && std::abs(d.a1.value) < 1.0 + d.a2.value; }

template <typename Check>
void OverTheGrid(Check&& check) {
    for (const int rate : kRates)
        for (const long freq : {20, 1000, 3500, 20000})
            for (const double dB : kDecibels) {
                SCOPED_TRACE(testing::Message() << rate << " Hz, " << freq << " Hz, " << dB << " dB");
                if (2 * freq < rate) check(rate, freq, dB);
                if (testing::Test::HasFailure()) return;
            }
}

#define EXPECT_GAIN(gain, expected) EXPECT_NEAR((gain) / (expected), 1.0, 1e-6)

TEST(BiquadDesign, PassFiltersScaleResonateAndStop) {
    OverTheGrid([](int rate, long freq, double dB) {
        for (const long Q : {10L, 50L, 400L})
            for (const int type : {0, 4, 7, 200}) {  // unknown types are high-passes
                const auto d = Designed(type, dB, freq, Q, rate);
                const double corner = 2.0 * kPi * static_cast<double>(freq) / rate;
                EXPECT_TRUE(Stable(d));
                EXPECT_GAIN(Gain(d, type == 4 ? 0.0 : kPi), Linear(dB));
                EXPECT_NEAR(Gain(d, type == 4 ? kPi : 0.0), 0.0, 1e-6);
                // Butterworth at Q = 50: 3 dB down; otherwise the resonance scales with Q.
                EXPECT_GAIN(Gain(d, corner), Linear(dB) * static_cast<double>(Q) * 0.02 / std::sqrt(2.0));
            }
    });
}

TEST(BiquadDesign, ShelvesMeetHalfWay) {
    OverTheGrid([](int rate, long freq, double dB) {
        for (const long Q : {10L, 50L, 150L, 1000L})
            for (const int type : {EQ_HIGHSHELF, EQ_LOWSHELF}) {
                const auto d = Designed(type, dB, freq, Q, rate);
                const bool high = type == EQ_HIGHSHELF;
                EXPECT_GAIN(Gain(d, high ? kPi : 0.0), Linear(dB));
                EXPECT_GAIN(Gain(d, high ? 0.0 : kPi), 1.0);
                if (Q <= 50) {  // steeper ones may have no damping left at all
                    EXPECT_GAIN(Gain(d, 2.0 * kPi * static_cast<double>(freq) / rate), Linear(dB / 2.0));
                }
            }
        // The slope is limited to 3.
        EXPECT_EQ(Designed(EQ_LOWSHELF, dB, freq, 150, rate).a1.value,
                  Designed(EQ_LOWSHELF, dB, freq, 9999, rate).a1.value);
    });
}

TEST(BiquadDesign, ButterworthShelvesMeetTheirCorner) {
    OverTheGrid([](int rate, long freq, double dB) {
        const double down = 10.0 * std::log10(2.0);
        const double fromPlateau = std::abs(dB) < 6.0 ? dB / 2.0 : dB > 0.0 ? dB - down : dB + down;
        for (const int type : {EQ_HIGHSHELF_BUTTERWORTH, EQ_LOWSHELF_BUTTERWORTH}) {
            const bool high = type == EQ_HIGHSHELF_BUTTERWORTH;
            const auto d = Designed(type, dB, freq, 1, rate);
            EXPECT_TRUE(Stable(d));
            EXPECT_GAIN(Gain(d, high ? kPi : 0.0), Linear(dB));
            EXPECT_GAIN(Gain(d, high ? 0.0 : kPi), 1.0);
            // The high shelf is the low one turned over: its corner counts from the unity side.
            const double corner = high ? dB - fromPlateau : fromPlateau;
            EXPECT_GAIN(Gain(d, 2.0 * kPi * static_cast<double>(freq) / rate), Linear(corner)) << type;
            EXPECT_EQ(d.b1.value, Designed(type, dB, freq, 500, rate).b1.value) << "takes no Q";
        }
    });
}

// Peak and edges on the axis that the bilinear transform makes of an analogue one, where the edges, at half
// the height in dB, lie symmetrically around the centre.
TEST(BiquadDesign, PeakHasItsHeightAndWidth) {
    OverTheGrid([](int rate, long freq, double dB) {
        for (const long Q : {25L, 133L, 400L}) {
            const auto d = Designed(EQ_PEAK, dB, freq, Q, rate);
            const double centre = kPi * static_cast<double>(freq) / rate, w = 2.0 * std::atan(centre);
            const double octaves = static_cast<double>(Q) / 133.0 * w / std::sin(w);
            EXPECT_GAIN(Gain(d, w), Linear(dB));
            for (const double side : {-0.5, 0.5}) {
                EXPECT_GAIN(Gain(d, 2.0 * std::atan(centre * std::exp2(side * octaves))), Linear(dB / 2.0));
            }
            EXPECT_GAIN(Gain(d, 0.0), 1.0);
            EXPECT_GAIN(Gain(d, kPi), 1.0);
        }
    });
}

}  // namespace
