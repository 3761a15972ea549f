#pragma once

#include <filesystem>

namespace PluginHost {

// A loaded library. It stays loaded while this lives.
class Module {
public:
    // Throws std::runtime_error with the system's reason.
    explicit Module(const std::filesystem::path& file);
    ~Module();
    Module(const Module&) = delete;
    Module& operator=(const Module&) = delete;

    template <typename Symbol>
    Symbol* Find(const char* name) const {
        return reinterpret_cast<Symbol*>(Address(name));
    }

private:
    void* Address(const char* name) const;  // null when there is none

    void* m_handle;
};

}  // namespace PluginHost
