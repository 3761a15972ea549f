#pragma once

#include <cstdio>
#include <cstdlib>
#include <vector>

#include "Input.h"

namespace Fuzz {

// What a fuzzer feeds. Each target stands in a file of its own and registers itself as one static object; a
// program has those that it is linked with.
struct Target {
    Target(const char* targetName, void (*function)(Input&)) : name(targetName), run(function) {
        All().push_back(this);
    }
    static std::vector<const Target*>& All() {
        static std::vector<const Target*> all;
        return all;
    }

    const char* name;
    void (*run)(Input&);
};

// Ends the program when a promise is broken, which fuzzer and replay take for a finding.
inline void Require(bool kept, const char* promise) {
    if (kept) return;
    std::fprintf(stderr, "broken promise: %s\n", promise);
    std::abort();
}

}  // namespace Fuzz
