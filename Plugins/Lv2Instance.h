#pragma once

#include <src/lv2/lv2.h>

#include <cstring>
#include <memory>

#include "Core.h"

namespace Corvo::Plugins {

// What an LV2 host holds of a plug-in, and hands to its window.
struct Lv2Instance {
    explicit Lv2Instance(std::unique_ptr<Core> made) : core(std::move(made)) {}
    virtual ~Lv2Instance() = default;

    const std::unique_ptr<Core> core;
};

// What the host gives under that name; null where it gives nothing.
inline void* Lv2Feature(const LV2_Feature* const* features, const char* uri) {
    for (; features && *features; ++features)
        if (std::strcmp((*features)->URI, uri) == 0) return (*features)->data;
    return nullptr;
}

}  // namespace Corvo::Plugins
