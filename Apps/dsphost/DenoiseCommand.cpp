#include <algorithm>
#include <charconv>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "EffectElement.h"
#include "Errors.h"
#include "NoiseProfileFile.h"
#include "Progress.h"
#include "Render.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::DSP::DenoiserProcessor;

constexpr int kBlock = 4096, kPrecision = 64;
constexpr int kMostChannels = 2;
constexpr int kLearn = 1;  // parameter

struct Passage {
    double from, to;  // seconds
    std::string text;
};

std::string Seconds(double seconds) {
    char text[32];
    return {text, std::to_chars(text, text + sizeof text, seconds, std::chars_format::fixed, 2).ptr};
}

// "FROM:TO", in the order of the recording.
std::vector<Passage> ParsePassages(const std::vector<std::string>& texts) {
    std::vector<Passage> passages;
    for (const auto& text : texts) {
        const auto colon = std::min(text.find(':'), text.size());
        const auto from = ToNumber(text.substr(0, colon)),
                   to = ToNumber(text.substr(std::min(colon + 1, text.size())));
        if (!from || !to || *from < 0.0 || *to <= *from)
            throw UserError("--learn cannot be \"" + text +
                            "\"; accepted: FROM:TO in seconds, such as 0.2:1.5");
        passages.push_back({*from, *to, text});
    }
    std::ranges::sort(passages, {}, &Passage::from);
    return passages;
}

void ProcessBlock(DenoiserProcessor& denoiser, std::vector<double>& block, int frames,
                  const tWAVEFORMATEX& format) {
    Corvo::DSP::ProcessFlags flags;
    denoiser.Process(block.data(), frames, &format, flags);
}

// Clamped, so that any number of seconds has a frame.
std::int64_t FrameAt(double seconds, int rate) {
    return static_cast<std::int64_t>(std::min(seconds * rate, 1e15));
}

// Plays a passage to the effect while it learns. The reader stands at `position`, which moves along.
void LearnPassage(DenoiserProcessor& denoiser, AudioReader& input, const Passage& passage,
                  std::int64_t& position, const tWAVEFORMATEX& format) {
    const std::int64_t from = FrameAt(passage.from, input.Rate()), to = FrameAt(passage.to, input.Rate());
    std::vector<double> block(static_cast<std::size_t>(kBlock) * format.nChannels);
    const double before = denoiser.LearnedSeconds();
    for (; position < to;) {
        const bool inside = position >= from;
        const auto wanted = static_cast<int>(std::min<std::int64_t>(kBlock, (inside ? to : from) - position));
        const int got = input.Read(block.data(), wanted);
        if (inside) {
            denoiser.SetParam(kLearn, 1.0f, false);
            ProcessBlock(denoiser, block, got, format);
        }
        position += got;
        if (got < wanted)
            throw UserError("--learn " + passage.text + ": " + input.Name() + " ends after " +
                            Seconds(static_cast<double>(position) / input.Rate()) + " s");
    }
    // The passage ends with the block that finds the switch off.
    denoiser.SetParam(kLearn, 0.0f, false);
    std::ranges::fill(block, 0.0);
    ProcessBlock(denoiser, block, 1, format);
    if (!(denoiser.LearnedSeconds() > before))
        throw UserError("--learn " + passage.text + ": too short; at least 0.02 s of noise is needed");
}

void Learn(DenoiserProcessor& denoiser, const DenoiseArguments& arguments, const tWAVEFORMATEX& format) {
    auto passages = ParsePassages(arguments.learn);
    while (!passages.empty()) {
        // Passages that overlap need the recording again.
        AudioReader input(arguments.input, arguments.spoolLimit);
        std::int64_t position = 0;
        std::vector<Passage> later;
        for (const auto& passage : passages)
            if (FrameAt(passage.from, input.Rate()) >= position)
                LearnPassage(denoiser, input, passage, position, format);
            else
                later.push_back(passage);
        passages = std::move(later);
    }
}

// Refuses settings that would learn, forget or bring a profile, for which the command has options of its own.
void RefuseProfileSettings(std::string_view settings) {
    for (std::size_t start = 0; start < settings.size();) {
        const std::size_t comma = std::min(settings.find(',', start), settings.size());
        const std::string_view piece = settings.substr(start, comma - start);
        start = comma + 1;
        const std::size_t equals = std::min(piece.find('='), piece.size());
        const auto key = Trimmed(piece.substr(0, equals)),
                   value = Trimmed(piece.substr(std::min(equals + 1, piece.size())));
        const bool off = SameNoCase(value, "off") || value == "0";
        if (SameNoCase(key, "chunk") ||
            (!off && (SameNoCase(key, "Learn") || SameNoCase(key, "Clear profile"))))
            throw UserError(
                "--set cannot be \"" + std::string(Trimmed(piece)) +
                "\" here; --learn FROM:TO learns noise, and --profile FILE uses what was learned");
    }
}

// Sets every parameter as `settings` say, or to its default. Of the profile's file only the noise is kept.
// With a profile it is used, unless they say otherwise.
void ApplySettings(DenoiserProcessor& denoiser, const std::string& settings, bool learned) {
    RefuseProfileSettings(settings);
    EffectElement parsed(*Corvo::DSP::FindEffectKind("Denoiser"),
                         (learned ? "Profile=Learned, " : "") + settings);
    DenoiserProcessor wanted;
    wanted.SetSettingsChunk(parsed.State());
    for (int i = 0; i < wanted.GetParamCount(); ++i)
        denoiser.SetParam(i, i == kLearn ? 0.0f : wanted.GetParam(i), false);
}

// Writes the cleaned recording, its latency taken out, and what was taken away.
void Clean(AudioReader& input, DenoiserProcessor& denoiser, const tWAVEFORMATEX& format, AudioWriter& output,
           AudioWriter* residue, bool quiet) {
    const auto width = static_cast<std::size_t>(format.nChannels);
    std::vector<double> block(kBlock * width), original;
    std::int64_t read = 0, skip = denoiser.GetLatency();
    const auto process = [&](int frames) {
        ProcessBlock(denoiser, block, frames, format);
        const auto skipped = std::min<std::int64_t>(skip, frames);
        skip -= skipped;
        const std::int64_t count = std::min(frames - skipped, read - output.FramesWritten());
        if (count <= 0) return;
        double* const cleaned = block.data() + width * static_cast<std::size_t>(skipped);
        output.Write(cleaned, count);
        if (!residue) return;
        const std::size_t samples = width * static_cast<std::size_t>(count);
        for (std::size_t i = 0; i < samples; ++i) cleaned[i] = original[i] - cleaned[i];
        original.erase(original.begin(), original.begin() + static_cast<std::ptrdiff_t>(samples));
        residue->Write(cleaned, count);
    };
    Progress progress("denoise", input.Rate(), input.Frames(), quiet);
    while (const int count = input.Read(block.data(), kBlock)) {
        read += count;
        if (residue)
            original.insert(original.end(), block.begin(),
                            block.begin() + static_cast<std::ptrdiff_t>(width) * count);
        process(count);
        progress.Update(read);
    }
    while (output.FramesWritten() < read) {
        std::ranges::fill(block, 0.0);
        process(kBlock);
    }
}

}  // namespace

void RunDenoise(DenoiseArguments arguments) {
    const bool learns = !arguments.learn.empty(), learned = learns || !arguments.profile.empty();
    ParsePassages(arguments.learn);
    const bool standardInput = arguments.input == "-";
    std::error_code error;
    if (learns && (standardInput || std::filesystem::is_other(PathOf(arguments.input), error)))
        throw UserError("--learn reads the recording twice, which " +
                        (standardInput ? "standard input" : arguments.input) +
                        " does not allow; accepted: a file");
    if (!arguments.saveProfile.empty() && !learned)
        throw UserError("--save-profile has nothing to save without --learn or --profile");
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    auto& rules = arguments.writing.rules;
    rules.inputs = {arguments.input, arguments.profile};
    RefuseSameOutputs({arguments.output, arguments.residue, arguments.saveProfile});

    DenoiserProcessor denoiser;
    if (!arguments.profile.empty()) LoadNoiseProfile(denoiser, arguments.profile);
    ApplySettings(denoiser, arguments.settings, learned);
    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, kMostChannels, "noise is reduced in mono and stereo");
    const auto format = ChainFormat(input.Channels(), input.Rate(), kPrecision);
    const AudioWriterOptions writing{input.Channels(), input.Rate(), asked, input.Format(), input.Frames()};
    AudioWriter output(arguments.output, rules, writing);
    std::optional<AudioWriter> residue;
    if (!arguments.residue.empty()) residue.emplace(arguments.residue, rules, writing);
    std::optional<OutputFile> profile;
    if (!arguments.saveProfile.empty()) profile.emplace(arguments.saveProfile, rules);

    denoiser.InitProcessing(kBlock, &format);
    if (learns) Learn(denoiser, arguments, format);
    if (profile) {
        std::vector<std::uint8_t> chunk;
        denoiser.GetSettingsChunk(chunk);
        profile->Bytes().Write(chunk.data(), chunk.size());
    }
    denoiser.InitProcessing(kBlock, &format);  // the recording begins
    Clean(input, denoiser, format, output, residue ? &*residue : nullptr, arguments.writing.quiet);
    std::vector<OutputFile*> together{&output.Complete()};
    if (residue) together.push_back(&residue->Complete());
    if (profile) together.push_back(&*profile);
    CommitTogether(together);
    WarnOfClipping(output);
}

}  // namespace dsphost
