#include <algorithm>
#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "DSP/Pitch/PitchAdapter.h"
#include "Errors.h"
#include "Progress.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::DSP::PitchAdapter;
using Corvo::DSP::PitchAdapterInfo;

constexpr int kBlock = 4096;
constexpr int kMostChannels = 2;
constexpr double kMostSemitones = 36.0;
constexpr double kLowestSpeed = 0.1, kHighestSpeed = 10.0;
constexpr int kClassicSizeIndex = 3;

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

// "New" makes up for its own delay in the path without padding. "Classic" delays by all of its frame but one
// step, which is dropped here and made up for with silence behind the input.
int DelayFrames(const PitchArguments& arguments, const PitchAdapterInfo& engine) {
    if (IsNew(arguments)) return 0;
    const int size = engine.GetFFTSizes()[kClassicSizeIndex];
    return size - size / engine.GetQualities()[static_cast<std::size_t>(arguments.quality)];
}

std::unique_ptr<PitchAdapter> Prepare(const PitchArguments& arguments, PitchAdapterInfo* engine,
                                      const AudioReader& input) {
    std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(engine));
    adapter->SetChannelsNum(input.Channels());
    adapter->SetSampleRate(input.Rate());
    adapter->SetFFTSize(kClassicSizeIndex);
    adapter->SetQuality(arguments.quality);
    adapter->SetTranspose(static_cast<float>(arguments.semitones));
    adapter->SetSpeed(static_cast<float>(arguments.speed));
    adapter->CookFactors();
    return adapter;
}

// Takes blocks as they come out of the engine: leaves out its delay, and stops where the output is long
// enough.
class Sink {
public:
    Sink(AudioWriter& output, int channels, int delay)
        : m_output(output), m_channels(static_cast<std::size_t>(channels)), m_delay(delay) {}

    void Take(const std::vector<float>& block, int frames, std::int64_t owed) {
        const auto skipped = static_cast<int>(std::min<std::int64_t>(m_delay, frames));
        m_delay -= skipped;
        const std::int64_t count = std::min<std::int64_t>(frames - skipped, owed - m_output.FramesWritten());
        if (count <= 0) return;
        const auto first = block.begin() + static_cast<std::ptrdiff_t>(m_channels) * skipped;
        m_samples.assign(
            first, first + static_cast<std::ptrdiff_t>(m_channels) * static_cast<std::ptrdiff_t>(count));
        m_output.Write(m_samples.data(), count);
    }

private:
    AudioWriter& m_output;
    std::size_t m_channels;
    std::int64_t m_delay;
    std::vector<double> m_samples;
};

void Shift(AudioReader& input, PitchAdapter& adapter, AudioWriter& output, const PitchArguments& arguments,
           int delay) {
    const auto width = static_cast<std::size_t>(input.Channels());
    std::vector<double> read(kBlock * width);
    std::vector<float> block(kBlock * width);
    Sink sink(output, input.Channels(), delay);
    const auto process = [&](int frames, std::int64_t owed) {
        const int got = adapter.ProcessInPlaceNoPadding(block.data(), frames);
        sink.Take(block, got, owed);
    };
    Progress progress("pitch", input.Rate(), input.Frames(), arguments.writing.quiet);
    const float speed = static_cast<float>(arguments.speed);
    std::int64_t frames = 0;
    const auto owed = [&] { return static_cast<std::int64_t>(static_cast<double>(frames) / speed); };
    while (const int count = input.Read(read.data(), kBlock)) {
        std::transform(read.begin(), read.begin() + static_cast<std::ptrdiff_t>(width) * count, block.begin(),
                       [](double sample) { return static_cast<float>(sample); });
        frames += count;
        process(count, owed());
        progress.Update(frames);
    }
    for (int left = delay; left > 0; left -= kBlock) {
        std::ranges::fill(block, 0.0f);
        process(std::min(left, kBlock), owed());
    }
    adapter.Flush();
    for (int left = adapter.GetNumSamplesAvailable(); left > 0; left = adapter.GetNumSamplesAvailable()) {
        const int count = std::min(left, kBlock);
        adapter.ReceiveSamples(block.data(), count);
        sink.Take(block, count, owed());
    }
}

}  // namespace

void RunPitch(PitchArguments arguments) {
    PitchAdapterInfo* const engine = Engine(arguments);
    CheckNumbers(arguments, *engine);
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    arguments.writing.rules.inputs = {arguments.input};

    AudioReader input(arguments.input);
    RequireFormat(input, kMostChannels, "the pitch is shifted in mono and stereo");
    const auto adapter = Prepare(arguments, engine, input);
    AudioWriterOptions writing{input.Channels(), input.Rate(), asked, input.Format(), input.Frames()};
    if (writing.framesAtMost)
        writing.framesAtMost =
            static_cast<std::int64_t>(static_cast<double>(*writing.framesAtMost) / kLowestSpeed);
    AudioWriter output(arguments.output, arguments.writing.rules, writing);
    Shift(input, *adapter, output, arguments, DelayFrames(arguments, *engine));
    output.Commit();
    WarnOfClipping(output);
}

}  // namespace dsphost
