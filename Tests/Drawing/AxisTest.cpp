#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Drawing/Axis.h"
#include "Drawing/ShortText.h"

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
    EXPECT_EQ(Labels(FrequencyTicks(Map(FrequencyScale::Logarithmic, 20, 24000), 1000, 6, false), 1),
              (Texts{"20", "50", "100", "200", "500", "1k", "2k", "5k", "10k", "20k"}));
    EXPECT_EQ(Labels(FrequencyTicks(Map(FrequencyScale::Linear, 0, 24000), 1000, 20, false), 2),
              (Texts{"0", "5k", "10k", "15k", "20k"}));
    EXPECT_EQ(Labels(FrequencyTicks(Map(FrequencyScale::Linear, 400, 480), 1000, 10, false), 2),
              (Texts{"400", "410", "420", "430", "440", "450", "460", "470", "480"}));
    EXPECT_EQ(Labels(FrequencyTicks(Map(FrequencyScale::Notes, 200, 1000, 600), 600, 6, false), 0),
              (Texts{"C4", "C5"}));
    EXPECT_EQ(Labels(FrequencyTicks(Map(FrequencyScale::Notes, 240, 500, 600), 600, 6, false), 1),
              (Texts{"B3", "C4", "D4", "E4", "F4", "G4", "A4", "B4"}));
    EXPECT_EQ(Labels(LevelTicks(Map(FrequencyScale::Linear, 0, 1), 180, 30), 0),
              (Texts{"0", "\u221220", "\u221240", "\u221260", "\u221280"}));
    const CoordinatesAndFrequencies amplitude({0, 0, 9, 9}, 0, 1, FrequencyScale::Linear,
                                              LevelScale::Amplitude, 0);
    EXPECT_EQ(Labels(LevelTicks(amplitude, 100, 18), 0), (Texts{"1.0", "0.8", "0.6", "0.4", "0.2", "0.0"}));
    EXPECT_EQ(Labels(TimeTicks(2.5, 1000, 150), 0),
              (Texts{"0 s", "\u22120.5", "\u22121.0", "\u22121.5", "\u22122.0", "\u22122.5"}));
}

TEST(Axis, DenseOrEmptyScalesEnd) {
    for (const float length : {0.0f, 1.0f, 1e6f})
        for (const double high : {1e-9, 20.0, 1e9})
            for (const auto scale : {FrequencyScale::Linear, FrequencyScale::Notes, FrequencyScale::Mel})
                EXPECT_LE(FrequencyTicks(Map(scale, 0, high, length), length, 1, false).All().size(), 192u);
    EXPECT_TRUE(TimeTicks(0.0, 100, 10).All().empty());
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
