#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "Apps/Program.h"
#include "AudioReader.h"
#include "Support/Sanitizers.h"
#include "WavHeader.h"

using namespace std::string_literals;

constexpr bool kSanitized = WITH_ADDRESS_SANITIZER || WITH_THREAD_SANITIZER;

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

// Every kind of file may come, through standard input too, and a WAV whose writer did not know its length
// or died, where 0, the largest size or half of it stand. A stated size ends the samples; what follows them
// is not sound.
TEST_F(Pipes, ReadsAnythingFromStandardInput) {
    const struct {
        int format;
        std::string size, behind;
    } cases[] = {
        {SF_FORMAT_WAV | SF_FORMAT_FLOAT, "", ""},
        {SF_FORMAT_WAVEX | SF_FORMAT_PCM_32, "", ""},
        {SF_FORMAT_RF64 | SF_FORMAT_PCM_16, "", "LIST....and so on"},
        {SF_FORMAT_FLAC | SF_FORMAT_PCM_16, "", ""},
        {kPcm16, "\xFF\xFF\xFF\xFF", ""},
        {kPcm16, "", "LIST....and so on"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.format << " " << testing::PrintToString(c.size));
        const auto sound = NoiseSound(3000, 1, c.format);
        Save("in", sound);
        SaveBytes("in", Bytes("in").replace(40, c.size.size(), c.size) + c.behind);
        EXPECT_EQ(Piped(Bytes("in")), sound.samples);
        Succeed("render in out.wav -y");
        EXPECT_EQ(Load("out.wav").samples, sound.samples);
    }
}

#if !defined(_WIN32)
// A size that may be meant: samples of 2 GiB less 4 KiB, and then a chunk. The samples take no room on the
// disk.
TEST_F(Pipes, EndsAtAChunkBehindADoubtfulSize) {
    if (kSanitized) GTEST_SKIP() << "takes long there";
    constexpr std::int64_t kSize = 0x7FFFF000, kFrameBytes = 64;
    const auto head = dsphost::MakeWavHeader({8, 48000, SF_FORMAT_DOUBLE}, kSize);
    dsphost::File file("sparse.wav", dsphost::File::Mode::New, "sparse.wav");
    file.Write(head.data(), head.size());
    file.Seek(kSize, SEEK_CUR);
    const std::string rest = "LIST" + std::string(kFrameBytes, '.');
    file.Write(rest.data(), rest.size());
    file.Seek(0);
    dsphost::AudioReader reader(std::move(file), true);
    std::vector<double> block(8 * 4096);
    std::int64_t frames = 0;
    for (int got = 4096; got == 4096; frames += got) got = reader.Read(block.data(), 4096);
    EXPECT_EQ(frames, kSize / kFrameBytes);
}
#endif

// A producer that died is no reason to lose what came, but it must not pass unnoticed.
TEST_F(Pipes, WarnsOfInputThatEndsEarly) {
    constexpr std::size_t kFrames = 100000, kCut = 400000;  // the second half
    const struct {
        int kind;
        std::string warning;
    } cases[] = {
        {SF_FORMAT_WAV, "ended after 100000 of 200000 frames\n"},
        {SF_FORMAT_RF64, "ended after 100000 of 200000 frames\n"},
        {SF_FORMAT_CAF, "ended after 100000 of 200000 frames\n"},
        {SF_FORMAT_AIFF, "was cut off, after 100000 frames\n"},
        {SF_FORMAT_AU, "was cut off, after 100000 frames\n"},
        {SF_FORMAT_W64, "was cut off, after 100000 frames\n"},
        {SF_FORMAT_FLAC, "ended after "},
        {SF_FORMAT_OGG, "was cut off, after "},
    };
    for (const auto& c : cases) {
        const bool vorbis = c.kind == SF_FORMAT_OGG;
        Save("in", NoiseSound(2 * kFrames, 2, c.kind | (vorbis ? SF_FORMAT_VORBIS : SF_FORMAT_PCM_16)));
        Succeed("render in out.wav -y");
        std::string bytes = Bytes("in");
        bytes.resize(vorbis ? bytes.size() / 2 : bytes.size() - kCut);
        SaveBytes("cut", bytes);
        for (const auto& [input, name] : {std::pair{"cut", "cut"}, {"-", "standard input"}}) {
            const auto result = Run("render -y " + std::string(input) + " out.wav", bytes);
            EXPECT_EQ(result.status, 0);
            EXPECT_EQ(result.err.find("dsphost: warning: " + (name + (": " + c.warning))), 0u) << result.err;
            EXPECT_LT(result.err.size(), 80u) << result.err;
        }
    }
}

// Neither is cut off: a stream whose length was never known, and a length that nobody can mean.
TEST_F(Pipes, DoesWithoutALength) {
    Save("in.flac", NoiseSound(200000, 1, SF_FORMAT_FLAC | SF_FORMAT_PCM_16));
    std::string flac = Bytes("in.flac");
    flac[21] = static_cast<char>(flac[21] & 0xF0);
    Succeed("render - out.wav", flac.replace(22, 4, 4, '\0'));
    EXPECT_EQ(Load("out.wav").samples, Load("in.flac").samples);
    const auto lie = dsphost::MakeWavHeader({1, 48000, SF_FORMAT_PCM_16, true, true}, std::int64_t{1} << 61);
    Succeed("convert - out.wav -y --rate 44100 --exact", std::string(lie.begin(), lie.end()) + "1234");
    // Damaged it must not be.
    ExpectRefused(Run("render - o.wav", flac.replace(flac.size() / 2, 4000, 4000, '\xFF')),
                  "is damaged after");
}

// Only the sizes that programs write when they do not know it stand for "unknown"; others are meant, 2 GiB
// and more too, and missed.
TEST_F(Pipes, KnowTheirSizeOrNot) {
    Save("in.wav", NoiseSound(3000, 1, SF_FORMAT_WAV | SF_FORMAT_PCM_24));
    const struct {
        std::string size;
        bool meant;
    } cases[] = {
        {"\0\0\0\0"s, false},         // never filled in
        {"\xFF\xFF\xFF\xFF", false},  // the largest
        {"\0\xF0\xFF\x7F"s, false},   // half of it, in whole pages
        {"\xFF\xEF\xFF\x7F", false},  // that in frames of 3 bytes
        {"\xFE\xEF\xFF\x7F", true},   // a byte less
        {"\0\xF1\xFF\x7F"s, true},    // a little more
        {"\0\0\0\xC0"s, true},        // 3 GiB
    };
    for (const auto& c : cases) {
        const auto result = Run("render - out.wav -y", Bytes("in.wav").replace(40, 4, c.size));
        EXPECT_EQ(result.err.find("ended after 3000 of") != std::string::npos, c.meant) << result.err;
        EXPECT_EQ(Load("out.wav").samples, Load("in.wav").samples);
    }
    EXPECT_TRUE(dsphost::StartsChunk("Junk.", 6));
    EXPECT_TRUE(dsphost::StartsChunk("\0LIST"s, 7));
    EXPECT_FALSE(dsphost::StartsChunk("\0\0\0\0\0"s, 6));
}

TEST_F(Pipes, RefusesStreamsThatAreNoAudio) {
    Save("in.wav", NoiseSound(100));
    std::string wav = Bytes("in.wav");
    for (const auto& [stream, words] : {std::pair{std::string(), "empty"},
                                        {wav.substr(0, 44), "no samples"},
                                        {wav.substr(0, 30), "not an audio file"},
                                        {"RIFF....WAVEdata....", "not an audio file"},
                                        {wav.replace(24, 4, "\0\0\0\0"s), "sample rate of 0 Hz"}})
        ExpectRefused(Run("render - out.wav", stream), std::string("standard input|") + words);
}

#if !defined(_WIN32)
// Endless input ends soon, and its temporary file before the disk is full.
TEST_F(Pipes, BoundsWhatItKeepsOfAStream) {
    Save("in.flac", NoiseSound(100000, 1, SF_FORMAT_FLAC | SF_FORMAT_PCM_16));
    for (const auto& [line, words] :
         {std::pair{"DSPHOST render /dev/zero out.wav", "/dev/zero|not an audio file"},
          {"{ printf 'RIFF....WAVE'; yes LIST | tr '\\n' '\\0'; } | DSPHOST render - out.wav", "first MiB"},
          {"{ printf fLaC; cat /dev/zero; } | DSPHOST render - out.wav", "not an audio file"},
          {"DSPHOST render /proc/version out.wav", "/proc/version|not an audio file"},
          {"DSPHOST denoise /dev/zero out.wav --learn 0:1", "--learn|/dev/zero"},
          {"DSPHOST render - out.wav --spool-limit 64K < in.flac", "65536 bytes|--spool-limit"}})
        ExpectRefused(Shell(line), words);
    EXPECT_EQ(Shell("DSPHOST render - out.wav --spool-limit 1M < in.flac").status, 0);
}

TEST_F(Pipes, WritesSizesThatSayUntilTheEnd) {
    Save("in.wav", NoiseSound(3000));
    ASSERT_EQ(Shell("DSPHOST render in.wav - | cat > stream").status, 0);
    EXPECT_EQ(Bytes("stream").substr(40, 4), "\xFF\xFF\xFF\xFF");
    EXPECT_EQ(Piped(Bytes("stream")), Load("in.wav").samples);
    // Standard output that is a file can be completed.
    ASSERT_EQ(Shell("DSPHOST render in.wav - > file.wav").status, 0);
    EXPECT_EQ(Bytes("file.wav"), Bytes("in.wav"));
    // Unless all goes to its end.
    ASSERT_EQ(Shell("DSPHOST render in.wav - >> log.wav").status, 0);
    EXPECT_EQ(Bytes("log.wav"), Bytes("stream"));
}

// Ten minutes of stereo at 96 kHz, made up while it is read: memory must not grow with length.
TEST_F(Pipes, StreamsLongFilesInLittleMemory) {
    if (kSanitized) GTEST_SKIP() << "sanitizers need memory of their own";
    Sound head = NoiseSound(0);
    head.rate = 96000;
    Save("head.wav", head);
    SaveBytes("head.wav", Bytes("head.wav").replace(40, 4, "\xFF\xFF\xFF\xFF"));
    const std::size_t bytes = std::size_t{10 * 60} * 96000 * 4;
    const auto result = Shell(
        "{ cat head.wav; head -c " + std::to_string(bytes) +
        " /dev/zero; } | { ulimit -v 131072; DSPHOST render - - --fx Gain --fx 'Gain: Pan=1'; } | wc -c");
    ASSERT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(std::stoull(result.out), bytes + 44) << result.err;
}
#endif

}  // namespace
}  // namespace AppTest
