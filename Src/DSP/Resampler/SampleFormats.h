#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "Platform/Export.h"

// Tags that tell the converter how one sample of a stream is read and written. Samples are little-endian
// and may start at any address. Any thread; a sample takes about 1 ns, and no memory.

// Reading gives full scale as -1..1. Writing integers truncates towards zero and clips to the format's
// range; NaN is written as 0.
template <int Bits>
struct IntegerSample {
    static constexpr int kBytes = Bits / 8;                                 // of one sample
    static constexpr double kScale = static_cast<double>(1 << (Bits - 1));  // steps from 0 to full scale

    // One sample at any address.
    static double Read(const char* sample) {
        std::uint32_t word = 0;
        for (int i = 0; i < kBytes; ++i)
            word |= static_cast<std::uint32_t>(static_cast<unsigned char>(sample[i])) << (32 - Bits + 8 * i);
        // Sits at the top of the word, so that its sign is the word's.
        return static_cast<std::int32_t>(word) * (1.0 / 2147483648.0);
    }
    // To any address.
    static void Write(double value, char* sample) {
        const double scaled = std::isnan(value) ? 0.0 : std::clamp(value * kScale, -kScale, kScale - 1.0);
        const auto word = static_cast<std::uint32_t>(static_cast<std::int32_t>(scaled));
        for (int i = 0; i < kBytes; ++i) sample[i] = static_cast<char>(word >> (8 * i) & 0xFF);
    }
};

// Full scale is -1..1; nothing is clipped.
template <typename Float>
struct FloatSample {
    using Value = Float;                          // how a sample is stored
    static constexpr int kBytes = sizeof(Float);  // of one sample

    // One sample at any address.
    static double Read(const char* sample) {
        Float value;
        std::memcpy(&value, sample, sizeof(value));
        return value;
    }
    // To any address, rounded to the nearest.
    static void Write(double value, char* sample) {
        const auto rounded = static_cast<Float>(value);
        std::memcpy(sample, &rounded, sizeof(rounded));
    }
};

// What the converter reads ...
struct DSP_API tipo_16bit : IntegerSample<16> {};
struct DSP_API tipo_24bit : IntegerSample<24> {};
struct DSP_API tipo_floatbit : FloatSample<float> {};
struct DSP_API tipo_doublebit : FloatSample<double> {};

// ... and what it writes.
struct DSP_API tipo_16bit_outd : IntegerSample<16> {};
struct DSP_API tipo_24bit_outd : IntegerSample<24> {};
struct DSP_API tipo_floatbit_outd : FloatSample<float> {};
struct DSP_API tipo_doublebit_outd : FloatSample<double> {};
