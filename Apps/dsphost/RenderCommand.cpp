#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "Automation.h"
#include "Chain.h"
#include "Errors.h"
#include "Progress.h"
#include "Render.h"
#include "Text.h"

namespace dsphost {
namespace {

constexpr int kMostChannels = 2;
constexpr int kLargestBlock = 1 << 20;
constexpr double kLongestTail = 3600.0;

std::optional<double> ParseTail(const std::string& text) {
    if (SameNoCase(text, "auto")) return {};
    const auto seconds = ToNumber(text);
    if (!seconds || *seconds < 0.0 || *seconds > kLongestTail)
        throw UserError("--tail cannot be \"" + text + "\"; accepted: seconds from 0 to 3600, or auto");
    return seconds;
}

void CheckNumbers(const RenderArguments& arguments) {
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
std::vector<std::unique_ptr<OutputFile>> PrepareChunks(const RenderArguments& arguments, Chain& chain) {
    std::vector<std::unique_ptr<OutputFile>> files;
    for (std::size_t i = 0; i < arguments.chunks.size(); ++i) {
        files.push_back(std::make_unique<OutputFile>(arguments.chunks[i], arguments.writing.rules));
        const auto state = chain.Element(i).State();
        files.back()->Bytes().Write(state.data(), state.size());
    }
    return files;
}

}  // namespace

void RunRender(RenderArguments arguments) {
    auto& options = arguments.options;
    auto& rules = arguments.writing.rules;
    CheckNumbers(arguments);
    options.tail = ParseTail(arguments.tail);
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    rules.inputs = {arguments.input, arguments.automation};
    auto outputs = arguments.chunks;
    outputs.push_back(arguments.output);
    RefuseSameOutputs(outputs);

    Chain chain(arguments.effects);
    for (std::size_t i = 0; i < chain.Size(); ++i) rules.inputs.push_back(chain.Element(i).SourceFile());
    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, kMostChannels, "the effects process mono and stereo");
    if (!arguments.automation.empty()) LoadAutomation(arguments.automation, input.Rate(), chain);
    const auto chunks = PrepareChunks(arguments, chain);

    const auto format = ChainFormat(input.Channels(), input.Rate(), options.precision);
    const auto interleavedOnly = chain.Prepare(options.block, format, options.planar);
    if (!interleavedOnly.empty())
        PrintMessage("note: --planar: interleaved only: " + Joined(interleavedOnly, ", "));

    const auto tail = static_cast<std::int64_t>(options.tail.value_or(kLongestAutoTail) * input.Rate() + 1.0);
    AudioWriter output(arguments.output, rules,
                       {input.Channels(), input.Rate(), asked, input.Format(), input.Frames(), tail});
    {
        Progress progress("render", input.Rate(), input.Frames(), arguments.writing.quiet);
        Render(input, chain, output, options, [&](std::int64_t frames) { progress.Update(frames); });
    }
    std::vector<OutputFile*> together{&output.Complete()};
    for (const auto& chunk : chunks) together.push_back(chunk.get());
    CommitTogether(together);
    WarnOfClipping(output);
}

}  // namespace dsphost
