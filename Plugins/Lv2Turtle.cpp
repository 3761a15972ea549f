#include <array>
#include <charconv>
#include <cstdio>
#include <exception>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <string_view>

#include "Core.h"
#include "Lv2Ports.h"

// Writes what LV2 hosts read about the plug-ins and their presets: dsp_lv2_turtle FOLDER BINARY
namespace {

using namespace Corvo::Plugins;

constexpr char kPrefixes[] = R"(@prefix atom: <http://lv2plug.in/ns/ext/atom#> .
@prefix doap: <http://usefulinc.com/ns/doap#> .
@prefix foaf: <http://xmlns.com/foaf/0.1/> .
@prefix lv2: <http://lv2plug.in/ns/lv2core#> .
@prefix owl: <http://www.w3.org/2002/07/owl#> .
@prefix pg: <http://lv2plug.in/ns/ext/port-groups#> .
@prefix pprops: <http://lv2plug.in/ns/ext/port-props#> .
@prefix pset: <http://lv2plug.in/ns/ext/presets#> .
@prefix rdf: <http://www.w3.org/1999/02/22-rdf-syntax-ns#> .
@prefix rdfs: <http://www.w3.org/2000/01/rdf-schema#> .
@prefix rsz: <http://lv2plug.in/ns/ext/resize-port#> .
@prefix state: <http://lv2plug.in/ns/ext/state#> .
@prefix ui: <http://lv2plug.in/ns/extensions/ui#> .
@prefix units: <http://lv2plug.in/ns/extensions/units#> .
@prefix xsd: <http://www.w3.org/2001/XMLSchema#> .
)";

struct UnitName {
    std::string_view shown, turtle;
};
constexpr UnitName kUnits[]{{"dB", "units:db"},      {"Hz", "units:hz"},
                            {"ms", "units:ms"},      {"%", "units:pc"},
                            {"cents", "units:cent"}, {"semitones", "units:semitone12TET"}};

std::string Number(float value) {
    std::array<char, 64> text;
    const auto end = std::to_chars(text.begin(), text.end(), value, std::chars_format::fixed).ptr;
    std::string number(text.begin(), end);
    return number.find('.') == number.npos ? number + ".0" : number;
}

std::string Quoted(std::string_view text) {
    std::string quoted = "\"";
    for (const char c : text) {
        if (c == '"' || c == '\\') quoted += '\\';
        quoted += c;
    }
    return quoted + '"';
}

std::string Base64(const std::vector<std::uint8_t>& bytes) {
    constexpr char kLetters[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        std::uint32_t group = 0;
        const std::size_t count = std::min<std::size_t>(3, bytes.size() - i);
        for (std::size_t k = 0; k < 3; ++k) group = group << 8 | (k < count ? bytes[i + k] : 0u);
        for (std::size_t k = 0; k < 4; ++k) text += k > count ? '=' : kLetters[group >> (18 - 6 * k) & 63];
    }
    return text;
}

// One file, complete or an error.
class File {
public:
    File(const std::string& folder, const std::string& name) : m_path(folder + "/" + name), m_out(m_path) {
        m_out << kPrefixes;
    }
    template <typename T>
    File& operator<<(const T& text) {
        m_out << text;
        return *this;
    }
    void Close() {
        m_out.close();
        if (!m_out) throw std::runtime_error("cannot write " + m_path);
    }

private:
    std::string m_path;
    std::ofstream m_out;
};

class PluginTurtle {
public:
    PluginTurtle(const PluginRow& row, int channels)
        : m_row(row),
          m_core(MakeCore(row, channels)),
          m_order{channels, m_core->SideChannels(), row.Is(kTempo)},
          m_uri(PluginUri(row, channels)) {}

    void WriteManifest(File& file, const std::string& binary) {
        file << "\n<" << m_uri << ">\n    a lv2:Plugin ;\n    lv2:binary <" << binary << "> ;\n"
             << "    rdfs:seeAlso <" << m_row.id << ".ttl> .\n";
        for (int preset = 0; preset < m_core->Presets(); ++preset)
            file << "\n<" << PresetUri(preset) << ">\n    a pset:Preset ;\n    lv2:appliesTo <" << m_uri
                 << "> ;\n    rdfs:label " << Quoted(m_core->PresetName(preset)) << " ;\n"
                 << "    rdfs:seeAlso <" << m_row.id << "-presets.ttl> .\n";
    }

    void WritePlugin(File& file) {
        const auto& groups = m_core->Groups();
        for (std::size_t i = 0; i < groups.size(); ++i)
            file << "\n<" << GroupUri(i) << ">\n    a pg:InputGroup ;\n    lv2:name " << Quoted(groups[i])
                 << " ;\n    lv2:symbol " << Quoted(SymbolOf(groups[i])) << " .\n";
        file << "\n<" << m_uri << ">\n    a lv2:" << m_row.lv2Class << ", lv2:Plugin, doap:Project ;\n"
             << "    doap:name " << Quoted(PluginName(m_row, m_order.channels)) << " ;\n"
             << "    doap:shortdesc " << Quoted(m_row.about) << " ;\n"
             << "    rdfs:comment " << Quoted(m_row.about) << " ;\n"
             << "    doap:license <urn:dspdll:licence-not-chosen> ;\n"
             << "    doap:maintainer [ a foaf:Organization ; foaf:name \"DSPDll\" ] ;\n"
             << "    lv2:minorVersion " << m_row.minorVersion << " ;\n    lv2:microVersion 0 ;\n"
             << "    lv2:extensionData state:interface ;\n"
             << "    lv2:optionalFeature <http://lv2plug.in/ns/ext/urid#map>, "
                "<http://lv2plug.in/ns/ext/options#options>, "
                "<http://lv2plug.in/ns/ext/buf-size#boundedBlockLength>"
             << (m_row.Is(kMayWait) ? "" : ", lv2:hardRTCapable") << " ;\n"
             << (m_core->HasWindow() ? std::string("    ui:ui <") + kLv2WindowUri + "> ;\n" : "")
             << "    <http://lv2plug.in/ns/ext/options#supportedOption> "
                "<http://lv2plug.in/ns/ext/buf-size#maxBlockLength> ;\n    lv2:port";
        WriteAudio(file);
        WriteFixed(file);
        for (std::size_t i = 0; i < m_core->Ports().size(); ++i) WriteControl(file, i);
        file << " .\n";
    }

    void WritePresets(File& file) {
        for (int preset = 0; preset < m_core->Presets(); ++preset) {
            m_core->TakePreset(preset);
            file << "\n<" << PresetUri(preset) << ">\n    a pset:Preset ;\n    lv2:appliesTo <" << m_uri
                 << "> ;\n    rdfs:label " << Quoted(m_core->PresetName(preset)) << " ;\n"
                 << "    state:state [ <" << kLv2SettingsKey << "> \"" << Base64(m_core->State())
                 << "\"^^xsd:base64Binary ] ;\n    lv2:port";
            const char* before = "";
            for (std::size_t i = 0; i < m_core->Ports().size(); ++i) {
                const Port& port = m_core->Ports()[i];
                if (port.momentary || port.isOutput) continue;
                file << before << "\n        [ lv2:symbol " << Quoted(port.symbol) << " ; pset:value "
                     << Number(m_core->Value(static_cast<int>(i))) << " ]";
                before = ",";
            }
            file << " .\n";
        }
    }

private:
    std::string PresetUri(int preset) const { return m_uri + ":preset-" + std::to_string(preset + 1); }
    std::string GroupUri(std::size_t group) const { return m_uri + ":group-" + std::to_string(group + 1); }

    void Begin(File& file, int index, const std::string& kind, const std::string& symbol,
               const std::string& name) {
        file << (index > 0 ? " , [" : " [") << "\n        a " << kind << " ;\n        lv2:index " << index
             << " ;\n        lv2:symbol " << Quoted(symbol) << " ;\n        lv2:name " << Quoted(name)
             << " ;\n";
    }

    void WriteAudio(File& file) {
        const auto write = [&](int first, int count, const char* kind, const std::string& symbol,
                               const std::string& name, const char* properties) {
            for (int c = 0; c < count; ++c) {
                const char* const side = count == 1 ? "" : c == 0 ? "_l" : "_r";
                const char* const sideName = count == 1 ? "" : c == 0 ? " left" : " right";
                Begin(file, first + c, kind, symbol + side, name + sideName);
                file << properties << "    ]";
            }
        };
        write(0, m_order.channels, "lv2:InputPort, lv2:AudioPort", "in", "In", "");
        write(m_order.FirstOut(), m_order.channels, "lv2:OutputPort, lv2:AudioPort", "out", "Out", "");
        write(m_order.FirstSide(), m_order.sideChannels, "lv2:InputPort, lv2:AudioPort", "side", "Side-chain",
              "        lv2:portProperty lv2:isSideChain, lv2:connectionOptional ;\n"
              "        rdfs:comment \"What the effect listens to instead of its input, once it sounds\" ;\n");
    }

    // The ports that every plug-in has.
    void WriteFixed(File& file) {
        if (m_order.tempo) {
            Begin(file, m_order.Time(), "lv2:InputPort, atom:AtomPort", "time", "Time");
            file << "        atom:bufferType atom:Sequence ;\n"
                    "        atom:supports <http://lv2plug.in/ns/ext/time#Position> ;\n"
                    "        lv2:designation lv2:control ;\n"
                    "        lv2:portProperty lv2:connectionOptional ;\n"
                    "        rdfs:comment \"Tempo and time signature of the host\" ;\n    ]";
        }
        Begin(file, m_order.Latency(), "lv2:OutputPort, lv2:ControlPort", "latency", "Latency");
        file << "        lv2:minimum 0 ;\n        lv2:maximum 192000 ;\n        lv2:designation lv2:latency "
                ";\n"
                "        lv2:portProperty lv2:reportsLatency, lv2:integer, lv2:connectionOptional, "
                "pprops:notOnGUI ;\n        units:unit units:frame ;\n"
                "        rdfs:comment \"Frames by which the output is late\" ;\n    ]";
        Begin(file, m_order.Enabled(), "lv2:InputPort, lv2:ControlPort", "enabled", "Enabled");
        file << "        lv2:default 1 ;\n        lv2:minimum 0 ;\n        lv2:maximum 1 ;\n"
                "        lv2:designation lv2:enabled ;\n"
                "        lv2:portProperty lv2:toggled, lv2:integer, lv2:connectionOptional ;\n"
                "        rdfs:comment \"Off: the input, as late as the effect\" ;\n    ]";
    }

    void WriteControl(File& file, std::size_t index) {
        const Port& port = m_core->Ports()[index];
        const bool toggled = port.type == Corvo::EffectParameterType::Switch;
        Begin(file, m_order.FirstControl() + static_cast<int>(index),
              port.isOutput ? "lv2:OutputPort, lv2:ControlPort" : "lv2:InputPort, lv2:ControlPort",
              port.symbol, port.name);
        if (!port.isOutput) file << "        lv2:default " << Number(port.start) << " ;\n";
        file << "        lv2:minimum " << Number(port.least) << " ;\n        lv2:maximum "
             << Number(port.most) << " ;\n        rdfs:comment " << Quoted(port.comment) << " ;\n";
        if (const auto name = ShortNameOf(port.name); name != port.name)
            file << "        lv2:shortName " << Quoted(name) << " ;\n";
        if (toggled) file << "        lv2:portProperty lv2:toggled, lv2:integer ;\n";
        if (port.type == Corvo::EffectParameterType::List)
            file << "        lv2:portProperty lv2:enumeration, lv2:integer ;\n";
        if (port.whole && port.points.empty()) file << "        lv2:portProperty lv2:integer ;\n";
        if (port.isIdle) file << "        lv2:portProperty pprops:notOnGUI ;\n";
        if (port.momentary) file << "        lv2:portProperty pprops:notAutomatic ;\n";
        if (port.springsBack) file << "        lv2:portProperty pprops:trigger ;\n";
        if (port.logarithmic) file << "        lv2:portProperty pprops:logarithmic ;\n";
        if (port.group >= 0)
            file << "        pg:group <" << GroupUri(static_cast<std::size_t>(port.group)) << "> ;\n";
        for (const auto& [shown, turtle] : kUnits)
            if (port.unit == shown) file << "        units:unit " << std::string(turtle) << " ;\n";
        for (const auto& point : port.points)
            file << "        lv2:scalePoint [ rdfs:label " << Quoted(point.text) << " ; rdf:value "
                 << Number(point.value) << " ] ;\n";
        file << "    ]";
    }

    const PluginRow& m_row;
    const std::unique_ptr<Core> m_core;
    const Lv2Ports m_order;
    const std::string m_uri;
};

void WriteAll(const std::string& folder, const std::string& binary) {
    File manifest(folder, "manifest.ttl");
    manifest << "\n<" << kLv2SettingsKey
             << ">\n    a rdf:Property, owl:DatatypeProperty ;\n    rdfs:label \"settings\" ;\n"
                "    rdfs:comment \"All settings of an effect, as it stores them\" ;\n"
                "    rdfs:range xsd:base64Binary .\n";
    for (const auto& row : PluginRows()) {
        PluginTurtle stereo(row, 2), mono(row, 1);
        File plugin(folder, std::string(row.id) + ".ttl"),
            presets(folder, std::string(row.id) + "-presets.ttl");
        for (PluginTurtle* const turtle : {&stereo, &mono}) {
            turtle->WriteManifest(manifest, binary);
            turtle->WritePlugin(plugin);
            turtle->WritePresets(presets);
        }
        plugin.Close();
        presets.Close();
    }
    if (MakeCore(PluginRows()[0], 2)->HasWindow())
        manifest << "\n<" << kLv2WindowUri << ">\n    a ui:X11UI ;\n    lv2:binary <" << binary << "> ;\n"
                 << "    lv2:requiredFeature ui:idleInterface, "
                    "<http://lv2plug.in/ns/ext/instance-access> ;\n"
                    "    lv2:optionalFeature ui:parent, ui:resize, <http://lv2plug.in/ns/ext/urid#map>, "
                    "<http://lv2plug.in/ns/ext/options#options> ;\n"
                    "    lv2:extensionData ui:idleInterface .\n";
    manifest.Close();
}

}  // namespace

int main(int count, char** arguments) {
    if (count != 3) {
        std::fprintf(stderr, "usage: dsp_lv2_turtle FOLDER BINARY\n");
        return 2;
    }
    try {
        WriteAll(arguments[1], arguments[2]);
        return 0;
    } catch (const std::exception& error) {
        std::fprintf(stderr, "dsp_lv2_turtle: %s\n", error.what());
        return 1;
    }
}
