#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <iterator>
#include <string_view>

#include "Platform/MediaParams.h"

namespace Corvo::DSP {

// One parameter's description with its texts cut to the record's fields.
inline MP_PARAMINFO MakeParamInfo(std::wstring_view label, std::wstring_view unit, MP_TYPE type, MP_CAPS caps,
                                  float minimum, float maximum, float neutral) {
    MP_PARAMINFO info{};
    info.mpType = type;
    info.mopCaps = caps;
    info.mpdMinValue = minimum;
    info.mpdMaxValue = maximum;
    info.mpdNeutralValue = neutral;
    std::ranges::copy(unit.substr(0, std::size(info.szUnitText) - 1), info.szUnitText);
    std::ranges::copy(label.substr(0, std::size(info.szLabel) - 1), info.szLabel);
    return info;
}

// The records of a whole table of rows, each with a `label`, a `unit` and a `type`, for effects that
// exchange normalised values: range 0..1, neutral 0.5. Kept in a function's static by the caller.
template <typename Row, std::size_t N>
std::array<MP_PARAMINFO, N> MakeNormalisedTable(const std::array<Row, N>& rows, MP_CAPS caps) {
    std::array<MP_PARAMINFO, N> records;
    std::ranges::transform(rows, records.begin(), [caps](const Row& row) {
        return MakeParamInfo(row.label, row.unit, row.type, caps, 0.0f, 1.0f, 0.5f);
    });
    return records;
}

}  // namespace Corvo::DSP
