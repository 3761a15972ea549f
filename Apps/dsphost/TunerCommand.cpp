#include <cmath>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <nlohmann/json.hpp>

#include "Arguments.h"
#include "AudioReader.h"
#include "Errors.h"
#include "File.h"
#include "PictureOptions.h"
#include "Playback.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Text.h"

namespace dsphost {
namespace {

std::vector<std::string> Names(const char* (*nameOf)(int)) {
    std::vector<std::string> names;
    for (int i = 0; *nameOf(i) != '\0'; ++i) names.push_back(nameOf(i));
    return names;
}

// What was heard at one refresh.
struct Heard {
    double seconds, hz;
    float cents;
    int note, octave;
};

// Only what sounds: the panel shows a note for a while longer.
Heard Hear(const Tuner& tuner, double seconds) {
    const bool sounds = tuner.IsTuned() && tuner.GetHeardFrequency() > 0.0;
    return {seconds, tuner.GetFrequency(), tuner.GetErrorCents(), sounds ? tuner.GetNote() : -1,
            tuner.GetOctave()};
}

std::string Json(const std::vector<Heard>& all) {
    auto array = nlohmann::ordered_json::array();
    const auto rounded = [](double value, double steps) { return std::round(value * steps) / steps; };
    for (const Heard& heard : all) {
        nlohmann::ordered_json row{{"time", rounded(heard.seconds, 1000.0)},
                                   {"note", nullptr},
                                   {"cents", nullptr},
                                   {"frequency", nullptr}};
        if (heard.note >= 0) {
            row["note"] = Tuner::GetNoteName(heard.note) + std::to_string(heard.octave);
            row["cents"] = rounded(static_cast<double>(heard.cents), 100.0);
            row["frequency"] = rounded(heard.hz, 1000.0);
        }
        array.push_back(std::move(row));
    }
    return array.dump(1) + "\n";
}

// Says when the panel is worth drawing: at the moment that was asked for, or as the longest note so far goes
// on.
class Moment {
public:
    explicit Moment(std::optional<double> at) : m_at(at) {}

    bool IsNow(const Heard& heard) {
        if (m_at) return std::exchange(m_before, heard.seconds) < *m_at && heard.seconds >= *m_at;
        const bool same = heard.note == m_note && heard.octave == m_octave;
        m_note = heard.note;
        m_octave = heard.octave;
        m_length = same ? m_length + 1 : 1;
        // Now and then is enough: a long note is drawn many times otherwise.
        constexpr int kRefreshes = 6;
        if (heard.note < 0 || m_length < m_longest + kRefreshes) return false;
        m_longest = m_length;
        return true;
    }

private:
    std::optional<double> m_at;
    double m_before = -1.0;
    int m_note = -1, m_octave = 0, m_length = 0, m_longest = 0;
};

class Listener {
public:
    explicit Listener(const TunerArguments& arguments)
        : m_arguments(arguments), m_input(arguments.input, arguments.spoolLimit) {
        RequireFormat(m_input, kMostChannels, "the analyser takes the mean of up to 64");
        m_analyser.set_parameters(m_input.Rate());
        m_analyser.SetOn(true);
        m_analyser.SetTunerOn(true);
        UseTunerWindow(m_input.Rate());
        kivspectrum::SetAnalysisWindowsOverlap(kDisplayOverlap);
        m_analyser.ObserverUpdate();
    }

    // each(seconds) at every refresh.
    template <typename Each>
    void Play(Each each) {
        PlayThrough(m_input, m_analyser, "tuner", m_arguments.writing.quiet, true, [&](double seconds) {
            if (m_analyser.Refresh()) each(seconds);
        });
    }
    kivspectrum& Analyser() { return m_analyser; }

private:
    const TunerArguments& m_arguments;
    AudioReader m_input;
    kivspectrum m_analyser;
};

}  // namespace

const std::vector<std::string>& DetectionMethods() {
    static const std::vector<std::string> methods{"denoised", "harmonic-product", "pseudo-harmonic-product",
                                                  "legacy", "two-way-mismatch"};
    return methods;
}

void RunTuner(TunerArguments arguments) {
    arguments.writing.rules.inputs = {arguments.input, arguments.drawing.font};
    const auto temperaments = Names(Tuner::GetTemperamentName);
    const auto sensitivities = Names(Tuner::GetSensibilityPresetName);
    Tuner::SetDetectionMethod(static_cast<int>(FindName(arguments.method, DetectionMethods(), "method")));
    Tuner::SetTemperament(static_cast<int>(FindName(arguments.temperament, temperaments, "temperament")));
    const auto sensitivity = static_cast<int>(FindName(arguments.sensitivity, sensitivities, "sensitivity"));
    if (arguments.at && !(*arguments.at >= 0.0))
        throw UserError("--at cannot be " + ToText(*arguments.at) + "; accepted: 0 seconds or more");
    if (arguments.json && arguments.output == "-")
        throw UserError("picture and notes cannot both go to standard output");
    const auto picture = arguments.drawing.Make();
    Listener listener(arguments);
    arguments.drawing.ApplyTo(listener.Analyser());
    const auto output = OpenPicture(arguments.output, arguments.writing.rules);
    listener.Analyser().GetTuner()->SetSensibilityPreset(sensitivity);
    Moment moment(arguments.at);
    std::vector<Heard> all;
    bool drawn = false;
    const auto draw = [&] {
        picture->Paint(
            [&](auto& target) { listener.Analyser().DrawTuner<PictureDrawing>(target, picture->Whole()); });
        drawn = true;
    };
    listener.Play([&](double seconds) {
        all.push_back(Hear(*listener.Analyser().GetTuner(), seconds));
        if (moment.IsNow(all.back())) draw();
    });
    if (!drawn && arguments.at)
        throw UserError("--at cannot be " + ToText(*arguments.at) + "; the file ends before");
    if (!drawn) draw();
    Write(*picture, *output);
    // First, so that there is no picture when it fails.
    if (arguments.json) Print(Json(all));
    output->Commit();
}

}  // namespace dsphost
