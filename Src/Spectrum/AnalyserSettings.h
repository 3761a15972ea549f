#pragma once

#include "Platform/CriticalSection.h"
#include "Spectrum/Scales/SpectrumSettings.h"

namespace Corvo {

// The lock in front of all analysers: settings, menu commands and the list of live analysers. Whoever needs
// it together with an analyser's own lock takes it first.
CriticalSection& AnalyserLock();

// Where one field of the settings follows from others.

// Stores the overlap, 1 and more (and what is not a number) as 0.99, and the hop length that follows from it.
void StoreOverlap(SpectrumSettings& settings, float overlap);
// The hop follows; a negative overlap leaves it as it is.
void StoreWindowLength(SpectrumSettings& settings, int length);
// The transform is never shorter than the window.
void FitTransform(SpectrumSettings& settings);

}  // namespace Corvo
