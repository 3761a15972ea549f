#pragma once

#include <vector>

#include "Picture/Geometry.h"
#include "Platform/CriticalSection.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/kivspectrum.h"

// What the views need of an analyser beside its public operations. Only this file knows where it is kept.
struct kivspectrum::ViewAccess {
    // Held while what the display thread prepares is drawn.
    static Corvo::CriticalSection& Lock(kivspectrum& a) { return a.m_instanceLock; }
    static Corvo::PointF Pointer(const kivspectrum& a) { return {a.m_pointerX, a.m_pointerY}; }
    static int SamplingRate(const kivspectrum& a) { return a.m_samplingRate; }
    static bool IsTunerVisible(const kivspectrum& a) { return a.m_tunerVisible; }
    // Memory that one picture leaves to the next.
    static std::vector<Corvo::PointF>& Outline(kivspectrum& a) { return a.m_outline; }
};

struct Corvo::Sonogram::ViewAccess {
    static std::vector<PointF>& Trace(Sonogram& sonogram) { return sonogram.m_trace; }
};
