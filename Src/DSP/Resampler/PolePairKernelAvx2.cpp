#include <immintrin.h>

#include "DSP/Resampler/PolePairKernel.h"

// Compiled for AVX2: nothing but the kernel belongs here.
namespace PolePairs {
namespace {

// Two pairs go on in one register, the last one alone. For the outputs each stands in a register of its own,
// change beside value. Every sum is taken in the baseline's order.
class PairsInTwos {
public:
    PairsInTwos(const State& state, const double* advance)
        : m_value{_mm256_loadu_pd(state.value[0]), _mm256_loadu_pd(state.value[2])},
          m_change{_mm256_loadu_pd(state.change[0]), _mm256_loadu_pd(state.change[2])},
          m_lastValue(_mm_load_pd(state.value[4])),
          m_lastChange(_mm_load_pd(state.change[4])),
          m_sample(Beside(_mm_load_pd(state.sample), _mm_setzero_pd())) {
        for (std::size_t j = 0; j < 2; ++j) {
            const double* const factors = advance + PolePairLowPass::ChangeAt(2 * j);
            const __m256d one = _mm256_loadu_pd(factors), other = _mm256_loadu_pd(factors + 4);
            m_changeFactor[j] = Lower(one, other);
            m_valueFactor[j] = Upper(one, other);
        }
        m_lastChangeFactor = _mm_load_pd(advance + PolePairLowPass::ChangeAt(4));
        m_lastValueFactor = _mm_load_pd(advance + PolePairLowPass::ValueAt(4));
        SetPairs();
    }
    void To(State& state) const {
        for (std::size_t j = 0; j < 2; ++j) {
            _mm256_storeu_pd(state.value[2 * j], m_value[j]);
            _mm256_storeu_pd(state.change[2 * j], m_change[j]);
        }
        _mm_store_pd(state.value[4], m_lastValue);
        _mm_store_pd(state.change[4], m_lastChange);
        _mm_store_pd(state.sample, _mm256_castpd256_pd128(m_sample));
    }
    void Take(const double* sample) {
        const __m128d once = _mm_load_pd(sample);
        const __m256d twice = Beside(once, once);
        m_sample = Beside(once, _mm_setzero_pd());
        for (std::size_t j = 0; j < 2; ++j) {
            m_change[j] = twice + m_change[j] * m_changeFactor[j] - m_value[j] * m_valueFactor[j];
            m_value[j] += m_change[j];
        }
        m_lastChange = once + m_lastChange * m_lastChangeFactor - m_lastValue * m_lastValueFactor;
        m_lastValue += m_lastChange;
        SetPairs();
    }
    // The lower half sums what the changes contribute, the upper half the values' share.
    void Output(const double* row, double* out) const {
        __m256d sum = m_sample * _mm256_load_pd(row);
        for (std::size_t k = 0; k < State::kPairs; ++k)
            sum += m_pairs[k] * _mm256_load_pd(row + PolePairLowPass::ChangeAt(k));
        _mm_store_pd(out, _mm256_castpd256_pd128(sum) + _mm256_extractf128_pd(sum, 1));
    }
    // Both at once wait less for each other's sums.
    void TwoOutputs(const double* row, const double* next, double* out) const {
        __m256d sum = m_sample * _mm256_load_pd(row), other = m_sample * _mm256_load_pd(next);
        for (std::size_t k = 0; k < State::kPairs; ++k) {
            sum += m_pairs[k] * _mm256_load_pd(row + PolePairLowPass::ChangeAt(k));
            other += m_pairs[k] * _mm256_load_pd(next + PolePairLowPass::ChangeAt(k));
        }
        _mm256_storeu_pd(out, Lower(sum, other) + Upper(sum, other));
    }

private:
    static __m256d Beside(__m128d low, __m128d high) {
        return _mm256_insertf128_pd(_mm256_castpd128_pd256(low), high, 1);
    }
    static __m256d Lower(__m256d a, __m256d b) { return _mm256_permute2f128_pd(a, b, 0x20); }
    static __m256d Upper(__m256d a, __m256d b) { return _mm256_permute2f128_pd(a, b, 0x31); }

    void SetPairs() {
        for (std::size_t j = 0; j < 2; ++j) {
            m_pairs[2 * j] = Lower(m_change[j], m_value[j]);
            m_pairs[2 * j + 1] = Upper(m_change[j], m_value[j]);
        }
        m_pairs[4] = Beside(m_lastChange, m_lastValue);
    }

    __m256d m_value[2], m_change[2], m_valueFactor[2], m_changeFactor[2];
    __m128d m_lastValue, m_lastChange, m_lastValueFactor, m_lastChangeFactor;
    __m256d m_sample, m_pairs[State::kPairs];  // beside zero, and change beside value
};

}  // namespace

void RunAvx2(const PolePairLowPass& filter, State& state, Stream& stream) {
    RunWith<PairsInTwos>(filter, state, stream);
}

}  // namespace PolePairs
