#include "Drawing/DrawingD2D.h"
#include "Drawing/Views.h"

DSP_INSTANTIATE_VIEWS(Corvo::DrawingD2D)
