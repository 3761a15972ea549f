#pragma once

#include <cmath>
#include <complex>
#include <cstddef>
#include <numbers>
#include <vector>

namespace Plain {

// The discrete Fourier transform by the textbook's halving, in long double.
inline std::vector<std::complex<long double>> Fft(const std::vector<std::complex<long double>>& x) {
    const std::size_t n = x.size();
    if (n == 1) return x;
    std::vector<std::complex<long double>> even(n / 2), odd(n / 2), out(n);
    for (std::size_t i = 0; i < n / 2; ++i) {
        even[i] = x[2 * i];
        odd[i] = x[2 * i + 1];
    }
    even = Fft(even);
    odd = Fft(odd);
    for (std::size_t k = 0; k < n / 2; ++k) {
        const long double angle =
            -2 * std::numbers::pi_v<long double> * static_cast<long double>(k) / static_cast<long double>(n);
        const auto turned = odd[k] * std::complex<long double>(std::cos(angle), std::sin(angle));
        out[k] = even[k] + turned;
        out[k + n / 2] = even[k] - turned;
    }
    return out;
}

}  // namespace Plain
