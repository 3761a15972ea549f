#include <gtest/gtest.h>

#include <set>
#include <string>

#include <nlohmann/json.hpp>

#include "Apps/Program.h"

namespace AppTest {
namespace {

class EffectsCommand : public Program {};

TEST_F(EffectsCommand, DescribesOneEffectAsJson) {
    const auto result = Run({"effects", "gain", "--json"});
    ASSERT_EQ(result.status, 0) << result.err;
    const auto all = nlohmann::json::parse(result.out);
    ASSERT_EQ(all.size(), 1u);
    EXPECT_EQ(all[0]["name"], "Gain");
    EXPECT_EQ(all[0]["latency"], 0);
    EXPECT_EQ(all[0]["default_preset"], 0);
    EXPECT_EQ(all[0]["presets"], nlohmann::json::array());
    const auto& parameters = all[0]["parameters"];
    ASSERT_EQ(parameters.size(), 5u);
    EXPECT_EQ(parameters[0],
              nlohmann::json::parse(R"({"index": 0, "name": "Gain", "unit": "dB", "default": 0.5,
                                                      "type": "continuous", "text": "0.0 dB", "values": []})"));
    // The full label, side included.
    EXPECT_EQ(parameters[4]["name"], "Flip phase R");
    EXPECT_EQ(parameters[4]["type"], "switch");
}

// Whatever effects there are: complete records, distinct names, defaults in range, texts in UTF-8 (the parser
// throws otherwise), and every effect can be named on the command line.
TEST_F(EffectsCommand, DescribesEveryEffect) {
    const auto result = Run({"effects", "--json"});
    ASSERT_EQ(result.status, 0) << result.err;
    Save("in.wav", NoiseSound(100));
    std::set<std::string> names;
    for (const auto& effect : nlohmann::json::parse(result.out)) {
        const std::string name = effect["name"];
        SCOPED_TRACE(name);
        EXPECT_TRUE(names.insert(name).second);
        EXPECT_FALSE(effect["parameters"].empty());
        int index = 0;
        for (const auto& parameter : effect["parameters"]) {
            EXPECT_EQ(parameter["index"], index++);
            EXPECT_FALSE(parameter["name"].get<std::string>().empty());
            EXPECT_FALSE(parameter["text"].get<std::string>().empty());
            EXPECT_GE(parameter["default"], 0.0);
            EXPECT_LE(parameter["default"], 1.0);
            EXPECT_TRUE(parameter["type"] != "list" || parameter["values"].size() > 1) << parameter;
        }
        EXPECT_EQ(Run({"effects", name}).status, 0);
        EXPECT_EQ(Run({"render", "in.wav", "out.wav", "-y", "--fx", name}).status, 0);
        for (const auto& preset : effect["presets"])
            EXPECT_EQ(Run({"render", "in.wav", "out.wav", "-y", "--fx",
                           name + ": preset=" + preset.get<std::string>()})
                          .status,
                      0)
                << preset;
    }
    EXPECT_TRUE(names.count("Gain"));
}

TEST_F(EffectsCommand, ShowsTextsAtTheEndsAndTheMiddle) {
    const auto result = Run({"effects", "Gain"});
    ASSERT_EQ(result.status, 0) << result.err;
    for (const std::string words : {"-Inf. dB", "20.0 dB", "-1.00", "Flip phase R", "Off", "On", "latency 0"})
        EXPECT_NE(result.out.find(words), std::string::npos) << words << " in\n" << result.out;
}

}  // namespace
}  // namespace AppTest
