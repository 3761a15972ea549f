#include "DSP/Effects/PitchDoctor/PitchDoctor.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <span>

#include "DSP/Pitch/VoicePitchDetector.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Support/EffectRun.h"
#include "Support/Voice.h"

class BuiltinEditor {};

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

constexpr int kRate = 48000;
constexpr double kA3 = 220.0;

using Settings = std::map<std::string, std::string>;

int IndexOf(CorvoEffectBase& effect, const std::string& label) {
    for (int i = 0; i < effect.GetParamCount(); ++i)
        if (effect.Describe(i).label == label) return i;
    throw std::invalid_argument(label);
}
void Set(CorvoEffectBase& effect, const Settings& settings) {
    for (const auto& [label, text] : settings) {
        const int index = IndexOf(effect, label);
        effect.SetParam(index, effect.GetParamValueNormalizedFromText(index, text), false);
    }
}
// At once, and all of the error.
Settings Exactly(Settings settings) {
    settings.insert(
        {{"Retune speed", "0"}, {"Note transition time", "0"}, {"Tolerance", "0"}, {"Keep vibrato", "0"}});
    return settings;
}

std::vector<double> Correct(const std::vector<double>& mono, const Settings& settings, int rate = kRate) {
    PitchDoctor effect;
    Set(effect, settings);
    return Render(effect, mono, Format<double>(1, rate), {512});
}

// Median pitch of the last half, Hz.
double PitchOf(const std::vector<double>& samples, int rate = kRate) {
    VoicePitchDetector detector({.rate = 1.0 * rate});
    std::vector<double> heard;
    for (std::size_t i = 0; i + 256 <= samples.size(); i += 256) {
        detector.Push(samples.data() + i, 256);
        for (VoicePitchFrame frame; detector.Take(frame);)
            if (frame.hz > 0.0 && i > samples.size() / 2) heard.push_back(frame.hz);
    }
    std::ranges::sort(heard);
    return heard.size() < 10 ? 0.0 : heard[heard.size() / 2];
}

void ExpectDelayed(const std::vector<double>& input, const std::vector<double>& output, int latency,
                   std::size_t from = 0) {
    for (std::size_t i = from; i + static_cast<std::size_t>(latency) < input.size(); ++i)
        ASSERT_NEAR(output[i + static_cast<std::size_t>(latency)], input[i], 1e-12) << "frame " << i;
}

// Of the last half.
double LevelAt(const std::vector<double>& samples, double hz) {
    return std::abs(TransformAt(std::span(samples).last(samples.size() / 2), hz / kRate));
}

}  // namespace

// Catches a wrong scale, root, ratio, unit or sign anywhere between a parameter and the sound.
TEST(PitchDoctor, BringsAVoiceWhereTheSettingsSay) {
    const double sung = kA3 * std::exp2(40.0 / 1200.0);  // A3 and 40 cents
    const Settings offWithA{{"Note A", "Off"}};
    for (const auto& [settings, cents] : std::vector<std::pair<Settings, double>>{
             // above A3
             {{}, 0.0},
             {{{"Correction ratio", "50 %"}}, 20.0},
             {offWithA, 100.0},
             {{{"Scale root", "D#"}, {"Scale mode", "Major pentatonic"}}, 100.0},
             {{{"Scale root", "F"}, {"Scale mode", "Minor pentatonic"}}, 100.0},
             {{{"Transpose", "5"}}, 500.0},
             {{{"Transpose", "-12"}, {"Correction ratio", "0"}}, -1160.0},
             {{{"Offset", "-30"}}, -30.0},
             {{{"Concert pitch", "450"}}, Cents(450.0, 440.0)},
             // Around D the chain of pure fifths goes from F to A#, seven of them above A.
             {{{"Scale root", "D"}, {"Temperament", "Pythagorean"}, {"Note A", "Off"}}, 113.685},
             {{{"Formants kept", "0"}}, 0.0},
             {{{"Lowest pitch", "160"}}, 0.0},
         }) {
        SCOPED_TRACE(settings.empty() ? "" : settings.begin()->first + "=" + settings.begin()->second);
        const double heard = PitchOf(Correct(Sing(1.0, kRate, sung), Exactly(settings)));
        EXPECT_NEAR(Cents(heard, kA3), cents, 0.5);
    }
    for (const int rate : {8000, 44100, 96000, 192000})
        EXPECT_NEAR(Cents(PitchOf(Correct(Sing(1.0, rate, sung), Exactly({}), rate), rate), kA3), 0.0,
                    rate < 20000 ? 3.0 : 0.5)
            << rate;
}

TEST(PitchDoctor, FollowsTheTunerWhenAskedTo) {
    Tuner::SetTemperament(4);
    Tuner::CookNotesFrequencies(true);
    const double cSharp = 2.0 * Tuner::GetNoteFrequency(4);
    const auto heard = PitchOf(Correct(Sing(1.0, kRate, 272.0), Exactly({{"Follow tuner", "On"}})));
    Tuner::SetTemperament(0);
    Tuner::CookNotesFrequencies(true);
    EXPECT_NEAR(Cents(heard, cSharp), 0.0, 0.5);
    EXPECT_GT(std::abs(Cents(cSharp, 440.0 * std::exp2(-8.0 / 12.0))), 5.0) << "tempered as it was";
}

// Formants stay under another pitch, unless they are not kept; harmonics 700 Hz apart tell the difference.
TEST(PitchDoctor, KeepsFormants) {
    const auto voice = Sing(1.0, kRate, 175.0);
    const auto tilt = [&](const Settings& settings) {
        const auto output = Correct(voice, Exactly(settings));
        const double hz = 175.0 * std::exp2(7.0 / 12.0);  // harmonics 3 and 6 at 787 and 1574 Hz
        return 20.0 * std::log10(LevelAt(output, 3 * hz) / LevelAt(output, 6 * hz));
    };
    const Settings up{{"Transpose", "7"}, {"Correction ratio", "0"}};
    auto moved = up;
    moved["Formants kept"] = "0";
    EXPECT_GT(tilt(up), tilt(moved) + 6.0);
}

// Catches windows with gaps, and grains that leave their places: what is not corrected is only delayed.
TEST(PitchDoctor, OnlyDelaysWhatItDoesNotCorrect) {
    const auto silent = [](double t) { return t < 0.3 || (t > 1.2 && t < 1.3); };
    auto voice = Sing(2.0, kRate, [&](double t) { return silent(t) ? 0.0 : 90.0 + 200.0 * t; });
    const auto noise = Noise<double>(voice.size());
    for (std::size_t i = 0; i < voice.size(); ++i) voice[i] += (i / 9000 % 3 == 0 ? 0.1 : 1e-4) * noise[i];
    for (const auto& [lowest, latency] : {std::pair{"55", 1408}, {"75", 1024}, {"110", 704}, {"160", 512}}) {
        PitchDoctor effect;
        Set(effect, {{"Correction ratio", "0"}, {"Lowest pitch", lowest}});
        const auto output = Render(effect, voice, Format<double>(1), {512});
        EXPECT_EQ(effect.GetLatency(), latency);
        ExpectDelayed(voice, output, latency);
        ExpectDelayed(voice, Correct(voice, {{"Mix", "0"}, {"Lowest pitch", lowest}}), latency);
        auto none = Exactly({{"Scale mode", "Whole tone"}, {"Lowest pitch", lowest}});
        for (const char* note : {"C", "D", "E", "F#", "G#", "A#"}) none[std::string("Note ") + note] = "Off";
        ExpectDelayed(voice, Correct(voice, none), latency);
    }
    ExpectDelayed(noise, Correct(noise, Exactly({})), 1024);
}

// A voice that sets in an octave up is misjudged at first. The shift in time that this leaves is taken back.
TEST(PitchDoctor, TakesBackTheShiftOfAMisjudgedOnset) {
    const auto voice = Sing(4.0, kRate, [](double t) {
        return t < 0.1 ? 0.0 : t < 0.16 ? 155.0 : kA3 / 2.0;
    });
    for (const char* tolerance : {"5", "2"}) {
        auto settings = Exactly({});
        settings["Tolerance"] = tolerance;
        ExpectDelayed(voice, Correct(voice, settings), 1024, 3 * kRate);
    }
}

// While the voice holds its note.
TEST(PitchDoctor, FollowsEditsOfTheScale) {
    PitchDoctor effect;
    Set(effect, Exactly({}));
    const auto format = Format<double>(1);
    effect.InitProcessing(kRate, &format);
    const auto second = Sing(1.0, kRate, 222.0);
    const auto heard = [&](const Settings& edit) {
        Set(effect, edit);
        auto block = second;
        ProcessBlock(effect, block.data(), kRate, format);
        return Cents(PitchOf(block), kA3);
    };
    EXPECT_NEAR(heard({}), 0.0, 0.5);
    EXPECT_NEAR(heard({{"Note A", "Off"}}), 100.0, 0.5);
    EXPECT_NEAR(heard({{"Scale root", "D"}, {"Temperament", "Pythagorean"}}), 113.685, 0.5);
}

// What is misheard as a voice stops is no reason to move the next note.
TEST(PitchDoctor, LeavesRepeatedNotesInTuneAlone) {
    for (int phase = 0; phase < 8; ++phase)
        for (const double pause : {0.03, 0.06, 0.07, 0.08}) {
            const double length = 0.42 + phase / (8.0 * kA3);
            PitchDoctor effect;
            BuiltinEditor editor;
            effect.SetEditor(&editor);
            const auto voice =
                Sing(2.2, kRate, [&](double t) { return std::fmod(t, length + pause) < length ? kA3 : 0.0; });
            Render(effect, voice, Format<double>(1), {512});
            std::vector<PitchReading> readings;
            effect.TakeReadings(readings);
            ASSERT_GT(readings.size(), 300u);
            for (const auto& reading : readings)
                ASSERT_LT(std::abs(reading.correctionCents), 5.0f)
                    << reading.position << ", phase " << phase << ", pause " << pause;
        }
}

TEST(PitchDoctor, KeepsTheStereoImage) {
    const auto voice = Sing(0.6, kRate, 228.0);
    std::vector<double> stereo;
    for (const double sample : voice) stereo.insert(stereo.end(), {sample, 0.25 * sample});
    PitchDoctor effect;
    const auto output = Render(effect, stereo, Format<double>(2), {100});
    const auto left = Correct(voice, {});
    for (std::size_t i = 0; i < voice.size(); ++i) {
        ASSERT_NEAR(output[2 * i + 1], 0.25 * output[2 * i], 1e-12);
        ASSERT_NEAR(output[2 * i], left[i], 1e-6);
    }
}

// Places in the stream are counted anew now and then. Catches a part that is left out, by a click or by a
// reading at a wrong place.
TEST(PitchDoctor, CountsPlacesAnew) {
    constexpr int kLowRate = 8000;
    constexpr std::size_t kPiece = 8000, kPieces = 540;  // 4.3 million frames
    PitchDoctor effect;
    BuiltinEditor editor;
    effect.SetEditor(&editor);
    Set(effect, Exactly({}));
    const auto format = Format<double>(1, kLowRate);
    effect.InitProcessing(kPiece, &format);
    const auto second = Sing(1.0, kLowRate, 222.0);  // whole periods
    const auto loudest = [](const std::vector<double>& block) {
        return std::max(std::ranges::max(block), -std::ranges::min(block));
    };
    std::vector<PitchReading> readings;
    double allowed = 1e9;
    for (std::size_t piece = 0; piece < kPieces; ++piece) {
        auto block = second;
        ProcessBlock(effect, block.data(), kPiece, format);
        readings.clear();
        effect.TakeReadings(readings);
        if (piece == 1) allowed = 1.02 * loudest(block);
        ASSERT_LT(loudest(block), allowed);
        ASSERT_NEAR(static_cast<double>(readings.back().position), static_cast<double>((piece + 1) * kPiece),
                    300.0);
        if (piece < 516) continue;
        ASSERT_NEAR(Cents(PitchOf(block, kLowRate), kA3), 0.0, 3.0) << piece;
    }
}

TEST(PitchDoctor, TellsAnEditorWhatItHears) {
    PitchDoctor effect;
    EXPECT_TRUE(effect.IsCantrix());
    std::vector<PitchReading> readings;
    const auto format = Format<double>(1);
    const auto voice = Sing(1.0, kRate, [](double t) { return t < 0.5 ? 225.0 : 300.0; });
    Render(effect, voice, format, {480});
    effect.TakeReadings(readings);
    EXPECT_TRUE(readings.empty()) << "no editor";
    BuiltinEditor editor;
    effect.SetEditor(&editor);
    Set(effect, Exactly({}));
    Render(effect, voice, format, {480});
    effect.TakeReadings(readings);
    ASSERT_GT(readings.size(), 150u);
    const auto& last = readings.back();
    EXPECT_NEAR(last.heardHz, 300.0, 0.1);
    EXPECT_EQ(last.note, 62);
    EXPECT_NEAR(Cents(static_cast<double>(last.noteHz), 440.0), -700.0, 0.01);
    EXPECT_NEAR(static_cast<double>(last.correctionCents), -Cents(300.0, 293.6648), 0.3);
    // Another latency begins no other stream.
    EXPECT_GE(readings.front().position, 0);
    readings.clear();
    Set(effect, {{"Lowest pitch", "160"}});
    auto more = voice;
    ProcessBlock(effect, more.data(), kRate, format);
    effect.TakeReadings(readings);
    const auto begun = readings.front().position;
    EXPECT_GE(begun, kRate);
    EXPECT_LT(begun, kRate + 1500);
}

// A short note and a misheard reading within a long note.
TEST(PitchDoctor, ListsNotesWithoutWhatIsShort) {
    std::vector<PitchReading> readings;
    for (int i = 0; i < 60; ++i) {
        const bool between = i >= 30 && i < 36;
        readings.push_back({100 * i, i == 10 ? 440.0f : 221.0f, 0.0f, between ? 58 : 57, 220.0f});
    }
    const auto notes = NotesOf(readings, 300, 1000);
    ASSERT_EQ(notes.size(), 1u);
    EXPECT_EQ(notes[0].start, 0);
    EXPECT_EQ(notes[0].end, 5900);
    EXPECT_NEAR(static_cast<double>(notes[0].heardCents), Cents(221.0, 220.0), 0.01);
    EXPECT_EQ(NotesOf(readings, 300, 100).size(), 3u);
    EXPECT_TRUE(NotesOf(readings, 300, 48000).empty()) << "shorter than asked for";
}

TEST(PitchDoctor, AnnouncesAnotherLatency) {
    PitchDoctor effect;
    EXPECT_EQ(effect.GetLatency(), 0);
    auto format = Format<float>(2, 96000);
    format.nSamplesPerSec = 0xFFFFFFFF;
    effect.InitProcessing(64, &format);
    EXPECT_EQ(effect.GetLatency(), 16384) << "counts as 768 kHz";
    format.nSamplesPerSec = 96000;
    effect.InitProcessing(64, &format);
    EXPECT_EQ(effect.GetLatency(), 2048);
    const auto lowest = IndexOf(effect, "Lowest pitch");
    effect.SetParam(lowest, 1.0f, true);
    EXPECT_EQ(effect.GetLatency(), 2048) << "not automated";
    EXPECT_FALSE(effect.WantRefreshAllParams());
    effect.SetPreset(6);  // "High voice, low latency"
    EXPECT_TRUE(effect.WantRefreshAllParams());
    EXPECT_EQ(effect.GetLatency(), 960);
    effect.SetWantRefreshAllParams(false);
    effect.SetParam(lowest, effect.GetParam(lowest), false);
    EXPECT_FALSE(effect.WantRefreshAllParams());
}

// Catches a count that is believed: other versions may have fewer settings, or more.
TEST(PitchDoctor, TakesChunksWithOtherCounts) {
    PitchDoctor effect;
    const auto defaults = Chunk(effect);
    Random random(3);
    SetAllParams(effect, random);
    const auto whole = Chunk(effect);
    const auto load = [&](std::size_t count) {
        auto chunk = whole;
        chunk[4] = static_cast<std::uint8_t>(count);
        chunk.resize(8 + 4 * count, 0x55);
        effect.SetSettingsChunk(chunk);
    };
    load(40);
    EXPECT_EQ(Chunk(effect), whole);
    load(5);
    auto expected = defaults;
    std::copy(whole.begin() + 8, whole.begin() + 8 + 4 * 5, expected.begin() + 8);
    EXPECT_EQ(Chunk(effect), expected);
}
