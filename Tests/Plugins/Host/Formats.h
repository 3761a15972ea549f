#pragma once

#include <algorithm>
#include <array>

#include "Instance.h"
#include "Support/AudioThreadRules.h"

// What the hosts of both formats have in common.
namespace PluginHost {

// Gives every port its channels in the format's own record.
template <typename Buffer, typename Count>
void Divide(const std::vector<Port>& ports, std::span<float* const> channels, std::array<Buffer, 4>& buffers,
            float** Buffer::*data, Count Buffer::*count) {
    std::size_t channel = 0;
    for (std::size_t i = 0; i < ports.size() && i < buffers.size() && !channels.empty(); ++i) {
        buffers[i].*data = const_cast<float**>(channels.data() + channel);
        buffers[i].*count = static_cast<Count>(ports[i].channels);
        channel += static_cast<std::size_t>(ports[i].channels);
    }
}

// The plug-in's work, under the rules of the audio thread.
inline void InRealTime(const auto& call) {
    const std::string broken = TestSupport::BrokenBy(call);
    if (!broken.empty() && IsRealTime()) Finding("does on the audio thread: " + broken);
}

}  // namespace PluginHost
