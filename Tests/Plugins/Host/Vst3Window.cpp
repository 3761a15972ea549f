#include "Vst3Window.h"

#include <travesty/view.h>

#include <set>

namespace PluginHost {
namespace {

// A window's frame, which leads to the host's timers.
std::set<v3_timer_handler**> g_timers;
Table<v3_run_loop, v3_run_loop_iid> g_loop({[](void*, v3_event_handler**, int) -> v3_result { return V3_OK; },
                                            [](void*, v3_event_handler**) -> v3_result { return V3_OK; },
                                            [](void*, v3_timer_handler** timer, std::uint64_t) -> v3_result {
                                                return g_timers.insert(timer).second ? V3_OK : V3_INVALID_ARG;
                                            },
                                            [](void*, v3_timer_handler** timer) -> v3_result {
                                                Expect(g_timers.erase(timer) == 1,
                                                       "takes away a timer that is not there");
                                                return V3_OK;
                                            }});
struct FrameTable : Table<v3_plugin_frame, v3_plugin_frame_iid> {
    FrameTable() : Table({[](void*, v3_plugin_view**, v3_view_rect*) -> v3_result { return V3_OK; }}) {
        query_interface = [](void* self, const v3_tuid iid, void** object) -> v3_result {
            if (!v3_tuid_match(iid, v3_run_loop_iid)) return Query<v3_plugin_frame_iid>(self, iid, object);
            *object = &g_loop.itself;
            return V3_OK;
        };
    }
} g_frame;

class Vst3Window : public Window {
public:
    explicit Vst3Window(v3_plugin_view** view) : m_view(view) {}
    ~Vst3Window() override {
        if (!m_view) return;
        Expect(m_view->removed(m_view.Get()) == V3_OK, "cannot remove its window");
        Expect(g_timers.empty(), "leaves its timer behind");
        m_view->set_frame(m_view.Get(), nullptr);
    }
    bool Open(std::uintptr_t parent) override {
        if (!m_view) return false;
        v3_view_rect size{};
        const auto own = reinterpret_cast<void*>(parent);
        m_view->set_frame(m_view.Get(), reinterpret_cast<v3_plugin_frame**>(&g_frame.itself));
        Expect(m_view->is_platform_type_supported(m_view.Get(), "NoSuchType") != V3_OK &&
                   m_view->attached(m_view.Get(), own, "NoSuchType") != V3_OK,
               "has windows of an unknown kind");
        return m_view->get_size(m_view.Get(), &size) == V3_OK && size.right > 0 && size.bottom > 0 &&
               m_view->attached(m_view.Get(), own, V3_VIEW_PLATFORM_TYPE_NATIVE) == V3_OK;
    }
    bool Resize(int width, int height) override {
        v3_view_rect size{0, 0, width, height};
        return m_view->can_resize(m_view.Get()) == V3_OK &&
               m_view->check_size_constraint(m_view.Get(), &size) == V3_OK &&
               m_view->on_size(m_view.Get(), &size) == V3_OK;
    }
    void Tick() override {
        for (v3_timer_handler** timer : g_timers) v3_cpp_obj(timer)->on_timer(timer);
    }

private:
    const Held<v3_plugin_view> m_view;
};

}  // namespace

std::unique_ptr<Window> MakeVst3Window(const Held<v3_edit_controller>& controller) {
    return std::make_unique<Vst3Window>(controller->create_view(controller.Get(), "editor"));
}

}  // namespace PluginHost
