// State and presets: choose a preset by name, turn a control, save everything, restore it elsewhere.
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <vector>

#include "DSP/Effects/EffectKinds.h"
#include "DSP/Effects/ParameterInput.h"

using namespace Corvo::DSP;

// What a control's label says, and what stands beside it.
static std::string Shown(CorvoEffectBase& effect) {
    std::string text;
    for (int i = 0; i < effect.GetParamCount(); ++i)
        text += "  " + effect.Describe(i).label + ": " + TextAt(effect, i, effect.GetParam(i)) + "\n";
    return text;
}

int main() {
    const EffectKind* const kind = FindEffectKind("Chorus");
    const auto chorus = kind->MakeReady();
    for (int i = 0; i < chorus->NumPresets(); ++i)
        if (chorus->GetPresetName(i) == "Vintage Flange") chorus->SetPreset(i);
    for (const int index : FindParameters(*chorus, "Frequency"))
        chorus->SetParam(index, ReadParameter(*chorus, index, "0.3 Hz").normalised, false);

    // Bad input is told in a sentence, and nothing changes.
    try {
        ReadParameter(*chorus, 0, "quickly");
        return 1;
    } catch (const std::invalid_argument& error) {
        std::printf("as expected: %s\n", error.what());
    }

    // The chunk is the same on every platform. Save it and not the preset's number: a control was turned.
    std::vector<std::uint8_t> chunk;
    chorus->GetSettingsChunk(chunk);
    std::ofstream("chorus.state", std::ios::binary)
        .write(reinterpret_cast<const char*>(chunk.data()), static_cast<std::streamsize>(chunk.size()));

    std::ifstream file("chorus.state", std::ios::binary);
    const std::vector<std::uint8_t> read{std::istreambuf_iterator<char>(file), {}};
    const auto restored = kind->MakeReady();
    const bool differed = Shown(*restored) != Shown(*chorus);
    restored->SetSettingsChunk(read);
    std::printf("%zu bytes hold\n%s", read.size(), Shown(*restored).c_str());
    return differed && Shown(*restored) == Shown(*chorus) ? 0 : 1;
}
