#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

namespace Corvo {

// The levels of one spectrum at the height of the picture, in dB below full scale, the highest frequency
// first.
class SonogramColumn {
public:
    // All rows at `level`. Allocates only when it was never that high before.
    void Fill(int height, float level) { m_levels.assign(static_cast<std::size_t>(height), level); }

    int Height() const { return static_cast<int>(m_levels.size()); }
    float* Levels() { return m_levels.data(); }
    const float* Levels() const { return m_levels.data(); }

private:
    std::vector<float> m_levels;
};

}  // namespace Corvo
