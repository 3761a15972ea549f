#pragma once

#include <algorithm>
#include <cstring>
#include <exception>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include "C/Handles.h"

// What every function of the C interface has in common: no exception leaves it, texts go into the caller's
// buffer, records are as long as the caller says.
namespace Corvo::C {

// A failure with a sentence for the caller's dsp_error.
struct Refusal {
    dsp_status status;
    std::string sentence;
};

// Cuts UTF-8 after the last whole character that fits.
inline std::size_t WholeCharacters(std::string_view text, std::size_t room) {
    if (text.size() <= room) return text.size();
    while (room > 0 && (static_cast<unsigned char>(text[room]) & 0xC0) == 0x80) --room;
    return room;
}

inline void Tell(dsp_error* error, std::string_view sentence) {
    constexpr std::size_t kText = offsetof(dsp_error, text);
    if (!error || error->size <= kText) return;
    const std::size_t room = std::min<std::size_t>(error->size - kText, sizeof error->text) - 1;
    const std::size_t length = WholeCharacters(sentence, room);
    std::memcpy(error->text, sentence.data(), length);
    error->text[length] = '\0';
}

// Runs `call`, which returns a status or throws.
template <typename Call>
dsp_status Guarded(dsp_error* error, Call call) noexcept {
    const auto fail = [error](dsp_status status, std::string_view sentence) {
        Tell(error, sentence);
        return status;
    };
    try {
        const dsp_status status = call();
        return status == DSP_OK ? status : fail(status, dsp_status_text(status));
    } catch (const Refusal& refusal) {
        return fail(refusal.status, refusal.sentence);
    } catch (const std::bad_alloc&) {
        return fail(DSP_NO_MEMORY, dsp_status_text(DSP_NO_MEMORY));
    } catch (const std::invalid_argument& e) {
        return fail(DSP_OUT_OF_RANGE, e.what());
    } catch (const std::exception& e) {
        return fail(DSP_FAILED, e.what());
    } catch (...) {
        return fail(DSP_FAILED, dsp_status_text(DSP_FAILED));
    }
}

// The same with the object behind a handle: call(T&) returns a status, or nothing for DSP_OK.
template <typename T, typename Call>
dsp_status With(const void* handle, dsp_error* error, Call call) noexcept {
    return Guarded(error, [&] {
        T* object = nullptr;
        if (const dsp_status status = Find(handle, object); status != DSP_OK) return status;
        if constexpr (std::is_void_v<std::invoke_result_t<Call, T&>>)
            return call(*object), dsp_status{DSP_OK};
        else
            return static_cast<dsp_status>(call(*object));
    });
}
template <typename T, typename Call>
dsp_status With(const void* handle, Call call) noexcept {
    return With<T>(handle, nullptr, std::move(call));
}

// Makes an object and stores its handle; make() returns a std::unique_ptr.
template <typename Handle, typename Make>
dsp_status Create(Handle** handle, dsp_error* error, Make make) noexcept {
    return Guarded(error, [&]() -> dsp_status {
        if (!handle) return DSP_NULL;
        void* const opened = OpenHandle(make());
        if (!opened) throw Refusal{DSP_NO_MEMORY, "there are too many handles"};
        *handle = static_cast<Handle*>(opened);
        return DSP_OK;
    });
}

inline void Require(bool holds, const std::string& sentence, dsp_status status = DSP_OUT_OF_RANGE) {
    if (!holds) throw Refusal{status, sentence};
}
inline bool Within(std::int64_t value, std::int64_t first, std::int64_t last) {
    return value >= first && value <= last;
}

inline dsp_status GiveText(std::string_view text, char* buffer, std::size_t size, std::size_t* needed) {
    if (!buffer && size > 0) return DSP_NULL;
    if (needed) *needed = text.size() + 1;
    if (size == 0) return buffer ? DSP_TOO_SMALL : DSP_OK;
    const std::size_t length = WholeCharacters(text, size - 1);
    std::memcpy(buffer, text.data(), length);
    buffer[length] = '\0';
    return length == text.size() ? DSP_OK : DSP_TOO_SMALL;
}

// Room for `count` elements of an array: fill(array) where they fit.
template <typename T, typename Fill>
dsp_status GiveArray(std::size_t count, T* array, std::size_t room, std::size_t* needed, Fill fill) {
    if (!array && room > 0) return DSP_NULL;
    if (needed) *needed = count;
    if (!array) return DSP_OK;
    if (room < count) return DSP_TOO_SMALL;
    fill(array);
    return DSP_OK;
}

template <typename T>
dsp_status Give(T value, std::type_identity_t<T>* to) {
    if (!to) return DSP_NULL;
    *to = value;
    return DSP_OK;
}

// Records may grow at their ends. How long each was at first is fixed here; a caller's record is at least as
// long.
template <typename Record>
constexpr std::size_t kFirstSize = 0;
template <>
inline constexpr std::size_t kFirstSize<dsp_format> = 20;
template <>
inline constexpr std::size_t kFirstSize<dsp_parameter> = 16;
template <>
inline constexpr std::size_t kFirstSize<dsp_band> = 32;
template <>
inline constexpr std::size_t kFirstSize<dsp_conversion> = 32;
template <>
inline constexpr std::size_t kFirstSize<dsp_shift> = 40;
template <>
inline constexpr std::size_t kFirstSize<dsp_tuner_reading> = 48;

// A caller's record as this version knows it; members behind the caller's size are 0.
template <typename Record>
Record Taken(const Record* record, const char* name, std::size_t firstSize = kFirstSize<Record>) {
    if (!record) throw Refusal{DSP_NULL, std::string(name) + " is null"};
    if (record->size < firstSize) throw Refusal{DSP_BAD_RECORD, std::string(name) + ": its size was not set"};
    Record taken{};
    std::memcpy(&taken, record, std::min<std::size_t>(record->size, sizeof taken));
    return taken;
}

// As much of it as the caller's record has room for.
template <typename Record>
dsp_status GiveRecord(Record value, Record* to) {
    if (!to) return DSP_NULL;
    if (to->size < kFirstSize<Record>) return DSP_BAD_RECORD;
    value.size = to->size;
    std::memcpy(to, &value, std::min<std::size_t>(to->size, sizeof value));
    return DSP_OK;
}

}  // namespace Corvo::C
