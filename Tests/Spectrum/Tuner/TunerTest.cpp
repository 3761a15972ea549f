#include "Spectrum/Tuner/Tuner.h"

#include <array>
#include <cmath>

#include "Spectrum/Tuner/TunerFixture.h"
#include "Support/AudioThreadRules.h"

namespace {

constexpr std::size_t kLength = 8192;

std::vector<float> Sharp(double cents) { return TunerSine(440.0 * std::exp2(cents / 1200.0)); }
double CentsBetween(double hz, double reference) { return 1200.0 * std::log2(hz / reference); }

struct Listener : TuningListener {
    Listener() { Tuner::SetTuningListener(this); }
    ~Listener() override { Tuner::SetTuningListener(nullptr); }
    void NotesMustBeRecomputed() override { ++told; }
    int told = 0;
};

// Each temperament's deviations from the equal one.
TEST_F(TunerTest, TempersTheNotes) {
    struct Case {
        const char* name;
        std::array<double, 12> cents;
    };
    // clang-format off
    const Case cases[] = {
        {"Equal",               {0,     0,     0,     0,     0,     0,     0,     0,     0,     0,     0,     0}},
        {"Pythagorean",         {0,  -9.8,   3.9,  -5.9,   7.8,  -2.0, -11.7,   2.0,  -7.8,   5.9,  -3.9,   9.8}},
        {"Meantone (1/4 tone)", {0,  17.1,  -6.8,  10.3, -13.7,   3.4,  20.5,  -3.4,  13.7, -10.3,   6.8, -17.1}},
        {"Werckmeister III",    {0,   7.8,   3.9,  11.7,   2.0,   3.9,   5.9,   2.0,   9.8,     0,   7.8,   3.9}},
        {"Just (Kepler)",       {0,  11.7, -17.6,  -5.9, -13.7,  -2.0,   9.8, -19.6,  -7.8, -15.6,  -3.9, -11.7}},
        {"Just (Fogliano I)",   {0,  -9.8, -17.6,  -5.9, -13.7,  -2.0, -11.7, -19.6,  -7.8, -15.6,  -3.9, -11.7}},
        {"Just (Fogliano II)",  {0,  -9.8, -17.6,  -5.9, -13.7,  -2.0, -11.7, -19.6,  -7.8, -15.6,  -3.9, -11.7}},
        {"Meantone (Romieu)",   {0,   5.6,  -2.2,   3.4,  -4.5,   1.1,   6.7,  -1.1,   4.5,  -3.4,   2.2,  -5.6}},
        {"Meantone (Zarlino)",  {0,  20.9,  -8.4,  12.6, -16.8,   4.2,  25.1,  -4.2,  16.8, -12.6,   8.4, -20.9}},
        {"Meantone (Salinas)",  {0,  26.1, -10.4,  15.6, -20.9,   5.2,  31.3,  -5.2,  20.9, -15.6,  10.4, -26.1}},
        {"Vallotti",            {0,   2.0,  -3.9,   5.9,  -3.9,   2.0,     0,  -2.0,   3.9,  -5.9,   3.9,  -2.0}},
    };
    // clang-format on
    Listener listener;
    for (int t = 0; t < 11; ++t) {
        Tuner::SetTemperament(t);
        Tuner::CookNotesFrequencies(false);
        EXPECT_EQ(listener.told, t) << "of real changes only";
        EXPECT_STREQ(Tuner::GetCurrentTemperamentName(), cases[t].name);
        for (int i = 0; i < 12; ++i)
            EXPECT_NEAR(CentsBetween(Tuner::GetNoteFrequency(i), 110.0 * std::exp2(i / 12.0)),
                        cases[t].cents[static_cast<std::size_t>(i)], 0.0501)
                << cases[t].name << ", note " << i;
        EXPECT_EQ(Tuner::GetNoteFrequency(12), 220.0);
    }
    Tuner::SetTemperament(12);
    EXPECT_EQ(Tuner::GetTemperament(), 0);
}

TEST_F(TunerTest, NamesWhatItShows) {
    const char* const bFlat[] = {"A#", "Bb", "La#"};
    for (int naming = 0; naming < 3; ++naming) {
        Tuner::SetNoteNaming(naming);
        EXPECT_STREQ(Tuner::GetNoteName(1), bFlat[naming]);
    }
    for (const auto& [cents, text] :
         {std::pair{12.34f, "+12.3c"}, {-0.26f, "\u22120.3c"}, {-0.04f, "0.0c"}, {9.96f, "+10.0c"}})
        EXPECT_EQ(Tuner::GetTuningErrorStr(cents), text) << cents;
}

// Notes by frequency over the octaves, which change at C; positive is sharp.
TEST_F(TunerTest, FindsTheNearestNote) {
    const auto expectNote = [](double semitones, const char* name, int octave, double cents) {
        TunerProbe probe;
        probe.Show(Sharp(100.0 * semitones).data());
        EXPECT_STREQ(probe.tuner.GetTunedNoteName(), name) << semitones;
        EXPECT_EQ(probe.tuner.GetOctave(), octave) << semitones;
        EXPECT_NEAR(probe.tuner.GetErrorCents(), cents, 0.1) << semitones;
        EXPECT_NEAR(CentsBetween(probe.tuner.GetFrequency(), 440.0), 100.0 * semitones, 0.1);
    };
    expectNote(-9, "C", 4, 0);
    expectNote(-10, "B", 3, 0);
    expectNote(0.3, "A", 4, 30);
    expectNote(0.7, "A#", 4, -30);
    expectNote(-37, "G#", 1, 0);
    TunerProbe probe;
    probe.Show(Sharp(-1.5).data());
    for (const bool centred : {false, true}) {
        Tuner::SetTunedQuantum(centred ? 1.6f : 1.4f);
        EXPECT_EQ(probe.tuner.IsTunedCentered(), centred);
    }
    // Where notes are unequally far apart they part midway in cents: C# and D lie 379.1 and 505.2 above A.
    Tuner::SetTemperament(9);
    expectNote(4.420, "C#", 5, 62.9);
    expectNote(4.424, "D", 5, -62.8);
}

// A first note appears when it is heard twice in succession, another when it has been confirmed, none when it
// has been missing for long enough; until then note and error stay as they were. The same name in another
// octave is another note.
TEST_F(TunerTest, HoldsAndReleasesByTheSensitivity) {
    const auto a = TunerSine(440.0), octave = TunerSine(880.0), c = TunerSine(523.0),
               silence = TunerSine(0.0);
    for (int preset = 0; preset < 6; ++preset) {
        SCOPED_TRACE(preset);
        const TunerSensitivityRow& row = kSensitivityRows[preset];
        TunerProbe probe;
        Tuner& tuner = probe.tuner;
        tuner.SetSensibilityPreset(preset);
        EXPECT_EQ(tuner.GetSensibilityPreset(), row.reported);
        const auto times = [&](int count, const std::vector<float>& samples) {
            for (int i = 0; i < count; ++i) probe.Tune(samples.data());
        };
        for (const auto* sound : {&a, &silence, &a, &octave}) times(1, *sound);
        EXPECT_FALSE(tuner.IsTuned());
        times(2, a);
        EXPECT_EQ(tuner.GetTunedNote(), (TunedNote{0, 4}));
        times(row.confirm - 1, octave);
        times(1, c);
        times(row.confirm - 1, octave);
        EXPECT_EQ(tuner.GetTunedNote(), (TunedNote{0, 4}));
        EXPECT_NEAR(tuner.GetErrorCents(), 0.0, 0.1);
        times(1, octave);
        EXPECT_EQ(tuner.GetTunedNote(), (TunedNote{0, 5}));
        const float error = tuner.GetErrorCents();
        times(row.release - 1, silence);
        times(1, octave);
        times(row.hold - 1, silence);
        EXPECT_TRUE(TunerIsTracking(tuner));
        times(1, silence);
        EXPECT_FALSE(TunerIsTracking(tuner));
        times(row.release - row.hold - 1, silence);
        EXPECT_TRUE(tuner.IsTuned());
        EXPECT_EQ(tuner.GetErrorCents(), error);
        times(1, silence);
        EXPECT_FALSE(tuner.IsTuned() || tuner.GetFrequency() > 0.0);
        times(2, a);
        tuner.SetSensibilityPreset(6);
        times(1, a);
        EXPECT_FALSE(tuner.IsTuned()) << "choosing a preset, even one that is none, forgets";
    }
}

// What is given as heard belongs to the note shown: nothing while a pitch falls as a drum's does, or for
// another note before it is shown; where a glide has led; and the note itself beside another.
TEST_F(TunerTest, GivesNothingThatItDoesNotShow) {
    const auto low = TunerSounds::Sound(TunerSounds::Kind::Sawtooth, 220.0, kTunerRate, kLength, 0.0);
    const auto high = TunerSounds::Sound(TunerSounds::Kind::Sawtooth, 311.1, kTunerRate, kLength, 0.0);
    TunerProbe probe;
    const auto expectHeard = [&probe](const std::vector<float>& sound, double hz) {
        probe.Tune(sound.data());
        EXPECT_NEAR(probe.tuner.GetHeardFrequency(), hz, 0.2);
    };
    for (int i = 4; i >= 0; --i) expectHeard(Sharp(30.0 * i), 0.0);
    for (const double cents : {0.0, 40.0, 80.0}) expectHeard(Sharp(cents), 440.0 * std::exp2(cents / 1200.0));
    expectHeard(Sharp(500.0), 0.0);
    for (int i = 0; i < 3; ++i) probe.Tune(low.data());
    for (int i = 0; i < 2; ++i) expectHeard(TunerSounds::Mixed(low, high, 1.2f), 220.0);
}

// Weak odd partials make a sound one of an octave lower, but not while its even ones are heard as a note.
TEST_F(TunerTest, KeepsItsOctaveInDoubt) {
    const auto partials = [](const std::vector<int>& numbers) {
        return TunerSounds::Partials(numbers, 110.0, kTunerRate, kLength);
    };
    const auto even = partials({2, 4, 6, 8, 10, 12});
    const auto doubtful = TunerSounds::Mixed(even, partials({1, 3, 5, 7, 9, 11}), 0.15f);
    TunerProbe probe;
    EXPECT_NEAR(probe.Hear(doubtful.data()), 110.0, 0.1);
    EXPECT_NEAR(probe.Hear(even.data()), 220.0, 0.1);
    for (int i = 0; i < 3; ++i) probe.Tune(doubtful.data());
    EXPECT_NEAR(probe.tuner.GetFrequency(), 220.0, 0.1);
}

// Takes a steady pitch for the nearest note, one that wanders by more than 10 cents for nothing. Refreshed
// every 30 ms, half a second is 18 analyses from the one that shows the note, which is the second.
TEST_F(TunerTest, Calibrates) {
    struct Case {
        double cents, wander, base;
        int frames, temperament = 0;
    };
    // In the temperament 9 the middle of a wide gap is further from both notes than one calibration goes.
    for (const Case& c : {Case{20, 0, 20, 19}, Case{20, 0, 0, 18}, Case{-30, 4.5, -30, 19},
                          Case{-30, 5.5, 0, 19}, Case{1260, 0, -40, 19}, Case{440, 0, 50, 19, 9}}) {
        TunerCalibrateReset();
        Tuner::SetTemperament(c.temperament);
        TunerProbe probe;
        for (int i = 0; i < c.frames; ++i) probe.Tune(Sharp(c.cents + c.wander * (i % 2 * 2 - 1)).data());
        const bool done = TunerCalibrateNow(probe.tuner);
        EXPECT_EQ(done, c.base != 0) << c.cents;
        EXPECT_NEAR(CentsBetween(Tuner::GetCalibrationBase(), 110.0), c.base, 0.5) << c.cents;
        EXPECT_EQ(TunerIsNonstandardCalibration(), done);
        EXPECT_NEAR(Tuner::GetNoteFrequency(12), 2.0 * Tuner::GetCalibrationBase(), 1e-9);
    }
}

// No note in silence, an offset, a click or seconds of noise. "Sensitive" hears one in two thousand spectra
// of noise alone, but in half an hour of white noise never the same in two that follow each other.
TEST_F(TunerTest, HearsNothingInNoise) {
    const auto white = TestSupport::Noise<float>(100000);
    auto brown = white, click = std::vector<float>(100000);  // falls by 6 dB per octave from 70 Hz
    for (std::size_t i = 1; i < brown.size(); ++i) brown[i] = 0.99f * brown[i - 1] + 0.1f * white[i];
    click[50000] = 1.0f;
    for (const auto& sound : {std::vector<float>(100000, 0.5f), click, white, brown})
        for (const int preset : {0, 2}) {
            TunerProbe probe;
            probe.tuner.SetSensibilityPreset(preset);
            for (std::size_t at = 0; at + kLength <= sound.size(); at += 1470) {
                probe.Tune(sound.data() + at);
                ASSERT_FALSE(probe.tuner.IsTuned()) << "sensitivity " << preset << ", at " << at;
            }
        }
}

TEST_F(TunerTest, SurvivesBadSpectraAndAllocatesNothing) {
    Tuner::SetShowDenoisedSpectrum(true);
    for (int method = 0; method < 5; ++method) {
        Tuner::SetDetectionMethod(method);
        TunerProbe probe;
        for (const float value : {0.0f, -1.0f, INFINITY, NAN})
            for (const std::size_t size : {0u, 1u, 40u, 10000u})
                for (const int length : {-1, 1, 8192, 1 << 30}) {
                    for (const int rate : {0, 1, 1 << 30})
                        probe.tuner.Tune(std::vector<float>(size, value), {}, length, length, length / 2,
                                         rate, true, size == 40);
                    EXPECT_TRUE(std::isfinite(probe.tuner.GetFrequency() + probe.tuner.GetErrorCents()));
                }
        const auto sound = TunerSounds::Sound(TunerSounds::Kind::Sawtooth, 110.0, kTunerRate, kLength, 0.0);
        const auto& power = probe.Transform(sound.data());
        probe.Tune(power);
        const TestSupport::AudioThreadRules rules;
        for (int i = 0; i < 20; ++i) probe.Tune(power);
        EXPECT_EQ(rules.Broken(), "") << method;
    }
}

}  // namespace
