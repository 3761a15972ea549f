#pragma once

#include "Platform/CriticalSection.h"

namespace Corvo {

// The lock in front of all analysers: settings, menu commands and the list of live analysers. Whoever needs
// it together with an analyser's own lock takes it first.
CriticalSection& AnalyserLock();

}  // namespace Corvo
