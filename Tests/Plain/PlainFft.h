#pragma once

#include <complex>
#include <cstddef>
#include <numbers>
#include <vector>

namespace Plain {

// The discrete Fourier transform by the textbook's halving, in long double.
inline std::vector<std::complex<long double>> Fft(const std::vector<std::complex<long double>>& x) {
    if (x.size() == 1) return x;
    std::vector<std::complex<long double>> halves[2], out;
    for (std::size_t i = 0; i < x.size(); ++i) halves[i % 2].push_back(x[i]);
    const auto even = Fft(halves[0]), odd = Fft(halves[1]);
    const long double turn = -2 * std::numbers::pi_v<long double> / static_cast<long double>(x.size());
    for (std::size_t k = 0; k < x.size(); ++k)
        out.push_back(even[k % even.size()] +
                      std::polar<long double>(1, turn * static_cast<long double>(k)) * odd[k % odd.size()]);
    return out;
}

}  // namespace Plain
