#include "Spectrum/Analyser.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <mutex>
#include <new>
#include <numbers>
#include <utility>

#include "Platform/DenormalGuard.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/SpectrumLimits.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Sonogram/SonogramHistory.h"
#include "Spectrum/Tuner/Tuner.h"

namespace Corvo {
namespace {

using Lock = std::lock_guard<CriticalSection>;
using Mode = SpectrumDisplay;

constexpr int kNoOrder = 100;  // of a length that is not a power of two
constexpr float kCalm = 0.035f, kBrisk = 0.15f;
constexpr float kSonogramSmoothing[] = {0.155f, 0.12f, 0.1f, 0.09f, 0.08f, 0.07f, 0.065f, 0.05f, 0.035f};

int OrderOf(std::int32_t length) {
    const auto bits = static_cast<std::uint32_t>(length);
    return length > 0 && std::has_single_bit(bits) ? std::countr_zero(bits) : kNoOrder;
}

std::size_t Entries(std::int32_t length) { return static_cast<std::size_t>(BufferLength(length)); }

int FilterLength(const SpectrumSettings& settings) {
    return std::clamp(settings.smoothing_filter_length, 0, kMaxFilterSpectra);
}

// The height of the curve last drawn, whose points go from left to right; at the ground where it has none.
double CurveAt(const std::vector<PointF>& points, float x, const RectF& plot) {
    const auto right = std::ranges::lower_bound(points, x, {}, &PointF::x);
    if (points.empty()) return plot.y + plot.height;
    if (right == points.begin()) return right->y;
    const PointF before = right[-1];
    if (right == points.end() || right->x <= before.x) return before.y;
    return std::lerp(before.y, right->y, (x - before.x) / (right->x - before.x));
}

bool SameBuffers(const SpectrumSettings& a, const SpectrumSettings& b) {
    return a.fft_length == b.fft_length && a.window_type == b.window_type &&
           a.window_length == b.window_length && a.hop_length == b.hop_length;
}

}  // namespace

Analyser::Analyser()
    : m_order(kNoOrder),
      m_fftOrder(kNoOrder),
      m_drawer(std::make_unique<SpectrumDrawer>(SpectrumSettings{})),
      m_filter(std::make_unique<VectorInterpolationFilterFloat>()),
      m_tuner(std::make_unique<Tuner>()),
      m_sonogram(std::make_unique<Sonogram>()) {
    m_built.fft_length = m_built.window_length = m_built.hop_length = 0;
    m_built.window_type = -1;
}
Analyser::~Analyser() = default;

void Analyser::SetOn(bool on) {
    state.on = on;
    m_drawer->SetOn(on);
}

void Analyser::SetTunerOn(bool on) {
    if (on) m_tuner->Forget();
    state.tunerOn = on;
    state.tunerVisible = on;
}

bool Analyser::ToggleTuner() {
    const bool start = !(state.tunerOn && state.on);
    SetTunerOn(start);
    if (!start) return false;
    SetOn(true);
    state.frozen = false;
    return true;
}

void Analyser::SetSamplingRate(int samplingRate) {
    if (samplingRate > 0) state.samplingRate = samplingRate;
}

void Analyser::SetPointer(float x, float y) {
    state.pointerX = x;
    state.pointerY = y;
}

void Analyser::ToggleDisplayMode() {
    const Lock lock(m_lock);
    const auto next = static_cast<DisplayMode>((state.displayMode + 1) % (Mode::display_tuner + 1));
    state.displayMode = next;
    state.showSonogram = next == Mode::display_sonogram || next == Mode::display_both;
}

void Analyser::ShowSonogram(bool show) {
    const Lock lock(m_lock);
    state.showSonogram = show;
    const DisplayMode mode = state.displayMode;
    if (show && mode == Mode::display_spectrum) state.displayMode = Mode::display_both;
    if (!show && (mode == Mode::display_sonogram || mode == Mode::display_both))
        state.displayMode = Mode::display_spectrum;
}

void Analyser::ResetPeaks() {
    const Lock lock(m_lock);
    m_drawer->peak_reset();
}

void Analyser::Prepare(const SpectrumSettings& settings) {
    const Lock lock(m_lock);
    if (SameBuffers(settings, m_built)) return FitFilter(settings);
    m_order = OrderOf(settings.fft_length);
    m_built = settings;
    try {
        UpdateDrawer(settings);
    } catch (...) {
        BuildAgain();
        throw;
    }
    Allocate(settings, true);
    m_capture.ClearPending();
}

// The next Prepare, whatever its settings.
void Analyser::BuildAgain() { m_built.hop_length = std::numeric_limits<std::int32_t>::min(); }

void Analyser::Allocate(const SpectrumSettings& settings, bool reset) {
    const Lock lock(m_lock);
    try {
        Build(settings, reset);
    } catch (...) {
        BuildAgain();
        throw;
    }
}

void Analyser::Build(const SpectrumSettings& settings, bool reset) {
    m_powerIsFrame = false;
    if (!reset || state.frozen) {
        m_capture.Resize(0, 0);
        for (auto* buffer : {&m_samples, &m_transform, &m_window, &m_power}) *buffer = {};
        m_drawer->Deallocate();
        m_filter->Resize(0, 0);
        return;
    }
    m_capture.Resize(BufferLength(m_built.fft_length), BufferLength(m_built.window_length));
    m_capture.SetHop(m_built.hop_length >= 1 ? m_built.hop_length : m_built.window_length);
    m_samples.resize(Entries(m_built.fft_length));
    m_transform.resize(Entries(m_built.fft_length));
    BuildTransform();
    m_power.resize(Entries(m_built.fft_length) / 2);
    m_drawer->Allocate();
    m_window.resize(Entries(m_built.window_length));
    ResizeFilter(FilterLength(settings));
    CookWindow();
}

// Without memory the transform does nothing, which an impulse shows.
void Analyser::BuildTransform() {
    if (m_order == m_fftOrder) return;
    m_fftOrder = kNoOrder;
    m_fft.Free();
    if (m_order == kNoOrder) return;
    m_fft.AllocateReal(m_built.fft_length, 0);
    if (m_transform.size() == static_cast<std::size_t>(m_built.fft_length) && m_transform.size() > 1) {
        std::ranges::fill(m_transform, 0.0f);
        m_transform[0] = 1.0f;
        m_fft.DoFFTReal(m_transform.data(), 0, 0);
        if (m_transform[1] != 1.0f) throw std::bad_alloc();
    }
    m_fftOrder = m_order;
}

void Analyser::FitFilter(const SpectrumSettings& settings) {
    const Lock lock(m_lock);
    const int spectra = FilterLength(settings);
    if (spectra != m_filter->GetSpectra() && !m_power.empty()) ResizeFilter(spectra);
}

// As long as the window or half the transform, whichever is more: a padded transform has more bins than the
// window has samples.
void Analyser::ResizeFilter(int spectra) {
    m_filter->Resize(spectra,
                     std::max(BufferLength(m_built.window_length), BufferLength(m_built.fft_length) / 2));
}

void Analyser::CookWindow() {
    const int length = std::min(m_built.window_length, m_built.fft_length);
    if (m_window.size() < static_cast<std::size_t>(std::max(m_built.window_length, 0))) return;
    if (m_built.window_type < 0 || m_built.window_type >= kWindowTypes) return;
    const double turn = 2.0 * std::numbers::pi / length;
    const auto shape = [&](int n) {
        switch (m_built.window_type) {
            case 0:
                return 1.0;
            case 1:
                return n <= length / 2 ? 2.0 * n / length : 2.0 - 2.0 * n / length;
            case 2:
                return 0.5 - 0.5 * std::cos(turn * n);
            case 3:
                return 0.54 - 0.46 * std::cos(turn * n);
            default:
                return 0.42 - 0.5 * std::cos(turn * n) + 0.08 * std::cos(2.0 * turn * n);
        }
    };
    for (int n = 0; n < length; ++n) m_window[static_cast<std::size_t>(n)] = static_cast<float>(shape(n));
}

bool Analyser::HasFrame() const {
    const Lock lock(m_lock);
    return !m_power.empty() && !state.frozen && state.on && m_capture.Pending();
}

float Analyser::SmoothingCoefficient(bool fast, bool sonogramMode) {
    if (sonogramMode) return kSonogramSmoothing[Sonogram::GetSpeedIndex()];
    return fast ? kCalm : kBrisk;
}

void Analyser::ProcessFrame(const SpectrumSettings& settings, int samplingRate, float coefficient) {
    const DenormalGuard denormals;
    PerformFFT();
    ComputePower();
    m_powerIsFrame = true;
    if (samplingRate != m_drawer->GetSamplingFrequency()) m_drawer->UpdateSamplingFrequency(samplingRate);
    UpdateDrawer(settings);
    m_drawer->SmoothFftSpectrum(m_power, coefficient, *m_filter);
    m_frameForSonogram = true;
}

void Analyser::PerformFFT() {
    if (m_transforming.exchange(true)) return;
    {
        const Lock lock(m_lock);
        const DenormalGuard denormals;
        m_capture.CopyTo(m_samples);
        // Alike, unless memory ran out while they grew.
        const std::size_t length = std::min(m_samples.size(), m_transform.size());
        const std::size_t windowed = std::min(m_window.size(), length);
        for (std::size_t i = 0; i < windowed; ++i) m_transform[i] = m_samples[i] * m_window[i];
        std::copy(m_samples.begin() + static_cast<std::ptrdiff_t>(windowed),
                  m_samples.begin() + static_cast<std::ptrdiff_t>(length),
                  m_transform.begin() + static_cast<std::ptrdiff_t>(windowed));
        if (m_transform.size() == static_cast<std::size_t>(m_built.fft_length))
            m_fft.DoFFTReal(m_transform.data(), 0, 0);
    }
    m_transforming = false;
}

// Entry 0 takes the Nyquist bin along with DC: the packed spectrum keeps both there. What is not a finite
// number counts as nothing, or it would stay in the smoothed spectrum for good.
void Analyser::ComputePower() {
    const float* const packed = m_transform.data();
    float* const power = m_power.data();
    constexpr float kLargest = std::numeric_limits<float>::max();
    for (std::size_t k = 0; k < m_power.size(); ++k) {
        const float sum = packed[2 * k] * packed[2 * k] + packed[2 * k + 1] * packed[2 * k + 1];
        power[k] = sum <= kLargest ? sum : 0.0f;
    }
}

void Analyser::UpdateDrawer(const SpectrumSettings& settings) {
    const bool resized = settings.fft_length != m_drawer->GetSettings().fft_length;
    m_drawer->UpdateSettings(settings);
    if (resized) m_drawer->ReallocateBuffers();
}

// A menu command may rebuild the buffers, even in answer to the frame's message: then there is nothing to
// tune until the next frame.
bool Analyser::Tune(int samplingRate) {
    const Lock lock(m_lock);
    if (!m_powerIsFrame) return false;
    m_tuner->SetWindowType(m_built.window_type);
    return m_tuner->Analyse(m_power, m_built.fft_length, m_built.hop_length, m_built.window_length,
                            samplingRate, true, false);
}

bool Analyser::LetTunerWait() { return m_tuner->Wait(); }

bool Analyser::AnnounceNote() {
    m_tuner->Announce();
    return m_tuner->IsTuned();
}

bool Analyser::AdvanceSonogram() {
    // The smoothed spectrum is rebuilt under this lock.
    const Lock lock(m_lock);
    if (m_drawer->GetSamplingFrequency() <= 0) return false;
    if (!state.on || state.frozen) {
        ++m_stoodFor;
        return false;
    }
    if (m_stoodFor > 0) LeaveGap(std::exchange(m_stoodFor, 0));
    m_sonogram->m_hidden = !state.showSonogram;
    const double pitch = state.tunerOn ? m_tuner->GetHeardFrequency() : 0.0;
    return m_sonogram->Step(*m_drawer, std::exchange(m_frameForSonogram, false), static_cast<float>(pitch)) &&
           !m_sonogram->m_hidden;
}

void Analyser::LeaveGap(std::int64_t refreshes) {
    m_sonogram->m_history->Skip(refreshes * SonogramHistory::kTicksPerSecond /
                                PitchTrace::kRefreshesPerSecond);
    m_sonogram->ClearColumn();
    m_sonogram->m_pictureStale = true;
}

double Analyser::SonogramSeconds() const {
    return static_cast<double>(m_sonogram->m_rightEdge) / SonogramHistory::kTicksPerSecond;
}

AnalyserReading Analyser::ReadingAt(PointF place) const {
    using Plot = AnalyserReading::Plot;
    const Lock lock(m_lock);
    if (shown.map && Contains(shown.spectrum, place))
        return {Plot::Spectrum, shown.map->XToFrequency(place.x),
                shown.map->YToLevel(CurveAt(m_drawer->GetXYPoints(), place.x, shown.spectrum))};
    if (!Contains(shown.sonogram, place)) return {};
    const RectF& axis = shown.sonogramAxis;
    const double rows = m_sonogram->GetBitmap().height;
    const double ago = (shown.sonogram.x + shown.sonogram.width - place.x) /
                       static_cast<double>(Sonogram::GetColumnsPerSecond());
    const double fromBelow = (axis.y + axis.height - place.y) * rows / axis.height;
    return {Plot::Sonogram, m_sonogram->GetFrequencyMap().XToFrequency(fromBelow),
            m_sonogram->GetPointAmplitude(place.x, place.y, axis), m_sonogram->GetTimeAtRightEdge() - ago,
            SonogramSeconds() - ago};
}

}  // namespace Corvo
