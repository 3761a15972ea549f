#include "DSP/Effects/Parameters/ParameterText.h"

#include <gtest/gtest.h>

#include <clocale>
#include <cmath>
#include <stdexcept>

#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/SettingsChunk.h"

using namespace Corvo::DSP;

// Catches knobs that creep by one word each time a project is saved and reopened.
TEST(FixedPoint, ReturnsEveryWordToItself) {
    for (const FixedPoint map : {FixedPoint{99999, 1}, FixedPoint{1160, -960}, FixedPoint{790, -800},
                                 FixedPoint{10000, 0}, FixedPoint{400, -300}, FixedPoint{2000, 0},
                                 FixedPoint{19980, 20}, FixedPoint{251, 0}, FixedPoint{200, -100}}) {
        const auto first = static_cast<std::int32_t>(map.floor);
        const auto last = static_cast<std::int32_t>(map.floor + map.span);
        for (auto word = first; word <= last; ++word)
            ASSERT_EQ(map.Word(map.Normalised(word)), word) << map.span << ", " << map.floor;
    }
    const FixedPoint map{1000.0f, -10.0f};
    EXPECT_EQ(map.Word(0.0199f), 9) << "truncates, never rounds";
    EXPECT_EQ(map.Word(0.0091f), 0) << "truncates toward zero, not downward";
    EXPECT_EQ(map.Word(std::nanf("")), -10);
    EXPECT_EQ(map.Word(7.0f), 990);
    EXPECT_EQ(map.Normalised(5000), 1.0f);
    EXPECT_EQ(map.Normalised(-5000), 0.0f);
}

TEST(ParameterText, FormatsNumbers) {
    EXPECT_EQ(FormatFixed(0.005, 2, 4), L"0.01");
    EXPECT_EQ(FormatFixed(-1.25, 1, 6), L"  -1.2");
    EXPECT_EQ(FormatFixed(1e300, 0).size(), 301u);
    EXPECT_EQ(FormatTenthsOfDb(-60, -800), L"-6.0");
    EXPECT_EQ(FormatTenthsOfDb(-7, -800), L"-0.7");
    EXPECT_EQ(FormatTenthsOfDb(123, -800), L"12.3");
    EXPECT_EQ(FormatTenthsOfDb(-800, -800), L"-Inf.");
    EXPECT_EQ(FormatTenthsOfDb(INT32_MIN, INT32_MIN + 1), L"-Inf.");
    EXPECT_EQ(WithUnit(L"1.00", L""), L"1.00 ");
}

// Catches a comma that a process with another locale would show, or expect.
TEST(ParameterText, IgnoresTheLocale) {
    const std::string before = std::setlocale(LC_ALL, nullptr);
    for (const char* locale : {"de_DE.UTF-8", "fr_FR.UTF-8", "German"})
        if (std::setlocale(LC_ALL, locale)) break;
    EXPECT_EQ(FormatFixed(1.5, 1), L"1.5");
    EXPECT_EQ(ParseNumber("1.5 dB"), 1.5f);
    std::setlocale(LC_ALL, before.c_str());
}

TEST(ParameterText, ReadsWhatItShows) {
    for (std::int32_t tenths = -799; tenths <= 400; ++tenths)
        ASSERT_EQ(ParseTenthsOfDb(Narrow(FormatTenthsOfDb(tenths, -800)), -800), tenths);
    EXPECT_EQ(ParseTenthsOfDb("-Inf. dB", -960), -960);
    EXPECT_EQ(ParseTenthsOfDb("nan", -960), -960);
    EXPECT_EQ(ParseNumber(" \t+3.5ms"), 3.5f);
    EXPECT_EQ(ParseNumber("-0.25 "), -0.25f);
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
    ChunkWriter write(chunk, 9);
    EXPECT_TRUE(write(std::int32_t{0x01020304}));
    EXPECT_TRUE(write(std::array<std::uint16_t, 2>{5, 6}));
    EXPECT_FALSE(write(1.0f)) << "one byte is left";
    EXPECT_EQ(chunk, (std::vector<std::uint8_t>{4, 3, 2, 1, 5, 0, 6, 0, 0}));

    std::int32_t word = 0;
    float number = 7.0f;
    std::uint8_t byte = 9;
    ChunkReader read(chunk);
    EXPECT_TRUE(read(word) && read.Skip(4));
    EXPECT_EQ(word, 0x01020304);
    EXPECT_FALSE(read(number));
    EXPECT_EQ(number, 7.0f);
    EXPECT_FALSE(read(byte)) << "after a failed read nothing more is believed";
    EXPECT_EQ(byte, 9);
}
