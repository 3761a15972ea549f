#pragma once

// MP_PARAMINFO and MP_ENVELOPE_SEGMENT: the media-parameter records that describe an effect's
// parameters and its automation.
#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
// medparam.h needs the types of windows.h, hence the gap.

#include <medparam.h>
#else
#include <cstdint>

enum MP_TYPE : std::uint32_t { MPT_INT = 0, MPT_FLOAT = 1, MPT_BOOL = 2, MPT_ENUM = 3 };
using MP_CAPS = std::uint32_t;
using MP_DATA = float;
enum MP_CURVE_TYPE : std::uint32_t {
    MP_CURVE_JUMP = 1,
    MP_CURVE_LINEAR = 2,
    MP_CURVE_SQUARE = 4,
    MP_CURVE_INVSQUARE = 8,
    MP_CURVE_SINE = 16,
};
using MP_FLAGS = std::uint32_t;

struct _MP_PARAMINFO {
    MP_TYPE mpType;
    MP_CAPS mopCaps;
    MP_DATA mpdMinValue;
    MP_DATA mpdMaxValue;
    MP_DATA mpdNeutralValue;
    wchar_t szUnitText[32];
    wchar_t szLabel[32];
};
using MP_PARAMINFO = _MP_PARAMINFO;

struct MP_ENVELOPE_SEGMENT {
    std::int64_t rtStart;
    std::int64_t rtEnd;
    MP_DATA valStart;
    MP_DATA valEnd;
    MP_CURVE_TYPE iCurve;
    MP_FLAGS flags;
};
#endif

static_assert(sizeof(MP_PARAMINFO) == 20 + 64 * sizeof(wchar_t));
static_assert(sizeof(MP_ENVELOPE_SEGMENT) == 32);
