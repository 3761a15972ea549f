#pragma once

namespace Corvo {

// Reports a failed internal assertion to the debugger on Windows and to standard error elsewhere. The program
// goes on. `sourcePath` is the file as the tree names it, without its ending ("Src/DSP/Effects/Compressor").
void ReportAssertion(const char* sourcePath, const char* expression) noexcept;

}  // namespace Corvo
