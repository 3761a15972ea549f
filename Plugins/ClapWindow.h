#pragma once

#include <src/clap/ext/gui.h>
#include <src/clap/ext/timer-support.h>

#include <cstring>
#include <exception>
#include <memory>

#include "Core.h"

namespace Corvo::Plugins {

// A plug-in's window as CLAP wants it: inside of one of the host's, driven by the host's timer.
class ClapWindow {
public:
    ClapWindow(Core& core, const clap_host_t* host) : m_core(core), m_host(host) {}
    ~ClapWindow() { Destroy(); }
    ClapWindow(const ClapWindow&) = delete;
    ClapWindow& operator=(const ClapWindow&) = delete;

    // The extension of plug-ins whose window kOf finds; null for another's name.
    template <ClapWindow& (*kOf)(const clap_plugin_t*)>
    static const void* Extension(const char* id);

private:
    const clap_host_timer_support_t* Timers() const {
        return static_cast<const clap_host_timer_support_t*>(
            m_host->get_extension(m_host, CLAP_EXT_TIMER_SUPPORT));
    }
    static bool Supports(const char* api, bool floating) {
        return api && std::strcmp(api, CLAP_WINDOW_API_X11) == 0 && !floating;
    }
    bool Create(const char* api, bool floating) try {
        const auto* const timers = Timers();
        if (m_window || !Supports(api, floating) || !timers) return false;
        m_window = m_core.MakeWindow();
        if (m_window && timers->register_timer(m_host, Window::kIdlePeriod, &m_timer)) return true;
        m_window.reset();
        return false;
    } catch (const std::exception&) {
        return false;  // no memory
    }
    void Destroy() {
        if (!m_window) return;
        Timers()->unregister_timer(m_host, m_timer);
        m_window.reset();
    }

    Core& m_core;
    const clap_host_t* const m_host;
    std::unique_ptr<Window> m_window;
    clap_id m_timer = CLAP_INVALID_ID;
};

template <ClapWindow& (*kOf)(const clap_plugin_t*)>
const void* ClapWindow::Extension(const char* id) {
    static constexpr auto window = [](const clap_plugin_t* plugin) { return kOf(plugin).m_window.get(); };
    static constexpr clap_plugin_gui_t kGui{
        [](const clap_plugin_t*, const char* api, bool floating) { return Supports(api, floating); },
        [](const clap_plugin_t*, const char** api, bool* floating) {
            *api = CLAP_WINDOW_API_X11;
            *floating = false;
            return true;
        },
        [](const clap_plugin_t* plugin, const char* api, bool floating) {
            return kOf(plugin).Create(api, floating);
        },
        [](const clap_plugin_t* plugin) { kOf(plugin).Destroy(); },
        [](const clap_plugin_t* plugin, double scale) {
            if (!window(plugin)) return false;
            window(plugin)->SetScale(scale);
            return true;
        },
        [](const clap_plugin_t* plugin, std::uint32_t* width, std::uint32_t* height) {
            if (!window(plugin)) return false;
            *width = static_cast<std::uint32_t>(window(plugin)->GetSize().width);
            *height = static_cast<std::uint32_t>(window(plugin)->GetSize().height);
            return true;
        },
        [](const clap_plugin_t*) { return true; },
        [](const clap_plugin_t*, clap_gui_resize_hints_t* hints) {
            *hints = {true, true, false, 1, 1};
            return true;
        },
        [](const clap_plugin_t* plugin, std::uint32_t* width, std::uint32_t* height) {
            if (!window(plugin)) return false;
            const auto fitting =
                window(plugin)->Fitting({static_cast<int>(*width), static_cast<int>(*height)});
            *width = static_cast<std::uint32_t>(fitting.width);
            *height = static_cast<std::uint32_t>(fitting.height);
            return true;
        },
        [](const clap_plugin_t* plugin, std::uint32_t width, std::uint32_t height) {
            const Window::Size size{static_cast<int>(width), static_cast<int>(height)};
            if (!window(plugin) || window(plugin)->Fitting(size) != size) return false;
            window(plugin)->Resize(size);
            return true;
        },
        [](const clap_plugin_t* plugin, const clap_window_t* parent) {
            return window(plugin) && Supports(parent->api, false) && window(plugin)->Open(parent->x11);
        },
        [](const clap_plugin_t*, const clap_window_t*) { return false; },
        [](const clap_plugin_t*, const char*) {},
        [](const clap_plugin_t* plugin) {
            if (window(plugin)) window(plugin)->Show(true);
            return window(plugin) != nullptr;
        },
        [](const clap_plugin_t* plugin) {
            if (window(plugin)) window(plugin)->Show(false);
            return window(plugin) != nullptr;
        }};
    static constexpr clap_plugin_timer_support_t kTimer{[](const clap_plugin_t* plugin, clap_id) {
        if (window(plugin)) window(plugin)->Idle();
    }};
    if (std::strcmp(id, CLAP_EXT_GUI) == 0) return &kGui;
    if (std::strcmp(id, CLAP_EXT_TIMER_SUPPORT) == 0) return &kTimer;
    return nullptr;
}

}  // namespace Corvo::Plugins
