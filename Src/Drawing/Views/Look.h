#pragma once

#include "Picture/DrawingColour.h"

// Colours and sizes of everything drawn, also for hosts that draw something beside it. Texts keep a contrast
// of 4.5:1 or more on the ground they stand on.
namespace Corvo::Look {

// clang-format off
constexpr ColourReference kGround     = ColourFromRgb(0x0E1116);  // behind everything
constexpr ColourReference kPlot       = ColourFromRgb(0x12161D);  // behind a curve or picture
constexpr ColourReference kGrid       = ColourFromRgb(0x323C48);  // lines at labels, outlines
constexpr ColourReference kMinorGrid  = ColourFromRgb(0x222A33);  // lines without a label
constexpr ColourReference kLabel      = ColourFromRgb(0xA3AFBE);  // numbers at the scales
constexpr ColourReference kText       = ColourFromRgb(0xE8EDF3);  // what is to be read first
constexpr ColourReference kBox        = ColourFromRgb(0x1D242E);  // behind the texts at the pointer
constexpr ColourReference kCurve      = ColourFromRgb(0x4CC2FF);  // the spectrum
constexpr ColourReference kPeaks      = ColourFromRgb(0xF2A65A);  // its peaks
constexpr ColourReference kPointer    = ColourFromRgb(0xE8EDF3);  // lines through the pointer
constexpr ColourReference kMarker     = ColourFromRgb(0xFF8AD8);  // a reading that was marked
constexpr ColourReference kTrace      = ColourFromRgb(0x7CFF6B);  // the pitch in the sonogram
constexpr ColourReference kInTune     = ColourFromRgb(0x5BE08A);  // a note in its place
constexpr ColourReference kNeedle     = ColourFromRgb(0xF5F7FA);  // the needle of a note that is off

// In 1/96 inch.
constexpr float kSmallest    = 9.0f;   // no text is smaller
constexpr float kLabelSize   = 11.0f;  // text at the scales
constexpr float kInfoSize    = 12.0f;  // text at the pointer
constexpr float kGap         = 4.0f;   // between a scale and its labels
constexpr float kLabelGap    = 10.0f;  // least distance between labels side by side
constexpr float kLevelPitch  = 24.0f;  // least distance between labels of levels
constexpr float kHairline    = 1.0f;   // width of the thinnest lines
constexpr float kCurveWidth  = 1.5f;   // of the spectrum's line
constexpr float kTraceWidth  = 2.0f;   // of the pitch in the sonogram
constexpr float kIntensity   = 12.0f;  // width of the intensity scale's bar
constexpr float kLeastPlot   = 48.0f;  // a plot with less on either side gets no labels
// clang-format on

}  // namespace Corvo::Look
