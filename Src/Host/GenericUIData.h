#pragma once

#include <string>
#include <vector>

// One pad of the host's XY editor: the parameters that its two axes move.
struct PluginParamXYGroupInfo {
    std::string name;         // its title
    int index = 0;            // which of the effect's groups this is, from 0
    std::vector<int> x_axis;  // real parameter indices moved along x
    std::vector<int> y_axis;  // and along y
};

// The XY editor's data, filled by CorvoEffectBase::InitializeXyEditingData.
struct GenericUIData {
    std::vector<PluginParamXYGroupInfo> groups;  // the pads, in order
    std::vector<std::string> entries;            // names under which presets are shown in the editor
};
