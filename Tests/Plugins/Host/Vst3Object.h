#pragma once

#include <travesty/base.h>

// Objects of VST3: a table of functions behind a pointer.
namespace PluginHost {

// What the host hands to plug-ins lives as long as the host, so nobody counts who holds it.
template <const v3_tuid& kId>
v3_result V3_API Query(void* self, const v3_tuid iid, void** object) {
    const bool known = v3_tuid_match(iid, kId) || v3_tuid_match(iid, v3_funknown_iid);
    *object = known ? self : nullptr;
    return known ? V3_OK : V3_NO_INTERFACE;
}
template <typename Functions, const v3_tuid& kId>
struct Table : v3_funknown {
    Functions functions;
    Table* itself = this;
    explicit Table(const Functions& f)
        : v3_funknown{Query<kId>, [](void*) { return 1u; }, [](void*) { return 1u; }}, functions(f) {}
};

// A plug-in's interface, counted.
template <typename Interface>
class Held {
public:
    explicit Held(Interface** object = nullptr) : m_object(object) {}
    // Of another interface's object; empty where it has none.
    template <typename Other>
    Held(const Held<Other>& other, const v3_tuid& id) {
        v3_cpp_obj_query_interface(other.Get(), id, &m_object);
    }
    Held(const Held&) = delete;
    ~Held() {
        if (m_object) v3_cpp_obj_unref(m_object);
    }

    Interface** Get() const { return m_object; }
    Interface* operator->() const { return v3_cpp_obj(m_object); }
    explicit operator bool() const { return m_object != nullptr; }

private:
    Interface** m_object = nullptr;
};

}  // namespace PluginHost
