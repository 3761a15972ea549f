#pragma once

#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <memory>
#include <numeric>
#include <string>
#include <vector>

#include "DSP/Equalizer/ParEQ.h"
#include "DSP/Pitch/PitchAdapter.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/EffectRun.h"

// All that is prepared and then remembers what it was given, behind one interface.
namespace TestSupport {

inline constexpr int kSubjectFrames = 256, kSubjectRate = 8000;

template <typename Sample>
struct Subject {
    virtual ~Subject() = default;
    virtual void Prepare() = 0;
    virtual void Edit() {}     // what a user interface does meanwhile; may throw
    virtual void Restore() {}  // the settings as they were
    // Makes of an interleaved stereo block what comes out, which may have another length.
    virtual void Run(std::vector<Sample>& block) = 0;
};
template <typename Sample>
using MakeSubject = std::function<std::unique_ptr<Subject<Sample>>()>;

template <typename Sample>
struct EffectSubject : Subject<Sample> {
    explicit EffectSubject(std::unique_ptr<CorvoEffectBase> made, bool inPlanes = false)
        : effect(std::move(made)), planar(inPlanes), settings(Chunk(*effect)) {}
    void Prepare() override { EXPECT_NO_THROW(effect->InitProcessing(kSubjectFrames, &format)); }
    void Edit() override {
        constexpr MP_ENVELOPE_SEGMENT kSegment{0, 0, 0.5f, 0.5f, MP_CURVE_JUMP, 0};
        effect->AddEnvelope(0, 1, &kSegment);
        for (int i = 0; i < effect->GetParamCount(); ++i) {
            effect->SetParam(i, 0.7f, false);
            effect->GetParameterFormattedText(i, 0.7);
        }
        effect->SetPreset(0);
        effect->SetSettingsChunk(Chunk(*effect));
        effect->Cleanup();
        Prepare();
    }
    void Restore() override {
        effect->SetSettingsChunk(settings);
        effect->AddEnvelope(0, 0, nullptr);
    }
    void Run(std::vector<Sample>& block) override {
        EXPECT_NO_THROW(planar ? ProcessPlanes(*effect, block, format)
                               : ProcessBlock(*effect, block.data(), kSubjectFrames, format));
    }
    std::unique_ptr<CorvoEffectBase> effect;
    bool planar;
    std::vector<std::uint8_t> settings;
    tWAVEFORMATEX format = Format<Sample>(2, kSubjectRate);
};

template <typename Sample>
struct EqualiserSubject : Subject<Sample> {
    explicit EqualiserSubject(bool channelByChannel) : apart(channelByChannel) {}
    void Prepare() override {
        for (int band = 0; band < 3; ++band) records[0].SetEqBoost(band, 60);
        eq.Cook(true, false, records.data(), kSubjectRate, 2);
    }
    void Run(std::vector<Sample>& block) override {
        if (!apart) return eq.Process(block.data(), kSubjectFrames, 2, true, records.data());
        for (const int channel : {0, 1})
            eq.ProcessSingle(block.data(), kSubjectFrames, 2, true, channel, records.data());
    }
    bool apart;
    std::array<Corvo::DSP::builtin_effects_data, 2> records;
    Corvo::DSP::ParEQ eq;
};

template <typename Sample>
struct ConverterSubject : Subject<Sample> {
    using In = std::conditional_t<sizeof(Sample) == 4, tipo_floatbit, tipo_doublebit>;
    // Two samples of a frame are converted, however long it is.
    explicit ConverterSubject(int samplesPerFrame) : frameSamples(samplesPerFrame) {}
    ~ConverterSubject() override { converter.FreeRings(); }
    void Prepare() override {
        converter.FreeRings();
        converter.InitConversionByFactors(3, 2);
        converter.Init(2);
    }
    void Run(std::vector<Sample>& block) override {
        std::array<double, 2 * (kSubjectFrames * 3 / 2 + 1)> out{};
        const int written = converter.template sfreq_conversion_core_block<In, tipo_doublebit_outd>(
            2 * kSubjectFrames / frameSamples, reinterpret_cast<char*>(block.data()),
            reinterpret_cast<char*>(out.data()), 2, frameSamples * In::kBytes, 16, nullptr);
        block.assign(out.begin(), out.begin() + 2 * std::max(written, 0));
    }
    int frameSamples;
    SamplingFrequencyConverter converter;
};

template <typename Sample>
struct BackEndSubject : Subject<Sample> {
    BackEndSubject(int index, bool withPadding)
        : padded(withPadding), adapter(Corvo::DSP::PitchAdapter::CreateAdapter(index)) {}
    void Prepare() override {
        adapter->SetChannelsNum(2);
        adapter->SetSampleRate(kSubjectRate);
        for (const int channel : {0, 1}) adapter->SetPitchFactor(channel, 1.2f);
        adapter->SetFFTSize(1);
        adapter->SetQuality(4);
        adapter->CookFactors();
    }
    void Run(std::vector<Sample>& block) override {
        if (padded)
            adapter->ProcessInPlace(block.data(), kSubjectFrames);
        else
            adapter->ProcessInPlaceNoPadding(block.data(), kSubjectFrames);
    }
    bool padded;
    std::unique_ptr<Corvo::DSP::PitchAdapter> adapter;
};

// What comes out is the curve of the spectrum, with the newest column of the sonogram in front.
template <typename Sample>
struct AnalyserSubject : Subject<Sample> {
    AnalyserSubject() { AnalyserSubject::Restore(); }
    ~AnalyserSubject() override { Restore(); }
    void Prepare() override {
        analyser.set_parameters(kSubjectRate);
        analyser.init();
        analyser.GetSonogram()->CheckPixelBufferSize({0, 0, 30, 64}, 0);
    }
    void Edit() override {
        for (int command = 1200; command <= 1402; command += 7) analyser.popupmenu_process(command);
    }
    void Restore() override {
        kivspectrum::settings = {};
        Tuner::SetDetectionMethod(0);
        Corvo::Sonogram::SetSpeedIndex(3);
        Corvo::Sonogram::SetColourScheme(0);
        analyser.SetOn(true);
        analyser.SetFrozen(false);
        analyser.SetTunerOn(true);
        analyser.ShowSonogram(true);
    }
    void Run(std::vector<Sample>& block) override {
        analyser.Feed(block.data(), kSubjectFrames, 2, 2);
        analyser.Refresh();
        std::ranges::fill(block, Sample(0));
        const auto& power = analyser.GetSpectrumDrawer()->GetPowerSmoothed();
        std::copy_n(power.begin(), std::min(power.size(), block.size()), block.begin());
        std::copy_n(analyser.GetSonogram()->GetColumn(), analyser.GetSonogram()->GetColumnHeight(),
                    block.begin());
    }
    kivspectrum analyser;
};

// Calls `check` with the name and the maker of each subject that is no effect.
template <typename Sample>
void ForSubjectsBesideTheEffects(const auto& check) {
    const auto with = [&]<template <typename> typename Kind>(const char* name, auto... variant) {
        check(std::string(name) + (sizeof(Sample) == 4 ? ", floats" : ", doubles"),
              MakeSubject<Sample>([=] { return std::make_unique<Kind<Sample>>(variant...); }));
    };
    with.template operator()<EqualiserSubject>("equaliser", false);
    with.template operator()<EqualiserSubject>("equaliser, channel by channel", true);
    with.template operator()<ConverterSubject>("converter", 2);
    with.template operator()<ConverterSubject>("converter of longer frames", 4);
    with.template operator()<BackEndSubject>("Classic", 0, true);
    with.template operator()<BackEndSubject>("New", 1, true);
    with.template operator()<BackEndSubject>("New without padding", 1, false);
    with.template operator()<AnalyserSubject>("analyser");
}

template <typename Sample>
double Energy(const std::vector<Sample>& samples) {
    return std::inner_product(samples.begin(), samples.end(), samples.begin(), 0.0);
}

}  // namespace TestSupport
