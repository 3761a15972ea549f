// Latency and bypass: what the host aligns its tracks by, and what it switches while they play.
#include <algorithm>
#include <cmath>
#include <numbers>
#include <numeric>

#include "Checks.h"

namespace PluginHost {
namespace {

const Parameter* Bypass(const Instance& plugin) {
    for (const Parameter& p : plugin.parameters)
        if (p.bypass) return &p;
    return nullptr;
}

struct Lag {
    std::size_t frames = 0;
    double likeness = 0;  // of the whole output to the input that much earlier, 0..1
};

double Energy(const std::vector<float>& signal, std::size_t count) {
    return std::inner_product(signal.begin(), signal.begin() + static_cast<std::ptrdiff_t>(count),
                              signal.begin(), 1e-12);
}

// What sounds before or behind the burst counts against it: reverbs and echoes have no lag to measure.
Lag MeasuredLag(const std::vector<float>& input, const std::vector<float>& output, std::size_t burst) {
    Lag best;
    const double energy = std::sqrt(Energy(input, burst) * Energy(output, output.size()));
    for (std::size_t lag = 0; lag + burst <= output.size(); ++lag) {
        const double sum =
            std::inner_product(input.begin(), input.begin() + static_cast<std::ptrdiff_t>(burst),
                               output.begin() + static_cast<std::ptrdiff_t>(lag), 0.0);
        if (const double likeness = std::abs(sum) / energy; likeness > best.likeness) best = {lag, likeness};
    }
    return best;
}

void CheckLatency(PluginFile& file, std::size_t index) {
    constexpr std::size_t kBurst = 512;
    for (const double rate : {44100.0, 48000.0, 96000.0, 192000.0})
        for (const bool bypassed : {true, false}) {
            const auto plugin = file.Create(index);
            const Parameter* bypass = Bypass(*plugin);
            if (bypassed && !bypass) continue;
            if (bypassed) plugin->Flush(std::vector<Change>{{bypass->id, bypass->maximum, 0}});
            plugin->Activate(rate, 256);
            const std::size_t latency = plugin->Latency();
            // The burst comes after all fades; before and behind it there is silence.
            const std::size_t start = static_cast<std::size_t>(rate / 10);
            Signal input(static_cast<std::size_t>(Channels(plugin->inputs)),
                         std::vector<float>(start + latency + 4096));
            const Signal noise = Noise(static_cast<int>(input.size()), kBurst);
            for (std::size_t c = 0; c < input.size(); ++c)
                std::copy(noise[c].begin(), noise[c].end(),
                          input[c].begin() + static_cast<std::ptrdiff_t>(start));
            const Signal output = Render(*plugin, input);
            plugin->Deactivate();
            const std::vector<float> behind(output[0].begin() + static_cast<std::ptrdiff_t>(start),
                                            output[0].end());
            const Lag lag = MeasuredLag(noise[0], behind, kBurst);
            const std::string where =
                std::string(bypassed ? "bypassed" : "active") + " at " + std::to_string(rate) + " Hz";
            if (bypassed)
                Expect(lag.frames == latency && lag.likeness > 0.99999,
                       where + " its output is not its input " + std::to_string(latency) +
                           " frames later, but (" + std::to_string(lag.likeness) + " alike) " +
                           std::to_string(lag.frames) + " later");
            else if (lag.likeness >
                     0.7)  // effects that change the sound more than that have no lag to measure
                Expect(lag.frames <= latency + 1 && lag.frames + 1 >= latency,
                       where + " it reports " + std::to_string(latency) + " frames of latency and takes " +
                           std::to_string(lag.frames));
        }
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
    const Parameter* bypass = Bypass(*plugin);
    if (!bypass) return;
    constexpr std::size_t kOn = 24123, kOff = 48217, kEnd = 72000;
    Signal input(static_cast<std::size_t>(Channels(plugin->inputs)), std::vector<float>(kEnd));
    for (auto& channel : input)
        for (std::size_t i = 0; i < kEnd; ++i)
            channel[i] = static_cast<float>(
                0.25 * std::sin(2 * std::numbers::pi * 200 / 48000 * static_cast<double>(i)));
    const std::vector<Change> changes{{bypass->id, bypass->maximum, kOn},
                                      {bypass->id, bypass->minimum, kOff}};
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
    CheckBypass(file, index);
}

}  // namespace PluginHost
