#pragma once

#include <travesty/base.h>

#include <exception>
#include <type_traits>

namespace Corvo::Plugins {

// An interface of a C++ object as VST3 sees it: its address is what hosts hold, and begins with the table of
// functions.
template <class Owner>
struct Vst3Face {
    const void* table;
    Owner* owner;
};

// A member function as an entry of such a table. Nothing is thrown into the host: it gets an error instead.
template <auto kMember>
struct Vst3Entry;
template <class Owner, class Result, class... Arguments, Result (Owner::*kMember)(Arguments...)>
struct Vst3Entry<kMember> {
    static Result V3_API Call(void* self, Arguments... arguments) {
        try {
            return (static_cast<Vst3Face<Owner>*>(self)->owner->*kMember)(arguments...);
        } catch (const std::exception&) {
            if constexpr (std::is_same_v<Result, v3_result>) return V3_INTERNAL_ERR;
            return Result{};
        }
    }
};
template <auto kMember>
inline constexpr auto kVst3Entry = Vst3Entry<kMember>::Call;

}  // namespace Corvo::Plugins
