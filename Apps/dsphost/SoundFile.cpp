#include "SoundFile.h"

#include <limits>
#include <string_view>
#include <utility>

#include "Errors.h"

namespace dsphost {
namespace {

bool StartsWith(File& file, std::string_view tag) {
    std::string found(tag.size(), '\0');
    return file.Seek(0) && file.Read(found.data(), found.size()) == tag.size() && found == tag;
}

}  // namespace

SF_VIRTUAL_IO SoundFile::Callbacks() {
    SF_VIRTUAL_IO io{};
    io.get_filelen = [](void* user) -> sf_count_t {
        auto& stream = *static_cast<Stream*>(user);
        // A stream ends when it ends; until then it is longer than any file.
        return stream.seekable && !stream.endless ? stream.file.Length()
                                                  : std::numeric_limits<sf_count_t>::max() / 2;
    };
    io.seek = [](sf_count_t offset, int whence, void* user) -> sf_count_t {
        auto& stream = *static_cast<Stream*>(user);
        if (!stream.seekable) return stream.position;
        return stream.file.Seek(offset, whence) ? stream.file.Position() : -1;
    };
    io.tell = [](void* user) -> sf_count_t {
        auto& stream = *static_cast<Stream*>(user);
        return stream.seekable ? stream.file.Position() : stream.position;
    };
    io.read = [](void* bytes, sf_count_t count, void* user) -> sf_count_t {
        auto& stream = *static_cast<Stream*>(user);
        const auto done = static_cast<sf_count_t>(stream.file.Read(bytes, static_cast<std::size_t>(count)));
        stream.position += done;
        return done;
    };
    io.write = [](const void* bytes, sf_count_t count, void* user) -> sf_count_t {
        auto& stream = *static_cast<Stream*>(user);
        const auto done = static_cast<sf_count_t>(stream.file.Write(bytes, static_cast<std::size_t>(count)));
        stream.position += done;
        return done;
    };
    return io;
}

SoundFile::SoundFile(File& file, int mode, SF_INFO& info)
    : m_stream{file, (info.format & SF_FORMAT_TYPEMASK) != SF_FORMAT_RAW} {
    auto io = Callbacks();
    m_handle = sf_open_virtual(&io, mode, &info, &m_stream);
    if (!m_handle && mode == SFM_READ && m_stream.seekable && StartsWith(file, "caff")) {
        // Refused when its samples are cut off, unless the rest seems to be there.
        m_stream.endless = true;
        info = {};
        file.Seek(0);
        m_handle = sf_open_virtual(&io, mode, &info, &m_stream);
    }
    if (m_handle) return;
    file.ThrowIfFailed();
    throw UserError(file.Name() + ": " + sf_strerror(nullptr));
}

bool SoundFile::Opens(File& file) try {
    SF_INFO info{};
    file.Seek(0);
    const SoundFile trial(file, SFM_READ, info);
    return true;
} catch (const UserError&) {
    return false;
}

bool SoundFile::MayBeSound(File& file) {
    // A tag may be longer than all that there is.
    return Opens(file) || sf_error(nullptr) != SF_ERR_UNRECOGNISED_FORMAT || StartsWith(file, "ID3");
}

SoundFile::~SoundFile() {
    if (m_handle) sf_close(m_handle);
}

std::string SoundFile::Error() const { return sf_strerror(m_handle); }

void SoundFile::Close() {
    if (sf_close(std::exchange(m_handle, nullptr)) != 0)
        throw IoError(Bytes().Name() + ": cannot be completed");
}

}  // namespace dsphost
