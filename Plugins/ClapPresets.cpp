#include "ClapPresets.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <memory>
#include <new>
#include <string>

namespace Corvo::Plugins {
namespace {

constexpr ClapPresetProvider::Descriptor kDescriptor{CLAP_VERSION, "urn:dspdll:presets", "DSPDll presets",
                                                     "DSPDll"};

// Hosts keep it: it says the plug-in too, since all presets lie in one place.
std::string KeyOf(const PluginRow& row, int preset) {
    return std::string(row.id) + ":preset-" + std::to_string(preset + 1);
}

// False when the host wants no more.
bool ListPresets(const PluginRow& row, const ClapPresetReceiver& host) {
    int preset = 0;
    for (const std::string& name : PresetNamesOf(row)) {
        if (!host.beginPreset(&host, name.c_str(), KeyOf(row, preset++).c_str())) return false;
        for (const int channels : {2, 1}) {
            const std::string uri = PluginUri(row, channels);
            const ClapPresetReceiver::PluginId id{"clap", uri.c_str()};
            host.addPlugin(&host, &id);
        }
        host.setFlags(&host, kClapFactoryContent);
        host.addCreator(&host, kDescriptor.vendor);
        host.addFeature(&host, row.clapFeature);
    }
    return true;
}

bool List(const ClapPresetProvider*, std::uint32_t kind, const char*, const ClapPresetReceiver* host) try {
    if (kind != kClapPresetsInPlugin) {
        host->onError(host, 0, "All presets lie in the plug-in itself");
        return false;
    }
    for (const PluginRow& row : PluginRows())
        if (!ListPresets(row, *host)) break;
    return true;
} catch (const std::exception& error) {
    host->onError(host, 0, error.what());
    return false;
}

// Its data is the host's indexer.
const ClapPresetProvider* Create(const ClapPresetFactory*, const ClapPresetIndexer* indexer, const char* id) {
    if (!indexer || !id || std::strcmp(id, kDescriptor.id) != 0) return nullptr;
    return new (std::nothrow)
        ClapPresetProvider{&kDescriptor,
                           const_cast<ClapPresetIndexer*>(indexer),
                           [](const ClapPresetProvider* provider) {
                               const auto* const host = static_cast<const ClapPresetIndexer*>(provider->data);
                               const ClapPresetLocation location{kClapFactoryContent, kDescriptor.name,
                                                                 kClapPresetsInPlugin, nullptr};
                               return host->declareLocation(host, &location);
                           },
                           [](const ClapPresetProvider* provider) { delete provider; },
                           List,
                           [](const ClapPresetProvider*, const char*) -> const void* { return nullptr; }};
}

constexpr ClapPresetFactory kFactory{
    [](const ClapPresetFactory*) { return 1u; },
    [](const ClapPresetFactory*, std::uint32_t index) { return index == 0 ? &kDescriptor : nullptr; },
    Create};

bool HasPresets() {
    static const bool has =
        std::ranges::any_of(PluginRows(), [](const PluginRow& row) { return !PresetNamesOf(row).empty(); });
    return has;
}

}  // namespace

const ClapPresetFactory* FindClapPresetFactory(const char* id) {
    for (const char* const known : kClapPresetFactory)
        if (std::strcmp(id, known) == 0 && HasPresets()) return &kFactory;
    return nullptr;
}

int PresetOfClapKey(Core& core, const char* key) {
    for (int preset = 0; key && preset < core.Presets(); ++preset)
        if (key == KeyOf(core.Row(), preset)) return preset;
    return -1;
}

}  // namespace Corvo::Plugins
