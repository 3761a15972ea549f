#include <array>
#include <xsimd/xsimd.hpp>

#include "DSP/Resampler/PolePairKernel.h"

namespace PolePairs {
namespace {

// A register for each number of each pair.
class PairsInTens {
public:
    PairsInTens(const State& state, const double* advance)
        : m_advance(advance), m_sample(Lanes::load_aligned(state.sample)) {
        for (std::size_t k = 0; k < kPairs; ++k) {
            m_value[k] = Lanes::load_aligned(state.value[k]);
            m_change[k] = Lanes::load_aligned(state.change[k]);
        }
    }
    void To(State& state) const {
        for (std::size_t k = 0; k < kPairs; ++k) {
            m_value[k].store_aligned(state.value[k]);
            m_change[k].store_aligned(state.change[k]);
        }
        m_sample.store_aligned(state.sample);
    }
    void Take(const double* sample) {
        m_sample = Lanes::load_aligned(sample);
        for (std::size_t k = 0; k < kPairs; ++k) {
            m_change[k] = m_sample + m_change[k] * Load(m_advance + PolePairLowPass::ChangeAt(k)) -
                          m_value[k] * Load(m_advance + PolePairLowPass::ValueAt(k));
            m_value[k] += m_change[k];
        }
    }
    void TwoOutputs(const double* row, const double* next, double* out) const {
        Output(row, out);
        Output(next, out + State::kLanes);
    }
    void Output(const double* row, double* out) const {
        Lanes even = m_sample * Load(row);
        Lanes odd = m_value[0] * Load(row + PolePairLowPass::ValueAt(0));
        for (std::size_t k = 0; k < kPairs; ++k) {
            even += m_change[k] * Load(row + PolePairLowPass::ChangeAt(k));
            if (k + 1 < kPairs) odd += m_value[k + 1] * Load(row + PolePairLowPass::ValueAt(k + 1));
        }
        (even + odd).store_aligned(out);
    }

private:
    static constexpr std::size_t kPairs = State::kPairs;
    using Lanes = xsimd::batch<double, xsimd::sse2>;
    static_assert(Lanes::size == State::kLanes);
    static Lanes Load(const double* twice) { return Lanes::load_aligned(twice); }

    const double* m_advance;
    std::array<Lanes, kPairs> m_value, m_change;
    Lanes m_sample;
};

}  // namespace

void RunBaseline(const PolePairLowPass& filter, State& state, Stream& stream) {
    RunWith<PairsInTens>(filter, state, stream);
}

}  // namespace PolePairs
