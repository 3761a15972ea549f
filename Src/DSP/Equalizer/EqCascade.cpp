#include "DSP/Equalizer/EqCascade.h"

#include <algorithm>

#include "Platform/Processor.h"

namespace Corvo::DSP {
namespace {

bool wideKernels = true;

template <typename Sample>
const EqKernels<Sample>& Kernels() {
    return HasAvx2() && wideKernels ? EqAvx2Kernels<Sample>() : EqBaselineKernels<Sample>();
}

template <typename Sample>
bool Moves(const EqCascade<Sample>& cascade, int band) {
    const auto at = static_cast<std::size_t>(band);
    return cascade.bands[0][at]->Moving() || (cascade.channels == 2 && cascade.bands[1][at]->Moving());
}

}  // namespace

bool& MayUseWideEqKernels() { return wideKernels; }

bool MayRunTogether(const EqBands& first, const EqBands& second, int numBands, std::int32_t counter) {
    int movingFirst = 0, movingSecond = 0;
    for (std::size_t i = 0; i < static_cast<std::size_t>(numBands); ++i) {
        if (first[i].active != second[i].active) return false;
        if (counter == 0 || !first[i].active) continue;
        movingFirst += first[i].Moving();
        movingSecond += second[i].Moving();
    }
    return movingSecond == 0 || counter > movingFirst;
}

template <typename Sample>
void RunCascade(Sample* samples, std::ptrdiff_t stride, int frames, std::span<EqBands* const> channels,
                int numBands, std::int32_t& counter) {
    EqCascade<Sample> cascade{samples, stride, frames, static_cast<int>(channels.size())};
    for (std::size_t i = 0; i < static_cast<std::size_t>(numBands); ++i) {
        if (!(*channels[0])[i].active) continue;
        for (std::size_t c = 0; c < channels.size(); ++c)
            cascade.bands[c][static_cast<std::size_t>(cascade.count)] = &(*channels[c])[i];
        ++cascade.count;
    }
    if (frames <= 0) return;

    const auto& kernels = Kernels<Sample>();
    if (counter == 0) {
        if (cascade.count) kernels.settled(cascade, 0, cascade.count);
        return;
    }
    // Only bands that really move pay for it: neighbours that do, and neighbours that do not, run together.
    for (int first = 0; first < cascade.count;) {
        const bool moves = Moves(cascade, first);
        int end = first + 1;
        while (end < cascade.count && Moves(cascade, end) == moves) ++end;
        if (moves)
            counter = std::max(counter - kernels.gliding(cascade, first, end - first), 0);
        else
            kernels.settled(cascade, first, end - first);
        first = end;
    }
}

template void RunCascade(float*, std::ptrdiff_t, int, std::span<EqBands* const>, int, std::int32_t&);
template void RunCascade(double*, std::ptrdiff_t, int, std::span<EqBands* const>, int, std::int32_t&);

}  // namespace Corvo::DSP
