#pragma once

#include <mutex>
#include <vector>

#include "Picture/Geometry.h"
#include "Spectrum/Analyser.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/kivspectrum.h"

// What the views need of an analyser beside its public operations. Only this file knows where it is kept.
namespace Corvo {

struct ViewAccess {
    // Held while what the display thread prepares is drawn.
    static CriticalSection& Lock(const kivspectrum& a) { return a.m_analyser->GetLock(); }
    static PointF Pointer(const kivspectrum& a) {
        const AnalyserState& state = a.m_analyser->state;
        return {state.pointerX, state.pointerY};
    }
    // With the lock.
    static ShownPlots& Shown(const kivspectrum& a) { return a.m_analyser->shown; }
    static const FrequencySpan& Span(const kivspectrum& a) { return a.m_analyser->span; }
    static const AnalyserReading& Marker(const kivspectrum& a) { return a.m_analyser->marker; }
    static double SonogramSeconds(const kivspectrum& a) { return a.m_analyser->SonogramSeconds(); }
    static AnalyserReading PointedAt(const kivspectrum& a) { return a.m_analyser->ReadingAt(Pointer(a)); }
    static void ForgetPlots(const kivspectrum& a) {
        const std::lock_guard lock(Lock(a));
        a.m_analyser->shown = {};
    }
    static int SamplingRate(const kivspectrum& a) { return a.m_analyser->state.samplingRate; }
    static bool IsTunerVisible(const kivspectrum& a) { return a.m_analyser->state.tunerVisible; }
    // Memory that one picture leaves to the next.
    static std::vector<PointF>& Outline(kivspectrum& a) { return a.m_outline; }
    static std::vector<PointF>& Trace(Sonogram& sonogram) { return sonogram.m_trace; }
};

}  // namespace Corvo
