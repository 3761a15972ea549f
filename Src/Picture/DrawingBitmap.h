#pragma once

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace Corvo {

// A picture in memory that any back-end can draw.
//
// One 32-bit word per pixel, 0xAARRGGBB in the machine's byte order with the colours already multiplied by
// the alpha; rows from the top down, none padded. Whoever changes pixels calls Changed(), so that
// a back-end which keeps a copy of its own knows when it is stale. No locks: one thread at a time.
struct DrawingBitmap {
    // 256 MiB, more than any screen: what a request beyond it is cut to.
    static constexpr int kLargestSide = 16384, kMostPixels = 1 << 26;

    int width = 0, height = 0;          // pixels, as Size made them
    std::vector<std::uint32_t> pixels;  // width * height
    bool opaque = false;                // the top byte is no alpha and may hold anything
    std::uint32_t version = 0;          // another one after every Changed()

    // The pixels' values are then unspecified, unless the size is what it was. Memory grows where it must and
    // is kept when the picture shrinks. Negative sides count as 0; rows that the limits leave no room for are
    // missing at the bottom.
    void Size(int newWidth, int newHeight) {
        newWidth = LimitedWidth(newWidth);
        newHeight = LimitedHeight(newWidth, newHeight);
        if (newWidth == width && newHeight == height) return;
        pixels.resize(static_cast<std::size_t>(newWidth) * static_cast<std::size_t>(newHeight));
        width = newWidth;
        height = newHeight;
        Changed();
    }

    // What Size makes of a wish.
    static constexpr int LimitedWidth(int width) { return std::clamp(width, 0, kLargestSide); }
    static constexpr int LimitedHeight(int width, int height) {
        return std::clamp(height, 0, std::min(kLargestSide, kMostPixels / std::max(LimitedWidth(width), 1)));
    }

    // No two states of any bitmaps get the same number.
    void Changed() {
        static std::atomic<std::uint32_t> latest{0};
        version = latest.fetch_add(1, std::memory_order_relaxed) + 1;
    }

    // Whether there is no pixel.
    bool IsEmpty() const { return pixels.empty(); }
    // The first pixel of row `y`, 0..height - 1; not checked.
    std::uint32_t* Row(int y) {
        return pixels.data() + static_cast<std::ptrdiff_t>(y) * static_cast<std::ptrdiff_t>(width);
    }
    // The same.
    const std::uint32_t* Row(int y) const {
        return pixels.data() + static_cast<std::ptrdiff_t>(y) * static_cast<std::ptrdiff_t>(width);
    }
};

}  // namespace Corvo
