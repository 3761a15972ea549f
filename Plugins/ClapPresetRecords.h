#pragma once

#include <src/clap/plugin.h>

// CLAP's interfaces for presets, which the headers inside of DPF do not have: how a host lists those of a
// file before it makes a plug-in, and how it has one loaded. Layouts and names are CLAP's. Texts are UTF-8
// and belong to the caller; they are valid for the call.
namespace Corvo::Plugins {

// Each came with another name first, and some hosts ask for that one.
constexpr const char* kClapPresetFactory[]{"clap.preset-discovery-factory/2",
                                           "clap.preset-discovery-factory/draft-2"};
constexpr const char* kClapPresetLoad[]{"clap.preset-load/2", "clap.preset-load.draft/2"};

// Kinds of places, and of what lies there. A place inside of the plug-in's own file has no path: null.
constexpr std::uint32_t kClapPresetsInPlugin = 1, kClapFactoryContent = 1;

// A host's side of the list.
struct ClapPresetReceiver {
    using Text = void(CLAP_ABI*)(const ClapPresetReceiver*, const char*);
    struct PluginId {
        const char *abi, *id;  // "clap" and the descriptor's
    };

    void* data;
    void(CLAP_ABI* onError)(const ClapPresetReceiver*, std::int32_t systemError, const char* message);
    // What follows is about this one. False: the host wants no more.
    bool(CLAP_ABI* beginPreset)(const ClapPresetReceiver*, const char* name, const char* key);
    void(CLAP_ABI* addPlugin)(const ClapPresetReceiver*, const PluginId*);
    Text setSoundpack;
    void(CLAP_ABI* setFlags)(const ClapPresetReceiver*, std::uint32_t flags);
    Text addCreator, setDescription;
    void(CLAP_ABI* setTimes)(const ClapPresetReceiver*, std::uint64_t created, std::uint64_t changed);
    Text addFeature;
    void(CLAP_ABI* addInfo)(const ClapPresetReceiver*, const char* key, const char* value);
};

struct ClapPresetLocation {
    std::uint32_t flags;
    const char* name;
    std::uint32_t kind;
    const char* path;
};

// A host's side of what there is to list.
struct ClapPresetIndexer {
    clap_version_t version;
    const char *name, *vendor, *url, *hostVersion;
    void* data;
    bool(CLAP_ABI* declareFileType)(const ClapPresetIndexer*, const void*);
    bool(CLAP_ABI* declareLocation)(const ClapPresetIndexer*, const ClapPresetLocation*);
    bool(CLAP_ABI* declareSoundpack)(const ClapPresetIndexer*, const void*);
    const void*(CLAP_ABI* extension)(const ClapPresetIndexer*, const char* id);
};

struct ClapPresetProvider {
    struct Descriptor {
        clap_version_t version;
        const char *id, *name, *vendor;
    };

    const Descriptor* descriptor;
    void* data;
    bool(CLAP_ABI* init)(const ClapPresetProvider*);  // declares the locations
    void(CLAP_ABI* destroy)(const ClapPresetProvider*);
    bool(CLAP_ABI* list)(const ClapPresetProvider*, std::uint32_t kind, const char* path,
                         const ClapPresetReceiver*);
    const void*(CLAP_ABI* extension)(const ClapPresetProvider*, const char* id);
};

// Any thread.
struct ClapPresetFactory {
    std::uint32_t(CLAP_ABI* count)(const ClapPresetFactory*);
    const ClapPresetProvider::Descriptor*(CLAP_ABI* descriptor)(const ClapPresetFactory*, std::uint32_t);
    const ClapPresetProvider*(CLAP_ABI* create)(const ClapPresetFactory*, const ClapPresetIndexer*,
                                                const char* providerId);
};

// Of a plug-in and of its host. The main thread.
struct ClapPresetLoad {
    bool(CLAP_ABI* load)(const clap_plugin_t*, std::uint32_t kind, const char* path, const char* key);
};
struct ClapHostPresetLoad {
    void(CLAP_ABI* onError)(const clap_host_t*, std::uint32_t kind, const char* path, const char* key,
                            std::int32_t systemError, const char* message);
    void(CLAP_ABI* loaded)(const clap_host_t*, std::uint32_t kind, const char* path, const char* key);
};

}  // namespace Corvo::Plugins
