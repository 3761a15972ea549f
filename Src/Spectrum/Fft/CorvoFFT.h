#pragma once

#include "Platform/Export.h"

namespace Corvo::Fft {
// The tables of one length.
template <typename T>
struct Plan;
// Shared by all objects of that length.
template <typename T>
struct SharedPlan;
}  // namespace Corvo::Fft

// Fast Fourier transforms of one length: forward and inverse, real and complex, float and double, in place
// and out of place. Forward transforms are unscaled, inverse ones scaled by 1/N.
//
// Lengths are powers of two up to 524288, in real values (real transforms) or complex points (complex
// transforms); any other length is rounded down to the power of two below it. A packed spectrum of N real
// values holds the real parts of bin 0 and of bin N/2 at positions 0 and 1, then bin k's real part at 2k and
// its imaginary part at 2k + 1. The split form holds position 2k in re[k] and position 2k + 1 in im[k].
//
// Stages of radix 8 and 4 after J. W. Cooley and J. W. Tukey, "An algorithm for the machine calculation of
// complex Fourier series", Mathematics of Computation 19 (1965), in the form of T. G. Stockham that leaves
// its results in order: C. Van Loan, "Computational Frameworks for the Fast Fourier Transform", SIAM, 1992.
//
// All memory is obtained by Allocate and AllocateReal; no transform allocates, and each takes time
// proportional to N log N. The tables belong to all objects of a length together, and the last one frees
// them: building and releasing may wait for other threads. A transform that was not built does nothing. One
// thread uses an object at a time; two objects may run on two threads. The `int` arguments without a name are
// not used.
class DSP_API CorvoFFT {
public:
    CorvoFFT();
    ~CorvoFFT();
    // Both objects then refer to the same set-ups and buffers, and only one of them may ever be freed.
    CorvoFFT(const CorvoFFT&);
    CorvoFFT& operator=(const CorvoFFT&);

    // Releases everything that was built; harmless on an empty object.
    void Free();
    // Releases `p` (may be null), which came from here, and returns a new block of `bytes` bytes aligned to a
    // cache line, or null when there is no memory or `bytes` is negative. The contents are not kept.
    void* intelRealloc(void* p, int bytes);

    // Build the transforms of one kind, the inverse ones only when `withInverse` is non-zero (complex) or
    // greater than 0 (real). What they replace is released: without `withInverse` an inverse complex
    // transform stays as it was, while the real ones all go, as they share their scratch. Where the length is
    // below 1 or above 524288, or memory is lacking, nothing takes its place.
    void Allocate(int length, int withInverse);
    void AllocateReal(int length, int withInverse);

    // Real values to the packed spectrum and back, in place.
    void DoFFTReal(float* data, int, int);
    void DoFFTReal(double* data, int, int);
    void DoIFFTReal(float* data, int, int);
    void DoIFFTReal(double* data, int, int);

    // Real values to the split spectrum and back. `length` samples, `length` / 2 entries in re and im; a
    // shorter `length` than was built is taken as samples followed by zeros, a longer one as that much of it.
    void DoFFTReal(const float* in, float* re, float* im, int length, int);
    void DoFFTReal(const double* in, double* re, double* im, int length, int);
    void DoIFFTReal(float* out, const float* re, const float* im, int length, int);
    void DoIFFTReal(double* out, const double* re, const double* im, int length, int);

    // Interleaved complex points in natural order, in place.
    void DoFFT(float* data, int, int);
    void DoFFT(double* data, int, int);
    void DoIFFT(float* data, int, int);
    void DoIFFT(double* data, int, int);

private:
    template <typename T>
    struct SetUp {
        const Corvo::Fft::Plan<T>* plan = nullptr;
        Corvo::Fft::SharedPlan<T>* shared = nullptr;  // which the plan is of
        T* work = nullptr;
    };

    SetUp<float> m_complexForward32;
    SetUp<double> m_complexForward64;
    SetUp<float> m_complexInverse32;
    SetUp<double> m_complexInverse64;
    SetUp<float> m_realForward32;
    SetUp<double> m_realForward64;
    float* m_scratch32 = nullptr;
    double* m_scratch64 = nullptr;
    SetUp<float> m_realInverse32;
    SetUp<double> m_realInverse64;
    int m_scratchLength = 0;

    template <typename T>
    static void Release(SetUp<T>& setUp);
    template <typename T>
    static void Build(SetUp<T>& setUp, int length, bool real);
    template <typename T>
    void SplitForward(const SetUp<T>& setUp, T* scratch, const T* in, T* re, T* im, int length) const;
    template <typename T>
    void SplitInverse(const SetUp<T>& setUp, T* scratch, T* out, const T* re, const T* im, int length) const;
    void ReleaseReal();
};
