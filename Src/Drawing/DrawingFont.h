#pragma once

#include <string>

#include "Platform/Export.h"

namespace Corvo {

// The typeface of all drawn text: "Montserrat", installed on the system or from a file of the host's; without
// either the system's plain sans-serif stands in.
class DSP_API DrawingFont {
public:
    static constexpr const char* kFamily = "Montserrat";        // as systems list it
    static constexpr const char* kFace = "Montserrat-Regular";  // its one weight that is used

    // The typeface's file, a path in UTF-8, for back-ends made from now on; empty for the installed one. A
    // file that cannot be read is as none. Any thread.
    static void SetFile(const std::string& path);
    static std::string GetFile();
};

}  // namespace Corvo
