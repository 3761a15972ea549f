// A stream with automation: block by block, a tremolo that sets in after a second, and the tail at the end.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <vector>

#include "DSP/Effects/Tremolo/Autovol.h"

constexpr int kRate = 48000, kBlock = 480;

int main() {
    Corvo::DSP::Autovol tremolo;
    tremolo.SetPreset(tremolo.GetDefaultPreset());
    tWAVEFORMATEX format{};
    format.nChannels = 2;
    format.nSamplesPerSec = kRate;
    format.wBitsPerSample = 64;  // doubles
    tremolo.InitProcessing(kBlock, &format);

    // Envelopes are jumps of one parameter: at rtStart, here a frame, to valStart, 0 to 1. Parameters 0 and 1
    // are the depth, left and right. None for a second, half of it for a second, then all.
    MP_ENVELOPE_SEGMENT depth[3]{};
    for (int second : {1, 2}) {
        depth[second].rtStart = second * kRate;
        depth[second].valStart = 0.5f * static_cast<float>(second);
    }
    for (const int side : {0, 1}) tremolo.AddEnvelope(side, 3, depth);

    double swing[3];
    std::vector<double> block(2 * kBlock);
    Corvo::DSP::ProcessFlags flags;
    for (int second = 0; second < 3; ++second) {
        double lowest = 1.0, highest = 0.0;
        for (int position = second * kRate; position < (second + 1) * kRate; position += kBlock) {
            std::fill(block.begin(), block.end(), 0.5);  // where a host would read its next block
            tremolo.SetEnvelopeTime(position);           // a jump applies from the block that reaches it
            tremolo.Process(block.data(), kBlock, &format, flags);
            const auto [low, high] = std::minmax_element(block.begin(), block.end());
            lowest = std::min(lowest, *low);
            highest = std::max(highest, *high);
        }
        swing[second] = highest - lowest;
        std::printf("second %d: between %.3f and %.3f\n", second, lowest, highest);
    }
    return swing[0] < 1e-6 && swing[1] > 0.1 && swing[2] > 1.4 * swing[1] ? 0 : 1;
}
