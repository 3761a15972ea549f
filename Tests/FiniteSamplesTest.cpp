#include "Platform/FiniteSamples.h"

#include <gtest/gtest.h>

#include <limits>
#include <utility>
#include <vector>

#include "Platform/Processor.h"

template <typename Sample>
class FiniteSamplesTest : public testing::Test {};
using Precisions = testing::Types<float, double>;
TYPED_TEST_SUITE(FiniteSamplesTest, Precisions);

// Catches a lane, a loop or an end that is not looked at, and one that looks past the block: NaN stands
// around it.
TYPED_TEST(FiniteSamplesTest, OneThatIsNotIsSeenAtEveryPlace) {
    using Limits = std::numeric_limits<TypeParam>;
    const TypeParam finite[] = {1, -TypeParam(0), Limits::denorm_min(), Limits::max(), -Limits::max()};
    std::vector<bool (*)(const TypeParam*, std::size_t)> versions{Corvo::AllFiniteBaseline};
    if (Corvo::HasAvx2()) versions.push_back(Corvo::AllFiniteAvx2);
    for (const auto version : versions)
        for (std::size_t count = 0; count <= 70; ++count) {
            std::vector<TypeParam> samples(count + 2, Limits::quiet_NaN());
            TypeParam* const block = samples.data() + 1;
            for (std::size_t i = 0; i < count; ++i) block[i] = finite[i % (count % 2 ? 5 : 3)];
            ASSERT_TRUE(version(block, count)) << count;
            for (std::size_t at = 0; at < count; ++at)
                for (const TypeParam bad : {Limits::infinity(), -Limits::infinity(), Limits::quiet_NaN()}) {
                    const TypeParam good = std::exchange(block[at], bad);
                    ASSERT_FALSE(version(block, count)) << bad << " at " << at << " of " << count;
                    block[at] = good;
                }
        }
}
