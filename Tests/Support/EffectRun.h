#pragma once

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Support/Signals.h"

namespace TestSupport {

using Corvo::DSP::CorvoEffectBase;

// One edit on the user-interface side, made in front of frame `at`.
struct Edit {
    std::size_t at;
    int index;
    float value;
};

template <typename Sample>
void ProcessBlock(CorvoEffectBase& effect, Sample* block, int frames, const tWAVEFORMATEX& format) {
    Corvo::DSP::ProcessFlags flags;
    effect.Process(reinterpret_cast<double*>(block), frames, &format, flags);
}

// The same for a block whose channels the effect is given one by one.
template <typename Sample>
void ProcessPlanes(CorvoEffectBase& effect, std::vector<Sample>& block, const tWAVEFORMATEX& format) {
    std::vector<std::vector<Sample>> planes(format.nChannels);
    std::vector<double*> channels;
    for (std::size_t i = 0; i < block.size(); ++i) planes[i % planes.size()].push_back(block[i]);
    for (auto& plane : planes) channels.push_back(reinterpret_cast<double*>(plane.data()));
    Corvo::DSP::ProcessFlags flags;
    effect.ProcessNoninterleaved(channels.data(), static_cast<int>(planes[0].size()), &format, flags);
    for (std::size_t i = 0; i < block.size(); ++i) block[i] = planes[i % planes.size()][i / planes.size()];
}

// Runs interleaved `samples` through the effect in blocks whose sizes are taken from `cuts` in turn. Blocks
// also end where an edit (sorted by place) is due, so that every way of cutting makes the edits at the same
// frame.
template <typename Sample>
std::vector<Sample> Render(CorvoEffectBase& effect, std::vector<Sample> samples, const tWAVEFORMATEX& format,
                           const std::vector<int>& cuts, const std::vector<Edit>& edits = {}) {
    effect.InitProcessing(*std::ranges::max_element(cuts), &format);
    const std::size_t frames = samples.size() / format.nChannels;
    auto edit = edits.begin();
    std::size_t cut = 0;
    for (std::size_t done = 0; done < frames;) {
        for (; edit != edits.end() && edit->at <= done; ++edit)
            effect.SetParam(edit->index, edit->value, false);
        const std::size_t limit = edit != edits.end() ? std::min(edit->at, frames) : frames;
        const auto count = std::min(limit - done, static_cast<std::size_t>(cuts[cut++ % cuts.size()]));
        ProcessBlock(effect, samples.data() + done * format.nChannels, static_cast<int>(count), format);
        done += count;
    }
    return samples;
}

using Bytes = std::vector<std::uint8_t>;

inline Bytes Chunk(CorvoEffectBase& effect) {
    Bytes chunk;
    effect.GetSettingsChunk(chunk);
    return chunk;
}

// A value of a chunk.
template <typename T>
T At(const Bytes& chunk, std::size_t offset) {
    T value;
    std::memcpy(&value, chunk.data() + offset, sizeof value);
    return value;
}
template <typename T>
void Put(Bytes& chunk, std::size_t offset, T value) {
    std::memcpy(chunk.data() + offset, &value, sizeof value);
}

// Loads settings by the words of the chunk in their order; those left out are 0.
inline void LoadWords(CorvoEffectBase& effect, std::vector<std::int32_t> words) {
    words.resize(static_cast<std::size_t>(effect.GetSettingsChunkSize()) / 4);
    const auto* const bytes = reinterpret_cast<const std::uint8_t*>(words.data());
    effect.SetSettingsChunk({bytes, bytes + 4 * words.size()});
}

// What the effect shows for a parameter: at a value, or as it stands.
inline std::string Text(CorvoEffectBase& effect, int index, double value) {
    const auto wide = effect.GetParameterFormattedText(index, value);
    return {wide.begin(), wide.end()};
}
inline std::string Text(CorvoEffectBase& effect, int index) {
    return Text(effect, index, effect.GetParam(index));
}

// A parameter of the left side and, right behind it, that of the right one.
inline void SetBoth(CorvoEffectBase& effect, int index, float value) {
    for (const int side : {0, 1}) effect.SetParam(index + side, value, false);
}

inline std::vector<float> AllParams(CorvoEffectBase& effect) {
    std::vector<float> values;
    for (int i = 0; i < effect.GetParamCount(); ++i) values.push_back(effect.GetParam(i));
    return values;
}

inline void SetAllParams(CorvoEffectBase& effect, auto&& random) {
    for (int i = 0; i < effect.GetParamCount(); ++i)
        effect.SetParam(i, static_cast<float>(random.Unit()), false);
}

}  // namespace TestSupport
