#include <gtest/gtest.h>

#include <bit>
#include <cstdint>

#include "DSP/Effects/Phaser/PhaserKernel.h"

using Corvo::DSP::PhaserKernel::Pair;

// Catches a sum that is taken for a float's value where a conversion gives another one: half way between two
// floats, near the ends of their range, infinite, no number. Ordinary numbers must not be in doubt.
TEST(PhaserRounding, IsSureOnlyOfWhatAConversionGives) {
    Corvo::DSP::PhaserKernel::RoundedByConversion<float> convert;
    const auto first = [](Pair value) {
        alignas(Pair) double lanes[2];
        value.store_aligned(lanes);
        return std::bit_cast<std::uint64_t>(lanes[0]);
    };
    int sure = 0;
    for (std::uint64_t upper = 0; upper < (1u << 16); ++upper)
        for (const std::uint64_t lower : {0x0ull, 0xFFFF'DFFF'FFFFull, 0xABCD'1000'0000ull,
                                          0x1234'3000'0000ull, 0x1234'5678'9ABCull, 0xFFFF'FFFF'FFFFull}) {
            const Pair value{std::bit_cast<double>(upper << 48 | lower), 1.5};
            Corvo::DSP::PhaserKernel::RoundedBySum add;
            const auto sum = first(add(value));
            if (!add.WereAllSure()) continue;
            ++sure;
            ASSERT_EQ(sum, first(convert(value))) << std::hex << upper << ' ' << lower;
        }
    EXPECT_GT(sure, 30000);
}
