#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <numbers>
#include <vector>

namespace Plain {

// The converter's low-pass as five biquads in a row, in a precision that makes it exact for a double.
template <typename Real>
class ButterworthCascade {
public:
    // `cutoff` as a fraction of the rate the filter runs at.
    explicit ButterworthCascade(Real cutoff) {
        const Real pi = std::numbers::pi_v<Real>, r = 2 * std::tan(pi * cutoff);
        for (std::size_t k = 0; k < m_sections.size(); ++k) {
            // The pole pair r e^(+-i angle) under s = 2 (z - 1) / (z + 1).
            const Real c = std::cos((static_cast<Real>(k) + Real(5.5)) * pi / 10);
            const Real lead = 4 - 4 * r * c + r * r;
            m_sections[k] = {r * r / lead, 2 * (r * r - 4) / lead, (4 + 4 * r * c + r * r) / lead};
        }
    }
    Real operator()(Real x) {
        for (auto& s : m_sections) {
            const Real y = s.b * x + s.first;
            s.first = 2 * s.b * x - s.a1 * y + s.second;
            s.second = s.b * x - s.a2 * y;
            x = y;
        }
        return x;
    }

private:
    struct Section {
        Real b, a1, a2, first = 0, second = 0;
    };
    std::array<Section, 5> m_sections;
};

// Zeros in, filter, every M-th sample kept.
inline std::vector<double> Convert(const std::vector<double>& input, int up, int down) {
    ButterworthCascade<long double> filter(0.455 * std::min(1.0 / up, 1.0 / down));
    std::vector<double> output;
    int untilRead = 0;
    for (const double sample : input)
        for (int j = 0; j < up; ++j) {
            const long double y = filter(j == 0 ? sample : 0.0);
            if (untilRead == 0) output.push_back(static_cast<double>(up * y));
            untilRead = untilRead == 0 ? down - 1 : untilRead - 1;
        }
    return output;
}

}  // namespace Plain
