#include "DSP/Effects/Framework/CorvoEffectBase.h"

#include <gtest/gtest.h>

#include <limits>

#include "DSP/Effects/Framework/CorvoEffect.h"
#include "Support/Signals.h"
#include "Support/VirtualSlot.h"

using namespace Corvo::DSP;
using TestSupport::PlacesAround;
using TestSupport::Slots;

namespace {

MP_PARAMINFO ParameterRecord(std::wstring_view label, std::wstring_view unit, MP_TYPE type) {
    MP_PARAMINFO record{type, 0, 0.0f, 1.0f, 0.5f, {}, {}};
    std::ranges::copy(label.substr(0, 31), record.szLabel);
    std::ranges::copy(unit, record.szUnitText);
    return record;
}

// Makes the protected members reachable and records what reaches the effect.
class Probe : public CorvoEffect {
public:
    using CorvoEffect::FlushEnvelope;
    using CorvoEffect::HostTempo;
    using CorvoEffect::m_cook;
    using CorvoEffect::m_reverse_param_order;
    using CorvoEffect::ProcessInternalNoninterleaved;

    struct Edit {
        int index;
        float value;
        bool automated;
        bool operator==(const Edit&) const = default;
    };

    explicit Probe(int count = 8) : m_count(count) {}

    float GetParam(int) override { return 0.0f; }
    int GetParamCountReal() override { return m_count; }
    std::string GetName() override { return "probe"; }
    int SeparateLeftRightControls() override { return paired ? 0 : 1; }
    const MP_PARAMINFO* GetParametersInfo() override { return records.data(); }
    void SetMaximumFramesPerBuffer(int frames) override {
        calls.push_back("maximum " + std::to_string(frames));
    }
    void CheckCookProperties(const tWAVEFORMATEX*, bool force) override {
        calls.push_back(force ? "forced cook" : "cook");
        if (m_cook.exchange(false) || force) InitEnvelopes(true);
    }

    bool paired = false;
    std::vector<Edit> edits;
    std::vector<std::string> calls;
    std::array<MP_PARAMINFO, 8> records{};

    bool DoSetParam(int index, float value, bool automated) override {
        edits.push_back({index, value, automated});
        return false;  // keeps the envelopes from being rewound
    }
    void ProcessInternal(double*, int, const tWAVEFORMATEX* format, ProcessFlags& flags) override {
        CheckCookProperties(format, flags.force_cook);
    }

private:
    int m_count;
};

MP_ENVELOPE_SEGMENT Jump(std::int64_t start, float value) {
    return {start, start, value, value, MP_CURVE_JUMP, 0};
}

}  // namespace

// Catches a virtual operation that was moved, inserted or dropped: hosts call by number.
TEST(CorvoEffectBase, KeepsEveryOperationInItsSlot) {
    using B = CorvoEffectBase;
    EXPECT_EQ(
        Slots(&Probe::DoSetParam, &Probe::ProcessInternal, &Probe::ProcessInternalNoninterleaved,
              &B::HasSeparateLeftRightSettings, &B::GetLatency, &B::IsCollapsingToMono, &B::HasNativeEditor,
              &B::SetEditor, &B::SupportsNoninterleaved, &B::SetMaximumFramesPerBuffer,
              &B::CheckCookProperties, &B::GetSettingsChunk, &B::GetSettingsChunkSize, &B::SetSettingsChunk,
              &B::Cleanup, &B::NumPresets, &B::GetPresetName, &B::SetPreset, &B::GetParameterFormattedText,
              &B::GetParamName, &B::GetParamUnitsText, &B::GetParam, &B::GetParamPlain, &B::GetParamCountReal,
              &B::GetName, &B::IsCantrix, &B::SetParam, &B::GetParamCount, &B::GetParameterTypeAutomatable,
              &B::GetDefaultPreset, &B::WantsXySerialization, &B::IsMono, &B::GetImage,
              &B::GetNumSidechainBusses, &B::GetSidechainBusNumChannelsMax, &B::SetSidechainBuffer,
              &B::GetParameterAvailableValues, &B::SeparateLeftRightControls,
              &B::AllowChangeParamFromInputBox, &B::GetParamValueNormalizedFromText,
              &B::GetPreferredNumColumnsForTab, &B::GetParamSectionInfo, &B::GetParamUiSections,
              &B::GetPluginIconPath, &B::GetLookAndFeel, &B::InitResetProcessingLight,
              &B::InitializeXyEditingData, &B::GetParamFromProp, &CorvoEffect::GetParametersInfo),
        PlacesAround(10, 49));
}

// Catches pairs and reversed orders that reach the wrong parameter or lose the automation flag.
TEST(CorvoEffectBase, RoutesExternalParametersToRealOnes) {
    using Edits = std::vector<Probe::Edit>;
    struct Case {
        const char* what;
        int count;
        bool paired, reversed;
        int externalCount, index;
        Edits edits;
    } const cases[] = {
        {"straight", 8, false, false, 8, 3, {{3, 0.5f, true}}},
        {"pairs", 8, true, false, 4, 3, {{6, 0.5f, true}, {7, 0.5f, true}}},
        {"odd count", 7, true, false, 3, 2, {{4, 0.5f, true}, {5, 0.5f, true}}},
        {"reversed drops the flag", 8, false, true, 8, 0, {{7, 0.5f, false}}},
        {"reversed pairs: only the second drops it",
         8,
         true,
         true,
         4,
         1,
         {{4, 0.5f, true}, {5, 0.5f, false}}},
    };
    for (const auto& c : cases) {
        Probe probe(c.count);
        probe.paired = c.paired;
        probe.m_reverse_param_order = c.reversed;
        EXPECT_EQ(probe.GetParamCount(), c.externalCount) << c.what;
        probe.SetParam(c.index, 0.5f, true);
        EXPECT_EQ(probe.edits, c.edits) << c.what;
    }
}

TEST(CorvoEffectBase, PreparesBeforeItCooks) {
    Probe probe;
    const auto format = TestSupport::Format<float>(1, 11025);
    EXPECT_TRUE(probe.InitProcessing(77, &format));
    EXPECT_EQ(probe.calls, (std::vector<std::string>{"maximum 77", "forced cook"}));
}

// Catches segments played early, twice or never.
TEST(CorvoEffectBase, PlaysEnvelopes) {
    Probe probe(2);
    const auto format = TestSupport::Format<float>();
    const MP_ENVELOPE_SEGMENT segments[] = {Jump(1000, 0.1f), Jump(2000, 0.2f), Jump(3000, 0.3f)};
    const auto block = [&](std::int64_t time) {
        float frame[2]{};
        ProcessFlags flags{false, true};
        probe.edits.clear();
        probe.SetEnvelopeTime(time);
        probe.Process(reinterpret_cast<double*>(frame), 1, &format, flags);
        return std::pair(probe.edits, flags.params_changed);
    };
    using Edits = std::vector<Probe::Edit>;
    probe.AddEnvelope(1, 3, segments);
    EXPECT_EQ(block(5000), std::pair(Edits{}, false)) << "nothing plays before the first cook";
    EXPECT_EQ(block(0), std::pair(Edits({{1, 0.1f, true}}), true)) << "the first segment waits for nothing";
    EXPECT_EQ(block(1999), std::pair(Edits{}, false));
    EXPECT_EQ(block(3000), std::pair(Edits({{1, 0.2f, true}, {1, 0.3f, true}}), true));
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
}

TEST(CorvoEffectBase, AnnouncesSidechainBusesInAscendingOrder) {
    Probe probe;
    probe.SetSidechainBusNumChannels(1, 1);
    EXPECT_EQ(probe.GetSidechainBusNumChannels(0), 0);
    EXPECT_EQ(probe.GetSidechainBusNumChannels(1), 1);
    probe.SetSidechainBusNumChannels(0, 2);
    EXPECT_EQ(probe.GetSidechainBusNumChannels(0), 2);
}

// Catches a label that loses more than its side, or that runs out of its field.
TEST(CorvoEffect, NamesParametersByTheirLabelsWithoutTheSide) {
    const std::pair<const wchar_t*, const wchar_t*> cases[] = {
        {L"Flip phase L", L"Flip phase"},
        {L"Depth R", L"Depth"},
        {L" L", L" L"},
        {L"DEPTHL", L"DEPTHL"},
        {L"exactly thirty-two characters!!!", L"exactly thirty-two characters!!"},
    };
    for (const auto& [label, name] : cases) {
        Probe probe(1);
        probe.records[0] = ParameterRecord(label, L"unit", MPT_INT);
        EXPECT_EQ(probe.GetParamName(0), name);
    }
}

// Catches nonsense from the host getting into delay lengths.
TEST(CorvoEffectBase, FallsBackToAPlainTempo) {
    struct Host : CorvoEffectHostCallback {
        double tempo = 90.0;
        int denominator = 0;
        double GetTempo() override { return tempo; }
        void GetTimeSignature(int& n, int& d) override { n = 3, d = denominator; }
    } host;
    Probe probe;
    probe.SetHostCallback(&host);
    EXPECT_EQ(probe.HostTempo().bpm, 90.0);
    EXPECT_EQ(probe.HostTempo().numerator, 3);
    EXPECT_EQ(probe.HostTempo().denominator, 4);
    for (const double tempo : {0.0, -10.0, std::numeric_limits<double>::quiet_NaN()}) {
        host.tempo = tempo;
        EXPECT_EQ(probe.HostTempo().bpm, 120.0);
    }
    probe.m_cook = false;
    probe.NotifyTempoChanged();
    EXPECT_TRUE(probe.m_cook);
}
