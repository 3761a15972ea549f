#include <benchmark/benchmark.h>

#include <memory>
#include <vector>

#include "Adapter.h"

// What a plug-in's adapter adds to its effect: the same blocks through both, in one run.
namespace {

using namespace Corvo::Plugins;

struct Block {
    explicit Block(int frames)
        : left(static_cast<std::size_t>(frames)), right(left.size()), both(2 * left.size()) {
        for (std::size_t i = 0; i < both.size(); ++i)
            both[i] = left[i / 2] = right[i / 2] =
                0.1f * static_cast<float>(static_cast<int>(i * 7919 % 31) - 15);
    }
    std::vector<float> left, right, both;
};

// As a host of the library calls it: in place, in the shape that the effect takes.
void BM_Bare(benchmark::State& state, const PluginRow* row) {
    const int frames = static_cast<int>(state.range(0));
    const Block in(frames);
    Block block(frames);
    const auto effect = row->Make();
    tWAVEFORMATEX format{};
    format.nChannels = 2;
    format.nSamplesPerSec = 48000;
    format.wBitsPerSample = 32;
    effect->InitProcessing(frames, &format);
    const bool planar = effect->SupportsNoninterleaved();
    Corvo::DSP::ProcessFlags flags;
    for (auto _ : state) {
        if (planar) {
            std::copy(in.left.begin(), in.left.end(), block.left.begin());
            std::copy(in.right.begin(), in.right.end(), block.right.begin());
            double* channels[]{reinterpret_cast<double*>(block.left.data()),
                               reinterpret_cast<double*>(block.right.data())};
            effect->ProcessNoninterleaved(channels, frames, &format, flags);
        } else {
            std::copy(in.both.begin(), in.both.end(), block.both.begin());
            effect->Process(block.both.data(), frames, &format, flags);
        }
        benchmark::ClobberMemory();
    }
}

void BM_Adapter(benchmark::State& state, const PluginRow* row) {
    const int frames = static_cast<int>(state.range(0));
    const Block in(frames);
    Block block(frames);
    Adapter adapter(*row, 2);
    adapter.Prepare(48000.0, frames);
    const float* const from[]{in.left.data(), in.right.data()};
    float* const to[]{block.left.data(), block.right.data()};
    for (auto _ : state) {
        adapter.Run(from, to, nullptr, frames);
        benchmark::ClobberMemory();
    }
}

[[maybe_unused]] const bool kRegistered = [] {
    for (const auto& row : PluginRows()) {
        benchmark::RegisterBenchmark((std::string("Bare/") + row.id).c_str(), BM_Bare, &row)
            ->Arg(128)
            ->Arg(512);
        benchmark::RegisterBenchmark((std::string("Adapter/") + row.id).c_str(), BM_Adapter, &row)
            ->Arg(128)
            ->Arg(512);
    }
    return true;
}();

}  // namespace
