#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <utility>
#include <vector>

#include "Spectrum/Tuner/TunerFixture.h"

namespace {

using TunerSounds::Kind;

constexpr int kLength = 8192;
constexpr std::size_t kFrames = kLength;

// The bare product looks for overtones at multiples of whole bins. It misses the fifth partial by more than
// two of them where the fundamental lies midway between two; the octave, on a bin of its own, may win then.
// Near the product's end, a tenth of the rate, a peak's skirt may never reach the valley that is asked for.
bool MayMiss(int method, double hz, double bins, double cents) {
    const bool midway = std::abs(bins - std::floor(bins) - 0.5) < 0.1;
    return method == 1 && ((midway && std::abs(cents - 1200.0) < 5.0) || hz > 4000.0);
}

// What each method hears, and through how much noise (decibels below the sound, 0 for none); what it does not
// hear is left out. Method 0 is held to more: within a few hundredths of a bin, but never asked below half a
// cent. The others hear to 5 cents. Catches octave errors, bias of the interpolation, and pitches pulled by
// noise or inharmonicity.
TEST_F(TunerTest, HearsWithEveryMethodWhatThatIsAbleTo) {
    constexpr auto kSine = Kind::Sine, kSawtooth = Kind::Sawtooth, kPiano = Kind::Piano;
    const struct {
        int method;
        Kind kind;
        std::vector<int> noises;
    } kAbilities[] = {
        {0, kSine, {0, 20, 10}}, {0, kSawtooth, {0, 20, 10}}, {0, kPiano, {0, 20, 10}},
        {1, kSine, {0}},         {1, kPiano, {20}},           {2, kSine, {10}},
        {2, kSawtooth, {0, 10}}, {2, kPiano, {20}},           {3, kSine, {10}},
        {3, kSawtooth, {0, 10}}, {3, kPiano, {20}},           {4, kSine, {10}},
        {4, kSawtooth, {0, 10}}, {4, kPiano, {20}},           {0, Kind::MissingFundamental, {0, 20, 10}},
    };
    for (const auto& [method, kind, noises] : kAbilities)
        for (int tone = 0; tone <= 75; tone += 4) {
            Tuner::SetDetectionMethod(method);
            const int rate = tone % 8 ? 44100 : 48000;
            const double cents = (37 * tone) % 90 - 45.0, hz = 55.0 * std::exp2((tone + 0.01 * cents) / 12.0);
            const double perBin = static_cast<double>(rate) / kLength;
            const auto clean = TunerSounds::Sound(kind, hz, rate, kFrames, 0.13 * tone);
            TunerProbe probe(rate);
            for (const int noise : noises) {
                const auto sound = noise ? TunerSounds::WithNoise(clean, noise, 7) : clean;
                const double bins = noise == 0 ? 0.02 : 0.06 - 0.001 * noise;
                const double allowed = std::max(bins * perBin / hz * 1200.0 / std::log(2.0), 0.5);
                const double off = 1200.0 * std::log2(probe.Hear(sound.data()) / hz);  // cents
                if (MayMiss(method, hz, hz / perBin, off)) continue;
                EXPECT_LE(std::abs(off), method == 0 ? allowed : 5.0)
                    << "method " << method << ", sound " << static_cast<int>(kind) << ", noise " << noise
                    << " dB below, " << hz << " Hz";
            }
        }
}

std::vector<float> Partials(const std::vector<int>& numbers, double hz) {
    return TunerSounds::Partials(numbers, hz, kTunerRate, kFrames);
}

// Each method is another: they part where the fundamental is missing.
TEST_F(TunerTest, DispatchesToFiveMethods) {
    const auto sound = Partials({3, 4, 5, 6, 7, 8}, 100.0);
    for (int method = 0; method < 5; ++method) {
        Tuner::SetDetectionMethod(method);
        TunerProbe probe;
        const bool first = std::abs(probe.Hear(sound.data()) - 100.0) < 0.05;
        EXPECT_TRUE(method == 3 || first == (method == 0)) << method;
    }
}

// By the letter: from the bin of the lowest frequency (30 Hz), 55 dB above valleys of 0 dB, and no higher
// than 17 kHz. The bins have no multiples among each other.
TEST_F(TunerTest, SearchesTheHarmonicProductWithinItsLimits) {
    Tuner::SetDetectionMethod(1);
    constexpr float kLimit = 316227.78125f, kBelow = 316227.75f;  // 10^5.5 lies between
    const struct {
        int rate, bin;
        float height;
        bool heard;
    } kCases[] = {{44100, 101, kLimit, true}, {44100, 101, kBelow, false}, {44100, 5, 1e6f, true},
                  {44100, 4, 1e6f, false},    {200000, 691, 1e6f, true},   {200000, 701, 1e6f, false}};
    for (const auto& [rate, bin, height, heard] : kCases) {
        std::vector<float> power(kFrames / 2, 1.0f);
        power[static_cast<std::size_t>(bin)] = height;
        EXPECT_NEAR(TunerProbe(rate).Hear(power), heard ? 1.0 * bin * rate / kLength : 0.0, 1e-6) << bin;
    }
}

// Made only when asked for, by every method, and gone when it is no longer; what is heard is the same.
TEST_F(TunerTest, ShowsTheSpectrumWithoutItsFloor) {
    const auto tone = TunerSounds::Sound(Kind::Piano, 1000.0, kTunerRate, kFrames, 0.0);
    TunerProbe probe;
    const auto& power = probe.Transform(TunerSounds::WithNoise(tone, 20.0, 3).data());
    const auto& clean = probe.tuner.GetDenoisedSpectrum();
    for (const int method : {1, 2, 3, 4, 0}) {
        Tuner::SetDetectionMethod(method);
        Tuner::SetShowDenoisedSpectrum(false);
        const double heard = probe.Hear(power);
        EXPECT_TRUE(clean.empty()) << method;
        Tuner::SetShowDenoisedSpectrum(true);
        EXPECT_EQ(probe.Hear(power), heard) << method;
        ASSERT_EQ(clean.size(), power.size()) << method;
    }
    EXPECT_NEAR(clean[186] / power[186], 1.0, 0.001);
}

// The floor of white noise of power 1, told from the quarter of the bins that are weakest, and what a
// Blackman window shows of sines so far above twice that.
std::vector<float> SinesAboveFloor(double decibels, const std::vector<int>& at = {300}) {
    std::vector<float> power(kFrames / 2, static_cast<float>(std::log(4.0 / 3.0)));
    const double peak = 2.0 * std::pow(10.0, 0.1 * decibels);
    constexpr double kLobe[] = {1.0, 0.25 / 0.42, 0.04 / 0.42};
    for (const int middle : at)
        for (const int off : {-2, -1, 0, 1, 2}) {
            float& bin = power[static_cast<std::size_t>(middle + off)];
            bin = std::max(bin, static_cast<float>(peak * kLobe[std::abs(off)] * kLobe[std::abs(off)]));
        }
    return power;
}

// Partials too weak to begin a note alone do so together, but not when they are partials of nothing.
TEST_F(TunerTest, HearsAWeakSeries) {
    const std::pair<std::vector<int>, double> kCases[] = {{{100, 200, 300, 400, 500, 600}, 100.0},
                                                          {{100, 171, 262, 343, 455, 577}, 0.0}};
    for (const auto& [bins, heard] : kCases)
        EXPECT_NEAR(TunerProbe().Hear(SinesAboveFloor(11.0, bins)) * kLength / kTunerRate, heard, 0.1);
}

// Partials 3 to 32 of a bass, pulled hither and thither by a filter. A fit that follows one after the other
// ends with the numbers of another pitch.
TEST_F(TunerTest, TakesPulledPartialsForWhatTheyAre) {
    constexpr double kBins = 12.19;
    std::vector<float> sound(kFrames);
    for (int n = 3; n < 33; ++n) {
        const double bins = kBins * n + 0.1 * std::sin(1.7 * n) * std::sqrt(n);
        sound = TunerSounds::Mixed(sound, TunerSine(bins * kTunerRate / kLength, 0.02));
    }
    EXPECT_NEAR(TunerProbe().Hear(sound.data()) * kLength / kTunerRate, kBins, 0.1);
}

// Of every sensitivity: which pitches are sought, how far above the floor a partial begins a note and keeps
// it, how far below the strongest one counts, and how many the pseudo product sums.
TEST_F(TunerTest, HearsAsTheSensitivitySays) {
    for (int preset = 0; preset < 6; ++preset) {
        SCOPED_TRACE(preset);
        const TunerSensitivityRow& row = kSensitivityRows[preset];
        TunerProbe probe, deep(kTunerRate, 32768);
        for (auto* const tuner : {&probe.tuner, &deep.tuner}) tuner->SetSensibilityPreset(preset);
        for (const double hz :
             {1.03 * row.lowest, 0.97 * row.lowest, 0.999 * row.highest, 1.001 * row.highest})
            EXPECT_NEAR(deep.Hear(TestSupport::Sine<float>(32768, hz, kTunerRate).data()),
                        hz > row.lowest && hz < row.highest ? hz : 0.0, 0.1);

        for (const auto& [decibels, heard] : {std::pair{row.onset - 0.2, false},
                                              {row.onset + 0.2, false},
                                              {row.onset + 0.2, true},
                                              {row.partial + 0.2, true},
                                              {row.partial - 0.2, false}}) {
            probe.Tune(SinesAboveFloor(decibels));
            EXPECT_EQ(probe.tuner.GetHeardFrequency() > 0.0, heard) << decibels;
        }

        // The legacy method takes the octave below the strongest partial for the pitch when anything is
        // there.
        Tuner::SetDetectionMethod(3);
        const double hz = 186.0 * kTunerRate / kLength;
        for (const double beside : {-0.5, 0.5}) {
            const double share = std::pow(10.0, -0.05 * (row.range + beside));
            const auto sound = TunerSounds::Mixed(TunerSine(hz), TunerSine(0.5 * hz, 0.5 * share));
            EXPECT_NEAR(probe.Hear(sound.data()), beside < 0.0 ? 0.5 * hz : hz, 0.1) << beside;
        }

        // With each partial counting 0.9 of the one before, these are heard as partials of 200 Hz only when
        // as many are summed; with fewer the lowest of them counts for more as a pitch of its own.
        Tuner::SetDetectionMethod(2);
        for (const auto& [needed, partials] :
             {std::pair{3, std::vector<int>{2, 3}}, {4, {2, 3, 4, 5}}, {7, {4, 7}}, {8, {5, 8}}}) {
            const double heard = probe.Hear(Partials(partials, 200.0).data());
            EXPECT_EQ(std::abs(heard - 200.0) < 0.1, row.harmonics >= needed) << needed << ": " << heard;
        }
        Tuner::SetDetectionMethod(0);
    }
}

}  // namespace
