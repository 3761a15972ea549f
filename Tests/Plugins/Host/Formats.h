#pragma once

#include <algorithm>
#include <array>
#include <cstring>

#include "Instance.h"
#include "Support/AudioThreadRules.h"

// What the hosts of both formats have in common.
namespace PluginHost {

// A state on its way, so many bytes at a time.
struct Stream {
    Bytes bytes;
    std::size_t most, position = 0;

    std::int64_t Read(void* buffer, std::int64_t size) {
        const auto count = std::min({static_cast<std::size_t>(size), most, bytes.size() - position});
        if (count) std::memcpy(buffer, bytes.data() + position, count);
        position += count;
        return static_cast<std::int64_t>(count);
    }
    std::int64_t Write(const void* buffer, std::int64_t size) {
        const auto count = std::min(static_cast<std::size_t>(size), most);
        const char* const from = static_cast<const char*>(buffer);
        bytes.insert(bytes.end(), from, from + count);
        return static_cast<std::int64_t>(count);
    }
};

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

// The plug-in's process, under the rules of the audio thread.
template <typename Call>
auto InRealTime(Call call) {
    std::string broken;
    const auto result = [&] {
        TestSupport::AudioThreadRules rules;
        const auto made = call();
        broken = rules.Broken();
        return made;
    }();
    ExpectRealTime(broken);
    return result;
}

}  // namespace PluginHost
