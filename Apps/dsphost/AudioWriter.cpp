#include "AudioWriter.h"

#include <algorithm>
#include <bit>
#include <cmath>

#include "Errors.h"

namespace dsphost {
namespace {

// Nearest integer, ties to even, of a value within the range of 32 bits: this far from zero doubles are whole
// numbers, and the lowest bits are the integer's.
std::uint32_t Rounded(double value) {
    constexpr double kFar = 0x1.8p52;
    return static_cast<std::uint32_t>(std::bit_cast<std::uint64_t>(value + kFar));
}

}  // namespace

AudioWriter::AudioWriter(const std::string& path, const OutputRules& rules, const AudioWriterOptions& options)
    : m_output(path, rules) {
    const int container = ContainerFor(path, m_output.IsStream());
    m_format = ChooseSampleFormat(path, container, options.inputFormat, options.asked);
    m_info.channels = options.channels;
    m_info.samplerate = options.rate;
    m_info.format = container | *SubtypeIn(container, m_format);
    if (container == SF_FORMAT_WAV || container == SF_FORMAT_RF64) OpenWav(container, options.framesAtMost);
    m_sound = std::make_unique<SoundFile>(m_output.Bytes(), SFM_WRITE, m_info);
    // The peak chunk carries the time of day, and the same input would give other bytes.
    sf_command(m_sound->Get(), SFC_SET_ADD_PEAK_CHUNK, nullptr, SF_FALSE);
}

AudioWriter::~AudioWriter() = default;

// WAV headers are our own, in files as in pipes; libsndfile lays the samples behind them.
void AudioWriter::OpenWav(int container, const std::optional<std::int64_t>& framesAtMost) {
    const int subtype = m_info.format & SF_FORMAT_SUBMASK;
    m_wav = WavShape{m_info.channels, m_info.samplerate, subtype};
    m_wav->rf64 = container == SF_FORMAT_RF64;
    const std::int64_t frameBytes = std::int64_t{m_info.channels} * WavSampleBytes(subtype);
    m_wav->room = !m_output.IsStream() && !(framesAtMost && *framesAtMost <= kLargestWavBytes / frameBytes);
    WriteHeader({});
    m_info.format = SF_FORMAT_RAW | subtype | SF_ENDIAN_LITTLE;
}

void AudioWriter::WriteHeader(std::optional<std::int64_t> sampleBytes) {
    const auto header = MakeWavHeader(*m_wav, sampleBytes);
    m_output.Bytes().Write(header.data(), header.size());
}

void AudioWriter::Write(const double* samples, std::int64_t frames) {
    if (frames <= 0) return;
    if (m_output.IsStream())
        Store(samples, frames);
    else
        WriteBehind(samples, frames);
    m_frames += frames;
}

void AudioWriter::WriteBehind(const double* samples, std::int64_t frames) {
    const auto channels = static_cast<std::size_t>(m_info.channels);
    if (!m_behind) m_behind = std::make_unique<Relay>(BlockSamples(channels));
    for (auto rest = static_cast<std::size_t>(frames) * channels; rest > 0;) {
        if (!m_block) m_block = m_behind->ToFill();
        const std::size_t filled = static_cast<std::size_t>(m_block->frames) * channels;
        const std::size_t count = std::min(rest, m_block->samples.size() - filled);
        std::copy_n(samples, count, m_block->samples.data() + filled);
        m_block->frames += static_cast<std::int64_t>(count / channels);
        samples += count;
        rest -= count;
        if (filled + count < m_block->samples.size()) return;
        m_block = nullptr;
        m_behind->Pass();
        if (!m_ownThread)
            m_ownThread = m_behind->Start([this] {
                while (StoreBlock()) continue;
            });
        if (!m_ownThread) StoreBlock();
    }
}

// Stores the next block that was passed on. False when there is none and none will come.
bool AudioWriter::StoreBlock() {
    const Block* const block = m_behind->ToTake();
    if (!block) return false;
    Store(block->samples.data(), block->frames);
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
    if (IntegerBits(m_format) > 0) {
        StoreIntegers(samples, frames);
    } else if (sf_writef_double(m_sound->Get(), samples, frames) != frames) {
        m_output.Bytes().ThrowIfFailed();
        throw IoError(Name() + ": " + m_sound->Error());
    }
    m_output.Bytes().ThrowIfFailed();
}

void AudioWriter::StoreIntegers(const double* samples, std::int64_t frames) {
    const int bits = IntegerBits(m_format);
    const double scale = std::ldexp(1.0, bits - 1);
    const double lowest = -scale, highest = scale - 1.0;
    const int shift = 32 - bits;  // libsndfile takes every integer as the top bits of 32
    const auto count = static_cast<std::size_t>(frames * m_info.channels);
    m_integers.resize(count);
    for (std::size_t i = 0; i < count; ++i) {
        double value = samples[i] * scale;
        // What would round to a neighbour of the range is clipped too; not-a-number counts and becomes 0.
        // No branches: a loud passage clips here and there.
        m_clipped += !((value >= lowest - 0.5) & (value < highest + 0.5));
        value = std::isnan(value) ? 0.0 : std::min(std::max(value, lowest), highest);
        m_integers[i] = static_cast<int>(Rounded(value) << shift);
    }
    if (sf_writef_int(m_sound->Get(), m_integers.data(), frames) == frames) return;
    m_output.Bytes().ThrowIfFailed();
    throw IoError(Name() + ": " + m_sound->Error());
}

void AudioWriter::CompleteWav() {
    auto& bytes = m_output.Bytes();
    const std::int64_t size = m_frames * m_wav->channels * WavSampleBytes(m_wav->subtype);
    // Standard output may well be a file that can be gone back in; one that was appended to is left alone.
    const auto start = static_cast<std::int64_t>(MakeWavHeader(*m_wav, {}).size());
    if (bytes.Position() != start + size || !bytes.Seek(0)) return;
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

void WarnOfClipping(const AudioWriter& writer, std::int64_t before) {
    if (const auto count = writer.ClippedSamples() + before; count > 0)
        PrintMessage("warning: " + writer.Name() + ": " + std::to_string(count) +
                     (count == 1 ? " sample was clipped" : " samples were clipped"));
}

}  // namespace dsphost
