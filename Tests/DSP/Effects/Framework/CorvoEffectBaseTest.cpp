#include "DSP/Effects/Framework/CorvoEffectBase.h"

#include <gtest/gtest.h>

#include <cfenv>
#include <tuple>

#include "DSP/Effects/Framework/CorvoEffect.h"
#include "Support/Signals.h"

using namespace Corvo::DSP;

namespace {

bool FlushesDenormals() {
    volatile double denormal = 1e-310;
    return denormal * 1e10 == 0.0;
}

// Makes the protected members reachable and records what reaches the effect.
class Probe : public CorvoEffect {
public:
    using CorvoEffect::FlushEnvelope;
    using CorvoEffect::m_cook;
    using CorvoEffect::m_reverse_param_order;
    using Record = std::tuple<int, float, bool>;  // index, value, automated

    explicit Probe(int count = 8) : m_count(count) {}

    float GetParam(int) override { return 0.0f; }
    int GetParamCountReal() override { return m_count; }
    std::string GetName() override { return "probe"; }
    int SeparateLeftRightControls() override { return paired ? 0 : 1; }
    const MP_PARAMINFO* GetParametersInfo() override { return nullptr; }
    void CheckCookProperties(const tWAVEFORMATEX*, bool force) override {
        if (m_cook.exchange(false) || force) InitEnvelopes(true);
    }

    bool paired = false, flushes = false;
    std::vector<Record> edits;

    bool DoSetParam(int index, float value, bool automated) override {
        edits.emplace_back(index, value, automated);
        return false;  // keeps the envelopes from being rewound
    }
    void ProcessInternal(double*, int, const tWAVEFORMATEX* format, ProcessFlags& flags) override {
        CheckCookProperties(format, flags.force_cook);
        flushes = FlushesDenormals();
    }
    void ProcessInternalNoninterleaved(double* const*, int, const tWAVEFORMATEX*, ProcessFlags&) override {}

private:
    int m_count;
};

using Edits = std::vector<Probe::Record>;

}  // namespace

// Catches pairs and reversed orders that reach the wrong parameter or lose the automation flag.
TEST(CorvoEffectBase, RoutesExternalParametersToRealOnes) {
    for (const bool reversed : {false, true})
        for (const bool paired : {false, true}) {
            Probe probe(7);
            probe.paired = paired;
            probe.m_reverse_param_order = reversed;
            EXPECT_EQ(probe.GetParamCount(), paired ? 3 : 7);
            probe.SetParam(2, 0.5f, true);
            // A reversed order drops the flag, of a pair that of the second.
            const int last = paired ? (reversed ? 2 : 5) : (reversed ? 4 : 2);
            Edits expected{{last, 0.5f, !reversed}};
            if (paired) expected.insert(expected.begin(), {last - 1, 0.5f, true});
            EXPECT_EQ(probe.edits, expected);
        }
}

// Catches segments played early, twice or never.
TEST(CorvoEffectBase, PlaysEnvelopes) {
    Probe probe(2);
    const auto format = TestSupport::Format<float>();
    MP_ENVELOPE_SEGMENT segments[3];
    for (std::int64_t i = 1; i <= 3; ++i) {
        const float value = 0.1f * static_cast<float>(i);
        segments[i - 1] = {1000 * i, 1000 * i, value, value, MP_CURVE_JUMP, 0};
    }
    const auto block = [&](std::int64_t time) {
        float frame[2]{};
        ProcessFlags flags{false, true};
        probe.edits.clear();
        probe.SetEnvelopeTime(time);
        probe.Process(reinterpret_cast<double*>(frame), 1, &format, flags);
        return std::pair(probe.edits, flags.params_changed);
    };
    probe.AddEnvelope(1, 3, segments);
    EXPECT_EQ(block(5000), std::pair(Edits{}, false)) << "nothing plays before the first cook";
    EXPECT_EQ(block(0), std::pair(Edits({{1, 0.1f, true}}), true)) << "the first segment waits for nothing";
    EXPECT_EQ(block(1999), std::pair(Edits{}, false));
    EXPECT_EQ(block(3000), std::pair(Edits({{1, 0.2f, true}, {1, 0.1f * 3, true}}), true));
    EXPECT_EQ(block(9000), std::pair(Edits{}, false));

    probe.AddEnvelope(1, 2, segments);
    block(0);  // the cook that AddEnvelope asked for rewinds
    EXPECT_EQ(probe.GetEnvelopeTime(), 0);
    EXPECT_EQ(block(0).first, Edits({{1, 0.1f, true}}));

    probe.AddEnvelope(1, 3, segments);
    probe.FlushEnvelope(1, 1000, 2000);  // half open: takes the first alone
    block(0);
    EXPECT_EQ(block(0).first, Edits({{1, 0.2f, true}}));
    probe.AddEnvelope(1, 0, nullptr);
    EXPECT_TRUE(probe.m_cook);
    block(0);
    EXPECT_EQ(block(9000).first, Edits{});
    probe.NotifyTempoChanged();
    EXPECT_TRUE(probe.m_cook);
}

// Catches a block that is processed with denormals on: a filter that fades would cost twenty times as much.
TEST(CorvoEffectBase, ProcessesWithoutDenormals) {
    std::fenv_t before;
    std::fegetenv(&before);
    std::fesetenv(FE_DFL_ENV);  // some libraries flush denormals as soon as they are loaded
    Probe probe;
    const auto format = TestSupport::Format<double>(1);
    ProcessFlags flags;
    probe.Process(nullptr, 0, &format, flags);
    EXPECT_TRUE(probe.flushes);
    EXPECT_FALSE(FlushesDenormals()) << "the caller's mode comes back";
    std::fesetenv(&before);
}
