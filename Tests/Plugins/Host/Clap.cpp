// CLAP over the C headers.
#include <clap/entry.h>
#include <clap/ext/audio-ports.h>
#include <clap/ext/latency.h>
#include <clap/ext/params.h>
#include <clap/ext/state.h>
#include <clap/ext/thread-check.h>
#include <clap/plugin-factory.h>
#include <clap/plugin-features.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <map>
#include <set>
#include <stdexcept>
#include <utility>

#include "ClapPresetRecords.h"
#include "ClapWindow.h"
#include "Formats.h"
#include "Module.h"

using namespace Corvo::Plugins;  // CLAP's records of presets

namespace PluginHost {
namespace {

void ExpectThread(Thread thread, const char* call) {
    Expect(CurrentThread() == thread, std::string("calls the host's ") + call + " from the wrong thread");
}

// The host that the plug-in sees, and what it was told of presets: the key that was loaded, and the one that
// was not.
bool g_rescanned = false;
std::string g_loaded, g_refused;
const clap_host_params_t kHostParams{
    [](const clap_host_t*, clap_param_rescan_flags) {
        ExpectThread(Thread::Main, "params.rescan");
        g_rescanned = true;
    },
    [](const clap_host_t*, clap_id, clap_param_clear_flags) { ExpectThread(Thread::Main, "params.clear"); },
    [](const clap_host_t*) {
        Expect(CurrentThread() != Thread::Audio, "calls params.request_flush on the audio thread");
    }};
const clap_host_latency_t kHostLatency{
    [](const clap_host_t*) { ExpectThread(Thread::Main, "latency.changed"); }};
const clap_host_thread_check_t kHostThreads{
    [](const clap_host_t*) { return CurrentThread() == Thread::Main; },
    [](const clap_host_t*) { return CurrentThread() == Thread::Audio; }};

const ClapHostPresetLoad kHostPresets{
    [](const clap_host_t*, std::uint32_t, const char*, const char* key, std::int32_t, const char* message) {
        ExpectThread(Thread::Main, "preset_load.on_error");
        Expect(message && *message, "does not say why a preset cannot be loaded");
        g_refused = key;
    },
    [](const clap_host_t*, std::uint32_t, const char*, const char* key) {
        ExpectThread(Thread::Main, "preset_load.loaded");
        g_loaded = key;
    }};

const void* HostExtension(const clap_host_t*, const char* id) {
    const std::string name = id;
    if (name == CLAP_EXT_PARAMS) return &kHostParams;
    if (name == CLAP_EXT_LATENCY) return &kHostLatency;
    if (name == CLAP_EXT_THREAD_CHECK) return &kHostThreads;
    if (name == CLAP_EXT_TIMER_SUPPORT) return &kClapTimers;
    if (name == kClapPresetLoad[0]) return &kHostPresets;
    return nullptr;
}

bool g_callbackWanted = false;
int g_restarts = 0;
const clap_host_t kHost{CLAP_VERSION,
                        nullptr,
                        "plugin_host",
                        "DSPDll",
                        "",
                        "1.0",
                        HostExtension,
                        [](const clap_host_t*) { ++g_restarts; },
                        [](const clap_host_t*) {},
                        [](const clap_host_t*) { g_callbackWanted = true; }};

// A list of events in both directions that never allocates once it is made.
struct Events {
    static constexpr std::size_t kMost = 8192;
    std::vector<clap_event_param_value_t> events;
    clap_input_events_t in{this, Size, Get};
    clap_output_events_t out{this, Push};

    Events() { events.reserve(kMost); }
    Events(const Events&) = delete;

    void Set(std::span<const Change> changes, std::uint16_t space = CLAP_CORE_EVENT_SPACE_ID) {
        events.clear();
        for (const Change& change : changes.first(std::min(changes.size(), kMost))) {
            const clap_event_header_t header{sizeof(clap_event_param_value_t), change.frame, space,
                                             CLAP_EVENT_PARAM_VALUE, 0};
            events.push_back({header, change.parameter, nullptr, -1, -1, -1, -1, change.value});
        }
    }

    static std::uint32_t Size(const clap_input_events_t* list) {
        return static_cast<std::uint32_t>(static_cast<Events*>(list->ctx)->events.size());
    }
    static const clap_event_header_t* Get(const clap_input_events_t* list, std::uint32_t index) {
        return &static_cast<Events*>(list->ctx)->events[index].header;
    }
    static bool Push(const clap_output_events_t*, const clap_event_header_t* event) {
        // A text would count as an allocation of the plug-in.
        if (!event || event->size < sizeof(clap_event_header_t)) Finding("sends the host a malformed event");
        return true;
    }
};

struct Preset {
    std::string name, key;
};

class ClapInstance : public Instance {
public:
    ClapInstance(const clap_plugin_t* plugin, const std::vector<Preset>& list)
        : m_plugin(plugin), m_list(list) {
        if (!plugin->init(plugin)) throw std::runtime_error("init fails");
        m_params = ClapExtension<clap_plugin_params_t>(m_plugin, CLAP_EXT_PARAMS);
        m_state = ClapExtension<clap_plugin_state_t>(m_plugin, CLAP_EXT_STATE);
        m_latency = ClapExtension<clap_plugin_latency_t>(m_plugin, CLAP_EXT_LATENCY);
        if (!m_params || !m_state) throw std::runtime_error("has no parameters or no state");
        Expect(!plugin->get_extension(plugin, "no.such.extension"), "has an extension that does not exist");
        for (const Preset& preset : list) presets.push_back(preset.name);
        for (const char* const id : kClapPresetLoad) {
            m_presetLoad = ClapExtension<ClapPresetLoad>(m_plugin, id);
            Expect((m_presetLoad != nullptr) == !list.empty(), "loads presets, or lists them, not both");
        }
        ReadParameters();
        ReadPorts(true, inputs);
        ReadPorts(false, outputs);
    }
    ~ClapInstance() override {
        RunCallback();
        m_plugin->destroy(m_plugin);
    }

    std::optional<std::string> Text(const Parameter& parameter, double value) override {
        std::array<char, 256> text{};
        if (!m_params->value_to_text(m_plugin, parameter.id, value, text.data(), text.size())) return {};
        std::array<char, 4> little{'x', 'x', 'x', 'x'};
        m_params->value_to_text(m_plugin, parameter.id, value, little.data(), 3);
        Expect(little[3] == 'x' && std::memchr(little.data(), 0, 3), "writes past the end of a short text");
        return text.data();
    }
    std::optional<double> Value(const Parameter& parameter, const std::string& text) override {
        double value = 0;
        if (!m_params->text_to_value(m_plugin, parameter.id, text.c_str(), &value)) return {};
        return value;
    }
    double Get(const Parameter& parameter) override {
        double value = NAN;
        Expect(m_params->get_value(m_plugin, parameter.id, &value), "get_value fails for " + parameter.name);
        return value;
    }

    bool TakePreset(std::size_t preset) override {
        g_rescanned = false;
        g_loaded.clear();
        const std::string& key = m_list[preset].key;
        if (!m_presetLoad->load(m_plugin, kClapPresetsInPlugin, nullptr, key.c_str())) return false;
        Expect(g_rescanned && g_loaded == key, "does not tell the host that a preset was loaded");
        return true;
    }

    bool SaveTo(Stream& stream) override {
        const clap_ostream_t out{
            &stream, [](const clap_ostream_t* to, const void* bytes, std::uint64_t size) {
                return static_cast<Stream*>(to->ctx)->Write(bytes, static_cast<std::int64_t>(size));
            }};
        return m_state->save(m_plugin, &out);
    }
    bool Load(Stream stream) override {
        const clap_istream_t in{&stream, [](const clap_istream_t* from, void* buffer, std::uint64_t size) {
                                    return static_cast<Stream*>(from->ctx)->Read(
                                        buffer, static_cast<std::int64_t>(size));
                                }};
        return m_state->load(m_plugin, &in);
    }

    bool Activate(double rate, std::uint32_t maxFrames) override {
        if (!m_plugin->activate(m_plugin, rate, 1, maxFrames)) return false;
        bool started = false;
        OnAudioThread([&] { started = m_plugin->start_processing(m_plugin); });
        return started;
    }
    void Deactivate() override {
        OnAudioThread([&] { m_plugin->stop_processing(m_plugin); });
        m_plugin->deactivate(m_plugin);
        RunCallback();
    }
    std::uint32_t Latency() override { return m_latency ? m_latency->get(m_plugin) : 0; }

    int TakeLatencyNews() override {
        RunCallback();
        return std::exchange(g_restarts, 0);
    }

    void Flush(std::span<const Change> changes) override {
        m_events.Set(changes);
        InRealTime([&] { m_params->flush(m_plugin, &m_events.in, &m_events.out); });
    }
    void FlushActive(std::span<const Change> changes) override { Flush(changes); }

    bool Process(const Block& block) override {
        m_events.Set(block.changes);
        std::array<clap_audio_buffer_t, 4> in{}, out{};
        using Buffer = clap_audio_buffer_t;
        Divide(inputs, block.inputs, in, &Buffer::data32, &Buffer::channel_count);
        Divide(outputs, block.outputs, out, &Buffer::data32, &Buffer::channel_count);
        clap_event_transport_t transport{};
        transport.header = {sizeof transport, 0, CLAP_CORE_EVENT_SPACE_ID, CLAP_EVENT_TRANSPORT, 0};
        transport.flags = CLAP_TRANSPORT_HAS_TEMPO | CLAP_TRANSPORT_IS_PLAYING;
        transport.tempo = tempo;
        clap_process_t process{m_time, block.frames, &transport,   in.data(), out.data(), 0,
                               0,      &m_events.in, &m_events.out};
        process.audio_inputs_count = static_cast<std::uint32_t>(inputs.size());
        process.audio_outputs_count = static_cast<std::uint32_t>(outputs.size());
        m_time += block.frames;
        clap_process_status status = CLAP_PROCESS_ERROR;
        InRealTime([&] { status = m_plugin->process(m_plugin, &process); });
        return status != CLAP_PROCESS_ERROR;
    }
    void Reset() override {
        InRealTime([&] { m_plugin->reset(m_plugin); });
    }

    std::unique_ptr<Window> MakeWindow() override { return MakeClapWindow(m_plugin); }

    void CheckFormat() override {
        clap_param_info_t info{};
        const auto beyond = m_params->count(m_plugin);
        double value = 0;
        Expect(!m_params->get_info(m_plugin, beyond, &info), "describes a parameter that it does not have");
        Expect(!m_params->get_value(m_plugin, 0x7fffffff, &value), "has a value for an unknown parameter");
        std::vector<Change> all;
        for (const Parameter& p : parameters)
            if (!p.readOnly) all.push_back({p.id, p.initial == p.minimum ? p.maximum : p.minimum, 0});
        m_events.Set(all, 0xb33f);
        m_params->flush(m_plugin, &m_events.in, &m_events.out);
        for (const Parameter& p : parameters)
            Expect(p.readOnly || std::abs(Get(p) - p.initial) <= 1e-6 * (p.maximum - p.minimum),
                   p.name + " follows an event of another name space");
        const auto state = Save();
        for (const char* key : {"", "no-such-preset", "compressor:preset-0", "gain:preset-1"})
            Expect(!m_presetLoad || (!m_presetLoad->load(m_plugin, kClapPresetsInPlugin, nullptr, key) &&
                                     g_refused == key && Save() == state),
                   std::string("takes the preset \"") + key + "\", or does not tell that it cannot");
    }

private:
    void ReadParameters() {
        for (std::uint32_t i = 0; i < m_params->count(m_plugin); ++i) {
            clap_param_info_t info{};
            Expect(m_params->get_info(m_plugin, i, &info), "get_info fails");
            const auto has = [&](auto flag) { return (info.flags & static_cast<unsigned>(flag)) != 0; };
            const double range = info.max_value - info.min_value;
            parameters.push_back({info.id, info.name, info.min_value, info.max_value, info.default_value,
                                  has(CLAP_PARAM_IS_STEPPED) ? static_cast<int>(range) : 0,
                                  has(CLAP_PARAM_IS_READONLY), has(CLAP_PARAM_IS_AUTOMATABLE),
                                  has(CLAP_PARAM_IS_BYPASS), has(CLAP_PARAM_IS_HIDDEN)});
        }
    }
    void ReadPorts(bool input, std::vector<Port>& ports) {
        const auto* audio = ClapExtension<clap_plugin_audio_ports_t>(m_plugin, CLAP_EXT_AUDIO_PORTS);
        if (!audio) throw std::runtime_error("has no audio ports");
        std::set<clap_id> ids;
        for (std::uint32_t i = 0; i < audio->count(m_plugin, input); ++i) {
            clap_audio_port_info_t info{};
            Expect(audio->get(m_plugin, i, input, &info), "describes a port that it does not have");
            Expect(ids.insert(info.id).second, "two ports have one id");
            const std::string type = info.port_type ? info.port_type : "";
            Expect(type != CLAP_PORT_MONO || info.channel_count == 1, "a mono port has not one channel");
            Expect(type != CLAP_PORT_STEREO || info.channel_count == 2, "a stereo port has not two channels");
            ports.push_back({info.name, static_cast<int>(info.channel_count),
                             (info.flags & CLAP_AUDIO_PORT_IS_MAIN) != 0});
        }
        clap_audio_port_info_t info{};
        const auto count = static_cast<std::uint32_t>(ports.size());
        Expect(!audio->get(m_plugin, count, input, &info), "describes one port more than it counts");
    }

    void RunCallback() {
        if (std::exchange(g_callbackWanted, false)) m_plugin->on_main_thread(m_plugin);
    }

    const clap_plugin_t* m_plugin;
    const clap_plugin_params_t* m_params;
    const clap_plugin_state_t* m_state;
    const clap_plugin_latency_t* m_latency;
    const ClapPresetLoad* m_presetLoad = nullptr;
    const std::vector<Preset>& m_list;
    Events m_events;
    std::int64_t m_time = 0;
};

class ClapFile : public PluginFile {
public:
    explicit ClapFile(const std::filesystem::path& file) : m_module(file) {
        m_entry = m_module.Find<const clap_plugin_entry_t>("clap_entry");
        if (!m_entry || !clap_version_is_compatible(m_entry->clap_version))
            throw std::runtime_error("has no entry of this version");
        if (!m_entry->init(file.string().c_str())) throw std::runtime_error("its entry's init fails");
        m_factory = static_cast<const clap_plugin_factory_t*>(m_entry->get_factory(CLAP_PLUGIN_FACTORY_ID));
        if (!m_factory) throw std::runtime_error("has no plug-in factory");
        Expect(!m_entry->get_factory("no.such.factory"), "has a factory that does not exist");
        Expect(!m_factory->get_plugin_descriptor(m_factory, m_factory->get_plugin_count(m_factory)),
               "describes one plug-in more than it has");
        const auto* const presets = m_entry->get_factory(kClapPresetFactory[0]);
        Expect(presets == m_entry->get_factory(kClapPresetFactory[1]), "has presets under one name only");
        if (presets) ReadPresets(static_cast<const ClapPresetFactory*>(presets));
    }
    ~ClapFile() override { m_entry->deinit(); }

    std::size_t Count() const override { return m_factory->get_plugin_count(m_factory); }
    std::string Name(std::size_t index) const override { return Descriptor(index)->name; }

    std::vector<std::string> Texts(std::size_t index) const override {
        const clap_plugin_descriptor_t& d = *Descriptor(index);
        std::set<std::string> features;
        for (const char** feature = d.features; *feature; ++feature)
            Expect(features.insert(*feature).second, std::string("names twice the feature ") + *feature);
        Expect(features.contains(CLAP_PLUGIN_FEATURE_AUDIO_EFFECT),
               "does not say that it is an audio effect");
        return {d.id, d.name, d.vendor, d.version, d.description};
    }
    std::unique_ptr<Instance> Create(std::size_t index) override {
        const clap_plugin_descriptor_t* descriptor = Descriptor(index);
        if (m_created.insert(index).second) CheckCreation(*descriptor);
        const clap_plugin_t* plugin = m_factory->create_plugin(m_factory, &kHost, descriptor->id);
        if (!plugin) throw std::runtime_error("cannot be created");
        Expect(std::strcmp(plugin->desc->id, descriptor->id) == 0, "its instance has another id");
        return std::make_unique<ClapInstance>(plugin, m_presets[descriptor->id]);
    }

private:
    const clap_plugin_descriptor_t* Descriptor(std::size_t index) const {
        return m_factory->get_plugin_descriptor(m_factory, static_cast<std::uint32_t>(index));
    }
    // As a host does before it makes a plug-in.
    struct Listing {
        std::map<std::string, std::vector<Preset>>& presets;
        Preset at{};
        bool located = false, failed = false;
        static Listing& Of(const auto* record) { return *static_cast<Listing*>(record->data); }
    };
    void ReadPresets(const ClapPresetFactory* factory) {
        Listing listing{m_presets};
        using Indexer = ClapPresetIndexer;
        using Receiver = ClapPresetReceiver;
        Indexer indexer{CLAP_VERSION, "plugin_host", "", "", "1.0", &listing, {}, {}, {}, {}};
        indexer.declareLocation = [](const Indexer* own, const ClapPresetLocation* location) {
            return Listing::Of(own).located = location->kind == kClapPresetsInPlugin && !location->path;
        };
        Receiver receiver{};
        receiver.data = &listing;
        receiver.onError = [](const Receiver* own, std::int32_t, const char*) {
            Listing::Of(own).failed = true;
        };
        receiver.beginPreset = [](const Receiver* own, const char* name, const char* key) {
            Listing::Of(own).at = {name, key};
            return true;
        };
        receiver.addPlugin = [](const Receiver* own, const Receiver::PluginId* id) {
            Listing::Of(own).presets[id->id].push_back(Listing::Of(own).at);
        };
        receiver.setFlags = [](const Receiver*, std::uint32_t) {};
        receiver.addCreator = receiver.addFeature = [](const Receiver*, const char*) {};
        const auto count = factory->count(factory);
        Expect(
            !factory->create(factory, &indexer, "no.such.provider") && !factory->descriptor(factory, count),
            "has a provider of presets that does not exist");
        for (std::uint32_t i = 0; i < count; ++i) {
            const auto* const own = factory->create(factory, &indexer, factory->descriptor(factory, i)->id);
            if (!own) throw std::runtime_error("has a provider of presets that cannot be created");
            Expect(own->init(own) && listing.located, "does not say where its presets are");
            Expect(own->list(own, kClapPresetsInPlugin, nullptr, &receiver) && !listing.failed,
                   "does not list its presets");
            Expect(!own->list(own, 0, "/nowhere", &receiver) && listing.failed,
                   "lists the presets of a file");
            own->destroy(own);
        }
    }

    void CheckCreation(const clap_plugin_descriptor_t& d) const {
        for (const std::string& id : {std::string(d.id) + "x", std::string("no.such.plugin")})
            Expect(!m_factory->create_plugin(m_factory, &kHost, id.c_str()),
                   "creates a plug-in of the unknown id " + id);
        // Never initialised.
        const clap_plugin_t* plugin = m_factory->create_plugin(m_factory, &kHost, d.id);
        if (plugin) plugin->destroy(plugin);
    }

    Module m_module;
    std::set<std::size_t> m_created;
    std::map<std::string, std::vector<Preset>> m_presets;  // by plug-in
    const clap_plugin_entry_t* m_entry;
    const clap_plugin_factory_t* m_factory;
};

}  // namespace

std::unique_ptr<PluginFile> OpenClap(const std::filesystem::path& file) {
    return std::make_unique<ClapFile>(file);
}

}  // namespace PluginHost
