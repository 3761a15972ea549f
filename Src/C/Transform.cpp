#include <bit>
#include <cstdint>
#include <memory>

#include "C/Calls.h"
#include "Spectrum/Fft/CorvoFFT.h"

namespace {

using namespace Corvo::C;

constexpr int kLongest = 524288;

class Transform : public Object {
public:
    static constexpr Kind kKind = Kind::Transform;

    Transform(int length, bool isComplex) : Object(kKind), m_complex(isComplex) {
        Require(Within(length, 2, kLongest) && std::has_single_bit(static_cast<unsigned>(length)),
                "the length can be a power of two from 2 to 524288");
        if (isComplex)
            m_fft.Allocate(length, 1);
        else
            m_fft.AllocateReal(length, 1);
    }
    ~Transform() override { m_fft.Free(); }

    template <typename T>
    void Run(T* values, bool inverse) {
        if (m_complex)
            inverse ? m_fft.DoIFFT(values, 0, 0) : m_fft.DoFFT(values, 0, 0);
        else
            inverse ? m_fft.DoIFFTReal(values, 0, 0) : m_fft.DoFFTReal(values, 0, 0);
    }

private:
    CorvoFFT m_fft;
    bool m_complex;
};

template <typename T>
dsp_status Transformed(dsp_transform* transform, T* values, bool inverse) {
    return With<Transform>(transform, [&](Transform& t) -> dsp_status {
        if (!values) return DSP_NULL;
        t.Run(values, inverse);
        return DSP_OK;
    });
}

}  // namespace

dsp_status DSP_CALL dsp_transform_create(int32_t length, int32_t complex_points, dsp_transform** transform,
                                         dsp_error* error) {
    return Create(transform, error, [=] { return std::make_unique<Transform>(length, complex_points != 0); });
}
dsp_status DSP_CALL dsp_transform_f32(dsp_transform* transform, float* values, int32_t inverse) {
    return Transformed(transform, values, inverse != 0);
}
dsp_status DSP_CALL dsp_transform_f64(dsp_transform* transform, double* values, int32_t inverse) {
    return Transformed(transform, values, inverse != 0);
}
