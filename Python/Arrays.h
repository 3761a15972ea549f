#pragma once

#include <pybind11/numpy.h>

#include <algorithm>
#include <cstring>
#include <stdexcept>
#include <string>

namespace python {

namespace py = pybind11;

// The samples of an array of (frames,) or (frames, channels), or of the other order; steps in samples.
template <typename Sample>
struct Strided {
    Sample* data;
    py::ssize_t frameStep, channelStep;

    bool Interleaved(py::ssize_t channels) const {
        return frameStep == channels && (channelStep == 1 || channels == 1);
    }
    Sample* At(py::ssize_t frame) const { return data + frame * frameStep; }
};

struct Shape {
    py::ssize_t frames = 0, channels = 1;
    bool flat = true;        // one dimension
    bool framesLast = true;  // (channels, frames)
};

inline std::string ShapeText(const py::array& x) {
    return py::str(static_cast<py::object>(x.attr("shape"))).cast<std::string>();
}

// `axis` is the frames'. Throws std::invalid_argument for anything that is not audio of 1 to `mostChannels`.
inline Shape ShapeOf(const py::array& x, int axis, py::ssize_t mostChannels) {
    const auto dimensions = x.ndim();
    if (axis < 0) axis += static_cast<int>(dimensions);
    if (dimensions < 1 || dimensions > 2 || axis < 0 || axis >= dimensions)
        throw std::invalid_argument("an array of the shape " + ShapeText(x) +
                                    " is no audio with frames along axis " + std::to_string(axis) +
                                    "; expected are (frames,) or (frames, channels)");
    Shape shape;
    shape.flat = dimensions == 1;
    shape.framesLast = shape.flat || axis == 1;
    shape.frames = x.shape(axis);
    shape.channels = shape.flat ? 1 : x.shape(1 - axis);
    if (shape.channels < 1 || shape.channels > mostChannels)
        throw std::invalid_argument(
            "an array of the shape " + ShapeText(x) + " has " + std::to_string(shape.channels) +
            " channels along axis " + std::to_string(1 - axis) + "; 1 to " + std::to_string(mostChannels) +
            " can be processed (the frames are along axis 0 unless axis= says otherwise)");
    return shape;
}

// A view of `x`, which must hold Sample; `keep` holds what has to live as long, a copy where the samples do
// not stand where the processor can reach them.
template <typename Sample>
Strided<const Sample> View(const py::array& x, const Shape& shape, py::array& keep) {
    constexpr py::ssize_t size = sizeof(Sample);
    const auto even = [&](const py::array& a) {
        bool all = (reinterpret_cast<std::uintptr_t>(a.data()) % sizeof(Sample)) == 0;
        for (py::ssize_t i = 0; i < a.ndim(); ++i) all = all && a.strides(i) % size == 0;
        return all;
    };
    keep = even(x) ? x
                   : py::array_t<Sample, py::array::c_style | py::array::forcecast>::ensure(x.attr("copy")());
    const auto frameAxis = shape.flat || !shape.framesLast ? 0 : 1;
    return {static_cast<const Sample*>(keep.data()), keep.strides(frameAxis) / size,
            shape.flat ? 1 : keep.strides(1 - frameAxis) / size};
}

// A new array of the shape's order with `frames` frames, not yet written.
template <typename Sample>
py::array_t<Sample> NewArray(const Shape& shape, py::ssize_t frames) {
    if (shape.flat) return py::array_t<Sample>(frames);
    if (shape.framesLast) return py::array_t<Sample>({shape.channels, frames});
    return py::array_t<Sample>({frames, shape.channels});
}
template <typename Sample>
Strided<Sample> WholeOf(py::array_t<Sample>& array, const Shape& shape, py::ssize_t frames) {
    if (shape.framesLast) return {array.mutable_data(), 1, frames};
    return {array.mutable_data(), shape.channels, 1};
}

// Between an array and an interleaved block. Samples are converted where the types differ.
template <typename From, typename To>
void Gather(const Strided<From>& from, py::ssize_t first, py::ssize_t frames, py::ssize_t channels,
            To* block) {
    if (std::is_same_v<std::remove_const_t<From>, To> && from.Interleaved(channels)) {
        std::memcpy(block, from.At(first), static_cast<std::size_t>(frames * channels) * sizeof(To));
        return;
    }
    for (py::ssize_t c = 0; c < channels; ++c) {
        const From* at = from.At(first) + c * from.channelStep;
        for (py::ssize_t i = 0; i < frames; ++i, at += from.frameStep)
            block[i * channels + c] = static_cast<To>(*at);
    }
}
template <typename From, typename To>
void Scatter(const From* block, py::ssize_t frames, py::ssize_t channels, const Strided<To>& to,
             py::ssize_t first) {
    if (std::is_same_v<From, To> && to.Interleaved(channels)) {
        std::memcpy(to.At(first), block, static_cast<std::size_t>(frames * channels) * sizeof(To));
        return;
    }
    for (py::ssize_t c = 0; c < channels; ++c) {
        To* at = to.At(first) + c * to.channelStep;
        for (py::ssize_t i = 0; i < frames; ++i, at += to.frameStep)
            *at = static_cast<To>(block[i * channels + c]);
    }
}

// What is an array or can become one, as a list can.
inline py::array AnyArray(const py::object& x) {
    auto array = py::array::ensure(x);
    if (!array) throw py::type_error("not an array of samples: " + py::repr(x).cast<std::string>());
    return array;
}

// call(float()) or call(double()) for what the array holds; TypeError for anything else.
template <typename Call>
auto ByType(const py::array& x, Call call) {
    if (py::isinstance<py::array_t<float>>(x)) return call(0.0f);
    if (py::isinstance<py::array_t<double>>(x)) return call(0.0);
    throw py::type_error("samples of the type " + py::str(x.dtype()).cast<std::string>() +
                         " cannot be processed; expected are float32 or float64, full scale being 1 "
                         "(soundfile.read gives them so)");
}

}  // namespace python
