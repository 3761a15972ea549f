#include "DSP/Resampler/SamplingFrequencyConverter.h"

#include <gtest/gtest.h>

#include <complex>
#include <cstdio>
#include <limits>
#include <numeric>
#include <string>

#include "Plain/ButterworthReference.h"
#include "Support/Signals.h"

namespace {

using Converter = SamplingFrequencyConverter;
using Bytes = std::vector<char>;
using Core = int (Converter::*)(int, char*, char*, int, int, int, CDither<double>*);

struct FormatPair {
    Core core;
    void (*write)(double value, char* sample);  // in the format of the input
    int inBytes, outBytes;
};

template <typename... In, typename... Out>
std::vector<FormatPair> Pairs(std::tuple<In...>, std::tuple<Out...>) {
    std::vector<FormatPair> pairs;
    const auto withIn = [&]<typename I>(I) {
        (pairs.push_back(
             {&Converter::sfreq_conversion_core_block<I, Out>, &I::Write, I::kBytes, Out::kBytes}),
         ...);
    };
    (withIn(In{}), ...);
    return pairs;
}

const auto kAllPairs =
    Pairs(std::tuple<tipo_16bit, tipo_24bit, tipo_floatbit, tipo_doublebit>{},
          std::tuple<tipo_16bit_outd, tipo_24bit_outd, tipo_floatbit_outd, tipo_doublebit_outd>{});

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

void ExpectExact(const std::vector<double>& input, int up, int down, double& worst) {
    const auto output = Owned(up, down, 1).Convert(input), exact = Plain::Convert(input, up, down);
    ASSERT_EQ(output.size(), exact.size());
    for (std::size_t i = 0; i < exact.size(); ++i) worst = std::max(worst, std::abs(output[i] - exact[i]));
    ASSERT_LT(worst, 1e-12) << up << "/" << down;
}

// Catches a wrong pole, residue or power, a phase table read at the wrong row, and rounding that grows:
// the direct form in double misses this bound by eight orders of magnitude.
TEST(SamplingFrequencyConverterTest, IsTheExactFilterForEveryPairOfFactors) {
    double worst = 0.0;
    for (int up = 1; up <= 49; ++up)
        for (int down = 1; down <= 49; ++down) {
            if (std::gcd(up, down) > 1 && up != down) continue;
            const auto frames = static_cast<std::size_t>(20 + 600 / up);
            ASSERT_NO_FATAL_FAILURE(ExpectExact(TestSupport::Noise<double>(frames, 1.0), up, down, worst));
        }
    // A constant is the hardest for poles next to 1, and the exact ratios of files go beyond 49.
    constexpr int kFactors[][2] = {{1, 49}, {49, 1}, {160, 147}, {147, 1280}, {1, 1000}};
    for (const auto& [up, down] : kFactors)
        ASSERT_NO_FATAL_FAILURE(ExpectExact(
            std::vector<double>(static_cast<std::size_t>(500 + 40 * down / up), 1.0), up, down, worst));
    std::printf("largest difference from the exact filter: %.2g\n", worst);
}

// Catches state, position or alignment lost at a block's edge, a channel that leaks into its neighbour,
// and a stereo kernel that differs from the mono one.
TEST(SamplingFrequencyConverterTest, GivesTheSameBytesHoweverTheStreamIsCut) {
    constexpr int kFrames = 300;
    constexpr int kFactors[][2] = {{37, 34}, {2, 1}, {3, 16}};
    for (std::size_t p = 0; p < kAllPairs.size(); ++p)
        for (const auto& [up, down] : kFactors)
            for (const int channels : {1, 2, 5}) {
                const auto& pair = kAllPairs[p];
                const int inStride = channels * pair.inBytes, outStride = channels * pair.outBytes;
                // One byte off, so that no sample is aligned.
                Bytes in(static_cast<std::size_t>(kFrames * inStride + 1));
                for (int i = 0; i < kFrames * channels; ++i)
                    pair.write(0.3 * std::sin(i * 0.1) + 0.2 * std::sin(i * 1.7),
                               in.data() + 1 + i * pair.inBytes);
                const auto convert = [&](const std::vector<int>& cuts) {
                    Owned converter(up, down, channels);
                    Bytes out(converter.OutputLimit(kFrames) * static_cast<std::size_t>(outStride) + 1);
                    int done = 0, written = 0;
                    for (std::size_t i = 0; done < kFrames; ++i) {
                        const int frames = std::min(cuts[i % cuts.size()], kFrames - done);
                        written += (converter.*pair.core)(frames, in.data() + 1 + done * inStride,
                                                          out.data() + 1 + written * outStride, channels,
                                                          inStride, outStride, nullptr);
                        done += frames;
                    }
                    EXPECT_EQ(written, (kFrames * up + down - 1) / down);
                    return out;
                };
                const auto whole = convert({kFrames});
                ASSERT_EQ(convert({1, 7, 0, 64, 3}), whole)
                    << "pair " << p << ", " << channels << " channels";
                Bytes none(whole.size());
                ASSERT_NE(whole, none);
            }
}

TEST(SamplingFrequencyConverterTest, ChoosesTheFirstOfTheBestFactors) {
    constexpr int kMost = std::numeric_limits<int>::max();
    constexpr struct {
        int in, out, result, up, down;
    } kCases[] = {
        {44100, 44100, 0, 0, 0},   {48000, 96000, 1, 2, 1},   {44100, 48000, 1, 37, 34},
        {48000, 44100, 1, 34, 37}, {96000, 44100, 1, 17, 37}, {32000, 44100, 1, 40, 29},
        {kMost, 1, 1, 1, 49},      {1, kMost, 0, 0, 0},       {0, 48000, 0, 0, 0},
        {48000, -1, 0, 0, 0},
    };
    for (const auto& c : kCases) {
        Converter converter;
        EXPECT_EQ(converter.InitConversion(c.in, c.out), c.result) << c.in << " " << c.out;
        EXPECT_EQ(converter.up, c.up) << c.in << " " << c.out;
        EXPECT_EQ(converter.down, c.down) << c.in << " " << c.out;
    }
}

TEST(SamplingFrequencyConverterTest, ReadsAndWritesSamplesToTheirLimits) {
    const double inf = std::numeric_limits<double>::infinity();
    const struct {
        double value;
        int as16, as24;
    } kCases[] = {
        {1.0, 32767, 8388607}, {-1.0, -32768, -8388608}, {inf, 32767, 8388607},     {-inf, -32768, -8388608},
        {std::nan(""), 0, 0},  {0.99 / 8388608, 0, 0},   {-1.99 / 32768, -1, -509}, {0.5, 16384, 4194304},
    };
    for (const auto& c : kCases) {
        char sample[3]{};
        tipo_16bit_outd::Write(c.value, sample);
        EXPECT_EQ(tipo_16bit::Read(sample), c.as16 / 32768.0) << c.value;
        tipo_24bit_outd::Write(c.value, sample);
        EXPECT_EQ(tipo_24bit::Read(sample), c.as24 / 8388608.0) << c.value;
    }
    const char lowest[] = {0, 0, '\x80'};
    EXPECT_EQ(tipo_16bit::Read(lowest + 1), -1.0);
    EXPECT_EQ(tipo_24bit::Read(lowest), -1.0);
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

// Catches a wrong gain, cutoff, delay or output length, and noise of our own: a sine comes out with the gain
// and the phase of the analogue filter, and what is left beside it are the images that one lets through.
TEST(SamplingFrequencyConverterTest, TreatsASineAsTheAnalogueFilterDoes) {
    constexpr struct {
        int in, out;
        double ofLowerRate, gainDb;
    } kCases[] = {
        {44100, 48000, 0.02, 0.0},    {44100, 48000, 0.35, 0.0}, {48000, 44100, 0.02, 0.0},
        {48000, 96000, 0.35, 0.0},    {96000, 44100, 0.35, 0.0}, {44100, 48000, 0.4, -0.32},
        {48000, 44100, 0.455, -3.01},
    };
    for (const auto& c : kCases) {
        SCOPED_TRACE(testing::Message() << c.in << " -> " << c.out << ", " << c.ofLowerRate);
        Converter chosen;
        ASSERT_EQ(chosen.InitConversion(c.in, c.out), 1);
        Owned converter(chosen.up, chosen.down, 1);
        const double up = converter.up, down = converter.down, cutoff = 0.455 / std::max(up, down);
        const double frequency = c.ofLowerRate * std::min(1.0, up / down);  // of the input rate
        const auto output = converter.Convert(TestSupport::Sine<double>(16000, frequency, 1, 1.0));
        EXPECT_EQ(static_cast<double>(output.size()), std::ceil(16000 * up / down));

        // Least squares of sine and cosine at the frequency it must have, after the filter has settled.
        double ss = 0, cc = 0, sc = 0, ys = 0, yc = 0, yy = 0;
        for (std::size_t i = 2000; i < output.size(); ++i) {
            const double angle = 2.0 * std::numbers::pi * frequency * down / up * static_cast<double>(i);
            const double s = std::sin(angle), co = std::cos(angle), y = output[i];
            ss += s * s, cc += co * co, sc += s * co, ys += y * s, yc += y * co, yy += y * y;
        }
        const double det = ss * cc - sc * sc, a = (ys * cc - yc * sc) / det, b = (yc * ss - ys * sc) / det;
        const auto response = Plain::ButterworthResponse(frequency / up, cutoff);
        EXPECT_NEAR(std::abs(std::complex(a, b) - response), 0.0, 1e-3);
        EXPECT_NEAR(20 * std::log10(std::abs(response)), c.gainDb, 0.03);
        double images = 0.0;
        for (int m = 1; m < converter.up; ++m)
            images += std::norm(Plain::ButterworthResponse((m + frequency) / up, cutoff)) / 2;
        const double noise = (yy - a * ys - b * yc) / static_cast<double>(output.size() - 2000);
        EXPECT_NEAR(10 * std::log10(noise / images), 0.0, 0.5);
        // A low tone is late by as many steps as its phase turns per radian.
        constexpr double kLow = 1e-6;
        const double delay =
            -std::arg(Plain::ButterworthResponse(kLow, cutoff)) / (2 * std::numbers::pi * kLow);
        EXPECT_NEAR(converter.GroupDelay() / delay, 1.0, 1e-6);
    }
}

TEST(SamplingFrequencyConverterTest, StaysQuietWhereThereIsNothingToDo) {
    Owned converter(2, 1, 2), wide(2, 1, 48);
    Converter fresh;
    double in[100]{}, out[200]{};
    const auto convert = [&](Converter& c, int frames, int channels) {
        return c.sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
            frames, reinterpret_cast<char*>(in), reinterpret_cast<char*>(out), channels, 8 * channels,
            8 * channels, nullptr);
    };
    EXPECT_EQ(convert(fresh, 1, 1), 0);
    EXPECT_EQ(convert(wide, 2, 48), 4);
    constexpr int kNothing[][2] = {{0, 2}, {-5, 2}, {1, 0}, {1, 3}, {1, 49}};  // Init made rings for two
    for (const auto& [frames, channels] : kNothing) EXPECT_EQ(convert(converter, frames, channels), 0);
    converter.FreeRings();
    EXPECT_EQ(convert(converter, 1, 2), 0);
    EXPECT_EQ(converter.InitConversionByFactors(0, 1), 0);
    EXPECT_EQ(converter.InitConversionByFactors(1, std::numeric_limits<int>::max()), 0);
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

TEST(SamplingFrequencyConverterTest, CopiesShareRingsAndContinueAlike) {
    const auto input = TestSupport::Noise<double>(50);
    Owned first(5, 3, 1);
    first.Convert(input);
    Converter copy = first;
    EXPECT_EQ(copy.rings[0], first.rings[0]);
    std::vector<double> in = input, out(first.OutputLimit(50));
    const int written = copy.sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
        50, reinterpret_cast<char*>(in.data()), reinterpret_cast<char*>(out.data()), 1, 8, 8, nullptr);
    out.resize(static_cast<std::size_t>(written));
    EXPECT_EQ(first.Convert(input), out);
}

// The initialisers clear two channels; the others go on with what they hold.
TEST(SamplingFrequencyConverterTest, ClearsTheFirstTwoChannelsOnly) {
    Owned converter(2, 1, 3);
    converter.Convert(std::vector<double>(30, 0.5), 3);
    ASSERT_EQ(converter.InitConversionByFactors(2, 1), 1);
    const auto rest = converter.Convert(std::vector<double>(3), 3);
    EXPECT_EQ(rest[0], 0.0);
    EXPECT_EQ(rest[1], 0.0);
    EXPECT_NE(rest[2], 0.0);
    for (auto* history : {converter.inputHistory[2], converter.outputHistory[2]})
        std::fill_n(history, Converter::kMaxOrder + 1, 0.0);
    EXPECT_EQ(converter.Convert(std::vector<double>(3), 3)[2], 0.0);
}

}  // namespace
