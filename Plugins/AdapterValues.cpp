#include <algorithm>
#include <cmath>
#include <stdexcept>

#include "Adapter.h"
#include "DSP/Effects/SettingsInput.h"

// The values of the ports: what the host wants, what the effect has, and what a session keeps.
namespace Corvo::Plugins {

// The values that the effect has, after it changed as a whole.
void Adapter::ReadBack() {
    m_gliding = 0;
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        const Port& port = Ports()[i];
        Control& control = m_controls[i];
        control.position = control.target = m_effect->GetParam(port.parameter);
        control.wanted = port.ValueOf(*m_effect);
        control.edited = control.touched = false;
        control.stepsLeft = 0;
    }
    m_edits = false;
}

void Adapter::Set(int index, float value) {
    if (static_cast<std::size_t>(index) >= m_controls.size()) return;
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    Control& control = m_controls[static_cast<std::size_t>(index)];
    if (!std::isfinite(value)) return;
    value = std::clamp(value, port.least, port.most);
    if (port.whole) value = std::round(value);
    // Hosts write numbers as text; what comes back must not edit settings that are finer than a port.
    const float before = control.wanted;
    if (std::abs(value - before) <= 1e-6f * (std::abs(before) + port.most - port.least)) return;
    control.wanted = value;
    control.edited = true;
    m_edits = true;
}

void Adapter::Recall(const std::vector<float>& values) {
    const auto copy = Copy();
    for (std::size_t i = 0; i < m_controls.size() && i < values.size(); ++i) {
        const Port& port = Ports()[i];
        const float value = std::clamp(values[i], port.least, port.most);
        if (!std::isfinite(values[i]) || port.momentary) continue;
        const float before = copy->GetParam(port.parameter);
        port.SetOn(*copy, port.Position(value), false);
        if (copy->GetParam(port.parameter) == before) m_controls[i].wanted = value;
    }
}

float Adapter::Value(int port) const {
    const auto index = static_cast<std::size_t>(port);
    return index < m_controls.size() ? m_controls[index].wanted : m_told[index - m_controls.size()];
}

// A list is set as by a user: some effects make things ready then. Nothing else happens at the same time.
void Adapter::Apply(std::size_t index, float position) {
    const Port& port = Ports()[index];
    m_controls[index].position = position;
    const bool automated = port.type != EffectParameterType::List && m_longest > 0;
    port.SetOn(*m_effect, position, automated);
}

// Of the lists, or of all others. Whether there were any.
bool Adapter::TakeEditsOf(bool lists, bool glide) {
    bool any = false;
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        const Port& port = Ports()[i];
        if ((port.type == EffectParameterType::List) != lists || !control.edited.exchange(false)) continue;
        any = true;
        control.target = port.Position(control.wanted);
        const bool glides = glide && port.glides;
        m_gliding += static_cast<int>(glides) - static_cast<int>(control.stepsLeft > 0);
        control.stepsLeft = glides ? m_glideSteps : 0;
        control.touched = true;
        if (!glides) Apply(i, control.target);
        if (!port.springsBack) continue;
        control.wanted = port.start;
        m_otherValues = true;
    }
    return any;
}

void Adapter::ReadBackOthers() {
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        if (control.stepsLeft > 0 || control.edited) continue;
        const Port& port = Ports()[i];
        const float position = m_effect->GetParam(port.parameter);
        const bool moved = port.type == EffectParameterType::Continuous && position != control.position;
        control.touched = moved && position >= 1.0f;
        // It may lie beyond the end of its control: no state with it would be taken again.
        if (control.touched) Apply(i, 1.0f);
        const float value = port.Value(position), before = control.wanted;
        const double step =
            std::max(1.01 * port.resolution, 5e-4 * static_cast<double>(port.most - port.least));
        control.position = control.target = position;
        if (std::abs(value - before) <= static_cast<float>(step)) continue;
        control.wanted = value;
        m_otherValues = true;
    }
}

void Adapter::KeepOthers() {
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        if (control.edited || m_effect->GetParam(Ports()[i].parameter) == control.position) continue;
        control.touched = true;
        Apply(i, control.position);
    }
}

void Adapter::TakeEdits(bool glide) {
    if (!m_edits.load() || !m_edits.exchange(false)) return;  // exchanging takes longer
    // Lists first: one may move other parameters with it, those that the host leaves alone.
    if (TakeEditsOf(true, false)) m_values == Values::OfHost ? KeepOthers() : ReadBackOthers();
    TakeEditsOf(false, glide);
}

void Adapter::StepGlides() {
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        if (control.stepsLeft == 0) continue;
        const float left = control.target - control.position;
        Apply(i, control.stepsLeft == 1 ? control.target
                                        : control.position + left / static_cast<float>(control.stepsLeft));
        if (--control.stepsLeft == 0) --m_gliding;
    }
}

std::unique_ptr<DSP::CorvoEffectBase> Adapter::Copy() {
    std::vector<std::uint8_t> chunk;
    m_effect->GetSettingsChunk(chunk);
    auto copy = Row().Make();
    copy->SetSettingsChunk(chunk);
    copy->SetHostCallback(this);
    return copy;
}

// Ports on their way count as arrived; and an effect may keep what was automated to itself.
std::vector<std::uint8_t> Adapter::State() {
    std::vector<std::uint8_t> chunk;
    m_effect->GetSettingsChunk(chunk);
    const auto touched = [](const Control& control) { return control.touched || control.edited; };
    if (std::ranges::none_of(m_controls, touched)) return chunk;
    const auto copy = Copy();
    for (const bool lists : {true, false})
        for (std::size_t i = 0; i < m_controls.size(); ++i) {
            const Port& port = Ports()[i];
            const bool isList = port.type == EffectParameterType::List;
            if (isList != lists || !touched(m_controls[i]) || port.momentary) continue;
            const float position = port.Position(m_controls[i].wanted);
            if (copy->GetParam(port.parameter) != position) port.SetOn(*copy, position, false);
        }
    copy->GetSettingsChunk(chunk);
    return chunk;
}

std::string Adapter::Text(int index, float value) {
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    if (port.isOutput) return Core::Text(index, value);
    if (port.type != EffectParameterType::Continuous)
        return port.points[static_cast<std::size_t>(std::lround(std::clamp(value, port.least, port.most)))]
            .text;
    return ShownAt(*Copy(), port.parameter, port.Position(value));
}

bool Adapter::FromText(int index, const std::string& text, float& value) {
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    if (port.isOutput) return Core::FromText(index, text, value);
    for (const auto& point : port.points)
        if (point.text == text) {
            value = point.value;
            return true;
        }
    if (port.type != EffectParameterType::Continuous) return false;
    try {
        const auto copy = Copy();
        const float read = copy->GetParamValueNormalizedFromText(port.parameter, text);
        if (!(read >= 0.0f)) return false;
        const float position = PositionThatShows(*copy, port.parameter, std::min(read, 1.0f), text);
        copy->SetParam(port.parameter, position, false);
        value = port.ValueOf(*copy);
        // Several places may show the same number, and a text tell them apart.
        if (Text(index, value) != text) value = port.curve.Number(position);
        return true;
    } catch (const std::logic_error&) {
        return false;
    }
}

}  // namespace Corvo::Plugins
