#include "DSP/Resampler/SamplingFrequencyConverter.h"

#include <gtest/gtest.h>

#include <limits>
#include <numeric>

#include "Plain/ButterworthReference.h"
#include "Support/Signals.h"

namespace {

using Converter = SamplingFrequencyConverter;
using Bytes = std::vector<char>;

// Owns its rings.
struct Owned : Converter {
    Owned(int upFactor, int downFactor, int channels) {
        EXPECT_EQ(InitConversionByFactors(upFactor, downFactor), 1);
        Init(channels);
    }
    ~Owned() { FreeRings(); }

    std::vector<double> Convert(std::vector<double> in, int channels = 1) {
        const int frames = static_cast<int>(in.size()) / channels, stride = 8 * channels;
        std::vector<double> out(OutputLimit(frames) * static_cast<std::size_t>(channels));
        const int written = sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
            frames, reinterpret_cast<char*>(in.data()), reinterpret_cast<char*>(out.data()), channels, stride,
            stride, nullptr);
        out.resize(static_cast<std::size_t>(written) * static_cast<std::size_t>(channels));
        return out;
    }
    std::size_t OutputLimit(int frames) const { return static_cast<std::size_t>(frames * up / down + 1); }
};

// Catches a wrong pole, residue or power, a phase table read at the wrong row, and rounding that grows:
// the direct form in double misses this bound by eight orders of magnitude.
TEST(SamplingFrequencyConverterTest, IsTheExactFilterForEveryPairOfFactors) {
    const auto expectExact = [](const std::vector<double>& input, int up, int down) {
        const auto output = Owned(up, down, 1).Convert(input), exact = Plain::Convert(input, up, down);
        ASSERT_EQ(output.size(), exact.size());
        for (std::size_t i = 0; i < exact.size(); ++i)
            ASSERT_NEAR(output[i], exact[i], 1e-12) << up << "/" << down;
    };
    for (int up = 1; up <= 49; ++up)
        for (int down = 1; down <= 49; ++down)
            if (std::gcd(up, down) == 1)
                expectExact(TestSupport::Noise<double>(static_cast<std::size_t>(20 + 600 / up), 1.0), up,
                            down);
    // A constant is the hardest for poles next to 1, and the exact ratios of files go beyond 49.
    for (const auto& [up, down] : {std::pair{1, 49}, {49, 1}, {160, 147}, {147, 1280}, {1, 1000}})
        expectExact(std::vector<double>(static_cast<std::size_t>(500 + 40 * down / up), 1.0), up, down);
}

// Any cuts give the bytes of the whole.
template <typename In, typename Out>
void ExpectTheSameBytes(int up, int down, int channels) {
    constexpr int kFrames = 300;
    const int inStride = channels * In::kBytes, outStride = channels * Out::kBytes;
    // One byte off, so that no sample is aligned.
    Bytes in(static_cast<std::size_t>(kFrames * inStride + 1));
    for (int i = 0; i < kFrames * channels; ++i)
        In::Write(0.3 * std::sin(i * 0.1) + 0.2 * std::sin(i * 1.7), in.data() + 1 + i * In::kBytes);
    const auto convert = [&](const std::vector<int>& cuts) {
        Owned converter(up, down, channels);
        Bytes out(converter.OutputLimit(kFrames) * static_cast<std::size_t>(outStride) + 1);
        int done = 0, written = 0;
        for (std::size_t i = 0; done < kFrames; ++i) {
            const int frames = std::min(cuts[i % cuts.size()], kFrames - done);
            written += converter.sfreq_conversion_core_block<In, Out>(frames, in.data() + 1 + done * inStride,
                                                                      out.data() + 1 + written * outStride,
                                                                      channels, inStride, outStride, nullptr);
            done += frames;
        }
        EXPECT_EQ(written, (kFrames * up + down - 1) / down);
        return out;
    };
    EXPECT_EQ(convert({1, 7, 0, 64, 3}), convert({kFrames}))
        << In::kBytes << " to " << Out::kBytes << " bytes, " << channels << " channels";
}

template <typename... In, typename... Out>
void ExpectTheSameBytes(std::tuple<In...>, std::tuple<Out...>) {
    for (const auto& factors : {std::pair{37, 34}, {2, 1}, {3, 16}})
        for (const int channels : {1, 2, 5})
            ([&]<typename I>(
                 I) { (ExpectTheSameBytes<I, Out>(factors.first, factors.second, channels), ...); }(In{}),
             ...);
}

// Catches state, position or alignment lost at a block's edge, a channel that leaks into its neighbour,
// and a stereo kernel that differs from the mono one.
TEST(SamplingFrequencyConverterTest, GivesTheSameBytesHoweverTheStreamIsCut) {
    ExpectTheSameBytes(
        std::tuple<tipo_16bit, tipo_24bit, tipo_floatbit, tipo_doublebit>{},
        std::tuple<tipo_16bit_outd, tipo_24bit_outd, tipo_floatbit_outd, tipo_doublebit_outd>{});
}

TEST(SamplingFrequencyConverterTest, ChoosesTheFirstOfTheBestFactors) {
    constexpr int kMost = std::numeric_limits<int>::max();
    constexpr int kCases[][4] = {{44100, 44100, 0, 0}, {48000, 96000, 2, 1},   {44100, 48000, 37, 34},
                                 {kMost, 1, 1, 49},    {96000, 44100, 17, 37}, {1, kMost, 0, 0},
                                 {0, 48000, 0, 0},     {48000, -1, 0, 0}};
    for (const auto& [in, out, up, down] : kCases) {
        Converter converter;
        EXPECT_EQ(converter.InitConversion(in, out), up > 0) << in << " " << out;
        EXPECT_TRUE(converter.up == up && converter.down == down) << in << " " << out;
    }
}

TEST(SamplingFrequencyConverterTest, ReadsAndWritesSamplesToTheirLimits) {
    constexpr double kInfinite = std::numeric_limits<double>::infinity();
    for (const auto& [value, as16, as24] : {std::tuple{-1.0, -32768, -8388608},
                                            {kInfinite, 32767, 8388607},
                                            {std::nan(""), 0, 0},
                                            {-1.99 / 32768, -1, -509}}) {
        char sample[3]{};
        tipo_16bit_outd::Write(value, sample);
        EXPECT_EQ(tipo_16bit::Read(sample), as16 / 32768.0) << value;
        tipo_24bit_outd::Write(value, sample);
        EXPECT_EQ(tipo_24bit::Read(sample), as24 / 8388608.0) << value;
    }
}

// A host that goes on with the step after a block must hear the stream continue.
TEST(SamplingFrequencyConverterTest, LeavesTheHistoriesWhereTheDirectFormWouldHaveThem) {
    constexpr int kFactors[][2] = {{1, 1}, {2, 1}, {3, 2}, {12, 1}};
    for (const auto& [up, down] : kFactors) {
        const auto input = TestSupport::Noise<double>(201, 1.0);
        Owned converter(up, down, 1);
        converter.Convert({input.begin(), input.begin() + 190});
        converter.Convert({input.begin() + 190, input.end() - 1});
        Plain::ButterworthCascade<long double> exact(0.455 / std::max(up, down));
        for (std::size_t i = 0; i < input.size(); ++i)
            for (int j = 0; j < up; ++j) {
                const double x = j == 0 ? input[i] : 0.0;
                const auto y = static_cast<double>(exact(x));
                if (i + 1 < input.size()) continue;
                ASSERT_NEAR(
                    converter.sfreq_conv_lowpass(x, converter.inputHistory[0], converter.outputHistory[0]), y,
                    1e-6)
                    << up << "/" << down;
            }
    }
}

TEST(SamplingFrequencyConverterTest, StaysQuietWhereThereIsNothingToDo) {
    Owned converter(2, 1, 2);
    Converter fresh;
    char in[16]{}, out[32]{};
    const auto convert = [&](Converter& c, int frames, int channels) {
        return c.sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
            frames, in, out, channels, 8 * channels, 8 * channels, nullptr);
    };
    EXPECT_EQ(convert(converter, 1, 2), 2);
    for (const auto& [frames, channels] : {std::pair{0, 2}, {-5, 2}, {1, 0}, {1, 3}, {1, 49}})
        EXPECT_EQ(convert(converter, frames, channels), 0) << "Init made rings for two";
    converter.FreeRings();
    EXPECT_EQ(convert(converter, 1, 2) + convert(fresh, 1, 1), 0);
}

// After hours the wrap counts must not have overflowed; taking off the common part does it.
TEST(SamplingFrequencyConverterTest, KeepsItsPositionsSmall) {
    Owned converter(3, 7, 1);
    const auto block = TestSupport::Noise<double>(4099);
    for (int i = 0; i < 5; ++i) converter.Convert(block);
    EXPECT_EQ(std::min(converter.writeWraps, converter.readWraps), 0);
    EXPECT_LE(std::max(converter.writeWraps, converter.readWraps), 1);
    EXPECT_EQ(converter.writePosition, 3 * 4099 * 5 % converter.ringLength);
    EXPECT_DOUBLE_EQ(converter.rings[0][converter.writePosition - 1],
                     converter.up * converter.outputHistory[0][Converter::kOrder]);
}

}  // namespace
