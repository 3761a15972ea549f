#include <gtest/gtest.h>

#include <algorithm>

#include "Apps/Program.h"
#include "Support/Voice.h"

// tune-voice: a voice, its notes and its curve.
namespace AppTest {
namespace {

constexpr int kRate = 44100;

class TuneVoice : public Program {
protected:
    // A3 and D4, 30 cents sharp, a pause between them.
    TuneVoice() {
        const auto hz = [](double t) { return t < 0.8 ? 220.0 : t < 0.9 ? 0.0 : 293.665; };
        Save("in.wav",
             {1, kRate, kDouble, TestSupport::Sing(1.7, kRate, [&](double t) { return 1.0175 * hz(t); })});
    }
};

}  // namespace

TEST_F(TuneVoice, WritesTheVoiceItsNotesAndItsCurve) {
    Succeed(
        "tune-voice in.wav out.wav --scale 'a minor' --retune '0 ms' --transition 0 --notes n.csv "
        "--curve c.png --size 400x200 -q");
    EXPECT_EQ(Load("out.wav").Frames(), Load("in.wav").Frames());
    EXPECT_TRUE(Bytes("c.png").starts_with("\x89PNG"));
    const std::string heading = "start_s,end_s,midi_note,name,sung_cents";
    const auto sung = Rows(Bytes("n.csv"), heading);
    ASSERT_EQ(sung.size(), 2u);
    for (std::size_t i = 0; i < 2; ++i) {
        EXPECT_EQ(sung[i][2] + sung[i][3], i == 0 ? "57A3" : "62D4");
        EXPECT_NEAR(std::stod(sung[i][0]), i == 0 ? 0.0 : 0.9, 0.04);
        EXPECT_NEAR(std::stod(sung[i][1]), i == 0 ? 0.8 : 1.7, 0.04);
        EXPECT_LE(std::stod(sung[i][1]), 1.7);
        EXPECT_NEAR(std::stod(sung[i][4]), 30.0, 1.0);
    }
    const auto minor = Bytes("out.wav");
    Succeed("tune-voice in.wav short.wav --scale Am --retune '0 ms' --transition 0 -q");
    EXPECT_EQ(Bytes("short.wav"), minor);
    Succeed("tune-voice in.wav major.wav --scale 'A major' -q");
    Succeed("tune-voice in.wav lone.wav --scale A -q");
    EXPECT_EQ(Bytes("lone.wav"), Bytes("major.wav"));
    // The corrected voice stands on its notes.
    Succeed("tune-voice out.wav again.wav --notes again.csv -q");
    const auto again = Rows(Bytes("again.csv"), heading);
    for (const auto& note : again) EXPECT_LT(std::abs(std::stod(note[4])), 3.0) << note[3];
    EXPECT_EQ(std::ranges::count(again, "A3", [](const auto& note) { return note[3]; }), 1);
}

// Ticks of 1/1920 s: on and off for both notes, between the tempo and the end of the track.
TEST_F(TuneVoice, WritesNotesAsMidi) {
    Succeed("tune-voice in.wav out.wav --notes n.mid -q");
    const std::string midi = Bytes("n.mid");
    ASSERT_TRUE(midi.starts_with(std::string("MThd\0\0\0\6\0\0\0\1\3\xC0MTrk", 18)));
    const auto length = static_cast<std::size_t>(static_cast<unsigned char>(midi[20])) << 8 |
                        static_cast<unsigned char>(midi[21]);
    ASSERT_EQ(midi.size(), 22 + length);
    std::vector<std::string> events;
    double ticks = 0.0;
    for (std::size_t at = 22 + 7; at < midi.size();) {
        unsigned delta = 0, byte = 0x80;
        for (; (byte & 0x80) != 0; ++at)
            delta = delta << 7 | ((byte = static_cast<unsigned char>(midi[at])) & 0x7F);
        ticks += delta;
        if (midi[at] == '\xFF') break;
        events.push_back(midi.substr(at, 2));
        at += 3;
    }
    EXPECT_EQ(events, (std::vector<std::string>{"\x90\x39", "\x80\x39", "\x90\x3E", "\x80\x3E"}));
    EXPECT_NEAR(ticks / 1920.0, 1.7, 0.04);
    EXPECT_TRUE(midi.ends_with(std::string("\0\xFF\x2F\0", 4)));
}

}  // namespace AppTest
