#include <gtest/gtest.h>

#include "DSP/Effects/Chorus/Chorus.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Effects/Tremolo/Autovol.h"
#include "Support/EffectRun.h"

using namespace Corvo::DSP;
using TestSupport::Chunk;

namespace {

using Bytes = std::vector<std::uint8_t>;

// The word w of a chunk is w - 3, in so many bytes; the upper ones do not count.
Bytes CountingChunk(std::size_t words, std::size_t width) {
    Bytes chunk(4 + words * width, 0xEE);
    for (std::size_t at = 0; at < 4; ++at) chunk[at] = static_cast<std::uint8_t>(at);
    for (std::size_t word = 0; word < words; ++word)
        for (std::size_t at = 0; at < 4; ++at)
            chunk[4 + word * width + at] =
                static_cast<std::uint8_t>((static_cast<std::uint32_t>(word) - 3) >> (8 * at));
    return chunk;
}

// Words of today and of the older layout; the word of each real parameter.
template <typename Effect>
void ExpectLayouts(std::size_t words, std::size_t oldWords, const std::vector<int>& places) {
    const auto today = CountingChunk(words, 4), old = CountingChunk(oldWords, 8);
    Effect fromToday, fromOld;
    SCOPED_TRACE(fromToday.GetName());
    const auto fresh = Chunk(fromOld);
    EXPECT_FALSE(fromOld.FitsOldChunk({old.begin(), old.end() - 1}));
    EXPECT_EQ(Chunk(fromOld), fresh) << "a byte is missing";

    fromToday.SetSettingsChunk(today);
    EXPECT_EQ(Chunk(fromToday), today);
    EXPECT_TRUE(fromOld.FitsOldChunk(old));
    auto expected = today;
    std::fill(expected.begin() + static_cast<std::ptrdiff_t>(4 + 4 * oldWords), expected.end(),
              std::uint8_t{0});
    EXPECT_EQ(Chunk(fromOld), expected);
    for (int index = 0; index < fromToday.GetParamCountReal(); ++index)
        EXPECT_EQ(fromToday.GetParamPlain(index),
                  static_cast<float>(places[static_cast<std::size_t>(index)] - 3))
            << "parameter " << index;
}

}  // namespace

// Catches words of the layouts in the wrong places, and chunks that are half loaded.
TEST(WordChunk, HasItsWordsInTheirPlaces) {
    ExpectLayouts<Autovol>(22, 22, {0, 1, 4, 5, 2, 3, 18, 19, 8, 9});
    ExpectLayouts<Chorus>(22, 22, {2, 3, 0, 1, 8, 9, 4, 5, 6, 7});
    ExpectLayouts<Echo>(24, 22, {4, 5, 22, 23, 0, 1, 6, 7, 2, 3, 18, 19});
    ExpectLayouts<Reverb>(18, 18, {0, 1, 2, 3, 4, 5, 10, 11, 12, 13, 14, 15, 6, 7, 8, 9});
}
