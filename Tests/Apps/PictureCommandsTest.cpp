#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <numbers>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "Apps/Program.h"
#include "Support/Signals.h"

namespace AppTest {
namespace {

class PictureCommands : public Program {
protected:
    // A second of silence, then two of a saw-tooth 20 cents above A3.
    static void SaveTone() {
        constexpr int kRate = 44100;
        const double hz = 220.0 * std::exp2(20.0 / 1200.0);
        std::vector<double> tone(kRate, 0.0);
        for (int i = 0; i < 2 * kRate; ++i) {
            double sum = 0.0;
            for (int h = 1; h <= 20; ++h) sum += std::sin(2.0 * std::numbers::pi * h * hz * i / kRate) / h;
            tone.push_back(0.2 * sum);
        }
        Save("in.wav", {1, kRate, SF_FORMAT_WAV | SF_FORMAT_DOUBLE, tone});
    }

    // Width and height as the file's header has them; 0 for anything but a PNG.
    static std::pair<std::uint32_t, std::uint32_t> PngSize(const std::string& path) {
        const std::string bytes = Bytes(path);
        if (bytes.size() < 24 || bytes.substr(0, 8) != "\x89PNG\r\n\x1a\n") return {0, 0};
        const auto number = [&](std::size_t at) {
            std::uint32_t value = 0;
            for (std::size_t i = at; i < at + 4; ++i)
                value = value << 8 | static_cast<std::uint8_t>(bytes[i]);
            return value;
        };
        return {number(16), number(20)};
    }
};

TEST_F(PictureCommands, DrawTheSizeAskedForAndTheSameBytesAgain) {
    SaveTone();
    for (const char* command : {"spectrum", "sonogram", "tuner"}) {
        SCOPED_TRACE(command);
        const auto draw = [&](const std::string& out, std::vector<std::string> more) {
            more.insert(more.begin(), {command, "in.wav", out});
            const auto result = Run(more);
            EXPECT_EQ(result.status, 0) << result.err;
            EXPECT_EQ(result.out, "");
        };
        const std::vector<std::string> options{"--size", "321x123", "--dpi",
                                               "144",    "--view",  "filled,note-names"};
        draw("a.png", options);
        draw("b.png", options);
        EXPECT_EQ(PngSize("a.png"), std::pair(321u, 123u));
        EXPECT_EQ(Bytes("a.png"), Bytes("b.png"));
        draw("c.png", {"--scale", "linear"});
        EXPECT_EQ(PngSize("c.png").second, 720u);
        for (const char* file : {"a.png", "b.png", "c.png"}) std::filesystem::remove(file);
    }
}

TEST_F(PictureCommands, SpectrumDrawsBesideItsTable) {
    SaveTone();
    const auto result = Run({"spectrum", "in.wav", "o.png", "--csv", "o.csv"});
    ASSERT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(PngSize("o.png"), std::pair(1280u, 720u));
    EXPECT_EQ(Bytes("o.csv").substr(0, 22), "frequency_hz,level_db\n");
}

// Catches times of the window's end, notes in silence, and anything but the array on standard output.
TEST_F(PictureCommands, TunerTellsNotesAsJson) {
    SaveTone();
    const auto result = Run({"tuner", "in.wav", "o.png", "--json"});
    ASSERT_EQ(result.status, 0) << result.err;
    const auto rows = nlohmann::json::parse(result.out);
    ASSERT_TRUE(rows.is_array());
    EXPECT_NEAR(static_cast<double>(rows.size()), 3.0 * 30.0, 5.0);
    int silent = 0, heard = 0;
    for (const auto& row : rows) {
        const double time = row.at("time");
        if (time < 0.8) {
            EXPECT_TRUE(row.at("note").is_null() && row.at("cents").is_null() &&
                        row.at("frequency").is_null());
            ++silent;
        } else if (time > 1.3) {
            EXPECT_EQ(row.at("note"), "A3") << time;
            EXPECT_NEAR(row.at("cents"), 20.0, 0.5) << time;
            EXPECT_NEAR(row.at("frequency"), 222.56, 0.07) << time;
            ++heard;
        }
    }
    EXPECT_GT(silent, 15);
    EXPECT_GT(heard, 40);
}

// Catches a window that is too short for low notes where the rate is high.
TEST_F(PictureCommands, TunerHearsLowNotesAtHighRates) {
    Save("in.wav",
         {1, 192000, SF_FORMAT_WAV | SF_FORMAT_FLOAT, TestSupport::Sine<double>(2 * 192000, 41.2, 192000)});
    const auto result = Run({"tuner", "in.wav", "o.png", "--json"});
    ASSERT_EQ(result.status, 0) << result.err;
    const auto rows = nlohmann::json::parse(result.out);
    ASSERT_GT(rows.size(), 30u);
    EXPECT_EQ(rows[rows.size() / 2].at("note"), "E1");
}

TEST_F(PictureCommands, RefuseWhatTheyCannotDo) {
    SaveTone();
    const struct {
        std::vector<std::string> arguments, words;
    } kCases[] = {
        {{"spectrum", "in.wav"}, {"output"}},
        {{"spectrum", "in.wav", "o.png", "--size", "0x10"}, {"--size", "0x10"}},
        {{"sonogram", "in.wav", "o.png", "--size", "100"}, {"--size", "WIDTHxHEIGHT"}},
        {{"sonogram", "in.wav", "o.png", "--size", "20000x20"}, {"--size", "16384"}},
        {{"sonogram", "in.wav", "o.png", "--speed", "9"}, {"--speed", "8"}},
        {{"sonogram", "in.wav", "o.png", "--scheme", "7"}, {"--scheme", "6"}},
        {{"tuner", "in.wav", "o.png", "--dpi", "nan"}, {"--dpi"}},
        {{"tuner", "in.wav", "o.png", "--view", "wavy"}, {"wavy", "view"}},
        {{"tuner", "in.wav", "o.png", "--scale", "cubic"}, {"cubic", "log"}},
        {{"tuner", "in.wav", "o.png", "--temperament", "Bach"}, {"Bach"}},
        {{"tuner", "in.wav", "o.png", "--at", "-1"}, {"--at"}},
        {{"tuner", "in.wav", "o.png", "--at", "99"}, {"--at", "ends"}},
        {{"tuner", "in.wav", "-", "--json"}, {"standard output"}},
        {{"spectrum", "in.wav", "-", "--csv", "-"}, {"standard output"}},
        {{"tuner", "in.wav", "o.png", "--font", "in.wav"}, {"--font", "in.wav"}},
        {{"tuner", "in.wav", "in.wav", "-y"}, {"in.wav", "input"}},
        {{"tuner", "in.wav", "o.png", "--font", "none.ttf"}, {"--font", "none.ttf"}},
    };
    for (const auto& c : kCases) {
        SCOPED_TRACE(c.arguments.back());
        ExpectRefused(Run(c.arguments), 2, c.words);
    }
}

}  // namespace
}  // namespace AppTest
