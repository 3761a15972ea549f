#pragma once

#include <cstdint>
#include <string>

#include <sndfile.h>

#include "File.h"

namespace dsphost {

// libsndfile over a File, so that names, large positions and failures are treated alike on every system.
// The File must outlive it and stay where it is.
class SoundFile {
public:
    // Opens with sf_open's modes; `info` as sf_open takes and fills it. Where the file cannot seek, only
    // raw samples can be handled, from where it stands. Throws UserError naming the file.
    SoundFile(File& file, int mode, SF_INFO& info);
    SoundFile(const SoundFile&) = delete;
    SoundFile& operator=(const SoundFile&) = delete;
    ~SoundFile();

    // False for bytes, from the start of `file` on, that no kind of sound file starts with; true where only
    // the rest is missing.
    static bool MayBeSound(File& file);
    // Whether what is there of `file` can be read already.
    static bool Opens(File& file);

    SNDFILE* Get() const { return m_handle; }
    File& Bytes() const { return m_stream.file; }
    // libsndfile's own words on what went wrong.
    std::string Error() const;
    // Writes what is pending, headers included; the file itself stays open.
    void Close();

private:
    struct Stream {
        File& file;
        bool seekable, endless = false;
        std::int64_t position = 0;  // of a stream that cannot seek
    };
    static SF_VIRTUAL_IO Callbacks();

    Stream m_stream;
    SNDFILE* m_handle;
};

}  // namespace dsphost
