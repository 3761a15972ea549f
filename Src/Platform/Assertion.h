#pragma once

namespace Corvo {

// Reports a failed internal assertion with the source path inside the tree and the expression, to the
// debugger on Windows and to standard error elsewhere. The program goes on.
void ReportAssertion(const char* sourcePath, const char* expression) noexcept;

}  // namespace Corvo

// `sourcePath` is the file as the tree names it, without its ending ("Src/DSP/Effects/Compressor").
#define DSP_ASSERT(expression, sourcePath) \
    ((expression) ? void() : ::Corvo::ReportAssertion(sourcePath, #expression))
