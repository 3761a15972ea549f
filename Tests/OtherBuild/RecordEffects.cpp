// Two builds of the library side by side: the same source runs on each target, and what both say must agree.
//   record_effects FILE          writes what the effects and the equaliser make of a fixed signal
//   record_effects FILE OTHER    and compares it with what another build wrote
// Nothing that is recorded depends on more than the library: no mathematics library, no clock.

#include <cmath>
#include <cstdio>
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
    std::string name;
    std::vector<double> samples;  // left and right in turn; of chunks the bytes
    double limit = 0.0;           // of their deviation, or of their levels'
    bool levels = false;          // these alone are compared
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

// Every parameter at random, and one moved now and then: the settings' chunk and the sound.
void RecordAtRandom(const EffectCase& which, std::uint64_t seed, std::vector<Take>& takes) {
    const auto effect = which.Make();
    Random random(seed);
    SetAllParams(*effect, random);
    const auto chunk = Chunk(*effect);
    std::vector<Edit> edits;
    for (std::size_t at = 5000; at < 40000; at += 5000)
        edits.push_back({at, random.Below(effect->GetParamCount()), static_cast<float>(random.Unit())});
    const std::string name = std::string(which.name).append(" ").append(std::to_string(seed));
    takes.push_back({std::string(name).append(" chunk"), {chunk.begin(), chunk.end()}});
    takes.push_back(
        {name, Render(*effect, FixedSignal(), Format<double>(kChannels, kRate), {512, 64, 1000, 1}, edits),
         which.splices ? kLevelLimitDb : kLimit, which.splices});
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
    return {"Equalizer", samples, kEqualizerLimit};
}

std::vector<Take> RecordAll() {
    std::vector<Take> takes{EqualizerTake()};
    for (const auto& which : AllEffects())
        for (const std::uint64_t seed : {1u, 2u, 3u}) RecordAtRandom(which, seed, takes);
    return takes;
}

// The samples of all takes, behind their numbers.
void Save(const std::string& path, const std::vector<Take>& takes) {
    std::ofstream file(path, std::ios::binary);
    for (const auto& take : takes) {
        file << take.samples.size() << '\n';
        file.write(reinterpret_cast<const char*>(take.samples.data()), std::ssize(take.samples) * 8);
    }
    if (!file.flush()) throw std::runtime_error("cannot write " + path);
}

std::vector<std::vector<double>> Load(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::vector<std::vector<double>> takes;
    for (std::size_t size; file >> size && file.get();)
        file.read(reinterpret_cast<char*>(takes.emplace_back(size).data()),
                  static_cast<std::streamsize>(8 * size));
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

// How far the builds are apart; infinite where one says more than the other.
double Apart(const Take& here, const std::vector<double>& there) {
    if (here.samples.size() != there.size()) return std::numeric_limits<double>::infinity();
    return here.levels ? std::abs(LevelDb(here.samples) - LevelDb(there)) : Deviation(here.samples, there);
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
        const double apart = Apart(here[i], there[i]);
        std::printf("%-24s %.1e%s\n", here[i].name.c_str(), apart, apart <= here[i].limit ? "" : " differs");
        agreed = agreed && apart <= here[i].limit;
    }
    return agreed ? 0 : 1;
} catch (const std::exception& exception) {
    std::cerr << "record_effects: " << exception.what() << "\n";
    return 1;
}
