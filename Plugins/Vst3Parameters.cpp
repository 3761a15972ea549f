#include "Vst3Parameters.h"

#include <algorithm>
#include <charconv>
#include <cmath>

#include "Vst3Text.h"

namespace Corvo::Plugins {
namespace {

constexpr double kMostFrames = 1 << 20;
const std::string kSwitchTexts[]{"Off", "On"};

// The unit that the texts of a port end with; empty where they do not all, or show no number.
std::string UnitOf(Core& core, int index) {
    const Port& port = core.Ports()[static_cast<std::size_t>(index)];
    const std::string ending = " " + port.unit;
    if (port.unit.empty() || !port.isNumber) return {};
    for (int i = 1; i < 8; ++i)
        if (!core.Text(index, port.curve.Number(static_cast<float>(i) / 8.0f)).ends_with(ending)) return {};
    return port.unit;
}

}  // namespace

Vst3Parameters::Vst3Parameters(Core& core) : m_core(core), m_ids{kBypass} {
    for (std::size_t i = 0; i < core.Ports().size(); ++i) {
        m_ids.push_back(static_cast<v3_param_id>(i + 1));
        m_units.push_back(UnitOf(core, static_cast<int>(i)));
    }
    for (int i = 0; i < core.Presets(); ++i) m_programs.push_back(core.PresetName(i));
    if (!m_programs.empty()) m_ids.push_back(kProgram);
    m_ids.push_back(kLatency);
}

std::optional<std::size_t> Vst3Parameters::Find(v3_param_id id) const {
    const auto found = std::ranges::find(m_ids, id);
    if (found == m_ids.end()) return {};
    return static_cast<std::size_t>(found - m_ids.begin());
}

const Port* Vst3Parameters::PortOf(v3_param_id id) const {
    return id > 0 && id <= m_core.Ports().size() ? &m_core.Ports()[id - 1] : nullptr;
}

int Vst3Parameters::Steps(v3_param_id id) const {
    if (id == kBypass) return 1;
    if (id == kProgram) return Programs() - 1;
    const Port* const port = PortOf(id);
    return port && port->whole ? static_cast<int>(port->most - port->least) : 0;
}

bool Vst3Parameters::Info(std::size_t index, v3_param_info& info) const {
    info = {};
    if (index >= Count()) return false;
    const v3_param_id id = info.param_id = m_ids[index];
    const Port* const port = PortOf(id);
    const std::string title = port             ? port->name
                              : id == kBypass  ? "Bypass"
                              : id == kProgram ? "Program"
                                               : "Latency";
    CopyText(info.title, title);
    CopyText(info.short_title, ShortNameOf(title));
    info.step_count = Steps(id);
    info.default_normalised_value = Start(id);
    if (id == kBypass) info.flags = V3_PARAM_CAN_AUTOMATE | V3_PARAM_IS_BYPASS;
    if (id == kProgram) info.flags = V3_PARAM_IS_LIST | V3_PARAM_PROGRAM_CHANGE;
    if (id == kLatency) info.flags = V3_PARAM_READ_ONLY | V3_PARAM_IS_HIDDEN;
    if (!port) return true;
    CopyText(info.units, m_units[id - 1]);
    info.unit_id = port->group + 1;
    if (!port->momentary && !port->isOutput) info.flags |= V3_PARAM_CAN_AUTOMATE;
    if (port->isOutput) info.flags |= V3_PARAM_READ_ONLY;
    if (port->type == EffectParameterType::List) info.flags |= V3_PARAM_IS_LIST;
    return true;
}

double Vst3Parameters::Start(v3_param_id id) const {
    if (const Port* const port = PortOf(id)) return Normalised(id, static_cast<double>(port->start));
    return id == kProgram ? Normalised(id, m_core.StartPreset()) : 0.0;
}

double Vst3Parameters::Plain(v3_param_id id, double normalised) const {
    const Port* const port = PortOf(id);
    const double least = port ? static_cast<double>(port->least) : 0.0;
    if (const int steps = Steps(id); steps > 0)
        return least + std::min<double>(steps, std::floor(normalised * (steps + 1)));
    if (port) return static_cast<double>(port->curve.Number(static_cast<float>(normalised)));
    return id == kLatency ? std::round(normalised * kMostFrames) : 0.0;
}

double Vst3Parameters::Normalised(v3_param_id id, double plain) const {
    const Port* const port = PortOf(id);
    const double least = port ? static_cast<double>(port->least) : 0.0;
    double place = 0.0;
    if (const int steps = Steps(id); steps > 0)
        place = std::round(plain - least) / steps;
    else if (port)
        place = static_cast<double>(port->curve.Place(static_cast<float>(plain)));
    else if (id == kLatency)
        place = plain / kMostFrames;
    return std::clamp(place, 0.0, 1.0);
}

std::string Vst3Parameters::Text(v3_param_id id, double normalised) const {
    const double plain = Plain(id, normalised);
    const auto number = static_cast<int>(plain);
    if (id == kBypass) return kSwitchTexts[number];
    if (id == kProgram) return Program(number);
    if (id == kLatency) return std::to_string(number);
    std::string text = m_core.Text(static_cast<int>(id) - 1, static_cast<float>(plain));
    const std::string& unit = m_units[id - 1];
    if (!unit.empty() && text.ends_with(" " + unit)) text.resize(text.size() - unit.size() - 1);
    return text;
}

std::optional<double> Vst3Parameters::FromText(v3_param_id id, const std::string& text) const {
    for (int i = 0; i <= Steps(id) && !PortOf(id); ++i)
        if (const double value = Normalised(id, i); text == Text(id, value)) return value;
    if (id == kLatency) {
        int frames = 0;
        const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), frames);
        return error == std::errc{} ? std::optional(Normalised(id, frames)) : std::nullopt;
    }
    const Port* const port = PortOf(id);
    if (!port) return {};
    const int index = static_cast<int>(id) - 1;
    const auto isText = [&](const Port::Point& point) { return point.text == text; };
    const std::string& unit = m_units[id - 1];
    const bool complete = unit.empty() || text.ends_with(unit) || std::ranges::any_of(port->points, isText);
    float value = 0.0f;
    if (!m_core.FromText(index, complete ? text : text + " " + unit, value)) return {};
    return Normalised(id, static_cast<double>(value));
}

}  // namespace Corvo::Plugins
