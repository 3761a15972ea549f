#include <limits>
#include <span>
#include <utility>

#include "DSP/Effects/Compressor/Compressor.h"
#include "Support/EveryEffect.h"
#include "Support/Subjects.h"

using namespace TestSupport;

// A sample that is not finite counts as 0, so that nothing keeps it. What overflows inside is forgotten.
namespace {

constexpr std::size_t kBlock = 2 * kSubjectFrames;

// A steady sound under a side-chain.
template <typename Sample>
struct SideChainSubject : EffectSubject<Sample> {
    explicit SideChainSubject(bool monitored)
        : EffectSubject<Sample>(std::make_unique<Corvo::DSP::Compressor>()) {
        this->effect->SetPreset(2);
        this->effect->SetParam(14, monitored ? 1.0f : 0.0f, false);
        this->effect->SetSidechainBusNumChannels(0, 2);
    }
    void Run(std::vector<Sample>& block) override {
        auto side = block;
        double* const channels[] = {reinterpret_cast<double*>(side.data()),
                                    reinterpret_cast<double*>(side.data() + kSubjectFrames)};
        static_cast<Corvo::DSP::Compressor&>(*this->effect).SetSidechainBuffer(0, channels);
        std::ranges::fill(block, Sample(0.5));
        EffectSubject<Sample>::Run(block);
    }
};

// One that was given samples that are not finite sounds like one that was given 0 in their places, from the
// next block on.
template <typename Sample>
void ExpectToCountAsZero(const std::string& name, const MakeSubject<Sample>& make) {
    using Limits = std::numeric_limits<Sample>;
    constexpr int kBlocks = 40, kBad = 12;
    for (const Sample poison : {Limits::quiet_NaN(), Limits::infinity(), -Limits::infinity()})
        for (const std::size_t count : {std::size_t{1}, kBlock}) {
            SCOPED_TRACE(name + ", " + std::to_string(count) + " times " + std::to_string(poison));
            const auto poisoned = make(), clean = make();
            poisoned->Prepare(), clean->Prepare();
            for (int i = 0; i < kBlocks; ++i) {
                auto expected = Noise<Sample>(kBlock, 0.25, static_cast<std::uint64_t>(i) + 1);
                auto output = expected;
                if (i == kBad) {
                    std::fill_n(expected.begin() + (count == 1 ? 101 : 0), count, Sample(0));
                    std::fill_n(output.begin() + (count == 1 ? 101 : 0), count, poison);
                }
                clean->Run(expected);
                poisoned->Run(output);
                if (i == kBad) continue;
                ASSERT_TRUE(AllFinite(output)) << "block " << i;
                ASSERT_EQ(output, expected) << "block " << i;
            }
        }
}

// What a subject is given until it overflows.
struct Flood {
    double level;  // 1 is the largest number; 0 stands for ordinary sound
    bool steady;
    int blocks = 40;

    template <typename Sample>
    std::vector<Sample> Block() const {
        const double amplitude = level * static_cast<double>(std::numeric_limits<Sample>::max());
        if (steady) return std::vector<Sample>(kBlock, static_cast<Sample>(amplitude));
        return Noise<Sample>(kBlock, level > 0.0 ? amplitude : 0.25);
    }
};
constexpr Flood kNearTheLimit[] = {{1.0, false}, {1.0, true}, {0.5, true}, {0.03, true}};
constexpr Flood kUntilItGrows[] = {{0.0, false, 2000}};

// Afterwards it sounds like a fresh one, as soon as what is loud but finite has faded. Ordinary sound never
// makes two blocks after another overflow. The number of blocks that did.
template <typename Sample>
int ExpectToForget(
    const std::string& name, const MakeSubject<Sample>& make, std::span<const Flood> floods,
    const std::function<void(Subject<Sample>&)>& edit = [](auto&) {}) {
    constexpr int kMostSeconds = 100;
    int overflows = 0;
    for (const Flood& flood : floods) {
        SCOPED_TRACE(name + ", level " + std::to_string(flood.level) + (flood.steady ? ", steady" : ""));
        const auto flooded = make(), fresh = make();
        flooded->Prepare(), fresh->Prepare();
        edit(*flooded);
        bool finite = true;
        for (int i = 0; i < flood.blocks; ++i) {
            auto block = flood.Block<Sample>();
            flooded->Run(block);
            const bool before = std::exchange(finite, AllFinite(block));
            overflows += !finite;
            EXPECT_TRUE(finite || before || flood.level > 0.0) << "block " << i << " and the one before";
        }
        flooded->Restore();
        bool alike = false;
        for (int second = 0; second < kMostSeconds && !alike; ++second) {
            double sound = 0.0, wanted = 0.0;
            for (int i = 0; i < kSubjectRate / kSubjectFrames; ++i) {
                auto expected = Noise<Sample>(kBlock, 0.25, static_cast<std::uint64_t>(i) + 1);
                auto output = expected;
                fresh->Run(expected);
                flooded->Run(output);
                sound += Energy(output), wanted += Energy(expected);
            }
            alike = sound >= 0.5 * wanted && sound <= 2.0 * wanted;
        }
        EXPECT_TRUE(alike);
    }
    return overflows;
}

}  // namespace

TEST_P(EveryEffect, ForgetsSamplesThatAreNotFinite) {
    for (const std::uint64_t seed : {0u, 1u, 2u})
        for (const bool planar : {false, true}) {
            if (planar && !Make()->SupportsNoninterleaved()) continue;
            const auto name = "settings " + std::to_string(seed) + (planar ? ", planar" : "");
            ForBothSamples([&]<typename Sample>(Sample) {
                ExpectToCountAsZero<Sample>(name + (sizeof(Sample) == 4 ? " floats" : " doubles"), [&] {
                    auto effect = Make();
                    if (seed > 0 && !GetParam().mayGrow) SetAllParams(*effect, Random(seed));
                    return std::make_unique<EffectSubject<Sample>>(std::move(effect), planar);
                });
            });
        }
}

TEST_P(EveryEffect, ForgetsOverflows) {
    int overflows = 0, grown = 0;
    ForBothSamples([&]<typename Sample>(Sample) {
        for (const float setting : {0.0f, 0.9f, 1.0f}) {
            // As they are, or all up but for short delays.
            const auto edit = [=](Subject<Sample>& subject) {
                auto& effect = *static_cast<EffectSubject<Sample>&>(subject).effect;
                for (int i = 0; setting > 0.0f && i < effect.GetParamCount(); ++i)
                    effect.SetParam(i, GetParam().mayGrow && i < 4 ? 0.0f : setting, false);
            };
            const auto run = [&](const auto& floods) {
                return ExpectToForget<Sample>(
                    "settings at " + std::to_string(setting),
                    [] { return std::make_unique<EffectSubject<Sample>>(Make()); }, floods, edit);
            };
            overflows += run(kNearTheLimit);
            if (setting == 1.0f && GetParam().mayGrow) grown += run(kUntilItGrows);
        }
    });
    EXPECT_TRUE(overflows > 0 || GetParam().bounded) << "nothing was asked of it";
    EXPECT_TRUE(grown > 1 || !GetParam().mayGrow) << "nothing grew";
}

TEST(NonFiniteSamples, AreForgottenBesideTheEffectsAsOverflowsAre) {
    ForBothSamples([]<typename Sample>(Sample) {
        ForSubjectsBesideTheEffects<Sample>([](const std::string& name, const MakeSubject<Sample>& make) {
            ExpectToCountAsZero<Sample>(name, make);
            ExpectToForget<Sample>(name, make, kNearTheLimit);
        });
        for (const bool monitored : {false, true})
            ExpectToCountAsZero<Sample>(
                "side-chain", [=] { return std::make_unique<SideChainSubject<Sample>>(monitored); });
    });
}
