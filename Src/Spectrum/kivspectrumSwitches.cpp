#include <mutex>

#include "Spectrum/AnalyserLock.h"
#include "Spectrum/CaptureBuffer.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"

// What an analyser shows and whether it runs.

using Lock = std::lock_guard<Corvo::CriticalSection>;

std::vector<float>& kivspectrum::GetBufferInputPoints() { return m_capture->Samples(); }
int kivspectrum::GetBufferInputChannels() const { return 1; }
const std::vector<float>& kivspectrum::GetPower() const { return m_power; }
const std::vector<float>& kivspectrum::GetWindow() const { return m_window; }
SpectrumDrawer* kivspectrum::GetSpectrumDrawer() const { return m_drawer.get(); }
Tuner* kivspectrum::GetTuner() const { return m_tuner.get(); }
Corvo::Sonogram* kivspectrum::GetSonogram() const { return m_sonogram.get(); }

void kivspectrum::peak_reset() {
    const Lock instanceLock(m_instanceLock);
    m_drawer->peak_reset();
}

void kivspectrum::SetOn(bool on) {
    m_on = on;
    m_drawer->SetOn(on);
}
bool kivspectrum::GetOn() const { return m_on; }

void kivspectrum::SetTunerOn(bool on) {
    if (on) m_tuner->Forget();
    m_tunerOn = on;
    m_tunerVisible = on;
}
bool kivspectrum::GetTunerOn() const { return m_tunerOn; }

void kivspectrum::ToggleTuner() {
    const Lock classLock(Corvo::AnalyserLock());
    if (m_tunerOn && m_on) {
        SetTunerOn(false);
        return;
    }
    SetTunerOn(true);
    SetOn(true);
    m_frozen = false;
    allocate(1);
    init();
}

void kivspectrum::SetFrozen(bool frozen) {
    const Lock classLock(Corvo::AnalyserLock());
    if (m_frozen.exchange(frozen) && !frozen) allocate(1);
}
bool kivspectrum::GetFrozen() const { return m_frozen; }

void kivspectrum::ToggleDisplayMode() {
    const Lock classLock(Corvo::AnalyserLock());
    const auto next = static_cast<_display_mode>((m_displayMode + 1) % (display_tuner + 1));
    m_displayMode = next;
    m_showSonogram = next == display_sonogram || next == display_both;
}

void kivspectrum::ToggleDisplayMode2() { ShowSonogram(!m_showSonogram); }

kivspectrum::_display_mode kivspectrum::GetDisplayMode() const { return m_displayMode; }

// The mode follows: a sonogram joins the spectrum, and the spectrum stays when it leaves.
void kivspectrum::ShowSonogram(bool show) {
    const Lock classLock(Corvo::AnalyserLock());
    m_showSonogram = show;
    const _display_mode mode = m_displayMode;
    if (show && mode == display_spectrum) m_displayMode = display_both;
    if (!show && (mode == display_sonogram || mode == display_both)) m_displayMode = display_spectrum;
}
bool kivspectrum::IsShowSonogram() const { return m_showSonogram; }

void kivspectrum::ToggleShowInfoBoxes() { SetShowInfoBox(!m_showInfoBox); }
void kivspectrum::SetShowInfoBox(bool show) { m_showInfoBox = show; }
bool kivspectrum::IsShowInfoBox() const { return m_showInfoBox; }

kivspectrum::spectrum_settings kivspectrum::GetSettings() {
    const Lock classLock(Corvo::AnalyserLock());
    return settings;
}

void kivspectrum::SetPointer(float x, float y) {
    m_pointerX = x;
    m_pointerY = y;
}
void kivspectrum::ClearPointer() { SetPointer(kNowhere, kNowhere); }
