#include "DSP/Effects/Parameters/ParameterText.h"

#include <gtest/gtest.h>

#include <stdexcept>

using namespace Corvo::DSP;

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
