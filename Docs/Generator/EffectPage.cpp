#include "EffectPage.h"

#include <algorithm>
#include <filesystem>

#include "DSP/Effects/ParameterInput.h"
#include "FlowDiagram.h"
#include "Measurements.h"
#include "PageText.h"
#include "Svg.h"

namespace docs {
namespace {

// Side by side in one row, as every control for left and right has the same range.
std::string WithoutSide(std::string label) {
    return label.ends_with(" L") || label.ends_with(" R") ? label.substr(0, label.size() - 2) : label;
}

// Where a list decides how the parameter reads, the range with each of its choices.
std::string Range(const EffectKind& kind, CorvoEffectBase& effect, int index) {
    if (!effect.Describe(index).choices.empty()) return Corvo::DSP::AcceptedTexts(effect, index);
    const std::string range = Corvo::DSP::AcceptedTexts(effect, index);
    for (int list = 0; list < effect.GetParamCount(); ++list) {
        std::string ranges;
        bool differ = false;
        for (const auto& choice : effect.Describe(list).choices) {
            const auto other = Prepared(kind, "", 48000);
            other->SetParam(list, choice.normalised, false);
            const std::string with = Corvo::DSP::AcceptedTexts(*other, index);
            differ |= with != range;
            ranges.append(ranges.empty() ? "" : "; ").append(choice.text).append(": ").append(with);
        }
        if (differ) return ranges;
    }
    return range;
}

// As the effect itself shows it, also where no control could set it.
std::string Shown(CorvoEffectBase& effect, int index) {
    // A path knows how to make UTF-8 of it.
    const std::filesystem::path text(effect.GetParameterFormattedText(index, effect.GetParam(index)));
    return Split(text.string(), "\n").at(0);
}

std::string Parameters(const EffectKind& kind) {
    const auto effect = Prepared(kind, "", 48000);
    std::string table = Headings({"Parameter", "Range", "Default"}), pair;
    std::vector<std::string> told;
    for (int i = 0; i < effect->GetParamCount(); ++i) {
        const auto parameter = effect->Describe(i);
        const std::string name = WithoutSide(parameter.label);
        if (std::ranges::find(told, name) != told.end()) continue;
        told.push_back(name);
        std::string first = Shown(*effect, i);
        bool sides = false;
        for (int j = i + 1; j < effect->GetParamCount(); ++j) {
            const auto other = effect->Describe(j).label;
            if (WithoutSide(other) != name || other == parameter.label) continue;
            sides = true;
            if (const auto text = Shown(*effect, j); text != first) {
                const bool left = parameter.label.ends_with(" L");
                first = (left ? first : text) + " left, " + (left ? text : first) + " right";
            }
        }
        if (sides && pair.empty()) pair = name;
        table += Cells({name + (sides ? " (L, R)" : ""), Range(kind, *effect, i), first});
    }
    if (pair.empty()) return table;
    return "(L, R): left and right are set apart, as `" + pair + " L` and `" + pair + " R`; `" + pair +
           "` sets both.\n\n" + table;
}

std::string PresetList(CorvoEffectBase& effect) {
    if (effect.NumPresets() == 0) return "None: it starts with the settings above.\n";
    std::string list;
    for (int i = 0; i < effect.NumPresets(); ++i) {
        const std::string mark = i == effect.GetDefaultPreset() ? "**" : "";
        list.append(i == 0 ? "" : " · ").append(mark).append(effect.GetPresetName(i)).append(mark);
    }
    return list + "\n\nA new instance starts from the one in bold.\n";
}

std::string Cost(const EffectKind& kind, std::string_view settings) {
    return Number(NanosecondsPerFrame(kind, settings));
}

// Both have a row for each line, "label: settings".
std::string LatencyTable(const EffectKind& kind, std::string_view text) {
    std::string table = Headings({"Setting", "44.1 kHz", "48 kHz", "96 kHz", "ns per stereo frame"});
    for (const auto& line : Split(text, "\n")) {
        const auto [label, settings] = NameAndRest(line);
        std::vector<std::string> at;
        for (const int rate : {44100, 48000, 96000}) {
            const int frames = Prepared(kind, settings, rate)->GetLatency();
            at.push_back(Number(frames) + (frames == 1 ? " frame, " : " frames, ") +
                         Number(frames * 1000.0 / rate, 2) + " ms");
        }
        table += Cells({label, at[0], at[1], at[2], Cost(kind, settings)});
    }
    return table;
}
std::string CostTable(const EffectKind& kind, std::string_view text) {
    std::string table = Headings({"Setting", "ns per stereo frame"});
    for (const auto& line : Split(text, "\n")) {
        const auto [label, settings] = NameAndRest(line);
        table += Cells({label, Cost(kind, settings)});
    }
    return table;
}

Facts FactsOf(const EffectKind& kind, CorvoEffectBase& effect, bool hasTable) {
    const int frames = effect.GetLatency();
    const std::string with =
        effect.NumPresets() > 0 ? " with the default preset" : " with the settings it starts with";
    return {(frames == 0 ? "none" : Number(frames) + " frames at 48 kHz, " + Number(frames / 48.0) + " ms,") +
                with,
            effect.PlaysAutomation() ? "yes" : "no", effect.GetNumSidechainBusses() > 0 ? "yes" : "no",
            Cost(kind, "") + " ns per stereo frame" + with +
                (hasTable ? " ([with other settings](#latency-and-cost))" : "")};
}

}  // namespace

std::string FileName(const std::string& effect) {
    std::string name;
    for (const char c : effect)
        name += c == ' ' ? '-' : c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
    return name;
}

std::string EffectPage(const EffectKind& kind, const std::string& textPath) {
    const auto effect = Prepared(kind, "", 48000);
    auto sections = ReadSections(
        textPath, {"Good for", "Signal flow", "What it does to sound", "Formulae", "Latency", "Try it"});
    const bool hasTable = sections[4].find("```") != std::string::npos;
    for (auto& section : sections) {
        section = ReplaceFences(section, "flow", DrawFlow);
        section = ReplaceFences(section, "chart",
                                [&](std::string_view text) { return DrawMeasurement(kind, text); });
        section = ReplaceFences(section, "latency",
                                [&](std::string_view text) { return LatencyTable(kind, text); });
        section =
            ReplaceFences(section, "cost", [&](std::string_view text) { return CostTable(kind, text); });
    }
    return "# " + effect->GetName() + "\n" + sections[0] + '\n' +
           FactsTable(FactsOf(kind, *effect, hasTable)) + "\n## Signal flow\n" + sections[1] +
           "\n## What it does to sound\n" + sections[2] + "\n## Parameters\n\n" + Parameters(kind) +
           "\n## Presets\n\n" + PresetList(*effect) + "\n## Formulae\n" + sections[3] + "\n## Latency" +
           (hasTable ? " and cost" : "") + '\n' + sections[4] + TryIt(sections[5]);
}

}  // namespace docs
