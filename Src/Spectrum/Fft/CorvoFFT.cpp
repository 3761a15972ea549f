#include "Spectrum/Fft/CorvoFFT.h"

#include <algorithm>
#include <bit>
#include <cstddef>

#include "Platform/AlignedMemory.h"
#include "Spectrum/Fft/FftPlan.h"
#include "Spectrum/Fft/SharedPlan.h"
#include "Spectrum/Fft/SplitSpectrum.h"

using Corvo::AlignedAllocate;
using Corvo::AlignedFree;
using Corvo::Fft::Kernels;
using Corvo::Fft::Kind;

namespace {

constexpr int kMaxLength = 524288;

template <typename T>
using TransformOf = void (*)(const Corvo::Fft::Plan<T>&, const T*, T*, T*);

template <typename T, typename SetUp>
void Run(const SetUp& setUp, TransformOf<T> Kernels<T>::*transform, const T* in, T* out) {
    if (setUp.plan) (setUp.plan->kernels->*transform)(*setUp.plan, in, out, setUp.work);
}

// The values that a real transform reads and writes.
template <typename SetUp>
int RealLength(const SetUp& setUp) {
    return std::max(static_cast<int>(2 * setUp.plan->points), 1);
}

// Transforms write the first power of two of it; the rest is set to 0.
template <typename T>
T* AllocateScratch(int length) {
    auto* const values = static_cast<T*>(AlignedAllocate(static_cast<std::size_t>(length) * sizeof(T)));
    const int written = length > 1 ? static_cast<int>(std::bit_floor(static_cast<unsigned>(length))) : 0;
    if (values) std::fill(values + written, values + length, T(0));
    return values;
}

}  // namespace

CorvoFFT::CorvoFFT() = default;
CorvoFFT::~CorvoFFT() { Free(); }
CorvoFFT::CorvoFFT(const CorvoFFT&) = default;
CorvoFFT& CorvoFFT::operator=(const CorvoFFT&) = default;

template <typename T>
void CorvoFFT::Release(SetUp<T>& setUp) {
    Corvo::Fft::GiveBack(setUp.shared);
    AlignedFree(setUp.work);
    setUp = {};
}

template <typename T>
void CorvoFFT::Build(SetUp<T>& setUp, int length, bool real) {
    const Kind kind = real ? Kind::Real : Kind::Complex;
    const auto order = static_cast<int>(std::bit_width(static_cast<unsigned>(length))) - 1;
    setUp.shared = Corvo::Fft::TakePlan<T>(order, kind);
    if (!setUp.shared) return;
    const auto* const plan = setUp.shared->plan;
    setUp.work = static_cast<T*>(AlignedAllocate(Corvo::Fft::WorkValues(plan->points) * sizeof(T)));
    if (setUp.work) setUp.plan = plan;
}

void CorvoFFT::ReleaseReal() {
    Release(m_realForward32);
    Release(m_realForward64);
    AlignedFree(m_scratch32);
    AlignedFree(m_scratch64);
    m_scratch32 = nullptr;
    m_scratch64 = nullptr;
    Release(m_realInverse32);
    Release(m_realInverse64);
    m_scratchLength = 0;
}

void CorvoFFT::Free() {
    Allocate(0, 1);
    ReleaseReal();
}

void* CorvoFFT::intelRealloc(void* p, int bytes) {
    AlignedFree(p);
    return bytes < 0 ? nullptr : AlignedAllocate(static_cast<std::size_t>(bytes));
}

void CorvoFFT::Allocate(int length, int withInverse) {
    const auto replace = [&](auto& setUp) {
        Release(setUp);
        if (length >= 1 && length <= kMaxLength) Build(setUp, length, false);
    };
    replace(m_complexForward32);
    replace(m_complexForward64);
    if (withInverse == 0) return;
    replace(m_complexInverse32);
    replace(m_complexInverse64);
}

void CorvoFFT::AllocateReal(int length, int withInverse) {
    ReleaseReal();
    if (length < 1 || length > kMaxLength) return;
    Build(m_realForward32, length, true);
    Build(m_realForward64, length, true);
    m_scratch32 = AllocateScratch<float>(length);
    m_scratch64 = AllocateScratch<double>(length);
    m_scratchLength = m_scratch32 && m_scratch64 ? length : 0;
    if (withInverse <= 0) return;
    Build(m_realInverse32, length, true);
    Build(m_realInverse64, length, true);
}

template <typename T>
void CorvoFFT::SplitForward(const SetUp<T>& setUp, T* scratch, const T* in, T* re, T* im, int length) const {
    if (!setUp.plan || m_scratchLength == 0) return;
    const int transformed = RealLength(setUp);
    if (length < transformed) {
        const int given = std::max(length, 0);
        std::copy_n(in, given, scratch);
        std::fill(scratch + given, scratch + transformed, T(0));
        in = scratch;
    }
    Run<T>(setUp, &Kernels<T>::realForward, in, scratch);
    const int pairs = std::max(std::min(length, m_scratchLength) / 2, 0);
    Corvo::Fft::SplitPairs(scratch, re, im, static_cast<std::size_t>(pairs));
}

template <typename T>
void CorvoFFT::SplitInverse(const SetUp<T>& setUp, T* scratch, T* out, const T* re, const T* im,
                            int length) const {
    if (!setUp.plan || m_scratchLength == 0) return;
    const int pairs = std::max(std::min(length, m_scratchLength) / 2, 0);
    Corvo::Fft::JoinPairs(re, im, scratch, static_cast<std::size_t>(pairs));
    const int transformed = RealLength(setUp);
    if (length >= transformed) {
        Run<T>(setUp, &Kernels<T>::realInverse, scratch, out);
    } else {
        std::fill(scratch + 2 * pairs, scratch + transformed, T(0));
        Run<T>(setUp, &Kernels<T>::realInverse, scratch, scratch);
        std::copy_n(scratch, std::max(length, 0), out);
    }
}

void CorvoFFT::DoFFTReal(float* data, int, int) {
    Run<float>(m_realForward32, &Kernels<float>::realForward, data, data);
}
void CorvoFFT::DoFFTReal(double* data, int, int) {
    Run<double>(m_realForward64, &Kernels<double>::realForward, data, data);
}
void CorvoFFT::DoIFFTReal(float* data, int, int) {
    Run<float>(m_realInverse32, &Kernels<float>::realInverse, data, data);
}
void CorvoFFT::DoIFFTReal(double* data, int, int) {
    Run<double>(m_realInverse64, &Kernels<double>::realInverse, data, data);
}
void CorvoFFT::DoFFTReal(const float* in, float* re, float* im, int length, int) {
    SplitForward(m_realForward32, m_scratch32, in, re, im, length);
}
void CorvoFFT::DoFFTReal(const double* in, double* re, double* im, int length, int) {
    SplitForward(m_realForward64, m_scratch64, in, re, im, length);
}
void CorvoFFT::DoIFFTReal(float* out, const float* re, const float* im, int length, int) {
    SplitInverse(m_realInverse32, m_scratch32, out, re, im, length);
}
void CorvoFFT::DoIFFTReal(double* out, const double* re, const double* im, int length, int) {
    SplitInverse(m_realInverse64, m_scratch64, out, re, im, length);
}
void CorvoFFT::DoFFT(float* data, int, int) {
    Run<float>(m_complexForward32, &Kernels<float>::complexForward, data, data);
}
void CorvoFFT::DoFFT(double* data, int, int) {
    Run<double>(m_complexForward64, &Kernels<double>::complexForward, data, data);
}
void CorvoFFT::DoIFFT(float* data, int, int) {
    Run<float>(m_complexInverse32, &Kernels<float>::complexInverse, data, data);
}
void CorvoFFT::DoIFFT(double* data, int, int) {
    Run<double>(m_complexInverse64, &Kernels<double>::complexInverse, data, data);
}
