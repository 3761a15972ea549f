#pragma once

#include <cstddef>
#include <xsimd/xsimd.hpp>

namespace Corvo::DSP::GainEfx {

// The gain effect's arithmetic on one stereo frame:
//   L' = ((L - R) * side + (L + R) * mid) * 0.5 * left,  R' = ((L + R) * mid - (L - R) * side) * 0.5 * right.
template <typename Sample>
struct Coefficients {
    Sample side, mid, left, right;

    void Apply(Sample& l, Sample& r) const {
        const Sample difference = (l - r) * side, sum = (l + r) * mid;
        l = (difference + sum) * Sample(0.5) * left;
        r = (sum - difference) * Sample(0.5) * right;
    }
};

// Whole frames side by side in one register, left in the even lanes. Both lanes of a frame compute L - R, and
// the right one multiplies it by -side: every sample has the bits of the plain form, signed zeros included.
template <typename Sample>
class InterleavedFrames {
public:
    using Batch = xsimd::batch<Sample>;

    explicit InterleavedFrames(const Coefficients<Sample>& c)
        : m_side(EvenOdd(c.side, -c.side)),
          m_mid(c.mid),
          m_gain(EvenOdd(c.left, c.right)),
          m_rightSign(EvenOdd(Sample(0.0), Sample(-0.0))) {}

    Batch operator()(const Batch& x) const {
        const Batch y = x ^ m_rightSign;  // L, -R
        return ((y + Swapped(y)) * m_side + (x + Swapped(x)) * m_mid) * Batch(Sample(0.5)) * m_gain;
    }

private:
    using Index = xsimd::batch<xsimd::as_unsigned_integer_t<Sample>>;
    struct Neighbour {
        static constexpr std::size_t get(std::size_t lane, std::size_t) { return lane ^ 1; }
    };
    struct Even {
        static constexpr bool get(std::size_t lane, std::size_t) { return lane % 2 == 0; }
    };
    static Batch Swapped(const Batch& x) {
        return xsimd::swizzle(x, xsimd::make_batch_constant<Index, Neighbour>());
    }
    static Batch EvenOdd(Sample even, Sample odd) {
        const typename Batch::batch_bool_type lanes = xsimd::make_batch_bool_constant<Batch, Even>();
        return xsimd::select(lanes, Batch(even), Batch(odd));
    }

    Batch m_side, m_mid, m_gain, m_rightSign;
};

template <typename Sample>
void ScaleStereo(Sample* samples, int frames, const Coefficients<Sample>& c) {
    const InterleavedFrames<Sample> apply(c);
    using Batch = xsimd::batch<Sample>;
    const std::size_t count = 2 * static_cast<std::size_t>(frames);
    std::size_t i = 0;
    for (; i + Batch::size <= count; i += Batch::size)
        apply(Batch::load_unaligned(samples + i)).store_unaligned(samples + i);
    for (; i < count; i += 2) c.Apply(samples[i], samples[i + 1]);
}

template <typename Sample>
void ScaleStereoPlanar(Sample* left, Sample* right, int frames, const Coefficients<Sample>& c) {
    using Batch = xsimd::batch<Sample>;
    const Coefficients<Batch> wide{c.side, c.mid, c.left, c.right};
    const auto count = static_cast<std::size_t>(frames);
    std::size_t i = 0;
    for (; i + Batch::size <= count; i += Batch::size) {
        Batch l = Batch::load_unaligned(left + i), r = Batch::load_unaligned(right + i);
        wide.Apply(l, r);
        l.store_unaligned(left + i);
        r.store_unaligned(right + i);
    }
    for (; i < count; ++i) c.Apply(left[i], right[i]);
}

}  // namespace Corvo::DSP::GainEfx
