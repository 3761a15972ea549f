#include "ClapWindow.h"

#include <set>

namespace PluginHost {
namespace {

std::set<clap_id> g_timers;

class ClapWindow : public Window {
public:
    explicit ClapWindow(const clap_plugin_t* plugin)
        : m_plugin(plugin), m_gui(ClapExtension<clap_plugin_gui_t>(plugin, CLAP_EXT_GUI)) {}
    ~ClapWindow() override {
        if (!m_open) return;
        m_gui->hide(m_plugin);
        m_gui->destroy(m_plugin);
        Expect(g_timers.empty(), "leaves its timer behind");
    }
    bool Open(std::uintptr_t parent) override {
        if (!m_gui) return false;
        Expect(!m_gui->is_api_supported(m_plugin, "no.such.api", false) &&
                   !m_gui->create(m_plugin, "no.such.api", false),
               "has windows of an unknown kind");
        std::uint32_t width = 0, height = 0;
        clap_window_t window{CLAP_WINDOW_API_X11, {}};
        window.x11 = static_cast<clap_xwnd>(parent);
        m_open = m_gui->is_api_supported(m_plugin, window.api, false) &&
                 m_gui->create(m_plugin, window.api, false);
        return m_open && m_gui->get_size(m_plugin, &width, &height) && width > 0 && height > 0 &&
               m_gui->set_parent(m_plugin, &window) && m_gui->show(m_plugin);
    }
    bool Resize(int width, int height) override {
        auto fitWidth = static_cast<std::uint32_t>(width), fitHeight = static_cast<std::uint32_t>(height);
        return m_gui->can_resize(m_plugin) && m_gui->adjust_size(m_plugin, &fitWidth, &fitHeight) &&
               m_gui->set_size(m_plugin, fitWidth, fitHeight);
    }
    void Tick() override {
        const auto* timer = ClapExtension<clap_plugin_timer_support_t>(m_plugin, CLAP_EXT_TIMER_SUPPORT);
        for (const clap_id id : g_timers) timer->on_timer(m_plugin, id);
    }

private:
    const clap_plugin_t* const m_plugin;
    const clap_plugin_gui_t* const m_gui;
    bool m_open = false;
};

}  // namespace

const clap_host_timer_support_t kClapTimers{[](const clap_host_t*, std::uint32_t, clap_id* timer) {
                                                static clap_id last = 0;
                                                return g_timers.insert(*timer = ++last).second;
                                            },
                                            [](const clap_host_t*, clap_id timer) {
                                                Expect(g_timers.erase(timer) == 1,
                                                       "takes away a timer that is not there");
                                                return true;
                                            }};

std::unique_ptr<Window> MakeClapWindow(const clap_plugin_t* plugin) {
    return std::make_unique<ClapWindow>(plugin);
}

}  // namespace PluginHost
