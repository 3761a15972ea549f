#include <src/lv2/atom-util.h>
#include <src/lv2/atom.h>
#include <src/lv2/buf-size.h>
#include <src/lv2/options.h>
#include <src/lv2/state.h>
#include <src/lv2/time.h>
#include <src/lv2/urid.h>

#include <atomic>
#include <cmath>
#include <cstring>
#include <exception>
#include <string>
#include <vector>

#include "Lv2Instance.h"
#include "Lv2Ports.h"

// Every plug-in as LV2. No feature is required: without the map of identifiers there is neither stored state
// nor tempo, without the options blocks are cut at 4096 frames.
namespace {

using namespace Corvo::Plugins;

// Numbers of tempo and time signature.
constexpr double kLeastTime = 1.0, kMostTime = 1e6;

struct Identifiers {
    explicit Identifiers(const LV2_URID_Map* map) {
        if (!map) return;
        const auto id = [map](const char* uri) { return map->map(map->handle, uri); };
        settings = id(kLv2SettingsKey);
        chunk = id(LV2_ATOM__Chunk);
        object = id(LV2_ATOM__Object);
        blank = id(LV2_ATOM__Blank);
        integer = id(LV2_ATOM__Int);
        longInteger = id(LV2_ATOM__Long);
        real = id(LV2_ATOM__Float);
        longReal = id(LV2_ATOM__Double);
        position = id(LV2_TIME__Position);
        bpm = id(LV2_TIME__beatsPerMinute);
        beatsPerBar = id(LV2_TIME__beatsPerBar);
        beatUnit = id(LV2_TIME__beatUnit);
        longest = id(LV2_BUF_SIZE__maxBlockLength);
    }

    LV2_URID settings = 0, chunk = 0, object = 0, blank = 0, integer = 0, longInteger = 0, real = 0,
             longReal = 0;
    LV2_URID position = 0, bpm = 0, beatsPerBar = 0, beatUnit = 0, longest = 0;
};

class Lv2Plugin final : public Lv2Instance {
public:
    Lv2Plugin(const PluginRow& row, int channels, double rate, const LV2_Feature* const* features)
        : Lv2Instance(MakeCore(row, channels, Values::OfHost)),
          m_ids(static_cast<const LV2_URID_Map*>(Lv2Feature(features, LV2_URID__map))),
          m_order{channels, core->SideChannels(), row.Is(kTempo)},
          m_rate(rate),
          m_ports(static_cast<std::size_t>(m_order.FirstControl()) + core->Ports().size()),
          m_seen(core->Ports().size()) {
        for (std::size_t i = 0; i < m_seen.size(); ++i) m_seen[i] = core->Ports()[i].start;
        const auto* option =
            static_cast<const LV2_Options_Option*>(Lv2Feature(features, LV2_OPTIONS__options));
        for (; option && option->key != 0; ++option)
            if (option->key == m_ids.longest && option->type == m_ids.integer)
                m_longest = *static_cast<const std::int32_t*>(option->value);
    }

    void Connect(std::uint32_t port, void* data) {
        if (port < m_ports.size()) m_ports[port] = data;
    }
    // The sound begins with the values that the host has put into the ports by now.
    void Activate() {
        m_actionsAreKnown = false;
        ReadControls();
        core->Prepare(m_rate, m_longest);
    }

    void Run(std::uint32_t frames) {
        if (const auto* const events = Port<const LV2_Atom_Sequence>(m_order.Time())) ReadTime(*events);
        ReadControls();
        m_actionsAreKnown = true;
        const float *in[2]{}, *side[2]{};
        float* out[2]{};
        bool whole = true;
        for (int c = 0; c < m_order.channels; ++c) {
            in[c] = Port<const float>(c);
            out[c] = Port<float>(m_order.FirstOut() + c);
            whole = whole && in[c] && out[c];
        }
        for (int c = 0; c < m_order.sideChannels; ++c) side[c] = Port<const float>(m_order.FirstSide() + c);
        core->Run(in, out, side, whole ? static_cast<int>(frames) : 0);
        if (auto* const latency = Port<float>(m_order.Latency()))
            *latency = static_cast<float>(core->Latency());
        for (std::size_t i = 0; i < m_seen.size(); ++i)
            if (auto* const value = Port<float>(m_order.FirstControl() + static_cast<int>(i));
                value && core->Ports()[i].isOutput)
                *value = core->Value(static_cast<int>(i));
    }

    LV2_State_Status Save(LV2_State_Store_Function store, LV2_State_Handle handle) {
        if (m_ids.settings == 0) return LV2_STATE_ERR_NO_FEATURE;
        const auto bytes = core->State();
        return store(handle, m_ids.settings, bytes.data(), bytes.size(), m_ids.chunk,
                     LV2_STATE_IS_POD | LV2_STATE_IS_PORTABLE);
    }
    LV2_State_Status Restore(LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle) {
        if (m_ids.settings == 0) return LV2_STATE_ERR_NO_FEATURE;
        std::size_t size = 0;
        std::uint32_t type = 0, flags = 0;
        const void* const data = retrieve(handle, m_ids.settings, &size, &type, &flags);
        if (!data) return LV2_STATE_ERR_NO_PROPERTY;
        if (type != m_ids.chunk) return LV2_STATE_ERR_BAD_TYPE;
        const auto* const bytes = static_cast<const std::uint8_t*>(data);
        m_actionsAreKnown = false;
        return core->TakeState({bytes, bytes + size}) ? LV2_STATE_SUCCESS : LV2_STATE_ERR_UNKNOWN;
    }

private:
    void ReadControls() {
        if (const auto* const enabled = Port<const float>(m_order.Enabled())) core->Bypass(*enabled <= 0.5f);
        for (std::size_t i = 0; i < m_seen.size(); ++i) {
            const auto* const value = Port<const float>(m_order.FirstControl() + static_cast<int>(i));
            if (!value || core->Ports()[i].isOutput || *value == m_seen[i] || std::isnan(*value)) continue;
            m_seen[i] = *value;
            // A switch that the host restores as it stood is not pressed again.
            if (m_actionsAreKnown || !core->Ports()[i].momentary) core->Set(static_cast<int>(i), *value);
        }
    }

    template <typename T>
    T* Port(int index) const {
        return index < 0 ? nullptr : static_cast<T*>(m_ports[static_cast<std::size_t>(index)]);
    }

    // Takes a number of any type, if it may be a tempo or part of a time signature.
    template <typename T>
    void TakeNumber(const LV2_Atom* atom, T& number) const {
        if (!atom) return;
        const void* const body = atom + 1;
        double read = 0.0;
        if (atom->type == m_ids.real)
            read = static_cast<double>(*static_cast<const float*>(body));
        else if (atom->type == m_ids.longReal)
            read = *static_cast<const double*>(body);
        else if (atom->type == m_ids.integer)
            read = *static_cast<const std::int32_t*>(body);
        else if (atom->type == m_ids.longInteger)
            read = static_cast<double>(*static_cast<const std::int64_t*>(body));
        if (read >= kLeastTime && read <= kMostTime) number = static_cast<T>(read);
    }

    void ReadTime(const LV2_Atom_Sequence& events) {
        LV2_ATOM_SEQUENCE_FOREACH(&events, event) {
            if (event->body.type != m_ids.object && event->body.type != m_ids.blank) continue;
            const auto* const object = reinterpret_cast<const LV2_Atom_Object*>(&event->body);
            if (object->body.otype != m_ids.position || m_ids.position == 0) continue;
            const LV2_Atom *bpm = nullptr, *beats = nullptr, *unit = nullptr;
            lv2_atom_object_get(object, m_ids.bpm, &bpm, m_ids.beatsPerBar, &beats, m_ids.beatUnit, &unit, 0);
            TakeNumber(bpm, m_bpm);
            TakeNumber(beats, m_numerator);
            TakeNumber(unit, m_denominator);
            core->Tempo(m_bpm, m_numerator, m_denominator);
        }
    }

    const Identifiers m_ids;
    const Lv2Ports m_order;
    const double m_rate;
    int m_longest = 4096;
    std::vector<void*> m_ports;
    std::vector<float> m_seen;                   // values of the control ports at the last run
    std::atomic<bool> m_actionsAreKnown{false};  // how they stood since the settings were taken as a whole
    double m_bpm = 120.0;
    int m_numerator = 4, m_denominator = 4;
};

Lv2Plugin& Of(LV2_Handle plugin) { return static_cast<Lv2Plugin&>(*static_cast<Lv2Instance*>(plugin)); }

// Hosts in C cannot take what is thrown.
LV2_State_Status Guarded(auto call) {
    try {
        return call();
    } catch (const std::exception&) {
        return LV2_STATE_ERR_UNKNOWN;  // no memory
    }
}

// Two descriptors for each row: of two channels, and of one.
struct Entry {
    const PluginRow* row;
    int channels;
    std::string uri;
    LV2_Descriptor descriptor;
};

extern const LV2_State_Interface kState;

LV2_Handle Instantiate(const LV2_Descriptor* descriptor, double rate, const char*,
                       const LV2_Feature* const* features);

const std::vector<Entry>& Entries() {
    static const auto entries = [] {
        std::vector<Entry> made;
        for (const auto& row : PluginRows())
            for (const int channels : {2, 1}) made.push_back({&row, channels, PluginUri(row, channels), {}});
        for (Entry& entry : made)
            entry.descriptor = {
                entry.uri.c_str(),
                Instantiate,
                [](LV2_Handle plugin, std::uint32_t port, void* data) { Of(plugin).Connect(port, data); },
                [](LV2_Handle plugin) { Guarded([&] { return Of(plugin).Activate(), LV2_STATE_SUCCESS; }); },
                [](LV2_Handle plugin, std::uint32_t frames) { Of(plugin).Run(frames); },
                nullptr,
                [](LV2_Handle plugin) { delete static_cast<Lv2Instance*>(plugin); },
                [](const char* uri) -> const void* {
                    return std::strcmp(uri, LV2_STATE__interface) == 0 ? &kState : nullptr;
                }};
        return made;
    }();
    return entries;
}

LV2_Handle Instantiate(const LV2_Descriptor* descriptor, double rate, const char*,
                       const LV2_Feature* const* features) {
    for (const Entry& entry : Entries())
        if (&entry.descriptor == descriptor) try {
                return static_cast<Lv2Instance*>(new Lv2Plugin(*entry.row, entry.channels, rate, features));
            } catch (const std::exception&) {
                return nullptr;  // no memory
            }
    return nullptr;
}

const LV2_State_Interface kState{
    [](LV2_Handle plugin, LV2_State_Store_Function store, LV2_State_Handle handle, std::uint32_t,
       const LV2_Feature* const*) { return Guarded([&] { return Of(plugin).Save(store, handle); }); },
    [](LV2_Handle plugin, LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle, std::uint32_t,
       const LV2_Feature* const*) { return Guarded([&] { return Of(plugin).Restore(retrieve, handle); }); }};

}  // namespace

LV2_SYMBOL_EXPORT const LV2_Descriptor* lv2_descriptor(std::uint32_t index) {
    return index < Entries().size() ? &Entries()[index].descriptor : nullptr;
}
