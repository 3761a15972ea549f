// The equaliser with any record, edits between blocks, copies and its analysers.
#include <memory>

#include "DSP/Equalizer/ParEQ.h"
#include "Spectrum/kivspectrum.h"
#include "Target.h"

namespace {

using Corvo::DSP::builtin_effects_data;
using Corvo::DSP::ParEQ;
using Fuzz::Input;

constexpr int kChannels = 5;
using Records = std::array<builtin_effects_data, kChannels>;

void EditBand(Input& input, builtin_effects_data& record) {
    const int band = input.Between(0, builtin_effects_data::kMaxBands - 1);
    if (input.Flag()) {
        record.SetNumBands(input.Between(0, builtin_effects_data::kMaxBands));
        record.SetEqType(band, input.Between(0, 8));
        record.SetEqFreq(band, input.Between(1, 30000));
        record.SetEqBoost(band, input.Between(-300, 300));
        record.SetEqQ(band, input.Between(-10, 1000));
    } else {
        record.SetNumBands(input.Raw<std::int32_t>());
        record.SetEqData(band, input.Raw<Corvo::DSP::_eq_data>());
    }
    record.SetPhaseShift(input.Flag());
    if (input.Between(0, 9) == 0) record.DeleteBand(input.Between(0, builtin_effects_data::kMaxBands - 1));
}

template <typename Sample>
void Play(Input& input, ParEQ& eq, Records& records) {
    const int frames = input.Between(1, 600), channels = input.Between(1, kChannels);
    auto block = input.Samples<Sample>(static_cast<std::size_t>(frames * channels));
    if (input.Flag())
        eq.Process(block.data(), frames, channels, input.Flag(), records.data());
    else {
        const int channel = input.Between(0, channels - 1);
        eq.ProcessSingle(block.data() + channel, frames - 1, channels, input.Flag(), channel, records.data());
    }
}

const Fuzz::Target target("Equaliser", [](Input& input) {
    static constexpr int kRates[]{48000, 44100, 8000, 192000, 1000, 1, 0};
    auto eq = std::make_unique<ParEQ>();
    Records records;
    int rate = 48000;
    for (int step = 0; step < 80 && !input.AtEnd(); ++step) {
        const int channel = input.Between(0, kChannels - 1);
        auto& record = records[static_cast<std::size_t>(channel)];
        switch (input.Between(0, 7)) {
            case 0:
                EditBand(input, record);
                break;
            case 1:
                rate = input.Flag() ? input.OneOf(kRates) : input.Raw<std::int32_t>();
                [[fallthrough]];
            case 2: {
                const bool a = input.Flag(), b = input.Flag();
                eq->Cook(a, b, &record, rate, input.Between(-1, kChannels));
                break;
            }
            case 3:
                Play<float>(input, *eq, records);
                break;
            case 4:
                Play<double>(input, *eq, records);
                break;
            case 5:
                eq->GetResponse(channel, input.Raw<double>(), rate, records.data());
                break;
            case 6:
                if (kivspectrum* const analyser = eq->GetSpectrum(input.Between(-1, kChannels))) {
                    analyser->SetOn(true);
                    analyser->Refresh();
                }
                break;
            default:
                eq = std::make_unique<ParEQ>(*eq);
                if (input.Flag()) eq->AfterCloneInit();
                eq->Resize(input.Between(-1, kChannels));
                if (input.Flag()) eq->ResetProcessing();
        }
    }
});

}  // namespace
