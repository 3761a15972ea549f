#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <utility>

#include "Apps/Program.h"
#include "WavHeader.h"

namespace AppTest {
namespace {

class CommandLine : public Program {
protected:
    CommandLine() {
        Save("in.wav", NoiseSound(100));
        Save("float.wav", NoiseSound(100, 2, SF_FORMAT_WAV | SF_FORMAT_FLOAT));
        Save("six.wav", NoiseSound(100, 6));
        Save("wide.wav", NoiseSound(10, 49));
        Save("nine.wav", NoiseSound(10, 9));
        Save("none.wav", NoiseSound(0));
        Save("second.wav", NoiseSound(48000, 1));
        Save("cd.wav", {2, 44100, kPcm16, NoiseSound(100).samples});
        const auto huge = dsphost::MakeWavHeader({2, 48000, SF_FORMAT_PCM_16, true, true}, 1ll << 33);
        SaveBytes("huge.rf64", std::string(huge.begin(), huge.end()) + "1234");
        SaveBytes("empty.wav", "");
        SaveBytes("face.ttf", "true");
        std::filesystem::create_directory("folder");
        SaveBytes("taken.wav", "something dear");
        SaveBytes("low.chunk", std::string(18, '\0') + "\x80\xBF");  // a word of -1
        SaveBytes("moves.json", R"([{"parameter": "Pan", "points": [[0, 0.5]]}])");
    }
};

struct Refusal {
    std::string arguments, words;
};
// clang-format off
const Refusal kLines[] = {
    {"", "command|render"},
    {"rendr", "rendr|render"},
    {std::string(3000, 'x'), "xxx...xxx|render"},
    {"render missing.wav o.wav", "missing.wav|No such file"},
    {"render \"\" o.wav", "name of a file is empty"},
    {"render folder o.wav", "folder|is a directory"},
    {"render empty.wav o.wav", "empty.wav|empty"},
    {"render none.wav o.wav", "none.wav|no samples"},
    {"render six.wav o.wav", "six.wav|6 channels|mono and stereo"},
    {"render in.wav o.mp4", "o.mp4|.wav|.flac"},
    {"render huge.rf64 o.aiff", "o.aiff|AIFF|.w64"},
    {"convert nine.wav o.flac --rate 96000", "9 channels|8 channels"},
    {"convert in.wav o.flac --rate 100001 --exact", "100001 Hz|steps of 10"},
    {"convert in.wav o.ogg --rate 655350 --exact", "655350 Hz|200000 Hz"},
    {"render in.wav nowhere/o.wav", "no directory|nowhere"},
    {"render in.wav taken.wav", "taken.wav|-y"},
    {"render in.wav ./in.wav -y", "in.wav|input"},
    {"render in.wav o.wav --format s20", "s20|s16, s24, f32, f64"},
    {"render float.wav o.flac", "o.flac|f32|s16, s24"},
    {"render in.wav o.wav --tail long", "--tail|long|auto"},
    {"render in.wav o.wav --fx Gain --automation moves.json", "moves.json|Gain plays no automation"},
    {"render in.wav o.wav --spool-limit 1X", "--spool-limit|1X|500M"},
    {"render in.wav o.wav --fx Gain --save-chunk ./o.wav", "./o.wav and o.wav are one file"},
    {"render in.wav - --fx Gain --save-chunk -", "standard output"},
    {"render in.wav o.wav -y --fx \"Gain: chunk=gain.chunk\" --save-chunk ./gain.chunk", "gain.chunk|input"},
    {"convert cd.wav o.wav --rate 1e5", "--rate|1e5|whole number"},
    {"convert cd.wav o.wav --rate 0", "--rate cannot be 0|1000 to 768000"},
    {"convert cd.wav o.wav --rate 1001 --format s16", "cents|--exact"},
    {"convert float.wav o.wav --rate 96000 --dither tpdf", "s16 and s24"},
    {"convert wide.wav o.wav --rate 48000", "49 channels|48"},
    {"pitch in.wav o.wav --semitones 37", "--semitones|36"},
    {"pitch in.wav o.wav --semitones 1 --engine classic --speed 2", "--speed|new"},
    {"eq-curve o.csv --fx Gain", "Gain|EQ:"},
    {"tuner in.wav o.jpg", "o.jpg|.png"},
    {"spectrum in.wav o.png --size 0x10", "--size|0x10"},
    {"tuner in.wav o.png --view wavy", "wavy|view"},
    {"tuner in.wav o.png --at 1e308", "--at cannot be 1e+308; the file ends"},
    {"tuner in.wav o.png --font in.wav", "--font|in.wav"},
    {"tuner in.wav o.png --font " + std::string(5000, 'x'), "--font|no file"},
    {"tuner in.wav face.ttf -y --font face.ttf", "face.ttf|input"},
    {"denoise in.wav o.wav --learn 1", "--learn|accepted: FROM:TO"},
    {"denoise in.wav o.wav --learn 2:1", "2:1|accepted"},
    {"denoise second.wav o.wav --learn 0.5:2", "0.5:2|second.wav|1.00 s"},
    {"denoise second.wav o.wav --learn 0.5:0.502", "0.5:0.502|too short"},
    {"denoise - o.wav --learn 0:1", "--learn|standard input"},
    {"denoise in.wav o.wav --profile taken.wav", "taken.wav|no noise profile"},
    {"denoise in.wav o.wav --save-profile p", "--save-profile|--learn"},
    {"denoise in.wav o.wav --set Reduktion=3", "Reduktion|did you mean|Reduction"},
    {"denoise in.wav o.wav --residue in.wav -y", "in.wav|input"},
    {"denoise second.wav o.wav --learn 0:1e300", "0:1e300|1.00 s"},
    {"denoise in.wav o.wav --set chunk=taken.wav", "chunk=taken.wav|--learn|--profile"},
    {"denoise in.wav o.wav --set Learn=On", "Learn=On|--learn"},
    {"denoise in.wav o.wav --set \"Mix=50 %, Clear profile=On\"", "Clear profile=On|--profile"},
    // An output that is there is refused before anything is learned.
    {"denoise in.wav o.wav --residue taken.wav --learn 3:5", "taken.wav|-y"},
    {"tune-voice second.wav o.wav --scale \"A nonsense\"", "nonsense|scale mode"},
    {"tune-voice second.wav o.wav --scale Hm", "Hm|root and a mode"},
    {"tune-voice second.wav o.wav --retune fast", "Retune speed|fast|400"},
    {"tune-voice second.wav o.wav --lowest 80", "Lowest pitch|55, 75, 110, 160"},
    {"tune-voice second.wav o.wav --notes n.txt", "n.txt|.csv|.mid"},
    {"tune-voice second.wav o.wav --notes o.wav.csv --curve o.wav.csv", "o.wav.csv"},
};
const Refusal kEffects[] = {
    {"Gian", "Gian|Gain"},
    {"", "effect"},
    {"Gain: Gane=1", "Gane|Gain|Flip phase L"},
    {"Gain: Gain=loud", "Gain|loud|-Inf. dB to 20.0 dB|n:"},
    {"Gain: Pan=nan", "Pan|nan|-1.00 to 1.00"},
    {"Gain: chunk=taken.wav", "taken.wav|14 bytes|20"},
    {"Gain: chunk=low.chunk", "low.chunk|Gain is out of range"},
    {"Gain: Gain", "Gain|is not a setting|label=value"},
    {"Echo: Depth=5 apples", "5 apples|4999 ms"},
    {"Valvex: Oversampling=5", "5|1, 2, 4, 8"},
    {"EQ", "no bands|2500 peak"},
    {"EQ: 100 low", "low|lowshelf"},
    {"EQ: 100 peak 3.05", "3.05|steps of 0.1"},
    {"EQ: 1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;"
     "1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak;1 peak", "more than 20"},
};
// Moves for a chain of tremolo, echo, tremolo.
const Refusal kMoves[] = {
    {"[", "is not JSON"},
    {std::string(100000, '['), "too deeply"},
    {"[1e999]", "too large"},
    {std::string((16 << 20) + 1, ' '), "larger than 16 MiB"},
    {R"([{"effect": "Echo", "parameter": "Depth", "points": [")" + std::string(100000, 'x') + "\"]}]", "xxx..."},
    {"[7]", "lane 1: a lane is"},
    {R"([{"effect": "Echo", "parameter": "Depth", "points": [[0]]}])", "a point is"},
    {R"([{"effect": "Echo", "parameter": "Depth", "points": [[1e300, 0]]}])", "time"},
    {R"([{"effect": "Tremolo", "parameter": "Depth", "points": [[0, 1]]}])", "more than once"},
    {R"([{"effect": 4, "parameter": "Depth", "points": [[0, 1]]}])", "1 to 3"},
    {R"([{"parameter": "Depth", "points": [[0, 1]]}])", "\"effect\" is missing"},
    {R"([{"effect": 1, "parameter": "Wetness", "points": [[0, 1]]}])", "Wetness"},
    {R"([{"effect": 1, "parameter": "Depth R", "points": [[0, 1]]},
         {"effect": 1, "parameter": "Depth", "points": [[0, 1]]}])", "lane 2: the same parameter"},
};
// clang-format on

// Bad input: one line that names the culprit and what would do, status 2, and no file left behind.
TEST_F(CommandLine, RefusesBadInput) {
    const auto refuse = [&](const std::string& arguments, const std::string& words) {
        SCOPED_TRACE(arguments);
        const auto result = Run(arguments);
        ExpectRefused(result, words);
        EXPECT_LT(result.err.size(), 420u);
        EXPECT_EQ(result.out, "");
    };
    Succeed("render in.wav o.wav --fx Gain --save-chunk gain.chunk");
    std::filesystem::remove("o.wav");
    for (const auto& c : kLines) refuse(c.arguments, c.words);
    for (const auto& c : kEffects) refuse("render in.wav o.wav --fx \"" + c.arguments + "\"", c.words);
    for (const auto& c : kMoves) {
        SCOPED_TRACE(c.arguments.substr(0, 200));
        SaveBytes("moves.json", c.arguments);
        refuse("render in.wav o.wav --fx Tremolo --fx Echo --fx Tremolo --automation moves.json",
               "moves.json: |" + c.words);
    }
    EXPECT_EQ(Bytes("taken.wav"), "something dear");
    EXPECT_EQ(Load("in.wav").samples, NoiseSound(100).samples);
    Succeed("render in.wav taken.wav -y");
    EXPECT_EQ(Load("taken.wav").samples, NoiseSound(100).samples);
}

#if !defined(_WIN32)
// A full disk, met by any of the writes: nothing stays, and the file that was to be replaced is still there.
TEST_F(CommandLine, ReportsAFullDisk) {
    for (const std::size_t thousands : {1u, 10u, 100u}) {
        Save("long.wav", NoiseSound(1000 * thousands));
        Save("long.flac", NoiseSound(1000 * thousands, 2, SF_FORMAT_FLAC | SF_FORMAT_PCM_16));
        for (const std::string name : {"/dev/full", "- > /dev/full"})
            ExpectRefused(Shell("DSPHOST render long.wav " + name), "No space left", 1);
        const std::string limit = "ulimit -f " + std::to_string(thousands) + "; ";
        for (const std::string name : {"out.wav", "out.flac", "out.aiff", "taken.wav"})
            ExpectRefused(Shell(limit + "DSPHOST render -y long.wav " + name), name + "|too large", 1);
        ExpectRefused(Shell(limit + "cat long.flac | DSPHOST render - o.wav"), "temporary file|too large", 1);
    }
    EXPECT_EQ(Bytes("taken.wav"), "something dear");
    for (const std::string arguments : {"effects", "--help", "render --help", "tuner in.wav o.png --json"})
        ExpectRefused(Shell("DSPHOST " + arguments + " > /dev/full"), "standard output|No space left", 1);
}

// No file comes to stand where a stream was closed.
TEST_F(CommandLine, KeepsClosedStreamsApart) {
    for (const auto& [line, words] : {std::pair{"DSPHOST render in.wav - >&-", "standard output|Bad file"},
                                      {"DSPHOST render in.wav - --fx Gain --save-chunk c <&- >&-", "output"},
                                      {"DSPHOST render - o.wav <&-", "standard input|Bad file"}})
        ExpectRefused(Shell(line), words, 1);
    Save("loud.wav", {1, 48000, kDouble, {0.5, HUGE_VAL}});  // warned of while the output is open
    ASSERT_EQ(Shell("DSPHOST render loud.wav told.wav; cat loud.wav | DSPHOST render - o.wav 2>&-").status,
              0);
    EXPECT_EQ(Bytes("o.wav"), Bytes("told.wav"));
}

// Whatever ends the program and whatever it waits for, nothing is left, in its folder or among the temporary
// files: samples of a stream, the rest of its header, what does not stream.
TEST_F(CommandLine, LeavesNothingWhenInterrupted) {
    SaveBytes("samples", Bytes("in.wav").replace(40, 4, "\xFF\xFF\xFF\xFF"));
    SaveBytes("header", "RIFF....WAVE");
    SaveBytes("flac", "fLaC" + std::string(50000, '.'));
    Save("long.wav", NoiseSound(100000));  // in several blocks
    const struct {
        std::string start, input, signal;
    } cases[] = {
        {"samples", "fifo", "HUP"},
        {"samples", "fifo", "XCPU"},
        {"header", "fifo", "INT"},
        {"flac", "fifo", "TERM"},
        {"samples", "--fx Reverb --tail 3600 long.wav", "QUIT"},
        {"samples", "--fx Reverb --tail 3600 long.wav", "TERM"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input + " " + c.signal);
        // What runs in the background would ignore an interrupt. It is ready when it catches them.
        const auto result =
            Shell("mkdir tmp; mkfifo fifo; exec 3<>fifo; cat " + c.start +
                  " >&3; TMPDIR=tmp env --default-signal=INT,QUIT DSPHOST render " + c.input +
                  " out.flac & "
                  "while kill -0 $! && ! grep -q 'SigCgt:.*4..7$' /proc/$!/status; do sleep 0.02; done; "
                  "sleep 0.1; kill -" +
                  c.signal + " $!; wait $!; status=$?; rm fifo; rmdir tmp; exit $status");
        ExpectRefused(result, "interrupted", 130);
    }
}
#endif

}  // namespace
}  // namespace AppTest
