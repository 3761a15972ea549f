#include <gtest/gtest.h>

#include <string>

#include "Apps/Program.h"

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kSanitized = true;
#else
constexpr bool kSanitized = false;
#endif

#if !defined(_WIN32)
#include <sys/resource.h>
#endif

namespace AppTest {
namespace {

class Pipes : public Program {
protected:
    // What arrives of a stream, which must be taken as a whole sound.
    std::vector<double> Piped(const std::string& stream) {
        const auto result = Run("render - out.wav -y", stream);
        EXPECT_EQ(result.status, 0) << result.err;
        return Load("out.wav").samples;
    }
};

// Every kind of file may come through standard input; what goes out is WAV with the same samples.
TEST_F(Pipes, ReadsAnythingFromStandardInput) {
    for (const int format : {SF_FORMAT_WAV | SF_FORMAT_FLOAT, SF_FORMAT_WAVEX | SF_FORMAT_PCM_32,
                             SF_FORMAT_RF64 | SF_FORMAT_PCM_16, SF_FORMAT_FLAC | SF_FORMAT_PCM_16}) {
        SCOPED_TRACE(format);
        Save("in", NoiseSound(3000, 1, format));
        SaveBytes("out", Succeed("render - - --fx Gain", Bytes("in")));
        EXPECT_EQ(Load("out").samples, Load("in").samples);
    }
}

// A WAV whose writer did not know its length: 0, the largest size or half of it stand there.
TEST_F(Pipes, ReadsAStreamToItsEnd) {
    const auto sound = NoiseSound(3000);
    Save("in.wav", sound);
    for (const std::string& size :
         {std::string(4, '\0'), std::string(4, '\xFF'), std::string("\x00\xF0\xFF\x7F", 4)})
        EXPECT_EQ(Piped(Bytes("in.wav").replace(40, 4, size)), sound.samples);
    // A stated size ends the samples; what follows them is not sound.
    EXPECT_EQ(Piped(Bytes("in.wav") + "LIST....and so on"), sound.samples);
}

// A producer that died is no reason to lose what came, but it must not pass unnoticed.
TEST_F(Pipes, WarnsOfAStreamThatEndsEarly) {
    Save("in.wav", NoiseSound(3000));
    const auto result = Run("render - out.wav", Bytes("in.wav").substr(0, 44 + 4 * 2000));
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err, "dsphost: warning: standard input: ended after 2000 of 3000 frames\n");
    EXPECT_EQ(Load("out.wav").Frames(), 2000u);
}

TEST_F(Pipes, RefusesStreamsThatAreNoAudio) {
    Save("in.wav", NoiseSound(100));
    const std::string wav = Bytes("in.wav");
    for (const auto& [stream, words] : {std::pair{std::string(), "empty"},
                                        {wav.substr(0, 44), "no samples"},
                                        {wav.substr(0, 30), "not an audio file"},
                                        {"RIFF....WAVEdata....", "not an audio file"}})
        ExpectRefused(Run("render - out.wav", stream), std::string("standard input|") + words);
}

#if !defined(_WIN32)
TEST_F(Pipes, WritesSizesThatSayUntilTheEnd) {
    Save("in.wav", NoiseSound(3000));
    ASSERT_EQ(Shell("DSPHOST render in.wav - | cat > stream").status, 0);
    EXPECT_EQ(Bytes("stream").substr(40, 4), "\xFF\xFF\xFF\xFF");
    EXPECT_EQ(Piped(Bytes("stream")), Load("in.wav").samples);
    // Standard output that is a file can be completed.
    ASSERT_EQ(Shell("DSPHOST render in.wav - > file.wav").status, 0);
    EXPECT_EQ(Bytes("file.wav"), Bytes("in.wav"));
}

// Ten minutes of stereo at 96 kHz, made up while it is read: memory must not grow with length.
TEST_F(Pipes, StreamsLongFilesInLittleMemory) {
    if (kSanitized) GTEST_SKIP() << "sanitizers need memory of their own";
    Sound head = NoiseSound(0);
    head.rate = 96000;
    Save("head.wav", head);
    SaveBytes("head.wav", Bytes("head.wav").replace(40, 4, "\xFF\xFF\xFF\xFF"));
    const std::size_t bytes = std::size_t{10 * 60} * 96000 * 4;
    const auto result = Shell("{ cat head.wav; head -c " + std::to_string(bytes) +
                              " /dev/zero; } | DSPHOST render - - --fx Gain --fx 'Gain: Pan=1' | wc -c");
    ASSERT_EQ(result.status, 0);
    EXPECT_EQ(std::stoull(result.out), bytes + 44);
    rusage usage{};
    getrusage(RUSAGE_CHILDREN, &usage);
    EXPECT_LT(usage.ru_maxrss, 64 * 1024) << "KiB, the largest of all programs that the tests ran";
}
#endif

}  // namespace
}  // namespace AppTest
