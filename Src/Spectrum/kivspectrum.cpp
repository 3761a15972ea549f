#include "Spectrum/kivspectrum.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <limits>
#include <mutex>
#include <numbers>
#include <utility>

#include "Platform/DenormalGuard.h"
#include "Spectrum/AnalyserLock.h"
#include "Spectrum/CaptureBuffer.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/MessagePoster.h"
#include "Spectrum/Scales/SpectrumLimits.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"

using Corvo::AnalyserLock;
using Corvo::BufferLength;
using Lock = std::lock_guard<Corvo::CriticalSection>;

namespace {

constexpr int kNoOrder = 100;
constexpr int kShortestTunerWindow = 8192;
constexpr float kLargestOverlap = 0.99f;
constexpr float kCalm = 0.035f, kBrisk = 0.15f;
constexpr float kSonogramSmoothing[] = {0.155f, 0.12f, 0.1f, 0.09f, 0.08f, 0.07f, 0.065f, 0.05f, 0.035f};

std::vector<kivspectrum*>& Observers() {
    static std::vector<kivspectrum*> observers;
    return observers;
}

int OrderOf(std::int32_t length) {
    const auto bits = static_cast<std::uint32_t>(length);
    return length > 0 && std::has_single_bit(bits) ? std::countr_zero(bits) : kNoOrder;
}

std::size_t Entries(std::int32_t length) { return static_cast<std::size_t>(BufferLength(length)); }

}  // namespace

namespace Corvo {
CriticalSection& AnalyserLock() {
    static CriticalSection lock;
    return lock;
}
}  // namespace Corvo

kivspectrum::spectrum_settings kivspectrum::settings;
std::atomic<bool> kivspectrum::lock_init{false};
std::atomic<bool> kivspectrum::needPrepareBitmap{false};

SpectrumStaticInfo& kivspectrum::GetStaticInfo() {
    static SpectrumStaticInfo info;
    return info;
}

int kivspectrum::GetRefreshRatePeriod() { return SpectrumDrawer::GetRefreshRatePeriod(); }

void kivspectrum::SetAnalysisWindowsOverlap(float overlap) {
    const Lock classLock(AnalyserLock());
    // Written so that an overlap which is not a number is stored as the largest, too.
    const double used = overlap < kLargestOverlap ? overlap : kLargestOverlap;
    settings.overlap = overlap < 1.0f ? overlap : kLargestOverlap;
    constexpr double kLongestHop = 1 << 30;
    const double hop = (1.0 - used) * settings.window_length;
    settings.hop_length = hop > -kLongestHop ? static_cast<std::int32_t>(std::min(hop, kLongestHop)) : -1;
}

void kivspectrum::SetDpi(int dpi) {
    static std::atomic<int> current{0};
    if (current.exchange(dpi) != dpi) needPrepareBitmap = true;
}

void kivspectrum::ObserverAdd(kivspectrum* instance, bool add) {
    const Lock classLock(AnalyserLock());
    if (add)
        Observers().push_back(instance);
    else
        std::erase(Observers(), instance);
}

kivspectrum::kivspectrum()
    : m_order(kNoOrder),
      m_fftOrder(kNoOrder),
      m_capture(std::make_unique<Corvo::CaptureBuffer>()),
      m_drawer(std::make_unique<SpectrumDrawer>(spectrum_settings{})),
      m_filter(std::make_unique<VectorInterpolationFilterFloat>()),
      m_tuner(std::make_unique<Tuner>()),
      m_sonogram(std::make_unique<Corvo::Sonogram>()) {
    // Together: a menu command in between would not reach this analyser.
    const Lock classLock(AnalyserLock());
    init();
    ObserverAdd(this, true);
}

kivspectrum::~kivspectrum() { ObserverAdd(this, false); }

void kivspectrum::Feed(const float* samples, int frames, int stride, int channels) {
    m_capture->Feed(samples, frames, stride, channels);
}
void kivspectrum::Feed(const double* samples, int frames, int stride, int channels) {
    m_capture->Feed(samples, frames, stride, channels);
}

void kivspectrum::set_parameters(int samplingRate) {
    if (samplingRate > 0) m_samplingRate = samplingRate;
}

void kivspectrum::init() {
    const Lock classLock(AnalyserLock());
    if (lock_init) return;
    if (m_tunerOn && settings.window_length < kShortestTunerWindow) {
        settings.window_length = kShortestTunerWindow;
        ObserverUpdate();
        return;
    }
    settings.fft_length = settings.fft_length_auto ? settings.window_length
                                                   : std::max(settings.window_length, settings.fft_length);
    const Lock instanceLock(m_instanceLock);
    m_capture->RestartHop();
    if (settings.fft_length == m_builtFftLength && settings.window_type == m_builtWindowType &&
        settings.window_length == m_builtWindowLength && settings.hop_length == m_builtHopLength) {
        const bool resized = std::clamp(settings.smoothing_filter_length, 0, Corvo::kMaxFilterSpectra) !=
                             m_filter->GetSpectra();
        if (resized && !m_power.empty()) ResizeFilter();
        return;
    }
    m_order = OrderOf(settings.fft_length);
    m_builtFftLength = settings.fft_length;
    m_builtWindowType = settings.window_type;
    m_builtWindowLength = settings.window_length;
    m_builtHopLength = settings.hop_length;
    UpdateDrawer(settings);
    try {
        allocate(1);
    } catch (...) {
        m_builtHopLength = std::numeric_limits<std::int32_t>::min();  // the next init builds again
        throw;
    }
    m_capture->ClearPending();
}

void kivspectrum::allocate(int reset) {
    const Lock classLock(AnalyserLock());
    const Lock instanceLock(m_instanceLock);
    m_powerIsFrame = false;
    if (m_order != m_fftOrder) {
        m_fft.Free();
        if (m_order != kNoOrder) m_fft.AllocateReal(m_builtFftLength, 0);
        m_fftOrder = m_order;
    }
    if (reset == 0 || m_frozen) {
        m_capture->Resize(0, 0);
        for (auto* buffer : {&m_samples, &m_transform, &m_window, &m_power}) *buffer = {};
        m_drawer->Deallocate();
        m_filter->Resize(0, 0);
        return;
    }
    m_capture->Resize(BufferLength(m_builtFftLength), BufferLength(m_builtWindowLength));
    m_capture->SetHop(m_builtHopLength >= 1 ? m_builtHopLength : m_builtWindowLength);
    m_samples.resize(Entries(m_builtFftLength));
    m_transform.resize(Entries(m_builtFftLength));
    m_power.resize(Entries(m_builtFftLength) / 2);
    m_drawer->Allocate();
    m_window.resize(Entries(m_builtWindowLength));
    ResizeFilter();
    cook_window();
}

// As long as the window or half the transform, whichever is more: a padded transform has more bins than the
// window has samples.
void kivspectrum::ResizeFilter() {
    m_filter->Resize(std::clamp(settings.smoothing_filter_length, 0, Corvo::kMaxFilterSpectra),
                     std::max(BufferLength(m_builtWindowLength), BufferLength(m_builtFftLength) / 2));
}

void kivspectrum::cook_window() {
    const auto length = static_cast<int>(std::min(m_builtWindowLength, m_builtFftLength));
    if (m_window.size() < static_cast<std::size_t>(std::max(m_builtWindowLength, 0))) return;
    const double turn = 2.0 * std::numbers::pi / length;
    const auto shape = [&](int n) {
        switch (m_builtWindowType) {
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
    if (m_builtWindowType < 0 || m_builtWindowType >= window_types_num) return;
    for (int n = 0; n < length; ++n) m_window[static_cast<std::size_t>(n)] = static_cast<float>(shape(n));
}

void kivspectrum::ObserverUpdate() {
    // The class-wide lock alone: with this analyser's own held as well, two walks could wait for each other.
    const Lock classLock(AnalyserLock());
    for (kivspectrum* const observer : Observers()) {
        if (!m_tunerOn) observer->SetTunerOn(false);
        observer->init();
    }
}

bool kivspectrum::PrepareFFTForDrawing(int samplingRate, bool fastSmoothing, bool sonogramMode,
                                       bool sonogramOverride, bool probeOnly) {
    {
        // The analyser's lock is taken before the class-wide one is let go, so that settings and buffers
        // belong together; the work itself holds up nobody else.
        std::unique_lock classLock(AnalyserLock());
        const Lock instanceLock(m_instanceLock);
        if (m_power.empty() || m_frozen || !m_on || !m_capture->Pending()) return false;
        if (probeOnly) return true;
        const spectrum_settings current = settings;
        classLock.unlock();

        const Corvo::DenormalGuard denormals;
        PerformFFT();
        ComputePower();
        m_powerIsFrame = true;
        if (samplingRate != m_drawer->GetSamplingFrequency()) m_drawer->UpdateSamplingFrequency(samplingRate);
        UpdateDrawer(current);
        m_drawer->SmoothFftSpectrum(
            m_power, SmoothingCoefficient(fastSmoothing, sonogramMode, sonogramOverride), *m_filter);
        m_frameForSonogram = true;
    }
    Tell(kMessageFrameReady, 0);
    return true;
}

bool kivspectrum::PrepareFFTForDrawingHelper(bool sonogramMode, bool sonogramOverride) {
    return PrepareFFTForDrawing(m_samplingRate, true, sonogramMode, sonogramOverride, false);
}

bool kivspectrum::GetFFTFor3DSonogram(int samplingRate, const std::vector<float>** spectrum,
                                      bool fastSmoothing, bool probeOnly) {
    if (!m_transforming) {
        if (!PrepareFFTForDrawing(samplingRate, fastSmoothing, false, false, probeOnly)) return false;
        if (!probeOnly && m_tunerOn) RunTuner(samplingRate);
    }
    if (spectrum) *spectrum = &m_drawer->GetPowerSmoothed();
    return true;
}

bool kivspectrum::Refresh() {
    const bool prepared = PrepareFFTForDrawingHelper(m_showSonogram, false);
    bool noteGone = false;
    if (m_tunerOn && prepared) RunTuner(m_samplingRate);
    if (m_tunerOn && !prepared && !m_frozen) noteGone = LetTunerWait();
    return AdvanceSonogram() || prepared || noteGone;
}

// The tuner reads buffers that a menu command may rebuild, even in answer to the frame's message: then there
// is nothing to tune until the next frame. Its listener is told without the lock for the same reason.
void kivspectrum::RunTuner(int samplingRate) {
    bool changed = false;
    {
        const Lock instanceLock(m_instanceLock);
        if (!m_powerIsFrame) return;
        m_tuner->SetWindowType(m_builtWindowType);
        changed = m_tuner->Analyse(m_power, m_builtFftLength, m_builtHopLength, m_builtWindowLength,
                                   samplingRate, true, false);
    }
    if (changed) TellOfNote();
}

bool kivspectrum::LetTunerWait() {
    const bool changed = m_tuner->Wait();
    if (changed) TellOfNote();
    return changed;
}

void kivspectrum::TellOfNote() {
    m_tuner->Announce();
    Tell(kMessageNoteChanged, m_tuner->IsTuned() ? 1 : 0);
}

bool kivspectrum::AdvanceSonogram() {
    // The smoothed spectrum is rebuilt under this lock.
    const Lock instanceLock(m_instanceLock);
    if (!m_showSonogram || !m_on || m_frozen || m_drawer->GetSamplingFrequency() <= 0) return false;
    const double pitch = m_tunerOn ? m_tuner->GetHeardFrequency() : 0.0;
    return m_sonogram->Step(*m_drawer, std::exchange(m_frameForSonogram, false), static_cast<float>(pitch));
}

void kivspectrum::PerformFFT() {
    if (m_transforming.exchange(true)) return;
    {
        const Lock instanceLock(m_instanceLock);
        const Corvo::DenormalGuard denormals;
        m_capture->CopyTo(m_samples);
        // Alike, unless memory ran out while they grew.
        const std::size_t length = std::min(m_samples.size(), m_transform.size());
        const std::size_t windowed = std::min(m_window.size(), length);
        for (std::size_t i = 0; i < windowed; ++i) m_transform[i] = m_samples[i] * m_window[i];
        std::copy(m_samples.begin() + static_cast<std::ptrdiff_t>(windowed),
                  m_samples.begin() + static_cast<std::ptrdiff_t>(length),
                  m_transform.begin() + static_cast<std::ptrdiff_t>(windowed));
        if (m_transform.size() == static_cast<std::size_t>(m_builtFftLength))
            m_fft.DoFFTReal(m_transform.data(), 0, 0);
    }
    m_transforming = false;
}

// Entry 0 takes the Nyquist bin along with DC: the packed spectrum keeps both there. What is not a finite
// number counts as nothing, or it would stay in the smoothed spectrum for good.
void kivspectrum::ComputePower() {
    const float* const packed = m_transform.data();
    float* const power = m_power.data();
    constexpr float kLargest = std::numeric_limits<float>::max();
    for (std::size_t k = 0; k < m_power.size(); ++k) {
        const float sum = packed[2 * k] * packed[2 * k] + packed[2 * k + 1] * packed[2 * k + 1];
        power[k] = sum <= kLargest ? sum : 0.0f;
    }
}

float kivspectrum::SmoothingCoefficient(bool fastSmoothing, bool sonogramMode, bool sonogramOverride) const {
    if (sonogramMode && !sonogramOverride) return kSonogramSmoothing[Corvo::Sonogram::GetSpeedIndex()];
    return fastSmoothing ? kCalm : kBrisk;
}

void kivspectrum::UpdateDrawer(const spectrum_settings& current) {
    const bool resized = current.fft_length != m_drawer->GetSettings().fft_length;
    m_drawer->UpdateSettings(current);
    if (resized) m_drawer->ReallocateBuffers();
}

// Called without a lock: the host may answer with a menu command.
void kivspectrum::Tell(int message, std::intptr_t detail) {
    if (MessagePoster* const poster = GetStaticInfo().GetMessagePoster())
        poster->Post(message, reinterpret_cast<std::intptr_t>(this), detail);
}
