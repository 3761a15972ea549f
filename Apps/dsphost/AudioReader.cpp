#include "AudioReader.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <iterator>
#include <limits>
#include <string_view>
#include <utility>
#include <vector>

#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

namespace fs = std::filesystem;

constexpr int kLowestRate = 1000, kHighestRate = 768000;

// Every kind of audio file is known by what stands in its first bytes; so many are more than enough.
constexpr std::size_t kEnoughToRecognise = 1 << 16;
// Of what looks like one so much must be readable: more than the largest picture in front of a FLAC's
// samples.
constexpr std::int64_t kEnoughToOpen = std::int64_t{32} << 20;

std::string Counted(std::int64_t count, const char* one, const char* several) {
    return std::to_string(count) + (count == 1 ? one : several);
}

std::string NoAudio(const std::string& name) {
    return name + ": is not an audio file that can be read (WAV, FLAC, AIFF, Ogg and others)";
}

// All of the stream in a temporary file, `start` in front.
File Spool(File& from, const std::vector<unsigned char>& start, std::int64_t limit) {
    File to = File::Temporary();
    to.Write(start.data(), start.size());
    std::vector<unsigned char> buffer(kEnoughToRecognise);
    auto size = static_cast<std::int64_t>(start.size());
    bool recognised = false, opened = false;
    while (const std::size_t count = from.Read(buffer.data(), buffer.size())) {
        size += static_cast<std::int64_t>(count);
        if (size > limit)
            throw UserError(from.Name() + ": does not stream, and its temporary file would be larger than " +
                            Counted(limit, " byte", " bytes") + "; --spool-limit allows more");
        to.Write(buffer.data(), count);
        to.ThrowIfFailed();
        const bool enough = size >= kEnoughToOpen;
        if (enough ? std::exchange(opened, true) : std::exchange(recognised, true)) continue;
        const bool sound = enough ? SoundFile::Opens(to) : SoundFile::MayBeSound(to);
        to.ThrowIfFailed();
        if (!sound) throw UserError(NoAudio(from.Name()));
        to.Seek(0, SEEK_END);
    }
    from.ThrowIfFailed();
    to.Seek(0);
    to.ThrowIfFailed();
    return to;
}

std::int64_t FrameBytes(const WavStreamHeader& header) {
    return std::int64_t{WavSampleBytes(header.subtype)} * header.channels;
}

// Nothing where a number of frames cannot be meant; to reckon with it would overflow.
std::optional<std::int64_t> Meant(std::int64_t frames) {
    constexpr std::int64_t kMost = std::int64_t{1} << 40;
    return frames <= kMost ? std::optional(frames) : std::nullopt;
}

using Front = std::array<unsigned char, 24>;

// Whether a file says in front that it is longer than it is, of kinds of which libsndfile does not tell.
bool PromisesMore(const Front& front, int kind, std::int64_t length) {
    struct {
        int kind;
        std::size_t at, size;     // of the number in front
        std::int64_t besides;     // bytes that it does not count
        std::uint64_t mostMeant;  // a writer that cannot go back puts something larger
    } constexpr kKinds[]{
        {SF_FORMAT_AIFF, 4, 4, 8, 0x7F000000},
        {SF_FORMAT_AU, 8, 4, 24, 0x7F000000},
        {SF_FORMAT_W64, 16, 8, 0, std::uint64_t{1} << 45},
    };
    const auto* const row = std::ranges::find(kKinds, kind, [](const auto& each) { return each.kind; });
    if (row == std::end(kKinds)) return false;
    const bool bigEndian = front[0] == 'F' || front[0] == '.';
    std::uint64_t number = 0;
    for (std::size_t i = 0; i < row->size; ++i)
        number = number << 8 | front[row->at + (bigEndian ? i : row->size - 1 - i)];
    if (number >= row->mostMeant) return false;
    return static_cast<std::int64_t>(number) + row->besides > length + 1;  // one more may pad it
}

ByteSource SourceOf(File& file) {
    return [&file](void* bytes, std::size_t count) { return file.Read(bytes, count); };
}

}  // namespace

AudioReader::AudioReader(const std::string& path, std::int64_t spoolLimit)
    : m_name(path == "-" ? "standard input" : path), m_spoolLimit(spoolLimit) {
    std::error_code error;
    const auto status = fs::status(PathOf(path), error);
    if (path == "-") {
        if (IsTerminal(stdin)) throw UserError("standard input is a terminal; pipe audio into it");
        OpenStream(File::StandardInput());
    } else {
        File file(PathOf(path), File::Mode::Read, path);
        // What a system makes up while it is read has no length.
        if ((fs::exists(status) && !fs::is_regular_file(status)) || file.Length() == 0)
            OpenStream(std::move(file));
        else
            OpenFile(std::move(file));
    }
}

AudioReader::AudioReader(File file, bool forwardsOnly) : m_name(file.Name()) {
    if (forwardsOnly)
        OpenStream(std::move(file));
    else
        OpenFile(std::move(file));
}

AudioReader::~AudioReader() = default;

void AudioReader::OpenFile(File file) {
    m_file = std::make_unique<File>(std::move(file));
    const std::int64_t length = m_file->Length();
    if (length == 0) throw UserError(m_name + ": is empty");
    // libsndfile says nothing of samples that a WAV file promises and does not hold.
    Front front{};
    std::vector<unsigned char> start;
    m_file->Seek(0);
    m_file->Read(front.data(), front.size());
    m_file->Seek(0);
    const auto header = ReadWavStreamHeader(SourceOf(*m_file), start);
    m_file->Seek(0);
    OpenSound(header);
    const std::int64_t sampleBytes = length - static_cast<std::int64_t>(start.size());
    if (m_info.frames == 0 && header && !header->sampleBytes) {  // its writer died, or there are none
        m_file->Seek(length - sampleBytes);
        if (!StartsChunk(m_file->Peek(kChunkStart), 0)) OpenSamples(*header);
        m_info.frames = m_streams ? sampleBytes / FrameBytes(*header) : 0;
    }
    if (m_info.frames <= 0) throw UserError(m_name + ": is empty: it holds no samples");
    m_frames = Meant(m_info.frames);
    if (header && header->sampleBytes && *header->sampleBytes > sampleBytes)
        m_frames = Meant(*header->sampleBytes / FrameBytes(*header));
    const int kind = m_info.format & SF_FORMAT_TYPEMASK;
    // As libsndfile says of Ogg that lacks its end, but also of a FLAC stream that never knew its length.
    m_cutOff = (kind == SF_FORMAT_OGG && m_info.frames == std::numeric_limits<sf_count_t>::max()) ||
               PromisesMore(front, kind, length);
}

void AudioReader::OpenStream(File stream) {
    std::vector<unsigned char> start;
    const auto header = ReadWavStreamHeader(SourceOf(stream), start);
    stream.ThrowIfFailed();
    if (start.empty()) throw UserError(m_name + ": is empty");
    if (start.size() >= kLongestWavHeader)
        throw UserError(m_name + ": is a WAV stream without samples in its first MiB");
    if (!header) return OpenFile(Spool(stream, start, m_spoolLimit));
    if (header->sampleBytes) m_frames = Meant(*header->sampleBytes / FrameBytes(*header));
    if (header->doubtfulBytes) m_doubtfulFrames = *header->doubtfulBytes / FrameBytes(*header);
    m_file = std::make_unique<File>(std::move(stream));
    OpenSamples(*header);
}

// From where the file stands, without looking back.
void AudioReader::OpenSamples(const WavStreamHeader& header) {
    m_info = {};
    m_info.channels = header.channels;
    m_info.samplerate = header.rate;
    m_info.format = SF_FORMAT_RAW | header.subtype | SF_ENDIAN_LITTLE;
    m_streams = true;
    OpenSound(header);
}

void AudioReader::OpenSound(const std::optional<WavStreamHeader>& header) {
    try {
        m_sound = std::make_unique<SoundFile>(*m_file, SFM_READ, m_info);
    } catch (const UserError&) {
        if (!header) throw UserError(NoAudio(m_name));
        throw UserError(m_name + ": cannot be read: it has " + std::to_string(header->channels) +
                        " channels and a sample rate of " + std::to_string(header->rate) + " Hz");
    }
}

int AudioReader::Read(double* samples, int frames) {
    int done = 0;
    while (done < frames) {
        double* const rest = samples + static_cast<std::ptrdiff_t>(done) * Channels();
        const int got = m_streams ? ReadSome(rest, frames - done) : ReadAhead(rest, frames - done);
        if (got == 0) break;
        done += got;
    }
    if (done < frames && !std::exchange(m_ended, true)) End();
    return done;
}

std::span<const double> AudioReader::Next(int frames) {
    const auto channels = static_cast<std::size_t>(Channels());
    const auto count = static_cast<std::size_t>(frames) * channels;
    if (!m_streams && Ahead() >= frames) return {Taken(frames), count};
    m_next.resize(count);
    return std::span(m_next).first(static_cast<std::size_t>(Read(m_next.data(), frames)) * channels);
}

// None at the end only.
int AudioReader::ReadAhead(double* samples, int frames) {
    const auto count = static_cast<int>(std::min<std::int64_t>(frames, Ahead()));
    if (count > 0) std::copy_n(Taken(count), static_cast<std::ptrdiff_t>(count) * Channels(), samples);
    return count;
}

// How many frames stand in the block that was read ahead, a new one where they were all taken. None at the
// end only.
std::int64_t AudioReader::Ahead() {
    if (!m_ahead) m_ahead = std::make_unique<Relay>(BlockSamples(static_cast<std::size_t>(Channels())));
    if (m_block && m_taken == m_block->frames) {
        m_ahead->Return();
        m_block = nullptr;
    }
    if (!m_block) {
        // What fits into one block needs no thread.
        if (!m_ownThread && DecodeBlock())
            m_ownThread = m_ahead->Start([this] {
                while (DecodeBlock()) continue;
            });
        m_block = m_ahead->ToTake();
        m_taken = 0;
    }
    return m_block ? m_block->frames - m_taken : 0;
}

const double* AudioReader::Taken(int frames) {
    return m_block->samples.data() + std::exchange(m_taken, m_taken + frames) * Channels();
}

// Passes one more block on. False at the end.
bool AudioReader::DecodeBlock() {
    Block* const block = m_ahead->ToFill();
    if (!block) return false;
    const auto most = static_cast<std::int64_t>(block->samples.size()) / Channels();
    const std::int64_t start = m_position;
    bool ended = false;
    std::exception_ptr failure;
    try {
        while (!ended && m_position < start + most)
            ended = ReadSome(block->samples.data() + (m_position - start) * Channels(),
                             static_cast<int>(start + most - m_position)) == 0;
    } catch (...) {
        failure = std::current_exception();
    }
    block->frames = m_position - start;  // those in front of the failure too
    if (block->frames > 0) m_ahead->Pass();
    if (!ended && !failure) return true;
    m_ahead->Close(failure);
    return false;
}

// None at the end only.
int AudioReader::ReadSome(double* samples, int frames) {
    if (m_doubtfulFrames && m_position == *m_doubtfulFrames) {
        const std::int64_t bytes =
            m_position * WavSampleBytes(m_info.format & SF_FORMAT_SUBMASK) * Channels();
        if (StartsChunk(m_file->Peek(kChunkStart), bytes)) m_frames = m_position;
        m_doubtfulFrames.reset();
    }
    std::int64_t wanted = frames;
    for (const auto& end : {m_frames, m_doubtfulFrames})
        if (end) wanted = std::min(wanted, *end - m_position);
    if (wanted <= 0) return 0;
    const auto got = Decode(samples, wanted);
    m_position += got;
    m_file->ThrowIfFailed();
    if (sf_error(m_sound->Get()) == SF_ERR_NO_ERROR) return static_cast<int>(got);
    // What is left of the last piece of a file that was cut off cannot be decoded.
    m_cutOff = !m_streams && m_position > 0 && m_file->Position() == m_file->Length();
    if (!m_cutOff)
        throw UserError(m_name + ": is damaged after " + std::to_string(m_position) +
                        " frames: " + m_sound->Error());
    return static_cast<int>(got);
}

std::int64_t AudioReader::Decode(double* samples, std::int64_t frames) {
    const auto count = static_cast<std::size_t>(frames * Channels());
    if ((m_info.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16) {
        m_words.resize(count);
        const auto got = sf_readf_short(m_sound->Get(), m_words.data(), frames);
        const auto words = std::span(m_words).first(static_cast<std::size_t>(got * Channels()));
        std::ranges::transform(words, samples, [](std::int16_t word) { return word * 0x1p-15; });
        return got;
    }
    const auto got = sf_readf_double(m_sound->Get(), samples, frames);
    CountNotFinite(std::span(samples, static_cast<std::size_t>(got * Channels())));
    return got;
}

void AudioReader::CountNotFinite(std::span<const double> samples) {
    const auto notFinite = [](double sample) { return !std::isfinite(sample); };
    const auto count = std::ranges::count_if(samples, notFinite);
    if (count > 0 && m_notFinite == 0)
        m_firstNotFinite =
            m_position + (std::ranges::find_if(samples, notFinite) - samples.begin()) / Channels();
    m_notFinite += count;
}

void AudioReader::End() {
    if (m_position == 0) throw UserError(m_name + ": is empty: it holds no samples");
    const std::string warning = "warning: " + m_name + ": ";
    if (m_frames && m_position < *m_frames) {
        PrintMessage(warning + "ended after " + std::to_string(m_position) + " of " +
                     std::to_string(*m_frames) + " frames");
        m_frames = m_position;
    } else if (m_cutOff) {
        PrintMessage(warning + "was cut off, after " + std::to_string(m_position) + " frames");
    }
    if (m_notFinite == 0) return;
    char time[32];
    std::snprintf(time, sizeof time, "%.3f", static_cast<double>(m_firstNotFinite) / Rate());
    PrintMessage(warning +
                 Counted(m_notFinite, " sample is not a finite number, at ",
                         " samples are not finite numbers, the first at ") +
                 time + " s");
}

std::int64_t ParseSpoolLimit(const std::string& size) {
    constexpr std::string_view kUnits = "KMGT";
    const auto length = NumberLength(size);
    const auto number = ToNumber(std::string_view(size).substr(0, length));
    const std::string_view unit = std::string_view(size).substr(length);
    const auto place = unit.size() == 1 ? kUnits.find(static_cast<char>(unit[0] & ~0x20)) : kUnits.npos;
    const int power = place == kUnits.npos ? 0 : 10 * (static_cast<int>(place) + 1);
    const double bytes = number ? std::ldexp(*number, power) : -1.0;
    if (!(bytes >= 0.0 && bytes < 0x1p62) || (power == 0 && !unit.empty()))
        throw UserError("--spool-limit cannot be \"" + size + "\"; accepted: a number of bytes, or 500M, 8G");
    return static_cast<std::int64_t>(bytes);
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
