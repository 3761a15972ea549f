#include "WavStream.h"

#include <algorithm>
#include <array>
#include <limits>
#include <string_view>

namespace dsphost {
namespace {

constexpr int kPcm = 1, kFloat = 3, kALaw = 6, kMuLaw = 7, kExtensible = 0xFFFE;

struct CodingRow {
    int tag, bits, subtype;
};
constexpr std::array kCodings{
    CodingRow{kPcm, 8, SF_FORMAT_PCM_U8},   CodingRow{kPcm, 16, SF_FORMAT_PCM_16},
    CodingRow{kPcm, 24, SF_FORMAT_PCM_24},  CodingRow{kPcm, 32, SF_FORMAT_PCM_32},
    CodingRow{kFloat, 32, SF_FORMAT_FLOAT}, CodingRow{kFloat, 64, SF_FORMAT_DOUBLE},
    CodingRow{kALaw, 8, SF_FORMAT_ALAW},    CodingRow{kMuLaw, 8, SF_FORMAT_ULAW},
};

// Programs that stream put a size here that stands for "unknown": the largest or half of it.
constexpr std::uint32_t kUnknownSize = 0x7FFFF000;
constexpr std::uint32_t kLargestFormatChunk = 4096;

// The bytes of a stream, all of them kept.
class Keeper {
public:
    Keeper(File& file, std::vector<unsigned char>& bytes) : m_file(file), m_bytes(bytes) {}
    bool Fetch(std::size_t count) {
        const std::size_t start = m_bytes.size();
        m_bytes.resize(start + count);
        const std::size_t done = m_file.Read(m_bytes.data() + start, count);
        m_bytes.resize(start + done);
        m_last = start;
        return done == count;
    }
    // Of the bytes fetched last.
    std::string_view Text(std::size_t offset) const {
        return {reinterpret_cast<const char*>(m_bytes.data()) + m_last + offset, 4};
    }
    std::uint32_t Number(std::size_t offset, int size) const {
        std::uint32_t value = 0;
        for (int i = size; i-- > 0;)
            value = value << 8 | m_bytes[m_last + offset + static_cast<std::size_t>(i)];
        return value;
    }

private:
    File& m_file;
    std::vector<unsigned char>& m_bytes;
    std::size_t m_last = 0;
};

bool ReadFormatChunk(Keeper& stream, std::uint32_t size, WavStreamHeader& header) {
    if (size < 16 || size > kLargestFormatChunk || !stream.Fetch(size + (size & 1))) return false;
    auto tag = static_cast<int>(stream.Number(0, 2));
    if (tag == kExtensible && size >= 40) tag = static_cast<int>(stream.Number(24, 2));
    const auto bits = static_cast<int>(stream.Number(14, 2));
    const auto coding = std::ranges::find_if(
        kCodings, [&](const CodingRow& each) { return each.tag == tag && each.bits == bits; });
    if (coding == kCodings.end()) return false;
    header.channels = static_cast<int>(stream.Number(2, 2));
    header.rate = static_cast<int>(std::min<std::uint32_t>(stream.Number(4, 4), 0x7FFFFFFF));
    header.subtype = coding->subtype;
    return stream.Number(12, 2) == static_cast<std::uint32_t>(header.channels * bits / 8);
}

// Chunks in front of the samples that say nothing about them.
constexpr std::uint32_t kLargestOtherChunk = 1 << 24;

}  // namespace

int WavSampleBytes(int subtype) {
    const auto coding = std::ranges::find(kCodings, subtype, &CodingRow::subtype);
    return coding == kCodings.end() ? 0 : coding->bits / 8;
}

std::optional<WavStreamHeader> ReadWavStreamHeader(File& file, std::vector<unsigned char>& bytes) {
    Keeper stream(file, bytes);
    if (!stream.Fetch(12) || stream.Text(0) != "RIFF" || stream.Text(8) != "WAVE") return {};
    WavStreamHeader header;
    while (stream.Fetch(8)) {
        const std::string_view name = stream.Text(0);
        const std::uint32_t size = stream.Number(4, 4);
        if (name == "data") {
            if (header.channels == 0) return {};
            if (size > 0 && size < kUnknownSize) header.sampleBytes = size;
            return header;
        }
        if (name == "fmt ") {
            if (!ReadFormatChunk(stream, size, header)) return {};
        } else if (size > kLargestOtherChunk || !stream.Fetch(size + (size & 1))) {
            return {};
        }
    }
    return {};
}

std::vector<unsigned char> MakeWavHeader(int channels, int rate, int subtype,
                                         std::optional<std::int64_t> sampleBytes) {
    constexpr std::int64_t kHeaderBytes = 44;
    constexpr std::uint32_t kUntilTheEnd = 0xFFFFFFFF;
    const auto& coding = *std::ranges::find(kCodings, subtype, &CodingRow::subtype);
    const auto size = [&](std::int64_t extra) {
        const bool known = sampleBytes && *sampleBytes + kHeaderBytes < kUntilTheEnd;
        return known ? static_cast<std::uint32_t>(*sampleBytes + extra) : kUntilTheEnd;
    };
    std::vector<unsigned char> bytes;
    const auto text = [&](std::string_view four) {
        for (const char c : four) bytes.push_back(static_cast<unsigned char>(c));
    };
    const auto number = [&](std::uint32_t value, int count) {
        for (int i = 0; i < count; ++i) bytes.push_back(static_cast<unsigned char>(value >> (8 * i)));
    };
    const auto frameBytes = static_cast<std::uint32_t>(channels * coding.bits / 8);
    text("RIFF"), number(size(kHeaderBytes - 8), 4), text("WAVE");
    text("fmt "), number(16, 4);
    number(static_cast<std::uint32_t>(coding.tag), 2), number(static_cast<std::uint32_t>(channels), 2);
    number(static_cast<std::uint32_t>(rate), 4), number(static_cast<std::uint32_t>(rate) * frameBytes, 4);
    number(frameBytes, 2), number(static_cast<std::uint32_t>(coding.bits), 2);
    text("data"), number(size(0), 4);
    return bytes;
}

}  // namespace dsphost
