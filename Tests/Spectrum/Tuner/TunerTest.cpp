#include "Spectrum/Tuner/Tuner.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <string>
#include <utility>

#include "Spectrum/Tuner/TunerFixture.h"
#include "Spectrum/Tuner/TunerSounds.h"
#include "Support/AudioThreadRules.h"

namespace {

constexpr int kRate = 44100;
constexpr std::size_t kLength = 8192;

std::vector<float> Sine(double hz, double amplitude = 0.5, std::size_t frames = kLength) {
    return TestSupport::Sine<float>(frames, hz, kRate, amplitude);
}

double CentsBetween(double hz, double reference) { return 1200.0 * std::log2(hz / reference); }

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
    for (int t = 0; t < 11; ++t) {
        Tuner::SetTemperament(t);
        Tuner::CookNotesFrequencies(false);
        EXPECT_STREQ(Tuner::GetCurrentTemperamentName(), cases[t].name);
        for (int i = 0; i < 12; ++i)
            EXPECT_NEAR(CentsBetween(Tuner::GetNoteFrequency(i), 110.0 * std::exp2(i / 12.0)),
                        cases[t].cents[static_cast<std::size_t>(i)], 0.0501)
                << cases[t].name << ", note " << i;
        EXPECT_EQ(Tuner::GetNoteFrequency(12), 220.0);
    }
    for (const int none : {-1, 13}) {
        EXPECT_STREQ(Tuner::GetTemperamentName(none), "");
        EXPECT_EQ(Tuner::GetNoteFrequency(none), 0.0);
    }
}

struct Listener : TuningListener {
    int told = 0;
    void NotesMustBeRecomputed() override { ++told; }
};

// The notes follow at the next cook, not before; the listener hears of real changes only.
TEST_F(TunerTest, CooksWhatChanged) {
    Listener listener;
    Tuner::SetTuningListener(&listener);
    Tuner::SetTemperament(-5);
    EXPECT_FALSE(listener.told > 0 || Tuner::IsTemperamentChanged());
    Tuner::SetTemperament(10);
    EXPECT_TRUE(listener.told == 1 && Tuner::IsTemperamentChanged());
    EXPECT_NEAR(Tuner::GetNoteFrequency(3), 130.81, 0.005);
    Tuner::CookNotesFrequencies(false);
    EXPECT_FALSE(Tuner::IsTemperamentChanged());
    EXPECT_NEAR(CentsBetween(Tuner::GetNoteFrequency(3), 110.0 * std::exp2(0.25)), 5.9, 0.06);
    Tuner::SetTuningListener(nullptr);
    Tuner::SetTemperament(12);
    EXPECT_EQ(Tuner::GetTemperament(), 0);
    CookNotesFreqs();
    EXPECT_FALSE(Tuner::IsTemperamentChanged());
    EXPECT_EQ(listener.told, 1);
}

TEST_F(TunerTest, NamesWhatItShows) {
    const char* const bFlat[] = {"A#", "Bb", "La#"};
    for (int naming = 0; naming < 3; ++naming) {
        Tuner::SetNoteNaming(naming);
        EXPECT_STREQ(Tuner::GetNoteName(1), bFlat[naming]);
        EXPECT_STREQ(Tuner::GetNoteName(10), naming < 2 ? "G" : "Sol");
        for (const int none : {-1, 12}) EXPECT_STREQ(Tuner::GetNoteName(none), "");
    }
    // clang-format off
    for (const auto& [cents, text] : {std::pair{12.34f, "+12.3c"}, {-0.26f, "\u22120.3c"}, {0.04f, "0.0c"},
                                      {-0.04f, "0.0c"}, {9.96f, "+10.0c"}, {-49.95f, "\u221250.0c"}})
        // clang-format on
        EXPECT_EQ(Tuner::GetTuningErrorStr(cents), text) << cents;
    Tuner tuner;
    EXPECT_EQ(tuner.GetTuningErrorStr(), "");
    EXPECT_STREQ(tuner.GetTunedNoteName(), "");
    EXPECT_STREQ(Tuner::GetSensibilityPresetName(4), "Strong sounds");
    EXPECT_STREQ(Tuner::GetSensibilityPresetName(6), "");
    for (int preset = 0; preset < 7; ++preset) {
        tuner.SetSensibilityPreset(preset);
        EXPECT_EQ(tuner.GetSensibilityPreset(), kSensitivityRows[std::min(preset, 5)].reported);
    }
    for (const auto& [preset, cents] :
         {std::pair{0, 0.1f}, {1, 0.5f}, {2, 1.0f}, {3, 2.0f}, {4, 5.0f}, {5, 10.0f}, {99, 2.0f}}) {
        Tuner::SetTunedQuantumPreset(preset);
        EXPECT_EQ(Tuner::GetTunedQuantum(), cents);
    }
}

// Notes by frequency over the octaves, which change at C; positive is sharp.
TEST_F(TunerTest, FindsTheNearestNote) {
    struct Case {
        double semitones;  // from the A of 440 Hz
        const char* name;
        int octave;
        double cents;
    };
    for (const Case& c : {Case{0, "A", 4, 0}, Case{-9, "C", 4, 0}, Case{-10, "B", 3, 0},
                          Case{0.3, "A", 4, 30}, Case{-0.3, "A", 4, -30}, Case{0.7, "A#", 4, -30},
                          Case{-33, "C", 2, 0}, Case{-37, "G#", 1, 0}, Case{39, "C", 8, 0}}) {
        TunerProbe probe(kRate);
        const double hz = 440.0 * std::exp2(c.semitones / 12.0);
        probe.Show(Sine(hz).data());
        EXPECT_STREQ(probe.tuner.GetTunedNoteName(), c.name) << hz;
        EXPECT_EQ(probe.tuner.GetOctave(), c.octave) << hz;
        EXPECT_NEAR(probe.tuner.GetErrorCents(), c.cents, 0.1) << hz;
        EXPECT_NEAR(probe.tuner.GetFrequency(), hz, 0.01) << hz;
    }
    // Where notes are unequally far apart they part midway in cents: C# and D lie 379.1 and 505.2 above A.
    Tuner::SetTemperament(9);
    for (const double cents : {442.0, 442.4}) {
        TunerProbe probe(kRate);
        probe.Show(Sine(440.0 * std::exp2(cents / 1200)).data());
        EXPECT_STREQ(probe.tuner.GetTunedNoteName(), cents < 442.2 ? "C#" : "D") << cents;
    }
    // E is 2 cents higher there.
    Tuner::SetTemperament(1);
    TunerProbe probe(kRate);
    probe.Show(Sine(660.0).data());
    EXPECT_NEAR(probe.tuner.GetErrorCents(), 0.0, 0.05);
}

// Centred means strictly closer than the quantum.
TEST_F(TunerTest, CentresWithinTheQuantum) {
    TunerProbe probe(kRate);
    EXPECT_FALSE(probe.tuner.IsTuned() || probe.tuner.IsTunedCentered());
    probe.Show(Sine(440.0 * std::exp2(-1.5 / 1200)).data());
    ASSERT_TRUE(probe.tuner.IsTuned());
    const float error = std::abs(probe.tuner.GetErrorCents());
    Tuner::SetTunedQuantum(error);
    EXPECT_FALSE(probe.tuner.IsTunedCentered());
    Tuner::SetTunedQuantum(std::nextafter(error, 2.0f));
    EXPECT_TRUE(probe.tuner.IsTunedCentered());
}

struct Display : TunerDisplayListener {
    std::string heard;
    void NoteChanged(bool present) override { heard += present ? '+' : '-'; }
};

// A first note appears when it is heard twice in succession, another when it has been confirmed, none when it
// has been missing for long enough; until then note and error stay as they were. The same name in another
// octave is another note.
TEST_F(TunerTest, HoldsAndReleasesByTheSensitivity) {
    const auto a = Sine(440.0), octave = Sine(880.0), c = Sine(523.0), silence = std::vector<float>(kLength);
    for (int preset = 0; preset < 6; ++preset) {
        SCOPED_TRACE(preset);
        const TunerSensitivityRow& row = kSensitivityRows[preset];
        TunerProbe probe(kRate);
        Tuner& tuner = probe.tuner;
        Display display;
        tuner.SetDisplayListener(&display);
        tuner.SetSensibilityPreset(preset);
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
        EXPECT_EQ(display.heard, "++-");
        // Choosing a preset, even one that is none, forgets the note, and what was on its way to being one.
        times(2, a);
        EXPECT_TRUE(tuner.IsTuned());
        tuner.SetSensibilityPreset(6);
        EXPECT_FALSE(tuner.IsTuned() || tuner.IsTracking() || tuner.GetHeardFrequency() > 0.0);
        times(1, a);
        EXPECT_FALSE(tuner.IsTuned());
        EXPECT_EQ(display.heard, "++-+-");
        times(1, a);
        EXPECT_TRUE(tuner.IsTuned());
    }
}

// Takes a steady pitch for the nearest note, one that wanders by more than 10 cents for nothing. Refreshed
// every 30 ms, half a second is 18 analyses from the one that shows the note, which is the second.
TEST_F(TunerTest, Calibrates) {
    EXPECT_EQ(TunerGetNumLines(), 2);
    struct Case {
        double cents, wander, base;
        int frames;
        bool done;
        int temperament = 0;
    };
    Listener listener;
    // In the temperament 9 the middle of a wide gap is further from both notes than one calibration goes.
    for (const Case& c :
         {Case{20, 0, 20, 19, true}, Case{20, 0, 0, 18, false}, Case{-30, 4.5, -30, 19, true},
          Case{-30, 5.5, 0, 19, false}, Case{1260, 0, -40, 19, true}, Case{440, 0, 50, 19, true, 9}}) {
        TunerCalibrateReset();
        Tuner::SetTemperament(c.temperament);
        TunerProbe probe(kRate);
        for (int i = 0; i < c.frames; ++i)
            probe.Tune(Sine(440.0 * std::exp2((c.cents + c.wander * (i % 2 * 2 - 1)) / 1200)).data());
        Tuner::SetTuningListener(&listener);
        EXPECT_EQ(TunerCalibrateNow(probe.tuner), c.done) << c.cents;
        Tuner::SetTuningListener(nullptr);
        EXPECT_NEAR(CentsBetween(Tuner::GetCalibrationBase(), 110.0), c.base, 0.5) << c.cents;
        EXPECT_EQ(TunerIsNonstandardCalibration(), c.done);
        EXPECT_NEAR(Tuner::GetNoteFrequency(12), 2.0 * Tuner::GetCalibrationBase(), 1e-9);
    }
    EXPECT_EQ(listener.told, 4);
    EXPECT_EQ(TunerGetNumLines(), 3);
    Tuner::SetTemperament(0);
    TunerCalibrateReset();
    EXPECT_FALSE(TunerCalibrationNotStandardOrNotUseEqualTemperament());
    Tuner::SetTemperament(4);
    EXPECT_TRUE(TunerCalibrationNotStandardOrNotUseEqualTemperament());
    EXPECT_FALSE(TunerIsNonstandardCalibration());
}

// No note in silence, an offset, a click or seconds of noise. "Sensitive" hears one in two thousand spectra
// of noise alone, but in half an hour of white noise never the same in two that follow each other.
TEST_F(TunerTest, HearsNothingInNoise) {
    const auto white = TestSupport::Noise<float>(200000);
    auto brown = white;  // falls by 6 dB per octave from 70 Hz
    for (std::size_t i = 1; i < brown.size(); ++i) brown[i] = 0.99f * brown[i - 1] + 0.1f * white[i];
    std::vector<float> click(200000);
    click[50000] = 1.0f;
    const std::vector<float> sounds[] = {
        std::vector<float>(200000), std::vector<float>(200000, 0.5f), click, white, brown,
        Sine(440.0, 1e-7, 200000)};
    for (int preset = 0; preset < 6; ++preset)
        for (std::size_t s = 0; s < std::size(sounds); ++s) {
            TunerProbe probe(kRate);
            probe.tuner.SetSensibilityPreset(preset);
            int heard = 0;
            for (std::size_t at = 0; at + kLength <= sounds[s].size(); at += 1470) {
                probe.Tune(sounds[s].data() + at);
                heard += probe.tuner.IsTuned();
            }
            EXPECT_EQ(heard, 0) << "sensitivity " << preset << ", sound " << s;
        }
}

TEST_F(TunerTest, SurvivesBadSpectraAndAllocatesNothing) {
    Tuner tuner;
    std::vector<float> transform(kLength);
    tuner.Tune({}, transform, 8192, -1, 8192, kRate, true, false);
    const float odd[] = {0.0f, -1.0f, INFINITY, NAN, std::numeric_limits<float>::max(), 1e-40f};
    for (int method = -1; method < 6; ++method) {
        Tuner::SetDetectionMethod(method);
        for (const float value : odd)
            for (const std::size_t size : {1u, 2u, 3u, 40u, 4096u, 10000u})
                for (const int length : {-1, 0, 1, 2, 7, 8192, 1 << 30}) {
                    std::vector<float> power(size, value);
                    if (size > 20) power[20] = 1e6f;
                    for (const int rate : {0, 1, 44100, 1 << 30})
                        tuner.Tune(power, transform, length, length, length / 2, rate, true, size % 2 == 0);
                    EXPECT_TRUE(std::isfinite(tuner.GetFrequency()) && std::isfinite(tuner.GetErrorCents()));
                }
    }
    for (int method = 0; method < 5; ++method) {
        Tuner::SetDetectionMethod(method);
        Tuner::SetShowDenoisedSpectrum(true);
        TunerProbe probe(kRate);
        const auto sound = TunerSounds::Sound(TunerSounds::Kind::Sawtooth, 110.0, kRate, kLength, 0.0);
        const auto& power = probe.Transform(sound.data());
        probe.Tune(power);
        const auto text = probe.tuner.GetTuningErrorStr();
        const TestSupport::AudioThreadRules rules;
        for (int i = 0; i < 20; ++i) probe.Tune(power);
        EXPECT_EQ(rules.Broken(), "") << method;
    }
}

}  // namespace
