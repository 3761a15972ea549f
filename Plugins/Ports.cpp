#include "Ports.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <mutex>
#include <utility>

namespace Corvo::Plugins {

using DSP::CorvoEffectBase;

// A control of so few steps jumps; others glide.
constexpr float kMostSteps = 30.0f;

// Reads the ports of an effect from its own descriptions and texts.
struct LayoutMaker {
    const PluginRow& row;
    int channels;
    std::unique_ptr<CorvoEffectBase> fresh = row.Make(), tried = row.Make();
    Layout layout{};

    // The other one of a pair; -1 for none.
    int OtherSide(int parameter) {
        const auto name = fresh->Describe(parameter).name;
        for (int i = 0; i < fresh->GetParamCount(); ++i)
            if (i != parameter && fresh->Describe(i).name == name) return i;
        return -1;
    }

    // Sides are told apart only where the plug-in has both, and where they are two parameters indeed.
    bool IsSecondSide(int parameter) {
        const auto description = fresh->Describe(parameter);
        const int first = OtherSide(parameter);
        if (first < 0) return false;
        if (fresh->Describe(first).label == description.label) return parameter > first;
        const bool right = description.label.ends_with(" R");
        return right && (channels == 1 || Follows(parameter, first));
    }
    bool Follows(int second, int first) {
        for (const float position : {0.0f, 1.0f}) {
            tried->SetParam(first, position, false);
            if (tried->GetParam(second) != position) return false;
        }
        return true;
    }
    // Switched on, an action is off again in what is stored.
    bool IsAction(int parameter) {
        std::vector<std::uint8_t> chunk;
        tried->SetParam(parameter, 1.0f, false);
        tried->GetSettingsChunk(chunk);
        const auto other = row.Make();
        other->SetSettingsChunk(chunk);
        return other->GetParam(parameter) == 0.0f;
    }

    void SetChoices(Port& port, const DSP::ParameterDescription& description) {
        port.momentary = port.type == EffectParameterType::Switch && IsAction(port.parameter);
        port.springsBack = port.momentary && tried->GetParam(port.parameter) == 0.0f;
        for (const auto& choice : description.choices) {
            port.points.push_back({choice.text, static_cast<float>(port.points.size())});
            port.m_choices.push_back(choice.normalised);
        }
        port.most = static_cast<float>(port.points.size()) - 1.0f;
        port.whole = true;
        for (const auto& point : port.points)
            port.comment.append(port.comment.empty() ? "" : ", ").append(point.text);
    }

    void SetRange(Port& port, const DSP::ParameterDescription& description) {
        auto read = CurveOf(*tried, port.parameter);
        if (!read.isNumber) read.curve = Curve(0.0, 100.0, 0.0);  // the knob's position
        port.unit.assign(read.isNumber ? description.unit : std::string(1, '%'));
        port.curve = read.curve;
        port.least = port.curve.Least();
        port.most = port.curve.Most();
        port.isNumber = read.isNumber;
        port.resolution = read.isNumber ? read.Resolution() * (read.keepsFractions ? 0.01 : 1.0) : 1e-4;
        port.whole = read.isNumber && !read.keepsFractions && read.decimals == 0 &&
                     port.most - port.least <= kMostSteps;
        // What shows no number may choose among notes: a glide would play those in between.
        port.glides = read.isNumber && !port.whole && !row.Is(kSmooth);
        const float middle = port.curve.Number(0.5f), product = port.least * port.most;
        port.logarithmic = port.least > 0.0f && std::abs(middle - std::sqrt(product)) <
                                                    std::abs(middle - 0.5f * (port.least + port.most));
        if (!read.endTexts[0].empty()) port.points.push_back({read.endTexts[0], port.least});
        if (!read.endTexts[1].empty()) port.points.push_back({read.endTexts[1], port.most});
        port.comment = ShownAt(*tried, port.parameter, 0.0f);
        port.comment.append(" to ").append(ShownAt(*tried, port.parameter, 1.0f));
        if (!read.isNumber) port.comment.append(", with the settings of a new instance");
    }

    int GroupOf(int parameter) {
        const auto sections = fresh->GetParamUiSections();
        PluginParameterInfo info;
        info.layout_group = -1;
        fresh->GetParamSectionInfo(parameter, info);
        if (info.layout_group < 0 || static_cast<std::size_t>(info.layout_group) >= sections.size())
            return -1;
        const auto& title = sections[static_cast<std::size_t>(info.layout_group)];
        const auto found = std::ranges::find(layout.groups, title);
        if (found == layout.groups.end()) layout.groups.push_back(title);
        return static_cast<int>(std::ranges::find(layout.groups, title) - layout.groups.begin());
    }

    Layout Make() {
        for (int parameter = 0; parameter < fresh->GetParamCount(); ++parameter) {
            if (IsSecondSide(parameter)) continue;
            const auto description = fresh->Describe(parameter);
            const int other = OtherSide(parameter);
            const bool isApart = other >= 0 && !IsSecondSide(other);
            tried = row.Make();
            Port port;
            port.parameter = parameter;
            if (channels == 1) port.second = other;
            port.name = isApart ? description.label : description.name;
            port.symbol = SymbolOf(port.name);
            port.type = description.type;
            port.group = GroupOf(parameter);
            if (description.type == EffectParameterType::Continuous)
                SetRange(port, description);
            else
                SetChoices(port, description);
            port.isIdle = channels == 1 && port.name.starts_with("Stereo ");
            port.start = port.ValueOf(*fresh);
            layout.ports.push_back(std::move(port));
        }
        if (row.results)
            for (const ResultPort& result : row.results->ports) layout.ports.push_back(OutputPort(result));
        return std::move(layout);
    }
};

float Port::Position(float value) const {
    if (m_choices.empty()) return curve.Position(value);
    const auto last = static_cast<float>(m_choices.size() - 1);
    return m_choices[static_cast<std::size_t>(std::lround(std::clamp(value, 0.0f, last)))];
}

float Port::Value(float position) const {
    if (m_choices.empty())
        // Plus 0, for no negative one.
        return static_cast<float>(
            std::round(static_cast<double>(curve.Number(position)) / resolution) * resolution + 0.0);
    const auto distance = [position](float choice) { return std::abs(choice - position); };
    return static_cast<float>(std::ranges::min_element(m_choices, {}, distance) - m_choices.begin());
}

void Port::SetOn(CorvoEffectBase& effect, float position, bool automated) const {
    effect.SetParam(parameter, position, automated);
    if (second >= 0) effect.SetParam(second, position, automated);
}

float Port::ValueOf(CorvoEffectBase& effect) const {
    const float position = effect.GetParam(parameter);
    float number = 0.0f;
    if (isNumber && ReadNumber(Shown(effect, parameter, position), number))
        return std::clamp(number, least, most);
    return Value(position);
}

const Layout& LayoutOf(const PluginRow& row, int channels) {
    static std::mutex mutex;
    static std::map<std::pair<const PluginRow*, int>, Layout> layouts;
    const std::lock_guard lock(mutex);
    const auto [found, isNew] = layouts.try_emplace({&row, channels});
    if (isNew) found->second = LayoutMaker{row, channels}.Make();
    return found->second;
}

}  // namespace Corvo::Plugins
