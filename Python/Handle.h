#pragma once

#include <memory>
#include <string>

#include "C/dspdll.h"

// The C interface as C++ likes it: handles that close themselves, and failures as exceptions, which the
// module turns into Python's: std::invalid_argument into ValueError, std::bad_alloc into MemoryError, all
// others into RuntimeError.
namespace python {

struct Closer {
    void operator()(void* handle) const { dsp_close(handle); }
};
template <typename Opaque>
using Owned = std::unique_ptr<Opaque, Closer>;

[[noreturn]] void Throw(dsp_status status, const char* text);
// For effects that follow a tempo: `bpm` points to a double.
void DSP_CALL TellTempo(void* bpm, dsp_tempo* tempo);
inline void Check(dsp_status status) {
    if (status != DSP_OK) Throw(status, "");
}

// call(error) for functions that say more than a status.
template <typename Call>
void Explained(Call call) {
    dsp_error error{sizeof(dsp_error), ""};
    if (const dsp_status status = call(&error); status != DSP_OK) Throw(status, error.text);
}

// create(handle, error).
template <typename Opaque, typename Create>
Owned<Opaque> Made(Create create) {
    Opaque* handle = nullptr;
    Explained([&](dsp_error* error) { return create(&handle, error); });
    return Owned<Opaque>(handle);
}

// give(buffer, size, needed).
template <typename Give>
std::string Text(Give give) {
    std::size_t needed = 0;
    Check(give(static_cast<char*>(nullptr), std::size_t{0}, &needed));
    std::string text(needed, '\0');
    Check(give(text.data(), text.size(), &needed));
    text.pop_back();
    return text;
}

// get(handle, value).
template <typename Value, typename Opaque>
Value Asked(dsp_status (*get)(Opaque*, Value*), const Owned<Opaque>& handle) {
    Value value{};
    Check(get(handle.get(), &value));
    return value;
}

}  // namespace python
