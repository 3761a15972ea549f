#include <iterator>

#include "C/Calls.h"

const char* DSP_CALL dsp_status_text(dsp_status status) {
    static constexpr const char* kTexts[]{
        "no error",
        "a pointer or handle is null",
        "the handle was closed or never was one",
        "the handle is of another kind",
        "a number is out of range",
        "the buffer is too small",
        "there is nothing of this name",
        "this cannot be understood",
        "the object is not prepared for this",
        "the object cannot do this",
        "there is not enough memory",
        "a record's size was not set",
        "an unexpected error",
    };
    static_assert(std::size(kTexts) == DSP_FAILED + 1);
    return status >= 0 && status <= DSP_FAILED ? kTexts[status] : "an unknown status";
}

uint32_t DSP_CALL dsp_version(void) {
    return DSP_VERSION_MAJOR << 16 | DSP_VERSION_MINOR << 8 | DSP_VERSION_PATCH;
}

dsp_status DSP_CALL dsp_close(void* handle) {
    return Corvo::C::Guarded(nullptr, [handle]() -> dsp_status {
        return !handle || Corvo::C::CloseHandle(handle) ? DSP_OK : DSP_CLOSED;
    });
}
