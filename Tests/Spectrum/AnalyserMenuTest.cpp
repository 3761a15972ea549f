#include "Spectrum/AnalyserMenu.h"

#include <set>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "Spectrum/AnalyserFixture.h"

namespace {

using Record = kivspectrum::spectrum_settings;

class MenuTest : public AnalyserFixture {
protected:
    kivspectrum m_analyser;
};

// One entry of every kind of command, where an offset or a shift by one would show; the rest is the table.
TEST_F(MenuTest, StoresWhatACommandStandsFor) {
    for (const auto& [command, field, value] :
         {std::tuple{1201, &Record::fft_length, 4096},  // raised to the window's length
          {1225, &Record::window_length, 4096},
          {1264, &Record::hop_length, 2048},
          {1226, &Record::hop_length, 4096},  // the hop follows the new window
          {1241, &Record::window_type, 1},
          {1253, &Record::view_option_d, 3},
          {1284, &Record::view_option_a, -1},
          {1299, &Record::peak_decay_mode, 3},
          {1302, &Record::peak_hold_mode, 2},
          {1314, &Record::time_smoothing, 0},
          {1395, &Record::smoothing_type, 2},
          {1402, &Record::smoothing_filter_length, 15}}) {
        EXPECT_TRUE(m_analyser.popupmenu_process(command)) << command;
        EXPECT_EQ(Settings().*field, value) << command;
    }
    for (const int command : {1321, 1334, 1337, 1338, 1345}) m_analyser.popupmenu_process(command);
    EXPECT_EQ(Tuner::GetDetectionMethod(), 4);
    EXPECT_EQ(Tuner::GetTemperament(), 10);
    EXPECT_EQ(Tuner::GetNoteNaming(), 2);
    EXPECT_EQ(Tuner::GetTunedQuantum(), 0.1f);
    EXPECT_EQ(m_analyser.GetTuner()->GetSensibilityPreset(), 1);
}

// The table has just the commands that are carried out. A choice is ticked once it is made, and of its group
// it alone; a switch changes its tick.
TEST_F(MenuTest, OffersWhatItCarriesOut) {
    const std::set<int> switches{1258, 1282, 1283, 1306, 1312, 1314}, actions{1295, 1350};
    const std::set<std::string> severalTicks{"Analyser", "Smoothing", "Show", "Tuner", "Tuner sensitivity"};
    Settings().window_length = 128;  // no transform is shorter
    std::set<int> commands;
    for (const auto& entry : Corvo::AnalyserMenu()) {
        EXPECT_TRUE(commands.insert(entry.command).second) << entry.command;
        const std::string group = entry.group;
        const bool before = m_analyser.popupmenu_checked(entry.command);
        EXPECT_TRUE(m_analyser.popupmenu_process(entry.command)) << entry.command;
        EXPECT_EQ(m_analyser.popupmenu_checked(entry.command),
                  switches.count(entry.command) ? !before : !actions.count(entry.command))
            << entry.command;
        int ticks = 0;
        for (const auto& other : Corvo::AnalyserMenu())
            ticks += group == other.group && m_analyser.popupmenu_checked(other.command);
        EXPECT_TRUE(ticks == 1 || severalTicks.count(group)) << entry.command;
    }
    EXPECT_EQ(commands.size(), 115u);
    for (int command = 1190; command < 1410; ++command) {
        if (commands.count(command)) continue;
        EXPECT_FALSE(m_analyser.popupmenu_process(command)) << command;
        EXPECT_FALSE(m_analyser.popupmenu_checked(command)) << command;
    }
}

// One change reaches every analyser; the tuner of another goes off with the caller's, and none works on less
// than 8192 samples.
TEST_F(MenuTest, ReachesEveryLiveAnalyser) {
    kivspectrum other;
    other.SetTunerOn(true);
    m_analyser.popupmenu_process(1222);
    EXPECT_FALSE(other.GetTunerOn());
    EXPECT_EQ(other.GetWindow().size(), 512u);
    other.popupmenu_process(1283);
    EXPECT_TRUE(other.GetTunerOn());
    other.popupmenu_process(1224);
    EXPECT_EQ(m_analyser.GetWindow().size(), 8192u);
}

TEST_F(MenuTest, SwitchesTunerAndAnalyser) {
    m_analyser.SetFrozen(true);
    m_analyser.ToggleTuner();
    EXPECT_TRUE(m_analyser.GetTunerOn() && m_analyser.GetOn() && !m_analyser.GetFrozen());
    EXPECT_EQ(m_analyser.GetWindow().size(), 8192u);
    // Frozen, the buffers are empty; thawed, they are built again.
    m_analyser.SetFrozen(true);
    m_analyser.popupmenu_process(1220);
    EXPECT_TRUE(m_analyser.GetPower().empty() && m_analyser.GetBufferInputPoints().empty());
    m_analyser.SetFrozen(false);
    Feed(m_analyser, std::vector<float>(128, 1.0f));
    EXPECT_TRUE(Prepare(m_analyser));
}

TEST_F(MenuTest, TellsTheHost) {
    std::vector<std::pair<int, std::intptr_t>> told;
    HookedPoster poster;
    poster.post = [&](int message, std::intptr_t detail) { told.emplace_back(message, detail); };
    kivspectrum::GetStaticInfo().SetMessagePoster(&poster);
    kivspectrum::needPrepareBitmap = false;
    m_analyser.popupmenu_process(1350);
    EXPECT_TRUE(kivspectrum::needPrepareBitmap.exchange(false));
    m_analyser.SetOn(true);
    Feed(m_analyser, std::vector<float>(4096, 1.0f));
    Prepare(m_analyser);
    EXPECT_EQ(told,
              (std::vector<std::pair<int, std::intptr_t>>{
                  {kMessageTunerPanelRedraw, 0}, {kMessageSettingsChanged, 1350}, {kMessageFrameReady, 0}}));
    kivspectrum::GetStaticInfo().SetMessagePoster(nullptr);
}

}  // namespace
