#include "Effect.h"

#include <pybind11/stl.h>

namespace python {

namespace py = pybind11;

Effect::Effect(const std::string& name)
    : m_effect(Made<dsp_effect>([&](dsp_effect** handle, dsp_error* error) {
          return dsp_effect_create(name.c_str(), handle, error);
      })) {}

std::string Effect::ParameterText(int index, int which) const {
    return Text([&](auto... out) { return dsp_effect_parameter_text(m_effect.get(), index, which, out...); });
}

std::vector<Effect::Parameter> Effect::Parameters() const {
    std::vector<Parameter> all;
    const int count = Asked(dsp_effect_parameters, m_effect);
    for (int index = 0; index < count; ++index) {
        dsp_parameter record{};
        record.size = sizeof record;
        Check(dsp_effect_parameter(m_effect.get(), index, &record));
        Parameter parameter{ParameterText(index, DSP_TEXT_LABEL),
                            ParameterText(index, DSP_TEXT_NAME),
                            ParameterText(index, DSP_TEXT_UNIT),
                            record.kind,
                            {}};
        for (int choice = 0; choice < record.choices; ++choice) {
            float value = 0.0f;
            const auto text = Text([&](auto... out) {
                return dsp_effect_choice(m_effect.get(), index, choice, &value, out...);
            });
            parameter.choices.push_back({text, value});
        }
        all.push_back(std::move(parameter));
    }
    return all;
}

std::string Effect::ShownText(int index) const {
    const std::string text = ParameterText(index, DSP_TEXT_VALUE);
    return text.substr(0, text.find_last_not_of(' ') + 1);
}

void Effect::Set(int index, float value) { Check(dsp_effect_set(m_effect.get(), index, value)); }

std::string Effect::ValueToText(int index, float value) const {
    return Text([&](auto... out) { return dsp_effect_value_to_text(m_effect.get(), index, value, out...); });
}

float Effect::TextToValue(int index, const std::string& text) const {
    float value = 0.0f;
    Explained([&](dsp_error* error) {
        return dsp_effect_text_to_value(m_effect.get(), index, text.c_str(), &value, error);
    });
    return value;
}

bool Effect::PlaysAutomation() { return dsp_effect_automate(m_effect.get(), 0, nullptr, 0) == DSP_OK; }

void Effect::SetTempo(double bpm) {
    m_bpm = bpm;
    Check(dsp_effect_tempo_callback(m_effect.get(), TellTempo, &m_bpm));
}

std::vector<std::string> Effect::Presets() const {
    std::vector<std::string> names;
    const int count = Asked(dsp_effect_presets, m_effect);
    for (int preset = 0; preset < count; ++preset)
        names.push_back(
            Text([&](auto... out) { return dsp_effect_preset_name(m_effect.get(), preset, out...); }));
    return names;
}

int Effect::DefaultPreset() const { return Asked(dsp_effect_default_preset, m_effect); }

void Effect::SetPreset(int index) { Check(dsp_effect_set_preset(m_effect.get(), index)); }

py::bytes Effect::State() const {
    std::size_t size = 0;
    Check(dsp_effect_state(m_effect.get(), nullptr, 0, &size));
    std::string bytes(size, '\0');
    Check(dsp_effect_state(m_effect.get(), bytes.data(), size, &size));
    return bytes;
}

void Effect::SetState(const std::string& bytes) {
    Explained([&](dsp_error* error) {
        return dsp_effect_set_state(m_effect.get(), bytes.data(), bytes.size(), error);
    });
}

int Effect::SidechainChannels() const {
    if (Asked(dsp_effect_sidechain_busses, m_effect) < 1) return 0;
    int channels = 0;
    Check(dsp_effect_sidechain_most_channels(m_effect.get(), 0, &channels));
    return channels;
}

void DefineEffect(py::module_& module) {
    module.def("kinds", [] {
        std::vector<std::string> names;
        for (int kind = 0; kind < dsp_effect_kinds(); ++kind)
            names.push_back(Text([&](auto... out) { return dsp_effect_kind_name(kind, out...); }));
        return names;
    });
    py::class_<Effect::Choice>(module, "Choice")
        .def_readonly("text", &Effect::Choice::text)
        .def_readonly("value", &Effect::Choice::value);
    py::class_<Effect::Parameter>(module, "Parameter")
        .def_readonly("label", &Effect::Parameter::label)
        .def_readonly("name", &Effect::Parameter::name)
        .def_readonly("unit", &Effect::Parameter::unit)
        .def_readonly("kind", &Effect::Parameter::kind)
        .def_readonly("choices", &Effect::Parameter::choices);
    py::class_<Effect>(module, "Effect")
        .def(py::init<const std::string&>(), py::arg("name"))
        .def("parameters", &Effect::Parameters)
        .def("text", &Effect::ShownText)
        .def("set", &Effect::Set)
        .def("value_to_text", &Effect::ValueToText)
        .def("text_to_value", &Effect::TextToValue)
        .def("plays_automation", &Effect::PlaysAutomation)
        .def("set_tempo", &Effect::SetTempo)
        .def("presets", &Effect::Presets)
        .def("default_preset", &Effect::DefaultPreset)
        .def("set_preset", &Effect::SetPreset)
        .def("state", &Effect::State)
        .def("set_state", &Effect::SetState)
        .def("sidechain_channels", &Effect::SidechainChannels);
}

}  // namespace python
