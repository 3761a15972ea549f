#include "DSP/Resampler/PolePairKernel.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <utility>
#include <vector>

#include "Platform/Processor.h"
#include "Support/Signals.h"

// Up and down, with less room at a time than one sample may fill.
TEST(PolePairKernel, GivesTheSameBitsInRegistersOfEveryWidth) {
    if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    auto input = TestSupport::Noise<double>(2 * 300);
    std::fill_n(input.begin() + 100, 50, -0.0);
    const auto outputs = [&](PolePairs::Kernel run, int up, int down) {
        const PolePairLowPass filter(up, 0.455 / std::max(up, down));
        PolePairs::State state;
        std::vector<double> all;
        alignas(16) double in[600], out[2 * 7];
        std::ranges::copy(input, in);
        PolePairs::Stream stream{in, 300, nullptr, 0, up, down, up};
        do {
            stream.out = out;
            stream.room = 7;
            run(filter, state, stream);
            all.insert(all.end(), out, stream.out);
        } while (stream.room == 0);
        return all;
    };
    for (const auto& [up, down] : {std::pair{160, 147}, {2, 1}, {1, 8}, {16, 1}})
        EXPECT_EQ(outputs(PolePairs::RunBaseline, up, down), outputs(PolePairs::RunAvx2, up, down));
}
