#pragma once

#include <cmath>

#include "DSP/Equalizer/BiquadDesign.h"

namespace Corvo::DSP {

// A designed section, before its coefficients are handed to their parameters.
struct BiquadSection {
    double b0, b1, b2, a1, a2;

    // Finite, and with no pole outside the unit circle.
    bool IsUsable() const {
        return std::isfinite(b0) && std::isfinite(b1) && std::isfinite(b2) && std::abs(a2) <= 1.0 &&
               std::abs(a1) <= 1.0 + a2;
    }
    template <typename Parameter>
    void HandTo(coeff<Parameter>& coefficients, bool immediate) const {
        const auto hand = [immediate](Parameter& parameter, double target) {
            parameter.SetTarget(target);
            if (immediate) parameter.Jump();
        };
        hand(coefficients.b0, b0);
        hand(coefficients.b1, b1);
        hand(coefficients.b2, b2);
        hand(coefficients.a1, a1);
        hand(coefficients.a2, a2);
    }
};

BiquadSection DesignBiquad(EQFilterType type, double gain, double freq, double Q, double rate);

}  // namespace Corvo::DSP
