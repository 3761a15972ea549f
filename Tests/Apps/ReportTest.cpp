#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "Apps/Program.h"
#include "Chain.h"
#include "Support/Signals.h"
#include "Support/Voice.h"

// What the commands tell of effects and files: listings, tables, notes, pictures.
namespace AppTest {
namespace {

using nlohmann::json;

constexpr int kRate = 48000;

class Reports : public Program {
protected:
    // A second of silence, then two of a voice 20 cents above A3.
    static void SaveTone() {
        const double hz = 220.0 * std::exp2(20.0 / 1200.0);
        Save("in.wav", {1, 44100, kDouble,
                        TestSupport::Sing(3.0, 44100, [=](double t) { return t < 1.0 ? 0.0 : hz; })});
    }
};

// Whatever effects there are: in UTF-8 (the parser throws otherwise), with all parameters in their order, and
// every effect and preset can be named in a chain.
TEST_F(Reports, DescribeEveryEffect) {
    const auto overview = Succeed("effects");
    for (const auto& effect : json::parse(Succeed("effects --json"))) {
        const std::string name = effect.at("name");
        EXPECT_NE(overview.find(name), std::string::npos);
        if (effect.contains("bands")) continue;
        int index = 0;
        for (const auto& parameter : effect.at("parameters")) {
            EXPECT_EQ(parameter.at("index"), index++);
            for (const char* key : {"name", "text"}) EXPECT_NE(parameter.at(key), "") << name;
            EXPECT_TRUE(parameter.at("default") >= 0.0 && parameter.at("default") <= 1.0) << parameter;
            EXPECT_TRUE(parameter.at("type") != "list" || parameter.at("values").size() > 1) << parameter;
        }
        EXPECT_GT(index, 0) << name;
        std::vector<std::string> chain{name};
        for (const std::string preset : effect.at("presets")) chain.push_back(name + ": preset=" + preset);
        EXPECT_NO_THROW(dsphost::Chain{chain});
    }
    EXPECT_NE(Succeed("effects EQ").find("lowshelf"), std::string::npos);
    const auto text = Succeed("effects Gain");
    for (const std::string words : {"-Inf. dB", "20.0 dB", "-1.00", "Flip phase R", "Off", "On", "latency 0"})
        EXPECT_NE(text.find(words), std::string::npos) << words << " in\n" << text;
}

TEST_F(Reports, EqCurveAgreesWithAnImpulseThroughRender) {
    Sound impulse{1, kRate, kDouble, std::vector<double>(kRate)};
    impulse.samples[0] = 0.1;
    Save("impulse.wav", impulse);
    for (const std::string bands :
         {"150 lowshelf 7.5; 40000 peak 6", "6000 highshelf -9 q=120; 3000 lowpass -2.5 q=90",
          "200 lowshelf-butterworth 12; 80 highpass q=50",
          "5000 highshelf-butterworth 4; 2500 peak -3 q=200"}) {
        SCOPED_TRACE(bands);
        const std::string fx = " --fx \"EQ: " + bands + "\" ";
        Succeed("render -y --tail 1 impulse.wav out.wav" + fx);
        const auto curve = Rows(Succeed("eq-curve --rate 48000 -" + fx), "frequency_hz,gain_db,phase_deg");
        ASSERT_EQ(curve.size(), 512u);
        EXPECT_NEAR(std::stod(curve[256][0]), 10.0 * std::pow(2400.0, 256.0 / 511.0), 1e-6);
        const Sound out = Load("out.wav");
        for (std::size_t i = 0; i < curve.size(); i += 17) {
            const double hz = std::stod(curve[i][0]), decibels = std::stod(curve[i][1]);
            if (decibels < -120.0) continue;
            const auto sum = TestSupport::TransformAt(out.samples, hz / kRate) / 0.1;
            EXPECT_NEAR(20.0 * std::log10(std::abs(sum)), decibels, 0.01) << hz;
            const double apart = std::arg(sum) * 180.0 / std::numbers::pi - std::stod(curve[i][2]);
            EXPECT_NEAR(std::remainder(apart, 360.0), 0.0, 0.1) << hz;
        }
    }
}

// Catches times of the window's end, notes in silence, and anything but the array on standard output.
TEST_F(Reports, TunerTellsNotes) {
    SaveTone();
    const auto rows = json::parse(Succeed("tuner in.wav o.png --json"));
    EXPECT_NEAR(static_cast<double>(rows.size()), 3.0 * 30.0, 5.0);
    int silent = 0, heard = 0;
    for (const auto& row : rows)
        if (const double time = row.at("time"); time < 0.8) {
            for (const char* key : {"note", "cents", "frequency"}) EXPECT_TRUE(row.at(key).is_null());
            ++silent;
        } else if (time > 1.3) {
            EXPECT_EQ(row.at("note"), "A3") << time;
            EXPECT_NEAR(row.at("cents"), 20.0, 0.5) << time;
            EXPECT_NEAR(row.at("frequency"), 222.56, 0.07) << time;
            ++heard;
        }
    EXPECT_GT(silent, 15);
    EXPECT_GT(heard, 40);
}

// Catches an alpha that lets the viewer's ground through, and a --dpi without effect.
TEST_F(Reports, PicturesHaveTheSizeAskedForAndTheSameBytesAgain) {
    SaveTone();
    for (const std::string command : {"spectrum", "sonogram", "tuner"}) {
        SCOPED_TRACE(command);
        const std::string options = " -y --size 321x123 --view filled,note-names";
        for (const std::string file : {"a.png --dpi 144", "b.png --dpi 144", "c.png"})
            EXPECT_EQ(Succeed(command + " in.wav " + file + options), "");
        EXPECT_EQ(Bytes("a.png").substr(16, 10), std::string("\0\0\x01\x41\0\0\0\x7B\x08\x02", 10));
        EXPECT_EQ(Bytes("a.png"), Bytes("b.png"));
        EXPECT_NE(Bytes("a.png"), Bytes("c.png"));
    }
    Succeed("spectrum in.wav o.png --csv o.csv --scale linear");
    EXPECT_TRUE(Bytes("o.csv").starts_with("frequency_hz,level_db\n"));
}

}  // namespace
}  // namespace AppTest
