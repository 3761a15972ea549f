#include "SavedState.h"

#include <algorithm>
#include <bit>
#include <iterator>

namespace Corvo::Plugins {
namespace {

constexpr std::uint8_t kTag[]{'D', 'S', 'P', '1'};

}  // namespace

std::vector<std::uint8_t> SaveState(Adapter& adapter) {
    std::vector<std::uint8_t> bytes(std::begin(kTag), std::end(kTag));
    bytes.push_back(adapter.Bypassed());
    for (std::size_t i = 0; i < adapter.Ports().size(); ++i) {
        const auto word = std::bit_cast<std::uint32_t>(adapter.Value(static_cast<int>(i)));
        for (int shift = 0; shift < 32; shift += 8) bytes.push_back(static_cast<std::uint8_t>(word >> shift));
    }
    const auto settings = adapter.State();
    bytes.insert(bytes.end(), settings.begin(), settings.end());
    return bytes;
}

bool LoadState(Adapter& adapter, const std::vector<std::uint8_t>& bytes) {
    constexpr std::size_t kValues = std::size(kTag) + 1;
    const std::size_t ports = adapter.Ports().size(), header = kValues + 4 * ports;
    if (bytes.size() < header || !std::equal(std::begin(kTag), std::end(kTag), bytes.begin())) return false;
    if (!adapter.TakeState({bytes.begin() + static_cast<std::ptrdiff_t>(header), bytes.end()})) return false;
    adapter.Bypass(bytes[std::size(kTag)] != 0);
    std::vector<float> values;
    for (std::size_t i = 0; i < ports; ++i) {
        std::uint32_t word = 0;
        for (std::size_t byte = 4; byte-- > 0;) word = word << 8 | bytes[kValues + 4 * i + byte];
        values.push_back(std::bit_cast<float>(word));
    }
    adapter.Recall(values);
    return true;
}

}  // namespace Corvo::Plugins
