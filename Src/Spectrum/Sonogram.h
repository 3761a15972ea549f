#pragma once

#include "Platform/Export.h"

namespace Corvo {

// The sonogram's choices, shared by all sonograms; any thread may read and set them.
class DSP_API Sonogram {
public:
    // 0..8: 5, 10, 15, 30, 60, 90, 150, 300 or 450 columns a second; an index outside is moved to the nearer
    // end.
    static void SetSpeedIndex(int index);
    static int GetSpeedIndex();
    // Kept as given; a scheme outside 0..6 has the colours of 0.
    static void SetColourScheme(int scheme);
    static int GetColourScheme();
};

}  // namespace Corvo
