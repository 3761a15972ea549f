#include <algorithm>
#include <cmath>
#include <cstring>
#include <utility>

#include "Vst3Plugin.h"
#include "Vst3Text.h"
#include "Vst3View.h"

// What a VST3 host shows of a plug-in: parameters, units and programs.
namespace Corvo::Plugins {
namespace {

constexpr std::int32_t kRoot = 0, kProgramList = 1, kNone = -1;

}  // namespace

// The component is this object and has it already.
v3_result Vst3Plugin::TakeComponentState(v3_bstream**) { return V3_OK; }
v3_result Vst3Plugin::NoState(v3_bstream**) { return V3_NOT_IMPLEMENTED; }

v3_plugin_view** Vst3Plugin::CreateView(const char* name) {
    if (std::strcmp(name, "editor") != 0 || !m_core->HasWindow()) return nullptr;
    auto window = m_core->MakeWindow();
    if (!window) return nullptr;
    return (new Vst3View(std::move(window), reinterpret_cast<v3_funknown**>(&m_component)))->Face();
}

std::int32_t Vst3Plugin::ParameterCount() { return static_cast<std::int32_t>(m_parameters.Count()); }

v3_result Vst3Plugin::ParameterInfo(std::int32_t index, v3_param_info* info) {
    return index >= 0 && m_parameters.Info(static_cast<std::size_t>(index), *info) ? V3_OK : V3_INVALID_ARG;
}

v3_result Vst3Plugin::TextOf(v3_param_id id, double normalised, std::int16_t* text) {
    if (!m_parameters.Find(id) || !std::isfinite(normalised)) return V3_INVALID_ARG;
    CopyText(AsText(text), m_parameters.Text(id, std::clamp(normalised, 0.0, 1.0)));
    TellLatency();
    return V3_OK;
}

v3_result Vst3Plugin::ValueOf(v3_param_id id, std::int16_t* text, double* normalised) {
    if (!m_parameters.Find(id) || !text) return V3_INVALID_ARG;
    const auto value = m_parameters.FromText(id, Narrow(text));
    if (value) *normalised = *value;
    return value ? V3_OK : V3_FALSE;
}

double Vst3Plugin::ToPlain(v3_param_id id, double normalised) { return m_parameters.Plain(id, normalised); }
double Vst3Plugin::ToNormalised(v3_param_id id, double plain) { return m_parameters.Normalised(id, plain); }

double Vst3Plugin::Value(v3_param_id id) {
    if (id == Vst3Parameters::kLatency) return m_parameters.Normalised(id, m_core->Latency());
    const auto index = m_parameters.Find(id);
    return index ? m_values[*index].load() : 0.0;
}

// The processor gets the same value from the host, with a block; a program it would have to wait for. Hosts
// may hold a lock here that restart_component takes: what a program changes is sent with the next block.
v3_result Vst3Plugin::SetValue(v3_param_id id, double normalised) {
    const auto index = m_parameters.Find(id);
    if (!index || !std::isfinite(normalised)) return V3_INVALID_ARG;
    normalised = std::clamp(normalised, 0.0, 1.0);
    const int before = ProgramNow();
    if (id != Vst3Parameters::kLatency) m_values[*index] = normalised;
    if (const int program = ProgramNow(); program != before) {
        m_core->TakePreset(program);
        ShowValues();
        m_sendAll = true;
    }
    if (id == Vst3Parameters::kLatency) TellLatency();
    return V3_OK;
}

int Vst3Plugin::ProgramNow() const {
    const auto index = m_parameters.Find(Vst3Parameters::kProgram);
    return index ? static_cast<int>(m_parameters.Plain(Vst3Parameters::kProgram, m_values[*index])) : 0;
}

// After the effect's settings changed as a whole.
void Vst3Plugin::ShowValues() {
    m_values[Vst3Parameters::kBypass] = m_core->Bypassed() ? 1.0 : 0.0;
    for (std::size_t i = 0; i < m_core->Ports().size(); ++i)
        m_values[i + 1] = m_parameters.Normalised(static_cast<v3_param_id>(i + 1),
                                                  static_cast<double>(m_core->Value(static_cast<int>(i))));
}

v3_result Vst3Plugin::SetHandler(v3_component_handler** handler) {
    if (handler) v3_cpp_obj_ref(handler);
    if (m_handler) v3_cpp_obj_unref(m_handler);
    m_handler = handler;
    return V3_OK;
}

void Vst3Plugin::Restart(std::int32_t flags) {
    if (m_handler) v3_cpp_obj(m_handler)->restart_component(m_handler, flags);
}

// Hosts that do not hand over what the processor sends hear of it when they ask for something else.
void Vst3Plugin::TellLatency() {
    if (!m_active) return;  // it is asked for afterwards
    const int latency = m_core->Latency();
    if (m_toldLatency.exchange(latency) != latency) Restart(V3_RESTART_LATENCY_CHANGED);
}

const std::vector<std::string>& Vst3Plugin::Groups() const { return m_core->Groups(); }

std::int32_t Vst3Plugin::UnitCount() { return static_cast<std::int32_t>(Groups().size()) + 1; }

v3_result Vst3Plugin::UnitInfo(std::int32_t index, v3_unit_info* info) {
    if (index < 0 || index >= UnitCount()) return V3_INVALID_ARG;
    const bool isRoot = index == 0;
    *info = {};
    info->id = index;
    info->parent_unit_id = isRoot ? kNone : kRoot;
    CopyText(info->name, isRoot ? "Root" : Groups()[static_cast<std::size_t>(index) - 1]);
    info->program_list_id = isRoot && m_parameters.Programs() > 0 ? kProgramList : kNone;
    return V3_OK;
}

std::int32_t Vst3Plugin::ProgramListCount() { return m_parameters.Programs() > 0 ? 1 : 0; }

v3_result Vst3Plugin::ProgramListInfo(std::int32_t index, v3_program_list_info* info) {
    if (index < 0 || index >= ProgramListCount()) return V3_INVALID_ARG;
    *info = {};
    info->id = kProgramList;
    CopyText(info->name, "Presets");
    info->programCount = m_parameters.Programs();
    return V3_OK;
}

v3_result Vst3Plugin::ProgramName(std::int32_t list, std::int32_t program, std::int16_t* name) {
    if (list != kProgramList || program < 0 || program >= m_parameters.Programs()) return V3_INVALID_ARG;
    CopyText(AsText(name), m_parameters.Program(program));
    return V3_OK;
}

v3_result Vst3Plugin::ProgramInfo(std::int32_t, std::int32_t, const char*, std::int16_t*) { return V3_FALSE; }
v3_result Vst3Plugin::HasPitchNames(std::int32_t, std::int32_t) { return V3_FALSE; }
v3_result Vst3Plugin::PitchName(std::int32_t, std::int32_t, std::int16_t, std::int16_t*) { return V3_FALSE; }
std::int32_t Vst3Plugin::SelectedUnit() { return kRoot; }
v3_result Vst3Plugin::SelectUnit(std::int32_t) { return V3_OK; }
v3_result Vst3Plugin::UnitByBus(std::int32_t, std::int32_t, std::int32_t, std::int32_t, std::int32_t* unit) {
    *unit = kRoot;
    return V3_OK;
}
v3_result Vst3Plugin::SetProgramData(std::int32_t, std::int32_t, v3_bstream**) { return V3_NOT_IMPLEMENTED; }

}  // namespace Corvo::Plugins
