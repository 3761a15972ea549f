#include <thread>
#include <vector>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Tuner/TunerSounds.h"

namespace {

using TunerSounds::Kind;

constexpr int kRate = 48000;

// An analyser whose tuner is on.
class TunerAnalyserTest : public AnalyserFixture {
protected:
    TunerAnalyserTest() {
        m_analyser.ToggleTuner();
        m_analyser.set_parameters(kRate);
    }
    bool Tune(const std::vector<float>& samples) {
        Feed(m_analyser, samples);
        return m_analyser.GetFFTFor3DSonogram(kRate, nullptr, true, false);
    }
    void Refresh(int times) {
        for (int i = 0; i < times; ++i) m_analyser.Refresh();
    }
    // The answer comes from another thread, which hangs when the message comes with a lock held.
    void Answer(int message, int command) {
        m_poster.post = [this, message, command](int posted, std::intptr_t detail) {
            if (posted != message) return;
            m_details.push_back(detail);
            std::thread([this, command] { m_analyser.popupmenu_process(command); }).join();
        };
        kivspectrum::GetStaticInfo().SetMessagePoster(&m_poster);
    }

    kivspectrum m_analyser;
    const Tuner& m_tuner = *m_analyser.GetTuner();
    HookedPoster m_poster;
    std::vector<std::intptr_t> m_details;
};

TEST_F(TunerAnalyserTest, TunesEveryFrameWhileOn) {
    const auto sound = TestSupport::Sine<float>(8192, 329.6276, kRate);
    Answer(kMessageNoteChanged, 1306);
    for (int i = 0; i < 2; ++i) EXPECT_TRUE(Tune(sound));
    EXPECT_STREQ(m_tuner.GetTunedNoteName(), "E");
    EXPECT_NEAR(m_tuner.GetErrorCents(), 0.0, 0.1);
    // Silence in windows without overlap, six to a second: the note leaves after two seconds of it.
    for (int frame = 1; frame <= 12; ++frame) {
        EXPECT_TRUE(m_tuner.IsTuned()) << frame;
        Feed(m_analyser, std::vector<float>(8192));
        EXPECT_TRUE(m_analyser.Refresh());
    }
    m_analyser.SetTunerOn(false);
    Feed(m_analyser, sound);
    EXPECT_TRUE(m_analyser.Refresh());
    EXPECT_EQ(m_details, (std::vector<std::intptr_t>{1, 0}));
}

// The answer to a frame is a window twice as long, whose spectrum has each frequency at twice the bin.
TEST_F(TunerAnalyserTest, SkipsAFrameWhoseBuffersWereRebuilt) {
    Answer(kMessageFrameReady, 1227);
    for (const std::size_t length : {8192u, 16384u, 16384u}) {
        EXPECT_EQ(m_tuner.GetHeardFrequency(), 0.0);
        EXPECT_TRUE(Tune(TestSupport::Sine<float>(length, 440.0, kRate)));
    }
    EXPECT_NEAR(m_tuner.GetHeardFrequency(), 440.0, 0.01);
}

// Windows of 8192 without overlap bring a frame at every sixth refresh. When the
// sound stops time goes on: 40 refreshes of tracking, the note for 60. Frozen, it stays.
TEST_F(TunerAnalyserTest, LetsTimePassWithoutFrames) {
    for (int frame = 0; frame < 2; ++frame) {
        Feed(m_analyser, TestSupport::Sine<float>(8192, 440.0, kRate));
        Refresh(6);
    }
    // Five of the refreshes without a frame have passed.
    Refresh(40 - 5 - 1);
    EXPECT_TRUE(m_tuner.IsTracking());
    Refresh(1);
    EXPECT_FALSE(m_tuner.IsTracking());
    Refresh(60 - 40 - 1);
    m_analyser.SetFrozen(true);
    Refresh(100);
    EXPECT_TRUE(m_tuner.IsTuned());
    m_analyser.SetFrozen(false);
    EXPECT_TRUE(m_analyser.Refresh());
    EXPECT_FALSE(m_tuner.IsTuned());
}

// Every window, whole and padded with zeros: each has lobes of its own, and its own way between the bins.
TEST_F(TunerAnalyserTest, KnowsItsWindow) {
    constexpr double kBins[] = {0.2, 0.03, 0.02, 0.02, 0.02};  // the first two suffer from what leaks far
    for (int windowType = 0; windowType < 5; ++windowType)
        for (const int fftLength : {8192, 32768}) {
            Settings().window_type = windowType;
            Settings().fft_length_auto = 0;
            Settings().fft_length = fftLength;
            m_analyser.init();
            for (const Kind kind : {Kind::Sine, Kind::MissingFundamental})
                for (const double hz : {82.4, 221.3, 2093.0}) {
                    m_analyser.SetTunerOn(true);
                    for (int i = 0; i < 2; ++i)
                        ASSERT_TRUE(Tune(TunerSounds::Sound(kind, hz, kRate, 8192, 0.3)));
                    EXPECT_NEAR(m_tuner.GetHeardFrequency() * 8192 / kRate, hz * 8192 / kRate,
                                kBins[windowType])
                        << "window " << windowType << " padded to " << fftLength << ", " << hz << " Hz";
                }
        }
}

}  // namespace
