// LV2 over its C headers. The values of the ports are the host's, and saved with a session; what they are
// stands in the bundle.
#include <lv2/atom.h>
#include <lv2/lv2.h>
#include <lv2/state.h>
#include <lv2/time.h>
#include <lv2/urid.h>

#include <fstream>
#include <map>
#include <sstream>
#include <stdexcept>
#include <utility>

#include "Formats.h"
#include "Module.h"

namespace PluginHost {
namespace {

LV2_URID Id(void*, const char* uri) {
    static std::map<std::string, LV2_URID> ids;
    return ids.try_emplace(uri, static_cast<LV2_URID>(ids.size() + 1)).first->second;
}
LV2_URID_Map g_map{nullptr, Id};
const LV2_Feature kMap{LV2_URID__map, &g_map};
const LV2_Feature* const kFeatures[]{&kMap, nullptr};

// What follows a word of Turtle.
std::string After(const std::string& text, const std::string& word) {
    const auto at = text.find(word + " ");
    std::string found;
    if (at != text.npos) std::istringstream(text.substr(at + word.size())) >> found;
    return found;
}
bool Has(const std::string& text, const char* word) { return text.find(word) != text.npos; }

// A sequence of one event: the host's tempo.
struct Time {
    LV2_Atom_Sequence list;
    std::int64_t frame;
    LV2_Atom_Object object;
    LV2_Atom_Property_Body key;
    float bpm, unused;

    explicit Time(double tempo)
        : list{{sizeof(Time) - sizeof(LV2_Atom), Id(nullptr, LV2_ATOM__Sequence)}, {0, 0}},
          frame(0),
          object{{sizeof object.body + sizeof key + sizeof bpm, Id(nullptr, LV2_ATOM__Object)},
                 {0, Id(nullptr, LV2_TIME__Position)}},
          key{Id(nullptr, LV2_TIME__beatsPerMinute), 0, {sizeof bpm, Id(nullptr, LV2_ATOM__Float)}},
          bpm(static_cast<float>(tempo)),
          unused(0.0f) {}
};

class Lv2Instance : public Instance {
public:
    Lv2Instance(const LV2_Descriptor& plugin, const std::string& turtle)
        : m_plugin(plugin),
          m_state(static_cast<const LV2_State_Interface*>(plugin.extension_data(LV2_STATE__interface))) {
        if (!m_state) throw std::runtime_error("has no state");
        for (auto at = turtle.find("[\n"); at != turtle.npos; at = turtle.find("[\n", at + 1))
            ReadPort(turtle.substr(at, turtle.find("\n    ]", at) - at));
        Make(48000);
    }
    ~Lv2Instance() override { m_plugin.cleanup(m_handle); }

    bool HasTexts() const override { return false; }
    double Get(const Parameter& p) override {
        const auto value = static_cast<double>(m_values[p.id]);
        return p.bypass ? 1 - value : value;
    }

    bool SaveTo(Stream& stream) override {
        for (const Parameter& p : parameters)
            if (!p.readOnly) stream.Write(&m_values[p.id], sizeof(float));
        const auto settings = Settings();
        stream.bytes.insert(stream.bytes.end(), settings.begin(), settings.end());
        return true;
    }
    bool Load(Stream stream) override {
        const auto count = std::ranges::count(parameters, false, &Parameter::readOnly);
        const auto size = static_cast<std::ptrdiff_t>(sizeof(float)) * count;
        if (static_cast<std::ptrdiff_t>(stream.bytes.size()) < size) return false;
        if (!Restore({stream.bytes.begin() + size, stream.bytes.end()})) return false;
        for (const Parameter& p : parameters) {
            float value = 0;
            if (p.readOnly) continue;
            stream.Read(&value, sizeof value);
            if (value >= static_cast<float>(p.minimum) && value <= static_cast<float>(p.maximum))
                m_values[p.id] = value;
        }
        return true;
    }

    bool Activate(double rate, std::uint32_t) override {
        if (rate != m_rate) {
            const auto settings = Settings();
            m_plugin.cleanup(m_handle);
            Make(rate);
            Restore(settings);
        }
        m_plugin.activate(m_handle);
        FlushActive({});  // tells the latency
        return true;
    }
    void Deactivate() override {
        if (m_plugin.deactivate) m_plugin.deactivate(m_handle);
    }
    std::uint32_t Latency() override { return static_cast<std::uint32_t>(m_values[m_latency]); }
    int TakeLatencyNews() override { return std::exchange(m_news, 0); }

    bool Process(const Block& block) override {
        for (const Change& change : block.changes)
            for (const Parameter& p : parameters)
                if (p.id == change.parameter)
                    m_values[p.id] = static_cast<float>(p.bypass ? 1 - change.value : change.value);
        for (std::size_t i = 0; i < block.inputs.size(); ++i) Connect(m_in[i], block.inputs[i]);
        for (std::size_t i = 0; i < block.outputs.size(); ++i) Connect(m_out[i], block.outputs[i]);
        Time time(tempo);
        if (m_time > 0) Connect(m_time, &time);
        const float before = m_values[m_latency];
        InRealTime([&] { m_plugin.run(m_handle, block.frames); });
        m_news += m_values[m_latency] != before;
        return true;
    }
    void Reset() override { m_plugin.activate(m_handle); }

private:
    void ReadPort(const std::string& text) {
        const auto index = static_cast<std::uint32_t>(std::stoi(After(text, "lv2:index")));
        const bool input = Has(text, "lv2:InputPort");
        m_values.resize(index + 1);
        if (Has(text, "lv2:AudioPort")) {
            (input ? m_in : m_out).push_back(index);
            auto& ports = input ? inputs : outputs;
            const bool side = Has(text, "lv2:isSideChain");
            if (ports.size() == (side ? 1u : 0u)) ports.push_back({side ? "Side-chain" : "Main", 0, !side});
            ++ports.back().channels;
        } else if (!Has(text, "lv2:ControlPort")) {
            m_time = index;
        } else if (Has(text, "lv2:reportsLatency")) {
            m_latency = index;
        } else {
            const double least = std::stod(After(text, "lv2:minimum")),
                         most = std::stod(After(text, "lv2:maximum"));
            const double initial = input ? std::stod(After(text, "lv2:default")) : least;
            const bool bypass = Has(text, "lv2:enabled");
            m_values[index] = static_cast<float>(initial);
            parameters.push_back({index, After(text, "lv2:symbol"), least, most, bypass ? 0 : initial,
                                  Has(text, "lv2:integer") ? static_cast<int>(most - least) : 0, !input,
                                  input && !Has(text, "pprops:notAutomatic"), bypass, false});
        }
    }
    void Connect(std::uint32_t port, void* data) { m_plugin.connect_port(m_handle, port, data); }
    void Make(double rate) {
        m_rate = rate;
        m_handle = m_plugin.instantiate(&m_plugin, rate, "", kFeatures);
        if (!m_handle) throw std::runtime_error("cannot be created");
        Connect(m_latency, &m_values[m_latency]);
        for (const Parameter& p : parameters) Connect(p.id, &m_values[p.id]);
    }

    Bytes Settings() {
        Bytes settings;
        const auto store = [](void* to, LV2_URID, const void* data, std::size_t size, LV2_URID,
                              std::uint32_t) {
            const auto* const bytes = static_cast<const char*>(data);
            static_cast<Bytes*>(to)->assign(bytes, bytes + size);
            return LV2_STATE_SUCCESS;
        };
        Expect(m_state->save(m_handle, store, &settings, 0, nullptr) == LV2_STATE_SUCCESS, "cannot be saved");
        return settings;
    }
    bool Restore(Bytes settings) {
        const auto retrieve = [](void* from, LV2_URID, std::size_t* size, LV2_URID* type,
                                 std::uint32_t* flags) -> const void* {
            const auto& bytes = *static_cast<Bytes*>(from);
            *size = bytes.size();
            *type = Id(nullptr, LV2_ATOM__Chunk);
            *flags = LV2_STATE_IS_POD;
            return bytes.data();
        };
        return m_state->restore(m_handle, retrieve, &settings, 0, nullptr) == LV2_STATE_SUCCESS;
    }

    const LV2_Descriptor& m_plugin;
    const LV2_State_Interface* const m_state;
    LV2_Handle m_handle = nullptr;
    double m_rate = 0;
    std::vector<float> m_values;  // of all ports, by index
    std::vector<std::uint32_t> m_in, m_out;
    std::uint32_t m_time = 0, m_latency = 0;
    int m_news = 0;
};

class Lv2File : public PluginFile {
public:
    explicit Lv2File(const std::filesystem::path& bundle)
        : m_module(bundle / bundle.stem().concat(".so")),
          m_describe(m_module.Find<const LV2_Descriptor*(std::uint32_t)>("lv2_descriptor")) {
        if (!m_describe) throw std::runtime_error("has no lv2_descriptor");
        for (const auto& file : std::filesystem::directory_iterator(bundle))
            if (file.path().extension() == ".ttl" && file.path().stem() != "manifest") {
                std::stringstream text;
                text << std::ifstream(file.path()).rdbuf();
                m_turtle += text.str();
            }
        while (m_describe(m_count)) ++m_count;
    }
    std::size_t Count() const override { return m_count; }
    std::string Name(std::size_t index) const override {
        const auto text = Turtle(index), before = std::string("doap:name \"");
        const auto from = text.find(before) + before.size();
        return text.substr(from, text.find('"', from) - from);
    }
    std::vector<std::string> Texts(std::size_t index) const override { return {Name(index)}; }
    std::unique_ptr<Instance> Create(std::size_t index) override {
        return std::make_unique<Lv2Instance>(*m_describe(static_cast<std::uint32_t>(index)), Turtle(index));
    }

private:
    std::string Turtle(std::size_t index) const {
        const std::string uri = m_describe(static_cast<std::uint32_t>(index))->URI;
        const auto from = m_turtle.find("\n<" + uri + ">\n    a lv2:");
        if (from == m_turtle.npos) throw std::runtime_error("is not described in its bundle");
        return m_turtle.substr(from, m_turtle.find("] .\n", from) - from);
    }

    Module m_module;
    const LV2_Descriptor* (*m_describe)(std::uint32_t);
    std::string m_turtle;
    std::uint32_t m_count = 0;
};

}  // namespace

std::unique_ptr<PluginFile> OpenLv2(const std::filesystem::path& bundle) {
    return std::make_unique<Lv2File>(bundle);
}

}  // namespace PluginHost
