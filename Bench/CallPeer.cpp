#include <algorithm>
#include <cstring>
#include <memory>

#include "DSP/Effects/EffectKinds.h"

// What a host in C++ does where a call from Python does the same; python_bench.py times both in turn.

namespace {

using namespace Corvo::DSP;

constexpr int kRate = 48000, kBlock = 1024;

tWAVEFORMATEX StereoFloats() {
    tWAVEFORMATEX format{};
    format.nChannels = 2;
    format.nSamplesPerSec = kRate;
    format.wBitsPerSample = 32;
    return format;
}

void Process(CorvoEffectBase& effect, float* samples, int frames) {
    const tWAVEFORMATEX format = StereoFloats();
    ProcessFlags flags;
    for (int done = 0; done < frames; done += kBlock)
        effect.Process(samples + 2 * done, std::min(kBlock, frames - done), &format, flags);
}

}  // namespace

#define PEER extern "C" __attribute__((visibility("default")))

PEER void* peer_open(const char* effect) {
    auto made = FindEffectKind(effect)->MakeReady();
    const tWAVEFORMATEX format = StereoFloats();
    made->InitProcessing(kBlock, &format);
    return made.release();
}

// A call that makes a new array, `repeats` times: of a whole recording, which begins afresh, or of a block of
// a stream that goes on.
PEER void peer_call(void* handle, const float* samples, int frames, bool whole, int repeats) {
    auto& effect = *static_cast<CorvoEffectBase*>(handle);
    const auto count = static_cast<std::size_t>(2 * frames);
    for (int i = 0; i < repeats; ++i) {
        if (whole) {
            const tWAVEFORMATEX format = StereoFloats();
            effect.Cleanup();
            effect.InitProcessing(kBlock, &format);
        }
        const auto result = std::make_unique_for_overwrite<float[]>(count);
        std::memcpy(result.get(), samples, count * sizeof(float));
        Process(effect, result.get(), frames);
    }
}
