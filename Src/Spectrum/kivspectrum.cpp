#include "Spectrum/kivspectrum.h"

#include <mutex>

#include "Spectrum/AnalyserAction.h"
#include "Spectrum/AnalyserSettings.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/MessagePoster.h"

using Corvo::Analyser, Corvo::AnalyserLock;
using Lock = std::lock_guard<Corvo::CriticalSection>;

namespace {

constexpr int kShortestTunerWindow = 8192;
constexpr int kRedrawTunerPanel = 1350;

std::vector<kivspectrum*>& Observers() {
    static std::vector<kivspectrum*> observers;
    return observers;
}

}  // namespace

kivspectrum::spectrum_settings kivspectrum::settings;
std::atomic<bool> kivspectrum::lock_init{false};

SpectrumStaticInfo& kivspectrum::GetStaticInfo() {
    static SpectrumStaticInfo info;
    return info;
}
int kivspectrum::GetRefreshRatePeriod() { return SpectrumDrawer::GetRefreshRatePeriod(); }
kivspectrum::spectrum_settings kivspectrum::GetSettings() {
    const Lock classLock(AnalyserLock());
    return settings;
}
void kivspectrum::SetAnalysisWindowsOverlap(float overlap) {
    const Lock classLock(AnalyserLock());
    Corvo::StoreOverlap(settings, overlap);
}

void kivspectrum::ObserverAdd(kivspectrum* instance, bool add) {
    const Lock classLock(AnalyserLock());
    if (add) return Observers().push_back(instance);
    std::erase(Observers(), instance);
}

void kivspectrum::ObserverUpdate() {
    // The class-wide lock alone: with this analyser's own held as well, two walks could wait for each other.
    const Lock classLock(AnalyserLock());
    for (kivspectrum* const observer : Observers()) {
        if (!m_analyser->state.tunerOn) observer->SetTunerOn(false);
        observer->init();
    }
}

kivspectrum::kivspectrum() : m_analyser(std::make_unique<Analyser>()) {
    // Together: a menu command in between would not reach this analyser.
    const Lock classLock(AnalyserLock());
    init();
    ObserverAdd(this, true);
}
kivspectrum::~kivspectrum() { ObserverAdd(this, false); }
void kivspectrum::Feed(const float* samples, int frames, int stride, int channels) {
    m_analyser->GetCapture().Feed(samples, frames, stride, channels);
}
void kivspectrum::Feed(const double* samples, int frames, int stride, int channels) {
    m_analyser->GetCapture().Feed(samples, frames, stride, channels);
}
void kivspectrum::set_parameters(int samplingRate) { m_analyser->SetSamplingRate(samplingRate); }

void kivspectrum::init() {
    const Lock classLock(AnalyserLock());
    if (lock_init) return;
    if (m_analyser->state.tunerOn && settings.window_length < kShortestTunerWindow) {
        settings.window_length = kShortestTunerWindow;
        return ObserverUpdate();
    }
    Corvo::FitTransform(settings);
    m_analyser->Prepare(settings);
}
void kivspectrum::allocate(int reset) {
    const Lock classLock(AnalyserLock());
    m_analyser->Allocate(settings, reset != 0);
}
bool kivspectrum::popupmenu_process(int command) {
    const auto* const entry = Corvo::FindAnalyserMenuEntry(command);
    if (!entry) return false;
    {
        const Lock classLock(AnalyserLock());
        if (command == kRedrawTunerPanel) needPrepareBitmap = true;
        entry->action->apply(*m_analyser, settings, entry->value);
        // A new length of the smoothing filter takes effect at once, even while lock_init is set.
        for (const kivspectrum* const observer : Observers()) observer->m_analyser->FitFilter(settings);
        ObserverUpdate();
    }
    if (command == kRedrawTunerPanel) Tell(kMessageTunerPanelRedraw, 0);
    Tell(kMessageSettingsChanged, command);
    return true;
}
bool kivspectrum::popupmenu_checked(int command) const {
    const Lock classLock(AnalyserLock());
    const auto* const entry = Corvo::FindAnalyserMenuEntry(command);
    return entry && entry->action->chosen(*m_analyser, settings, entry->value);
}

bool kivspectrum::PrepareFFTForDrawing(int samplingRate, bool fastSmoothing, bool sonogramMode,
                                       bool sonogramOverride, bool probeOnly) {
    {
        // The analyser's lock is taken before the class-wide one is let go, so that settings and buffers
        // belong together; the work itself holds up nobody else.
        std::unique_lock classLock(AnalyserLock());
        const Lock instanceLock(m_analyser->GetLock());
        if (!m_analyser->HasFrame()) return false;
        if (probeOnly) return true;
        const spectrum_settings current = settings;
        classLock.unlock();
        const bool atItsSpeed = sonogramMode && !sonogramOverride;
        m_analyser->ProcessFrame(current, samplingRate,
                                 Analyser::SmoothingCoefficient(fastSmoothing, atItsSpeed));
    }
    Tell(kMessageFrameReady, 0);
    return true;
}
bool kivspectrum::PrepareFFTForDrawingHelper(bool sonogramMode, bool sonogramOverride) {
    return PrepareFFTForDrawing(m_analyser->state.samplingRate, true, sonogramMode, sonogramOverride, false);
}
bool kivspectrum::GetFFTFor3DSonogram(int samplingRate, const std::vector<float>** spectrum,
                                      bool fastSmoothing, bool probeOnly) {
    if (!m_analyser->IsTransforming()) {
        if (!PrepareFFTForDrawing(samplingRate, fastSmoothing, false, false, probeOnly)) return false;
        if (!probeOnly && m_analyser->state.tunerOn) RunTuner(samplingRate);
    }
    if (spectrum) *spectrum = &m_analyser->GetDrawer().GetPowerSmoothed();
    return true;
}
bool kivspectrum::Refresh() {
    const bool prepared = PrepareFFTForDrawingHelper(IsShowSonogram(), false);
    if (m_analyser->state.tunerOn && prepared) RunTuner(m_analyser->state.samplingRate);
    const bool noteGone =
        m_analyser->state.tunerOn && !prepared && !GetFrozen() && m_analyser->LetTunerWait();
    if (noteGone) TellOfNote();
    return AdvanceSonogram() || prepared || noteGone;
}
bool kivspectrum::AdvanceSonogram() { return m_analyser->AdvanceSonogram(); }
void kivspectrum::PerformFFT() { m_analyser->PerformFFT(); }

// All that is told is told without a lock: the host may answer with a menu command.
void kivspectrum::RunTuner(int samplingRate) {
    if (m_analyser->Tune(samplingRate)) TellOfNote();
}
void kivspectrum::TellOfNote() { Tell(kMessageNoteChanged, m_analyser->AnnounceNote() ? 1 : 0); }
void kivspectrum::Tell(int message, std::intptr_t detail) {
    if (MessagePoster* const poster = GetStaticInfo().GetMessagePoster())
        poster->Post(message, reinterpret_cast<std::intptr_t>(this), detail);
}
std::vector<float>& kivspectrum::GetBufferInputPoints() { return m_analyser->GetCapture().Samples(); }
int kivspectrum::GetBufferInputChannels() const { return 1; }
const std::vector<float>& kivspectrum::GetPower() const { return m_analyser->GetPower(); }
const std::vector<float>& kivspectrum::GetWindow() const { return m_analyser->GetWindow(); }
SpectrumDrawer* kivspectrum::GetSpectrumDrawer() const { return &m_analyser->GetDrawer(); }
Tuner* kivspectrum::GetTuner() const { return &m_analyser->GetTuner(); }
Corvo::Sonogram* kivspectrum::GetSonogram() const { return &m_analyser->GetSonogram(); }
void kivspectrum::peak_reset() { m_analyser->ResetPeaks(); }
void kivspectrum::SetOn(bool on) { m_analyser->SetOn(on); }
bool kivspectrum::GetOn() const { return m_analyser->state.on; }
void kivspectrum::SetTunerOn(bool on) { m_analyser->SetTunerOn(on); }
bool kivspectrum::GetTunerOn() const { return m_analyser->state.tunerOn; }
void kivspectrum::ToggleTuner() {
    const Lock classLock(AnalyserLock());
    if (!m_analyser->ToggleTuner()) return;
    allocate(1);
    init();
}
void kivspectrum::ShowTuner(bool show) { m_analyser->state.tunerVisible = show && GetTunerOn(); }
bool kivspectrum::IsShowTuner() const { return m_analyser->state.tunerVisible; }
void kivspectrum::SetFrozen(bool frozen) {
    const Lock classLock(AnalyserLock());
    if (m_analyser->state.frozen.exchange(frozen) && !frozen) allocate(1);
}
bool kivspectrum::GetFrozen() const { return m_analyser->state.frozen; }
void kivspectrum::ToggleDisplayMode() { m_analyser->ToggleDisplayMode(); }
void kivspectrum::ToggleDisplayMode2() { ShowSonogram(!IsShowSonogram()); }
kivspectrum::_display_mode kivspectrum::GetDisplayMode() const { return m_analyser->state.displayMode; }
void kivspectrum::ShowSonogram(bool show) { m_analyser->ShowSonogram(show); }
bool kivspectrum::IsShowSonogram() const { return m_analyser->state.showSonogram; }
void kivspectrum::ToggleShowInfoBoxes() { SetShowInfoBox(!m_analyser->state.showInfoBox); }
void kivspectrum::SetShowInfoBox(bool show) { m_analyser->state.showInfoBox = show; }
bool kivspectrum::IsShowInfoBox() const { return m_analyser->state.showInfoBox; }
void kivspectrum::SetPointer(float x, float y) { m_analyser->SetPointer(x, y); }
void kivspectrum::ClearPointer() { m_analyser->ClearPointer(); }
void kivspectrum::SetFrequencySpan(const Corvo::FrequencySpan& span) {
    const bool usable = span.lowest >= 0.0 && span.lowest < span.highest;
    const Lock lock(m_analyser->GetLock());
    m_analyser->span = usable ? span : Corvo::FrequencySpan{};
}
Corvo::FrequencySpan kivspectrum::GetFrequencySpan() const {
    const Lock lock(m_analyser->GetLock());
    return m_analyser->span;
}
Corvo::AnalyserReading kivspectrum::GetReading(float x, float y) const {
    return m_analyser->ReadingAt({x, y});
}
void kivspectrum::SetMarker(const Corvo::AnalyserReading& reading) {
    const Lock lock(m_analyser->GetLock());
    m_analyser->marker = reading;
}
void kivspectrum::ClearMarker() { SetMarker({}); }
Corvo::AnalyserReading kivspectrum::GetMarker() const {
    const Lock lock(m_analyser->GetLock());
    return m_analyser->marker;
}
