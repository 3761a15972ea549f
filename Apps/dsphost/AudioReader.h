#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "File.h"
#include "Relay.h"
#include "SampleFormat.h"
#include "SoundFile.h"
#include "WavHeader.h"

namespace dsphost {

// Reads audio of any kind that libsndfile knows, a block at a time, as doubles with full scale 1.
//
// "-" is standard input; it and named pipes may carry anything: WAV streams through, also without a stated
// length, and what cannot be read forwards only (FLAC, W64, ...) is first spooled to a temporary file.
//
// Files are read and decoded ahead, on a thread of the reader's own. Streams are not: whoever writes them
// works at the same time anyway, and a thread that waits for them could not be ended.
class AudioReader {
public:
    // Throws UserError when there is nothing there, or nothing that is audio.
    // A temporary file takes at most `spoolLimit` bytes.
    explicit AudioReader(const std::string& path, std::int64_t spoolLimit = kUsualSpoolLimit);
    // `forwardsOnly`: as if the file could not seek.
    explicit AudioReader(File file, bool forwardsOnly = false);
    ~AudioReader();

    static constexpr std::int64_t kUsualSpoolLimit = std::int64_t{8} << 30;

    int Channels() const { return m_info.channels; }
    int Rate() const { return m_info.samplerate; }
    std::optional<std::int64_t> Frames() const { return m_frames; }  // nothing: known at the end only
    // Nothing for lossy codecs.
    std::optional<SampleFormat> Format() const { return FromSubtype(m_info.format & SF_FORMAT_SUBMASK); }
    const std::string& Name() const { return m_name; }  // as messages call it

    // Fills `samples` with up to `frames` interleaved frames and returns how many there were: fewer only at
    // the end. Throws UserError when the file turns out to be damaged. At the end it warns of an input that
    // was cut off and of samples that are not finite numbers, which it leaves as they are.
    int Read(double* samples, int frames);
    // The same without a copy where that can be; they stay until the next call.
    std::span<const double> Next(int frames);

private:
    void OpenStream(File stream);
    void OpenFile(File file);
    void OpenSamples(const WavStreamHeader& header);
    void OpenSound(const std::optional<WavStreamHeader>& header);
    int ReadSome(double* samples, int frames);
    int ReadAhead(double* samples, int frames);
    std::int64_t Ahead();
    const double* Taken(int frames);
    bool DecodeBlock();
    std::int64_t Decode(double* samples, std::int64_t frames);
    void CountNotFinite(std::span<const double> samples);
    void End();

    std::string m_name;
    std::int64_t m_spoolLimit = kUsualSpoolLimit;
    std::unique_ptr<File> m_file;
    std::unique_ptr<SoundFile> m_sound;
    SF_INFO m_info{};
    std::optional<std::int64_t> m_frames, m_doubtfulFrames;
    std::int64_t m_position = 0;
    std::int64_t m_notFinite = 0, m_firstNotFinite = 0;  // samples; the frame of the first
    bool m_cutOff = false, m_ended = false, m_streams = false;
    std::vector<std::int16_t> m_words;
    std::vector<double> m_next;  // what Next had to copy
    Block* m_block = nullptr;    // what was read ahead
    std::int64_t m_taken = 0;    // frames of it
    bool m_ownThread = false;
    std::unique_ptr<Relay> m_ahead;  // last: its thread uses the others
};

// A number of bytes as "500M": with a K, M, G or T behind it, or nothing. Throws UserError that names
// --spool-limit.
std::int64_t ParseSpoolLimit(const std::string& size);

// Throws UserError unless the rate is between 1000 and 768000 Hz and there are at most `maxChannels`
// channels; `reason` says why not more.
void RequireFormat(const AudioReader& input, int maxChannels, const std::string& reason);

}  // namespace dsphost
