#include <pybind11/pybind11.h>
#include <xmmintrin.h>

#include "Analysis.h"
#include "Conversion.h"
#include "Effect.h"
#include "Interrupt.h"
#include "Line.h"

// The package's inner module: what its Python files are written on top of.
PYBIND11_MODULE(_native, module) {
    // A library that this one loads flushes denormal numbers in the whole thread, which is not ours to
    // decide: back to what Python and NumPy count on.
    constexpr unsigned kFlushes = 0x8040;
    _mm_setcsr(_mm_getcsr() & ~kFlushes);
    const std::uint32_t version = dsp_version();
    module.attr("version") = std::to_string(version >> 16) + "." + std::to_string(version >> 8 & 255) + "." +
                             std::to_string(version & 255);
    python::Interrupt::FindMainThread();
    python::DefineEffect(module);
    python::DefineLine(module);
    python::DefineConversion(module);
    python::DefineAnalysis(module);
}
