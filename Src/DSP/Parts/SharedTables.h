#pragma once

#include <memory>
#include <mutex>
#include <vector>

namespace Corvo::DSP {

// Tables that never change once made: those another object has, where they are for the same key, or new ones.
// The last object that has them frees them. `Tables` is made from the key and has `bool IsFor(key...)`. May
// wait for another thread that makes some. Throws std::bad_alloc.
template <typename Tables, typename... Key>
std::shared_ptr<const Tables> SharedTables(const Key&... key) {
    static std::mutex mutex;
    static std::vector<std::weak_ptr<const Tables>> all;
    const std::lock_guard lock(mutex);
    std::erase_if(all, [](const auto& tables) { return tables.expired(); });
    for (const auto& tables : all)
        if (auto found = tables.lock(); found && found->IsFor(key...)) return found;
    // What make_shared makes would stay until the last weak pointer goes too.
    std::shared_ptr<const Tables> made(new const Tables(key...));
    all.push_back(made);
    return made;
}

}  // namespace Corvo::DSP
