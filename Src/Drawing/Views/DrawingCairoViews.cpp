#include "Drawing/Backends/DrawingCairo.h"
#include "Drawing/Views/Views.h"

DSP_INSTANTIATE_VIEWS(Corvo::DrawingCairo)
