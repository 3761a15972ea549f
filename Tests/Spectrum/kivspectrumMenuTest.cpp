#include <climits>
#include <cstring>
#include <memory>
#include <utility>
#include <vector>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/MessagePoster.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"

namespace {

using Record = kivspectrum::spectrum_settings;

class MenuTest : public AnalyserTest {
protected:
    ~MenuTest() override {
        Tuner::SetDetectionMethod(0);
        Tuner::SetShowDenoisedSpectrum(false);
        Tuner::SetTemperament(0);
        Tuner::SetNoteNaming(0);
        Tuner::SetTunedQuantumPreset(3);
    }

    kivspectrum m_analyser;
};

struct Entry {
    int command;
    std::int32_t Record::*field;
    std::int32_t value;
};

// The ends of every range, where an offset by one would show.
TEST_F(MenuTest, StoresWhatEachCommandStandsFor) {
    for (const Entry& entry : {Entry{1201, &Record::fft_length, 4096},  // raised to the window's length
                               {1206, &Record::fft_length, 4096},
                               {1208, &Record::fft_length, 16384},
                               {1213, &Record::fft_length, 524288},
                               {1200, &Record::fft_length, 4096},
                               {1220, &Record::window_length, 128},
                               {1232, &Record::window_length, 524288},
                               {1225, &Record::window_length, 4096},
                               {1240, &Record::window_type, 0},
                               {1244, &Record::window_type, 4},
                               {1250, &Record::view_option_d, 0},
                               {1253, &Record::view_option_d, 3},
                               {1254, &Record::view_option_c, 0},
                               {1255, &Record::view_option_c, 1},
                               {1262, &Record::hop_length, 4096},
                               {1263, &Record::hop_length, 3072},
                               {1267, &Record::hop_length, 256},
                               {1282, &Record::view_flag_a, 1},
                               {1284, &Record::view_option_a, -1},
                               {1290, &Record::view_option_a, 5},
                               {1291, &Record::view_option_b, 0},
                               {1293, &Record::view_option_b, 2},
                               {1296, &Record::peak_decay_mode, 0},
                               {1299, &Record::peak_decay_mode, 3},
                               {1300, &Record::peak_hold_mode, 0},
                               {1302, &Record::peak_hold_mode, 2},
                               {1306, &Record::view_flag_b, 0},
                               {1307, &Record::view_option_e, 1},
                               {1309, &Record::view_option_e, 3},
                               {1312, &Record::view_flag_c, 0},
                               {1314, &Record::time_smoothing, 0},
                               {1393, &Record::smoothing_type, 0},
                               {1395, &Record::smoothing_type, 2},
                               {1398, &Record::smoothing_filter_length, 3},
                               {1401, &Record::smoothing_filter_length, 9},
                               {1402, &Record::smoothing_filter_length, 15}}) {
        EXPECT_TRUE(m_analyser.popupmenu_process(entry.command)) << entry.command;
        EXPECT_EQ(Settings().*entry.field, entry.value) << entry.command;
    }
    m_analyser.popupmenu_process(1316);
    EXPECT_TRUE(Settings().view_flag_d);
    m_analyser.popupmenu_process(1315);
    EXPECT_FALSE(Settings().view_flag_d);
    m_analyser.popupmenu_process(1258);
    EXPECT_TRUE(m_analyser.GetOn());
    EXPECT_TRUE(m_analyser.GetSpectrumDrawer()->GetOn());
}

// The hop follows a new window where an overlap was chosen; a negative one is the host's own business.
TEST_F(MenuTest, RecomputesTheHopForANewWindow) {
    m_analyser.popupmenu_process(1264);
    m_analyser.popupmenu_process(1226);
    EXPECT_EQ(Settings().hop_length, 4096);
    Settings().overlap = -0.5f;
    m_analyser.popupmenu_process(1221);
    EXPECT_EQ(Settings().hop_length, 4096);
}

TEST_F(MenuTest, LeavesOtherCommandsToTheHost) {
    const int unknown[] = {0,    -1,   1199, 1214, 1219, 1233, 1239, 1245, 1249,
                           1256, 1257, 1259, 1261, 1268, 1281, 1294, 1303, 1305,
                           1310, 1311, 1313, 1351, 1392, 1396, 1397, 1403, 1 << 30};
    const Record before = Settings();
    for (const int command : unknown) EXPECT_FALSE(m_analyser.popupmenu_process(command)) << command;
    EXPECT_EQ(std::memcmp(&before, &Settings(), sizeof before), 0);
}

TEST_F(MenuTest, SetsTheTunersChoices) {
    kivspectrum other;
    for (const int command : {1321, 1323, 1334, 1337, 1338, 1345}) m_analyser.popupmenu_process(command);
    EXPECT_EQ(Tuner::GetDetectionMethod(), 4);
    EXPECT_TRUE(Tuner::GetShowDenoisedSpectrum());
    EXPECT_EQ(Tuner::GetTemperament(), 10);
    EXPECT_EQ(Tuner::GetNoteNaming(), 2);
    EXPECT_EQ(Tuner::GetTunedQuantum(), 0.1f);
    EXPECT_EQ(m_analyser.GetTuner()->GetSensibilityPreset(), 1);
    EXPECT_EQ(other.GetTuner()->GetSensibilityPreset(), 2);

    Tuner::SetTemperament(12);
    EXPECT_EQ(Tuner::GetTemperament(), 0);
    Tuner::SetTemperament(-1);
    EXPECT_EQ(Tuner::GetTemperament(), 0);
    Tuner::SetTunedQuantumPreset(99);
    EXPECT_EQ(Tuner::GetTunedQuantum(), 2.0f);
    Corvo::Sonogram::SetSpeedIndex(99);
    EXPECT_EQ(Corvo::Sonogram::GetSpeedIndex(), 8);
    Corvo::Sonogram::SetSpeedIndex(3);
}

TEST_F(MenuTest, LengthensTheTransformWithTheWindow) {
    Settings().fft_length_auto = 0;
    Settings().fft_length = 1024;
    m_analyser.init();
    EXPECT_EQ(Settings().fft_length, 4096);
    EXPECT_EQ(m_analyser.GetBufferInputPoints().size(), 4096u);

    kivspectrum::lock_init = true;
    Settings().window_length = 256;
    m_analyser.init();
    EXPECT_EQ(m_analyser.GetWindow().size(), 4096u);
    kivspectrum::lock_init = false;
    m_analyser.init();
    EXPECT_EQ(m_analyser.GetWindow().size(), 256u);
}

// One change reaches every analyser; the tuner of another goes off with the caller's.
TEST_F(MenuTest, ReachesEveryLiveAnalyser) {
    auto gone = std::make_unique<kivspectrum>();
    kivspectrum other;
    gone.reset();
    other.SetTunerOn(true);
    m_analyser.popupmenu_process(1222);
    EXPECT_FALSE(other.GetTunerOn());
    EXPECT_EQ(other.GetWindow().size(), 512u);

    // The tuner works on no less than 8192 samples.
    other.popupmenu_process(1283);
    EXPECT_TRUE(other.GetTunerOn());
    EXPECT_EQ(Settings().window_length, 8192);
    other.popupmenu_process(1224);
    EXPECT_EQ(Settings().window_length, 8192);
    EXPECT_EQ(m_analyser.GetWindow().size(), 8192u);
}

TEST_F(MenuTest, TogglesTheTunerWithTheAnalyser) {
    m_analyser.SetFrozen(true);
    m_analyser.ToggleTuner();
    EXPECT_TRUE(m_analyser.GetTunerOn() && m_analyser.GetOn());
    EXPECT_FALSE(m_analyser.GetFrozen());
    EXPECT_EQ(m_analyser.GetWindow().size(), 8192u);
    m_analyser.ToggleTuner();
    EXPECT_FALSE(m_analyser.GetTunerOn());
    EXPECT_TRUE(m_analyser.GetOn());
}

TEST_F(MenuTest, EmptiesAFrozenAnalyserAndRebuildsAThawedOne) {
    m_analyser.SetOn(true);
    m_analyser.SetFrozen(true);
    m_analyser.popupmenu_process(1220);
    EXPECT_TRUE(m_analyser.GetPower().empty());
    EXPECT_TRUE(m_analyser.GetBufferInputPoints().empty());
    Feed(m_analyser, std::vector<float>(300, 1.0f));
    EXPECT_FALSE(Prepare(m_analyser));
    m_analyser.PerformFFT();
    m_analyser.SetFrozen(false);
    EXPECT_EQ(m_analyser.GetPower().size(), 64u);
    Feed(m_analyser, std::vector<float>(128, 1.0f));
    EXPECT_TRUE(Prepare(m_analyser));
}

// A length that the transform cannot have shows nonsense, but nothing worse.
TEST_F(MenuTest, SurvivesImpossibleLengths) {
    m_analyser.SetOn(true);
    for (const std::int32_t length : {0, -5, 1, 3, 1000, 1 << 30, INT32_MIN, INT32_MAX}) {
        Settings().window_length = Settings().fft_length = length;
        Settings().smoothing_filter_length = length < 0 ? length : 2;
        Settings().smoothing_type = 1;
        m_analyser.ObserverUpdate();
        Feed(m_analyser, std::vector<float>(5000, 1.0f));
        Prepare(m_analyser);
    }
}

struct Poster : MessagePoster {
    std::vector<std::pair<int, std::intptr_t>> messages;
    void Post(int message, std::intptr_t, std::intptr_t detail) override {
        messages.emplace_back(message, detail);
    }
    void Send(int, std::intptr_t, std::intptr_t) override {}
};

TEST_F(MenuTest, TellsTheHost) {
    Poster poster;
    kivspectrum::GetStaticInfo().SetMessagePoster(&poster);
    kivspectrum::needPrepareBitmap = false;
    m_analyser.popupmenu_process(1350);
    EXPECT_TRUE(kivspectrum::needPrepareBitmap);
    m_analyser.SetOn(true);
    Feed(m_analyser, std::vector<float>(4096, 1.0f));
    Prepare(m_analyser);
    kivspectrum::GetStaticInfo().SetMessagePoster(nullptr);
    const std::vector<std::pair<int, std::intptr_t>> expected{
        {kMessageTunerPanelRedraw, 0}, {kMessageSettingsChanged, 1350}, {kMessageFrameReady, 0}};
    EXPECT_EQ(poster.messages, expected);
    kivspectrum::needPrepareBitmap = false;
    kivspectrum::SetDpi(144);
    EXPECT_TRUE(kivspectrum::needPrepareBitmap);
    kivspectrum::needPrepareBitmap = false;
    kivspectrum::SetDpi(144);
    EXPECT_FALSE(kivspectrum::needPrepareBitmap);
}

TEST_F(MenuTest, StepsThroughTheDisplayModes) {
    for (const auto mode : {kivspectrum::display_sonogram, kivspectrum::display_both,
                            kivspectrum::display_tuner, kivspectrum::display_spectrum}) {
        m_analyser.ToggleDisplayMode();
        EXPECT_EQ(m_analyser.GetDisplayMode(), mode);
        EXPECT_EQ(m_analyser.IsShowSonogram(),
                  mode == kivspectrum::display_sonogram || mode == kivspectrum::display_both);
    }
    m_analyser.ToggleDisplayMode2();
    EXPECT_EQ(m_analyser.GetDisplayMode(), kivspectrum::display_both);
    m_analyser.ToggleDisplayMode2();
    EXPECT_EQ(m_analyser.GetDisplayMode(), kivspectrum::display_spectrum);
}

}  // namespace
