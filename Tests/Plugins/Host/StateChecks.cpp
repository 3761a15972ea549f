// States: what a session keeps must come back, and what is no state must do no harm.
#include <cmath>
#include <cstdio>

#include "Checks.h"
#include "Support/TwoThreads.h"

namespace PluginHost {
namespace {

void ExpectSameValues(Instance& plugin, Instance& other, const std::string& when) {
    for (std::size_t i = 0; i < plugin.parameters.size(); ++i) {
        const Parameter& p = plugin.parameters[i];
        if (p.readOnly || p.hidden) continue;
        const double ours = plugin.Get(p), theirs = other.Get(other.parameters[i]);
        Expect(std::abs(ours - theirs) <= 1e-6 * (p.maximum - p.minimum),
               p.name + " is " + std::to_string(theirs) + " and not " + std::to_string(ours) + " " + when);
    }
}

void CheckRestoring(PluginFile& file, std::size_t index, unsigned seed) {
    std::mt19937 random(seed);
    const auto plugin = file.Create(index), restored = file.Create(index);
    std::vector<Change> changes = ForAll(*plugin, [&] { return Share(random); });
    for (const Parameter& p : plugin->parameters)
        if (p.bypass && seed % 3 == 0) changes.push_back({p.id, p.maximum, 0});
    plugin->Flush(changes);
    const auto state = plugin->Save(), inPieces = plugin->Save({.most = 17});
    if (state.empty()) return Finding("its state cannot be saved");
    Expect(state == inPieces, "its state differs when the stream takes 17 bytes at a time");
    Expect(restored->Load({.bytes = state, .most = 23}), "refuses its own state, 23 bytes at a time");
    ExpectSameValues(*plugin, *restored, "after the state came back");
    Expect(restored->Save() == state, "saves other bytes than it was given");

    // The same values with a block, and while it runs without audio.
    const auto active = file.Create(index);
    active->Activate(48000, 64);
    const Signal input = Noise(*active, 64);
    if (seed % 2)
        Render(*active, input, {.block = 64, .changes = changes});
    else
        OnAudioThread([&] { active->FlushActive(changes); });
    active->Deactivate();
    ExpectSameValues(*plugin, *active, seed % 2 ? "set with a block" : "set without audio");
    Expect(active->Save() == state, "saves another state where its values came otherwise");

    const Signal noise = Noise(*plugin, 12000);
    const double difference =
        LargestDifference(RenderAt(*plugin, 48000, noise), RenderAt(*restored, 48000, noise));
    Expect(difference < 1e-5,
           "sounds otherwise (by " + std::to_string(difference) + ") after its state came back");
}

// A list may move other values with it. A session that is saved then goes on with them.
void CheckMovedValues(PluginFile& file, std::size_t index) {
    const auto fresh = file.Create(index);
    const Signal noise = Noise(*fresh, 2400);
    std::mt19937 random(9);
    for (const Parameter& p : fresh->parameters)
        for (int step = 0; step <= p.steps && p.steps > 1 && p.automatable; ++step) {
            const auto plugin = file.Create(index), restored = file.Create(index);
            const Change change{p.id, p.At(1.0 * step / p.steps), 0};
            RenderAt(*plugin, 48000, noise, {.changes = ForAll(*plugin, [&] { return Share(random); })});
            RenderAt(*plugin, 48000, noise, {.changes = {&change, 1}});
            const auto state = plugin->Save();
            Expect(restored->Load({.bytes = state}), "refuses its own state");
            ExpectSameValues(*plugin, *restored, "saved after a change of " + p.name);
            RenderAt(*restored, 48000, noise);
            Expect(restored->Save() == state,
                   "goes on otherwise than it was saved after a change of " + p.name);
        }
}

// Learning noise and forgetting it are done, not set: neither is done again by loading.
void CheckActions(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index), restored = file.Create(index);
    const Signal noise = Noise(*plugin, 48000);
    std::vector<Parameter> actions;
    for (const Parameter& p : plugin->parameters)
        if (p.steps == 1 && !p.automatable && !p.readOnly) actions.push_back(p);
    if (actions.size() < 2) return;
    const auto press = [&](Instance& pressed, const Parameter& action, double value) {
        const Change change{action.id, value, 0};
        Render(pressed, noise, {.changes = {&change, 1}});
    };
    for (const auto& each : {plugin.get(), restored.get()}) each->Activate(48000, 256);
    const auto empty = plugin->Save();
    press(*plugin, actions.back(), 1);
    press(*plugin, actions.front(), 1);
    press(*plugin, actions.front(), 0);
    const auto learned = plugin->Save();
    Expect(learned.size() > 2 * empty.size(), "learns nothing");
    press(*plugin, actions.front(), 1);
    Expect(restored->Load({.bytes = plugin->Save()}), "refuses its own state");
    restored->Deactivate();
    restored->Activate(48000, 256);
    press(*restored, actions.front(), 0);
    Expect(restored->Save() == learned, "does something again when its state is loaded");
}

void CheckHarm(PluginFile& file, std::size_t index) {
    const auto fresh = file.Create(index), plugin = file.Create(index);
    const auto state = fresh->Save();
    if (state.empty()) return;
    Expect(!plugin->Load({.bytes = {}}), "takes an empty stream for a state");
    ExpectSameValues(*fresh, *plugin, "after an empty state");
    std::mt19937 random(5);
    for (int i = 0; i < 40; ++i) {
        Bytes broken = state;
        if (i % 2) broken.resize(random() % state.size());
        for (int hits = i; hits > 0 && !broken.empty(); --hits)
            broken[random() % broken.size()] = static_cast<char>(random());
        plugin->Load({.bytes = broken});
        Expect(IsFinite(RenderAt(*plugin, 48000, Noise(*plugin, 256))),
               "does not sound finite after a broken state");
        for (const Parameter& p : plugin->parameters) {
            const double value = plugin->Get(p);
            Expect(value >= p.minimum && value <= p.maximum,
                   p.name + " leaves its range after a broken state");
        }
    }
    Expect(plugin->Load({.bytes = state}), "refuses its own state after broken ones");
    ExpectSameValues(*fresh, *plugin, "after broken states and its own");
}

// What a host may ask for on its main thread while audio runs.
void CheckBesideAudio(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    const Bytes state = plugin->Save();
    const Signal input = Noise(*plugin, 256);
    std::mt19937 random(6);
    plugin->Activate(48000, 256);
    bool finite = true;
    const auto play = [&](int) { finite &= IsFinite(Render(*plugin, input)); };
    TestSupport::WhileAnotherThread(play, [&] {
        for (int i = 0; i < 40; ++i) {
            plugin->Save();
            plugin->Load({.bytes = state});
            if (!plugin->presets.empty()) plugin->TakePreset(random() % plugin->presets.size());
            for (const Parameter& p : plugin->parameters) plugin->Text(p, plugin->Get(p));
        }
    });
    plugin->Deactivate();
    Expect(finite, "is not finite while the main thread saves and loads its state");
}

}  // namespace

void CheckState(PluginFile& file, std::size_t index) {
    for (unsigned seed = 1; seed <= 6; ++seed) CheckRestoring(file, index, seed);
    CheckMovedValues(file, index);
    CheckActions(file, index);
    CheckHarm(file, index);
    CheckBesideAudio(file, index);
}

void PrintPresets(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    for (std::size_t preset = plugin->presets.size(); preset-- > 0;) {
        plugin->TakePreset(preset);
        std::printf("%s\t%s\t", file.Name(index).c_str(), plugin->presets[preset].c_str());
        for (const char byte : plugin->Save())
            std::printf("%02x", static_cast<unsigned>(static_cast<unsigned char>(byte)));
        std::printf("\n");
    }
}

}  // namespace PluginHost
