#include "SavedState.h"

#include <algorithm>
#include <bit>
#include <iterator>

namespace Corvo::Plugins {
namespace {

constexpr std::uint8_t kTag[]{'D', 'S', 'P', '1'};

}  // namespace

std::vector<std::uint8_t> SaveState(Core& core) {
    std::vector<std::uint8_t> bytes(std::begin(kTag), std::end(kTag));
    bytes.push_back(core.Bypassed());
    for (std::size_t i = 0; i < core.Ports().size(); ++i) {
        const Port& port = core.Ports()[i];
        if (port.isOutput) continue;
        const float value = port.momentary ? port.start : core.Value(static_cast<int>(i));
        const auto word = std::bit_cast<std::uint32_t>(value);
        for (int shift = 0; shift < 32; shift += 8) bytes.push_back(static_cast<std::uint8_t>(word >> shift));
    }
    const auto settings = core.State();
    bytes.insert(bytes.end(), settings.begin(), settings.end());
    return bytes;
}

bool LoadState(Core& core, const std::vector<std::uint8_t>& bytes) {
    constexpr std::size_t kValues = std::size(kTag) + 1;
    const auto ports = std::ranges::count(core.Ports(), false, &Port::isOutput);
    const std::size_t header = kValues + 4 * static_cast<std::size_t>(ports);
    if (bytes.size() < header || !std::equal(std::begin(kTag), std::end(kTag), bytes.begin())) return false;
    if (!core.TakeState({bytes.begin() + static_cast<std::ptrdiff_t>(header), bytes.end()})) return false;
    core.Bypass(bytes[std::size(kTag)] != 0);
    std::vector<float> values;
    auto next = bytes.begin() + kValues;
    for (const Port& port : core.Ports()) {
        std::uint32_t word = 0;
        for (int shift = 0; shift < 32 && !port.isOutput; shift += 8)
            word |= static_cast<std::uint32_t>(*next++) << shift;
        values.push_back(std::bit_cast<float>(word));
    }
    core.Recall(values);
    return true;
}

}  // namespace Corvo::Plugins
