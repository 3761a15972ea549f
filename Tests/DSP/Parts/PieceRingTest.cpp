#include "DSP/Parts/PieceRing.h"

#include <gtest/gtest.h>

#include <limits>
#include <vector>

#include "Support/Signals.h"

using namespace Corvo::DSP;

// Catches memory that is heard before anything was written there, at first and after clearing, and pieces
// that run over the ring's end.
TEST(PieceRing, DelaysOnWhateverMemoryItFinds) {
    using Ring = PieceRing<float>;
    TestSupport::Random random;
    for (const int length : {64, 65, 127, 200, 1000}) {
        std::vector<float> cells(static_cast<std::size_t>(Ring::Cells(length)),
                                 std::numeric_limits<float>::quiet_NaN());
        auto others = cells;
        Ring pushed, taken;  // one is read where the reader likes, the other where it is written
        pushed.Use(cells.data());
        taken.Use(others.data());
        pushed.SetLength(length);
        taken.SetLength(length);
        std::vector<float> all;
        const auto ago = [&](std::size_t now, int delay) {
            return now < static_cast<std::size_t>(delay) ? 0.0f : all[now - static_cast<std::size_t>(delay)];
        };
        for (int piece = 0; piece < 300; ++piece) {
            if (piece % 97 == 41) {
                pushed.Clear();
                taken.Clear();
                all.clear();
            }
            const int count = 1 + random.Below(Ring::kPiece);
            const auto samples =
                TestSupport::Noise<float>(static_cast<std::size_t>(count), 1.0, random.Next());
            const std::size_t before = all.size();
            all.insert(all.end(), samples.begin(), samples.end());

            pushed.Push(samples.data(), count);
            const int delay = count + random.Below(length - count + 1);
            const float* const read = pushed.Before(delay, count);
            float* const oldest = taken.MakeReady(count);
            for (int i = 0; i < count; ++i) {
                const auto at = static_cast<std::size_t>(i);
                ASSERT_EQ(read[i], ago(all.size() + at, delay)) << length << ", piece " << piece;
                ASSERT_EQ(oldest[i], ago(before + at, length)) << length << ", piece " << piece;
                oldest[i] = samples[at];
            }
            taken.Advance(count);
        }
    }
}
