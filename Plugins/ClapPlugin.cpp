#include <src/clap/entry.h>
#include <src/clap/ext/audio-ports.h>
#include <src/clap/ext/latency.h>
#include <src/clap/ext/params.h>
#include <src/clap/ext/state.h>
#include <src/clap/plugin-factory.h>
#include <src/clap/plugin-features.h>
#include <src/clap/plugin.h>

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstring>
#include <exception>
#include <memory>
#include <string>
#include <vector>

#include "ClapPresets.h"
#include "ClapWindow.h"
#include "SavedState.h"

// Every plug-in as CLAP. Parameter 0 is the bypass; port i of the core is the parameter i + 1.
namespace {

using namespace Corvo::Plugins;

constexpr char kVersion[] = DSP_PLUGIN_VERSION;
constexpr clap_id kBypass = 0;

void CopyText(char* to, std::size_t size, const std::string& text) {
    const std::size_t count = std::min(text.size(), size - 1);
    std::copy_n(text.data(), count, to);
    to[count] = '\0';
}

// Hosts draw a knob from its least to its most value in a straight line: a continuous one is told as its
// place, 0..1, so that frequencies and times are as far apart as the effect has them.
bool IsPlace(const Port& port) { return !port.whole && !port.isOutput; }
double ToClap(const Port& port, float value) {
    return static_cast<double>(IsPlace(port) ? port.curve.Place(value) : value);
}
float FromClap(const Port& port, double told) {
    const auto value = static_cast<float>(told);
    return IsPlace(port) && std::isfinite(value) ? port.curve.Number(value) : value;
}

// Younger than DPF's headers.
struct ClapTail {
    std::uint32_t (*get)(const clap_plugin_t* plugin);  // frames; endless from 2^31 - 1 on
};
constexpr char kClapTail[] = "clap.tail";
constexpr std::uint32_t kEndlessTail = 0x7fffffff;

// One for each row: of two channels, and of one.
struct Entry {
    const PluginRow* row;
    int channels;
    std::string id, name;
    std::vector<const char*> features;
    clap_plugin_descriptor_t descriptor;
};

const std::vector<Entry>& Entries() {
    static const auto entries = [] {
        std::vector<Entry> made;
        for (const auto& row : PluginRows())
            for (const int channels : {2, 1})
                made.push_back(
                    {&row,
                     channels,
                     PluginUri(row, channels),
                     PluginName(row, channels),
                     {CLAP_PLUGIN_FEATURE_AUDIO_EFFECT, row.clapFeature,
                      channels == 2 ? CLAP_PLUGIN_FEATURE_STEREO : CLAP_PLUGIN_FEATURE_MONO, nullptr},
                     {}});
        for (Entry& entry : made)
            entry.descriptor = {CLAP_VERSION, entry.id.c_str(), entry.name.c_str(),   "DSPDll", "", "", "",
                                kVersion,     entry.row->about, entry.features.data()};
        return made;
    }();
    return entries;
}

class ClapPlugin {
public:
    ClapPlugin(const Entry& entry, const clap_host_t* host)
        : plugin{&entry.descriptor,
                 this,
                 Init,
                 Destroy,
                 Activate,
                 [](const clap_plugin_t* self) { Of(self).m_isActive = false; },
                 [](const clap_plugin_t*) { return true; },
                 [](const clap_plugin_t*) {},
                 DoReset,
                 DoProcess,
                 Extension,
                 OnMainThread},
          m_host(host),
          m_core(MakeCore(*entry.row, entry.channels)),
          m_window(*m_core, host),
          m_sent(m_core->Ports().size()) {}

    const clap_plugin_t plugin;

private:
    static ClapPlugin& Of(const clap_plugin_t* plugin) {
        return *static_cast<ClapPlugin*>(plugin->plugin_data);
    }
    template <typename T>
    const T* HostExtension(const char* id) const {
        return static_cast<const T*>(m_host->get_extension(m_host, id));
    }

    // Life.
    static bool Init(const clap_plugin_t*) { return true; }
    static void Destroy(const clap_plugin_t* plugin) { delete &Of(plugin); }
    static bool Activate(const clap_plugin_t* plugin, double rate, std::uint32_t, std::uint32_t most) {
        ClapPlugin& self = Of(plugin);
        try {
            self.m_core->Prepare(rate, static_cast<int>(std::min(most, 1u << 20)));
        } catch (const std::exception&) {
            return false;
        }
        self.m_isActive = true;
        self.TellLatency();
        return true;
    }
    static void DoReset(const clap_plugin_t* plugin) try {
        Of(plugin).m_core->Reset();
    } catch (const std::exception&) {
        return;  // no memory
    }

    // A host takes a new latency only while it activates, for which it is asked once.
    bool HasNewLatency() const {
        const int latency = m_core->Latency();
        return latency != m_told && latency != m_restartFor;
    }
    void AskForRestart() {
        if (!m_isActive || !HasNewLatency()) return;
        m_restartFor = m_core->Latency();
        m_host->request_restart(m_host);
    }
    void TellLatency() {
        m_restartFor = m_core->Latency();
        if (m_told == m_core->Latency()) return;
        m_told = m_core->Latency();
        const auto* const latency = HostExtension<clap_host_latency_t>(CLAP_EXT_LATENCY);
        if (latency) latency->changed(m_host);
    }

    // The audio thread asks for this when something happened that only this thread may tell.
    static void OnMainThread(const clap_plugin_t* plugin) {
        ClapPlugin& self = Of(plugin);
        self.m_callbackIsWanted = false;
        self.AskForRestart();
        if (self.m_core->TakeOtherValues()) self.TellValues();
    }
    void TellValues() {
        const auto* const params = HostExtension<clap_host_params_t>(CLAP_EXT_PARAMS);
        if (params) params->rescan(m_host, CLAP_PARAM_RESCAN_VALUES | CLAP_PARAM_RESCAN_TEXT);
    }

    // Processing.
    void Take(const clap_event_header_t& event) {
        if (event.space_id != CLAP_CORE_EVENT_SPACE_ID) return;
        if (event.type == CLAP_EVENT_TRANSPORT)
            TakeTransport(reinterpret_cast<const clap_event_transport_t&>(event));
        if (event.type != CLAP_EVENT_PARAM_VALUE) return;
        const auto& change = reinterpret_cast<const clap_event_param_value_t&>(event);
        if (change.param_id == kBypass)
            m_core->Bypass(change.value > 0.5);
        else if (change.param_id <= m_core->Ports().size())
            m_core->Set(static_cast<int>(change.param_id) - 1,
                        FromClap(m_core->Ports()[change.param_id - 1], change.value));
    }
    void TakeTransport(const clap_event_transport_t& transport) {
        const bool hasMeter = (transport.flags & CLAP_TRANSPORT_HAS_TIME_SIGNATURE) != 0;
        if ((transport.flags & CLAP_TRANSPORT_HAS_TEMPO) != 0)
            m_core->Tempo(transport.tempo, hasMeter ? transport.tsig_num : 4,
                          hasMeter ? transport.tsig_denom : 4);
    }

    static clap_process_status DoProcess(const clap_plugin_t* plugin, const clap_process_t* block) {
        return Of(plugin).Process(*block);
    }
    clap_process_status Process(const clap_process_t& block) {
        const auto channels = static_cast<std::uint32_t>(m_core->Channels());
        if (block.audio_inputs_count < 1 || block.audio_outputs_count < 1 ||
            block.audio_inputs[0].channel_count < channels ||
            block.audio_outputs[0].channel_count < channels || !block.audio_inputs[0].data32 ||
            !block.audio_outputs[0].data32)
            return CLAP_PROCESS_ERROR;
        if (block.transport) TakeTransport(*block.transport);
        const std::uint32_t events = block.in_events ? block.in_events->size(block.in_events) : 0;
        std::uint32_t next = 0;
        for (std::uint32_t done = 0; done < block.frames_count || next < events;) {
            std::uint32_t until = block.frames_count;
            for (; next < events; ++next) {
                const auto& event = *block.in_events->get(block.in_events, next);
                if (event.time > done && done < block.frames_count) {
                    until = std::min(event.time, block.frames_count);
                    break;
                }
                Take(event);
            }
            RunPiece(block, done, until - done);
            done = until;
        }
        if ((m_core->HasOtherValues() || HasNewLatency()) && !m_callbackIsWanted.exchange(true))
            m_host->request_callback(m_host);
        block.audio_outputs[0].constant_mask = 0;
        SendOutputs(block.out_events);
        // What rings, or shows what it hears, goes on in silence.
        return m_core->Row().Is(kRings) || m_core->HasWindow() ? CLAP_PROCESS_CONTINUE : CLAP_PROCESS_TAIL;
    }
    void SendOutputs(const clap_output_events_t* events) {
        for (std::size_t i = 0; events && i < m_sent.size(); ++i) {
            const float value = m_core->Value(static_cast<int>(i));
            if (!m_core->Ports()[i].isOutput || value == m_sent[i]) continue;
            const clap_event_param_value_t event{
                {sizeof event, 0, CLAP_CORE_EVENT_SPACE_ID, CLAP_EVENT_PARAM_VALUE, 0},
                static_cast<clap_id>(i + 1),
                nullptr,
                -1,
                -1,
                -1,
                -1,
                ToClap(m_core->Ports()[i], value)};
            if (events->try_push(events, &event.header)) m_sent[i] = value;
        }
    }
    void RunPiece(const clap_process_t& block, std::uint32_t from, std::uint32_t frames) {
        const float *in[2]{}, *side[2]{};
        float* out[2]{};
        for (int c = 0; c < m_core->Channels(); ++c) {
            in[c] = block.audio_inputs[0].data32[c] + from;
            out[c] = block.audio_outputs[0].data32[c] + from;
        }
        if (m_core->SideChannels() > 0 && block.audio_inputs_count > 1 && block.audio_inputs[1].data32)
            for (std::uint32_t c = 0; c < block.audio_inputs[1].channel_count && c < 2; ++c)
                if (const float* const channel = block.audio_inputs[1].data32[c]) side[c] = channel + from;
        m_core->Run(in, out, side, static_cast<int>(frames));
    }

    // Audio ports.
    static std::uint32_t PortCount(const clap_plugin_t* plugin, bool isInput) {
        return isInput && Of(plugin).m_core->SideChannels() > 0 ? 2 : 1;
    }
    static bool PortInfo(const clap_plugin_t* plugin, std::uint32_t index, bool isInput,
                         clap_audio_port_info_t* info) {
        if (index >= PortCount(plugin, isInput)) return false;
        const Core& core = *Of(plugin).m_core;
        const bool main = index == 0;
        *info = {};
        info->id = (isInput ? 0u : 16u) + index;
        CopyText(info->name, sizeof info->name, !main ? "Side-chain" : isInput ? "In" : "Out");
        info->flags = main ? static_cast<std::uint32_t>(CLAP_AUDIO_PORT_IS_MAIN) : 0u;
        info->channel_count = static_cast<std::uint32_t>(main ? core.Channels() : core.SideChannels());
        info->port_type = info->channel_count == 1 ? CLAP_PORT_MONO : CLAP_PORT_STEREO;
        info->in_place_pair = !main ? CLAP_INVALID_ID : isInput ? 16u : 0u;
        return true;
    }
    static constexpr clap_plugin_audio_ports_t kAudioPorts{PortCount, PortInfo};

    // Parameters.
    static std::uint32_t Count(const clap_plugin_t* plugin) {
        return static_cast<std::uint32_t>(Of(plugin).m_core->Ports().size()) + 1;
    }
    static bool Info(const clap_plugin_t* plugin, std::uint32_t index, clap_param_info_t* info) {
        if (index >= Count(plugin)) return false;
        *info = {};
        info->id = index;
        if (index == kBypass) {
            info->flags = CLAP_PARAM_IS_STEPPED | CLAP_PARAM_IS_BYPASS | CLAP_PARAM_IS_AUTOMATABLE;
            CopyText(info->name, sizeof info->name, "Bypass");
            info->max_value = 1.0;
            return true;
        }
        const ClapPlugin& self = Of(plugin);
        const Port& port = self.m_core->Ports()[index - 1];
        const auto& groups = self.m_core->Groups();
        if (port.isOutput)
            info->flags = CLAP_PARAM_IS_READONLY;
        else if (!port.momentary)
            info->flags = CLAP_PARAM_IS_AUTOMATABLE;
        if (port.whole) info->flags |= CLAP_PARAM_IS_STEPPED;
        if (port.isIdle) info->flags |= CLAP_PARAM_IS_HIDDEN;
        CopyText(info->name, sizeof info->name, port.name);
        if (port.group >= 0)
            CopyText(info->module, sizeof info->module, groups[static_cast<std::size_t>(port.group)]);
        info->min_value = ToClap(port, port.least);
        info->max_value = ToClap(port, port.most);
        info->default_value = ToClap(port, port.start);
        return true;
    }
    static bool Value(const clap_plugin_t* plugin, clap_id id, double* value) {
        if (id >= Count(plugin)) return false;
        const Core& core = *Of(plugin).m_core;
        *value = id == kBypass ? core.Bypassed()
                               : ToClap(core.Ports()[id - 1], core.Value(static_cast<int>(id) - 1));
        return true;
    }
    static bool ValueToText(const clap_plugin_t* plugin, clap_id id, double value, char* text,
                            std::uint32_t size) try {
        if (id >= Count(plugin) || size == 0 || !std::isfinite(value)) return false;
        Core& core = *Of(plugin).m_core;
        CopyText(text, size,
                 id == kBypass ? (value > 0.5 ? "On" : "Off")
                               : core.Text(static_cast<int>(id) - 1, FromClap(core.Ports()[id - 1], value)));
        return true;
    } catch (const std::exception&) {
        return false;
    }
    static bool TextToValue(const clap_plugin_t* plugin, clap_id id, const char* text, double* value) try {
        if (id >= Count(plugin)) return false;
        float number = 0.0f;
        const std::string shown = text;
        if (id == kBypass) {
            if (shown != "On" && shown != "Off") return false;
            *value = shown == "On" ? 1.0 : 0.0;
            return true;
        }
        Core& core = *Of(plugin).m_core;
        if (!core.FromText(static_cast<int>(id) - 1, shown, number)) return false;
        *value = ToClap(core.Ports()[id - 1], number);
        return true;
    } catch (const std::exception&) {
        return false;
    }
    static void Flush(const clap_plugin_t* plugin, const clap_input_events_t* in,
                      const clap_output_events_t*) {
        for (std::uint32_t i = 0; in && i < in->size(in); ++i) Of(plugin).Take(*in->get(in, i));
    }
    static constexpr clap_plugin_params_t kParams{Count, Info, Value, ValueToText, TextToValue, Flush};

    static std::uint32_t LatencyNow(const clap_plugin_t* plugin) {
        return static_cast<std::uint32_t>(Of(plugin).m_core->Latency());
    }
    static constexpr clap_plugin_latency_t kLatency{LatencyNow};
    static std::uint32_t TailNow(const clap_plugin_t* plugin) {
        return Of(plugin).m_core->Row().Is(kRings) ? kEndlessTail : LatencyNow(plugin);
    }
    static constexpr ClapTail kTail{TailNow};

    // State.
    static bool Save(const clap_plugin_t* plugin, const clap_ostream_t* stream) try {
        return WriteAll(SaveState(*Of(plugin).m_core), [stream](const void* bytes, std::size_t count) {
            return stream->write(stream, bytes, count);
        });
    } catch (const std::exception&) {
        return false;
    }
    static bool Load(const clap_plugin_t* plugin, const clap_istream_t* stream) try {
        std::vector<std::uint8_t> bytes;
        const auto read = [stream](void* buffer, std::size_t count) {
            return stream->read(stream, buffer, count);
        };
        ClapPlugin& self = Of(plugin);
        if (!ReadAll(bytes, read) || !LoadState(*self.m_core, bytes)) return false;
        self.TellValues();
        self.AskForRestart();
        return true;
    } catch (const std::exception&) {
        return false;
    }
    static constexpr clap_plugin_state_t kState{Save, Load};

    // Presets. A key that is none changes nothing.
    const ClapHostPresetLoad* PresetHost() const {
        for (const char* const id : kClapPresetLoad)
            if (const auto* const host = HostExtension<ClapHostPresetLoad>(id)) return host;
        return nullptr;
    }
    bool TakePreset(std::uint32_t kind, const char* key) try {
        const int preset = kind == kClapPresetsInPlugin ? PresetOfClapKey(*m_core, key) : -1;
        if (preset < 0) return false;
        m_core->TakePreset(preset);
        TellValues();
        AskForRestart();
        return true;
    } catch (const std::exception&) {
        return false;
    }
    static bool LoadPreset(const clap_plugin_t* plugin, std::uint32_t kind, const char* path,
                           const char* key) {
        ClapPlugin& self = Of(plugin);
        const bool taken = self.TakePreset(kind, key);
        const auto* const host = self.PresetHost();
        if (host && taken) host->loaded(self.m_host, kind, path, key);
        if (host && !taken) host->onError(self.m_host, kind, path, key, 0, "The plug-in has no such preset");
        return taken;
    }
    static constexpr ClapPresetLoad kPresetLoad{LoadPreset};

    static ClapWindow& WindowOf(const clap_plugin_t* plugin) { return Of(plugin).m_window; }

    static const void* Extension(const clap_plugin_t* plugin, const char* id) {
        if (std::strcmp(id, CLAP_EXT_AUDIO_PORTS) == 0) return &kAudioPorts;
        if (std::strcmp(id, CLAP_EXT_PARAMS) == 0) return &kParams;
        if (std::strcmp(id, CLAP_EXT_LATENCY) == 0) return &kLatency;
        if (std::strcmp(id, CLAP_EXT_STATE) == 0) return &kState;
        if (std::strcmp(id, kClapTail) == 0) return &kTail;
        for (const char* const known : kClapPresetLoad)
            if (std::strcmp(id, known) == 0) return Of(plugin).m_core->Presets() > 0 ? &kPresetLoad : nullptr;
        return Of(plugin).m_core->HasWindow() ? ClapWindow::Extension<WindowOf>(id) : nullptr;
    }

    const clap_host_t* const m_host;
    const std::unique_ptr<Core> m_core;
    ClapWindow m_window;
    std::vector<float> m_sent;  // of the outputs
    bool m_isActive = false;
    std::atomic<int> m_told{0}, m_restartFor{0};  // the latencies that the host knows, and was asked for
    std::atomic<bool> m_callbackIsWanted{false};
};

const clap_plugin_factory_t kFactory{
    [](const clap_plugin_factory_t*) { return static_cast<std::uint32_t>(Entries().size()); },
    [](const clap_plugin_factory_t*, std::uint32_t index) {
        return index < Entries().size() ? &Entries()[index].descriptor : nullptr;
    },
    [](const clap_plugin_factory_t*, const clap_host_t* host, const char* id) -> const clap_plugin_t* {
        if (!host || !clap_version_is_compatible(host->clap_version)) return nullptr;
        for (const Entry& entry : Entries())
            if (entry.id == id) try {
                    return &(new ClapPlugin(entry, host))->plugin;
                } catch (const std::exception&) {
                    return nullptr;  // no memory
                }
        return nullptr;
    }};

}  // namespace

const clap_plugin_entry_t clap_entry{CLAP_VERSION, [](const char*) { return true; }, [] {},
                                     [](const char* id) -> const void* {
                                         if (std::strcmp(id, CLAP_PLUGIN_FACTORY_ID) == 0) return &kFactory;
                                         return FindClapPresetFactory(id);
                                     }};
