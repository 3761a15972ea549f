#include "WavHeader.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "Text.h"

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

constexpr std::uint32_t kLargestFormatChunk = 4096;

// What programs write for the size of a stream that they do not know, rounded down to whole frames. The first
// two can mean nothing else; as many bytes as the others say could also be there.
constexpr std::array<std::uint32_t, 6> kUnknownSizes{0,          0xFFFFFFFF, 0x7FFFF000,
                                                     0x7FFFFF00, 0x7FFFFFFF, 0x80000000};
constexpr std::size_t kCertainlyUnknown = 2;

// Chunks that stand behind the samples, in either case.
constexpr std::array<std::string_view, 17> kChunkNames{"LIST", "bext", "id3 ", "cue ", "smpl", "JUNK",
                                                       "PAD ", "fact", "iXML", "inst", "plst", "acid",
                                                       "_PMX", "axml", "umid", "PEAK", "afsp"};

// The bytes of a stream, all of them kept.
class Keeper {
public:
    Keeper(const ByteSource& source, std::vector<unsigned char>& bytes) : m_source(source), m_bytes(bytes) {}
    bool Fetch(std::size_t count) {
        const std::size_t start = m_bytes.size(), most = std::min(count, kLongestWavHeader - start);
        m_bytes.resize(start + most);
        m_bytes.resize(start + m_source(m_bytes.data() + start, most));
        m_last = start;
        return m_bytes.size() - start == count;
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
    const ByteSource& m_source;
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

// An RF64 has its sizes in front, with 64 bits: of the file, of the samples. Nothing where the size is not
// known.
std::optional<std::int64_t> ReadLongSize(Keeper& stream, std::uint32_t size) {
    constexpr std::uint32_t kHighest = 0x3FFFFFFF;
    if (size < 16 || size > kLongestWavHeader || !stream.Fetch(size + (size & 1))) return {};
    const std::uint32_t low = stream.Number(8, 4), high = stream.Number(12, 4);
    if (high > kHighest || (high == 0 && low == 0)) return {};
    return static_cast<std::int64_t>(std::uint64_t{high} << 32 | low);
}

void TakeSize(std::uint32_t size, std::uint32_t frameBytes, WavStreamHeader& header) {
    const auto unknown = std::ranges::find_if(kUnknownSizes, [&](std::uint32_t value) {
        return size == value || size == value - value % frameBytes;
    });
    const auto place = static_cast<std::size_t>(unknown - kUnknownSizes.begin());
    if (unknown == kUnknownSizes.end())
        header.sampleBytes = size;
    else if (place >= kCertainlyUnknown)
        header.doubtfulBytes = size;
}

}  // namespace

int WavSampleBytes(int subtype) {
    const auto coding = std::ranges::find(kCodings, subtype, &CodingRow::subtype);
    return coding == kCodings.end() ? 0 : coding->bits / 8;
}

std::optional<WavStreamHeader> ReadWavStreamHeader(const ByteSource& source,
                                                   std::vector<unsigned char>& bytes) {
    Keeper stream(source, bytes);
    if (!stream.Fetch(12) || stream.Text(8) != "WAVE") return {};
    const bool rf64 = stream.Text(0) == "RF64";
    if (!rf64 && stream.Text(0) != "RIFF") return {};
    WavStreamHeader header;
    std::optional<std::int64_t> longSize;
    while (stream.Fetch(8)) {
        const std::string_view name = stream.Text(0);
        const std::uint32_t size = stream.Number(4, 4);
        if (name == "data") {
            if (header.channels == 0) return {};
            if (rf64 && longSize && size == 0xFFFFFFFF)
                header.sampleBytes = longSize;
            else
                TakeSize(size, static_cast<std::uint32_t>(header.channels * WavSampleBytes(header.subtype)),
                         header);
            return header;
        }
        if (name == "ds64") {
            longSize = ReadLongSize(stream, size);
        } else if (name == "fmt ") {
            if (!ReadFormatChunk(stream, size, header)) return {};
        } else if (!stream.Fetch(std::size_t{size} + (size & 1))) {
            return {};
        }
    }
    return {};
}

bool StartsChunk(std::string_view bytes, std::int64_t sampleBytes) {
    const std::size_t padding = sampleBytes % 2 == 0 ? 0 : 1;
    return bytes.size() >= padding + 4 && std::ranges::any_of(kChunkNames, [&](std::string_view name) {
               return SameNoCase(name, bytes.substr(padding, 4));
           });
}

std::vector<unsigned char> MakeWavHeader(const WavShape& shape, std::optional<std::int64_t> sampleBytes) {
    constexpr std::uint64_t kUntilTheEnd = 0xFFFFFFFF;
    const auto& coding = *std::ranges::find(kCodings, shape.subtype, &CodingRow::subtype);
    const auto frameBytes = static_cast<std::uint64_t>(shape.channels * coding.bits / 8);
    const auto size = static_cast<std::uint64_t>(sampleBytes.value_or(0));
    const bool rf64 = shape.rf64 || (shape.room && sampleBytes > kLargestWavBytes);
    const bool integers = coding.tag == kPcm;
    // What follows the first 8 bytes: "WAVE", the room, the format, the count of frames, the samples.
    const std::uint64_t room = shape.room || shape.rf64 ? 36 : 0;
    const std::uint64_t whole = 4 + room + (integers ? 24 : 38) + 8 + size + size % 2;
    const auto shortSize = [&](std::uint64_t value) {
        return sampleBytes && !rf64 ? std::min(value, kUntilTheEnd) : kUntilTheEnd;
    };

    std::vector<unsigned char> bytes;
    const auto text = [&](std::string_view four) {
        for (const char c : four) bytes.push_back(static_cast<unsigned char>(c));
    };
    const auto number = [&](std::uint64_t value, int count) {
        for (int i = 0; i < count; ++i) bytes.push_back(static_cast<unsigned char>(value >> (8 * i)));
    };
    text(rf64 ? "RF64" : "RIFF"), number(shortSize(whole), 4), text("WAVE");
    if (room > 0) {
        text(rf64 ? "ds64" : "JUNK"), number(28, 4);
        for (const std::uint64_t value : {whole, size, size / frameBytes}) number(rf64 ? value : 0, 8);
        number(0, 4);
    }
    text("fmt "), number(integers ? 16 : 18, 4);
    number(static_cast<std::uint64_t>(coding.tag), 2), number(static_cast<std::uint64_t>(shape.channels), 2);
    number(static_cast<std::uint64_t>(shape.rate), 4);
    number(static_cast<std::uint64_t>(shape.rate) * frameBytes, 4);
    number(frameBytes, 2), number(static_cast<std::uint64_t>(coding.bits), 2);
    if (!integers) number(0, 2), text("fact"), number(4, 4), number(shortSize(size / frameBytes), 4);
    text("data"), number(shortSize(size), 4);
    return bytes;
}

}  // namespace dsphost
