#pragma once

#include <array>
#include <atomic>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <type_traits>

namespace Corvo::DSP {

// A plain record of 32-bit words (integers or floats) that the user-interface thread edits and the audio
// thread reads. No word is ever torn; a word that changes during a Snapshot has its flag raised behind it,
// so the next block takes another look.
template <typename Word>
Word LoadShared(const Word& word) {
    static_assert(sizeof(Word) == 4);
    return std::atomic_ref(const_cast<Word&>(word)).load(std::memory_order_relaxed);
}

template <typename Word>
void StoreShared(Word& word, std::type_identity_t<Word> value) {
    static_assert(sizeof(Word) == 4);
    std::atomic_ref(word).store(value, std::memory_order_relaxed);
}

template <typename Record>
concept SharedRecord = std::is_trivially_copyable_v<Record> && sizeof(Record) % 4 == 0 &&
                       alignof(Record) == 4;

// Words of any type are copied as bits; the attribute allows that for floats too.
using AnyWord [[gnu::may_alias]] = std::uint32_t;

template <SharedRecord Record>
Record Snapshot(const Record& shared) {
    std::array<std::uint32_t, sizeof(Record) / 4> words;
    const auto* word = reinterpret_cast<const AnyWord*>(&shared);
    for (auto& copy : words) copy = __atomic_load_n(word++, __ATOMIC_RELAXED);
    return std::bit_cast<Record>(words);
}

template <SharedRecord Record>
void Assign(Record& shared, const Record& value) {
    const auto words = std::bit_cast<std::array<std::uint32_t, sizeof(Record) / 4>>(value);
    auto* word = reinterpret_cast<AnyWord*>(&shared);
    for (const auto copy : words) __atomic_store_n(word++, copy, __ATOMIC_RELAXED);
}

}  // namespace Corvo::DSP
