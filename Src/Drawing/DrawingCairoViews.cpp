#include "Drawing/DrawingCairo.h"
#include "Drawing/Views.h"

DSP_INSTANTIATE_VIEWS(Corvo::DrawingCairo)
