#include "AudioWriter.h"

#include <algorithm>
#include <cmath>

#include "Errors.h"
#include "WavStream.h"

namespace dsphost {
namespace {

// What a plain WAV can hold, headers and an ample reserve for them taken off.
constexpr std::int64_t kLargestWav = 0xFFFFFFFFll - (1 << 16);

// Nearest integer, ties to even, of a value that is within the integer's range.
int Rounded(double value) { return static_cast<int>(std::lrint(value)); }

}  // namespace

AudioWriter::AudioWriter(const std::string& path, const OutputRules& rules, const AudioWriterOptions& options)
    : m_output(path, rules), m_stream(m_output.IsStream()) {
    const int container = ContainerFor(path, m_stream);
    m_format = ChooseSampleFormat(path, container, options.inputFormat, options.asked);
    m_subtype = *SubtypeIn(container, m_format);
    m_info.channels = options.channels;
    m_info.samplerate = options.rate;
    Open(container, options.framesAtMost);
}

AudioWriter::~AudioWriter() = default;

void AudioWriter::Open(int container, const std::optional<std::int64_t>& framesAtMost) {
    if (m_stream) {
        m_start = m_output.Bytes().Position();
        const auto header = MakeWavHeader(m_info.channels, m_info.samplerate, m_subtype, {});
        m_output.Bytes().Write(header.data(), header.size());
        m_info.format = SF_FORMAT_RAW | m_subtype | SF_ENDIAN_LITTLE;
    } else {
        const std::int64_t frameBytes = std::int64_t{m_info.channels} * WavSampleBytes(m_subtype);
        const bool fits =
            framesAtMost && *framesAtMost <= kLargestWav / std::max<std::int64_t>(frameBytes, 1);
        if (container == SF_FORMAT_WAV && !fits) container = SF_FORMAT_RF64;
        m_info.format = container | m_subtype;
    }
    const bool mayShrink =
        !m_stream && (m_info.format & SF_FORMAT_TYPEMASK) == SF_FORMAT_RF64 && !framesAtMost;
    m_sound = std::make_unique<SoundFile>(m_output.Bytes(), SFM_WRITE, m_info);
    // The peak chunk carries the time of day, and the same input would give other bytes.
    sf_command(m_sound->Get(), SFC_SET_ADD_PEAK_CHUNK, nullptr, SF_FALSE);
    if (mayShrink) sf_command(m_sound->Get(), SFC_RF64_AUTO_DOWNGRADE, nullptr, SF_TRUE);
}

void AudioWriter::Write(const double* samples, std::int64_t frames) {
    if (frames <= 0) return;
    if (IntegerBits(m_format) > 0) {
        WriteIntegers(samples, frames);
    } else if (sf_writef_double(m_sound->Get(), samples, frames) != frames) {
        m_output.Bytes().ThrowIfFailed();
        throw IoError(Name() + ": " + m_sound->Error());
    }
    m_output.Bytes().ThrowIfFailed();
    m_frames += frames;
}

void AudioWriter::WriteIntegers(const double* samples, std::int64_t frames) {
    const int bits = IntegerBits(m_format);
    const double scale = std::ldexp(1.0, bits - 1);
    const double lowest = -scale, highest = scale - 1.0;
    const int shift = 32 - bits;  // libsndfile takes every integer as the top bits of 32
    const auto count = static_cast<std::size_t>(frames * m_info.channels);
    m_integers.resize(count);
    for (std::size_t i = 0; i < count; ++i) {
        double value = samples[i] * scale;
        // What would round to a neighbour of the range is clipped too; not-a-number counts and becomes 0.
        if (!(value >= lowest - 0.5 && value < highest + 0.5)) {
            ++m_clipped;
            value = value < lowest ? lowest : value > highest ? highest : 0.0;
        }
        value = std::min(std::max(value, lowest), highest);
        m_integers[i] = static_cast<int>(static_cast<unsigned>(Rounded(value)) << shift);
    }
    if (sf_writef_int(m_sound->Get(), m_integers.data(), frames) == frames) return;
    m_output.Bytes().ThrowIfFailed();
    throw IoError(Name() + ": " + m_sound->Error());
}

void AudioWriter::Commit() {
    m_sound->Close();
    auto& bytes = m_output.Bytes();
    // A stream that turned out to be a file gets its true sizes.
    if (m_stream && m_start == 0 && bytes.Seek(0)) {
        const auto size = m_frames * m_info.channels * WavSampleBytes(m_subtype);
        const auto header = MakeWavHeader(m_info.channels, m_info.samplerate, m_subtype, size);
        bytes.Write(header.data(), header.size());
        bytes.Seek(0, SEEK_END);
    }
    m_output.Commit();
}

void WarnOfClipping(const AudioWriter& writer) {
    if (const auto count = writer.ClippedSamples(); count > 0)
        PrintMessage("warning: " + writer.Name() + ": " + std::to_string(count) +
                     (count == 1 ? " sample was clipped" : " samples were clipped"));
}

}  // namespace dsphost
