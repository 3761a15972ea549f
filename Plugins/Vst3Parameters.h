#pragma once

#include <travesty/edit_controller.h>

#include <optional>
#include <string>
#include <vector>

#include "Core.h"

namespace Corvo::Plugins {

// The controls of a plug-in as VST3 parameters, whose values run from 0 to 1. Identifiers never change: 0 is
// the bypass, i + 1 the port i.
class Vst3Parameters {
public:
    static constexpr v3_param_id kBypass = 0;
    static constexpr v3_param_id kProgram = 0x1000;  // only where there are presets
    // Read-only and hidden. The processor sends it, and the host hands it to the controller, which may then
    // tell that the latency is another.
    static constexpr v3_param_id kLatency = 0x1001;

    explicit Vst3Parameters(Core& core);

    std::size_t Count() const { return m_ids.size(); }
    v3_param_id Id(std::size_t index) const { return m_ids[index]; }
    std::optional<std::size_t> Find(v3_param_id id) const;
    // Of a port's parameter; else null.
    const Port* PortOf(v3_param_id id) const;
    int Programs() const { return static_cast<int>(m_programs.size()); }
    const std::string& Program(int program) const { return m_programs[static_cast<std::size_t>(program)]; }

    bool Info(std::size_t index, v3_param_info& info) const;
    double Start(v3_param_id id) const;
    // Values of ports in their units; programs by number; frames.
    double Plain(v3_param_id id, double normalised) const;
    double Normalised(v3_param_id id, double plain) const;
    // The unit is apart.
    std::string Text(v3_param_id id, double normalised) const;
    std::optional<double> FromText(v3_param_id id, const std::string& text) const;

private:
    int Steps(v3_param_id id) const;

    Core& m_core;
    std::vector<v3_param_id> m_ids;
    std::vector<std::string> m_programs, m_units;  // m_units: of the ports
};

}  // namespace Corvo::Plugins
