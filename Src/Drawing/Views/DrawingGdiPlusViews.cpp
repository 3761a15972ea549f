#include "Drawing/Backends/DrawingGdiPlus.h"
#include "Drawing/Views/Views.h"

DSP_INSTANTIATE_VIEWS(Corvo::DrawingGdiPlus)
