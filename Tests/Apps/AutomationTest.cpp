#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "Apps/Program.h"
#include "Automation.h"
#include "Chain.h"
#include "Errors.h"

namespace AppTest {
namespace {

using dsphost::AutomationPoint;

// Has a pair of parameters and keeps what it is given.
class Listener : public dsphost::ChainElement {
public:
    Listener(std::string name, std::map<int, std::vector<AutomationPoint>>& heard)
        : m_name(std::move(name)), m_heard(heard) {}
    std::string Name() const override { return m_name; }
    bool Prepare(int, const tWAVEFORMATEX&, bool) override { return false; }
    void Process(double*, int, std::int64_t) override {}
    std::vector<int> AutomationLanes(std::string_view parameter) override {
        if (parameter == "Depth") return {0, 1};
        if (parameter == "Depth R") return {1};
        throw dsphost::UserError("no such parameter");
    }
    void Automate(int lane, std::span<const AutomationPoint> points) override {
        m_heard[lane].assign(points.begin(), points.end());
    }

private:
    std::string m_name;
    std::map<int, std::vector<AutomationPoint>>& m_heard;
};

class Automation : public Program {
protected:
    // Two of one name around one of another.
    void Load(const std::string& json) {
        SaveBytes("moves.json", json);
        for (auto& lanes : m_heard) lanes.clear();
        std::vector<std::unique_ptr<dsphost::ChainElement>> elements;
        for (std::size_t i = 0; i < 3; ++i)
            elements.push_back(std::make_unique<Listener>(i == 1 ? "Echo" : "Tremolo", m_heard[i]));
        dsphost::Chain chain(std::move(elements));
        dsphost::LoadAutomation("moves.json", 1000, chain);
    }
    std::map<int, std::vector<AutomationPoint>> m_heard[3];
};

TEST_F(Automation, FindsItsLanesAndSortsItsPoints) {
    Load(R"([{"effect": "echo", "parameter": "Depth", "points": [[2, 1], [0.5, 0.25]]},
             {"effect": 3, "parameter": "Depth R", "points": [{"time": 0, "value": 0.5}]}])");
    EXPECT_TRUE(m_heard[0].empty());
    for (const int side : {0, 1}) {
        ASSERT_EQ(m_heard[1][side].size(), 2u);
        EXPECT_EQ(m_heard[1][side][0].frame, 500);
        EXPECT_EQ(m_heard[1][side][0].value, 0.25f);
        EXPECT_EQ(m_heard[1][side][1].frame, 2000);
    }
    EXPECT_EQ(m_heard[2].size(), 1u);
    EXPECT_EQ(m_heard[2][1].size(), 1u);
}

TEST_F(Automation, RefusesWhatItCannotPlay) {
    struct Case {
        std::string json, words;
    };
    const auto lane = [](const std::string& effect, const std::string& points) {
        return R"([{"effect": )" + effect + R"(, "parameter": "Depth", "points": )" + points + "}]";
    };
    const Case cases[] = {
        {"[", "is not JSON"},
        {"7", "not a list of lanes"},
        {"[7]", "lane 1: a lane is"},
        {R"([{"effect": "Echo", "parameter": "Depth"}])", "a lane is"},
        {lane("\"Echo\"", "[]"), "a lane is"},
        {lane("\"Echo\"", "[[0]]"), "a point is"},
        {lane("\"Echo\"", "[[-1, 0]]"), "time"},
        {lane("\"Echo\"", "[[1e300, 0]]"), "time"},
        {lane("\"Echo\"", "[[0, 1.5]]"), "value"},
        {lane("\"Echo\"", "[[0, \"1\"]]"), "value"},
        {lane("\"Ecco\"", "[[0, 1]]"), "Ecco"},
        {lane("\"Tremolo\"", "[[0, 1]]"), "more than once"},
        {lane("4", "[[0, 1]]"), "1 to 3"},
        {lane("true", "[[0, 1]]"), "a name or a place"},
        {R"([{"parameter": "Depth", "points": [[0, 1]]}])", "\"effect\" is missing"},
        {R"([{"effect": 2, "parameter": "Mix", "points": [[0, 1]]}])", "no such parameter"},
        {R"([{"effect": 2, "parameter": "Depth R", "points": [[0, 1]]},
             {"effect": 2, "parameter": "Depth", "points": [[0, 1]]}])",
         "lane 2: the same parameter"},
    };
    for (const auto& c : cases) {
        try {
            Load(c.json);
            ADD_FAILURE() << c.json << " was accepted";
        } catch (const dsphost::UserError& error) {
            EXPECT_EQ(std::string(error.what()).find("moves.json: "), 0u) << error.what();
            EXPECT_NE(std::string(error.what()).find(c.words), std::string::npos) << error.what();
        }
    }
}

}  // namespace
}  // namespace AppTest
