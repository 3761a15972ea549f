#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Apps/Program.h"

namespace AppTest {
namespace {

class CommandLine : public Program {
protected:
    CommandLine() {
        Save("in.wav", NoiseSound(100));
        Save("six.wav", NoiseSound(100, 6));
        Sound slow = NoiseSound(100);
        slow.rate = 999;
        Save("slow.wav", slow);
        Save("float.wav", NoiseSound(100, 2, SF_FORMAT_WAV | SF_FORMAT_FLOAT));
        Save("none.wav", NoiseSound(0));
        SaveBytes("empty.wav", "");
        SaveBytes("text.wav", "this is no audio at all, whatever its name says");
        SaveBytes("taken.wav", "something dear");
    }
};

struct Refusal {
    std::vector<std::string> arguments;
    std::vector<std::string> words;
};

// Bad input: one line that names the culprit and what would do, status 2, and no file left behind.
TEST_F(CommandLine, RefusesBadInput) {
    const auto fx = [](const std::string& text) {
        return std::vector<std::string>{"render", "in.wav", "out.wav", "--fx", text};
    };
    const Refusal cases[] = {
        {{}, {"command", "render"}},
        {{"rendr"}, {"rendr", "render"}},
        {{"render", "in.wav"}, {"OUT"}},
        {{"render", "in.wav", "out.wav", "--bloc", "7"}, {"--bloc"}},
        {{"render", "missing.wav", "out.wav"}, {"missing.wav", "No such file"}},
        {{"render", ".", "out.wav"}, {"directory"}},
        {{"render", "empty.wav", "out.wav"}, {"empty.wav", "empty"}},
        {{"render", "none.wav", "out.wav"}, {"none.wav", "no samples"}},
        {{"render", "text.wav", "out.wav"}, {"text.wav", "not an audio file", "WAV"}},
        {{"render", "six.wav", "out.wav"}, {"six.wav", "6 channels", "mono and stereo"}},
        {{"render", "slow.wav", "out.wav"}, {"slow.wav", "999", "1000 to 768000"}},
        {{"render", "in.wav", "out.mp4"}, {"out.mp4", ".wav", ".flac"}},
        {{"render", "in.wav", "out"}, {"out", ".wav"}},
        {{"render", "in.wav", "nowhere/out.wav"}, {"no directory", "nowhere"}},
        {{"render", "in.wav", "taken.wav"}, {"taken.wav", "-y"}},
        {{"render", "in.wav", "in.wav", "-y"}, {"in.wav", "input"}},
        {{"render", "in.wav", "./in.wav", "-y"}, {"in.wav", "input"}},
        {{"render", "in.wav", "out.wav", "--format", "s20"}, {"s20", "s16, s24, f32, f64"}},
        {{"render", "float.wav", "out.flac"}, {"out.flac", "f32", "s16, s24"}},
        {{"render", "in.wav", "out.ogg", "--format", "s16"}, {"out.ogg", "Vorbis"}},
        {{"render", "in.wav", "out.wav", "--block", "0"}, {"--block", "1 to"}},
        {{"render", "in.wav", "out.wav", "--precision", "16"}, {"--precision", "32, 64"}},
        {{"render", "in.wav", "out.wav", "--tail", "long"}, {"--tail", "long", "auto"}},
        {{"render", "in.wav", "out.wav", "--tail", "-1"}, {"--tail", "-1"}},
        {{"render", "in.wav", "out.wav", "--automation", "missing.json"}, {"missing.json"}},
        {fx("Gian"), {"Gian", "Gain"}},
        {fx(""), {"effect"}},
        {fx("Gain: Gane=1"), {"Gane", "Gain", "Flip phase L"}},
        {fx("Gain: Gain=loud"), {"Gain", "loud", "-Inf. dB to 20.0 dB", "n:"}},
        {fx("Gain: Gain="), {"Gain", "-Inf. dB to 20.0 dB"}},
        {fx("Gain: Gain=3 apples"), {"3 apples", "dB"}},
        {fx("Gain: Gain=1e999"), {"1e999", "dB"}},
        {fx("Gain: Pan=nan"), {"Pan", "nan", "-1.00 to 1.00"}},
        {fx("Gain: Gain=inf"), {"Gain", "inf"}},
        {fx("Gain: Flip phase=perhaps"), {"perhaps", "Off, On"}},
        {fx("Gain: Pan=n:1.01"), {"n:1.01", "0 to 1"}},
        {fx("Gain: Pan=n:nan"), {"n:nan"}},
        {fx("Gain: preset=Loud"), {"preset", "Loud", "there are none"}},
        {fx("Gain: chunk=missing"), {"missing"}},
        {fx("Gain: chunk=empty.wav"), {"empty.wav", "empty"}},
        {fx("Gain: Gain"), {"\"Gain\" is not a setting", "label=value"}},
        {{"render", "in.wav", "out.wav", "--fx", "Gain", "--fx", "Gain", "--save-chunk", "state"},
         {"--save-chunk"}},
        {{"effects", "Gian"}, {"Gian", "Gain"}},
    };
    for (const auto& c : cases) {
        const auto result = Run(c.arguments);
        SCOPED_TRACE(testing::PrintToString(c.arguments));
        ExpectRefused(result, 2, c.words);
        EXPECT_EQ(result.out, "");
    }
    EXPECT_EQ(Bytes("taken.wav"), "something dear");
    EXPECT_EQ(Load("in.wav").samples, NoiseSound(100).samples);
}

TEST_F(CommandLine, OverwritesOnlyWhenAsked) {
    EXPECT_EQ(Run({"render", "in.wav", "taken.wav", "-y"}).status, 0);
    EXPECT_EQ(Load("taken.wav").samples, Load("in.wav").samples);
}

#if !defined(_WIN32)
TEST_F(CommandLine, FollowsALinkAndKeepsIt) {
    std::filesystem::create_symlink("taken.wav", "link.wav");
    std::filesystem::create_symlink("in.wav", "again.wav");
    EXPECT_EQ(Run({"render", "in.wav", "link.wav", "-y"}).status, 0);
    EXPECT_TRUE(std::filesystem::is_symlink("link.wav"));
    EXPECT_EQ(Load("taken.wav").samples, Load("in.wav").samples);
    ExpectRefused(Run({"render", "in.wav", "again.wav", "-y"}), 2, {"again.wav", "input"});
}

// A full disk: nothing stays, and the file that was to be replaced is still there.
TEST_F(CommandLine, ReportsAFullDisk) {
    Save("long.wav", NoiseSound(100000));
    ExpectRefused(Shell("DSPHOST render long.wav /dev/full"), 1, {"/dev/full", "No space left"});
    for (const std::string name : {"out.wav", "out.flac", "out.aiff", "taken.wav"})
        ExpectRefused(Shell("ulimit -f 100; DSPHOST render -y long.wav " + name), 1, {name, "too large"});
    EXPECT_EQ(Bytes("taken.wav"), "something dear");
    EXPECT_EQ(Shell("DSPHOST effects > /dev/full").status, 1);
}

// Ctrl-C while it waits for more input leaves nothing behind either.
TEST_F(CommandLine, LeavesNothingWhenInterrupted) {
    std::string endless = Bytes("in.wav");
    endless.replace(40, 4, "\xFF\xFF\xFF\xFF");
    SaveBytes("endless", endless);
    const auto result = Shell(
        "mkfifo fifo; exec 3<>fifo; cat endless >&3; DSPHOST render fifo out.flac & "
        "while ! ls | grep -q part; do sleep 0.02; done; kill -TERM $!; wait $!; "
        "status=$?; rm fifo; exit $status");
    ExpectRefused(result, 130, {"interrupted"});
}
#endif

}  // namespace
}  // namespace AppTest
