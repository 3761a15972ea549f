#include <gtest/gtest.h>

#include <bit>
#include <cstdint>
#include <vector>

#include "Platform/Processor.h"
#include "Spectrum/Scales/DecibelKernel.h"

// Of every length and of every kind of float: zeros, denormals, infinities and what is no number among them.
TEST(DecibelKernel, GivesTheSameBitsInRegistersOfEveryWidth) {
    if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    std::vector<float> powers;
    for (std::uint64_t bits = 0; bits < (1ull << 32); bits += 3000017)
        powers.push_back(std::bit_cast<float>(static_cast<std::uint32_t>(bits)));
    const auto levels = [&](auto convert, std::size_t count) {
        std::vector<float> result(count);
        convert(powers.data() + powers.size() - count, result.data(), count, 1.5f);
        return result;
    };
    for (std::size_t count = powers.size() - 17; count <= powers.size(); ++count)
        ASSERT_EQ(levels(Corvo::PowerToDecibelsBaseline, count), levels(Corvo::PowerToDecibelsAvx2, count));
}
