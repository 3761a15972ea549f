#pragma once

#include <algorithm>

namespace Corvo {

// The size that images kept for drawing have, so that they are made anew only when that pays.
class ImageSize {
public:
    static constexpr int kLargest = 1024;  // no panel is larger; more would only cost memory
    // In pictures. Where a small panel and a large one are drawn in turn, the large one's images serve both.
    static constexpr int kPatience = 60;

    // Calls make(size), within 1..kLargest, when there are no images, or not large enough ones, or ones that
    // were more than twice as large as needed for kPatience pictures on end. Should it throw, there are none.
    template <typename Make>
    void Provide(int needed, Make make) {
        const int size = std::clamp(needed, 1, kLargest);
        m_tooLarge = 2 * size < m_made ? m_tooLarge + 1 : 0;
        if (size <= m_made && m_tooLarge < kPatience) return;
        Forget();
        make(size);
        m_made = size;
    }
    void Forget() { m_made = m_tooLarge = 0; }

private:
    int m_made = 0;  // 0: none
    int m_tooLarge = 0;
};

}  // namespace Corvo
