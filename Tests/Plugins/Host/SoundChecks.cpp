// Sound: whatever a host sends in, however it divides it.
#include <algorithm>
#include <cmath>
#include <limits>

#include "Checks.h"
#include "Support/Signals.h"

namespace PluginHost {
namespace {

// Under changes of everything to an end of its range or to anywhere in it.
void CheckRatesAndBlocks(PluginFile& file, std::size_t index) {
    bool any = false;
    std::mt19937 random(11);
    for (const int layout : {1, 2}) {
        const auto plugin = file.Create(index);
        if (!plugin->SetChannels(layout)) continue;
        any = true;
        for (const double rate : {22050.0, 32000.0, 44100.0, 48000.0, 88200.0, 96000.0, 192000.0, 44099.5})
            for (const std::uint32_t block : {1u, 2u, 17u, 64u, 480u, 1023u, 4096u}) {
                const std::uint32_t frames = block < 64 ? 256 : 4096;
                std::vector<Change> changes;
                for (const std::uint32_t frame : {0u, frames / 4, frames / 2})
                    for (const Parameter& p : plugin->parameters)
                        if (!p.readOnly && !p.hidden && !p.bypass)
                            changes.push_back(
                                {p.id, p.At(std::clamp(2 * Share(random) - 0.5, 0.0, 1.0)), frame});
                const Signal input = Noise(*plugin, frames, 0.9f);
                Expect(
                    IsFinite(RenderAt(*plugin, rate, input, {.block = block, .changes = changes})),
                    "is not finite at " + std::to_string(rate) + " Hz in blocks of " + std::to_string(block));
            }
    }
    Expect(any, "is neither mono nor stereo");
}

void CheckRepeats(PluginFile& file, std::size_t index) {
    const auto fresh = file.Create(index), plugin = file.Create(index), other = file.Create(index);
    const Signal input = Noise(*fresh, 24000);
    const Signal expected = RenderAt(*fresh, 48000, input);
    const auto expect = [&](const Signal& output, const std::string& text) {
        const double difference = LargestDifference(expected, output);
        Expect(difference < 1e-5, text + " (by " + std::to_string(difference) + ")");
    };
    if (IsRealTime())  // others cut the stream in their own way
        expect(RenderAt(*other, 48000, input, {.block = 1024, .mixed = true}),
               "sounds otherwise in blocks of changing length");
    // Only the main ports share memory, and only when they are alike.
    if (plugin->inputs.front().channels == plugin->outputs.front().channels)
        expect(RenderAt(*other, 48000, input, {.inPlace = true}), "sounds otherwise in place");
    plugin->Activate(48000, 256);
    Render(*plugin, Noise(*plugin, 30000, 0.9f, 3));
    OnAudioThread([&] { plugin->Reset(); });
    expect(Render(*plugin, input), "sounds otherwise after a reset");
    plugin->Deactivate();
    expect(RenderAt(*plugin, 48000, input), "sounds otherwise after it was activated anew");
}

void CheckBadSamples(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    Signal input = Noise(*plugin, 24000);
    std::size_t at = 6000;
    constexpr float kInfinity = std::numeric_limits<float>::infinity();
    for (const float bad : {std::numeric_limits<float>::quiet_NaN(), kInfinity, -kInfinity, 1e-42f})
        for (auto& channel : input) channel[at++] = bad;
    std::vector<Change> changes;
    for (const Parameter& p : plugin->parameters)
        if (!p.readOnly && !p.hidden)
            changes.push_back({p.id, std::numeric_limits<double>::quiet_NaN(), 3000});
    const Signal output = RenderAt(*plugin, 48000, input, {.changes = changes});
    Expect(IsFinite(output), "is not finite when its input is not");
    const auto fresh = file.Create(index);
    const Signal usual = RenderAt(*fresh, 48000, Noise(*fresh, 24000));
    const auto level = [](const auto& channel) { return TestSupport::Level(channel, 0.375, 0.5); };
    for (std::size_t c = 0; c < usual.size(); ++c)
        Expect(std::abs(level(output[c]) - level(usual[c])) < 6,
               "does not sound as before a quarter of a second after bad samples");
}

void CheckSilence(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    Signal input = Noise(*plugin, 3 * 48000);
    for (auto& channel : input) std::fill(channel.begin() + 4800, channel.end(), 0.0f);
    for (const auto& channel : RenderAt(*plugin, 48000, input, {.block = 512}))
        Expect(std::ranges::all_of(channel, [](float s) { return s == 0 || std::isnormal(s); }),
               "sends denormal numbers while it fades to silence");
}

// A side-chain that is there has to be heard at some setting.
void CheckSideChain(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    const auto& inputs = plugin->inputs;
    const Signal loud = Noise(*plugin, 9600, 0.9f);
    Signal silent = loud;
    for (auto channel = silent.begin() + inputs.front().channels; channel != silent.end(); ++channel)
        std::fill(channel->begin(), channel->end(), 0.0f);
    Expect(inputs.size() < 2 || !AlwaysAlike(file, index, loud, silent), "does not hear its side-chain");
}

}  // namespace

void CheckSound(PluginFile& file, std::size_t index) {
    for (const auto check :
         {CheckRatesAndBlocks, CheckRepeats, CheckBadSamples, CheckSilence, CheckSideChain})
        check(file, index);
}

}  // namespace PluginHost
