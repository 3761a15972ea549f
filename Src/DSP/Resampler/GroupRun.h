#pragma once

#include <emmintrin.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>

#include "DSP/Resampler/Dither.h"
#include "DSP/Resampler/PolePairKernel.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Platform/Processor.h"

namespace PolePairs {

// What a group of one or two channels converts.
struct Block {
    int frames;
    const char* in[2];
    char* out[2];
    int inStride, outStride;
    CDither<double>* dither;  // null, or of a group's only channel
};

template <typename Format>
concept FloatingPoint = requires {
    typename Format::Value;
};

// Two samples side by side, at any address. Written for the processor, as compilers convert them one by one
// in a 32-bit program.
template <typename Value>
__m128d ReadPair(const char* from) {
    if constexpr (sizeof(Value) == sizeof(float))
        return _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(from))));
    else
        return _mm_loadu_pd(reinterpret_cast<const double*>(from));
}
template <typename Value>
void WritePair(__m128d pair, char* to) {
    if constexpr (sizeof(Value) == sizeof(float))
        _mm_storel_epi64(reinterpret_cast<__m128i*>(to), _mm_castps_si128(_mm_cvtpd_ps(pair)));
    else
        _mm_storeu_pd(reinterpret_cast<double*>(to), pair);
}

// Runs one group through `block`, picking up and leaving behind its state and its read position: how many
// steps of the raised rate the next output is away from the next input. Groups of one channel leave the
// second lane silent.
template <typename In, typename Out, int kChannels>
class GroupRun {
public:
    GroupRun(const SamplingFrequencyConverter& converter, const State& state, const Block& block,
             std::int64_t toNextOutput)
        : m_filter(*converter.pairs),
          m_state(state),
          m_block(block),
          m_up(converter.up),
          m_down(converter.down),
          m_step(static_cast<std::ptrdiff_t>(toNextOutput) + converter.up) {}

    void Run(int frames) {
        for (std::size_t left = static_cast<std::size_t>(frames), count; left > 0; left -= count) {
            count = std::min(left, kPiece);
            Read(count);
            Stream stream{m_in, count, m_out, kPiece, m_up, m_down, m_step};
            do {
                stream.out = m_out;
                stream.room = kPiece;
                m_kernel(m_filter, m_state, stream);
                Write(kPiece - stream.room);
            } while (stream.room == 0);
            m_step = stream.step;
        }
    }
    // What the filter gives at the raised rate from `step` on until the next sample, at most a piece of it.
    const double* Raised(int step) {
        Stream stream{nullptr, 0, m_out, kPiece, m_up, 1, step};
        m_kernel(m_filter, m_state, stream);
        return m_out;
    }

    const State& Filter() const { return m_state; }
    int Written() const { return m_written; }

private:
    static constexpr std::size_t kLanes = State::kLanes, kPiece = 64;

    void Read(std::size_t frames) {
        Block block = m_block;  // what is written may be anything, as far as the compiler knows
        double *to = m_in, *const end = m_in + kLanes * frames;
        if constexpr (FloatingPoint<In> && kChannels == 2)
            if (block.in[1] == block.in[0] + In::kBytes) {
                for (; to != end; to += kLanes, block.in[0] += block.inStride)
                    _mm_store_pd(to, ReadPair<typename In::Value>(block.in[0]));
                block.in[1] = block.in[0] + In::kBytes;
            }
        for (; to != end; to += kLanes)
            for (int c = 0; c < kChannels; ++c) {
                to[c] = In::Read(block.in[c]);
                block.in[c] += block.inStride;
            }
        m_block = block;
    }
    void Write(std::size_t frames) {
        Block block = m_block;
        const double *from = m_out, *const end = m_out + kLanes * frames;
        if constexpr (FloatingPoint<Out> && kChannels == 2)
            if (block.out[1] == block.out[0] + Out::kBytes) {
                for (; from != end; from += kLanes, block.out[0] += block.outStride)
                    WritePair<typename Out::Value>(_mm_load_pd(from), block.out[0]);
                block.out[1] = block.out[0] + Out::kBytes;
            }
        for (; from != end; from += kLanes) {
            double values[] = {from[0], from[1]};
            if constexpr (kChannels == 1)
                if (block.dither) values[0] = ApplyDither(*block.dither, values[0]);
            for (int c = 0; c < kChannels; ++c) {
                Out::Write(values[c], block.out[c]);
                block.out[c] += block.outStride;
            }
        }
        m_block = block;
        m_written += static_cast<int>(frames);
    }

    const Kernel m_kernel = Corvo::HasAvx2() ? RunAvx2 : RunBaseline;
    const PolePairLowPass& m_filter;
    State m_state;
    Block m_block;
    const std::ptrdiff_t m_up, m_down;
    std::ptrdiff_t m_step;
    int m_written = 0;
    alignas(16) double m_in[kLanes * kPiece]{}, m_out[kLanes * kPiece];
};

}  // namespace PolePairs
