#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Drawing/Views/Axis.h"
#include "Drawing/Views/ShortText.h"

using namespace Corvo;

namespace {

std::vector<std::string> Labels(const AxisTicks& ticks, int upToRank) {
    std::vector<std::string> labels;
    for (const AxisTick& tick : ticks.All())
        if (tick.rank <= upToRank) labels.emplace_back(tick.Label());
    return labels;
}

CoordinatesAndFrequencies Map(FrequencyScale scale, double low, double high, float width = 1000.0f) {
    return {{0, 0, width, 100}, low, high, scale, LevelScale::Decibels, 90.0f};
}

using Texts = std::vector<std::string>;

}  // namespace

TEST(Axis, ScalesAreMarkedAtRoundValues) {
    const auto frequencies = [](FrequencyScale scale, double low, double high, AxisRoom room, int ranks) {
        return Labels(FrequencyTicks(Map(scale, low, high, room.length), room, false), ranks);
    };
    constexpr auto kLogarithmic = FrequencyScale::Logarithmic, kLinear = FrequencyScale::Linear;
    EXPECT_EQ(frequencies(kLogarithmic, 20, 24000, {1000, 6, 40}, 2),
              (Texts{"20 Hz", "50", "100", "200", "500", "1k", "2k", "5k", "10k", "20k"}));
    EXPECT_EQ(frequencies(kLogarithmic, 20, 24000, {400, 6, 40}, 2),
              (Texts{"30 Hz", "100", "300", "1k", "3k", "10k"}))
        << "every decade alike";
    EXPECT_EQ(frequencies(kLogarithmic, 20, 24000, {250, 6, 40}, 2), (Texts{"100 Hz", "1k", "10k"}));
    EXPECT_EQ(frequencies(kLinear, 0, 24000, {1000, 20, 200}, 2), (Texts{"0 Hz", "5k", "10k", "15k", "20k"}));
    EXPECT_EQ(frequencies(kLinear, 400, 480, {1000, 10, 100}, 2),
              (Texts{"400 Hz", "410", "420", "430", "440", "450", "460", "470", "480"}));
    EXPECT_EQ(frequencies(FrequencyScale::Mel, 0, 24000, {1000, 6, 40}, 1).front(), "0 Hz");
    EXPECT_EQ(frequencies(FrequencyScale::Notes, 200, 1000, {600, 6, 40}, 0), (Texts{"C4", "C5"}));
    EXPECT_EQ(frequencies(FrequencyScale::Notes, 240, 500, {600, 6, 24}, 1),
              (Texts{"B3", "C4", "D4", "E4", "F4", "G4", "A4", "B4"}));
}

TEST(Axis, LevelsAndTimesAreMarkedAtRoundValues) {
    const auto levels = [](float range, float length) {
        const CoordinatesAndFrequencies map({0, 0, 9, 9}, 0, 1, FrequencyScale::Linear, LevelScale::Decibels,
                                            range);
        return Labels(LevelTicks(map, {length, 6, 30}), 2);
    };
    EXPECT_EQ(levels(90, 180),
              (Texts{"0 dB", "\u221215", "\u221230", "\u221245", "\u221260", "\u221275", "\u221290"}));
    EXPECT_EQ(levels(60, 100), (Texts{"0 dB", "\u221220", "\u221240", "\u221260"}));
    EXPECT_EQ(levels(144, 130), (Texts{"0 dB", "\u221236", "\u221272", "\u2212108", "\u2212144"}));
    const CoordinatesAndFrequencies amplitude({0, 0, 9, 9}, 0, 1, FrequencyScale::Linear,
                                              LevelScale::Amplitude, 0);
    EXPECT_EQ(Labels(LevelTicks(amplitude, {100, 6, 18}), 2),
              (Texts{"1.0", "0.8", "0.6", "0.4", "0.2", "0.0"}));
    EXPECT_EQ(Labels(TimeTicks(0.0, 2.2, {1000, 6, 150}), 2),
              (Texts{"\u22122.0", "\u22121.5", "\u22121.0", "\u22120.5", "0.0 s"}));
    EXPECT_EQ(Labels(TimeTicks(7.3, 4.0, {400, 6, 60}), 2), (Texts{"4", "5", "6", "7 s"}));
}

TEST(Axis, DenseOrEmptyScalesEnd) {
    for (const float length : {0.0f, 1.0f, 1e6f})
        for (const double high : {1e-9, 20.0, 1e9})
            for (const auto scale : {FrequencyScale::Linear, FrequencyScale::Notes, FrequencyScale::Mel})
                EXPECT_LE(FrequencyTicks(Map(scale, 0, high, length), {length, 1, 1}, false).All().size(),
                          192u);
    EXPECT_TRUE(TimeTicks(0.0, 0.0, {100, 6, 10}).All().empty());
}

TEST(Axis, RoomIsGivenOnce) {
    LabelRoom room(0, 100, 5);
    EXPECT_TRUE(room.Take(10, 20));
    EXPECT_FALSE(room.Take(22, 30)) << "closer than the gap";
    EXPECT_TRUE(room.Take(25, 30));
    EXPECT_FALSE(room.Take(5, 40)) << "around both";
    EXPECT_FALSE(room.Take(-1, 4));
    EXPECT_FALSE(room.Take(96, 101));
}

// The names' expected values are those of equal temperament: A4 = 440 Hz, a cent a factor of 2^(1/1200).
TEST(ShortText, ReadsLikeAScale) {
    EXPECT_EQ(ShortText().AddFrequency(440.04).View(), "440.0 Hz");
    EXPECT_EQ(ShortText().AddFrequency(43.436).View(), "43.44 Hz");
    EXPECT_EQ(ShortText().AddFrequency(999.96).View(), "1.000 kHz");
    EXPECT_EQ(ShortText().AddFrequency(12345.0).View(), "12.35 kHz");
    EXPECT_EQ(ShortText().AddNote(440.0).View(), "A4 +0c");
    EXPECT_EQ(ShortText().AddNote(261.6256 * 1.00986).View(), "C4 +17c");
    EXPECT_EQ(ShortText().AddNote(27.5 * 0.99).View(), "A0 \u221217c");
    EXPECT_EQ(ShortText().AddNote(1.0).View(), "");
    EXPECT_EQ(ShortText().AddNumber(-0.04, 1).View(), "0.0") << "no sign on nothing";
    ShortText full;
    for (int i = 0; i < 100; ++i) full.Add("longer than it can hold");
    EXPECT_EQ(full.View().size(), 95u);
}
