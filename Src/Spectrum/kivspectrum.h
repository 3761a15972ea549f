#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

#include "Picture/DrawingBitmap.h"
#include "Platform/Export.h"
#include "Spectrum/AnalyserReading.h"
#include "Spectrum/Scales/SpectrumSettings.h"

class SpectrumDrawer;
class SpectrumStaticInfo;
class Tuner;
namespace Corvo {
class Analyser;
class Sonogram;
struct ViewAccess;
struct PointF;
struct RectF;
}  // namespace Corvo

// A real-time spectrum analyser: captures the newest samples of a signal, windows and transforms them, and
// hands the power spectrum to its drawer for smoothing and drawing.
//
// All analysis settings are class-wide: a change made through any analyser's menu reaches every live one.
//
// Threads: one audio thread calls Feed. One display thread prepares frames and reads what the drawer and the
// buffers hold. Menu commands and switches may come from any thread; a class-wide lock in front of the
// analysers' own keeps them apart, and nobody holds up the audio thread. Drawing on another thread than the
// menu's: do not read the buffers while a command runs.
//
// Cost: Feed copies one value per frame. A refresh transforms and smooths when new samples came, in time
// proportional to n log n of the transform's length n; now and then it allocates.
class DSP_API kivspectrum : public Corvo::SpectrumDisplay {
public:
    using spectrum_settings = Corvo::SpectrumSettings;            // what a host stores
    static constexpr int window_types_num = Corvo::kWindowTypes;  // shapes of windows to choose from

    // Four of the tuner panel's images, nearest the centre first.
    using BarItems = std::array<Corvo::DrawingBitmap*, 4>;

    // Class-wide. Written by menu commands and init; a host that stores or restores it does so while no
    // command runs and calls ObserverUpdate afterwards.
    static spectrum_settings settings;
    // While set, init does nothing; of the menu's choices, only the length of the moving average reaches the
    // buffers.
    static std::atomic<bool> lock_init;
    // The tuner panel's bitmaps must be made again: command 1350 was chosen or the resolution changed.
    static std::atomic<bool> needPrepareBitmap;

    // The tuner panel's images, drawn at the size needed when they are first drawn: the circle behind the
    // note, lit and unlit (Base); ripples beside it for notes too low (L) and too high (R), lit and unlit;
    // and upright bars in the place of ripples for small panels. They belong to the thread that draws.
    static Corvo::DrawingBitmap &mainWitheCirleBitmap, &mainWitheCirleBitmapBase;
    // clang-format off
    static Corvo::DrawingBitmap &tunerBarItem_00_L, &tunerBarItem_01_L, &tunerBarItem_02_L, &tunerBarItem_03_L;
    static Corvo::DrawingBitmap &tunerBarItem_00_R, &tunerBarItem_01_R, &tunerBarItem_02_R, &tunerBarItem_03_R;
    static Corvo::DrawingBitmap &tunerBarItem_Base_00_L, &tunerBarItem_Base_01_L,
                                &tunerBarItem_Base_02_L, &tunerBarItem_Base_03_L;
    static Corvo::DrawingBitmap &tunerBarItem_Base_00_R, &tunerBarItem_Base_01_R,
                                &tunerBarItem_Base_02_R, &tunerBarItem_Base_03_R;
    static Corvo::DrawingBitmap &tunerBarItem_Minimized_00_L, &tunerBarItem_Minimized_01_L,
                                &tunerBarItem_Minimized_02_L, &tunerBarItem_Minimized_03_L;
    static Corvo::DrawingBitmap &tunerBarItem_Minimized_00_R, &tunerBarItem_Minimized_01_R,
                                &tunerBarItem_Minimized_02_R, &tunerBarItem_Minimized_03_R;
    static Corvo::DrawingBitmap &tunerBarItem_Minimized_Base_00_L, &tunerBarItem_Minimized_Base_01_L,
                                &tunerBarItem_Minimized_Base_02_L, &tunerBarItem_Minimized_Base_03_L;
    static Corvo::DrawingBitmap &tunerBarItem_Minimized_Base_00_R, &tunerBarItem_Minimized_Base_01_R,
                                &tunerBarItem_Minimized_Base_02_R, &tunerBarItem_Minimized_Base_03_R;
    // clang-format on
    // The images above, four and four.
    static const BarItems leftItems, rightItems, baseItems_L, baseItems_R;
    static const BarItems leftItemsMinimized, rightItemsMinimized, baseItemsMinimized_L, baseItemsMinimized_R;
    // Arrows that point to where the note has to go.
    static Corvo::DrawingBitmap &tunerErrorFlatBitmap, &tunerErrorSharpBitmap;
    // Draw the images anew when larger ones are needed, when they have been more than twice too large for a
    // while, or when needPrepareBitmap asks for it, then all kinds. Sizes in pixels, limited to 1..1024.
    // Without memory they throw std::bad_alloc, and the next call tries again.
    static void SetupTunerBitmaps(int circleRadius);
    static void SetupMinimizedTunerBitmaps(int height);
    static void SetupErrorBitmaps(int side);

    // What all analysers share; the library's.
    static SpectrumStaticInfo& GetStaticInfo();
    // A copy that no menu command changes half way. Any thread.
    static spectrum_settings GetSettings();
    // Milliseconds between display refreshes: 30, while everything that is counted in refreshes counts 30 of
    // them to a second. A host that takes the period for its timer makes 33.3 a second: peaks are held 10 %
    // shorter and then sink by 33.3 dB a second, the sonogram moves 11 % faster than its scale says,
    // and a note that has ended goes 10 % sooner. One that refreshes every 33.3 ms gets all times as stated.
    static int GetRefreshRatePeriod();
    // Stores the overlap, 1 and more as 0.99, and the hop length that follows from it. Values below 0 leave
    // gaps between the windows.
    static void SetAnalysisWindowsOverlap(float overlap);
    // The display's dots per inch; a change asks for new bitmaps.
    static void SetDpi(int dpi);
    // Every live analyser is registered by its constructor and leaves with its destructor.
    static void ObserverAdd(kivspectrum* instance, bool add);

    // Memory: what prepares, refreshes or changes settings throws std::bad_alloc where there is none, and the
    // next call tries again. Feed never does.

    // Off, its tuner too, with buffers for the current settings.
    kivspectrum();
    ~kivspectrum();
    kivspectrum(const kivspectrum&) = delete;
    kivspectrum& operator=(const kivspectrum&) = delete;

    // Audio thread; never allocates and never waits. Frame i has its channels at samples[i * stride] and
    // following; their mean is captured. Ignored without samples, frames or channels.
    void Feed(const float* samples, int frames, int stride, int channels);
    void Feed(const double* samples, int frames, int stride, int channels);

    // The rate for PrepareFFTForDrawingHelper; below 1 is ignored.
    void set_parameters(int samplingRate);
    // Brings buffers and window in line with the settings. Where they are already, the frames go on as
    // before.
    void init();
    // Sizes the buffers for what init found, or empties them when `reset` is 0 or the analyser is frozen.
    void allocate(int reset);
    // Re-initialises every live analyser after a change of the settings. Tuners go off with this one's.
    void ObserverUpdate();
    // Carries out a menu command, 1200..1402 (AnalyserMenu.h has the table). False, with nothing changed,
    // when it is none of these.
    bool popupmenu_process(int command);
    // Whether a command's entry has a tick: a choice that is the current one, or a switch that is on.
    bool popupmenu_checked(int command) const;

    // Prepares a frame when new samples came; false when there is nothing to do. With probeOnly it only says
    // whether there would be a frame. sonogramMode smooths at the sonogram's speed unless overridden,
    // fastSmoothing is for everything else.
    bool PrepareFFTForDrawing(int samplingRate, bool fastSmoothing, bool sonogramMode, bool sonogramOverride,
                              bool probeOnly);
    bool PrepareFFTForDrawingHelper(bool sonogramMode, bool sonogramOverride);
    // The display's entry per frame: prepares one, tunes when the tuner is on, and returns the smoothed power
    // spectrum, which stays the drawer's. False, with `spectrum` untouched, when there was no new frame.
    bool GetFFTFor3DSonogram(int samplingRate, const std::vector<float>** spectrum, bool fastSmoothing,
                             bool probeOnly);
    // One display refresh, 30 times a second: prepares a frame when new samples came, smoothed at the
    // sonogram's speed while that is shown, tunes when the tuner is on, and advances the sonogram; at the
    // stored rate. Without new samples time passes for the tuner, whose note goes after a while, unless the
    // analyser is frozen. True when there is something new to draw.
    bool Refresh();
    // The sonogram's part of a refresh: its step, with the pitch that the tuner hears, while it is shown and
    // the analyser runs. True when the picture has new columns, which it has without a new frame, too.
    bool AdvanceSonogram();
    // Windows and transforms the newest samples.
    void PerformFFT();

    // The captured samples: the newest min(window length, transform length), oldest first, then zeros. The
    // audio thread goes on writing them.
    std::vector<float>& GetBufferInputPoints();
    // Their channels: always 1.
    int GetBufferInputChannels() const;
    // The spectrum of the last frame, |bin|^2 unscaled; entry 0 holds DC^2 + Nyquist^2.
    const std::vector<float>& GetPower() const;
    // The window that the newest samples are multiplied by.
    const std::vector<float>& GetWindow() const;
    // Its parts, which live as long as it does. Never null.
    SpectrumDrawer* GetSpectrumDrawer() const;
    Tuner* GetTuner() const;
    Corvo::Sonogram* GetSonogram() const;
    // Forgets the peaks of its curve.
    void peak_reset();

    // Switched off, it analyses nothing and prepares no frames. Any thread.
    void SetOn(bool on);
    bool GetOn() const;
    // Switched on, the tuner has forgotten what it heard.
    void SetTunerOn(bool on);
    bool GetTunerOn() const;
    // Switches the tuner off when it runs, else tuner and analyser on, with fresh buffers.
    void ToggleTuner();
    // Whether a tuner that runs stands in a strip above the other views, as it does once it is switched on.
    void ShowTuner(bool show);
    bool IsShowTuner() const;
    // A frozen analyser runs no analysis; a thawed one has fresh buffers. Its sonogram goes on behind a gap
    // as long as it stood, and so it does where the analyser was switched off.
    void SetFrozen(bool frozen);
    bool GetFrozen() const;

    // Spectrum, sonogram, both, tuner, and around again.
    void ToggleDisplayMode();
    // Shows or hides the sonogram.
    void ToggleDisplayMode2();
    // What DoDraw draws; any thread.
    _display_mode GetDisplayMode() const;
    // Adds the sonogram to the spectrum, or leaves the spectrum alone.
    void ShowSonogram(bool show);
    bool IsShowSonogram() const;
    // The box that tells what is at the pointer.
    void ToggleShowInfoBoxes();
    void SetShowInfoBox(bool show);
    bool IsShowInfoBox() const;
    // Where the mouse is, in the coordinates of the drawing; the info box tells what is there.
    void SetPointer(float x, float y);
    void ClearPointer();

    // The stretch of the frequency axis that spectrum and sonogram show: all of it, which {0, 0} stands for,
    // unless lowest < highest. What the axis does not have is cut off; down to a sixteenth of the axis the
    // sonogram keeps up with it. Any thread.
    void SetFrequencySpan(const Corvo::FrequencySpan& span);
    Corvo::FrequencySpan GetFrequencySpan() const;
    // What the picture drawn last shows at a place in its coordinates. Display thread.
    Corvo::AnalyserReading GetReading(float x, float y) const;
    // Marks a reading, of another plot than None: it stays at its frequency and moment, and the info box at
    // the pointer tells how far away from it that is. Display thread.
    void SetMarker(const Corvo::AnalyserReading& reading);
    void ClearMarker();
    // Of plot None when there is no marker.
    Corvo::AnalyserReading GetMarker() const;

    // Drawing, with any back-end (its header makes these templates): into `rectangle`, in pixels of the
    // target, whatever its size. One thread draws for all analysers; it is the display thread, or the menu's
    // while the display thread rests.
    //
    // DoDraw draws what the display mode says, and the tuner in a strip above it while that is on.
    template <class Drawing>
    void DoDraw(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    template <class Drawing>
    void DoDrawSpectrum(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // The spectrum above the sonogram.
    template <class Drawing>
    void DoDrawSonogramAndSpectrum(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // The sonogram with its scales and, while the tuner is on, the pitch; and its scale of colours alone.
    template <class Drawing>
    void DrawSonogramComponents(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    template <class Drawing>
    void DrawSonogramIntensityScale(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // The name of the note in its circle.
    template <class Drawing>
    void DoDrawBigLetter(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // The whole tuner: note and needle side by side or one above the other, or one line where it is small.
    template <class Drawing>
    void DrawTuner(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // The note between ripples that light up with its error.
    template <class Drawing>
    void DrawTunerBigLetter(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // A dial from -50 to 50 cents, and what there is to read below it.
    template <class Drawing>
    void DrawTunerWithNeedle(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    // The dial alone, and the text alone.
    template <class Drawing>
    void DrawNeedle(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);
    template <class Drawing>
    void DrawNeedleInfo(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle);

private:
    friend struct Corvo::ViewAccess;  // what the drawing routines read of the inside

    void TellOfNote();
    void RunTuner(int samplingRate);
    void Tell(int message, std::intptr_t detail);

    std::unique_ptr<Corvo::Analyser> m_analyser;
    std::vector<Corvo::PointF> m_outline;  // memory that one picture leaves to the next
};
