#pragma once

#include <pybind11/numpy.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "Arrays.h"
#include "Handle.h"

namespace python {

// Effects and equalisers one behind the other, for one stream: what the package calls a Stream. Build it with
// Add... before anything else; the first block's type decides whether it works in floats or doubles.
//
// Any thread, one after the other: a second one waits. The interpreter's lock is released while samples are
// processed.
class Line {
public:
    using Points = std::vector<std::pair<double, float>>;  // seconds, normalised value

    // `channels` 1 or 2, `axis` that of the frames in two-dimensional blocks.
    Line(int rate, int channels, int axis);
    // `automation` by parameter; `keyChannels` of the side-chain, 0 for none.
    void AddEffect(const std::string& name, const std::string& state,
                   const std::vector<std::pair<int, Points>>& automation, double bpm, int keyChannels);
    // Each (type, frequency, gain, q).
    void AddEqualizer(const std::vector<std::tuple<int, int, double, int>>& bands, bool invert);

    // A block of any length becomes a block of the same shape and type.
    pybind11::array Call(const pybind11::object& x);
    // The same, followed by `extra` frames of silence, without the first `skip` frames of the result. `key`
    // is an array of either type for the side-chain, as long as x, or None.
    pybind11::array Process(const pybind11::array& x, py::ssize_t extra, py::ssize_t skip,
                            const pybind11::object& key);
    // Forgets the sound and begins at position 0.
    void Reset();
    // The same, but only delay lines are cleared: at a small part of the cost.
    void Rewind();
    int Latency();
    double LongestGap();
    bool IsDouble() const { return m_sample == DSP_F64; }
    int Rate() const { return m_rate; }
    int Channels() const { return m_channels; }
    int Axis() const { return m_axis; }
    std::int64_t Position() const { return m_position; }

private:
    struct Station {
        Owned<dsp_effect> effect;  // or:
        Owned<dsp_equaliser> equaliser;
        double bpm = 0.0;
        int keyChannels = 0;
    };
    // Where a block comes from and goes to.
    template <typename Sample>
    struct Passage {
        Strided<const Sample> from, key;
        py::ssize_t frames, keyChannels, total, skip;
        Strided<Sample> to;
    };

    void Prepare(int sample);
    void GoToStart(dsp_status(DSP_CALL* go)(dsp_effect*, std::int64_t));
    template <typename Sample>
    pybind11::array ProcessAs(const pybind11::array& x, py::ssize_t extra, py::ssize_t skip,
                              const pybind11::object& key);
    template <typename Sample>
    void Run(const Passage<Sample>& passage);
    template <typename Sample>
    void ProcessBlock(Sample* block, int frames, Sample* const* key);

    const int m_rate, m_channels, m_axis;
    std::vector<std::unique_ptr<Station>> m_stations;
    std::mutex m_lock;
    std::atomic<int> m_sample = -1;  // DSP_F32 or DSP_F64; -1 before the first preparation
    std::atomic<std::int64_t> m_position = 0;
    std::vector<double> m_block, m_key;  // memory for a block of either type
};

void DefineLine(pybind11::module_& module);

}  // namespace python
