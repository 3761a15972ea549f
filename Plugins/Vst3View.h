#pragma once

#include <travesty/view.h>

#include <atomic>
#include <memory>

#include "Vst3Object.h"
#include "Window.h"

namespace Corvo::Plugins {

// A plug-in's window as VST3 wants it: a view that the host attaches to a window of its own, driven by the
// timer of the host's loop.
class Vst3View {
public:
    // With one reference, which belongs to whom Face is given. Holds the owner.
    Vst3View(std::unique_ptr<Window> window, v3_funknown** owner);

    v3_plugin_view** Face() { return reinterpret_cast<v3_plugin_view**>(&m_view); }

private:
    ~Vst3View();
    struct Tables;
    using Own = Vst3Face<Vst3View>;

    v3_result Query(const std::uint8_t* id, void** object);
    std::uint32_t Ref();
    std::uint32_t Unref();

    v3_result IsSupported(const char* platform);
    v3_result Attached(void* parent, const char* platform);
    v3_result Removed();
    v3_result Wheel(float distance);
    v3_result Key(std::int16_t letter, std::int16_t code, std::int16_t modifiers);
    v3_result GetSize(v3_view_rect* rectangle);
    v3_result OnSize(v3_view_rect* rectangle);
    v3_result OnFocus(v3_bool on);
    v3_result SetFrame(v3_plugin_frame** frame);
    v3_result CanResize();
    v3_result CheckSize(v3_view_rect* rectangle);
    v3_result SetScale(float scale);
    void OnTimer();

    Own m_view, m_timer, m_scale;
    std::atomic<std::uint32_t> m_references{1};
    const std::unique_ptr<Window> m_window;
    v3_funknown** const m_owner;
    v3_run_loop** m_loop = nullptr;
    bool m_attached = false;
};

}  // namespace Corvo::Plugins
