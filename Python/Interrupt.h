#pragma once

#include <pybind11/pybind11.h>

#include <chrono>

namespace python {

// For loops that run without the interpreter's lock: Ctrl+C ends them within a part of a second. Signals are
// the main thread's; all others go on undisturbed, and do not ask for the lock of an interpreter that ends.
class Interrupt {
public:
    // When the module is loaded, with the interpreter's lock.
    static void FindMainThread() {
        s_main =
            pybind11::module_::import("threading").attr("main_thread")().attr("ident").cast<unsigned long>();
    }

    // Throws what a signal's handler raised. Call it for every block.
    void Check() {
        // Even reading the clock takes a part of what a cheap effect takes for a block.
        if (++m_blocks % kBlocks != 0 || PyThread_get_thread_ident() != s_main) return;
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
    static inline unsigned long s_main = 0;

    unsigned m_blocks = 0;
    Clock::time_point m_next = Clock::now() + kPause;
};

}  // namespace python
