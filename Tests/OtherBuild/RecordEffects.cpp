// A host of its own, built for every target from this one source: drives each effect and the equaliser with a
// fixed signal and writes what comes out, for CompareBuilds to hold one build against another. Nothing here
// may depend on the build: no mathematics library, no clock, no standard random numbers.

#include <iostream>

#include "DSP/Effects/Framework/MemoryFile.h"
#include "OtherBuild/FixedSignal.h"
#include "OtherBuild/Subjects.h"
#include "Support/EffectRun.h"

namespace {

using namespace OtherBuild;
using namespace TestSupport;

struct Scene {
    std::string name;
    int preset = -1;         // chosen first, if there is one
    std::uint64_t seed = 0;  // every parameter at random, and one moved now and then
};

std::vector<Scene> ScenesOf(CorvoEffectBase& effect) {
    std::vector<Scene> scenes{{.name = "as constructed"}};
    const int presets = effect.NumPresets();
    if (presets > 1) scenes.push_back({.name = "preset 1", .preset = 1});
    if (presets > 2) scenes.push_back({.name = "last preset", .preset = presets - 1});
    for (std::uint64_t seed = 1; seed <= 3; ++seed)
        scenes.push_back({.name = "random " + std::to_string(seed), .seed = seed});
    return scenes;
}

template <typename Sample>
void RecordSamples(const EffectCase& which, const Scene& scene, Kind kind, std::vector<Take>& takes) {
    const auto effect = which.make();
    if (scene.preset >= 0) effect->SetPreset(scene.preset);
    std::vector<Edit> edits;
    if (scene.seed != 0) {
        Random random(scene.seed);
        SetAllParams(*effect, random);
        if (kind == Kind::Float) takes.push_back({which.name, scene.name, Kind::Chunk, Chunk(*effect)});
        for (std::size_t at = 5000; at < 40000; at += 5000)
            edits.push_back({at, random.Below(effect->GetParamCount()), static_cast<float>(random.Unit())});
    }
    const auto output =
        Render(*effect, FixedSignal<Sample>(), Format<Sample>(kChannels, kRate), {512, 64, 1000, 1}, edits);
    takes.push_back({which.name, scene.name, kind, Bytes(output)});
}

// What the effect says about itself, one item a line.
std::vector<std::uint8_t> Texts(CorvoEffectBase& effect) {
    std::u32string text;
    const auto say = [&](const auto& words) {
        for (const auto letter : words) text += static_cast<char32_t>(letter);
        text += U'\n';
    };
    say(effect.GetName());
    say(std::to_string(effect.GetLatency()));
    for (int i = 0; i < effect.NumPresets(); ++i) say(effect.GetPresetName(i));
    for (int i = 0; i < effect.GetParamCount(); ++i) {
        say(effect.GetParamName(i));
        say(effect.GetParamUnitsText(i));
        for (int step = 0; step <= 16; ++step) {
            const float value = static_cast<float>(step) / 16.0f;
            effect.SetParam(i, value, false);
            say(effect.GetParameterFormattedText(i, value));
        }
    }
    return Bytes(std::vector<char32_t>(text.begin(), text.end()));
}

// Thrown inside the library and caught here, which takes one runtime and one type information for both.
void ExpectException() {
    KivFiles::CMemoryFile file;
    try {
        file.Truncate();
    } catch (const Corvo::CorvoException& exception) {
        if (std::string(exception.what()) == "Not implemented") return;
        throw std::runtime_error(std::string("the exception says ") + exception.what());
    }
    throw std::runtime_error("the library threw nothing");
}

}  // namespace

int main(int count, char** arguments) try {
    if (count != 2) throw std::runtime_error("usage: record_effects FILE");
    ExpectException();
    std::cout << "caught the exception thrown inside the library\n";
    std::vector<Take> takes;
    for (const auto& which : AllEffects()) {
        const auto effect = which.make();
        for (const auto& scene : ScenesOf(*effect)) {
            RecordSamples<float>(which, scene, Kind::Float, takes);
            RecordSamples<double>(which, scene, Kind::Double, takes);
        }
        takes.push_back({which.name, "texts", Kind::Texts, Texts(*effect)});
    }
    RecordEqualizer(takes);
    Save(arguments[1], takes);
    std::cout << "recorded " << AllEffects().size() << " effects and the equaliser in " << takes.size()
              << " takes\n";
} catch (const std::exception& exception) {
    std::cerr << "record_effects: " << exception.what() << "\n";
    return 1;
}
