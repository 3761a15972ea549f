#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "AudioReader.h"
#include "AudioWriter.h"
#include "Automation.h"
#include "Chain.h"
#include "Commands.h"
#include "Errors.h"
#include "Progress.h"
#include "Render.h"
#include "Text.h"

namespace dsphost {
namespace {

constexpr int kMostChannels = 2;
constexpr int kLargestBlock = 1 << 20;
constexpr double kLongestTail = 3600.0;

struct Arguments {
    std::string input, output, format, automation, tail = "0";
    std::vector<std::string> effects, chunks;
    RenderOptions options;
    WritingOptions writing;
};

std::optional<double> ParseTail(const std::string& text) {
    if (SameNoCase(text, "auto")) return {};
    const auto seconds = ToNumber(text);
    if (!seconds || *seconds < 0.0 || *seconds > kLongestTail)
        throw UserError("--tail cannot be \"" + text + "\"; accepted: seconds from 0 to 3600, or auto");
    return seconds;
}

void CheckNumbers(const Arguments& arguments) {
    if (arguments.options.precision != 32 && arguments.options.precision != 64)
        throw UserError("--precision cannot be " + std::to_string(arguments.options.precision) +
                        "; accepted: 32, 64");
    if (arguments.options.block < 1 || arguments.options.block > kLargestBlock)
        throw UserError("--block cannot be " + std::to_string(arguments.options.block) + "; accepted: 1 to " +
                        std::to_string(kLargestBlock) + " frames");
    if (!arguments.chunks.empty() && arguments.chunks.size() != arguments.effects.size())
        throw UserError("--save-chunk goes once with each --fx, in the same order: there are " +
                        std::to_string(arguments.chunks.size()) + " for " +
                        std::to_string(arguments.effects.size()));
}

// The state of each effect as rendering begins, in files that wait for their Commit.
std::vector<std::unique_ptr<OutputFile>> PrepareChunks(const Arguments& arguments, Chain& chain) {
    std::vector<std::unique_ptr<OutputFile>> files;
    for (std::size_t i = 0; i < arguments.chunks.size(); ++i) {
        files.push_back(std::make_unique<OutputFile>(arguments.chunks[i], arguments.writing.rules));
        const auto state = chain.Element(i).State();
        files.back()->Bytes().Write(state.data(), state.size());
    }
    return files;
}

void Run(Arguments arguments) {
    auto& options = arguments.options;
    auto& rules = arguments.writing.rules;
    CheckNumbers(arguments);
    options.tail = ParseTail(arguments.tail);
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    rules.inputs = {arguments.input, arguments.automation};

    Chain chain(arguments.effects);
    AudioReader input(arguments.input);
    RequireFormat(input, kMostChannels, "the effects process mono and stereo");
    if (!arguments.automation.empty()) LoadAutomation(arguments.automation, input.Rate(), chain);
    const auto chunks = PrepareChunks(arguments, chain);

    const auto format = ChainFormat(input.Channels(), input.Rate(), options.precision);
    const auto interleavedOnly = chain.Prepare(options.block, format, options.planar);
    if (!interleavedOnly.empty())
        PrintMessage("note: --planar: interleaved only: " + Joined(interleavedOnly, ", "));

    AudioWriterOptions writing{input.Channels(), input.Rate(), asked, input.Format(), input.Frames()};
    if (writing.framesAtMost)
        *writing.framesAtMost +=
            static_cast<std::int64_t>(options.tail.value_or(kLongestAutoTail) * input.Rate() + 1.0);
    AudioWriter output(arguments.output, rules, writing);
    {
        Progress progress("render", input.Rate(), input.Frames(), arguments.writing.quiet);
        Render(input, chain, output, options, [&](std::int64_t frames) { progress.Update(frames); });
    }
    output.Commit();
    for (const auto& chunk : chunks) chunk->Commit();
    WarnOfClipping(output);
}

}  // namespace

void AddRenderCommand(CLI::App& app) {
    const auto arguments = std::make_shared<Arguments>();
    auto& a = *arguments;
    auto* const command = app.add_subcommand("render", "Renders an audio file through a chain of effects");
    command->add_option("IN", a.input, "Audio file, or - for standard input")->required();
    command->add_option("OUT", a.output, "Audio file by its ending, or - for WAV on standard output")
        ->required();
    command
        ->add_option("--fx", a.effects,
                     "\"NAME: label=value, ...\"; once per effect, in the order of processing")
        ->allow_extra_args(false);
    command->add_option("--automation", a.automation, "JSON file of parameter moves");
    command->add_option("--save-chunk", a.chunks, "Writes the effect's settings; once per --fx")
        ->allow_extra_args(false);
    command->add_option("--format", a.format, "s16, s24, f32 or f64; the input's when left out");
    command->add_option("--tail", a.tail, "Seconds after the input's end, or auto: until it has died away");
    command->add_option("--precision", a.options.precision, "Bits of the samples in the chain, 32 or 64");
    command->add_option("--block", a.options.block, "Most frames per block");
    command->add_flag("--planar", a.options.planar, "One buffer per channel, where an effect supports it");
    a.writing.AddTo(*command);
    command->callback([arguments] { Run(*arguments); });
}

}  // namespace dsphost
