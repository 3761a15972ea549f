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

// One word of a record by its place, for records that are known by a table only.
inline std::uint32_t LoadWord(const void* record, std::size_t place) {
    return __atomic_load_n(static_cast<const AnyWord*>(record) + place, __ATOMIC_RELAXED);
}
inline void StoreWord(void* record, std::size_t place, std::uint32_t word) {
    __atomic_store_n(static_cast<AnyWord*>(record) + place, word, __ATOMIC_RELAXED);
}

// Audio thread: lowers the flag that says there is something new, and tells whether it was up. It looks
// first: an exchange holds up all reading behind it, however far away the flag's memory is.
inline bool TakeFlag(std::atomic<bool>& flag) {
    return flag.load(std::memory_order_relaxed) && flag.exchange(false, std::memory_order_acquire);
}

template <SharedRecord Record>
Record Snapshot(const Record& shared) {
    std::array<std::uint32_t, sizeof(Record) / 4> words;
    for (std::size_t place = 0; place < words.size(); ++place) words[place] = LoadWord(&shared, place);
    return std::bit_cast<Record>(words);
}

template <SharedRecord Record>
void Assign(Record& shared, const Record& value) {
    const auto words = std::bit_cast<std::array<std::uint32_t, sizeof(Record) / 4>>(value);
    for (std::size_t place = 0; place < words.size(); ++place) StoreWord(&shared, place, words[place]);
}

}  // namespace Corvo::DSP
