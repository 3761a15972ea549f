#include "View.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <map>
#include <set>
#include <string>

#include "Analyser/ViewFixture.h"
#include "Spectrum/AnalyserMenu.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Support/Signals.h"

namespace {

using namespace analyser;
using Plot = Corvo::AnalyserReading::Plot;

class LiveView : public ViewTest {
protected:
    static constexpr int kRate = 48000, kRefresh = kRate / 30;

    void SetUp() override { Draw(); }
    void Draw() { m_canvas.Draw(m_view); }
    void Hear(double hz, double amplitude, double seconds = 0.5) {
        const auto sine =
            TestSupport::Sine<float>(static_cast<std::size_t>(seconds * kRate), hz, kRate, amplitude);
        Hear(sine, 1);
    }
    void Hear(const std::vector<float>& sound, int channels) {
        m_view.SetSamplingRate(kRate);
        const auto step = static_cast<std::size_t>(kRefresh * channels);
        for (std::size_t i = 0; i + step <= sound.size(); i += step) {
            m_view.Feed(sound.data() + i, kRefresh, channels);
            m_view.Refresh();
        }
        Draw();
    }
    void Click(float x, float y, int times = 1) {
        m_view.Press({Button::Left, x, y, times});
        m_view.Release(x, y);
    }
    void Press(char32_t key, bool control = false) {
        m_view.KeyDown({key, control});
        Draw();
    }
    // The first place from the left or, upright, from above that shows a frequency from `hz` on.
    Corvo::PointF PlaceOf(Plot plot, double hz) {
        for (float y = 595.0f; y > 0.0f; y -= 1.0f)
            for (float x = 60.0f; x < 900.0f; x += 1.0f) {
                const auto reading = m_view.GetAnalyser().GetReading(x, y);
                if (reading.plot != plot) continue;
                if (reading.frequency >= hz) return {x, y};
                if (plot == Plot::Sonogram) break;
            }
        return {-1.0f, -1.0f};
    }
    double FrequencyAt(Corvo::PointF place) {
        return m_view.GetAnalyser().GetReading(place.x, place.y).frequency;
    }

    AnalyserTest::TestShell m_shell;
    View m_view{m_shell};
    AnalyserTest::Canvas m_canvas;
};

// Catches a key that does nothing or something else than its line says.
TEST_F(LiveView, KeysDoWhatTheirLinesSay) {
    kivspectrum& first = m_view.GetAnalyser();
    EXPECT_EQ(first.GetDisplayMode(), kivspectrum::display_both);
    EXPECT_TRUE(first.IsShowTuner());
    for (const auto& [key, mode] : {std::pair{U'1', kivspectrum::display_spectrum},
                                    {U'2', kivspectrum::display_sonogram},
                                    {U'4', kivspectrum::display_tuner},
                                    {U'3', kivspectrum::display_both}}) {
        Press(key);
        EXPECT_EQ(first.GetDisplayMode(), mode);
    }
    Press(U't');
    EXPECT_FALSE(first.IsShowTuner());
    EXPECT_TRUE(first.GetTunerOn()) << "the trace and the plug-in's outputs go on";
    Press(U' ');
    EXPECT_TRUE(first.GetFrozen());
    Press(U' ');
    EXPECT_FALSE(first.GetFrozen());
    Press(U'f');
    EXPECT_TRUE(m_shell.full);
    Press(U'a');
    EXPECT_TRUE(m_shell.tone);
    for (int i = 0; i < 200; ++i) Press(U',');
    EXPECT_DOUBLE_EQ(Tuner::GetCalibrationBase(), 380.0 / 4.0);
    for (int i = 0; i < 200; ++i) Press(U'.');
    EXPECT_DOUBLE_EQ(Tuner::GetCalibrationBase(), 480.0 / 4.0);
    m_view.Do(kFirstReference + 5);
    Hear(445.0, 0.5, 1.5);
    Press(U'c');
    EXPECT_NEAR(4.0 * Tuner::GetCalibrationBase(), 445.0, 0.2);
    Press(U'c', true);
    EXPECT_NE(m_shell.copied.find("A4"), std::string::npos) << m_shell.copied;
    EXPECT_FALSE(m_view.KeyDown({U'y'}));
}

// Catches an entry of the library's or our own that takes more than two keys, or is missing.
TEST_F(LiveView, EveryEntryOfTheMenuIsTwoKeysAway) {
    const std::string keys = "123456789abcdefghijklmnopqrstuvwxyz";
    Press(U'm');
    ASSERT_TRUE(m_view.IsMenuOpen());
    Press(kKeyEscape);
    EXPECT_FALSE(m_view.IsMenuOpen());
    int found = 0;
    for (const char group : keys)
        for (const char entry : keys) {
            for (const char key : {'m', group, entry}) m_view.KeyDown({static_cast<char32_t>(key)});
            if (m_view.IsMenuOpen())
                while (m_view.IsMenuOpen()) m_view.KeyDown({kKeyEscape});
            else
                ++found;
        }
    const auto own = std::ranges::count_if(
        Commands(), [](const CommandRow& row) { return *row.group != '\0' && row.command != kPlay; });
    // Beside these: speeds, colours, references, inputs.
    EXPECT_EQ(found,
              static_cast<int>(own + 9 + 7 + 13 + 2 + static_cast<long>(Corvo::AnalyserMenu().size())));
}

// Catches settings that are written again although nothing of them was chosen.
TEST_F(LiveView, CountsWhatIsKept) {
    const unsigned before = m_view.GetChoices();
    for (const char32_t key : {U' ', U'+', U'0', U'h', U'h', U'k', U'r', U'm', U'm'}) Press(key);
    EXPECT_EQ(m_view.GetChoices(), before);
    for (const char32_t key : {U'2', U']', U'.'}) m_view.Do(FindCommand({key})->command);
    m_view.Do(kFirstInput + 1);
    EXPECT_EQ(m_view.GetChoices(), before + 4);
}

// Catches a list of keys that ends where a small window does.
TEST_F(LiveView, KeysTurnTheirPages) {
    const auto presses = [&](int width, int height) {
        TestSupport::DrawingSurface<Corvo::DrawingCairo> small{width, height};
        int count = 0;
        do {
            m_view.Do(kShowKeys);
            small.PaintPlainly([&](cairo_t* context) { m_view.Draw(context, width, height, 96.0f); });
            ++count;
        } while (m_view.IsChosen(kShowKeys));
        return count;
    };
    EXPECT_EQ(presses(960, 600), 2);
    EXPECT_EQ(presses(240, 184), 6);
}

// Catches a choice that is not kept, a switch that comes back on, and a broken file that changes something.
TEST_F(LiveView, SettingsComeBackAsTheyWere) {
    const std::string fresh = m_view.GetSettings();
    for (const int command : {kShowSonogram + 0, kTunerStrip + 0, kFirstSpeed + 7, kFirstColours + 3, 1283,
                              1223, 1242, 1306, 1314, 1345, 1326, 1343, 1289, 1309})
        m_view.Do(command);
    TunerCalibrateTo(442.5);
    const std::string chosen = m_view.GetSettings();
    ASSERT_TRUE(m_view.SetSettings(fresh));
    EXPECT_EQ(m_view.GetSettings(), fresh);
    for (std::size_t length = 0; length < chosen.size(); length += 7)
        if (!m_view.SetSettings(chosen.substr(0, length))) {
            EXPECT_EQ(m_view.GetSettings(), fresh) << length;
        } else {
            m_view.SetSettings(fresh);
        }
    for (const char* broken :
         {"", "other\n", "analyser settings 1\nView = 9\n", "analyser settings 1\nnonsense\n",
          "analyser settings 1\nTuner reference = nan\n"}) {
        EXPECT_FALSE(m_view.SetSettings(broken)) << broken;
        EXPECT_EQ(m_view.GetSettings(), fresh) << broken;
    }
    ASSERT_TRUE(m_view.SetSettings(chosen));
    EXPECT_EQ(m_view.GetSettings(), chosen);
}

// Catches a zoom that loses what is pointed at, a drag that goes the other way, and a reset that is none.
TEST_F(LiveView, WheelAndDragMoveTheFrequencies) {
    Hear(1000.0, 0.5);
    for (const Plot plot : {Plot::Spectrum, Plot::Sonogram}) {
        const Corvo::PointF place = PlaceOf(plot, 1000.0);
        m_view.Wheel(place.x, place.y, 5.0f, false);
        Draw();
        EXPECT_NEAR(FrequencyAt(place), 1000.0, 25.0);
        const auto span = m_view.GetAnalyser().GetFrequencySpan();
        EXPECT_GT(span.lowest, 100.0);
        EXPECT_LT(span.highest, 10000.0);
        const Corvo::PointF to = plot == Plot::Spectrum ? Corvo::PointF{place.x + 40, place.y}
                                                        : Corvo::PointF{place.x, place.y - 20};
        m_view.Press({Button::Left, place.x, place.y});
        m_view.PointTo(to.x, to.y);
        m_view.Release(to.x, to.y);
        Draw();
        EXPECT_NEAR(FrequencyAt(to), 1000.0, 25.0);
        EXPECT_EQ(m_view.GetAnalyser().GetMarker().plot, Plot::None) << "a drag is no click";
        Click(to.x, to.y);
        EXPECT_NEAR(m_view.GetAnalyser().GetMarker().frequency, 1000.0, 25.0);
        Click(to.x, to.y, 2);
        Draw();
        EXPECT_EQ(m_view.GetAnalyser().GetFrequencySpan(), Corvo::FrequencySpan{});
        EXPECT_EQ(m_view.GetAnalyser().GetMarker().plot, Plot::None);
    }
}

// Catches a drag that loses the moment it took hold of, and a sonogram that does not hold it, or not until it
// is let go; and a speed that does not zoom around the pointer.
TEST_F(LiveView, SonogramIsDraggedThroughTime) {
    const auto& sonogram = *m_view.GetAnalyser().GetSonogram();
    const auto since = [&](Corvo::PointF place) {
        return m_view.GetAnalyser().GetReading(place.x, place.y).since;
    };
    Press(U'1');
    Hear(1000.0, 0.5, 25.0);
    Press(U'2');
    EXPECT_EQ(sonogram.GetHeardColumns(), sonogram.GetBitmap().width) << "it heard while it was hidden";
    const Corvo::PointF from = PlaceOf(Plot::Sonogram, 1000.0), to{from.x + 300.0f, from.y};
    const double moment = since(from);
    m_view.Press({Button::Left, from.x, from.y});
    m_view.PointTo(from.x, from.y + 30.0f);
    EXPECT_EQ(sonogram.GetSecondsBack(), 0.0) << "upright";
    m_view.PointTo(to.x, to.y);
    m_view.Release(to.x, to.y);
    EXPECT_NEAR(sonogram.GetSecondsBack(), 5.0, 1e-6);
    Hear(1000.0, 0.5, 1.0);
    EXPECT_NEAR(since(to), moment, 1e-6);
    EXPECT_NEAR(sonogram.GetSecondsBack(), 6.0, 1e-6);
    m_view.Wheel(to.x, to.y, 1.0f, true);
    Draw();
    EXPECT_NEAR(since(to), moment, 0.02);
    m_view.ScrollBack(1e6f);
    EXPECT_GT(sonogram.GetSecondsBack(), 10.0);
    EXPECT_EQ(sonogram.GetHeardColumns(), sonogram.GetBitmap().width);
    m_view.ScrollBack(-1e6f);
    EXPECT_EQ(sonogram.GetSecondsBack(), 0.0);
    for (const auto leave : {+[](View& view) { view.KeyDown({kKeyEnd}); },
                             +[](View& view) {
                                 view.Press({Button::Left, 300.0f, 300.0f, 2});
                             },
                             +[](View& view) { view.Do(kFreeze), view.Do(kFreeze); }}) {
        Press(kKeyLeft);
        EXPECT_NEAR(sonogram.GetSecondsBack(), 5.0, 1e-6);
        leave(m_view);
        EXPECT_EQ(sonogram.GetSecondsBack(), 0.0);
    }
}

// Catches a zoom in time that loses the moment because there is too little before it.
TEST_F(LiveView, TimeZoomsAroundTheBeginning) {
    Press(U'2');
    Hear(1000.0, 0.5, 2.0);
    Press(U' ');
    const auto reading = [&] { return m_view.GetAnalyser().GetReading(820.0f, 300.0f); };
    const double moment = reading().since;
    ASSERT_GT(moment, 0.5);
    for (const float steps : {1.0f, 1.0f, 1.0f, -1.0f}) {
        m_view.Wheel(820.0f, 300.0f, steps, true);
        Draw();
        EXPECT_NEAR(reading().since, moment, 0.02);
    }
}

// Catches files that are cut off, levels that are not those of the picture, one file that takes another's
// place, and a picture with the list of keys.
TEST_F(LiveView, WritesThePictureAndItsNumbers) {
    namespace fs = std::filesystem;
    const fs::path folder = fs::temp_directory_path() / "analyser_view_test";
    fs::remove_all(folder);
    m_view.SetFolder(folder.string());
    Hear(1500.0, 0.1, 2.0);
    for (const char32_t key : {U'p', U'h', U'p', U's', U'd'}) Press(key);
    std::set<std::string> pictures;
    std::map<std::string, int> endings;
    for (const auto& entry : fs::directory_iterator(folder)) ++endings[entry.path().extension().string()];
    EXPECT_EQ(endings, (std::map<std::string, int>{{".csv", 2}, {".pdf", 1}, {".png", 2}, {".svg", 1}}));
    double loudest = 0.0, level = -1000.0;
    for (const auto& entry : fs::directory_iterator(folder)) {
        std::ifstream file(entry.path());
        std::string text((std::istreambuf_iterator<char>(file)), {});
        const std::string ending = entry.path().extension().string();
        const std::map<std::string, std::string> ends{
            {".png", "IEND"}, {".pdf", "%%EOF"}, {".svg", "</svg>"}, {".csv", "\n"}};
        EXPECT_NE(text.rfind(ends.at(ending)), std::string::npos) << ending;
        if (ending == ".png") pictures.insert(text);
        if (ending != ".csv") continue;
        double hz = 0.0, decibels = 0.0;
        for (std::size_t at = text.find('\n') + 1; at < text.size(); at = text.find('\n', at) + 1)
            if (std::sscanf(text.c_str() + at, "%lf,%lf", &hz, &decibels) == 2 && decibels > level) {
                level = decibels;
                loudest = hz;
            }
    }
    EXPECT_EQ(pictures.size(), 1u);
    EXPECT_NEAR(loudest, 1500.0, 6.0);
    EXPECT_NEAR(level, -20.0, 1.5);
    fs::remove_all(folder);
    m_view.SetFolder("/proc/nowhere");
    Press(U'p');  // says so, and nothing else happens
}

// Catches a click beside its place in the file, and a picture that goes on while the file rests.
TEST_F(LiveView, TheTimelineSeeks) {
    m_shell.playback = Playback{0.0, 100.0, true};
    Draw();
    double before = -1.0;
    for (float x = 200.0f; x <= 700.0f; x += 100.0f) {
        Click(x, 590.0f);
        EXPECT_GT(m_shell.playback->position, before);
        before = m_shell.playback->position;
    }
    Press(kKeyLeft);
    EXPECT_NEAR(m_shell.playback->position, before - 5.0, 1e-9);
    Press(U'k');
    EXPECT_FALSE(m_shell.playback->playing);
}

// Catches channels that are mixed although they are to be shown apart, choices that do not reach another
// view, and one that resets them when it comes.
TEST_F(LiveView, ShowsTheChannelsApart) {
    for (const int command : {kFirstSpeed + 1, 1266, 1348}) m_view.Do(command);
    View other(m_shell);
    for (const int command : {kFirstSpeed + 1, 1266, 1348}) EXPECT_TRUE(other.IsChosen(command)) << command;
    other.Do(1282);
    m_view.Refresh();
    const auto left = TestSupport::Sine<float>(kRate, 1000.0, kRate, 0.5);
    std::vector<float> stereo(2 * left.size());
    for (std::size_t i = 0; i < left.size(); ++i) stereo[2 * i] = left[i];
    Hear(stereo, 2);
    const auto peak = m_view.GetAnalyser().GetSpectrumDrawer()->HighestPeak(20.0);
    EXPECT_NEAR(peak.level, -6.0, 0.5) << "the mean of both would have -12 dB";
    for (const auto& [y, name] : {std::pair{100.0f, "left"}, {350.0f, "right"}}) {
        m_view.PointTo(400.0f, y);
        m_view.Do(kCopyReading);
        EXPECT_TRUE(m_shell.copied.ends_with(name)) << m_shell.copied;
    }
}

}  // namespace
