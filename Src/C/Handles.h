#pragma once

#include <cstdint>
#include <memory>

#include "C/dspdll.h"
#include "Platform/Export.h"

namespace Corvo::C {

// What a handle stands for.
class Object {
public:
    enum class Kind : std::uint8_t { Effect, Equaliser, Converter, PitchShift, Transform, Analyser, Drawing };

    explicit Object(Kind ofKind) : kind(ofKind) {}
    virtual ~Object() = default;
    Object(const Object&) = delete;
    Object& operator=(const Object&) = delete;

    const Kind kind;
};

// Handles are places in a table with the number of times that the place was used, so that whatever else comes
// in is noticed without being looked into. Opening and closing take a lock, finding takes none. The library
// that draws keeps its objects here, too.

// Null when there are 65536 objects already. Throws std::bad_alloc.
DSP_API void* OpenHandle(std::unique_ptr<Object> object);
// Gives the object back, so that it is destroyed outside the lock; null when the handle is none.
DSP_API std::unique_ptr<Object> CloseHandle(const void* handle);
DSP_API Object* FindObject(const void* handle);

// Each kind of object says `static constexpr Kind kKind`.
template <typename T>
dsp_status Find(const void* handle, T*& found) {
    if (!handle) return DSP_NULL;
    Object* const object = FindObject(handle);
    if (!object) return DSP_CLOSED;
    if (object->kind != T::kKind) return DSP_OTHER_KIND;
    found = static_cast<T*>(object);
    return DSP_OK;
}

}  // namespace Corvo::C
