#pragma once

// <gdiplus.h> with what it expects to stand before it.
#include <algorithm>

#include "Platform/WindowsHeader.h"

#include <objidl.h>

namespace Gdiplus {
using std::max;  // for the macros that WindowsHeader.h does without
using std::min;
}  // namespace Gdiplus

#include <gdiplus.h>
