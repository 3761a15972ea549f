#pragma once

namespace Plain {

// The gain effect on a stereo block, one frame after the other, as its definition reads.
template <typename Sample>
void Gain(Sample* samples, int frames, Sample side, Sample mid, Sample left, Sample right) {
    for (; frames > 0; --frames, samples += 2) {
        const Sample l = samples[0], r = samples[1];
        samples[0] = ((l - r) * side + (l + r) * mid) * Sample(0.5) * left;
        samples[1] = ((l + r) * mid - (l - r) * side) * Sample(0.5) * right;
    }
}

}  // namespace Plain
