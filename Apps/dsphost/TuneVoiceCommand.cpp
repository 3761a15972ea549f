#include <algorithm>
#include <cmath>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "Chain.h"
#include "DSP/Effects/PitchDoctor/PitchDoctor.h"
#include "EffectParameters.h"
#include "Errors.h"
#include "Progress.h"
#include "Render.h"
#include "Scale.h"
#include "Text.h"
#include "TuneVoiceNotes.h"
#include "TuneVoicePicture.h"

// The effect publishes its readings while an editor is set. This is ours: it takes them between blocks.
class BuiltinEditor {};

namespace dsphost {
namespace {

using Corvo::DSP::PitchDoctor;
using Corvo::DSP::PitchReading;

constexpr int kMostChannels = 2;
constexpr double kLongestPause = 0.03;  // seconds that do not end a note
constexpr double kShortestNote = 0.06;

// The effect as a station of a chain, which keeps what it heard.
class VoiceTuner : public ChainElement {
public:
    VoiceTuner(const TuneVoiceArguments& arguments, std::vector<PitchReading>& readings)
        : m_readings(readings) {
        m_effect.SetEditor(&m_editor);
        m_parameters = DescribeParameters(*Corvo::DSP::FindEffectKind(Name()));
        const Scale scale = ParseScale(arguments.scale, m_effect);
        Set("Scale root", scale.root);
        Set("Scale mode", scale.mode);
        Set("Retune speed", arguments.retune);
        Set("Note transition time", arguments.transition);
        Set("Correction ratio", arguments.ratio);
        Set("Lowest pitch", arguments.lowest);
    }

    std::string Name() const override { return "Cantrix"; }
    bool Prepare(int maxFrames, const tWAVEFORMATEX& format, bool) override {
        m_format = format;
        m_effect.InitProcessing(maxFrames, &m_format);
        return false;
    }
    int Latency() override { return m_effect.GetLatency(); }
    void Process(double* samples, int frames, std::int64_t) override {
        Corvo::DSP::ProcessFlags flags;
        m_effect.Process(samples, frames, &m_format, flags);
        m_effect.TakeReadings(m_readings);
    }

private:
    void Set(const char* label, const std::string& text) {
        if (text.empty()) return;
        std::string warning;
        for (const auto* parameter : FindParameters(m_effect, m_parameters, label))
            m_effect.SetParam(parameter->index, ParseValue(m_effect, *parameter, text, warning), false);
        if (!warning.empty()) PrintMessage("warning: " + warning);
    }

    PitchDoctor m_effect;
    BuiltinEditor m_editor;
    std::vector<EffectParameter> m_parameters;
    std::vector<PitchReading>& m_readings;
    tWAVEFORMATEX m_format{};
};

bool IsMidi(const std::string& path) {
    const auto ends = [&](std::string_view ending) {
        return path.size() >= ending.size() && SameNoCase(path.substr(path.size() - ending.size()), ending);
    };
    if (ends(".mid") || ends(".midi")) return true;
    if (ends(".csv") || path == "-") return false;
    throw UserError("--notes cannot be \"" + path + "\"; accepted: a name that ends in .csv, .mid or .midi");
}

}  // namespace

void RunTuneVoice(TuneVoiceArguments arguments) {
    auto& rules = arguments.writing.rules;
    rules.inputs = {arguments.input, arguments.drawing.font};
    RefuseSameOutputs({arguments.output, arguments.notes, arguments.curve});
    std::optional<SampleFormat> asked;
    if (!arguments.format.empty()) asked = ParseSampleFormat(arguments.format);
    const bool midi = !arguments.notes.empty() && IsMidi(arguments.notes);

    VoiceCurve curve;
    std::vector<std::unique_ptr<ChainElement>> elements;
    elements.push_back(std::make_unique<VoiceTuner>(arguments, curve.readings));
    Chain chain(std::move(elements));
    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, kMostChannels, "the pitch is corrected in mono and stereo");
    std::unique_ptr<Picture> picture;
    std::unique_ptr<OutputFile> drawing;
    std::optional<OutputFile> notes;
    if (!arguments.curve.empty()) {
        picture = arguments.drawing.Make();
        drawing = OpenPicture(arguments.curve, rules);
    }
    if (!arguments.notes.empty()) notes.emplace(arguments.notes, rules);
    const RenderOptions options;
    chain.Prepare(options.block, ChainFormat(input.Channels(), input.Rate(), options.precision), false);
    AudioWriter output(arguments.output, rules,
                       {input.Channels(), input.Rate(), asked, input.Format(), input.Frames()});
    {
        Progress progress("tune-voice", input.Rate(), input.Frames(), arguments.writing.quiet);
        Render(input, chain, output, options, [&](std::int64_t frames) { progress.Update(frames); });
    }
    curve.rate = input.Rate();
    curve.seconds = static_cast<double>(output.FramesWritten()) / curve.rate;
    curve.notes = NotesOf(curve.readings, std::llround(kLongestPause * curve.rate),
                          std::llround(kShortestNote * curve.rate));
    for (auto& note : curve.notes) {  // the voice may sound to the end, and is heard a little later
        note.start = std::min(note.start, output.FramesWritten());
        note.end = std::min(note.end, output.FramesWritten());
    }
    curve.title = arguments.scale;
    std::vector<OutputFile*> together{&output.Complete()};
    if (notes) {
        const auto bytes = midi ? NotesAsMidi(curve.notes, curve.rate) : NotesAsCsv(curve.notes, curve.rate);
        notes->Bytes().Write(bytes.data(), bytes.size());
        together.push_back(&*notes);
    }
    if (picture) {
        picture->Paint([&](auto& target) { DrawVoiceCurve(target, picture->Whole(), curve); });
        Write(*picture, *drawing);
        together.push_back(drawing.get());
    }
    CommitTogether(together);
    WarnOfClipping(output);
}

}  // namespace dsphost
