#pragma once

#include <filesystem>
#include <memory>

namespace PluginHost {

// A loaded library. It stays loaded while this lives.
class Module {
public:
    // Throws std::runtime_error with the system's reason.
    explicit Module(const std::filesystem::path& file);

    template <typename Symbol>
    Symbol* Find(const char* name) const {
        return reinterpret_cast<Symbol*>(Address(name));
    }

private:
    void* Address(const char* name) const;  // null when there is none

    std::unique_ptr<void, void (*)(void*)> m_handle;
};

}  // namespace PluginHost
