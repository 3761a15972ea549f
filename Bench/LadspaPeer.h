#pragma once

#if DSP_HAVE_LADSPA

#include <benchmark/benchmark.h>
#include <dlfcn.h>
#include <ladspa.h>

#include <map>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "Support/Signals.h"

// A LADSPA plug-in as a peer in the benchmarks: `file` under the system's LADSPA folder, `label` inside it.
// Controls go by the start of their port's name; those not named stay in the middle of their range; one that
// names no port is an error. A plug-in with one input runs once per channel.
class LadspaPeer {
public:
    using Controls = std::map<std::string, float>;

    LadspaPeer(const std::string& file, const std::string& label, const Controls& controls, int rate,
               std::size_t frames)
        : m_frames(frames) {
        m_library = dlopen(("/usr/lib/ladspa/" + file).c_str(), RTLD_NOW);
        if (!m_library) throw std::runtime_error(file + " is not installed");
        const auto find = reinterpret_cast<LADSPA_Descriptor_Function>(dlsym(m_library, "ladspa_descriptor"));
        for (unsigned long i = 0; find && (m_descriptor = find(i)); ++i)
            if (label == m_descriptor->Label) break;
        if (!m_descriptor) throw std::runtime_error(file + " has no " + label);
        for (const auto& control : controls)
            if (!HasPort(control.first)) throw std::runtime_error(label + " has no port " + control.first);
        const std::size_t inputs = Count(LADSPA_PORT_INPUT), outputs = Count(LADSPA_PORT_OUTPUT);
        m_buffers.assign(2 + 2 * outputs, std::vector<float>(frames));
        m_values.resize(m_descriptor->PortCount);
        for (std::size_t instance = 0; instance < (inputs == 1 ? 2u : 1u); ++instance)
            m_handles.push_back(Connect(instance, controls, static_cast<unsigned long>(rate)));
    }
    ~LadspaPeer() {
        for (const auto handle : m_handles) m_descriptor->cleanup(handle);
        dlclose(m_library);
    }
    LadspaPeer(const LadspaPeer&) = delete;
    LadspaPeer& operator=(const LadspaPeer&) = delete;

    // Runs one block of interleaved stereo; taking the channels apart is part of the price.
    void Run(const float* interleaved) {
        for (std::size_t i = 0; i < m_frames; ++i) {
            m_buffers[0][i] = interleaved[2 * i];
            m_buffers[1][i] = interleaved[2 * i + 1];
        }
        for (const auto handle : m_handles) m_descriptor->run(handle, static_cast<unsigned long>(m_frames));
        benchmark::ClobberMemory();
    }

private:
    std::size_t Count(int direction) const {
        std::size_t count = 0;
        for (unsigned long port = 0; port < m_descriptor->PortCount; ++port)
            count += LADSPA_IS_PORT_AUDIO(m_descriptor->PortDescriptors[port]) &&
                     (m_descriptor->PortDescriptors[port] & direction) != 0;
        return count;
    }

    bool IsNamed(unsigned long port, const std::string& start) const {
        return LADSPA_IS_PORT_CONTROL(m_descriptor->PortDescriptors[port]) &&
               std::string_view(m_descriptor->PortNames[port]).starts_with(start);
    }
    bool HasPort(const std::string& start) const {
        for (unsigned long port = 0; port < m_descriptor->PortCount; ++port)
            if (IsNamed(port, start)) return true;
        return false;
    }

    LADSPA_Handle Connect(std::size_t instance, const Controls& controls, unsigned long rate) {
        const auto handle = m_descriptor->instantiate(m_descriptor, rate);
        std::size_t input = instance, output = 2 + instance;
        for (unsigned long port = 0; port < m_descriptor->PortCount; ++port) {
            const auto kind = m_descriptor->PortDescriptors[port];
            if (LADSPA_IS_PORT_AUDIO(kind)) {
                auto& index = LADSPA_IS_PORT_INPUT(kind) ? input : output;
                m_descriptor->connect_port(handle, port, m_buffers[index++].data());
                continue;
            }
            const auto& range = m_descriptor->PortRangeHints[port];
            m_values[port] = (range.LowerBound + range.UpperBound) * 0.5f;
            for (const auto& [name, value] : controls)
                if (IsNamed(port, name)) m_values[port] = value;
            m_descriptor->connect_port(handle, port, &m_values[port]);
        }
        if (m_descriptor->activate) m_descriptor->activate(handle);
        return handle;
    }

    std::size_t m_frames;
    void* m_library = nullptr;
    const LADSPA_Descriptor* m_descriptor = nullptr;
    std::vector<LADSPA_Handle> m_handles;
    std::vector<std::vector<float>> m_buffers;
    std::vector<float> m_values;
};

// Times a plug-in over blocks of state.range(0) stereo frames of noise; skipped where it is not installed.
inline void RunLadspa(benchmark::State& state, const std::string& file, const std::string& label,
                      const LadspaPeer::Controls& controls = {}) {
    const auto frames = static_cast<std::size_t>(state.range(0));
    const auto input = TestSupport::Noise<float>(2 * frames);
    try {
        LadspaPeer peer(file, label, controls, 48000, frames);
        for (auto _ : state) peer.Run(input.data());
    } catch (const std::exception& missing) {
        state.SkipWithError(missing.what());
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

#endif
