#include <cmath>
#include <thread>
#include <vector>

#include "AnalyserFixture.h"
#include "Spectrum/MessagePoster.h"
#include "Spectrum/Tuner.h"
#include "TunerSounds.h"

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
                    EXPECT_NEAR(analyser.GetTuner()->GetHeardFrequency() * 8192 / kRate, hz * 8192 / kRate,
                                c.bins)
                        << "window " << c.windowType << " padded to " << fftLength << ", sound "
                        << static_cast<int>(kind) << ", " << hz << " Hz";
                }
}

}  // namespace
