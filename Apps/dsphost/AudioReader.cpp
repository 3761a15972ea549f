#include "AudioReader.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "Errors.h"
#include "OutputFile.h"
#include "WavHeader.h"

namespace dsphost {
namespace {

namespace fs = std::filesystem;

constexpr int kLowestRate = 1000, kHighestRate = 768000;

void Spool(File& from, const std::vector<unsigned char>& start, const fs::path& path) {
    File to(path, File::Mode::Write, "temporary file " + path.string());
    to.Write(start.data(), start.size());
    std::vector<unsigned char> buffer(1 << 16);
    for (;;) {
        const std::size_t count = from.Read(buffer.data(), buffer.size());
        if (count == 0) break;
        to.Write(buffer.data(), count);
        to.ThrowIfFailed();
        CheckInterrupted();
    }
    from.ThrowIfFailed();
    to.Close();
}

}  // namespace

AudioReader::AudioReader(const std::string& path) : m_name(path == "-" ? "standard input" : path) {
    std::error_code error;
    const auto status = fs::status(path, error);
    if (path == "-") {
        if (IsTerminal(stdin)) throw UserError("standard input is a terminal; pipe audio into it");
        OpenStream(File::StandardInput());
    } else if (fs::is_directory(status)) {
        throw UserError(path + ": is a directory, not an audio file");
    } else if (fs::exists(status) && !fs::is_regular_file(status)) {
        OpenStream(File(path, File::Mode::Read, path));
    } else {
        OpenFile(path);
    }
}

AudioReader::~AudioReader() {
    m_sound.reset();
    m_file.reset();
    std::error_code error;
    if (!m_spool.empty()) fs::remove(m_spool, error);
}

void AudioReader::OpenFile(const fs::path& path) {
    m_file = std::make_unique<File>(path, File::Mode::Read, m_name);
    if (m_file->Length() == 0) throw UserError(m_name + ": is empty");
    try {
        m_sound = std::make_unique<SoundFile>(*m_file, SFM_READ, m_info);
    } catch (const UserError&) {
        throw UserError(m_name + ": is not an audio file that can be read (WAV, FLAC, AIFF, Ogg and others)");
    }
    if (m_info.frames <= 0) throw UserError(m_name + ": is empty: it holds no samples");
    m_frames = m_info.frames;
}

void AudioReader::OpenStream(File stream) {
    std::vector<unsigned char> start;
    const auto header = ReadWavStreamHeader(stream, start);
    stream.ThrowIfFailed();
    if (start.empty()) throw UserError(m_name + ": is empty");
    if (!header) {
        m_spool = OutputFile::UnusedName(fs::temp_directory_path(), "dsphost");
        Spool(stream, start, m_spool);
        return OpenFile(m_spool);
    }
    m_info.channels = header->channels;
    m_info.samplerate = header->rate;
    m_info.format = SF_FORMAT_RAW | header->subtype | SF_ENDIAN_LITTLE;
    if (header->sampleBytes)
        m_frames = *header->sampleBytes / (WavSampleBytes(header->subtype) * header->channels);
    m_file = std::make_unique<File>(std::move(stream));
    m_sound = std::make_unique<SoundFile>(*m_file, SFM_READ, m_info);
}

int AudioReader::Read(double* samples, int frames) {
    std::int64_t wanted = frames;
    if (m_frames) wanted = std::min(wanted, *m_frames - m_position);
    if (wanted <= 0) return 0;
    const auto got = sf_readf_double(m_sound->Get(), samples, wanted);
    m_position += got;
    m_file->ThrowIfFailed();
    if (sf_error(m_sound->Get()) != SF_ERR_NO_ERROR)
        throw UserError(m_name + ": is damaged after " + std::to_string(m_position) +
                        " frames: " + m_sound->Error());
    if (m_position == 0) throw UserError(m_name + ": is empty: it holds no samples");
    if (m_frames && got < wanted) {
        PrintMessage("warning: " + m_name + ": ended after " + std::to_string(m_position) + " of " +
                     std::to_string(*m_frames) + " frames");
        m_frames = m_position;
    }
    return static_cast<int>(got);
}

void RequireFormat(const AudioReader& input, int maxChannels, const std::string& reason) {
    if (input.Channels() < 1 || input.Channels() > maxChannels)
        throw UserError(input.Name() + ": has " + std::to_string(input.Channels()) + " channels; " + reason);
    if (input.Rate() < kLowestRate || input.Rate() > kHighestRate)
        throw UserError(input.Name() + ": has a sample rate of " + std::to_string(input.Rate()) +
                        " Hz; accepted: " + std::to_string(kLowestRate) + " to " +
                        std::to_string(kHighestRate) + " Hz");
}

}  // namespace dsphost
