#pragma once

#include <string>
#include <vector>

// How the host's generic editor lays out one parameter; filled by CorvoEffectBase::GetParamSectionInfo.
struct PluginParameterInfo {
    int param_index = 0;              // real parameter index
    bool is_switch = false;           // an on/off button, where the effect says so
    int layout_group = 0;             // index in GetParamUiSections(); -1: in none of them
    std::vector<std::string> values;  // choices of a list parameter
    bool hidden = false;              // not shown with the present format
    std::string label;                // what stands at the control; UTF-8
};
