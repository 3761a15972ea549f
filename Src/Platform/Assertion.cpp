#include "Platform/Assertion.h"

#include <cstdio>

#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
#endif

namespace Corvo {

void ReportAssertion(const char* sourcePath, const char* expression) noexcept {
    char text[512];
    std::snprintf(text, sizeof text, "%s: assertion failed: %s\n", sourcePath, expression);
#if defined(_WIN32)
    OutputDebugStringA(text);
#else
    std::fputs(text, stderr);
#endif
}

}  // namespace Corvo
