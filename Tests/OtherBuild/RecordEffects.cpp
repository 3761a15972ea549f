// Two builds of the library side by side: the same source runs on each target, and what both say must agree.
//   record_effects FILE          writes what the effects and the equaliser make of a fixed signal
//   record_effects FILE OTHER    and compares it with what another build wrote
// Nothing that is recorded depends on more than the library: no mathematics library, no clock.

#include <cmath>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <limits>
#include <stdexcept>

#include "DSP/Equalizer/ParEQ.h"
#include "Support/EffectCases.h"
#include "Support/EffectRun.h"

namespace {

using namespace TestSupport;

constexpr int kRate = 48000, kChannels = 2;
constexpr std::size_t kToneFrames = 24000, kNoiseFrames = 12000, kSilentFrames = 12000;
// 4500 roundings of a double: what sines and powers that differ in their last bit grow into. A low band of
// the equaliser is what is left of coefficients near 1 and 2: a last bit counts (rate / (2 pi 50 Hz))^2
// times.
constexpr double kLimit = 1e-12, kEqualizerLimit = 1e-11;
constexpr double kLevelLimitDb = 0.5;

struct Take {
    std::string name, words;      // words (texts and chunks) are the same to the byte
    std::vector<double> samples;  // left and right in turn, compared by the rule
    OtherBuild rule = OtherBuild::SameBits;
    double limit = 0.0;
    const char* reason = "";
};

// 440 Hz by recursion, noise, silence: the same bits everywhere, as a library's sine is not.
std::vector<double> FixedSignal() {
    constexpr double kTwiceCosine = 1.9966836332280566, kSine = 0.057564026959567284;
    std::vector<double> signal;
    double previous = -0.4 * kSine, current = 0.0;
    for (std::size_t i = 0; i < kToneFrames; ++i) {
        signal.insert(signal.end(), {current, 0.5 * current});
        current = kTwiceCosine * current - std::exchange(previous, current);
    }
    const auto noise = Noise<double>(kNoiseFrames * kChannels);
    signal.insert(signal.end(), noise.begin(), noise.end());
    signal.resize(signal.size() + kSilentFrames * kChannels);
    return signal;
}

// What the effect says of itself. Letters as numbers where they are not ASCII.
std::string Words(CorvoEffectBase& effect) {
    std::string words;
    const auto say = [&](const auto& text) {
        for (const auto c : text)
            if (c > 0 && c < 128)
                words += static_cast<char>(c);
            else
                words.append("<").append(std::to_string(static_cast<int>(c)));
        words += '\n';
    };
    say(effect.GetName() + " " + std::to_string(effect.GetLatency()));
    for (int i = 0; i < effect.NumPresets(); ++i) say(effect.GetPresetName(i));
    for (int i = 0; i < effect.GetParamCount(); ++i)
        for (int step = 0; step <= 16; ++step) {
            const float value = static_cast<float>(step) / 16.0f;
            effect.SetParam(i, value, false);
            say(effect.GetParamName(i) + effect.GetParamUnitsText(i) +
                effect.GetParameterFormattedText(i, value));
        }
    return words;
}

// Every parameter at random, and one moved now and then.
Take RandomTake(const EffectCase& which, std::uint64_t seed) {
    const auto effect = which.make();
    Random random(seed);
    SetAllParams(*effect, random);
    const auto chunk = Chunk(*effect);
    std::vector<Edit> edits;
    for (std::size_t at = 5000; at < 40000; at += 5000)
        edits.push_back({at, random.Below(effect->GetParamCount()), static_cast<float>(random.Unit())});
    return {std::string(which.name) + " " + std::to_string(seed),
            {chunk.begin(), chunk.end()},
            Render(*effect, FixedSignal(), Format<double>(kChannels, kRate), {512, 64, 1000, 1}, edits),
            which.otherBuild,
            which.otherBuild == OtherBuild::Relative    ? kLimit
            : which.otherBuild == OtherBuild::Character ? kLevelLimitDb
                                                        : 0.0,
            which.otherBuildReason};
}

// Twenty bands, one of which changes and glides now and then.
Take EqualizerTake() {
    using namespace Corvo::DSP;
    Random random(1);
    const auto band = [&] {
        _eq_data made;
        made.type = random.Below(EQ_LOWSHELF + 1);
        made.freq = (50 << random.Below(8)) + random.Below(50);
        made.boost = random.Below(240) - 120;
        made.Q = 20 + random.Below(100);
        return made;
    };
    std::vector<builtin_effects_data> records(kChannels);
    records[0].numBands = builtin_effects_data::kMaxBands;
    for (auto& each : records[0].bands) each = band();
    ParEQ equalizer;
    equalizer.Cook(false, false, &records[0], kRate, kChannels);
    auto samples = FixedSignal();
    constexpr std::size_t kBlock = 500, kBetweenEdits = 10 * kBlock;
    for (std::size_t frame = 0; frame < samples.size() / kChannels; frame += kBlock) {
        if (frame % kBetweenEdits == kBetweenEdits - kBlock) {
            records[0].bands[static_cast<std::size_t>(random.Below(records[0].numBands))] = band();
            equalizer.Cook(true, false, &records[0], kRate, kChannels);
        }
        equalizer.Process(samples.data() + frame * kChannels, kBlock, kChannels, false, records.data());
    }
    return {"Equalizer", "", samples, OtherBuild::Relative, kEqualizerLimit, "the cancellation in low bands"};
}

std::vector<Take> RecordAll() {
    std::vector<Take> takes{EqualizerTake()};
    for (const auto& which : AllEffects()) {
        for (const std::uint64_t seed : {1, 2, 3}) takes.push_back(RandomTake(which, seed));
        takes.push_back({std::string(which.name) + " texts", Words(*which.make()), {}});
    }
    return takes;
}

void Save(const std::string& path, const std::vector<Take>& takes) {
    std::ofstream file(path, std::ios::binary);
    const auto put = [&](const auto& values) {
        file << values.size() << '\n';
        file.write(reinterpret_cast<const char*>(values.data()), std::ssize(values) * sizeof values[0]);
    };
    for (const auto& take : takes) put(take.name), put(take.words), put(take.samples);
    if (!file.flush()) throw std::runtime_error("cannot write " + path);
}

std::vector<Take> Load(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::vector<Take> takes;
    std::size_t size = 0;
    const auto get = [&](auto& values) {
        file.get();  // the end of the line
        values.resize(size);
        file.read(reinterpret_cast<char*>(values.data()), std::ssize(values) * sizeof values[0]);
    };
    while (file >> size) {
        Take& take = takes.emplace_back();
        get(take.name), file >> size, get(take.words), file >> size, get(take.samples);
    }
    return takes;
}

// The largest difference, relative to the largest sample; where the output grows past full scale, to the
// largest so far, as the end would hide everything before it. Infinite when one build stops being a number
// before the other; where both stop at the same sample, nothing after it is compared.
double Deviation(const std::vector<double>& here, const std::vector<double>& there) {
    double scale = 0.0, worst = 0.0;
    for (const double sample : here)
        if (std::isfinite(sample)) scale = std::max(scale, std::min(std::abs(sample), 1.0));
    for (std::size_t i = 0; i < here.size(); ++i) {
        const double a = here[i], b = there[i];
        if (!std::isfinite(a) && !std::isfinite(b)) break;
        if (!std::isfinite(a) || !std::isfinite(b)) return std::numeric_limits<double>::infinity();
        scale = std::max(scale, std::abs(a));
        if (a != b) worst = std::max(worst, std::abs(a - b) / std::max(scale, std::abs(b)));
    }
    return worst;
}

// Of the tone's second half, where every effect has settled.
double LevelDb(const std::vector<double>& samples) {
    double power = 1e-20;
    for (std::size_t i = kToneFrames; i < kToneFrames * kChannels; ++i) power += samples[i] * samples[i];
    return 10.0 * std::log10(power);
}

// The first words that differ, or how far the samples are apart; empty where the builds agree.
std::string Difference(const Take& here, const Take& there) {
    if (here.name != there.name || here.samples.size() != there.samples.size()) return "other takes";
    const auto at = std::ranges::mismatch(here.words, there.words).in1 - here.words.begin();
    if (here.words != there.words) return "words from " + here.words.substr(static_cast<std::size_t>(at), 30);
    const bool levels = here.rule == OtherBuild::Character;
    const double apart = levels ? std::abs(LevelDb(here.samples) - LevelDb(there.samples))
                                : Deviation(here.samples, there.samples);
    char text[32];
    std::snprintf(text, sizeof text, "%.1e", apart);
    return apart <= here.limit ? "" : text;
}

}  // namespace

int main(int count, char** arguments) try {
    if (count != 2 && count != 3) throw std::runtime_error("usage: record_effects FILE [OTHER]");
    const auto here = RecordAll();
    Save(arguments[1], here);
    if (count == 2) return 0;
    const auto there = Load(arguments[2]);
    bool agreed = here.size() == there.size();
    for (std::size_t i = 0; i < std::min(here.size(), there.size()); ++i) {
        const std::string difference = Difference(here[i], there[i]);
        std::printf("%-24s %-8s %s\n", here[i].name.c_str(), difference.empty() ? "ok" : difference.c_str(),
                    here[i].reason);
        agreed = agreed && difference.empty();
    }
    return agreed ? 0 : 1;
} catch (const std::exception& exception) {
    std::cerr << "record_effects: " << exception.what() << "\n";
    return 1;
}
