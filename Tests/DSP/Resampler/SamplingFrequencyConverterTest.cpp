#include "DSP/Resampler/SamplingFrequencyConverter.h"

#include <gtest/gtest.h>

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
    int inBytes, outBytes;
};

template <typename... In, typename... Out>
std::vector<FormatPair> Pairs(std::tuple<In...>, std::tuple<Out...>) {
    std::vector<FormatPair> pairs;
    const auto withIn = [&]<typename I>(I) {
        (pairs.push_back({&Converter::sfreq_conversion_core_block<I, Out>, I::kBytes, Out::kBytes}), ...);
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

double LargestDifference(const std::vector<double>& a, const std::vector<double>& b) {
    EXPECT_EQ(a.size(), b.size());
    double largest = 0.0;
    for (std::size_t i = 0; i < std::min(a.size(), b.size()); ++i)
        largest = std::max(largest, std::abs(a[i] - b[i]));
    return largest;
}

// Catches a wrong pole, residue or power, a phase table read at the wrong row, and rounding that grows:
// the direct form in double misses this bound by eight orders of magnitude.
TEST(SamplingFrequencyConverterTest, IsTheExactFilterForEveryPairOfFactors) {
    double worst = 0.0;
    for (int up = 1; up <= 49; ++up)
        for (int down = 1; down <= 49; ++down) {
            if (std::gcd(up, down) > 1 && up != down) continue;
            const auto input = TestSupport::Noise<double>(static_cast<std::size_t>(20 + 600 / up), 1.0);
            const auto exact = Plain::Convert(input, up, down);
            const double error = LargestDifference(Owned(up, down, 1).Convert(input), exact);
            ASSERT_LT(error, 1e-12) << up << "/" << down;
            worst = std::max(worst, error);
        }
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
                for (int i = 0; i < kFrames * channels; ++i) {
                    char* sample = in.data() + 1 + i * pair.inBytes;
                    const double value = 0.3 * std::sin(i * 0.1) + 0.2 * std::sin(i * 1.7);
                    if (pair.inBytes == 2) tipo_16bit::Write(value, sample);
                    if (pair.inBytes == 3) tipo_24bit::Write(value, sample);
                    if (pair.inBytes == 4) tipo_floatbit::Write(value, sample);
                    if (pair.inBytes == 8) tipo_doublebit::Write(value, sample);
                }
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

// A constant is the hardest for poles next to 1, and the exact ratios of files go beyond 49.
TEST(SamplingFrequencyConverterTest, StaysExactForSlowFiltersAndLargeFactors) {
    constexpr int kFactors[][2] = {{1, 49}, {49, 1}, {160, 147}, {147, 1280}, {1, 1000}};
    for (const auto& [up, down] : kFactors) {
        const std::vector<double> input(static_cast<std::size_t>(500 + 40 * down / up), 1.0);
        EXPECT_LT(LargestDifference(Owned(up, down, 1).Convert(input), Plain::Convert(input, up, down)),
                  1e-12)
            << up << "/" << down;
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

// Catches a wrong gain, a wrong cutoff and noise of our own. What is left beside the sine must be the
// images that a Butterworth of order 10 lets through, no more.
TEST(SamplingFrequencyConverterTest, KeepsASineWhereItIs) {
    constexpr struct {
        int in, out;
        double ofLowerRate, dbLevel;
    } kCases[] = {
        {44100, 48000, 0.02, 0.03}, {44100, 48000, 0.35, 0.03}, {48000, 44100, 0.02, 0.03},
        {48000, 96000, 0.35, 0.03}, {96000, 44100, 0.35, 0.03}, {44100, 48000, 0.4, 1.2},
    };
    for (const auto& c : kCases) {
        Converter chosen;
        ASSERT_EQ(chosen.InitConversion(c.in, c.out), 1);
        Owned converter(chosen.up, chosen.down, 1);
        const double up = converter.up, down = converter.down;
        const double frequency = c.ofLowerRate * std::min(1.0, up / down);  // of the input rate
        std::vector<double> input(16000);
        for (std::size_t i = 0; i < input.size(); ++i)
            input[i] = std::sin(2.0 * std::numbers::pi * frequency * static_cast<double>(i));
        auto output = converter.Convert(input);
        output.erase(output.begin(), output.begin() + 2000);

        // Least squares of sine and cosine at the frequency it must have.
        double ss = 0, cc = 0, sc = 0, ys = 0, yc = 0, yy = 0;
        for (std::size_t i = 0; i < output.size(); ++i) {
            const double angle = 2.0 * std::numbers::pi * frequency * down / up * static_cast<double>(i);
            const double s = std::sin(angle), co = std::cos(angle), y = output[i];
            ss += s * s, cc += co * co, sc += s * co, ys += y * s, yc += y * co, yy += y * y;
        }
        const double det = ss * cc - sc * sc, a = (ys * cc - yc * sc) / det, b = (yc * ss - ys * sc) / det;
        const double level = std::hypot(a, b),
                     noise = (yy - a * ys - b * yc) / static_cast<double>(output.size());

        const double cutoff = 0.455 / std::max(up, down);
        EXPECT_NEAR(level, Plain::ButterworthMagnitude(frequency / up, cutoff), 1e-3);
        EXPECT_NEAR(20 * std::log10(level), 0.0, c.dbLevel);
        double images = 0.0;
        for (int m = 1; m < converter.up; ++m)
            images += std::pow(Plain::ButterworthMagnitude((m + frequency) / up, cutoff), 2) / 2;
        const double snr = 10 * std::log10(level * level / 2 / noise);
        EXPECT_NEAR(snr, 10 * std::log10(level * level / 2 / images), 0.5);
        std::printf("%d -> %d, sine at %.2f of the lower rate: level %.4f dB, SNR %.1f dB (its own images)\n",
                    c.in, c.out, c.ofLowerRate, 20 * std::log10(level), snr);
    }
}

TEST(SamplingFrequencyConverterTest, StaysQuietWhereThereIsNothingToDo) {
    Owned converter(2, 1, 2);
    double in[100]{}, out[200];
    std::ranges::fill(out, 7.0);
    const auto convert = [&](Converter& c, int frames, int channels) {
        return c.sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
            frames, reinterpret_cast<char*>(in), reinterpret_cast<char*>(out), channels, 8 * channels,
            8 * channels, nullptr);
    };
    Converter fresh;
    EXPECT_EQ(convert(fresh, 1, 1), 0);
    EXPECT_EQ(convert(converter, 0, 2), 0);
    EXPECT_EQ(convert(converter, -5, 2), 0);
    EXPECT_EQ(convert(converter, 1, 0), 0);
    EXPECT_EQ(convert(converter, 1, 3), 0);  // Init made rings for two
    EXPECT_EQ(convert(converter, 1, 49), 0);
    EXPECT_TRUE(std::ranges::all_of(out, [](double sample) { return sample == 7.0; }));
    EXPECT_EQ(converter.InitConversionByFactors(0, 1), 0);
    EXPECT_EQ(converter.InitConversionByFactors(1, std::numeric_limits<int>::max()), 0);
    Owned wide(2, 1, 48);
    EXPECT_EQ(convert(wide, 2, 48), 4);
    converter.FreeRings();
    EXPECT_EQ(convert(converter, 1, 2), 0);
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
