#include "AudioWriter.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <limits>
#include <span>

#include "Errors.h"

namespace dsphost {
namespace {

constexpr int kBlocksBetweenSyncs = 256;  // some megabytes

// Two ways to make a value an integer: which values lead into the range, and to which number within it.

struct Nearest {  // ties to even
    static bool Fits(double value, double lowest, double highest) {
        return (value >= lowest - 0.5) & (value < highest + 0.5);
    }
    // This far from zero doubles are whole numbers, and their lowest bits are the integer's.
    static std::uint32_t Integer(double value) {
        constexpr double kFar = 0x1.8p52;
        return static_cast<std::uint32_t>(std::bit_cast<std::uint64_t>(value + kFar));
    }
};
struct TowardsZero {
    static bool Fits(double value, double lowest, double highest) {
        return (value > lowest - 1.0) & (value < highest + 1.0);
    }
    static std::uint32_t Integer(double value) {
        return static_cast<std::uint32_t>(static_cast<std::int32_t>(value));
    }
};

// Whether all of them are at most so far from zero, and numbers: vectors of any processor can do this.
bool Within(std::span<const double> samples, double limit) {
    constexpr std::int64_t kMagnitude = std::numeric_limits<std::int64_t>::max();
    std::int64_t room = 0;
    for (const double sample : samples)
        room |= std::bit_cast<std::int64_t>(limit) - (std::bit_cast<std::int64_t>(sample) & kMagnitude);
    return room >= 0;
}

// Each sample becomes the top bits of what libsndfile takes. Returns how many did not fit: they are clipped,
// and what is no number becomes 0.
template <typename Way, typename Stored>
std::int64_t ToIntegers(std::span<const double> samples, int bits, Stored* integers) {
    const double scale = std::ldexp(1.0, bits - 1);
    const double lowest = -scale, highest = scale - 1.0;
    const int shift = 8 * static_cast<int>(sizeof(Stored)) - bits;
    const auto integer = [shift](double value) { return static_cast<Stored>(Way::Integer(value) << shift); };
    if (Within(samples, highest / scale)) {
        for (const double sample : samples) *integers++ = integer(sample * scale);
        return 0;
    }
    std::int64_t clipped = 0;
    for (const double sample : samples) {
        const double value = sample * scale;
        clipped += !Way::Fits(value, lowest, highest);  // no branch: a loud passage clips here and there
        *integers++ = integer(std::isnan(value) ? 0.0 : std::min(std::max(value, lowest), highest));
    }
    return clipped;
}

}  // namespace

AudioWriter::AudioWriter(const std::string& path, const OutputRules& rules, const AudioWriterOptions& options)
    : m_output(path, rules) {
    const int container = ContainerFor(path, m_output.IsStream());
    m_format = ChooseSampleFormat(path, container, options.inputFormat, options.asked);
    m_info.channels = options.channels;
    m_info.samplerate = options.rate;
    m_info.format = container | *SubtypeIn(container, m_format);
    RequireShape(path, container, m_info.channels, m_info.samplerate);
    RequireRoom(options.frames.value_or(0));
    if (container == SF_FORMAT_WAV || container == SF_FORMAT_RF64) OpenWav(container, options);
    m_sound = std::make_unique<SoundFile>(m_output.Bytes(), SFM_WRITE, m_info);
    // The peak chunk carries the time of day, and the same input would give other bytes.
    sf_command(m_sound->Get(), SFC_SET_ADD_PEAK_CHUNK, nullptr, SF_FALSE);
}

AudioWriter::~AudioWriter() = default;

// WAV headers are our own, in files as in pipes; libsndfile lays the samples behind them.
void AudioWriter::OpenWav(int container, const AudioWriterOptions& options) {
    const int subtype = m_info.format & SF_FORMAT_SUBMASK;
    m_wav = WavShape{m_info.channels, m_info.samplerate, subtype};
    m_wav->rf64 = container == SF_FORMAT_RF64;
    const std::int64_t frameBytes = std::int64_t{m_info.channels} * WavSampleBytes(subtype);
    const std::int64_t largest = kLargestWavBytes / frameBytes - options.moreAtMost;
    m_wav->room = !m_output.IsStream() && !(options.frames && *options.frames <= largest);
    WriteHeader({});
    m_info.format = SF_FORMAT_RAW | subtype | SF_ENDIAN_LITTLE;
}

// The sizes in an AIFF file have 32 bits, and nothing stands for more.
void AudioWriter::RequireRoom(std::int64_t frames) const {
    if ((m_info.format & SF_FORMAT_TYPEMASK) != SF_FORMAT_AIFF) return;
    const int floatBits = m_format == SampleFormat::F64 ? 64 : 32;
    const int bits = IntegerBits(m_format) > 0 ? IntegerBits(m_format) : floatBits;
    if (frames > kLargestWavBytes / (bits / 8 * m_info.channels))
        throw UserError(Name() + ": would be larger than an AIFF file can be; use .wav, .w64 or .caf");
}

void AudioWriter::WriteHeader(std::optional<std::int64_t> sampleBytes) {
    const auto header = MakeWavHeader(*m_wav, sampleBytes);
    m_output.Bytes().Write(header.data(), header.size());
}

void AudioWriter::Write(const double* samples, std::int64_t frames) {
    if (frames <= 0) return;
    RequireRoom(m_frames + frames);
    if (m_output.IsStream())
        Store(samples, frames);
    else
        WriteBehind(samples, frames);
    m_frames += frames;
}

std::int64_t AudioWriter::Put(std::int64_t most, const std::function<std::int64_t(double*)>& fill) {
    const auto count = static_cast<std::size_t>(most * m_info.channels);
    if (m_output.IsStream() || count > BlockSamples(static_cast<std::size_t>(m_info.channels))) {
        m_apart.resize(count);
        const std::int64_t frames = fill(m_apart.data());
        Write(m_apart.data(), frames);
        return frames;
    }
    if (Room().size() < count) PassBlock();
    const std::int64_t frames = fill(Room().data());
    RequireRoom(m_frames + frames);
    Filled(frames);
    m_frames += frames;
    return frames;
}

void AudioWriter::WriteBehind(const double* samples, std::int64_t frames) {
    for (auto rest = static_cast<std::size_t>(frames * m_info.channels); rest > 0;) {
        const auto room = Room();
        const std::size_t count = std::min(rest, room.size());
        std::copy_n(samples, count, room.data());
        samples += count;
        rest -= count;
        Filled(static_cast<std::int64_t>(count) / m_info.channels);
    }
}

// What is free of the block to be filled.
std::span<double> AudioWriter::Room() {
    if (!m_behind)
        m_behind = std::make_unique<Relay>(BlockSamples(static_cast<std::size_t>(m_info.channels)));
    if (!m_block) m_block = m_behind->ToFill();
    return std::span(m_block->samples).subspan(static_cast<std::size_t>(m_block->frames * m_info.channels));
}

void AudioWriter::Filled(std::int64_t frames) {
    m_block->frames += frames;
    if (Room().empty()) PassBlock();
}

void AudioWriter::PassBlock() {
    m_block = nullptr;
    m_behind->Pass();
    if (!m_ownThread)
        m_ownThread = m_behind->Start([this] {
            while (StoreBlock()) continue;
        });
    if (!m_ownThread) StoreBlock();
}

// Stores the next block that was passed on. False when there is none and none will come.
bool AudioWriter::StoreBlock() {
    const Block* const block = m_behind->ToTake();
    if (!block) return false;
    Store(block->samples.data(), block->frames);
    if (++m_stored % kBlocksBetweenSyncs == 0) m_output.Bytes().BeginSync();
    m_behind->Return();
    return true;
}

void AudioWriter::FinishBehind() {
    if (!m_behind) return;
    if (m_block) m_behind->Pass();
    m_behind->Close();
    while (!m_ownThread && StoreBlock()) continue;
    m_behind->Finish();
}

void AudioWriter::Store(const double* samples, std::int64_t frames) {
    const int bits = IntegerBits(m_format);
    const bool stored = bits == 16 ? StoreIntegers(samples, frames, m_words)
                        : bits > 0 ? StoreIntegers(samples, frames, m_integers)
                                   : sf_writef_double(m_sound->Get(), samples, frames) == frames;
    m_output.Bytes().ThrowIfFailed();
    if (!stored) throw IoError(Name() + ": " + m_sound->Error());
}

template <typename Stored>
bool AudioWriter::StoreIntegers(const double* samples, std::int64_t frames, std::vector<Stored>& integers) {
    constexpr std::size_t kAtOnce = 512;  // one clipped sample slows down all of these
    const auto toIntegers = m_truncates ? ToIntegers<TowardsZero, Stored> : ToIntegers<Nearest, Stored>;
    const std::span all(samples, static_cast<std::size_t>(frames * m_info.channels));
    integers.resize(all.size());
    for (std::size_t i = 0; i < all.size(); i += kAtOnce)
        m_clipped += toIntegers(all.subspan(i, std::min(kAtOnce, all.size() - i)), IntegerBits(m_format),
                                integers.data() + i);
    if constexpr (sizeof(Stored) == 2)
        return sf_writef_short(m_sound->Get(), integers.data(), frames) == frames;
    else
        return sf_writef_int(m_sound->Get(), integers.data(), frames) == frames;
}

void AudioWriter::CompleteWav() {
    auto& bytes = m_output.Bytes();
    const std::int64_t size = m_frames * m_wav->channels * WavSampleBytes(m_wav->subtype);
    // Standard output may well be a file that can be gone back in; one that was appended to is left alone.
    const auto start = static_cast<std::int64_t>(MakeWavHeader(*m_wav, {}).size());
    if (bytes.Position() != start + size || bytes.Appends() || !bytes.Seek(0)) return;
    WriteHeader(size);
    bytes.Seek(0, SEEK_END);
    if (size % 2 != 0) bytes.Write("", 1);
}

OutputFile& AudioWriter::Complete() {
    FinishBehind();
    m_sound->Close();
    if (m_wav) CompleteWav();
    return m_output;
}

void AudioWriter::Commit() { Complete().Commit(); }

void WarnOfClipping(const AudioWriter& writer) {
    if (const auto count = writer.ClippedSamples(); count > 0)
        PrintMessage("warning: " + writer.Name() + ": " + std::to_string(count) +
                     (count == 1 ? " sample was clipped" : " samples were clipped"));
}

}  // namespace dsphost
