#pragma once

#include <cstdint>

#include "Picture/DrawingColour.h"
#include "Platform/Export.h"

namespace Corvo {

// A brush or pen of a back-end.
struct DrawingBrush {
    void* object = nullptr;  // the back-end's own; null when it could not be made
};
struct DrawingPen {
    void* object = nullptr;  // the same
};

// What every drawing back-end can do with its resources. Used on the thread that draws.
class DSP_API DrawingApi {
public:
    virtual ~DrawingApi();
    // A brush of one colour; opacity 0 (clear) to 255. The caller releases it.
    virtual DrawingBrush CreateSolidBrush(ColourReference colour, std::uint8_t opacity) = 0;
    // Deletes the brush; the caller's handle is left as it is. An empty handle is ignored.
    virtual void ReleaseBrush(DrawingBrush brush) = 0;
    // Deletes the pen and its holder and sets the pointer to null. Null is ignored.
    virtual void ReleasePen(DrawingPen*& pen) = 0;

    // The host's setting "EnableD2d": whether it draws through Direct2D. Class-wide, off at the start; any
    // thread.
    static void SetEnableD2d(bool enable);
    static bool GetEnableD2d();
};

}  // namespace Corvo
