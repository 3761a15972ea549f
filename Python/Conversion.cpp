#include "Conversion.h"

#include <pybind11/complex.h>
#include <pybind11/stl.h>

#include <vector>

#include "Arrays.h"
#include "DSP/Equalizer/BuiltinEffectsData.h"
#include "Handle.h"
#include "Interrupt.h"

namespace python {
namespace {

constexpr int kBlock = 4096, kMostChannels = 48;

template <typename Sample>
py::array ConvertAs(const py::array& x, int inRate, int outRate, bool nearest, int axis) {
    const Shape shape = ShapeOf(x, axis, kMostChannels);
    const int channels = static_cast<int>(shape.channels);
    constexpr int stored = sizeof(Sample) == 4 ? DSP_F32 : DSP_F64;
    const dsp_conversion conversion{sizeof(dsp_conversion), inRate, outRate, channels, stored, stored,
                                    DSP_DITHER_NONE,        nearest};
    const auto converter = Made<dsp_converter>([&](dsp_converter** handle, dsp_error* error) {
        return dsp_converter_create(&conversion, handle, error);
    });
    std::int64_t outFrames = 0, most = 0;
    Check(dsp_converter_frames(converter.get(), kBlock, &outFrames, &most));
    Check(dsp_converter_frames(converter.get(), shape.frames, &outFrames, nullptr));
    py::array keep;
    const auto from = View<Sample>(x, shape, keep);
    auto result = NewArray<Sample>(shape, outFrames);
    const auto to = WholeOf<Sample>(result, shape, outFrames);
    {
        const py::gil_scoped_release released;
        std::vector<Sample> in(static_cast<std::size_t>(kBlock * channels));
        std::vector<Sample> out(static_cast<std::size_t>(most * channels));
        py::ssize_t stands = 0;
        Interrupt interrupt;
        int written = 0;
        const auto keepWritten = [&] {
            Scatter(out.data(), std::min<py::ssize_t>(written, outFrames - stands), channels, to, stands);
            stands += written;
        };
        for (py::ssize_t done = 0; done < shape.frames; done += kBlock) {
            const auto count = std::min<py::ssize_t>(kBlock, shape.frames - done);
            Gather(from, done, count, channels, in.data());
            Check(dsp_converter_process(converter.get(), in.data(), static_cast<int>(count), out.data(),
                                        static_cast<int>(most), &written));
            keepWritten();
            interrupt.Check();
        }
        do {
            Check(dsp_converter_finish(converter.get(), out.data(), static_cast<int>(most), &written));
            keepWritten();
        } while (written > 0);
    }
    return result;
}

template <typename Sample>
py::array ShiftAs(const py::array& x, const dsp_shift& settings, int axis) {
    const Shape shape = ShapeOf(x, axis, 2);
    dsp_shift shift = settings;
    shift.channels = static_cast<int>(shape.channels);
    const auto engine = Made<dsp_pitch_shift>([&](dsp_pitch_shift** handle, dsp_error* error) {
        return dsp_pitch_shift_create(&shift, handle, error);
    });
    py::array keep;
    const auto from = View<Sample>(x, shape, keep);
    std::vector<float> shifted;
    {
        const py::gil_scoped_release released;
        std::vector<float> block(static_cast<std::size_t>(kBlock * shape.channels));
        Interrupt interrupt;
        const auto take = [&] {
            for (int written = kBlock; written == kBlock;) {
                Check(dsp_pitch_shift_take(engine.get(), block.data(), kBlock, &written));
                shifted.insert(shifted.end(), block.begin(), block.begin() + written * shape.channels);
            }
        };
        for (py::ssize_t done = 0; done < shape.frames; done += kBlock) {
            const auto count = std::min<py::ssize_t>(kBlock, shape.frames - done);
            Gather(from, done, count, shape.channels, block.data());
            Check(dsp_pitch_shift_feed(engine.get(), block.data(), static_cast<int>(count)));
            take();
            interrupt.Check();
        }
        Check(dsp_pitch_shift_finish(engine.get()));
        take();
    }
    const auto frames = static_cast<py::ssize_t>(shifted.size()) / shape.channels;
    auto result = NewArray<Sample>(shape, frames);
    Scatter(shifted.data(), frames, shape.channels, WholeOf<Sample>(result, shape, frames), 0);
    return result;
}

py::array Convert(const py::array& x, int inRate, int outRate, bool nearest, int axis) {
    return ByType(
        x, [&](auto sample) { return ConvertAs<decltype(sample)>(x, inRate, outRate, nearest, axis); });
}

py::array Shift(const py::array& x, int rate, double semitones, const std::string& engine, int quality,
                double speed, int axis) {
    if (!(speed > 0.0)) throw std::invalid_argument("the speed can be 0.1 to 10");  // 0 would count as 1
    if (engine != "new" && engine != "classic")
        throw std::invalid_argument("there is no engine \"" + engine + "\"; there are new, classic");
    const dsp_shift settings{
        sizeof(dsp_shift), rate, 1,         engine == "new" ? DSP_ENGINE_NEW : DSP_ENGINE_CLASSIC,
        quality,           0,    semitones, speed};
    return ByType(x, [&](auto sample) { return ShiftAs<decltype(sample)>(x, settings, axis); });
}

std::vector<std::complex<double>> Response(const std::vector<std::tuple<int, int, double, int>>& bands,
                                           bool invert, int rate, const std::vector<double>& frequencies) {
    const auto equaliser = Made<dsp_equaliser>(dsp_equaliser_create);
    std::vector<dsp_band> records;
    for (const auto& [type, frequency, gain, q] : bands)
        records.push_back({sizeof(dsp_band), type, frequency, q, 0, 0, gain});
    const dsp_format format{sizeof(dsp_format), rate, 1, DSP_F64, 1};
    Explained([&](dsp_error* error) {
        return dsp_equaliser_set_bands(equaliser.get(), records.data(), static_cast<int>(records.size()),
                                       error);
    });
    Check(dsp_equaliser_invert(equaliser.get(), invert));
    Explained([&](dsp_error* error) { return dsp_equaliser_prepare(equaliser.get(), &format, error); });
    std::vector<double> real(frequencies.size()), imaginary(frequencies.size());
    if (!frequencies.empty())
        Check(dsp_equaliser_response(equaliser.get(), frequencies.data(), real.data(), imaginary.data(),
                                     frequencies.size()));
    std::vector<std::complex<double>> response;
    for (std::size_t i = 0; i < real.size(); ++i) response.emplace_back(real[i], imaginary[i]);
    return response;
}

int DefaultQ(int type) {
    Corvo::DSP::builtin_effects_data data;
    data.SetNumBands(1);
    data.SetEqType(0, static_cast<Corvo::DSP::EQFilterType>(type));
    data.SetDefaultQ(0);
    return data.GetEqQ(0);
}

}  // namespace

void DefineConversion(py::module_& module) {
    module.def("convert", Convert);
    module.def("pitch", Shift);
    module.def("equalizer_response", Response);
    module.def("default_q", DefaultQ);
}

}  // namespace python
