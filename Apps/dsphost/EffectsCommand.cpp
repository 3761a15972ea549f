#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "Arguments.h"
#include "EffectParameters.h"
#include "EffectTable.h"
#include "EqualiserElement.h"
#include "Process.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::EffectParameterType;
using Json = nlohmann::ordered_json;

constexpr int kFrames = 512;
constexpr tWAVEFORMATEX kFormat{3, 2, 48000, 48000 * 16, 16, 64, 0};

const char* TypeName(EffectParameterType type) {
    switch (type) {
        case EffectParameterType::Switch:
            return "switch";
        case EffectParameterType::List:
            return "list";
        default:
            return "continuous";
    }
}

// In the state it starts from, prepared for a stereo stream at 48 kHz: a latency may depend on the format.
std::unique_ptr<Effect> Prepared(EffectFactory factory) {
    auto effect = MakeEffect(factory);
    effect->InitProcessing(kFrames, &kFormat);
    return effect;
}

std::vector<std::string> Presets(Effect& effect) {
    std::vector<std::string> names;
    for (int i = 0; i < effect.NumPresets(); ++i) names.push_back(effect.GetPresetName(i));
    return names;
}

std::vector<std::string> ListTexts(const EffectParameter& parameter) {
    std::vector<std::string> texts;
    if (parameter.type == EffectParameterType::List)
        for (const auto& choice : parameter.choices) texts.push_back(choice.text);
    return texts;
}

Json Describe(EffectFactory factory) {
    const auto effect = Prepared(factory);
    Json parameters = Json::array();
    for (const auto& parameter : DescribeParameters(factory))
        parameters.push_back({{"index", parameter.index},
                              {"name", parameter.label},
                              {"unit", parameter.unit},
                              {"type", TypeName(parameter.type)},
                              {"default", effect->GetParam(parameter.index)},
                              {"text", CurrentText(*effect, parameter)},
                              {"values", ListTexts(parameter)}});
    return {{"name", effect->GetName()},
            {"latency", effect->GetLatency()},
            {"default_preset", effect->GetDefaultPreset()},
            {"presets", Presets(*effect)},
            {"parameters", parameters}};
}

std::string Padded(std::string text, std::size_t width) {
    // Columns count characters, not the bytes of their UTF-8.
    const auto characters = static_cast<std::size_t>(
        std::ranges::count_if(text, [](char c) { return (static_cast<unsigned char>(c) & 0xC0) != 0x80; }));
    return text.append(width > characters ? width - characters : 0, ' ');
}

// Rows of cells as aligned columns.
std::string Table(const std::vector<std::vector<std::string>>& rows) {
    std::vector<std::size_t> widths(rows.front().size());
    for (const auto& row : rows)
        for (std::size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], row[i].size());
    std::string text;
    for (const auto& row : rows) {
        std::string line;
        for (std::size_t i = 0; i < row.size(); ++i) line.append("  ").append(Padded(row[i], widths[i]));
        text += line.substr(0, line.find_last_not_of(' ') + 1) + "\n";
    }
    return text;
}

std::string Explain(EffectFactory factory) {
    const auto effect = Prepared(factory);
    const auto scratch = MakeEffect(factory);
    const auto shown = [](const std::string& text) { return std::string(Trimmed(text)); };
    std::vector<std::vector<std::string>> rows{
        {"", "parameter", "unit", "at 0", "neutral", "at 1", "default"}};
    for (const auto& parameter : DescribeParameters(factory)) {
        const auto at = [&](float n) {
            std::string text = shown(TextAt(*scratch, parameter, n));
            scratch->SetParam(parameter.index, effect->GetParam(parameter.index), false);
            return text;
        };
        rows.push_back({std::to_string(parameter.index), parameter.label, shown(parameter.unit), at(0.0f),
                        at(parameter.neutral), at(1.0f), shown(CurrentText(*effect, parameter))});
    }
    std::string text = effect->GetName() + ", latency " + std::to_string(effect->GetLatency()) +
                       " frames at 48 kHz\n\n" + Table(rows);
    for (const auto& parameter : DescribeParameters(factory))
        if (const auto texts = ListTexts(parameter); !texts.empty())
            text += "\n  " + parameter.label + ": " + Joined(texts, ", ");
    const auto presets = Presets(*effect);
    text += presets.empty() ? "\nNo presets.\n" : "\nPresets (* is where a new instance starts):\n";
    for (std::size_t i = 0; i < presets.size(); ++i) {
        text += static_cast<int>(i) == effect->GetDefaultPreset() ? "* " : "  ";
        text += presets[i];
        text += '\n';
    }
    return text;
}

std::string Overview() {
    std::vector<std::vector<std::string>> rows{{"effect", "parameters", "presets", "latency"}};
    for (const auto factory : EffectFactories()) {
        const auto effect = Prepared(factory);
        rows.push_back({effect->GetName(), std::to_string(effect->GetParamCount()),
                        std::to_string(effect->NumPresets()), std::to_string(effect->GetLatency())});
    }
    rows.push_back({EqualiserElement::kName, "bands", "0", "0"});
    return Table(rows);
}

// The equaliser has bands where effects have parameters.
constexpr const char* kBandForm = "FREQ TYPE [GAIN_DB] [q=Q]";

Json DescribeEqualiser() {
    return {{"name", EqualiserElement::kName},
            {"latency", 0},
            {"presets", Json::array()},
            {"parameters", Json::array()},
            {"bands",
             {{"form", kBandForm},
              {"most", Corvo::DSP::builtin_effects_data::kMaxBands},
              {"types", FilterTypes()}}}};
}

std::string ExplainEqualiser() {
    const std::string most = std::to_string(Corvo::DSP::builtin_effects_data::kMaxBands);
    return std::string(EqualiserElement::kName) + ", latency 0 frames\n\nUp to " + most +
           " bands with semicolons between them: \"EQ: 80 highpass; 2500 peak -3 q=200\"\n\n" +
           "  FREQ      in whole Hz, 1 to 1000000\n  TYPE      " + Joined(FilterTypes(), ", ") +
           "\n  GAIN_DB   -100 to 100 in steps of 0.1, 0 when left out\n" +
           "  q=Q       1 to 100000, what suits the type when left out\n";
}

}  // namespace

void RunEffects(EffectsArguments arguments) {
    auto factories = EffectFactories();
    bool equaliser = true;
    if (!arguments.effect.empty()) {
        std::vector<std::string> names(EffectNames().begin(), EffectNames().end());
        names.emplace_back(EqualiserElement::kName);
        const std::size_t found = FindName(arguments.effect, names, "effect");
        equaliser = found == factories.size();
        factories = factories.subspan(found, equaliser ? 0 : 1);
    }
    if (arguments.json) {
        Json all = Json::array();
        for (const auto factory : factories) all.push_back(Describe(factory));
        if (equaliser) all.push_back(DescribeEqualiser());
        return Print(all.dump(2) + "\n");
    }
    if (arguments.effect.empty()) return Print(Overview());
    Print(equaliser ? ExplainEqualiser() : Explain(factories.front()));
}

}  // namespace dsphost
