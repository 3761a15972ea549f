#pragma once

#include <cstddef>
#include <span>
#include <vector>

namespace Corvo {

// The running floor of a power spectrum: the level of the noise between its peaks.
//
// In each of some thirty blocks that widen with frequency the floor is taken from a low quantile, which peaks
// do not reach as long as they leave a quarter of the block free; between the blocks' middles it is
// interpolated. White noise of mean power p per bin gives p.
class SpectrumFloor {
public:
    // `stretch` is the number of bins that one bin of the window covers. Allocates.
    void Prepare(std::size_t bins, double stretch);
    // Writes the floor of every bin. Both spans have the length prepared for.
    void Measure(std::span<const float> power, std::span<float> floor);

private:
    struct Block {
        std::size_t first, count, step;  // samples of the spectrum
        float middle;
    };
    std::vector<Block> m_blocks;
    std::vector<float> m_samples;
    std::vector<float> m_levels;
};

}  // namespace Corvo
