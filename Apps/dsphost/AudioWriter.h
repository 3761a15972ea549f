#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "OutputFile.h"
#include "Relay.h"
#include "SampleFormat.h"
#include "SoundFile.h"
#include "WavHeader.h"

namespace dsphost {

struct AudioWriterOptions {
    int channels = 2, rate = 48000;
    std::optional<SampleFormat> asked;        // --format
    std::optional<SampleFormat> inputFormat;  // kept when nothing is asked for
    std::optional<std::int64_t> frames;       // to come; nothing: not known
    std::int64_t moreAtMost = 0;              // frames; decides whether a plain WAV is large enough
};

// Writes audio a block at a time; the file appears at Commit, whole, or not at all. The kind of file follows
// from the name's ending; streams ("-", devices, pipes) get WAV with sizes that say "until the end". A WAV
// that would pass 4 GiB becomes an RF64; an AIFF is refused. The same samples always give the same bytes (Ogg
// excepted, whose streams carry a random number).
//
// Files are encoded and written on a thread of the writer's own, which is some blocks behind: a failure shows
// in one of the next calls.
//
// Integers: full scale is 1; values are rounded to nearest, ties to even, without dither, and clipped.
class AudioWriter {
public:
    // Throws UserError when the place, the kind of file or the sample format will not do.
    AudioWriter(const std::string& path, const OutputRules& rules, const AudioWriterOptions& options);
    ~AudioWriter();

    // Integers are truncated towards zero instead; call it before Write.
    void TruncateIntegers() { m_truncates = true; }

    // `samples`: interleaved. Throws IoError when they cannot be stored.
    void Write(const double* samples, std::int64_t frames);
    // The same without a copy: `fill` puts up to `most` frames where it is told to, and returns how many.
    // Returns the same.
    std::int64_t Put(std::int64_t most, const std::function<std::int64_t(double*)>& fill);
    // Completes the file and puts it in its place. Throws IoError.
    void Commit();
    // The first half of it; the result is still to be committed.
    OutputFile& Complete();

    std::int64_t ClippedSamples() const { return m_clipped; }  // when it is complete
    std::int64_t FramesWritten() const { return m_frames; }
    SampleFormat Format() const { return m_format; }
    const std::string& Name() const { return m_output.Name(); }

private:
    void OpenWav(int container, const AudioWriterOptions& options);
    void RequireRoom(std::int64_t frames) const;
    void WriteHeader(std::optional<std::int64_t> sampleBytes);
    void CompleteWav();
    void WriteBehind(const double* samples, std::int64_t frames);
    std::span<double> Room();
    void Filled(std::int64_t frames);
    void PassBlock();
    bool StoreBlock();
    void FinishBehind();
    void Store(const double* samples, std::int64_t frames);
    template <typename Stored>
    bool StoreIntegers(const double* samples, std::int64_t frames, std::vector<Stored>& integers);

    OutputFile m_output;
    SF_INFO m_info{};
    SampleFormat m_format;
    std::optional<WavShape> m_wav;
    std::unique_ptr<SoundFile> m_sound;
    std::vector<std::int16_t> m_words;
    std::vector<int> m_integers;
    std::vector<double> m_apart;  // more than fits into a block, or for a stream
    std::int64_t m_clipped = 0, m_frames = 0;
    Block* m_block = nullptr;  // being filled
    bool m_truncates = false, m_ownThread = false;
    int m_stored = 0;                 // blocks
    std::unique_ptr<Relay> m_behind;  // last: its thread uses the others
};

// "3 samples of out.wav were clipped" on standard error when there were any.
void WarnOfClipping(const AudioWriter& writer);

}  // namespace dsphost
