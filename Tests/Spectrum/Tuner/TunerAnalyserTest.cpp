#include <cmath>
#include <thread>
#include <vector>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/MessagePoster.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/Tuner/TunerSounds.h"

namespace {

using TunerSounds::Kind;

constexpr int kRate = 48000;

class TunerAnalyserTest : public AnalyserTest {};

// Answers from another thread with a menu command, which hangs when the message comes with a lock held.
struct Poster : MessagePoster {
    explicit Poster(kivspectrum& analyser) : m_analyser(analyser) {}
    void Post(int message, std::intptr_t, std::intptr_t detail) override {
        if (message != kMessageNoteChanged) return;
        notes.push_back(detail);
        std::thread([this] { m_analyser.popupmenu_process(1306); }).join();
    }
    void Send(int, std::intptr_t, std::intptr_t) override {}
    std::vector<std::intptr_t> notes;

private:
    kivspectrum& m_analyser;
};

TEST_F(TunerAnalyserTest, TunesEveryFrameWhileOn) {
    kivspectrum analyser;
    analyser.ToggleTuner();
    analyser.set_parameters(kRate);
    const Tuner& tuner = *analyser.GetTuner();
    const auto sound = TestSupport::Sine<float>(8192, 329.6276, kRate);
    const std::vector<float>* spectrum = nullptr;
    Poster poster(analyser);
    kivspectrum::GetStaticInfo().SetMessagePoster(&poster);

    Feed(analyser, sound);
    EXPECT_TRUE(analyser.GetFFTFor3DSonogram(kRate, &spectrum, true, true));
    EXPECT_EQ(tuner.GetHeardFrequency(), 0.0);
    EXPECT_TRUE(analyser.GetFFTFor3DSonogram(kRate, &spectrum, true, false));
    Feed(analyser, sound);
    EXPECT_TRUE(analyser.GetFFTFor3DSonogram(kRate, &spectrum, true, false));
    EXPECT_STREQ(tuner.GetTunedNoteName(), "E");
    EXPECT_NEAR(tuner.GetErrorCents(), 0.0, 0.1);
    EXPECT_FALSE(analyser.Refresh());

    // Silence in windows without overlap, six to a second: the note leaves after two seconds of it.
    for (int frame = 1; frame <= 12; ++frame) {
        EXPECT_TRUE(tuner.IsTuned()) << frame;
        Feed(analyser, std::vector<float>(8192));
        EXPECT_TRUE(analyser.GetFFTFor3DSonogram(kRate, &spectrum, true, true));  // asks, and tunes nothing
        EXPECT_TRUE(analyser.Refresh());
    }
    EXPECT_FALSE(tuner.IsTuned());
    analyser.SetTunerOn(false);
    Feed(analyser, sound);
    EXPECT_TRUE(analyser.Refresh());
    EXPECT_FALSE(tuner.IsTuned());
    EXPECT_EQ(poster.notes, (std::vector<std::intptr_t>{1, 0}));
    kivspectrum::GetStaticInfo().SetMessagePoster(nullptr);
}

// Answers a frame by choosing a window twice as long, whose spectrum has each frequency at twice the bin.
struct Resizer : MessagePoster {
    explicit Resizer(kivspectrum& analyser) : m_analyser(analyser) {}
    void Post(int message, std::intptr_t, std::intptr_t) override {
        if (message == kMessageFrameReady) m_analyser.popupmenu_process(1227);
    }
    void Send(int, std::intptr_t, std::intptr_t) override {}

private:
    kivspectrum& m_analyser;
};

TEST_F(TunerAnalyserTest, SkipsAFrameWhoseBuffersWereRebuilt) {
    kivspectrum analyser;
    analyser.ToggleTuner();
    Resizer resizer(analyser);
    kivspectrum::GetStaticInfo().SetMessagePoster(&resizer);
    double heard = 0.0;
    for (const std::size_t length : {8192u, 16384u}) {
        EXPECT_EQ(heard, 0.0);
        Feed(analyser, TestSupport::Sine<float>(length, 440.0, kRate));
        EXPECT_TRUE(analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false));
        heard = analyser.GetTuner()->GetHeardFrequency();
    }
    EXPECT_NEAR(heard, 440.0, 0.01);
    kivspectrum::GetStaticInfo().SetMessagePoster(nullptr);
}

// Windows of 8192 without overlap bring a frame at every sixth refresh. A running tuner keeps its note and
// takes another at its first frame; when the sound stops time goes on: 40 refreshes of tracking, the note for
// 60. Frozen, it stays.
TEST_F(TunerAnalyserTest, LetsTimePassWithoutFrames) {
    kivspectrum analyser;
    analyser.ToggleTuner();
    analyser.set_parameters(kRate);
    const Tuner& tuner = *analyser.GetTuner();
    const auto refresh = [&](int times) {
        for (int i = 0; i < times; ++i) analyser.Refresh();
    };
    const auto play = [&](double hz, int frames) {
        for (int frame = 0; frame < frames; ++frame) {
            Feed(analyser, TestSupport::Sine<float>(8192, hz, kRate));
            refresh(6);
            EXPECT_EQ(tuner.IsTracking(), frame > 0 || tuner.GetNote() >= 0) << frame;
        }
    };
    play(440.0, 10);
    EXPECT_GT(tuner.GetStableFrequency(), 0.0);
    play(494.0, 1);
    EXPECT_EQ(tuner.GetNote(), 2);
    play(494.0, 10);
    // Five of the refreshes without a frame have passed.
    refresh(40 - 5 - 1);
    EXPECT_TRUE(tuner.IsTracking());
    EXPECT_FALSE(TunerCalibrateNow(tuner));
    EXPECT_EQ(tuner.GetHeardFrequency(), 0.0);
    refresh(1);
    EXPECT_FALSE(tuner.IsTracking());
    refresh(60 - 40 - 1);
    EXPECT_TRUE(tuner.IsTuned());
    analyser.SetFrozen(true);
    refresh(100);
    EXPECT_TRUE(tuner.IsTuned());
    analyser.SetFrozen(false);
    EXPECT_TRUE(analyser.Refresh());
    EXPECT_FALSE(tuner.IsTuned());
}

// However it is switched on.
TEST_F(TunerAnalyserTest, ForgetsOldNotesWhenSwitchedOn) {
    kivspectrum analyser;
    analyser.ToggleTuner();
    const Tuner& tuner = *analyser.GetTuner();
    void (*const switches[])(kivspectrum&, bool) = {[](kivspectrum& a, bool on) { a.SetTunerOn(on); },
                                                    [](kivspectrum& a, bool) { a.ToggleTuner(); },
                                                    [](kivspectrum& a, bool) { a.popupmenu_process(1283); }};
    for (const auto& turn : switches) {
        for (int i = 0; i < 2; ++i) {
            Feed(analyser, TestSupport::Sine<float>(8192, 440.0, kRate));
            analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false);
        }
        EXPECT_TRUE(tuner.IsTuned());
        turn(analyser, false);
        turn(analyser, true);
        EXPECT_TRUE(analyser.GetTunerOn());
        EXPECT_FALSE(tuner.IsTuned());
    }
}

// The harmonic product's overtones count half.
TEST_F(TunerAnalyserTest, HalvesOvertones) {
    Tuner::SetDetectionMethod(1);
    kivspectrum analyser;
    analyser.ToggleTuner();
    for (int i = 0; i < 2; ++i) {
        Feed(analyser, TunerSounds::Sound(Kind::Sawtooth, 441.0, kRate, 8192, 0.3));
        analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false);
    }
    Tuner tuner;
    const auto prominence = [&](bool halve) {
        tuner.Forget();
        for (int i = 0; i < 2; ++i) tuner.Tune(analyser.GetPower(), {}, 8192, 1, 8192, kRate, halve, false);
        return tuner.GetProminence();
    };
    EXPECT_EQ(analyser.GetTuner()->GetProminence(), prominence(true));
    EXPECT_NE(prominence(true), prominence(false));
    Tuner::SetDetectionMethod(0);
}

// Every window, whole and padded with zeros: each has lobes of its own, and its own way between the bins.
TEST_F(TunerAnalyserTest, KnowsItsWindow) {
    struct Case {
        int windowType;
        double bins;  // of the window; rectangle and triangle suffer from what leaks far
    };
    for (const Case& c : {Case{0, 0.2}, Case{1, 0.03}, Case{2, 0.02}, Case{3, 0.02}, Case{4, 0.02}})
        for (const int fftLength : {8192, 16384, 32768})
            for (const Kind kind : {Kind::Sine, Kind::Sawtooth, Kind::MissingFundamental})
                for (const double hz : {82.4, 221.3, 997.0, 2093.0}) {
                    Settings().window_type = c.windowType;
                    Settings().window_length = 8192;
                    Settings().fft_length_auto = 0;
                    Settings().fft_length = fftLength;
                    kivspectrum analyser;
                    analyser.ToggleTuner();
                    Feed(analyser, TunerSounds::Sound(kind, hz, kRate, 8192, 0.3));
                    ASSERT_TRUE(analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false));
                    Tuner tuner;
                    tuner.SetWindowType(c.windowType);
                    tuner.Tune(analyser.GetPower(), {}, fftLength, -1, 8192, kRate, true, false);
                    EXPECT_EQ(analyser.GetTuner()->GetHeardFrequency(), tuner.GetHeardFrequency());
                    EXPECT_NEAR(analyser.GetTuner()->GetHeardFrequency() * 8192 / kRate, hz * 8192 / kRate,
                                c.bins)
                        << "window " << c.windowType << " padded to " << fftLength << ", sound "
                        << static_cast<int>(kind) << ", " << hz << " Hz";
                }
}

}  // namespace
