#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include "Spectrum/Tuner/HarmonicProduct.h"
#include "Spectrum/Tuner/SpectrumFloor.h"
#include "Spectrum/Tuner/TunerFixture.h"
#include "Spectrum/Tuner/TunerSounds.h"

namespace {

using Corvo::HarmonicProduct;
using TunerSounds::Kind;

constexpr int kRate = 44100;
constexpr std::size_t kLength = 8192;

// Each overtone counts as 1 at least, the fundamental as it is.
TEST(HarmonicProductTest, MultipliesCompressedSpectra) {
    const std::vector<float> spectrum{2, 0.5f, 0.25f, 10, 4, 3, 8, 1, 6, 1.5f, 7, 7};
    struct Case {
        int harmonics;
        bool halve;
        std::vector<double> product;
    };
    HarmonicProduct product;
    for (const Case& c : {Case{3, false, {8, 0.5 * 1 * 10, 0.25 * 4 * 8, 10 * 8 * 1.5}},
                          Case{3, true, {2, 0.5 * 1 * 5, 0.25 * 2 * 4, 10 * 4 * 1}},
                          Case{5, false, {32, 0.5 * 1 * 10 * 4 * 3}}}) {
        product.HarmonicProductSepctrumComputation(spectrum, c.harmonics, c.halve);
        EXPECT_EQ(product.Values(), c.product) << c.harmonics << c.halve;
    }
}

TEST(HarmonicProductTest, SearchesAPeakBetweenValleys) {
    struct Case {
        const char* fault;
        std::vector<double> values;
        int start, end;
        double limit;
        int bin;
        double prominence;
    };
    constexpr double kInfinite = std::numeric_limits<double>::infinity();
    for (const Case& c : {
             Case{"misses the peak", {9, 1, 5, 100, 4, 1, 9}, 0, 7, 20.0, 3, 20.0},
             Case{"accepts less than the limit", {9, 1, 5, 100, 4, 1, 9}, 0, 7, 20.001, -1, 0.0},
             Case{"stops before the valley", {9, 1, 10, 20, 1000, 20, 10, 9}, 0, 8, 0.0, -1, 0.0},
             Case{"takes the deeper of two valleys",
                  {9, 1, 8, 4, 100, 2, 8, 1, 9},
                  0,
                  9,
                  0.0,
                  4,
                  20.0 - 5.0 * std::log10(8.0)},
             Case{"wants valleys deeper than both sides",
                  {9, 4, 4, 100, 2, 2, 9},
                  0,
                  7,
                  0.0,
                  3,
                  20.0 - 5.0 * std::log10(8.0)},
             Case{"takes the higher of equals", {9, 1, 100, 1, 100, 1, 9}, 0, 7, 0.0, 2, 20.0},
             Case{"searches below the start", {1000, 1, 9, 1, 100, 1, 9}, 1, 7, 0.0, 4, 20.0},
             Case{"searches the end", {9, 1, 100, 1, 1000, 1, 9}, 0, 4, 0.0, 2, 20.0},
             Case{"invents a valley after the last bin", {9, 1, 5, 4, 100}, 0, 5, 0.0, -1, 0.0},
             Case{"takes the last bin for a valley", {9, 1, 5, 100, 4}, 0, 5, 0.0, -1, 0.0},
             Case{"takes the first bin for a valley", {1, 100, 1, 9, 1, 9}, 0, 6, 0.0, -1, 0.0},
             Case{"hears silence", {0, 0, 0, 0, 0, 0, 0}, 3, 7, 0.0, -1, 0.0},
             Case{"refuses a clean tone", {9, 0, 100, 0, 9}, 0, 5, 55.0, 2, kInfinite},
             Case{"reads outside", {9, 1, 100, 1, 9}, -5, 50, 0.0, 2, 20.0},
             Case{"searches nothing", {9, 1, 100, 1, 9}, 4, 3, 0.0, -1, 0.0},
         }) {
        HarmonicProduct product;
        // A single spectrum's product is the spectrum.
        product.HarmonicProductSepctrumComputation(std::vector<float>(c.values.begin(), c.values.end()), 1,
                                                   false);
        double prominence = -1.0;
        EXPECT_EQ(product.SearchMaximunInRange(c.start, c.end, c.limit, prominence), c.bin) << c.fault;
        if (std::isinf(c.prominence))
            EXPECT_EQ(prominence, c.prominence) << c.fault;
        else
            EXPECT_NEAR(prominence, c.prominence, 1e-9) << c.fault;
    }
}

// The floor is the mean power of white noise, and no more than the rest's when half the bins are peaks.
TEST(SpectrumFloorTest, FindsTheNoiseBelowThePeaks) {
    constexpr std::size_t kBins = 4096;
    TestSupport::Random random;
    std::vector<float> power(kBins), floor(kBins);
    Corvo::SpectrumFloor measure;
    measure.Initialise(kBins, 1.0);
    for (const bool tones : {false, true}) {
        double sum = 0.0;
        for (int frame = 0; frame < 50; ++frame) {
            for (std::size_t k = 0; k < kBins; ++k) {
                power[k] = static_cast<float>(-3.0 * std::log(1.0 - random.Unit()));
                if (tones && k % 10 < 5) power[k] = 1e6f;
            }
            measure.Measure(power, floor);
            for (const float value : floor) sum += value;
        }
        const double decibels = 10.0 * std::log10(sum / (50.0 * kBins) / 3.0);
        // Half the bins gone, the quarter is the half of those that are left: ln 2 instead of ln 4/3.
        EXPECT_NEAR(decibels, tones ? 10.0 * std::log10(std::log(2.0) / std::log(4.0 / 3.0)) : 0.0, 1.0);
    }
}

// What each method is able to hear; what it is not is left out.
struct Ability {
    int method;
    Kind kind;
    double noise;  // dB below, 0 for none
};
constexpr Ability kAbilities[] = {
    {1, Kind::Sine, 0},      {1, Kind::Plucked, 0},   {1, Kind::Plucked, 20},
    {1, Kind::Piano, 20},    {2, Kind::Sine, 10},     {2, Kind::Sawtooth, 0},
    {2, Kind::Sawtooth, 10}, {2, Kind::Plucked, 20},  {2, Kind::Piano, 20},
    {3, Kind::Sine, 10},     {3, Kind::Sawtooth, 0},  {3, Kind::Sawtooth, 10},
    {3, Kind::Plucked, 20},  {3, Kind::Piano, 20},    {4, Kind::Sine, 10},
    {4, Kind::Sawtooth, 0},  {4, Kind::Sawtooth, 10}, {4, Kind::Plucked, 20},
    {4, Kind::Piano, 20},    {7, Kind::Sawtooth, 20},  // as 3
};

// The bare product looks for overtones at multiples of whole bins. It misses the fifth partial by more than
// two of them where the fundamental lies midway between two; the octave, on a bin of its own, may win then.
bool Hears(const Ability& ability, double hz, double heard) {
    constexpr double kOff = 0.003, kMidway = 0.1;
    const double bins = hz * kLength / kRate;
    const bool midway = std::abs(bins - std::floor(bins) - 0.5) < kMidway;
    return std::abs(heard / hz - 1.0) < kOff ||
           (ability.method == 1 && midway && std::abs(heard / hz - 2.0) < kOff);
}

TEST_F(TunerTest, HearsWithEveryMethodWhatThatIsAbleTo) {
    for (const Ability& ability : kAbilities) {
        Tuner::SetDetectionMethod(ability.method);
        for (int semitones = 0; semitones <= 72; semitones += 3) {
            const double hz = 55.0 * std::exp2((semitones + 0.2 * std::sin(semitones)) / 12.0);
            auto sound = TunerSounds::Sound(ability.kind, hz, kRate, kLength, 0.1 * semitones);
            if (ability.noise > 0.0) TunerSounds::AddNoise(sound, ability.noise, 7);
            TunerProbe probe(kRate);
            const double heard = probe.Hear(sound.data());
            EXPECT_TRUE(Hears(ability, hz, heard))
                << "method " << ability.method << ", sound " << static_cast<int>(ability.kind) << ", "
                << ability.noise << " dB, " << hz << " Hz: " << heard;
        }
    }
}

std::vector<float> Partials(std::initializer_list<int> numbers, double hz) {
    return TunerSounds::Partials(numbers, hz, kRate, kLength);
}

// Each method is another: they part where the fundamental is missing.
TEST_F(TunerTest, DispatchesToFiveMethods) {
    const auto sound = Partials({3, 4, 5, 6, 7, 8}, 100.0);
    const auto heard = [&](int method, bool denoise) {
        Tuner::SetDetectionMethod(method);
        TunerProbe probe(kRate);
        probe.Show(sound.data(), denoise);
        return probe.tuner.GetFrequency();
    };
    EXPECT_NEAR(heard(0, false), 100.0, 0.05);
    for (int method = 1; method < 5; ++method) {
        EXPECT_FALSE(std::abs(heard(method, false) - 100.0) < 1.0 && method != 3) << method;
        EXPECT_NEAR(heard(method, true), 100.0, 0.05) << method;  // the denoising form, whatever is chosen
    }
}

// A stranger two octaves below is not the fundamental: most of its other partials are missing.
TEST_F(TunerTest, KeepsTheStrongestPeakWithoutItsSubharmonics) {
    Tuner::SetDetectionMethod(3);
    TunerProbe probe(kRate);
    EXPECT_NEAR(probe.Hear(Partials({1, 4, 4, 4}, 250.0).data()), 1000.0, 0.1);
}

// Two notes at once are no deep third one whose high partials they happen to meet. (A fifth is partials 2 and
// 3 of one, and heard so.)
TEST_F(TunerTest, HearsOneOfTwoNotes) {
    for (const double other : {1.26, 1.335, 1.682, 2.245}) {
        auto sound = TunerSounds::Sound(Kind::Piano, 329.6, kRate, kLength, 0.2);
        const auto second = TunerSounds::Sound(Kind::Piano, 329.6 * other, kRate, kLength, 0.7);
        for (std::size_t i = 0; i < kLength; ++i) sound[i] += 0.7f * second[i];
        TunerProbe probe(kRate);
        const double heard = probe.Hear(sound.data());
        EXPECT_NEAR(std::min(std::abs(heard / 329.6 - 1.0), std::abs(heard / (329.6 * other) - 1.0)), 0.0,
                    0.005)
            << other;
    }
}

// The harmonic product leaves its five harmonics to the pseudo product, until a preset is chosen: with three
// of them partials 2..5 of 200 Hz sound like 400 Hz.
TEST_F(TunerTest, KeepsFiveHarmonicsUntilAPresetIsChosen) {
    const auto sound = Partials({2, 3, 4, 5}, 200.0);
    TunerProbe probe(kRate);
    const auto heard = [&] {
        Tuner::SetDetectionMethod(2);
        for (int i = 0; i < 3; ++i) probe.Tune(sound.data());
        return probe.tuner.GetFrequency();
    };
    EXPECT_NEAR(heard(), 400.0, 0.1);
    Tuner::SetDetectionMethod(1);
    probe.Tune(sound.data());
    probe.tuner.SetSensibilityPreset(6);
    EXPECT_NEAR(heard(), 200.0, 0.1);
    probe.tuner.SetSensibilityPreset(0);
    EXPECT_NEAR(heard(), 400.0, 0.1);
}

// By the letter: from the bin of the lowest frequency (30 Hz), 55 dB above valleys of 0 dB, and no higher
// than 17 kHz. The bins have no multiples among each other.
TEST_F(TunerTest, SearchesTheHarmonicProductWithinItsLimits) {
    Tuner::SetDetectionMethod(1);
    struct Case {
        int rate;
        std::size_t bin;
        float power;
        bool heard;
    };
    constexpr float kLimit = 316227.78125f, kBelow = 316227.75f;  // 10^5.5 lies between
    for (const Case& c :
         {Case{44100, 101, kLimit, true}, Case{44100, 101, kBelow, false}, Case{44100, 5, 1e6f, true},
          Case{44100, 4, 1e6f, false}, Case{200000, 691, 1e6f, true}, Case{200000, 701, 1e6f, false}}) {
        std::vector<float> power(kLength / 2, 1.0f);
        power[c.bin] = c.power;
        const double hz = static_cast<double>(c.bin) * c.rate / kLength;
        EXPECT_NEAR(TunerProbe(c.rate).Hear(power), c.heard ? hz : 0.0, 1e-6) << c.bin << ' ' << c.power;
    }
}

// Made only when asked for, by every method, and gone when it is no longer; peaks stay, most of the noise is
// gone, and what is heard is the same.
TEST_F(TunerTest, ShowsTheSpectrumWithoutItsFloor) {
    auto sound = TunerSounds::Sound(Kind::Plucked, 1000.0, kRate, kLength, 0.0);
    TunerSounds::AddNoise(sound, 20.0, 3);
    TunerProbe probe(kRate);
    const auto& power = probe.Transform(sound.data());
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
    int left = 0;
    for (std::size_t k = 0; k < clean.size(); ++k) left += clean[k] > 0.0f;
    // One bin of noise in seven is above the floor, give or take what one spectrum allows.
    EXPECT_NEAR(left / 4096.0, std::exp(-2.0), 0.03);
    EXPECT_NEAR(clean[186] / power[186], 1.0, 0.001);
}

}  // namespace
