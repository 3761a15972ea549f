#pragma once

#include <array>
#include <atomic>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Drawing/Backends/DrawingCairo.h"
#include "Events.h"
#include "Menu.h"
#include "Shell.h"
#include "Spectrum/kivspectrum.h"

namespace analyser {

// The live analyser in a window of any kind: events go in, a picture on a Cairo context comes out.
//
// Threads: the audio thread feeds. One display thread does everything else; it refreshes 30 times a second
// and draws when there is something new. What is chosen is shared by all analysers of the process, as the
// library has it, except for the views, the zoom and the marker.
class View {
public:
    // Shows spectrum and sonogram with the tuner above. The shell outlives it.
    explicit View(Shell& shell);
    ~View();
    View(const View&) = delete;
    View& operator=(const View&) = delete;

    // Audio thread; never waits. Interleaved frames, of which the highest sample's magnitude is returned.
    float Feed(const float* samples, int frames, int channels);

    // Display thread from here on.
    void SetSamplingRate(int rate);
    // A thirtieth of a second has passed. True when the picture has changed.
    bool Refresh();
    // The whole picture. `dpi` is what it is to be looked at with: 96 on a plain screen.
    void Draw(cairo_t* context, int width, int height, float dpi);
    // Nothing of what was heard is shown any more: another input or place in a file. Nothing feeds meanwhile.
    void StartOver();
    // What the sonogram's next column is called, seconds; 0 for what is live, and after StartOver.
    void SetTime(double seconds);

    void PointTo(float x, float y);
    void PointerLeft();
    void Press(const PointerPress& press);
    void Release(float x, float y);
    // Positive steps zoom in: the frequencies or, with control, the sonogram's time.
    void Wheel(float x, float y, float steps, bool control);
    // Positive steps lead the sonogram to what is older.
    void ScrollBack(float steps);
    // False when the key means nothing here.
    bool KeyDown(const KeyPress& press);
    // A command of the menu; false for one that there is not.
    bool Do(int command);
    bool IsChosen(int command) const;
    bool IsMenuOpen() const { return m_menu.IsOpen(); }

    // All that is chosen, as lines of text; false, with nothing changed, for a text that is no settings.
    std::string GetSettings() const;
    bool SetSettings(const std::string& text);
    // Counts up with every choice that is kept.
    unsigned GetChoices() const { return m_choices; }

    // One sentence that stays until it is taken back with an empty one: why nothing is heard.
    void SetTrouble(std::string sentence);
    // One sentence that goes after a few seconds.
    void Say(std::string sentence);
    // Where pictures and numbers are written; the user's folder for pictures unless it is set.
    void SetFolder(std::string folder) { m_folder = std::move(folder); }

    kivspectrum& GetAnalyser() { return m_analysers[0]; }
    const kivspectrum& GetAnalyser() const { return m_analysers[0]; }

private:
    enum class Kind { Png, Svg, Pdf };
    struct Bar {
        Corvo::RectF whole{}, timeline{};
    };
    struct KeyRow {
        std::string_view key, text;
    };
    struct Action;
    static const Action kActions[];

    static const Action* FindAction(int command);
    bool Act(int command);
    bool IsOffered(int command) const;
    std::vector<MenuGroup> MakeMenu() const;
    void OpenMenu();  // at the pointer
    bool TogglePlaying();
    void ToggleStrip();
    void ToggleFrozen();
    void TurnKeys();
    void CopyReading();
    void Calibrate();
    bool Skip(double seconds);
    void ShowMode(kivspectrum::_display_mode mode);
    void FollowFirst();
    void Zoom(double aroundHz, double factor);
    void Pan(double fromHz, double toHz);
    void DragTime(float x);
    bool LookBack(double seconds);
    bool Scroll(double seconds);
    int UnheardColumns() const;
    double SecondsBack() const;
    void SetSpan(double low, double high);
    int Rate() const;
    Corvo::AnalyserReading ReadingAt(float x, float y) const;
    void Pin(const Corvo::AnalyserReading& reading);
    void SetReference(double hz);
    void Save(Kind kind);
    std::string Numbers() const;
    std::string TunerNumbers() const;
    std::string DescribeHeard() const;
    const char* ChannelAt(float x, float y) const;
    void SeekTo(float x);
    void FollowLevel();

    std::string Trouble() const;
    // For a file there is nothing but what is measured.
    enum class For { Window, File };
    void DrawFor(For what, cairo_t* context, int width, int height, float dpi);
    void DrawAnalysers(Corvo::DrawingCairo::DrawTarget& target, const Corvo::RectF& rectangle);
    void DrawChannelNames(Corvo::DrawTarget& target, const Corvo::RectF& rectangle, float half) const;
    void DrawBar(Corvo::DrawTarget& target, const Corvo::RectF& bar, For what);
    float DrawLevel(Corvo::DrawTarget& target, const Corvo::RectF& bar, float x) const;
    float DrawStatus(Corvo::DrawTarget& target, const Corvo::RectF& bar, float x, float room);
    void DrawTimeline(Corvo::DrawTarget& target, const Corvo::RectF& bar, float x, float end,
                      const Playback& playback);
    void SizeSonograms(const Corvo::RectF& picture);
    void DrawHints(Corvo::DrawTarget& target, const Corvo::RectF& rectangle);
    void DrawSentences(Corvo::DrawTarget& target, const Corvo::RectF& rectangle) const;
    std::vector<KeyRow> KeyRows() const;
    void DrawKeys(Corvo::DrawTarget& target, const Corvo::RectF& rectangle);

    Shell& m_shell;
    std::unique_ptr<Corvo::DrawingCairo> m_drawing;  // made with the first picture
    std::array<kivspectrum, 2> m_analysers;  // the second is the right channel's, where they are apart
    std::atomic<bool> m_apart{false}, m_heard{false};
    std::atomic<float> m_peak{0.0f};  // since the last refresh
    float m_level = -120.0f;          // dB, falling
    int m_tooLoudFor = 0;             // refreshes that it is still said
    int m_rate = 48000;

    Menu m_menu;
    Bar m_bar;
    int m_width = 0, m_height = 0;
    float m_dpi = 96.0f;
    bool m_dirty = true, m_keysShown = false, m_troubleSaid = false;
    int m_keysPage = 0, m_keyPages = 1;
    static std::atomic<int> s_views, s_sensitivity;  // the analyser cannot tell all of those apart
    unsigned m_choices = 0;
    std::string m_trouble, m_said, m_folder;
    int m_saidFor = 0;  // refreshes that it stays

    struct Drag {
        Corvo::AnalyserReading start;
        float x, y;
        bool moved = false, seeks = false, inFrequency = false, inTime = false;
    };
    std::optional<Drag> m_drag;
    Corvo::PointF m_pointer{-1.0f, -1.0f};
};

}  // namespace analyser
