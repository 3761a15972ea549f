#pragma once

#include <atomic>
#include <cstdint>
#include <limits>
#include <memory>
#include <optional>
#include <vector>

#include "Picture/Geometry.h"
#include "Platform/CriticalSection.h"
#include "Spectrum/AnalyserReading.h"
#include "Spectrum/CaptureBuffer.h"
#include "Spectrum/Fft/CorvoFFT.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
#include "Spectrum/Scales/SpectrumSettings.h"

class SpectrumDrawer;
class Tuner;
class VectorInterpolationFilterFloat;

namespace Corvo {

class Sonogram;

// What is on and what is shown. Any thread, value by value.
struct AnalyserState {
    static constexpr float kNowhere = std::numeric_limits<float>::quiet_NaN();  // within no rectangle

    std::atomic<bool> on{false}, frozen{false};
    std::atomic<bool> tunerOn{false}, tunerVisible{false};
    std::atomic<bool> showSonogram{false}, showInfoBox{true};
    std::atomic<DisplayMode> displayMode{SpectrumDisplay::display_spectrum};
    std::atomic<int> samplingRate{44100};
    std::atomic<float> pointerX{kNowhere}, pointerY{kNowhere};
};

// Where the plots of a picture stand.
struct ShownPlots {
    RectF spectrum{}, sonogram{};
    RectF sonogramAxis{};                          // where the sonogram's whole picture would stand
    std::optional<CoordinatesAndFrequencies> map;  // of the spectrum
};

// One analyser: captures the newest samples of a signal, windows and transforms them, hands the power
// spectrum to its drawer for smoothing and its tuner for the pitch, and keeps the sonogram going. It knows of
// no other analyser and no menu: settings come with each call.
//
// Threads: one audio thread feeds the capture buffer and never waits. One display thread processes frames.
// What sizes buffers, and what reads them, takes the lock by itself; who reads several things that belong
// together holds it meanwhile. Where AnalyserLock is needed as well, that one is taken first.
class Analyser {
public:
    // Empty until it is prepared.
    Analyser();
    ~Analyser();

    AnalyserState state;
    // With the lock: what the last picture shows, and what every picture is to show.
    ShownPlots shown;
    FrequencySpan span;
    AnalyserReading marker;

    CaptureBuffer& GetCapture() { return m_capture; }
    CriticalSection& GetLock() const { return m_lock; }
    SpectrumDrawer& GetDrawer() const { return *m_drawer; }
    Tuner& GetTuner() const { return *m_tuner; }
    Sonogram& GetSonogram() const { return *m_sonogram; }
    const std::vector<float>& GetPower() const { return m_power; }
    const std::vector<float>& GetWindow() const { return m_window; }

    void SetOn(bool on);
    // Switched on, the tuner has forgotten what it heard.
    void SetTunerOn(bool on);
    // Off when tuner and analyser run, else both on and thawed, and true: the buffers are to be built again.
    bool ToggleTuner();
    // Below 1 is ignored.
    void SetSamplingRate(int samplingRate);
    // In the coordinates of the drawing.
    void SetPointer(float x, float y);
    void ClearPointer() { SetPointer(AnalyserState::kNowhere, AnalyserState::kNowhere); }
    // Spectrum, sonogram, both, tuner, and around again.
    void ToggleDisplayMode();
    // The mode follows: a sonogram joins the spectrum, and the spectrum stays when it leaves.
    void ShowSonogram(bool show);
    void ResetPeaks();

    // Brings buffers and window in line with the settings; allocates where they changed. Where nothing did,
    // the next frame comes when it would have come: a host may prepare more often than a hop lasts.
    void Prepare(const SpectrumSettings& settings);
    // The moving average's length alone.
    void FitFilter(const SpectrumSettings& settings);
    // Sizes the buffers for the lengths last prepared, or empties them: without `reset`, and while frozen.
    void Allocate(const SpectrumSettings& settings, bool reset);

    // Whether there is a frame to process: new samples, and nothing that stops it.
    bool HasFrame() const;
    // How fast the smoothed spectrum follows; the sonogram's speed decides in its mode.
    static float SmoothingCoefficient(bool fast, bool sonogramMode);
    // Transform, power and smoothing of the newest samples. With the lock held since HasFrame.
    void ProcessFrame(const SpectrumSettings& settings, int samplingRate, float coefficient);
    // Windows and transforms the newest samples; nothing while that goes on already.
    void PerformFFT();
    bool IsTransforming() const { return m_transforming; }

    // Looks for the pitch of the last frame or, without one, lets the time pass that a note is held for. True
    // when another note is shown: AnnounceNote then tells the tuner's listener, without the lock, and says
    // whether there is one.
    bool Tune(int samplingRate);
    bool LetTunerWait();
    bool AnnounceNote();

    // The sonogram's part of a display refresh; hidden, it hears all the same once it had a size. Off or
    // frozen it stands, and leaves a gap as long as that lasted when it goes on. True when its picture has
    // new columns.
    bool AdvanceSonogram();
    // Of the right edge of the sonogram's picture, since its beginning.
    double SonogramSeconds() const;
    AnalyserReading ReadingAt(PointF place) const;

private:
    void BuildAgain();
    void Build(const SpectrumSettings& settings, bool reset);
    void BuildTransform();
    void CookWindow();
    void ComputePower();
    void ResizeFilter(int spectra);
    void UpdateDrawer(const SpectrumSettings& settings);
    void LeaveGap(std::int64_t refreshes);

    mutable CriticalSection m_lock;
    CorvoFFT m_fft;
    int m_order, m_fftOrder;          // of the transform length, and what m_fft was built for
    SpectrumSettings m_built;         // lengths and window type that the buffers are for
    bool m_powerIsFrame = false;      // m_power was made since the buffers were built
    bool m_frameForSonogram = false;  // processed since its last step
    std::int64_t m_stoodFor = 0;      // refreshes that the sonogram missed
    std::atomic<bool> m_transforming{false};

    CaptureBuffer m_capture;
    std::vector<float> m_samples;    // the copy that an analysis works on
    std::vector<float> m_transform;  // windowed, then transformed in place
    std::vector<float> m_window;
    std::vector<float> m_power;
    std::unique_ptr<SpectrumDrawer> m_drawer;
    std::unique_ptr<VectorInterpolationFilterFloat> m_filter;
    std::unique_ptr<Tuner> m_tuner;
    std::unique_ptr<Sonogram> m_sonogram;
};

}  // namespace Corvo
