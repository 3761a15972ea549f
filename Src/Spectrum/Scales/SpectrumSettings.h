#pragma once

#include <cstddef>
#include <cstdint>

namespace Corvo {

// What an analyser does and how it is shown: 24 fields of 32 bits. Hosts store and restore the record as it
// is. Lengths are in samples. The windows are those of F. J. Harris, "On the Use of Windows for Harmonic
// Analysis with the Discrete Fourier Transform", Proceedings of the IEEE 66 (1978).
struct SpectrumSettings {
    std::int32_t fft_length = 4096;            // of the transform, a power of two from 128 to 524288
    std::int32_t fft_length_auto = 1;          // 1: the transform is as long as the window
    std::int32_t window_length = 4096;         // samples that the window lets through
    std::int32_t hop_length = -1;              // samples between analyses; below 1: one window
    std::int32_t window_type = 4;              // 0 rectangular, 1 triangular, 2 Hann, 3 Hamming, 4 Blackman
    std::int32_t view_option_a = 1;            // frequency scale, see FrequencyScale
    std::int32_t view_option_b = 0;            // level scale, see LevelScale
    std::int32_t peak_decay_mode = 2;          // how long peaks stay: 0 for good, 1 long, 2 medium, 3 short
    std::int32_t view_option_c = 1;            // grid: 0 off, 1 on
    std::int32_t view_option_d = 1;            // vertical range: 0 60 dB, 1 90, 2 120, 3 144
    float gain = 1.0f;                         // scales the drawn amplitude
    std::int32_t view_flag_a = 0;              // for the host: show the two channels' analysers apart
    std::int32_t peak_hold_mode = 1;           // 0 no peaks, 1 peaks fall, 2 they stay until reset
    std::int32_t view_flag_b = 1;              // labels
    std::int32_t view_option_e = 1;            // curve style: 1 line, 2 filled, 3 bars
    std::int32_t view_flag_c = 1;              // info box at the pointer
    float overlap = 0.0f;                      // of successive windows, kept below 1
    std::int32_t reserved_18 = 0;              // kept
    std::int32_t time_smoothing = 1;           // 1: as smoothing_type says; 0: each spectrum as it comes
    bool view_flag_d = false;                  // note names on the frequency axis
    std::uint8_t view_flag_d_rest[3]{};        // kept
    std::int32_t reserved_21 = 1;              // kept
    std::int32_t reserved_22 = 0;              // kept
    std::int32_t smoothing_type = 0;           // 0 exponential, 1 moving filter, 2 none: the curve stands
    std::int32_t smoothing_filter_length = 5;  // spectra that the moving filter averages
};
static_assert(sizeof(SpectrumSettings) == 24 * 4);
static_assert(offsetof(SpectrumSettings, window_type) == 4 * 4 &&
              offsetof(SpectrumSettings, gain) == 10 * 4 && offsetof(SpectrumSettings, overlap) == 16 * 4 &&
              offsetof(SpectrumSettings, view_flag_d) == 19 * 4 &&
              offsetof(SpectrumSettings, smoothing_filter_length) == 23 * 4);

constexpr int kWindowTypes = 5;  // shapes that window_type chooses from

// What an analyser's display shows. The analyser inherits the names.
struct SpectrumDisplay {
    // Curve, sonogram, the curve above the sonogram, tuner.
    enum _display_mode : int { display_spectrum, display_sonogram, display_both, display_tuner };
};
// The same, for everybody else.
using DisplayMode = SpectrumDisplay::_display_mode;

}  // namespace Corvo
