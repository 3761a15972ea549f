#include "Vst3View.h"

#include <cstring>
#include <utility>

namespace Corvo::Plugins {
namespace {

Window::Size SizeOf(const v3_view_rect& rectangle) {
    return {rectangle.right - rectangle.left, rectangle.bottom - rectangle.top};
}

}  // namespace

struct Vst3View::Tables {
    using V = Vst3View;
    static constexpr v3_funknown kObject{kVst3Entry<&V::Query>, kVst3Entry<&V::Ref>, kVst3Entry<&V::Unref>};
    static constexpr v3_plugin_view_cpp kView{
        kObject,
        {kVst3Entry<&V::IsSupported>, kVst3Entry<&V::Attached>, kVst3Entry<&V::Removed>,
         kVst3Entry<&V::Wheel>, kVst3Entry<&V::Key>, kVst3Entry<&V::Key>, kVst3Entry<&V::GetSize>,
         kVst3Entry<&V::OnSize>, kVst3Entry<&V::OnFocus>, kVst3Entry<&V::SetFrame>, kVst3Entry<&V::CanResize>,
         kVst3Entry<&V::CheckSize>}};
    static constexpr v3_timer_handler_cpp kTimer{kObject, {kVst3Entry<&V::OnTimer>}};
    static constexpr v3_plugin_view_content_scale_cpp kScale{kObject, {kVst3Entry<&V::SetScale>}};
};

Vst3View::Vst3View(std::unique_ptr<Window> window, v3_funknown** owner)
    : m_view{&Tables::kView, this},
      m_timer{&Tables::kTimer, this},
      m_scale{&Tables::kScale, this},
      m_window(std::move(window)),
      m_owner(owner) {
    v3_cpp_obj_ref(m_owner);
}

Vst3View::~Vst3View() {
    Removed();
    SetFrame(nullptr);
}

v3_result Vst3View::Query(const std::uint8_t* id, void** object) {
    *object = nullptr;
    if (v3_tuid_match(v3_funknown_iid, id) || v3_tuid_match(v3_plugin_view_iid, id)) *object = &m_view;
    if (v3_tuid_match(v3_timer_handler_iid, id)) *object = &m_timer;
    if (v3_tuid_match(v3_plugin_view_content_scale_iid, id)) *object = &m_scale;
    if (!*object) return V3_NO_INTERFACE;
    Ref();
    return V3_OK;
}

std::uint32_t Vst3View::Ref() { return ++m_references; }

std::uint32_t Vst3View::Unref() {
    const std::uint32_t left = --m_references;
    if (left == 0) {
        auto** const owner = m_owner;
        delete this;
        v3_cpp_obj_unref(owner);
    }
    return left;
}

v3_result Vst3View::IsSupported(const char* platform) {
    return std::strcmp(platform, V3_VIEW_PLATFORM_TYPE_X11) == 0 ? V3_OK : V3_FALSE;
}

v3_result Vst3View::Attached(void* parent, const char* platform) {
    if (m_attached || !m_loop || IsSupported(platform) != V3_OK) return V3_FALSE;
    if (!m_window->Open(reinterpret_cast<std::uintptr_t>(parent))) return V3_FALSE;
    m_attached = true;
    return v3_cpp_obj(m_loop)->register_timer(m_loop, reinterpret_cast<v3_timer_handler**>(&m_timer),
                                              Window::kIdlePeriod);
}

v3_result Vst3View::Removed() {
    if (!std::exchange(m_attached, false)) return V3_FALSE;
    if (m_loop) v3_cpp_obj(m_loop)->unregister_timer(m_loop, reinterpret_cast<v3_timer_handler**>(&m_timer));
    m_window->Close();
    return V3_OK;
}

// The window gets its keys and its wheel itself.
v3_result Vst3View::Wheel(float) { return V3_FALSE; }
v3_result Vst3View::Key(std::int16_t, std::int16_t, std::int16_t) { return V3_FALSE; }
v3_result Vst3View::OnFocus(v3_bool) { return V3_OK; }

v3_result Vst3View::GetSize(v3_view_rect* rectangle) {
    *rectangle = {0, 0, m_window->GetSize().width, m_window->GetSize().height};
    return V3_OK;
}

v3_result Vst3View::OnSize(v3_view_rect* rectangle) {
    m_window->Resize(SizeOf(*rectangle));
    return V3_OK;
}

v3_result Vst3View::SetFrame(v3_plugin_frame** frame) {
    if (m_attached) Removed();
    if (m_loop) v3_cpp_obj_unref(m_loop);
    m_loop = nullptr;
    if (frame) v3_cpp_obj_query_interface(frame, v3_run_loop_iid, &m_loop);
    return V3_OK;
}

v3_result Vst3View::CanResize() { return V3_OK; }

v3_result Vst3View::CheckSize(v3_view_rect* rectangle) {
    const auto fitting = m_window->Fitting(SizeOf(*rectangle));
    rectangle->right = rectangle->left + fitting.width;
    rectangle->bottom = rectangle->top + fitting.height;
    return V3_OK;
}

v3_result Vst3View::SetScale(float scale) {
    m_window->SetScale(static_cast<double>(scale));
    return V3_OK;
}

void Vst3View::OnTimer() { m_window->Idle(); }

}  // namespace Corvo::Plugins
