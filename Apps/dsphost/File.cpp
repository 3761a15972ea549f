#include "File.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <random>
#include <utility>

#include "Errors.h"

#if defined(_WIN32)
#include <fcntl.h>
#include <io.h>
#include <share.h>
#include <sys/stat.h>

#include "Platform/WindowsHeader.h"
#else
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#endif

namespace dsphost {
namespace {

namespace fs = std::filesystem;

#if defined(_WIN32)

int ErrnoOf(DWORD error) {
    switch (error) {
        case ERROR_FILE_EXISTS:
        case ERROR_ALREADY_EXISTS:
            return EEXIST;
        case ERROR_FILE_NOT_FOUND:
        case ERROR_PATH_NOT_FOUND:
            return ENOENT;
        case ERROR_ACCESS_DENIED:
        case ERROR_SHARING_VIOLATION:
            return EACCES;
        default:
            return EIO;
    }
}

// Others may remove the file while it is open, which a console's end does.
std::FILE* OpenHandle(const fs::path& path, File::Mode mode, DWORD flags) {
    const bool reads = mode == File::Mode::Read, creates = mode == File::Mode::New;
    const DWORD access = (reads || creates ? GENERIC_READ : 0) | (reads ? 0 : GENERIC_WRITE);
    const DWORD share = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;
    const DWORD how = reads ? OPEN_EXISTING : creates ? CREATE_NEW : CREATE_ALWAYS;
    const HANDLE handle = CreateFileW(path.c_str(), access, share, nullptr, how, flags, nullptr);
    if (handle == INVALID_HANDLE_VALUE) {
        errno = ErrnoOf(GetLastError());
        return nullptr;
    }
    const int descriptor = _open_osfhandle(reinterpret_cast<std::intptr_t>(handle), reads ? _O_RDONLY : 0);
    return _fdopen(descriptor, reads ? "rb" : creates ? "w+b" : "wb");
}

std::FILE* OpenStream(const fs::path& path, File::Mode mode) {
    return OpenHandle(path, mode, FILE_ATTRIBUTE_NORMAL);
}

std::FILE* OpenTemporary(const fs::path& directory) {
    std::random_device random;
    const auto path = directory / ("dsphost." + std::to_string(random()) + "." + std::to_string(random()));
    return OpenHandle(path, File::Mode::New, FILE_ATTRIBUTE_TEMPORARY | FILE_FLAG_DELETE_ON_CLOSE);
}

std::optional<FileIdentity> IdentityOf(HANDLE handle) {
    BY_HANDLE_FILE_INFORMATION info;
    if (GetFileType(handle) != FILE_TYPE_DISK || !GetFileInformationByHandle(handle, &info)) return {};
    return FileIdentity{info.dwVolumeSerialNumber,
                        std::uint64_t{info.nFileIndexHigh} << 32 | info.nFileIndexLow};
}

int SeekStream(std::FILE* stream, std::int64_t offset, int origin) {
    return _fseeki64(stream, offset, origin);
}
std::int64_t TellStream(std::FILE* stream) { return _ftelli64(stream); }
int SyncStream(std::FILE* stream) { return _commit(_fileno(stream)); }

#else

std::FILE* OpenStream(const fs::path& path, File::Mode mode) {
    if (mode != File::Mode::New) return std::fopen(path.c_str(), mode == File::Mode::Read ? "rb" : "wb");
    const int descriptor = open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
    return descriptor < 0 ? nullptr : fdopen(descriptor, "w+b");
}

// Its name is gone before anything is in it.
std::FILE* OpenTemporary(const fs::path& directory) {
    const SignalsWait wait;
    std::string name = (directory / "dsphost.XXXXXX").string();
    const int descriptor = mkostemp(name.data(), O_CLOEXEC);
    if (descriptor < 0) return nullptr;
    unlink(name.c_str());
    return fdopen(descriptor, "w+b");
}

std::optional<FileIdentity> Identity(int result, const struct stat& status) {
    if (result != 0 || !(S_ISREG(status.st_mode) || S_ISFIFO(status.st_mode))) return {};
    return FileIdentity{status.st_dev, status.st_ino};
}

int SeekStream(std::FILE* stream, std::int64_t offset, int origin) {
    return fseeko(stream, static_cast<off_t>(offset), origin);
}
std::int64_t TellStream(std::FILE* stream) { return ftello(stream); }
int SyncStream(std::FILE* stream) { return fsync(fileno(stream)); }

#endif

int Reason() { return errno ? errno : EIO; }

}  // namespace

fs::path PathOf(const std::string& name) { return fs::path(std::u8string(name.begin(), name.end())); }

std::string NameOf(const fs::path& path) {
    const auto name = path.u8string();
    return {name.begin(), name.end()};
}

#if defined(_WIN32)
std::optional<FileIdentity> IdentityOf(const fs::path& path) {
    const HANDLE handle = CreateFileW(path.c_str(), 0, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                      nullptr, OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
    if (handle == INVALID_HANDLE_VALUE) return {};
    const auto identity = IdentityOf(handle);
    CloseHandle(handle);
    return identity;
}
std::optional<FileIdentity> IdentityOf(std::FILE* stream) {
    return IdentityOf(reinterpret_cast<HANDLE>(_get_osfhandle(_fileno(stream))));
}
#else
std::optional<FileIdentity> IdentityOf(const fs::path& path) {
    struct stat status {};
    return Identity(stat(path.c_str(), &status), status);
}
std::optional<FileIdentity> IdentityOf(std::FILE* stream) {
    struct stat status {};
    return Identity(fstat(fileno(stream), &status), status);
}
#endif

File::File(std::FILE* stream, std::string name, bool owned)
    : m_stream(stream), m_name(std::move(name)), m_owned(owned) {}

File::File(const fs::path& path, Mode mode, std::string name)
    : m_stream(OpenStream(path, mode)), m_name(std::move(name)) {
    const int reason = errno;
    if (path.empty()) throw UserError("the name of a file is empty");
    std::error_code none;
    if (fs::is_directory(path, none)) {
        if (m_stream) std::fclose(m_stream);
        throw UserError(m_name + ": is a directory; name a file");
    }
    if (!m_stream) throw UserError(m_name + ": " + std::strerror(reason));
    // What comes or goes through a pipe must not wait for more.
    if (fs::is_regular_file(path, none)) EnlargeBuffer();
}

void File::EnlargeBuffer() {
    constexpr std::size_t kBytes = 1 << 16;
    m_buffer = std::make_unique_for_overwrite<char[]>(kBytes);
    std::setvbuf(m_stream, m_buffer.get(), _IOFBF, kBytes);
}

File File::Temporary() {
    std::error_code error;
    const auto directory = fs::temp_directory_path(error);
    std::FILE* const stream = error ? nullptr : OpenTemporary(directory);
    if (stream) {
        File file(stream, "temporary file in " + NameOf(directory), true);
        file.EnlargeBuffer();
        return file;
    }
    throw IoError("there is no room for temporary files" +
                  (error ? std::string() : " in " + NameOf(directory)) + ": " +
                  (error ? error.message() : std::strerror(errno)));
}

File::File(File&& other) noexcept
    : m_stream(std::exchange(other.m_stream, nullptr)),
      m_name(std::move(other.m_name)),
      m_owned(other.m_owned),
      m_error(other.m_error),
      m_ahead(std::move(other.m_ahead)),
      m_buffer(std::move(other.m_buffer)) {}

File::~File() {
    if (m_stream && m_owned) std::fclose(m_stream);
}

File File::StandardInput() { return {stdin, "standard input", false}; }
File File::StandardOutput() { return {stdout, "standard output", false}; }

std::size_t File::Read(void* bytes, std::size_t count) {
    const std::size_t ahead = std::min(count, m_ahead.size());
    std::copy_n(m_ahead.begin(), ahead, static_cast<char*>(bytes));
    m_ahead.erase(0, ahead);
    errno = 0;
    const std::size_t done =
        ahead + std::fread(static_cast<char*>(bytes) + ahead, 1, count - ahead, m_stream);
    if (done < count && std::ferror(m_stream) && m_error == 0) m_error = Reason();
    return done;
}

std::string File::Peek(std::size_t count) {
    std::string bytes(count, '\0');
    bytes.resize(Read(bytes.data(), count));
    return m_ahead = bytes + m_ahead;
}

std::size_t File::Write(const void* bytes, std::size_t count) {
    errno = 0;
    const std::size_t done = m_error == 0 ? std::fwrite(bytes, 1, count, m_stream) : 0;
    if (done < count && m_error == 0) m_error = Reason();
    return done;
}

bool File::Seek(std::int64_t offset, int origin) {
    errno = 0;
    if (SeekStream(m_stream, offset, origin) == 0) return true;
    // Before it goes elsewhere it writes what is pending, and drops what the disk does not take.
    if (std::ferror(m_stream) && m_error == 0) m_error = Reason();
    return false;
}
std::int64_t File::Position() { return TellStream(m_stream); }

bool File::Appends() const {
#if defined(_WIN32)
    return false;  // whoever opens a file to append to it only begins at its end
#else
    const int flags = fcntl(fileno(m_stream), F_GETFL);
    return flags >= 0 && (flags & O_APPEND) != 0;
#endif
}

std::int64_t File::Length() {
    const std::int64_t position = Position();
    if (position < 0 || !Seek(0, SEEK_END)) return -1;
    const std::int64_t length = Position();
    Seek(position);
    return length;
}

void File::ThrowIfFailed() const {
    if (m_error != 0) throw IoError(m_name + ": " + std::strerror(m_error));
}

bool File::BecomeLike(const fs::path& other) {
#if defined(_WIN32)
    static_cast<void>(other);  // the system does that when it replaces one file by the other
    return true;
#else
    struct stat theirs {
    }, ours{};
    const int descriptor = fileno(m_stream);
    if (stat(other.c_str(), &theirs) != 0 || fstat(descriptor, &ours) != 0) return true;
    const bool same = theirs.st_uid == ours.st_uid && theirs.st_gid == ours.st_gid;
    const bool owned = same || fchown(descriptor, theirs.st_uid, theirs.st_gid) == 0;
    // After the owner: a change of owner takes some permissions away.
    return fchmod(descriptor, theirs.st_mode & 07777) == 0 && owned;
#endif
}

void File::BeginSync() {
#if defined(__linux__)
    sync_file_range(fileno(m_stream), 0, 0, SYNC_FILE_RANGE_WRITE);
#endif
}

void File::Sync() {
    errno = 0;
    const bool done = std::fflush(m_stream) == 0 && SyncStream(m_stream) == 0;
    // Where there is no disk behind the file there is nothing to wait for.
    const bool noDisk = errno == EINVAL || errno == ENOSYS;
    if (!done && !noDisk && m_error == 0) m_error = Reason();
}

void File::Close() {
    if (!m_stream) return;
    errno = 0;
    const bool flushed = std::fflush(m_stream) == 0 && !std::ferror(m_stream);
    if (!flushed && m_error == 0) m_error = Reason();
    const bool closed = !m_owned || std::fclose(m_stream) == 0;
    if (!closed && m_error == 0) m_error = Reason();
    m_stream = nullptr;
    ThrowIfFailed();
}

std::string ReadWhole(const std::string& name, std::size_t most) {
    File file(PathOf(name), File::Mode::Read, name);
    std::string bytes;
    char buffer[1 << 16];
    while (const std::size_t count = file.Read(buffer, sizeof buffer)) {
        bytes.append(buffer, count);
        if (bytes.size() > most)
            throw UserError(name + ": is larger than " + std::to_string(most >> 20) + " MiB");
    }
    file.ThrowIfFailed();
    return bytes;
}

}  // namespace dsphost
