#include <chrono>
#include <filesystem>
#include <thread>
#include <vector>

#include "Analyser/ViewFixture.h"
#include "Files.h"
#include "Program/Player.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Support/Signals.h"

namespace {

using namespace analyser;
namespace fs = std::filesystem;

class PlayedFile : public ViewTest {
protected:
    static constexpr int kRate = 44100;

    void TearDown() override { fs::remove_all(m_folder); }
    std::string Write(const char* name, int format, double seconds) {
        fs::create_directories(m_folder);
        SF_INFO info{0, kRate, 1, format | SF_FORMAT_PCM_16, 0, 0};
        const std::string path = (m_folder / name).string();
        SNDFILE* const file = sf_open(path.c_str(), SFM_WRITE, &info);
        const auto sine =
            TestSupport::Sine<float>(static_cast<std::size_t>(seconds * kRate), 1000.0, kRate, 0.5);
        sf_writef_float(file, sine.data(), static_cast<sf_count_t>(sine.size()));
        sf_close(file);
        return path;
    }
    void Open(const std::string& path) {
        m_canvas.Draw(m_view);
        ASSERT_EQ(m_player.Open(path), "");
        m_view.SetSamplingRate(kRate);
        m_view.StartOver();
    }
    void Step(int refreshes = 1) {
        for (int i = 0; i < refreshes; ++i) {
            m_player.Step(m_view);
            m_shell.playback = m_player.Get();
            m_view.Refresh();
        }
    }
    Corvo::Sonogram& Sonogram() { return *m_view.GetAnalyser().GetSonogram(); }
    // What the first column that was heard is called.
    double Beginning() {
        return Sonogram().GetTimeAtRightEdge() -
               1.0 * Sonogram().GetHeardColumns() / Corvo::Sonogram::GetColumnsPerSecond();
    }

    const fs::path m_folder = fs::temp_directory_path() / "analyser_program_test";
    AnalyserTest::TestShell m_shell;
    View m_view{m_shell};
    const double m_half = kivspectrum::GetSettings().window_length / 2.0 / kRate;
    AnalyserTest::Canvas m_canvas;
    Player m_player;
};

// Catches a beginning or an end that is not shown, also of a file shorter than the window, times that are not
// the file's, and a seek that does not go on from the end.
TEST_F(PlayedFile, IsShownFromItsBeginningToItsEnd) {
    for (const double seconds : {0.01, 0.75}) {
        Open(Write("whole.wav", SF_FORMAT_WAV, seconds));
        Step(60);
        EXPECT_TRUE(m_player.Get().ended);
        EXPECT_NEAR(Sonogram().GetTimeAtRightEdge(), seconds, 1e-3);
        EXPECT_NEAR(Beginning(), -m_half, 0.04);
        const auto peak = m_view.GetAnalyser().GetSpectrumDrawer()->HighestPeak(20.0);
        EXPECT_NEAR(peak.frequency, 1000.0, 10.0);
        EXPECT_GT(peak.level, -40.0);
        m_player.TogglePlaying();
        EXPECT_FALSE(m_player.Get().playing);
        m_player.Seek(0.0);
        m_player.TogglePlaying();
        EXPECT_TRUE(m_player.Get().playing);
    }
}

// Catches times that run on while the picture stands, and a past without the gap.
TEST_F(PlayedFile, KeepsItsTimesWhileThePictureStands) {
    Open(Write("long.wav", SF_FORMAT_WAV, 6.0));
    Step(60);
    for (const auto stop : {+[](View& view) { view.Do(kFreeze); },
                            +[](View& view) {
                                kivspectrum& first = view.GetAnalyser();
                                first.SetOn(!first.GetOn());
                            }}) {
        const double edge = Sonogram().GetTimeAtRightEdge();
        stop(m_view);
        Step(30);
        EXPECT_EQ(Sonogram().GetTimeAtRightEdge(), edge);
        stop(m_view);
        Step(15);
        EXPECT_NEAR(Sonogram().GetTimeAtRightEdge(), edge + 1.5, 1e-3);
        EXPECT_NEAR(Beginning(), -m_half, 0.04);
    }
}

// Catches a file that was cut off and promises more for ever, and one that is lost by a seek behind its end.
TEST_F(PlayedFile, EndsWhereItWasCutOff) {
    const std::string path = Write("cut.flac", SF_FORMAT_FLAC, 4.0);
    fs::resize_file(path, fs::file_size(path) / 2);
    Open(path);
    m_player.Seek(3.5);
    Step(100);
    EXPECT_TRUE(m_player.Get().ended);
    EXPECT_NEAR(m_player.Get().length, 2.0, 0.3);
    EXPECT_EQ(m_player.Get().position, m_player.Get().length);
}

// Catches a silence before the beginning while the output starts, and a place that is lost with the output.
TEST_F(PlayedFile, WaitsForItsOutputAndGoesOnWithoutIt) {
    ASSERT_EQ(SDL_AudioInit("dummy"), 0) << SDL_GetError();
    Open(Write("heard.wav", SF_FORMAT_WAV, 0.6));
    ASSERT_TRUE(m_player.Hear());
    for (int left = 2000; left > 0 && m_player.Get().position < 0.45; --left) {
        Step();
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    ASSERT_GE(m_player.Get().position, 0.45);
    EXPECT_NEAR(Beginning(), -m_half, 0.04);
    m_player.TogglePlaying();
    EXPECT_FALSE(m_player.Get().ended) << "though the output has got the end already";
    m_player.TogglePlaying();
    m_player.Mute();
    Step(30);
    EXPECT_TRUE(m_player.Get().ended);
    EXPECT_NEAR(Beginning(), -m_half, 0.07);
    SDL_AudioQuit();
}

// Catches what cannot be read and ends the program.
TEST(UserFiles, WhatCannotBeReadIsNothing) {
    EXPECT_FALSE(ReadWhole(fs::temp_directory_path()));
    EXPECT_FALSE(ReadWhole("/nowhere/at/all"));
    const fs::path path = fs::temp_directory_path() / "analyser_whole";
    const std::string bytes(10000, 'x');
    EXPECT_TRUE(WriteWhole(path, bytes));
    EXPECT_EQ(ReadWhole(path), bytes);
    fs::remove(path);
}

}  // namespace
