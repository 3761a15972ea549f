#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <utility>
#include <vector>

#include "Spectrum/Tuner/TunerFixture.h"

namespace {

using TunerSounds::Kind;

constexpr int kRate = 44100;
constexpr int kLength = 8192;
constexpr std::size_t kFrames = kLength;

// Semitones above 55 Hz and cents beside them.
struct Tone {
    int semitones;
    double cents;
    double Hz() const { return 55.0 * std::exp2((semitones + 0.01 * cents) / 12.0); }
};
constexpr Tone kTones[] = {{0, 0},    {1, -37}, {4, 21},  {7, 0},   {11, 44}, {12, 0},   {17, -44},
                           {21, 12},  {24, -7}, {28, 31}, {33, 0},  {36, 45}, {41, -19}, {48, 3},
                           {55, -45}, {60, 0},  {63, 38}, {68, -3}, {72, 17}, {74, -30}, {75, 0}};

// What each method hears, and through how much noise (decibels below the sound, 0 for none); what it does not
// hear is left out. Method 0 is held to more: eight frames of each tone, of which one in a hundred may be
// wrong, within a few hundredths of a bin, but never asked below half a cent. The others hear one frame of
// each, to 5 cents.
struct Ability {
    int method;
    Kind kind;
    std::vector<int> noises;
};
// clang-format off
const Ability kAbilities[] = {
    {0, Kind::Sine,     {0, 30, 20, 10}}, {0, Kind::Sawtooth, {0, 30, 20, 10}}, {0, Kind::Plucked, {0, 30, 20, 10}},
    {0, Kind::Piano,    {0, 30, 20, 10}}, {0, Kind::MissingFundamental, {0, 30, 20, 10}},
    {1, Kind::Sine,     {0}},             {1, Kind::Plucked,  {0, 20}},         {1, Kind::Piano,   {20}},
    {2, Kind::Sine,     {10}},            {2, Kind::Sawtooth, {0, 10}},         {2, Kind::Plucked, {20}},
    {2, Kind::Piano,    {20}},            {3, Kind::Sine,     {10}},            {3, Kind::Sawtooth, {0, 10}},
    {3, Kind::Plucked,  {20}},            {3, Kind::Piano,    {20}},            {4, Kind::Sine,    {10}},
    {4, Kind::Sawtooth, {0, 10}},         {4, Kind::Plucked,  {20}},            {4, Kind::Piano,   {20}},
    {7, Kind::Sawtooth, {20}},  // as 3
};
// clang-format on
double ExactBins(int noise) { return noise == 0 ? 0.02 : 0.06 - 0.001 * noise; }

// The bare product looks for overtones at multiples of whole bins. It misses the fifth partial by more than
// two of them where the fundamental lies midway between two; the octave, on a bin of its own, may win then.
// Near the product's end, a tenth of the rate, a peak's skirt may never reach the valley that is asked for.
bool MayMiss(int method, double hz, double bins, double cents) {
    const bool midway = std::abs(bins - std::floor(bins) - 0.5) < 0.1;
    return method == 1 && ((midway && std::abs(cents - 1200.0) < 5.0) || hz > 4000.0);
}

// How often one kind of sound was heard wrongly.
struct Heard {
    int all = 0, wrong = 0, octaves = 0;
    double worst = 0.0;  // share of what is allowed

    void Add(bool any, double off, double allowed) {  // cents
        const bool right = std::abs(off) < 50.0;
        ++all;
        wrong += !right;
        octaves += any && !right && std::abs(std::remainder(off, 1200.0)) < 50.0;
        if (right) worst = std::max(worst, std::abs(off) / allowed);
    }
};

std::vector<Heard> HearTones(const Ability& ability) {
    constexpr std::size_t kHop = 1470;  // a refresh
    const std::size_t frames = ability.method == 0 ? 8 : 1;
    std::vector<Heard> results(ability.noises.size());
    for (const int rate : {44100, 48000})
        for (std::size_t t = 0; t < std::size(kTones); ++t) {
            const double hz = kTones[t].Hz(), perBin = static_cast<double>(rate) / kLength;
            const auto clean = TunerSounds::Sound(ability.kind, hz, rate, kFrames + frames * kHop,
                                                  0.13 * static_cast<double>(t));
            TunerProbe probe(rate);
            for (std::size_t n = 0; n < results.size(); ++n) {
                const int noise = ability.noises[n];
                auto sound = clean;
                if (noise > 0) TunerSounds::AddNoise(sound, noise, 4 * t + n);
                const double exact = std::max(ExactBins(noise) * perBin / hz * 1200.0 / std::log(2.0), 0.5);
                for (std::size_t frame = 0; frame < frames; ++frame) {
                    const double heard = probe.Hear(sound.data() + frame * kHop);
                    const double off = 1200.0 * std::log2(heard / hz);  // cents
                    if (!MayMiss(ability.method, hz, hz / perBin, off))
                        results[n].Add(heard > 0.0, off, ability.method == 0 ? exact : 5.0);
                }
            }
        }
    return results;
}

// Catches octave errors, bias of the interpolation, and pitches pulled by noise or inharmonicity.
TEST_F(TunerTest, HearsWithEveryMethodWhatThatIsAbleTo) {
    for (const Ability& ability : kAbilities) {
        Tuner::SetDetectionMethod(ability.method);
        const auto results = HearTones(ability);
        for (std::size_t n = 0; n < results.size(); ++n) {
            SCOPED_TRACE(testing::Message()
                         << "method " << ability.method << ", sound " << static_cast<int>(ability.kind)
                         << ", noise " << ability.noises[n] << " dB below");
            EXPECT_LE(results[n].wrong, ability.method == 0 ? results[n].all / 100 : 0);
            EXPECT_EQ(results[n].octaves, 0);
            EXPECT_LE(results[n].worst, 1.0);
        }
    }
}

std::vector<float> Partials(const std::vector<int>& numbers, double hz) {
    return TunerSounds::Partials(numbers, hz, kRate, kFrames);
}

// Each method is another: they part where the fundamental is missing. The denoising form is what is asked
// for, whatever is chosen.
TEST_F(TunerTest, DispatchesToFiveMethods) {
    const auto sound = Partials({3, 4, 5, 6, 7, 8}, 100.0);
    for (int method = 0; method < 5; ++method) {
        Tuner::SetDetectionMethod(method);
        TunerProbe probe(kRate);
        const bool first = std::abs(probe.Hear(sound.data()) - 100.0) < 0.05;
        EXPECT_TRUE(method == 3 || first == (method == 0)) << method;
        probe.tuner.Forget();
        probe.Show(sound.data(), true);
        EXPECT_NEAR(probe.tuner.GetFrequency(), 100.0, 0.05) << method;
    }
    // A stranger two octaves below is not the fundamental: most of its other partials are missing.
    Tuner::SetDetectionMethod(3);
    EXPECT_NEAR(TunerProbe(kRate).Hear(Partials({1, 4, 4, 4}, 250.0).data()), 1000.0, 0.1);
}

// Two notes at once are no deep third one whose high partials they happen to meet. (A fifth is partials 2 and
// 3 of one, and heard so.)
TEST_F(TunerTest, HearsOneOfTwoNotes) {
    for (const double other : {1.26, 1.335, 1.682, 2.245}) {
        auto sound = TunerSounds::Sound(Kind::Piano, 329.6, kRate, kFrames, 0.2);
        const auto second = TunerSounds::Sound(Kind::Piano, 329.6 * other, kRate, kFrames, 0.7);
        for (std::size_t i = 0; i < kFrames; ++i) sound[i] += 0.7f * second[i];
        const double heard = TunerProbe(kRate).Hear(sound.data()) / 329.6;
        EXPECT_LT(std::min(std::abs(heard - 1.0), std::abs(heard / other - 1.0)), 0.005) << other;
    }
}

// The harmonic product leaves its five harmonics to the pseudo product, until a preset is chosen: with three
// of them partials 2..5 of 200 Hz sound like 400 Hz.
TEST_F(TunerTest, KeepsFiveHarmonicsUntilAPresetIsChosen) {
    const auto sound = Partials({2, 3, 4, 5}, 200.0);
    TunerProbe probe(kRate);
    const auto heard = [&](int method) {
        Tuner::SetDetectionMethod(method);
        return probe.Hear(sound.data());
    };
    EXPECT_NEAR(heard(2), 400.0, 0.1);
    heard(1);
    probe.tuner.SetSensibilityPreset(6);
    EXPECT_NEAR(heard(2), 200.0, 0.1);
    probe.tuner.SetSensibilityPreset(0);
    EXPECT_NEAR(heard(2), 400.0, 0.1);
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
        std::vector<float> power(kFrames / 2, 1.0f);
        power[c.bin] = c.power;
        const double hz = static_cast<double>(c.bin) * c.rate / kLength;
        EXPECT_NEAR(TunerProbe(c.rate).Hear(power), c.heard ? hz : 0.0, 1e-6) << c.bin << ' ' << c.power;
    }
}

// Made only when asked for, by every method, and gone when it is no longer; peaks stay, most of the noise is
// gone, and what is heard is the same.
TEST_F(TunerTest, ShowsTheSpectrumWithoutItsFloor) {
    auto sound = TunerSounds::Sound(Kind::Plucked, 1000.0, kRate, kFrames, 0.0);
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
    // One bin of noise in seven is above the floor, give or take what one spectrum allows.
    const auto left = std::count_if(clean.begin(), clean.end(), [](float value) { return value > 0.0f; });
    EXPECT_NEAR(static_cast<double>(left) / 4096.0, std::exp(-2.0), 0.03);
    EXPECT_NEAR(clean[186] / power[186], 1.0, 0.001);
}

// The floor of white noise of power 1, told from the quarter of the bins that are weakest, and what a
// Blackman window shows of a sine so far above twice that.
std::vector<float> SineAboveFloor(double decibels) {
    std::vector<float> power(kFrames / 2, static_cast<float>(std::log(4.0 / 3.0)));
    const double peak = 2.0 * std::pow(10.0, 0.1 * decibels);
    constexpr double kLobe[] = {1.0, 0.25 / 0.42, 0.04 / 0.42};
    for (const int off : {-2, -1, 0, 1, 2}) {
        float& bin = power[static_cast<std::size_t>(300 + off)];
        bin = std::max(bin, static_cast<float>(peak * kLobe[std::abs(off)] * kLobe[std::abs(off)]));
    }
    return power;
}

// Of every sensitivity: which pitches are sought, how far above the floor a partial begins a note and keeps
// it, how far below the strongest one counts, and how many the pseudo product sums.
TEST_F(TunerTest, HearsAsTheSensitivitySays) {
    for (int preset = 0; preset < 6; ++preset) {
        SCOPED_TRACE(preset);
        const TunerSensitivityRow& row = kSensitivityRows[preset];
        TunerProbe probe(kRate), deep(kRate, 32768);
        for (auto* const tuner : {&probe.tuner, &deep.tuner}) tuner->SetSensibilityPreset(preset);
        for (const auto& [hz, heard] : {std::pair{1.03 * row.lowest, true},
                                        {0.97 * row.lowest, false},
                                        {0.999 * row.highest, true},
                                        {1.001 * row.highest, false}})
            EXPECT_NEAR(deep.Hear(TestSupport::Sine<float>(32768, hz, kRate).data()), heard ? hz : 0.0, 0.1);

        for (const auto& [decibels, heard] : {std::pair{row.onset - 0.2, false},
                                              {row.onset + 0.2, true},
                                              {row.onset + 0.2, true},
                                              {row.partial + 0.2, true},
                                              {row.partial - 0.2, false}}) {
            probe.Tune(SineAboveFloor(decibels));
            EXPECT_EQ(probe.tuner.GetHeardFrequency() > 0.0, heard) << decibels;
        }

        // The legacy method takes the octave below the strongest partial for the pitch when anything is
        // there.
        Tuner::SetDetectionMethod(3);
        const double hz = 186.0 * kRate / kLength;
        for (const double beside : {-0.5, 0.5}) {
            auto sound = TestSupport::Sine<float>(kFrames, hz, kRate, 0.5);
            const auto below = TestSupport::Sine<float>(kFrames, 0.5 * hz, kRate,
                                                        0.5 * std::pow(10.0, -0.05 * (row.range + beside)));
            for (std::size_t i = 0; i < kFrames; ++i) sound[i] += below[i];
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
