#pragma once

#include <pybind11/pybind11.h>

namespace python {

// Sample-rate conversion and pitch shift of whole arrays, and the equaliser's curve.
void DefineConversion(pybind11::module_& module);

}  // namespace python
