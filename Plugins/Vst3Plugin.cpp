#include "Vst3Plugin.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "SavedState.h"
#include "Vst3Text.h"

// The object, its buses and its state.
namespace Corvo::Plugins {
namespace {

constexpr v3_speaker_arrangement kMono = V3_SPEAKER_M, kStereo = V3_SPEAKER_L | V3_SPEAKER_R;

v3_speaker_arrangement ArrangementOf(int channels) {
    return channels == 0 ? 0 : channels == 1 ? kMono : kStereo;
}

// The number of the preset, in 4 bytes, stands before what CLAP keeps too.
constexpr std::size_t kProgramBytes = 4;

}  // namespace

struct Vst3Plugin::Tables {
    using P = Vst3Plugin;
    static constexpr v3_funknown kObject{kVst3Entry<&P::Query>, kVst3Entry<&P::Ref>, kVst3Entry<&P::Unref>};
    static constexpr v3_plugin_base kBase{kVst3Entry<&P::Initialize>, kVst3Entry<&P::Terminate>};
    static constexpr v3_component_cpp kComponent{
        kObject,
        kBase,
        {kVst3Entry<&P::ControllerClass>, kVst3Entry<&P::IoMode>, kVst3Entry<&P::BusCount>,
         kVst3Entry<&P::BusInfo>, kVst3Entry<&P::Routing>, kVst3Entry<&P::ActivateBus>,
         kVst3Entry<&P::SetActive>, kVst3Entry<&P::SetState>, kVst3Entry<&P::GetState>}};
    static constexpr v3_audio_processor_cpp kProcessor{
        kObject,
        {kVst3Entry<&P::SetArrangements>, kVst3Entry<&P::Arrangement>, kVst3Entry<&P::CanProcess>,
         kVst3Entry<&P::Latency>, kVst3Entry<&P::Setup>, kVst3Entry<&P::SetProcessing>,
         kVst3Entry<&P::Process>, kVst3Entry<&P::Tail>}};
    static constexpr v3_edit_controller_cpp kController{
        kObject,
        kBase,
        {kVst3Entry<&P::TakeComponentState>, kVst3Entry<&P::NoState>, kVst3Entry<&P::NoState>,
         kVst3Entry<&P::ParameterCount>, kVst3Entry<&P::ParameterInfo>, kVst3Entry<&P::TextOf>,
         kVst3Entry<&P::ValueOf>, kVst3Entry<&P::ToPlain>, kVst3Entry<&P::ToNormalised>,
         kVst3Entry<&P::Value>, kVst3Entry<&P::SetValue>, kVst3Entry<&P::SetHandler>,
         kVst3Entry<&P::CreateView>}};
    static constexpr v3_unit_information_cpp kUnits{
        kObject,
        {kVst3Entry<&P::UnitCount>, kVst3Entry<&P::UnitInfo>, kVst3Entry<&P::ProgramListCount>,
         kVst3Entry<&P::ProgramListInfo>, kVst3Entry<&P::ProgramName>, kVst3Entry<&P::ProgramInfo>,
         kVst3Entry<&P::HasPitchNames>, kVst3Entry<&P::PitchName>, kVst3Entry<&P::SelectedUnit>,
         kVst3Entry<&P::SelectUnit>, kVst3Entry<&P::UnitByBus>, kVst3Entry<&P::SetProgramData>}};
    static constexpr v3_process_context_requirements_cpp kRequirements{kObject,
                                                                       {kVst3Entry<&P::Requirements>}};
};

Vst3Plugin::Vst3Plugin(const PluginRow& row)
    : m_component{&Tables::kComponent, this},
      m_processor{&Tables::kProcessor, this},
      m_controller{&Tables::kController, this},
      m_units{&Tables::kUnits, this},
      m_requirements{&Tables::kRequirements, this},
      m_core(MakeCore(row, 2)),
      m_parameters(*m_core),
      m_hasOutputs(std::ranges::count(m_core->Ports(), true, &Port::isOutput) > 0),
      m_values(m_parameters.Count()),
      m_sideChannels(m_core->SideChannels()) {
    m_queues.reserve(m_parameters.Count());
    for (std::size_t i = 0; i < m_values.size(); ++i) m_values[i] = m_parameters.Start(m_parameters.Id(i));
}

Vst3Plugin::~Vst3Plugin() { SetHandler(nullptr); }

v3_result Vst3Plugin::Query(const std::uint8_t* id, void** object) {
    const struct {
        const v3_tuid& id;
        Face& face;
    } known[]{{v3_funknown_iid, m_component},
              {v3_plugin_base_iid, m_component},
              {v3_component_iid, m_component},
              {v3_audio_processor_iid, m_processor},
              {v3_edit_controller_iid, m_controller},
              {v3_unit_information_iid, m_units},
              {v3_process_context_requirements_iid, m_requirements}};
    *object = nullptr;
    for (const auto& entry : known)
        if (v3_tuid_match(entry.id, id)) {
            *object = &entry.face;
            Ref();
            return V3_OK;
        }
    return V3_NO_INTERFACE;
}

std::uint32_t Vst3Plugin::Ref() { return ++m_references; }

std::uint32_t Vst3Plugin::Unref() {
    const std::uint32_t left = --m_references;
    if (left == 0) delete this;
    return left;
}

v3_result Vst3Plugin::Initialize(v3_funknown**) { return V3_OK; }
v3_result Vst3Plugin::Terminate() { return SetHandler(nullptr); }
v3_result Vst3Plugin::ControllerClass(std::uint8_t*) { return V3_NOT_IMPLEMENTED; }  // it is this object
v3_result Vst3Plugin::IoMode(std::int32_t) { return V3_NOT_IMPLEMENTED; }
v3_result Vst3Plugin::Routing(v3_routing_info*, v3_routing_info*) { return V3_NOT_IMPLEMENTED; }

std::int32_t Vst3Plugin::BusCount(std::int32_t media, std::int32_t direction) {
    if (media != V3_AUDIO) return 0;
    return direction == V3_INPUT && m_core->SideChannels() > 0 ? 2 : 1;
}

bool Vst3Plugin::HasBus(std::int32_t media, std::int32_t direction, std::int32_t bus) {
    return (direction == V3_INPUT || direction == V3_OUTPUT) && bus >= 0 && bus < BusCount(media, direction);
}

v3_result Vst3Plugin::BusInfo(std::int32_t media, std::int32_t direction, std::int32_t bus,
                              v3_bus_info* info) {
    if (!HasBus(media, direction, bus)) return V3_INVALID_ARG;
    const bool main = bus == 0;
    *info = {};
    info->media_type = media;
    info->direction = direction;
    info->channel_count = main ? m_core->Channels() : m_sideChannels;
    CopyText(info->bus_name, !main ? "Side-chain" : direction == V3_INPUT ? "In" : "Out");
    info->bus_type = main ? V3_MAIN : V3_AUX;
    info->flags = main ? V3_DEFAULT_ACTIVE : 0;
    return V3_OK;
}

v3_result Vst3Plugin::ActivateBus(std::int32_t media, std::int32_t direction, std::int32_t bus, v3_bool on) {
    if (!HasBus(media, direction, bus)) return V3_INVALID_ARG;
    if (bus == 1) m_sideIsOn = on != 0;
    return V3_OK;
}

v3_result Vst3Plugin::SetArrangements(v3_speaker_arrangement* in, std::int32_t ins,
                                      v3_speaker_arrangement* out, std::int32_t outs) {
    if (ins < 0 || outs < 0 || (ins > 0 && !in) || (outs > 0 && !out)) return V3_INVALID_ARG;
    if (m_active || ins < 1 || ins > BusCount(V3_AUDIO, V3_INPUT) || outs != 1) return V3_FALSE;
    if (in[0] != out[0] || (in[0] != kMono && in[0] != kStereo)) return V3_FALSE;
    // Of a wider side-chain the first channels are heard; some hosts ask for one without any.
    if (ins == 2 && in[1] != 0 && in[1] != kMono && in[1] != kStereo) return V3_FALSE;
    m_core->SetChannels(in[0] == kMono ? 1 : 2);
    m_sideChannels = ins < 2 ? m_core->SideChannels() : in[1] == 0 ? 0 : in[1] == kMono ? 1 : 2;
    return V3_OK;
}

v3_result Vst3Plugin::Arrangement(std::int32_t direction, std::int32_t bus,
                                  v3_speaker_arrangement* arrangement) {
    v3_bus_info info;
    if (BusInfo(V3_AUDIO, direction, bus, &info) != V3_OK) return V3_INVALID_ARG;
    *arrangement = ArrangementOf(info.channel_count);
    return V3_OK;
}

v3_result Vst3Plugin::SetState(v3_bstream** stream) {
    if (!stream) return V3_INVALID_ARG;
    std::vector<std::uint8_t> bytes;
    ReadAll(bytes, [stream](void* buffer, std::size_t size) {
        std::int32_t count = 0;
        const auto wanted = static_cast<std::int32_t>(size);
        // Some streams fail at their end.
        return v3_cpp_obj(stream)->read(stream, buffer, wanted, &count) == V3_OK ? count : 0;
    });
    if (bytes.size() < kProgramBytes) return V3_FALSE;
    std::uint32_t program = 0;
    for (std::size_t i = kProgramBytes; i-- > 0;) program = program << 8 | bytes[i];
    if (program > 0 && program >= static_cast<std::uint32_t>(m_parameters.Programs())) return V3_FALSE;
    if (!LoadState(*m_core, {bytes.begin() + kProgramBytes, bytes.end()})) return V3_FALSE;
    ShowValues();
    if (const auto index = m_parameters.Find(Vst3Parameters::kProgram))
        m_values[*index] = m_parameters.Normalised(Vst3Parameters::kProgram, program);
    Restart(V3_RESTART_PARAM_VALUES_CHANGED);
    TellLatency();
    return V3_OK;
}

v3_result Vst3Plugin::GetState(v3_bstream** stream) {
    if (!stream) return V3_INVALID_ARG;
    std::vector<std::uint8_t> bytes;
    for (std::size_t i = 0; i < kProgramBytes; ++i)
        bytes.push_back(static_cast<std::uint8_t>(ProgramNow() >> 8 * i));
    const auto state = SaveState(*m_core);
    bytes.insert(bytes.end(), state.begin(), state.end());
    const bool isWritten = WriteAll(std::move(bytes), [stream](void* from, std::size_t size) {
        std::int32_t count = 0;
        const auto left = static_cast<std::int32_t>(size);
        return v3_cpp_obj(stream)->write(stream, from, left, &count) == V3_OK ? count : 0;
    });
    return isWritten ? V3_OK : V3_FALSE;
}

}  // namespace Corvo::Plugins
