#include <algorithm>
#include <cmath>
#include <cstdio>
#include <numeric>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Errors.h"
#include "Progress.h"
#include "Text.h"

namespace dsphost {
namespace {

constexpr int kLowestRate = 1000, kHighestRate = 768000;
constexpr int kBlock = 4096;
constexpr double kMostCents = 20.0;

struct NamedCurve {
    const char* name;
    DitherCurve curve;
};
constexpr NamedCurve kCurves[] = {
    {"none", DitherCurve::None},
    {"tpdf", DitherCurve::Flat},
    {"shaped", DitherCurve::Gentle},
    {"shaped-strong", DitherCurve::Strong},
};

DitherCurve ParseDither(const std::string& name) {
    std::vector<std::string> names;
    for (const auto& named : kCurves) {
        if (SameNoCase(named.name, name)) return named.curve;
        names.emplace_back(named.name);
    }
    throw UserError("there is no dither \"" + name + "\"; accepted: " + Joined(names, ", "));
}

// The converter between two rates, or none where they are equal. Owns its rings.
class Converter {
public:
    Converter(int inRate, int outRate, int channels, bool exact) : m_channels(channels) {
        if (inRate == outRate) return;
        const int common = std::gcd(inRate, outRate);
        const std::string reduced = std::to_string(outRate / common) + "/" + std::to_string(inRate / common);
        const bool set = exact ? m_core.InitConversionByFactors(outRate / common, inRate / common) != 0
                               : m_core.InitConversion(inRate, outRate) != 0;
        if (!set) throw IoError("there is not enough memory to convert by " + reduced);
        CheckPitch(inRate, outRate, reduced);
        m_core.Init(channels);
        // Outputs begin where the filter's delay ends, to the nearest step of the raised rate.
        const auto delay = static_cast<int>(std::lround(m_core.GroupDelay()));
        m_core.readPosition = delay % m_core.ringLength;
        m_core.readWraps = delay / m_core.ringLength;
        m_active = true;
    }
    Converter(const Converter&) = delete;
    Converter& operator=(const Converter&) = delete;
    ~Converter() { m_core.FreeRings(); }

    std::int64_t OutputFrames(std::int64_t frames) const {
        const std::int64_t up = m_active ? m_core.up : 1, down = m_active ? m_core.down : 1;
        return (2 * frames * up + down) / (2 * down);
    }

    // Converts interleaved doubles; the result is valid until the next call.
    std::span<double> Convert(std::vector<double>& samples, int frames, CDither<double>* dither) {
        const auto channels = static_cast<std::size_t>(m_channels);
        const int stride = m_channels * static_cast<int>(sizeof(double));
        if (!m_active) {
            const auto whole = std::span(samples).first(static_cast<std::size_t>(frames) * channels);
            for (std::size_t i = 0; dither && i < whole.size(); ++i)
                whole[i] = ApplyDither(dither[i % channels], whole[i]);
            return whole;
        }
        m_output.resize((static_cast<std::size_t>(OutputFrames(frames)) + 2) * channels);
        const int written = m_core.sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
            frames, reinterpret_cast<char*>(samples.data()), reinterpret_cast<char*>(m_output.data()),
            m_channels, stride, stride, dither);
        return std::span(m_output).first(static_cast<std::size_t>(written) * channels);
    }

private:
    // Factors are small numbers; where they miss the ratio, the output plays at another pitch and drifts.
    void CheckPitch(int inRate, int outRate, const std::string& reduced) const {
        const double cents =
            1200.0 * std::log2(static_cast<double>(outRate) / inRate * m_core.down / m_core.up);
        if (static_cast<std::int64_t>(inRate) * m_core.up == static_cast<std::int64_t>(outRate) * m_core.down)
            return;
        char text[160];
        std::snprintf(text, sizeof text, "%d to %d Hz by %d/%d is %.2f cents %s", inRate, outRate, m_core.up,
                      m_core.down, std::abs(cents), cents > 0.0 ? "sharp" : "flat");
        if (std::abs(cents) > kMostCents)
            throw UserError(std::string(text) + "; --exact converts by " + reduced);
        PrintMessage("warning: " + std::string(text) + " and drifts; --exact converts by " + reduced);
    }

    SamplingFrequencyConverter m_core;
    int m_channels;
    bool m_active = false;
    std::vector<double> m_output;
};

// What the library stores for a value in `Out`, as a double again; counts what it had to clip.
template <typename Out>
void Store(std::span<double> samples, std::int64_t& clipped) {
    for (double& value : samples) {
        clipped += !(value * Out::kScale > -Out::kScale - 1.0 && value * Out::kScale < Out::kScale);
        char stored[Out::kBytes];
        Out::Write(value, stored);
        value = Out::Read(stored);
    }
}

}  // namespace

void RunConvert(ConvertArguments arguments) {
    auto& rules = arguments.writing.rules;
    if (arguments.rate < kLowestRate || arguments.rate > kHighestRate)
        throw UserError("--rate cannot be " + std::to_string(arguments.rate) +
                        "; accepted: 1000 to 768000 Hz");
    const DitherCurve curve = ParseDither(arguments.dither);
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    rules.inputs = {arguments.input};

    AudioReader input(arguments.input);
    RequireFormat(input, SamplingFrequencyConverter::kMaxChannels, "the converter takes up to 48");
    const auto channels = static_cast<std::size_t>(input.Channels());
    Converter converter(input.Rate(), arguments.rate, input.Channels(), arguments.exact);
    AudioWriterOptions writing{input.Channels(), arguments.rate, asked, input.Format(), {}};
    if (input.Frames()) writing.framesAtMost = converter.OutputFrames(*input.Frames());
    AudioWriter output(arguments.output, rules, writing);

    const int bits = IntegerBits(output.Format());
    if (curve != DitherCurve::None && bits != 16 && bits != 24)
        throw UserError("--dither is for s16 and s24 samples; " + output.Name() + " has " +
                        Name(output.Format()));
    std::vector<CDither<double>> dither(channels, MakeDither(curve, bits));
    std::int64_t clipped = 0, frames = 0, written = 0;
    std::vector<double> samples(kBlock * channels);
    const auto convert = [&](int count, std::int64_t limit) {
        auto converted =
            converter.Convert(samples, count, curve == DitherCurve::None ? nullptr : dither.data());
        const auto wanted = static_cast<std::size_t>(limit - written) * channels;
        converted = converted.first(std::min(converted.size(), wanted));
        if (bits == 16) Store<tipo_16bit_outd>(converted, clipped);
        if (bits == 24) Store<tipo_24bit_outd>(converted, clipped);
        output.Write(converted.data(), static_cast<std::int64_t>(converted.size() / channels));
        written += static_cast<std::int64_t>(converted.size() / channels);
    };
    {
        Progress progress("convert", input.Rate(), input.Frames(), arguments.writing.quiet);
        while (const int got = input.Read(samples.data(), kBlock)) {
            frames += got;
            convert(got, converter.OutputFrames(frames));
            progress.Update(frames);
        }
        // What is still in the filter.
        std::ranges::fill(samples, 0.0);
        while (written < converter.OutputFrames(frames)) convert(kBlock, converter.OutputFrames(frames));
    }
    output.Commit();
    WarnOfClipping(output, clipped);
}

}  // namespace dsphost
