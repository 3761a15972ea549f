// Latency and bypass: what the host aligns its tracks by, and what it switches while they play.
#include <algorithm>
#include <cmath>

#include "Checks.h"
#include "Support/Signals.h"

namespace PluginHost {
namespace {

const Parameter& Bypass(const Instance& plugin) {
    const auto at = std::ranges::find(plugin.parameters, true, &Parameter::bypass);
    return plugin.parameters.at(static_cast<std::size_t>(at - plugin.parameters.begin()));
}

// Bypassed, the output is the input so many frames later. That the effect's own sound is as late, the
// renderings of other hosts show.
void CheckLatency(PluginFile& file, std::size_t index) {
    for (const double rate : {44100.0, 48000.0, 96000.0, 192000.0})
        for (const bool bypassed : {true, false}) {
            const auto plugin = file.Create(index);
            const Parameter& bypass = Bypass(*plugin);
            if (bypassed) plugin->Flush(std::vector<Change>{{bypass.id, bypass.maximum, 0}});
            const Signal input = Noise(*plugin, static_cast<std::size_t>(rate / 2));
            plugin->Activate(rate, 256);
            const std::size_t latency = plugin->Latency();
            const Signal output = Render(*plugin, input);
            Expect(plugin->Latency() == latency, "reports another latency after it sounded");
            plugin->Deactivate();
            float wrong = 0;
            for (std::size_t i = latency; bypassed && i < output[0].size(); ++i)
                wrong = std::max(wrong, std::abs(output[0][i] - input[0][i - latency]));
            Expect(wrong < 1e-6f, "bypassed at " + std::to_string(rate) + " Hz its output is not its input " +
                                      std::to_string(latency) + " frames later");
        }
}

// A setting may move the latency, which the host is told once.
void CheckNewLatency(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    const Signal input = Noise(*plugin, 4800);
    plugin->Activate(48000, 256);
    plugin->TakeLatencyNews();
    for (const Parameter& p : plugin->parameters)
        for (const double part : {0.0, 1.0}) {
            if (p.steps == 0 || p.readOnly || p.bypass || !p.automatable) continue;
            const std::uint32_t before = plugin->Latency();
            const Change change{p.id, p.At(part), 0};
            Render(*plugin, input, {.changes = {&change, 1}});
            const int told = plugin->TakeLatencyNews(), expected = plugin->Latency() != before ? 1 : 0;
            Expect(told == expected, "tells " + std::to_string(told) + " times and not " +
                                         std::to_string(expected) + " that " + p.name + " moved the latency");
        }
    plugin->Deactivate();
}

void CheckTempo(PluginFile& file, std::size_t index) {
    if (file.Name(index).rfind("Echo", 0) != 0) return;
    const Signal noise = Noise(*file.Create(index), 96000);
    Expect(!AlwaysAlike(file, index, noise, noise, 60), "does not follow the tempo");
}

double SharpestBend(const std::vector<float>& signal, std::size_t from, std::size_t to) {
    double sharpest = 0;
    for (std::size_t i = from + 2; i < std::min(to, signal.size()); ++i)
        sharpest = std::max(sharpest,
                            std::abs(static_cast<double>(signal[i]) - 2.0 * signal[i - 1] + signal[i - 2]));
    return sharpest;
}

// Switched in the middle of a wave nothing bends more sharply than on both sides of it, but for the fade's
// own.
void CheckBypass(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    const Parameter& bypass = Bypass(*plugin);
    constexpr std::size_t kOn = 24123, kOff = 48217, kEnd = 72000;
    const Signal input(static_cast<std::size_t>(Channels(plugin->inputs)),
                       TestSupport::Sine<float>(kEnd, 200, 48000, 0.25));
    const std::vector<Change> changes{{bypass.id, bypass.maximum, kOn}, {bypass.id, bypass.minimum, kOff}};
    const Signal output = RenderAt(*plugin, 48000, input, {.block = 64, .changes = changes});
    for (const auto& channel : output) {
        const double around =
            std::max(SharpestBend(channel, 12000, kOn - 64), SharpestBend(channel, 36000, kOff - 64));
        const double switched =
            std::max(SharpestBend(channel, kOn - 64, 30000), SharpestBend(channel, kOff - 64, 54000));
        Expect(switched <= 2 * around + 0.004, "clicks when it is bypassed: a bend of " +
                                                   std::to_string(switched) + " beside " +
                                                   std::to_string(around) + " elsewhere");
    }
}

}  // namespace

void CheckTiming(PluginFile& file, std::size_t index) {
    CheckLatency(file, index);
    CheckNewLatency(file, index);
    CheckTempo(file, index);
    CheckBypass(file, index);
}

}  // namespace PluginHost
