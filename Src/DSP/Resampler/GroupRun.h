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

// Two samples side by side, at any address, and two such frames. Written for the processor, as compilers
// convert them one by one in a 32-bit program.
inline __m128d ReadPair(const float* from) {
    return _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(from))));
}
inline __m128d ReadPair(const double* from) { return _mm_loadu_pd(from); }
inline void ReadTwoPairs(const float* from, double* to) {
    const __m128 four = _mm_loadu_ps(from);
    _mm_store_pd(to, _mm_cvtps_pd(four));
    _mm_store_pd(to + 2, _mm_cvtps_pd(_mm_movehl_ps(four, four)));
}
inline void ReadTwoPairs(const double* from, double* to) {
    _mm_store_pd(to, ReadPair(from));
    _mm_store_pd(to + 2, ReadPair(from + 2));
}
inline void WritePair(__m128d pair, float* to) {
    _mm_storel_epi64(reinterpret_cast<__m128i*>(to), _mm_castps_si128(_mm_cvtpd_ps(pair)));
}
inline void WritePair(__m128d pair, double* to) { _mm_storeu_pd(to, pair); }
inline void WriteTwoPairs(const double* from, float* to) {
    _mm_storeu_ps(to, _mm_movelh_ps(_mm_cvtpd_ps(_mm_load_pd(from)), _mm_cvtpd_ps(_mm_load_pd(from + 2))));
}
inline void WriteTwoPairs(const double* from, double* to) {
    WritePair(_mm_load_pd(from), to);
    WritePair(_mm_load_pd(from + 2), to + 2);
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
          m_step(static_cast<std::ptrdiff_t>(toNextOutput) + converter.up) {
        if constexpr (kChannels == 1) std::ranges::fill(m_in, 0.0);
    }

    void Run(int frames) {
        for (std::size_t left = static_cast<std::size_t>(frames), count; left > 0; left -= count) {
            count = std::min(left, kPiece);
            Read(count);
            Stream stream{m_in, count, m_out, kRoom, m_up, m_down, m_step};
            do {
                stream.out = m_out;
                stream.room = kRoom;
                m_kernel(m_filter, m_state, stream);
                Write(kRoom - stream.room);
            } while (stream.frames > 0 || stream.step < m_up);
            m_step = stream.step;
        }
    }
    // What the last run read, at most a piece.
    const double* Samples() const { return m_in; }
    // The last run once more, of at most a piece: what the filter, now as it was `before`, gives at the
    // raised rate from `step` on.
    const double* Raised(State before, std::size_t frames, std::ptrdiff_t step) {
        Stream stream{m_in, frames, m_out, kRoom, m_up, 1, m_up + step};
        m_kernel(m_filter, before, stream);
        return m_out;
    }

    const State& Filter() const { return m_state; }
    int Written() const { return m_written; }

private:
    static constexpr std::ptrdiff_t kLanes = State::kLanes;
    static constexpr std::size_t kPiece = 64, kRoom = 2 * kPiece;

    void Read(std::size_t frames) {
        Block block = m_block;  // what is written may be anything, as far as the compiler knows
        double *to = m_in, *const end = m_in + kLanes * frames;
        if constexpr (FloatingPoint<In> && kChannels == 2)
            if (block.in[1] == block.in[0] + In::kBytes) {
                const auto at = [&] { return reinterpret_cast<const typename In::Value*>(block.in[0]); };
                if (block.inStride == 2 * In::kBytes)
                    for (; end - to >= 2 * kLanes; to += 2 * kLanes, block.in[0] += 2 * block.inStride)
                        ReadTwoPairs(at(), to);
                for (; to != end; to += kLanes, block.in[0] += block.inStride)
                    _mm_store_pd(to, ReadPair(at()));
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
                const auto at = [&] { return reinterpret_cast<typename Out::Value*>(block.out[0]); };
                if (block.outStride == 2 * Out::kBytes)
                    for (; end - from >= 2 * kLanes; from += 2 * kLanes, block.out[0] += 2 * block.outStride)
                        WriteTwoPairs(from, at());
                for (; from != end; from += kLanes, block.out[0] += block.outStride)
                    WritePair(_mm_load_pd(from), at());
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
    alignas(16) double m_in[kLanes * kPiece], m_out[kLanes * kRoom];
};

}  // namespace PolePairs
