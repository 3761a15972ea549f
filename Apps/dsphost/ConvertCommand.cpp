#include <algorithm>
#include <cmath>
#include <cstdio>
#include <numeric>
#include <optional>
#include <string>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "DSP/Resampler/AlignedConverter.h"
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

// Factors are small numbers unless they must be exact; where they miss the ratio, the output plays at another
// pitch and drifts.
void CheckPitch(int inRate, int outRate, const AlignedConverter& converter) {
    const int up = converter.Up(), down = converter.Down();
    if (static_cast<std::int64_t>(inRate) * up == static_cast<std::int64_t>(outRate) * down) return;
    const double cents = 1200.0 * std::log2(static_cast<double>(outRate) / inRate * down / up);
    const int common = std::gcd(inRate, outRate);
    char text[200];
    std::snprintf(text, sizeof text, "%d to %d Hz by %d/%d is %.2f cents %s", inRate, outRate, up, down,
                  std::abs(cents), cents > 0.0 ? "sharp" : "flat");
    const std::string cure =
        "--exact converts by " + std::to_string(outRate / common) + "/" + std::to_string(inRate / common);
    if (std::abs(cents) > kMostCents) throw UserError(std::string(text) + "; " + cure);
    PrintMessage("warning: " + std::string(text) + " and drifts; " + cure);
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

    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, SamplingFrequencyConverter::kMaxChannels, "the converter takes up to 48");
    AlignedConverter::Settings settings{.inRate = input.Rate(),
                                        .outRate = arguments.rate,
                                        .channels = input.Channels(),
                                        .exact = arguments.exact};
    std::optional<AlignedConverter> converter(std::in_place, settings);
    CheckPitch(input.Rate(), arguments.rate, *converter);
    AudioWriterOptions writing{input.Channels(), arguments.rate, asked, input.Format(), {}};
    if (input.Frames()) writing.frames = converter->FramesOut(*input.Frames());
    AudioWriter output(arguments.output, rules, writing);

    const int bits = IntegerBits(output.Format());
    if (curve != DitherCurve::None) {
        if (bits != 16 && bits != 24)
            throw UserError("--dither is for s16 and s24 samples; " + output.Name() + " has " +
                            Name(output.Format()));
        settings.dither = curve;
        settings.ditherBits = bits;
        converter.emplace(settings);
    }
    // As the library stores these itself.
    if (bits == 16 || bits == 24) output.TruncateIntegers();
    std::int64_t read = 0;
    const auto most = static_cast<int>(converter->MostFrames(kBlock));
    {
        Progress progress("convert", input.Rate(), input.Frames(), arguments.writing.quiet);
        for (auto samples = input.Next(kBlock); !samples.empty(); samples = input.Next(kBlock)) {
            const int frames = static_cast<int>(samples.size()) / input.Channels();
            output.Put(most, [&](double* to) { return converter->Convert(samples.data(), frames, to); });
            progress.Update(read += frames);
        }
        while (output.Put(most, [&](double* to) { return converter->Finish(to, most); }) > 0) continue;
    }
    output.Commit();
    WarnOfClipping(output);
}

}  // namespace dsphost
