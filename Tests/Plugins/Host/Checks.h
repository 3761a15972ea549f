#pragma once

#include <random>

#include "Instance.h"

namespace PluginHost {

// Each takes a file and the number of the plug-in in it, and notes what it finds.
void CheckLife(PluginFile&, std::size_t);
void CheckParameters(PluginFile&, std::size_t);
void CheckState(PluginFile&, std::size_t);
void CheckSound(PluginFile&, std::size_t);
void CheckTiming(PluginFile&, std::size_t);
void PrintPresets(PluginFile&, std::size_t);  // in lines: plug-in, preset, its state in hexadecimal digits
void CheckWindow(PluginFile&, std::size_t);   // needs a display

using Signal = std::vector<std::vector<float>>;  // by channel

struct Way {
    std::uint32_t block = 256;
    bool inPlace = false, mixed = false;   // blocks of all lengths up to `block`, 0 included
    std::span<const Change> changes = {};  // frames count from the beginning of the signal
};

int Channels(const std::vector<Port>&);
inline double Share(std::mt19937& random) { return static_cast<double>(random()) / 4294967295.0; }
Signal Noise(const Instance&, std::size_t frames, float level = 0.25f, unsigned seed = 1);
// The output of an active plug-in.
Signal Render(Instance&, const Signal& input, const Way& = {});
// Activates, renders and deactivates.
Signal RenderAt(Instance&, double rate, const Signal& input, const Way& = {});
bool IsFinite(const Signal&);
double LargestDifference(const Signal&, const Signal&);
// Whether two inputs, or two tempos, sound alike at any settings.
bool AlwaysAlike(PluginFile&, std::size_t, const Signal& one, const Signal& other, double tempo = 120);

// A value for every parameter that a host may automate; `of` gives its place in the range, 0..1.
template <typename Of>
std::vector<Change> ForAll(const Instance& plugin, Of of, std::uint32_t frame = 0) {
    std::vector<Change> changes;
    for (const Parameter& parameter : plugin.parameters)
        if (parameter.automatable && !parameter.bypass)
            changes.push_back({parameter.id, parameter.At(of()), frame});
    return changes;
}

}  // namespace PluginHost
