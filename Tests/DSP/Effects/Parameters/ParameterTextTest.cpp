#include "DSP/Effects/Parameters/ParameterText.h"

#include <gtest/gtest.h>

#include <cmath>
#include <stdexcept>

#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/SettingsChunk.h"

using namespace Corvo::DSP;

TEST(FixedPoint, TruncatesAndStaysInItsRange) {
    const FixedPoint map{1000.0f, -10.0f};
    EXPECT_EQ(map.Word(0.0199f), 9) << "truncates, never rounds";
    EXPECT_EQ(map.Word(0.0091f), 0) << "truncates toward zero, not downward";
    EXPECT_EQ(map.Word(std::nanf("")), -10);
    EXPECT_EQ(map.Word(7.0f), 990);
    EXPECT_EQ(map.Normalised(-5000), 0.0f);
}

TEST(ParameterText, ReadsWhatItShows) {
    EXPECT_EQ(ParseTenthsOfDb(Narrow(FormatTenthsOfDb(-7, -800)), -800), -7);
    EXPECT_EQ(ParseTenthsOfDb("-Inf. dB", -960), -960);
    EXPECT_EQ(ParseTenthsOfDb("nan", -960), -960);
    EXPECT_EQ(ParseNumber(" \t+3.5ms"), 3.5f);
    EXPECT_EQ(ParseSwitch(" on"), 1.0f);
    EXPECT_EQ(ParseSwitch("OFF"), 0.0f);
    EXPECT_EQ(ParseSwitch("0.5"), 1.0f);
    for (const char* text : {"", "   ", "dB", "+-1", "."})
        EXPECT_THROW(ParseNumber(text), std::invalid_argument);
    for (const char* text : {"1e39", "-1e400"}) EXPECT_THROW(ParseNumber(text), std::out_of_range);
    constexpr std::string_view names[] = {"1/2", "1/256", "Beat"};
    EXPECT_EQ(FindName(" 1/256 (8 ms)", names), 1);
    EXPECT_EQ(FindName("beat", names), 2);
    EXPECT_EQ(FindName("1", names), -1);
}

// Catches a field read half, or the one after it read from the middle.
TEST(SettingsChunk, StopsWhereTheBytesEnd) {
    std::vector<std::uint8_t> chunk;
    ChunkWriter write(chunk, 5);
    EXPECT_TRUE(write(std::int32_t{0x01020304}));
    EXPECT_FALSE(write(1.0f)) << "one byte is left";
    EXPECT_EQ(chunk, (std::vector<std::uint8_t>{4, 3, 2, 1, 0}));

    float number = 7.0f;
    std::uint8_t byte = 9;
    ChunkReader read(chunk);
    EXPECT_TRUE(read.Skip(4));
    EXPECT_FALSE(read(number));
    EXPECT_FALSE(read(byte)) << "after a failed read nothing more is believed";
    EXPECT_EQ(number, 7.0f);
    EXPECT_EQ(byte, 9);
}
