#pragma once

#include "C/dspdll.h"
#include "Platform/Export.h"

class kivspectrum;

namespace Corvo::C {

// The analyser behind a handle of the C interface, for hosts that use both interfaces; it stays the handle's.
// Any thread, at no cost; the status is as for every handle.
DSP_API dsp_status AnalyserBehind(dsp_analyser* handle, kivspectrum*& analyser);

}  // namespace Corvo::C
