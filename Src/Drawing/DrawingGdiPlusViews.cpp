#include "Drawing/DrawingGdiPlus.h"
#include "Drawing/Views.h"

DSP_INSTANTIATE_VIEWS(Corvo::DrawingGdiPlus)
