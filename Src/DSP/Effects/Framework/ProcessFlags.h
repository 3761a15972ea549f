#pragma once

namespace Corvo::DSP {

// Travels with every block.
struct ProcessFlags {
    bool force_cook = false;      // host: derive everything afresh for this block
    bool params_changed = false;  // library: automation changed a parameter in front of this block
};
static_assert(sizeof(ProcessFlags) == 2);

}  // namespace Corvo::DSP
