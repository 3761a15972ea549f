// Fast Fourier transforms of every kind and length, built and freed in any order.
#include "Spectrum/Fft/CorvoFFT.h"
#include "Target.h"

namespace {

using Fuzz::Input;

// As many values as the largest transform in use here may touch.
constexpr int kLongest = 1 << 14;

template <typename T>
void Transform(Input& input, CorvoFFT& fft) {
    auto data = input.Samples<T>(2 * kLongest);
    std::vector<T> re(kLongest), im(kLongest);
    const int length = input.Between(-2, kLongest);
    switch (input.Between(0, 5)) {
        case 0:
            fft.DoFFTReal(data.data(), 0, 0);
            break;
        case 1:
            fft.DoIFFTReal(data.data(), 0, 0);
            break;
        case 2:
            fft.DoFFT(data.data(), 0, 0);
            break;
        case 3:
            fft.DoIFFT(data.data(), 0, 0);
            break;
        case 4:
            fft.DoFFTReal(data.data(), re.data(), im.data(), length, 0);
            break;
        default:
            fft.DoIFFTReal(data.data(), re.data(), im.data(), length, 0);
    }
}

const Fuzz::Target target("Transform", [](Input& input) {
    CorvoFFT fft;
    void* block = nullptr;
    for (int step = 0; step < 40 && !input.AtEnd(); ++step) switch (input.Between(0, 5)) {
            case 0: {
                const int length = input.Between(-2, kLongest);
                fft.Allocate(length, input.Flag());
                break;
            }
            case 1: {
                const int length = input.Between(-2, kLongest);
                fft.AllocateReal(length, input.Flag());
                break;
            }
            case 2:
                Transform<float>(input, fft);
                break;
            case 3:
                Transform<double>(input, fft);
                break;
            case 4:
                block = fft.intelRealloc(block, input.Between(-1, 5000));
                break;
            default:
                fft.Free();
        }
    fft.intelRealloc(block, -1);
    fft.Free();
});

}  // namespace
