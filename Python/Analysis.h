#pragma once

#include <pybind11/pybind11.h>

namespace python {

// Spectra and notes of whole arrays, and the library's pictures of them.
void DefineAnalysis(pybind11::module_& module);

}  // namespace python
