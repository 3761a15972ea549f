#pragma once

#include <pybind11/pybind11.h>

#include <chrono>

namespace python {

// For loops that run without the interpreter's lock: Ctrl+C ends them within a part of a second.
class Interrupt {
public:
    // Throws what a signal's handler raised. Call it for every block.
    void Check() {
        // Even reading the clock takes a part of what a cheap effect takes for a block.
        if (++m_blocks % kBlocks != 0) return;
        const auto now = Clock::now();
        if (now < m_next) return;
        m_next = now + kPause;
        const pybind11::gil_scoped_acquire locked;
        if (PyErr_CheckSignals() != 0) throw pybind11::error_already_set();
    }

private:
    using Clock = std::chrono::steady_clock;
    static constexpr std::chrono::milliseconds kPause{200};

    static constexpr unsigned kBlocks = 16;

    unsigned m_blocks = 0;
    Clock::time_point m_next = Clock::now() + kPause;
};

}  // namespace python
