#include <src/lv2/instance-access.h>
#include <src/lv2/options.h>
#include <src/lv2/ui.h>
#include <src/lv2/urid.h>

#include <cstring>
#include <exception>
#include <memory>

#include "Lv2Instance.h"
#include "Lv2Ports.h"

// The window of LV2 plug-ins that have one. It reaches the plug-in directly, in the same file.
namespace {

using namespace Corvo::Plugins;

double ScaleOf(const LV2_Feature* const* features) {
    const auto* const map = static_cast<const LV2_URID_Map*>(Lv2Feature(features, LV2_URID__map));
    const auto* option = static_cast<const LV2_Options_Option*>(Lv2Feature(features, LV2_OPTIONS__options));
    if (!map || !option) return 0.0;
    const LV2_URID key = map->map(map->handle, LV2_UI__scaleFactor);
    for (; option->key != 0; ++option)
        if (option->key == key && option->size == sizeof(float))
            return static_cast<double>(*static_cast<const float*>(option->value));
    return 0.0;
}

LV2UI_Handle Instantiate(const LV2UI_Descriptor*, const char*, const char*, LV2UI_Write_Function,
                         LV2UI_Controller, LV2UI_Widget* widget, const LV2_Feature* const* features) try {
    auto* const instance =
        static_cast<Lv2Instance*>(const_cast<void*>(Lv2Feature(features, LV2_INSTANCE_ACCESS_URI)));
    const void* const parent = Lv2Feature(features, LV2_UI__parent);
    if (!instance || !parent) return nullptr;
    auto window = instance->core->MakeWindow();
    if (!window) return nullptr;
    if (const double scale = ScaleOf(features); scale > 0.0) window->SetScale(scale);
    if (!window->Open(reinterpret_cast<std::uintptr_t>(parent))) return nullptr;
    *widget = reinterpret_cast<LV2UI_Widget>(window->Handle());
    const auto [width, height] = window->GetSize();
    if (const auto* const resize = static_cast<const LV2UI_Resize*>(Lv2Feature(features, LV2_UI__resize)))
        resize->ui_resize(resize->handle, width, height);
    return window.release();
} catch (const std::exception&) {
    return nullptr;  // no memory
}

constexpr LV2UI_Idle_Interface kIdle{[](LV2UI_Handle window) {
    static_cast<Window*>(window)->Idle();
    return 0;
}};

constexpr LV2UI_Descriptor kDescriptor{
    kLv2WindowUri, Instantiate, [](LV2UI_Handle window) { delete static_cast<Window*>(window); }, nullptr,
    [](const char* uri) -> const void* {
        return std::strcmp(uri, LV2_UI__idleInterface) == 0 ? &kIdle : nullptr;
    }};

}  // namespace

LV2_SYMBOL_EXPORT const LV2UI_Descriptor* lv2ui_descriptor(std::uint32_t index) {
    return index == 0 ? &kDescriptor : nullptr;
}
