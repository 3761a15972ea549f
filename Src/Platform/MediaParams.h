#pragma once

// MP_PARAMINFO and MP_ENVELOPE_SEGMENT: the media-parameter records that describe an effect's
// parameters and its automation.
#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
// medparam.h needs the types of windows.h, hence the gap.

#include <medparam.h>
#else
#include <cstdint>

// What kind of control a parameter is: an amount, a switch, or one of several choices.
enum MP_TYPE : std::uint32_t { MPT_INT = 0, MPT_FLOAT = 1, MPT_BOOL = 2, MPT_ENUM = 3 };
using MP_CAPS = std::uint32_t;  // curves that a parameter can be moved along, a bit each
using MP_DATA = float;          // a plain or normalised value
// How a segment leads from its first value to its last; only jumps are played here.
enum MP_CURVE_TYPE : std::uint32_t {
    MP_CURVE_JUMP = 1,
    MP_CURVE_LINEAR = 2,
    MP_CURVE_SQUARE = 4,
    MP_CURVE_INVSQUARE = 8,
    MP_CURVE_SINE = 16,
};
using MP_FLAGS = std::uint32_t;  // of a segment

// One parameter of an effect.
struct _MP_PARAMINFO {
    MP_TYPE mpType;           // what kind of control it is
    MP_CAPS mopCaps;          // curves it can be moved along
    MP_DATA mpdMinValue;      // plain value at 0
    MP_DATA mpdMaxValue;      // plain value at 1
    MP_DATA mpdNeutralValue;  // plain value where a control rests
    wchar_t szUnitText[32];   // may be empty; ends with a zero
    wchar_t szLabel[32];      // with the side, " L" or " R", where there are two; ends with a zero
};
using MP_PARAMINFO = _MP_PARAMINFO;  // the name that other code uses

// One step of a parameter's automation; see CorvoEffectBase::AddEnvelope.
struct MP_ENVELOPE_SEGMENT {
    std::int64_t rtStart;  // when it begins, in the host's units of stream position
    std::int64_t rtEnd;    // when it ends; not read while it is played
    MP_DATA valStart;      // the normalised value from rtStart on
    MP_DATA valEnd;        // not read
    MP_CURVE_TYPE iCurve;  // not read
    MP_FLAGS flags;        // not read
};
#endif

static_assert(sizeof(MP_PARAMINFO) == 20 + 64 * sizeof(wchar_t));
static_assert(sizeof(MP_ENVELOPE_SEGMENT) == 32);
