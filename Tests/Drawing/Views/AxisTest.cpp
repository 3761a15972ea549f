#include <gtest/gtest.h>

#include <string>

#include "Drawing/Views/Axis.h"
#include "Drawing/Views/ShortText.h"

using namespace Corvo;

namespace {

// The labels up to a rank, one blank apart.
std::string Labels(const AxisTicks& ticks, int upToRank = 2) {
    std::string labels;
    for (const AxisTick& tick : ticks.All())
        if (tick.rank <= upToRank) labels.append(labels.empty() ? "" : " ").append(tick.Label());
    return labels;
}

CoordinatesAndFrequencies Map(FrequencyScale scale, double low, double high, float width,
                              LevelScale levels = LevelScale::Decibels, float range = 90.0f) {
    return {{0, 0, width, 100}, low, high, scale, levels, range};
}

// Catches steps that are not round, units lost or repeated, and decades that are not alike.
TEST(Axis, ScalesAreMarkedAtRoundValues) {
    constexpr auto kLog = FrequencyScale::Logarithmic, kLinear = FrequencyScale::Linear;
    constexpr auto kNotes = FrequencyScale::Notes;
    const struct {
        FrequencyScale scale;
        double low, high;
        AxisRoom room;
        int ranks;
        const char* labels;
    } frequencies[] = {
        {kLog, 20, 24000, {1000, 6, 40}, 2, "20 Hz 50 100 200 500 1k 2k 5k 10k 20k"},
        {kLog, 20, 24000, {250, 6, 40}, 2, "100 Hz 1k 10k"},
        {kLinear, 0, 24000, {1000, 20, 200}, 2, "0 Hz 5k 10k 15k 20k"},
        {kNotes, 240, 500, {600, 6, 24}, 1, "B3 C4 D4 E4 F4 G4 A4 B4"},
    };
    for (const auto& [scale, low, high, room, ranks, labels] : frequencies)
        EXPECT_EQ(Labels(FrequencyTicks(Map(scale, low, high, room.length), room, false), ranks), labels);

    const auto levels = [](float range, float length, LevelScale scale = LevelScale::Decibels) {
        return Labels(LevelTicks(Map(FrequencyScale::Linear, 0, 1, 9, scale, range), {length, 6, 30}));
    };
    EXPECT_EQ(levels(90, 180), "0 dB \u221215 \u221230 \u221245 \u221260 \u221275 \u221290");
    EXPECT_EQ(levels(144, 130), "0 dB \u221236 \u221272 \u2212108 \u2212144");
    EXPECT_EQ(levels(0, 165, LevelScale::Amplitude), "1.0 0.8 0.6 0.4 0.2 0.0");
    EXPECT_EQ(Labels(TimeTicks(0.0, 2.2, {1000, 6, 150})), "\u22122.0 \u22121.5 \u22121.0 \u22120.5 0.0 s");
    for (const auto scale : {kLinear, kNotes, FrequencyScale::Mel})  // scales too dense for their labels end
        EXPECT_LE(FrequencyTicks(Map(scale, 0, 1e9, 1e6f), {1e6f, 1, 1}, false).All().size(), 192u);
}

// The names' expected values are those of equal temperament: A4 = 440 Hz, a cent a factor of 2^(1/1200).
TEST(ShortText, ReadsLikeAScale) {
    EXPECT_EQ(ShortText().AddFrequency(55.0).View(), "55.00 Hz");
    EXPECT_EQ(ShortText().AddFrequency(440.04).View(), "440.0 Hz");
    EXPECT_EQ(ShortText().AddFrequency(999.96).View(), "1.000 kHz");
    EXPECT_EQ(ShortText().AddFrequency(9990.0).View(), "9.990 kHz");
    EXPECT_EQ(ShortText().AddFrequency(12345.0).View(), "12.35 kHz");
    EXPECT_EQ(ShortText().AddNote(440.0).View(), "A4 +0c");
    EXPECT_EQ(ShortText().AddNote(261.6256 * 1.00986).View(), "C4 +17c");
    EXPECT_EQ(ShortText().AddNumber(-0.04, 1).View(), "0.0") << "no sign on nothing";
    EXPECT_EQ(ShortText().Add(std::string(100, 'x')).View().size(), 95u);
}

}  // namespace
