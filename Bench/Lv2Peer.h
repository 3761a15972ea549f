#pragma once

#if DSP_HAVE_LILV

#include <lilv/lilv.h>
#include <lv2/core/lv2.h>
#include <lv2/urid/urid.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <map>
#include <stdexcept>
#include <string>
#include <vector>

// An LV2 plug-in as a peer in the benchmarks, run in this process from one planar stereo block into another.
// Controls go by their port's symbol; those not named have their default; one that names no port is an error.
// A plug-in with one input runs once per channel.
class Lv2Peer {
public:
    using Controls = std::map<std::string, double>;
    using Stereo = std::array<float*, 2>;

    Lv2Peer(const std::string& uri, const Controls& controls, double rate, const Stereo& from,
            const Stereo& to) {
        const World& world = World::Get();
        LilvNode* const node = lilv_new_uri(world.lilv, uri.c_str());
        const LilvPlugin* const plugin =
            lilv_plugins_get_by_uri(lilv_world_get_all_plugins(world.lilv), node);
        lilv_node_free(node);
        if (!plugin) throw std::runtime_error(uri + " is not installed");
        for (const auto& control : controls) RequirePort(world, plugin, control.first);
        m_values.resize(lilv_plugin_get_num_ports(plugin));
        lilv_plugin_get_port_ranges_float(plugin, nullptr, nullptr, m_values.data());
        const auto inputs = lilv_plugin_get_num_ports_of_class(plugin, world.audio, world.input, nullptr);
        for (std::size_t channel = 0; channel < (inputs == 1 ? 2u : 1u); ++channel)
            Connect(world, plugin, controls, rate, from.data() + channel, to.data() + channel);
    }
    ~Lv2Peer() {
        for (auto* const instance : m_instances) {
            lilv_instance_deactivate(instance);
            lilv_instance_free(instance);
        }
    }
    Lv2Peer(Lv2Peer&& other) noexcept = default;
    Lv2Peer(const Lv2Peer&) = delete;
    Lv2Peer& operator=(const Lv2Peer&) = delete;

    void Run(int frames) {
        for (auto* const instance : m_instances)
            lilv_instance_run(instance, static_cast<std::uint32_t>(frames));
    }

private:
    // What is installed, and the numbers of URIs; lives until the program ends.
    struct World {
        LilvWorld* lilv = lilv_world_new();
        LilvNode *audio, *control, *input;
        std::map<std::string, LV2_URID> numbers;
        LV2_URID_Map map{
            this, [](LV2_URID_Map_Handle self, const char* uri) {
                auto& known = static_cast<World*>(self)->numbers;
                return known.try_emplace(uri, static_cast<LV2_URID>(known.size() + 1)).first->second;
            }};
        LV2_Feature mapFeature{LV2_URID__map, &map};
        std::array<const LV2_Feature*, 2> features{&mapFeature, nullptr};

        World() {
            lilv_world_load_all(lilv);
            audio = lilv_new_uri(lilv, LV2_CORE__AudioPort);
            control = lilv_new_uri(lilv, LV2_CORE__ControlPort);
            input = lilv_new_uri(lilv, LV2_CORE__InputPort);
        }
        static const World& Get() {
            static const World world;
            return world;
        }
    };

    static void RequirePort(const World& world, const LilvPlugin* plugin, const std::string& symbol) {
        LilvNode* const node = lilv_new_string(world.lilv, symbol.c_str());
        const bool found = lilv_plugin_get_port_by_symbol(plugin, node) != nullptr;
        lilv_node_free(node);
        if (!found)
            throw std::runtime_error(std::string(lilv_node_as_uri(lilv_plugin_get_uri(plugin))) +
                                     " has no port " + symbol);
    }

    void Connect(const World& world, const LilvPlugin* plugin, const Controls& controls, double rate,
                 float* const* from, float* const* to) {
        auto* const instance = lilv_plugin_instantiate(plugin, rate, world.features.data());
        if (!instance) throw std::runtime_error("an LV2 plug-in cannot be made");
        m_instances.push_back(instance);
        for (std::uint32_t index = 0; index < m_values.size(); ++index) {
            const LilvPort* const port = lilv_plugin_get_port_by_index(plugin, index);
            const bool input = lilv_port_is_a(plugin, port, world.input);
            void* place = nullptr;  // events and the like: nothing to hear, nothing to say
            if (lilv_port_is_a(plugin, port, world.audio)) {
                place = input ? *from++ : *to++;
            } else if (lilv_port_is_a(plugin, port, world.control)) {
                const auto named = controls.find(lilv_node_as_string(lilv_port_get_symbol(plugin, port)));
                if (named != controls.end()) m_values[index] = static_cast<float>(named->second);
                place = &m_values[index];
            }
            lilv_instance_connect_port(instance, index, place);
        }
        lilv_instance_activate(instance);
    }

    std::vector<LilvInstance*> m_instances;
    std::vector<float> m_values;
};

#endif
