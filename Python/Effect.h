#pragma once

#include <pybind11/pybind11.h>

#include "Handle.h"

namespace python {

// The settings of one effect, as the package's class Effect needs them. It never processes.
class Effect {
public:
    explicit Effect(const std::string& name);

    struct Choice {
        std::string text;
        float value;
    };
    struct Parameter {
        std::string label, name, unit;
        int kind;
        std::vector<Choice> choices;
    };
    std::vector<Parameter> Parameters() const;
    std::string ShownText(int index) const;
    void Set(int index, float value);
    std::string ValueToText(int index, float value) const;
    float TextToValue(int index, const std::string& text) const;
    bool PlaysAutomation();
    // Texts of parameters in notes say how long those are.
    void SetTempo(double bpm);

    std::vector<std::string> Presets() const;
    int DefaultPreset() const;
    void SetPreset(int index);

    pybind11::bytes State() const;
    void SetState(const std::string& bytes);

    // The most channels of a side-chain; 0 for none.
    int SidechainChannels() const;

private:
    std::string ParameterText(int index, int which) const;

    double m_bpm = 120.0;
    Owned<dsp_effect> m_effect;
};

void DefineEffect(pybind11::module_& module);

}  // namespace python
