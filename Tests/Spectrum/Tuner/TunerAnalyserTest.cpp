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

// Answers one message from another thread with a menu command, which hangs when it comes with a lock held.
struct Poster : MessagePoster {
    Poster(kivspectrum& analyser, int asked, int answer)
        : m_analyser(analyser), m_asked(asked), m_answer(answer) {
        kivspectrum::GetStaticInfo().SetMessagePoster(this);
    }
    void Post(int message, std::intptr_t, std::intptr_t detail) override {
        if (message != m_asked) return;
        details.push_back(detail);
        std::thread([this] { m_analyser.popupmenu_process(m_answer); }).join();
    }
    void Send(int, std::intptr_t, std::intptr_t) override {}
    std::vector<std::intptr_t> details;

private:
    kivspectrum& m_analyser;
    int m_asked, m_answer;
};

TEST_F(TunerAnalyserTest, TunesEveryFrameWhileOn) {
    kivspectrum analyser;
    analyser.ToggleTuner();
    analyser.set_parameters(kRate);
    const Tuner& tuner = *analyser.GetTuner();
    const auto sound = TestSupport::Sine<float>(8192, 329.6276, kRate);
    const std::vector<float>* spectrum = nullptr;
    Poster poster(analyser, kMessageNoteChanged, 1306);

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
    EXPECT_EQ(poster.details, (std::vector<std::intptr_t>{1, 0}));
}

// The answer to a frame is a window twice as long, whose spectrum has each frequency at twice the bin.
TEST_F(TunerAnalyserTest, SkipsAFrameWhoseBuffersWereRebuilt) {
    kivspectrum analyser;
    analyser.ToggleTuner();
    Poster poster(analyser, kMessageFrameReady, 1227);
    double heard = 0.0;
    for (const std::size_t length : {8192u, 16384u}) {
        EXPECT_EQ(heard, 0.0);
        Feed(analyser, TestSupport::Sine<float>(length, 440.0, kRate));
        EXPECT_TRUE(analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false));
        heard = analyser.GetTuner()->GetHeardFrequency();
    }
    EXPECT_NEAR(heard, 440.0, 0.01);
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

// However it is switched on, the tuner has forgotten old notes. The harmonic product's overtones count half.
TEST_F(TunerAnalyserTest, ForgetsOldNotesWhenSwitchedOn) {
    Tuner::SetDetectionMethod(1);
    kivspectrum analyser;
    analyser.ToggleTuner();
    const Tuner& tuner = *analyser.GetTuner();
    void (*const switches[])(kivspectrum&, bool) = {[](kivspectrum& a, bool on) { a.SetTunerOn(on); },
                                                    [](kivspectrum& a, bool) { a.ToggleTuner(); },
                                                    [](kivspectrum& a, bool) { a.popupmenu_process(1283); }};
    for (const auto& turn : switches) {
        for (int i = 0; i < 2; ++i) {
            Feed(analyser, TunerSounds::Sound(Kind::Sawtooth, 441.0, kRate, 8192, 0.3));
            analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false);
        }
        EXPECT_TRUE(tuner.IsTuned());
        for (const bool halve : {true, false}) {
            Tuner other;
            for (int i = 0; i < 2; ++i)
                other.Tune(analyser.GetPower(), {}, 8192, 1, 8192, kRate, halve, false);
            EXPECT_EQ(tuner.GetProminence() == other.GetProminence(), halve);
        }
        turn(analyser, false);
        turn(analyser, true);
        EXPECT_TRUE(analyser.GetTunerOn());
        EXPECT_FALSE(tuner.IsTuned());
    }
}

// Every window, whole and padded with zeros: each has lobes of its own, and its own way between the bins.
TEST_F(TunerAnalyserTest, KnowsItsWindow) {
    constexpr double kBins[] = {0.2, 0.03, 0.02, 0.02, 0.02};  // the first two suffer from what leaks far
    for (int windowType = 0; windowType < 5; ++windowType)
        for (const int fftLength : {8192, 32768})
            for (const Kind kind : {Kind::Sine, Kind::Sawtooth, Kind::MissingFundamental})
                for (const double hz : {82.4, 221.3, 2093.0}) {
                    Settings().window_type = windowType;
                    Settings().window_length = 8192;
                    Settings().fft_length_auto = 0;
                    Settings().fft_length = fftLength;
                    kivspectrum analyser;
                    analyser.ToggleTuner();
                    Feed(analyser, TunerSounds::Sound(kind, hz, kRate, 8192, 0.3));
                    ASSERT_TRUE(analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false));
                    EXPECT_NEAR(analyser.GetTuner()->GetHeardFrequency() * 8192 / kRate, hz * 8192 / kRate,
                                kBins[windowType])
                        << "window " << windowType << " padded to " << fftLength << ", sound "
                        << static_cast<int>(kind) << ", " << hz << " Hz";
                }
}

}  // namespace
