#pragma once

#include "Picture/DrawingColour.h"

// Colours and sizes of everything drawn, also for hosts that draw something beside it. Texts keep a contrast
// of 4.5:1 or more on the ground they stand on.
namespace Corvo::Look {

// clang-format off
constexpr ColourReference kGround     = ColourFromRgb(0x0E1116);
constexpr ColourReference kPlot       = ColourFromRgb(0x12161D);
constexpr ColourReference kGrid       = ColourFromRgb(0x323C48);
constexpr ColourReference kMinorGrid  = ColourFromRgb(0x222A33);
constexpr ColourReference kLabel      = ColourFromRgb(0xA3AFBE);
constexpr ColourReference kText       = ColourFromRgb(0xE8EDF3);
constexpr ColourReference kBox        = ColourFromRgb(0x1D242E);
constexpr ColourReference kCurve      = ColourFromRgb(0x4CC2FF);
constexpr ColourReference kPeaks      = ColourFromRgb(0xF2A65A);
constexpr ColourReference kPointer    = ColourFromRgb(0xE8EDF3);
constexpr ColourReference kMarker     = ColourFromRgb(0xFF8AD8);
constexpr ColourReference kTrace      = ColourFromRgb(0x7CFF6B);
constexpr ColourReference kInTune     = ColourFromRgb(0x5BE08A);
constexpr ColourReference kNeedle     = ColourFromRgb(0xF5F7FA);

// In 1/96 inch.
constexpr float kSmallest    = 9.0f;   // no text is smaller
constexpr float kLabelSize   = 11.0f;
constexpr float kInfoSize    = 12.0f;
constexpr float kGap         = 4.0f;
constexpr float kLabelGap    = 10.0f;  // least distance between labels side by side
constexpr float kLevelPitch  = 24.0f;  // least distance between labels of levels
constexpr float kHairline    = 1.0f;
constexpr float kCurveWidth  = 1.5f;
constexpr float kTraceWidth  = 2.0f;
constexpr float kIntensity   = 12.0f;  // width of the intensity scale's bar
constexpr float kLeastPlot   = 48.0f;  // a plot with less on either side gets no labels
// clang-format on

}  // namespace Corvo::Look
