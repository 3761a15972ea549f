#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "DSP/Pitch/OfflinePitchShift.h"
#include "Errors.h"
#include "Progress.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::DSP::OfflinePitchShift;
using Corvo::DSP::PitchAdapterInfo;

constexpr int kBlock = 4096;
constexpr int kMostChannels = 2;
constexpr double kMostSemitones = 36.0;
constexpr double kLowestSpeed = 0.1, kHighestSpeed = 10.0;

bool IsNew(const PitchArguments& arguments) { return SameNoCase(arguments.engine, "new"); }

PitchAdapterInfo* Engine(const PitchArguments& arguments) {
    if (IsNew(arguments)) return PitchAdapterInfo::SoundTouch;
    if (SameNoCase(arguments.engine, "classic")) return PitchAdapterInfo::OldCorvo;
    throw UserError("--engine cannot be \"" + arguments.engine + "\"; accepted: new, classic");
}

void CheckNumbers(const PitchArguments& arguments, const PitchAdapterInfo& engine) {
    if (!(std::abs(arguments.semitones) <= kMostSemitones)) throw UserError("--semitones accepts -36 to 36");
    if (!(arguments.speed >= kLowestSpeed && arguments.speed <= kHighestSpeed))
        throw UserError("--speed accepts 0.1 to 10");
    if (arguments.speed != 1.0 && !IsNew(arguments))
        throw UserError("--speed goes with the engine new only; classic keeps the speed");
    const int last = static_cast<int>(engine.GetQualities().size()) - 1;
    if (arguments.quality < 0 || arguments.quality > last)
        throw UserError("--quality accepts 0 to " + std::to_string(last) + " with the engine " +
                        arguments.engine);
}

void Shift(AudioReader& input, OfflinePitchShift& shift, AudioWriter& output, bool quiet) {
    const auto width = static_cast<std::size_t>(input.Channels());
    std::vector<double> samples(kBlock * width);
    std::vector<float> block(kBlock * width);
    const auto write = [&] {
        while (const int count = shift.Take(block.data(), kBlock)) {
            std::copy_n(block.begin(), static_cast<std::size_t>(count) * width, samples.begin());
            output.Write(samples.data(), count);
        }
    };
    Progress progress("pitch", input.Rate(), input.Frames(), quiet);
    std::int64_t frames = 0;
    while (const int count = input.Read(samples.data(), kBlock)) {
        std::transform(samples.begin(), samples.begin() + static_cast<std::ptrdiff_t>(width) * count,
                       block.begin(), [](double sample) { return static_cast<float>(sample); });
        shift.Feed(block.data(), count);
        write();
        progress.Update(frames += count);
    }
    shift.Finish();
    write();
}

}  // namespace

void RunPitch(PitchArguments arguments) {
    PitchAdapterInfo* const engine = Engine(arguments);
    CheckNumbers(arguments, *engine);
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    arguments.writing.rules.inputs = {arguments.input};

    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, kMostChannels, "the pitch is shifted in mono and stereo");
    OfflinePitchShift shift(
        {input.Rate(), input.Channels(), arguments.semitones,
         IsNew(arguments) ? OfflinePitchShift::Engine::New : OfflinePitchShift::Engine::Classic,
         arguments.quality, arguments.speed});
    AudioWriterOptions writing{input.Channels(), input.Rate(), asked, input.Format(), input.Frames()};
    if (writing.frames) {
        const auto frames = static_cast<double>(*writing.frames);
        writing.frames = static_cast<std::int64_t>(frames / arguments.speed);
        writing.moreAtMost = static_cast<std::int64_t>(frames / kLowestSpeed) - *writing.frames;
    }
    AudioWriter output(arguments.output, arguments.writing.rules, writing);
    Shift(input, shift, output, arguments.writing.quiet);
    output.Commit();
    WarnOfClipping(output);
}

}  // namespace dsphost
