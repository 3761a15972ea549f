#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <utility>

namespace Corvo::DSP {

// How an effect rings out after its input has ended: the host's wishes and the effect's report. Belongs
// to the audio thread; CorvoEffectBase describes the use from the host's side. The base keeps its own notes
// here.
struct TailRecord {
    bool restart_requested = false;       // host: begin a new tail with the next block
    std::int64_t frames_limited_to = -1;  // host: frames the tail may still have; below 0: no tail mode
    int frames_produced = 0;              // effect: frames of the last block that hold output
    bool finished = false;                // effect: nothing follows
    bool unprepared = false;              // base: memory ran out, so that blocks pass unchanged
    bool automated = false;               // base: there was an envelope

    bool TailMode() const { return frames_limited_to >= 0; }
    bool TakeRestart() { return std::exchange(restart_requested, false); }

    // Around every block, by the base: the frames that the host's limit leaves, and the account.
    int BeginBlock(int frames) {
        if (TailMode()) frames = static_cast<int>(std::clamp<std::int64_t>(frames, 0, frames_limited_to));
        frames_produced = std::max(frames, 0);
        finished = false;
        return frames;
    }
    void EndBlock() {
        if (!TailMode()) return;
        frames_limited_to -= frames_produced;
        finished = finished || frames_limited_to == 0;
    }

    // For an effect that knows how long it rings: the frames each channel may process of this block.
    // Outside tail mode these are all; inside it no more than `remaining`, which is counted down, and the
    // longer channel decides what is reported.
    template <std::size_t N>
    std::array<int, N> Limit(int frames, std::array<int, N>& remaining) {
        std::array<int, N> allowed;
        allowed.fill(frames);
        if (!TailMode()) return allowed;
        for (std::size_t channel = 0; channel < N; ++channel) {
            allowed[channel] = std::min(frames, remaining[channel]);
            remaining[channel] -= allowed[channel];
        }
        frames_produced = *std::ranges::max_element(allowed);
        finished = std::ranges::all_of(remaining, [](int left) { return left == 0; });
        return allowed;
    }
};

}  // namespace Corvo::DSP
