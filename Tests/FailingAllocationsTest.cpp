#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <memory>
#include <new>
#include <numeric>

#include "DSP/Equalizer/ParEQ.h"
#include "DSP/Pitch/PitchAdapter.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Fft/CorvoFFT.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/AudioThreadRules.h"
#include "Support/EveryEffect.h"

using namespace TestSupport;

// Memory that runs out may cost a preparation, never more.
namespace {

constexpr int kFrames = 512, kRate = 8000, kBlocks = 16;

// What is prepared, and then runs over a block in place.
struct Subject {
    virtual ~Subject() = default;
    virtual void Prepare() = 0;
    virtual void Edit() {}     // what a user interface does meanwhile; may throw
    virtual void Restore() {}  // the settings as they were
    virtual void Run(std::vector<float>& block) = 0;
};
using MakeSubject = std::function<std::unique_ptr<Subject>()>;

struct EffectSubject : Subject {
    explicit EffectSubject(const EffectCase& row) : effect(row.make()) {
        effect->SetPreset(effect->GetDefaultPreset());
        settings = Chunk(*effect);
    }
    void Prepare() override { EXPECT_NO_THROW(effect->InitProcessing(kFrames, &format)); }
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
        effect->Cleanup();
    }
    void Run(std::vector<float>& block) override {
        EXPECT_NO_THROW(ProcessBlock(*effect, block.data(), kFrames, format));
    }
    std::unique_ptr<CorvoEffectBase> effect;
    std::vector<std::uint8_t> settings;
    tWAVEFORMATEX format = Format<float>(2, kRate);
};

struct EqualiserSubject : Subject {
    void Prepare() override {
        records[0].SetEqBoost(0, 60);
        eq.Cook(true, false, records.data(), kRate, 2);
    }
    void Run(std::vector<float>& block) override {
        eq.Process(block.data(), kFrames, 2, true, records.data());
    }
    std::array<Corvo::DSP::builtin_effects_data, 2> records;
    Corvo::DSP::ParEQ eq;
};

struct ConverterSubject : Subject {
    ~ConverterSubject() override { converter.FreeRings(); }
    void Prepare() override {
        converter.FreeRings();
        converter.InitConversionByFactors(1, 2);
        converter.Init(2);
    }
    void Run(std::vector<float>& block) override {
        auto* const samples = reinterpret_cast<char*>(block.data());
        std::array<float, 2 * kFrames> out{};
        const int written = converter.sfreq_conversion_core_block<tipo_floatbit, tipo_floatbit_outd>(
            kFrames, samples, reinterpret_cast<char*>(out.data()), 2, 8, 8, nullptr);
        if (written > 0) std::ranges::copy(out, block.begin());
    }
    SamplingFrequencyConverter converter;
};

struct BackEndSubject : Subject {
    explicit BackEndSubject(int index) : adapter(Corvo::DSP::PitchAdapter::CreateAdapter(index)) {}
    void Prepare() override {
        adapter->SetChannelsNum(2);
        adapter->SetSampleRate(kRate);
        for (const int channel : {0, 1}) adapter->SetPitchFactor(channel, 1.5f);
        adapter->SetFFTSize(1);
        adapter->SetQuality(4);
        adapter->CookFactors();
    }
    void Run(std::vector<float>& block) override { adapter->ProcessInPlace(block.data(), kFrames); }
    std::unique_ptr<Corvo::DSP::PitchAdapter> adapter;
};

struct TransformSubject : Subject {
    void Prepare() override { fft.AllocateReal(2 * kFrames, 1); }
    void Run(std::vector<float>& block) override {
        fft.DoFFTReal(block.data(), 0, 0);
        fft.DoIFFTReal(block.data(), 0, 0);
    }
    CorvoFFT fft;
};

// The block that comes out is the newest column of the sonogram.
struct AnalyserSubject : Subject {
    AnalyserSubject() { AnalyserSubject::Restore(); }
    ~AnalyserSubject() override { Restore(); }
    void Prepare() override {
        analyser.set_parameters(kRate);
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
    void Run(std::vector<float>& block) override {
        analyser.Feed(block.data(), kFrames, 2, 2);
        analyser.Refresh();
        std::ranges::fill(block, 0.0f);
        const auto& power = analyser.GetSpectrumDrawer()->GetPowerSmoothed();
        std::copy_n(power.begin(), std::min(power.size(), block.size()), block.begin());
        std::copy_n(analyser.GetSonogram()->GetColumn(), analyser.GetSonogram()->GetColumnHeight(),
                    block.begin());
    }
    kivspectrum analyser;
};

double Energy(const std::vector<float>& samples) {
    return std::inner_product(samples.begin(), samples.end(), samples.begin(), 0.0);
}

// Of the last block.
double Sound(Subject& subject) {
    std::vector<float> block;
    for (int i = 0; i < kBlocks; ++i) {
        block = Sine<float>(kFrames, 437.5, kRate, 0.5, 2);
        subject.Run(block);
    }
    return Energy(block);
}

void ExpectToSurvive(const std::string& name, const MakeSubject& make) {
    const auto input = Sine<float>(kFrames, 437.5, kRate, 0.5, 2);
    double expected = 0.0;
    for (const bool lasting : {false, true})
        for (int after = 0; after < 300; ++after) {
            SCOPED_TRACE(name + (lasting ? ", lasting after " : ", once after ") + std::to_string(after));
            std::unique_ptr<Subject> subject;
            auto block = input;
            bool reached = false;
            const auto attempt = [&](const auto& call) {
                try {
                    call();
                } catch (const std::bad_alloc&) {
                }
            };
            {
                const FailingAllocations failing(after, lasting);
                attempt([&] { subject = make(); });
                if (subject) {
                    attempt([&] { subject->Prepare(); });
                    attempt([&] { subject->Run(block); });
                    attempt([&] { subject->Edit(); });
                    attempt([&] { subject->Run(block); });
                }
                reached = failing.Reached();
            }
            if (!subject) subject = make();
            subject->Restore();
            subject->Prepare();
            const double sound = Sound(*subject);
            if (expected == 0.0) {
                const auto other = make();
                other->Prepare();
                expected = Sound(*other);
            }
            ASSERT_GT(sound, 0.5 * expected);
            ASSERT_LT(sound, 2.0 * expected);
            if (!reached) break;
        }
}

}  // namespace

class FailingMemory : public EveryEffect {};
INSTANTIATE_TEST_SUITE_P(All, FailingMemory, testing::ValuesIn(AllEffects()), EffectTestName);

TEST_P(FailingMemory, CostsOnePreparation) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "allocations cannot be made to fail here";
    ExpectToSurvive("default", [] { return std::make_unique<EffectSubject>(GetParam()); });
}

TEST(FailingMemoryTest, CostsOnePreparationBesideTheEffects) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "allocations cannot be made to fail here";
    ExpectToSurvive("equaliser", [] { return std::make_unique<EqualiserSubject>(); });
    ExpectToSurvive("converter", [] { return std::make_unique<ConverterSubject>(); });
    ExpectToSurvive("Classic", [] { return std::make_unique<BackEndSubject>(0); });
    ExpectToSurvive("New", [] { return std::make_unique<BackEndSubject>(1); });
    ExpectToSurvive("transform", [] { return std::make_unique<TransformSubject>(); });
    ExpectToSurvive("analyser", [] { return std::make_unique<AnalyserSubject>(); });
}
