#include "EffectPage.h"

#include <algorithm>

#include "DSP/Effects/ParameterInput.h"
#include "FlowDiagram.h"
#include "Measurements.h"
#include "PageText.h"
#include "Svg.h"

namespace docs {
namespace {

std::string Cells(std::initializer_list<std::string> cells) {
    std::string row = "|";
    for (std::string cell : cells) {
        for (std::size_t at = 0; (at = cell.find('|', at)) != std::string::npos; at += 2)
            cell.insert(at, "\\");
        row.append(" ").append(cell).append(" |");
    }
    return row + '\n';
}

// Side by side in one row, as every control for left and right has the same range.
std::string WithoutSide(std::string label) {
    return label.ends_with(" L") || label.ends_with(" R") ? label.substr(0, label.size() - 2) : label;
}

std::string Range(CorvoEffectBase& effect, int index, const Corvo::DSP::ParameterDescription& parameter) {
    if (parameter.choices.empty()) return Corvo::DSP::AcceptedTexts(effect, index);
    std::string choices;
    for (const auto& choice : parameter.choices) choices += (choices.empty() ? "" : ", ") + choice.text;
    return choices;
}

std::string Shown(CorvoEffectBase& effect, int index) {
    return Corvo::DSP::TextAt(effect, index, effect.GetParam(index));
}

std::string ParameterTable(const EffectKind& kind) {
    const auto effect = Prepared(kind, "", 48000);
    std::string table = Cells({"Parameter", "Range", "At first"}) + Cells({"---", "---", "---"});
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
        table += Cells({name + (sides ? " (L, R)" : ""), Range(*effect, i, parameter), first});
    }
    return table;
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

// A row for each line, "label: settings".
std::string LatencyTable(const EffectKind& kind, std::string_view text) {
    std::string table =
        Cells({"Setting", "44.1 kHz", "48 kHz", "96 kHz"}) + Cells({"---", "---", "---", "---"});
    for (const auto& line : Split(text, "\n")) {
        const auto [label, settings] = NameAndRest(line);
        std::vector<std::string> at;
        for (const int rate : {44100, 48000, 96000}) {
            const int frames = Prepared(kind, settings, rate)->GetLatency();
            at.push_back(Number(frames) + (frames == 1 ? " frame, " : " frames, ") +
                         Number(frames * 1000.0 / rate, 2) + " ms");
        }
        table += Cells({label, at[0], at[1], at[2]});
    }
    return table;
}

std::string Facts(const EffectKind& kind, CorvoEffectBase& effect) {
    const int frames = effect.GetLatency();
    std::string facts = Cells({"", ""}) + Cells({"---", "---"});
    facts += Cells(
        {"Latency at first",
         frames == 0 ? "none" : Number(frames) + " frames at 48 kHz, " + Number(frames / 48.0) + " ms"});
    facts += Cells({"Automation", effect.PlaysAutomation() ? "yes" : "no"});
    facts += Cells({"Side-chain", effect.GetNumSidechainBusses() > 0 ? "yes" : "no"});
    facts += Cells({"Cost", Number(NanosecondsPerFrame(kind)) +
                                " ns per stereo frame at first, on the machine that made this page"});
    return facts;
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
    for (auto& section : sections) {
        section = ReplaceFences(section, "flow", DrawFlow);
        section = ReplaceFences(section, "chart",
                                [&](std::string_view text) { return DrawMeasurement(kind, text); });
        section = ReplaceFences(section, "latency",
                                [&](std::string_view text) { return LatencyTable(kind, text); });
    }
    return "# " + effect->GetName() + "\n" + sections[0] + '\n' + Facts(kind, *effect) +
           "\n## Signal flow\n" + sections[1] + "\n## What it does to sound\n" + sections[2] +
           "\n## Parameters\n\nWith (L, R) each side has its own; `dsphost` and the texts take them as "
           "shown.\n\n" +
           ParameterTable(kind) + "\n## Presets\n\n" + PresetList(*effect) + "\n## Formulae\n" + sections[3] +
           "\n## Latency\n" + sections[4] + "\n## Try it\n" + sections[5];
}

}  // namespace docs
