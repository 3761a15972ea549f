#pragma once

#include <array>
#include <cstdint>

#include "DSP/Equalizer/BiquadDesign.h"
#include "DSP/Equalizer/BuiltinEffectsData.h"

namespace Corvo::DSP {

// One second-order section of a channel, in direct form II.
struct EqBand {
    std::int32_t active = 0;
    coeff<ManagedCoefficient> _eq_coeffs;
    double w1 = 0.0, w2 = 0.0;  // the most recent internal value, and the one before

    template <typename Call>
    void ForEachCoefficient(Call&& call) {
        for (auto* c : {&_eq_coeffs.a1, &_eq_coeffs.a2, &_eq_coeffs.b0, &_eq_coeffs.b1, &_eq_coeffs.b2})
            call(*c);
    }
    // How many of its coefficients are on the move.
    int Moving() const {
        const auto& c = _eq_coeffs;
        return c.a1.moving + c.a2.moving + c.b0.moving + c.b1.moving + c.b2.moving;
    }
};

using EqBands = std::array<EqBand, builtin_effects_data::kMaxBands>;

}  // namespace Corvo::DSP
