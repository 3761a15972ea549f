#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <limits>

#include "DSP/Parts/SineOscillator.h"

namespace Corvo::DSP::ChorusPrivate {

// The ring that the channels share, sample by sample in turn. Its memory comes as it is: from `written` on it
// counts as silent, and a page of it is touched when the sound gets there.
struct Ring {
    float* samples;
    int length;  // in samples, a whole number of frames and at least one
    int channels;
    int& written;  // samples of it, from the first one on

    // Before one side writes: what the other side will write in between is silent.
    void WriteUpTo(int end) const {
        if (end <= written) return;
        std::fill(samples + written, samples + end, 0.0f);
        written = end;
    }
    // Calls back with what gives the sample at an index. Once the ring is full it need not look.
    template <typename Call>
    void WithCells(Call&& call) const {
        const float* const cells = samples;
        const int end = written;
        if (end >= length)
            call([cells](int at) { return cells[at]; });
        else
            call([cells, end](int at) { return at < end ? cells[at] : 0.0f; });
    }
};

// One side's delay, in frames, and its levels.
struct Side {
    SineOscillator oscillator;
    double wet = 0.0, dry = 0.0;
    int amplitude = 0;  // of the sweep
    int base = 0;       // the read position trails the written one by `base` at the sweep's lower end
    int channel = 0;    // and index of its first sample in the ring
    int write = 0;      // index of the sample written next

    // One channel of a block.
    template <typename Sample>
    void Run(Sample* samples, int frames, std::ptrdiff_t stride, const Ring& ring) {
        std::array<double, SineOscillator::kPiece> sines, fractions;
        std::array<int, SineOscillator::kPiece> offsets;
        for (int taken; frames > 0; frames -= taken, samples += taken * stride) {
            taken = std::min(frames, SineOscillator::kPiece);
            oscillator.StepAndTakeSines(sines.data(), taken);
            for (std::size_t i = 0; i < static_cast<std::size_t>(taken); ++i) {
                const double sweep = (sines[i] + 1.0) * amplitude;
                const int whole = static_cast<int>(sweep);
                fractions[i] = sweep - whole;
                offsets[i] = (whole - base) * ring.channels;
            }
            for (int done = 0; done < taken;) {
                const int run = std::min(taken - done, FramesToWrap(ring));
                ring.WriteUpTo(write + run * ring.channels);
                ring.WithCells([&](auto cell) {
                    RunStraight(samples + done * stride, run, stride, ring, offsets.data() + done,
                                fractions.data() + done, cell);
                });
                done += run;
            }
        }
    }

private:
    static float Kept(float sample) { return sample; }
    // What no float can hold would come back as an infinity, and between two samples as no number at all.
    static float Kept(double sample) {
        constexpr double kMost = std::numeric_limits<float>::max();
        return static_cast<float>(std::clamp(sample, -kMost, kMost));
    }
    // At least 1: a ring that became shorter may have left the index at its end, for one frame.
    int FramesToWrap(const Ring& ring) const {
        return std::max((ring.length - write + ring.channels - 1) / ring.channels, 1);
    }

    // `cell` gives the sample of the ring at an index.
    template <typename Sample, typename Cell>
    void RunStraight(Sample* samples, int frames, std::ptrdiff_t stride, const Ring& ring, const int* offsets,
                     const double* fractions, Cell cell) {
        const int length = ring.length, step = ring.channels;
        // Reading, the end of the ring is its beginning.
        int read = write < length ? write : write - length;
        float* written = ring.samples + write;
        for (int i = 0; i < frames; ++i, read += step, written += step, samples += stride) {
            int at = read + offsets[i];
            at += at < 0 ? length : 0;
            at -= at >= length ? length : 0;
            int next = at + step;
            next -= next >= length ? length : 0;
            const double x = *samples, here = cell(at);
            const double delayed = (cell(next) - here) * fractions[i] + here;
            *written = Kept(*samples);
            *samples = static_cast<Sample>(delayed * wet + x * dry);
        }
        write += frames * step;
        if (write >= length) write = channel;
    }
};

struct Delay {
    std::array<Side, 2> sides;
    int written = 0;  // of the ring
};

}  // namespace Corvo::DSP::ChorusPrivate
