#include "Line.h"

#include <pybind11/stl.h>

#include <algorithm>
#include <cmath>

#include "Interrupt.h"

namespace python {
namespace {

constexpr int kBlock = 1024;

dsp_status ProcessOne(dsp_effect* effect, float* samples, int frames) {
    return dsp_effect_process_f32(effect, samples, frames);
}
dsp_status ProcessOne(dsp_effect* effect, double* samples, int frames) {
    return dsp_effect_process_f64(effect, samples, frames);
}
dsp_status ProcessOne(dsp_equaliser* equaliser, float* samples, int frames) {
    return dsp_equaliser_process_f32(equaliser, samples, frames);
}
dsp_status ProcessOne(dsp_equaliser* equaliser, double* samples, int frames) {
    return dsp_equaliser_process_f64(equaliser, samples, frames);
}
dsp_status GiveKey(dsp_effect* effect, float* const* channels) {
    return dsp_effect_sidechain_f32(effect, 0, channels);
}
dsp_status GiveKey(dsp_effect* effect, double* const* channels) {
    return dsp_effect_sidechain_f64(effect, 0, channels);
}

}  // namespace

Line::Line(int rate, int channels, int axis)
    : m_rate(rate), m_channels(channels), m_axis(axis), m_block(2 * kBlock), m_key(2 * kBlock) {
    if (rate < 1) throw std::invalid_argument("the sample rate is in Hz and above 0");
    if (channels < 1 || channels > 2) throw std::invalid_argument("channels can be 1 or 2");
}

void Line::AddEffect(const std::string& name, const std::string& state,
                     const std::vector<std::pair<int, Points>>& automation, double bpm, int keyChannels) {
    auto station = std::make_unique<Station>();
    station->effect = Made<dsp_effect>([&](dsp_effect** handle, dsp_error* error) {
        return dsp_effect_create(name.c_str(), handle, error);
    });
    dsp_effect* const effect = station->effect.get();
    Explained(
        [&](dsp_error* error) { return dsp_effect_set_state(effect, state.data(), state.size(), error); });
    for (const auto& [parameter, points] : automation) {
        std::vector<dsp_point> jumps;
        for (const auto& [seconds, value] : points)
            jumps.push_back({std::llround(seconds * m_rate), value, 0.0f});
        Check(dsp_effect_automate(effect, parameter, jumps.data(), jumps.size()));
    }
    station->bpm = bpm;
    Check(dsp_effect_tempo_callback(effect, TellTempo, &station->bpm));
    station->keyChannels = keyChannels;
    if (keyChannels > 0) Check(dsp_effect_sidechain_channels(effect, 0, keyChannels));
    m_stations.push_back(std::move(station));
}

void Line::AddEqualizer(const std::vector<std::tuple<int, int, double, int>>& bands, bool invert) {
    auto station = std::make_unique<Station>();
    station->equaliser = Made<dsp_equaliser>(dsp_equaliser_create);
    std::vector<dsp_band> records;
    for (const auto& [type, frequency, gain, q] : bands)
        records.push_back({sizeof(dsp_band), type, frequency, q, 0, 0, gain});
    Explained([&](dsp_error* error) {
        return dsp_equaliser_set_bands(station->equaliser.get(), records.data(),
                                       static_cast<std::int32_t>(records.size()), error);
    });
    Check(dsp_equaliser_invert(station->equaliser.get(), invert));
    m_stations.push_back(std::move(station));
}

void Line::Prepare(int sample) {
    const dsp_format format{sizeof(dsp_format), m_rate, m_channels, sample, kBlock};
    m_sample = -1;  // until all are prepared
    for (const auto& station : m_stations)
        Explained([&](dsp_error* error) {
            return station->effect ? dsp_effect_prepare(station->effect.get(), &format, error)
                                   : dsp_equaliser_prepare(station->equaliser.get(), &format, error);
        });
    m_sample = sample;
    GoToStart(dsp_effect_seek);
}

// Each effect's automation is timed by what it hears, which is late by what comes before it.
void Line::GoToStart(dsp_status(DSP_CALL* go)(dsp_effect*, std::int64_t)) {
    m_position = 0;
    std::int64_t delay = 0;
    for (const auto& station : m_stations)
        if (station->effect) {
            Check(go(station->effect.get(), -delay));
            delay += Asked(dsp_effect_latency, station->effect);
        }
}

void Line::Reset() {
    const py::gil_scoped_release released;
    const std::lock_guard guard(m_lock);
    if (m_sample >= 0) Prepare(m_sample);
}

void Line::Rewind() {
    const py::gil_scoped_release released;
    const std::lock_guard guard(m_lock);
    if (m_sample >= 0) GoToStart(dsp_effect_rewind);
}

int Line::Latency() {
    const py::gil_scoped_release released;
    const std::lock_guard guard(m_lock);
    if (m_sample < 0) Prepare(DSP_F32);
    int latency = 0;
    for (const auto& station : m_stations)
        if (station->effect) latency += Asked(dsp_effect_latency, station->effect);
    return latency;
}

double Line::LongestGap() {
    const py::gil_scoped_release released;
    const std::lock_guard guard(m_lock);
    double gap = 0.0;
    for (const auto& station : m_stations)
        if (station->effect) gap += Asked(dsp_effect_longest_gap, station->effect);
    return gap;
}

template <typename Sample>
void Line::ProcessBlock(Sample* block, int frames, Sample* const* key) {
    for (const auto& station : m_stations) {
        if (station->equaliser) {
            Check(ProcessOne(station->equaliser.get(), block, frames));
            continue;
        }
        if (station->keyChannels > 0 && key) Check(GiveKey(station->effect.get(), key));
        Check(ProcessOne(station->effect.get(), block, frames));
    }
    m_position += frames;
}

template <typename Sample>
void Line::Run(const Passage<Sample>& p) {
    const std::lock_guard guard(m_lock);
    constexpr int sample = sizeof(Sample) == 4 ? DSP_F32 : DSP_F64;
    if (m_sample != sample) {
        if (m_sample >= 0 && m_position > 0)
            throw py::type_error("the stream began with the other type of samples, float32 or float64");
        Prepare(sample);
    }
    auto* const scratch = reinterpret_cast<Sample*>(m_block.data());
    auto* const planes = reinterpret_cast<Sample*>(m_key.data());
    Sample* const key[]{planes, planes + kBlock};
    // Where the result stands as it is processed, one copy is enough.
    const bool direct = p.skip == 0 && p.to.Interleaved(m_channels);
    if (direct) Gather(p.from, 0, p.frames, m_channels, p.to.At(0));
    Interrupt interrupt;
    for (py::ssize_t done = 0; done < p.total;) {
        interrupt.Check();
        const auto count = std::min<py::ssize_t>(kBlock, p.total - done);
        const auto given = std::clamp<py::ssize_t>(p.frames - done, 0, count);
        Sample* const block = direct ? p.to.At(done) : scratch;
        if (!direct) Gather(p.from, done, given, m_channels, block);
        std::fill(block + given * m_channels, block + count * m_channels, Sample{});
        for (py::ssize_t c = 0; c < p.keyChannels; ++c) {
            const Strided<const Sample> channel{p.key.data + c * p.key.channelStep, p.key.frameStep, 1};
            Gather(channel, done, given, 1, key[c]);
            std::fill(key[c] + given, key[c] + count, Sample{});
        }
        ProcessBlock(block, static_cast<int>(count), p.keyChannels > 0 ? key : nullptr);
        const auto late = std::clamp<py::ssize_t>(p.skip - done, 0, count);
        if (!direct) Scatter(block + late * m_channels, count - late, m_channels, p.to, done + late - p.skip);
        done += count;
    }
}

template <typename Sample>
py::array Line::ProcessAs(const py::array& x, py::ssize_t extra, py::ssize_t skip, const py::object& key) {
    if (extra < 0 || skip < 0) throw std::invalid_argument("frames before and behind cannot be below 0");
    const Shape shape = ShapeOf(x, x.ndim() == 1 ? 0 : m_axis, 2);
    if (shape.channels != m_channels)
        throw std::invalid_argument("the stream has " + std::to_string(m_channels) + " channels, the block " +
                                    std::to_string(shape.channels));
    Passage<Sample> passage{};
    py::array keep, keepKey, keyArray;
    passage.from = View<Sample>(x, shape, keep);
    passage.frames = shape.frames;
    passage.total = shape.frames + extra;
    passage.skip = std::min(skip, passage.total);
    if (!key.is_none()) {
        keyArray = AnyArray(key);
        ByType(keyArray, [](auto) {});
        keyArray = py::array_t<Sample, py::array::forcecast>(keyArray);
        const Shape keyShape = ShapeOf(keyArray, keyArray.ndim() == 1 ? 0 : m_axis, 2);
        if (keyShape.frames != shape.frames)
            throw std::invalid_argument("the side-chain has " + std::to_string(keyShape.frames) +
                                        " frames, the signal " + std::to_string(shape.frames));
        passage.key = View<Sample>(keyArray, keyShape, keepKey);
        passage.keyChannels = keyShape.channels;
    }
    auto result = NewArray<Sample>(shape, passage.total - passage.skip);
    passage.to = WholeOf<Sample>(result, shape, passage.total - passage.skip);
    {
        const py::gil_scoped_release released;
        Run(passage);
    }
    return result;
}

py::array Line::Call(const py::object& x) { return Process(AnyArray(x), 0, 0, py::none()); }

py::array Line::Process(const py::array& x, py::ssize_t extra, py::ssize_t skip, const py::object& key) {
    return ByType(x, [&](auto sample) { return ProcessAs<decltype(sample)>(x, extra, skip, key); });
}

void DefineLine(py::module_& module) {
    py::class_<Line>(module, "Line")
        .def(py::init<int, int, int>(), py::arg("rate"), py::arg("channels"), py::arg("axis"))
        .def("_add_effect", &Line::AddEffect)
        .def("_add_equalizer", &Line::AddEqualizer)
        .def("__call__", &Line::Call, py::arg("x"))
        .def("_process", &Line::Process)
        .def("reset", &Line::Reset, "Forgets the sound and begins anew.")
        .def("rewind", &Line::Rewind,
             "Begins at position 0 with delay lines cleared: quicker than reset, but what else sounds goes "
             "on.")
        .def_property_readonly("latency", &Line::Latency, "Frames that the output is later than the input.")
        .def_property_readonly("longest_gap", &Line::LongestGap,
                               "Seconds that may pass between two echoes, as the settings are now.")
        .def_property_readonly("is_double", &Line::IsDouble)
        .def_property_readonly("rate", &Line::Rate, "Hz.")
        .def_property_readonly("channels", &Line::Channels, "1 or 2.")
        .def_property_readonly("axis", &Line::Axis, "The frames' axis in two-dimensional blocks.")
        .def_property_readonly("position", &Line::Position, "Frames processed so far.");
}

}  // namespace python
