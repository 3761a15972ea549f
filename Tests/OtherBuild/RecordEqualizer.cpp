#include <algorithm>

#include "DSP/Equalizer/ParEQ.h"
#include "OtherBuild/FixedSignal.h"
#include "OtherBuild/Subjects.h"

namespace OtherBuild {
namespace {

using namespace Corvo::DSP;
using TestSupport::Random;

struct Scene {
    const char* name;
    int bands;
    bool edits;  // now and then one band changes and glides
};

constexpr Scene kScenes[] = {
    {"3 bands", 3, false},         {"8 bands", 8, false},         {"20 bands", 20, false},
    {"3 bands, gliding", 3, true}, {"8 bands, gliding", 8, true}, {"20 bands, gliding", 20, true},
};

_eq_data RandomBand(Random& random) {
    _eq_data band;
    band.type = random.Below(EQ_LOWSHELF + 1);
    band.freq = (kLowestHz << random.Below(8)) + random.Below(kLowestHz);
    band.boost = random.Below(240) - 120;
    band.Q = 20 + random.Below(100);
    return band;
}

template <typename Sample>
void RecordScene(const Scene& scene, Kind kind, std::vector<Take>& takes) {
    Random random(1);
    std::vector<builtin_effects_data> records(kChannels);
    auto& data = records[0];
    data.numBands = scene.bands;
    for (auto& band : data.bands) band = RandomBand(random);
    ParEQ equalizer;
    equalizer.Cook(false, false, &data, kRate, kChannels);

    auto samples = FixedSignal<Sample>();
    constexpr int kBlock = 500, kBlocksPerEdit = 10;
    const int blocks = static_cast<int>(samples.size() / kChannels) / kBlock;
    for (int block = 0; block < blocks; ++block) {
        if (scene.edits && block % kBlocksPerEdit == kBlocksPerEdit - 1) {
            data.bands[static_cast<std::size_t>(random.Below(scene.bands))] = RandomBand(random);
            equalizer.Cook(true, false, &data, kRate, kChannels);
        }
        equalizer.Process(samples.data() + static_cast<std::ptrdiff_t>(block) * kBlock * kChannels, kBlock,
                          kChannels, false, records.data());
    }
    takes.push_back({kEqualizer.name, scene.name, kind, Bytes(samples)});
}

}  // namespace

void RecordEqualizer(std::vector<Take>& takes) {
    for (const auto& scene : kScenes) {
        RecordScene<float>(scene, Kind::Float, takes);
        RecordScene<double>(scene, Kind::Double, takes);
    }
}

}  // namespace OtherBuild
