#include "Module.h"

#include <stdexcept>

#ifdef _WIN32
#include <windows.h>
#else
#include <dlfcn.h>
#endif

namespace PluginHost {

#ifdef _WIN32
Module::Module(const std::filesystem::path& file)
    : m_handle(LoadLibraryW(std::filesystem::absolute(file).c_str()),
               [](void* handle) { FreeLibrary(static_cast<HMODULE>(handle)); }) {
    if (!m_handle) throw std::runtime_error("cannot be loaded: error " + std::to_string(GetLastError()));
}

void* Module::Address(const char* name) const {
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(m_handle.get()), name));
}
#else
// All symbols at once: what is missing shows here and not in the middle of a session.
Module::Module(const std::filesystem::path& file)
    : m_handle(dlopen(std::filesystem::absolute(file).c_str(), RTLD_NOW | RTLD_LOCAL),
               [](void* handle) { dlclose(handle); }) {
    if (!m_handle) throw std::runtime_error(std::string("cannot be loaded: ") + dlerror());
}

void* Module::Address(const char* name) const { return dlsym(m_handle.get(), name); }
#endif

}  // namespace PluginHost
