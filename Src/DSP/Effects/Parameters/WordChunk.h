#pragma once

#include "DSP/Effects/Parameters/SettingsChunk.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {

// Settings chunks of a tag and `kWords` words of a record that the two threads share, in the order in which
// `kVisit` goes through them.
template <typename Record, auto kVisit, std::size_t kWords = sizeof(Record) / 4>
struct WordChunk {
    static constexpr std::size_t kSize = 4 + 4 * kWords;
    static constexpr std::size_t kOldSize = 4 + 8 * kWords;  // when a word took 8 bytes

    static void Write(std::vector<std::uint8_t>& chunk, std::int32_t tag, const Record& record) {
        const auto settings = Snapshot(record);
        ChunkWriter write(chunk, kSize);
        write(tag) && kVisit(write, settings);
    }
    // False, with nothing changed, when the chunk is too short.
    static bool Read(const std::vector<std::uint8_t>& chunk, std::int32_t& tag, Record& record) {
        return chunk.size() >= kSize && Take<ChunkReader>(chunk, tag, record);
    }
    static bool ReadOld(const std::vector<std::uint8_t>& chunk, std::int32_t& tag, Record& record) {
        return chunk.size() >= kOldSize && Take<SpreadWordReader>(chunk, tag, record);
    }

private:
    template <typename Words>
    static bool Take(const std::vector<std::uint8_t>& chunk, std::int32_t& tag, Record& record) {
        ChunkReader read(chunk);
        Record settings{};
        read(tag) && kVisit(Words(read), settings);
        Assign(record, settings);
        return true;
    }
};

}  // namespace Corvo::DSP
