#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdlib>
#include <initializer_list>
#include <vector>

#include "Spectrum/Tuner/TunerFixture.h"
#include "Spectrum/Tuner/TunerSounds.h"

namespace {

constexpr int kRate = 48000;

// What each sensitivity is defined to be; how long it waits is tested with the notes.
struct Row {
    double lowest, highest, partial, onset, range;
    int harmonics;
};
// clang-format off
constexpr Row kRows[] = {
    { 30, 17000,  5, 15, 25, 3},
    { 70, 10000, 25, 40, 20, 3},
    { 30, 17000,  4, 11, 25, 2},
    { 70, 15000,  8, 18, 13, 3},
    { 40, 12000, 25, 35, 15, 7},
    {100, 19000, 15, 35, 15, 2},
};
// clang-format on

// A row's tuner, behind a window long enough for the lowest pitch.
struct Sensitive : TunerProbe {
    explicit Sensitive(const Row& row, int frames = 32768) : TunerProbe(kRate, frames), length(frames) {
        tuner.SetSensibilityPreset(static_cast<int>(&row - kRows));
    }
    double HearSine(double hz) {
        return Hear(TestSupport::Sine<float>(static_cast<std::size_t>(length), hz, kRate).data());
    }
    int length;
};

TEST_F(TunerTest, SeeksPitchesWithinTheRange) {
    for (const Row& row : kRows) {
        Sensitive probe(row);
        EXPECT_NEAR(probe.HearSine(1.03 * row.lowest), 1.03 * row.lowest, 0.1);
        EXPECT_EQ(probe.HearSine(0.97 * row.lowest), 0.0) << row.lowest;
        EXPECT_NEAR(probe.HearSine(0.999 * row.highest), 0.999 * row.highest, 0.1);
        EXPECT_EQ(probe.HearSine(1.001 * row.highest), 0.0) << row.highest;
    }
}

// The floor of white noise of power 1, told from the quarter of the bins that are weakest, and what a
// Blackman window shows of a sine so far above twice that.
std::vector<float> SineAboveFloor(double decibels) {
    std::vector<float> power(4096, static_cast<float>(std::log(4.0 / 3.0)));
    const double peak = 2.0 * std::pow(10.0, 0.1 * decibels);
    constexpr double kLobe[] = {1.0, 0.25 / 0.42, 0.04 / 0.42};
    for (const int off : {-2, -1, 0, 1, 2}) {
        float& bin = power[static_cast<std::size_t>(300 + off)];
        bin = std::max(bin, static_cast<float>(peak * kLobe[std::abs(off)] * kLobe[std::abs(off)]));
    }
    return power;
}

TEST_F(TunerTest, BeginsAndKeepsNotesAboveTheFloor) {
    for (const Row& row : kRows) {
        Sensitive probe(row, 8192);
        const auto hears = [&](double decibels) {
            probe.Tune(SineAboveFloor(decibels));
            return probe.tuner.GetHeardFrequency() > 0.0;
        };
        EXPECT_FALSE(hears(row.onset - 0.2)) << row.onset;
        EXPECT_TRUE(hears(row.onset + 0.2)) << row.onset;
        EXPECT_TRUE(hears(row.onset + 0.2)) << row.onset;
        EXPECT_TRUE(hears(row.partial + 0.2)) << row.partial;
        EXPECT_FALSE(hears(row.partial - 0.2)) << row.partial;
    }
}

// The legacy method takes the octave below the strongest partial for the pitch when anything is there.
TEST_F(TunerTest, LeavesOutWhatIsFarBelowTheStrongest) {
    Tuner::SetDetectionMethod(3);
    constexpr std::size_t kFrames = 8192;
    for (const Row& row : kRows)
        for (const double beside : {-0.5, 0.5}) {
            Sensitive probe(row, kFrames);
            const double hz = 186.0 * kRate / kFrames;
            auto sound = TestSupport::Sine<float>(kFrames, hz, kRate, 0.5);
            const double amplitude = 0.5 * std::pow(10.0, -0.05 * (row.range + beside));
            const auto below = TestSupport::Sine<float>(kFrames, 0.5 * hz, kRate, amplitude);
            for (std::size_t i = 0; i < kFrames; ++i) sound[i] += below[i];
            EXPECT_NEAR(probe.Hear(sound.data()), beside < 0.0 ? 0.5 * hz : hz, 0.1) << row.range << beside;
        }
}

// With each partial counting 0.9 of the one before, these are heard as partials of 200 Hz only when as many
// are summed; with fewer the lowest of them counts for more as a pitch of its own.
TEST_F(TunerTest, SumsAsManyPartialsAsTheSensitivitySays) {
    Tuner::SetDetectionMethod(2);
    struct Case {
        int needed;
        std::initializer_list<int> partials;
    };
    constexpr std::size_t kFrames = 8192;
    for (const Row& row : kRows)
        for (const Case& c : {Case{3, {2, 3}}, Case{4, {2, 3, 4, 5}}, Case{7, {4, 7}}, Case{8, {5, 8}}}) {
            Sensitive probe(row, kFrames);
            const double heard = probe.Hear(TunerSounds::Partials(c.partials, 200.0, kRate, kFrames).data());
            EXPECT_EQ(std::abs(heard - 200.0) < 0.1, row.harmonics >= c.needed)
                << row.harmonics << " of " << c.needed << ": " << heard;
        }
}

}  // namespace
