#include "Drawing/Backends/DrawingD2D.h"
#include "Drawing/Views/Views.h"

DSP_INSTANTIATE_VIEWS(Corvo::DrawingD2D)
