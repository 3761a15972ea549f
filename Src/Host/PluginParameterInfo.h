#pragma once

#include <string>
#include <vector>

// How the host's generic editor lays out one parameter; filled by CorvoEffectBase::GetParamSectionInfo.
struct PluginParameterInfo {
    int param_index = 0;  // real parameter index
    bool is_switch = false;
    int layout_group = 0;
    std::vector<std::string> values;  // choices of a list parameter
    bool hidden = false;
    std::string label;
};
