#include "File.h"

#include <cerrno>
#include <csignal>
#include <cstring>
#include <utility>

#include "Errors.h"

#if defined(_WIN32)
#include <fcntl.h>
#include <io.h>
#else
#include <sys/stat.h>
#include <unistd.h>
#endif

namespace dsphost {
namespace {

volatile std::sig_atomic_t g_interrupted = 0;

extern "C" void OnInterrupt(int) { g_interrupted = 1; }

// The first signal also ends a wait for input; a second one ends the program at once.
void CatchInterrupt(int signal) {
#if defined(_WIN32)
    std::signal(signal, OnInterrupt);  // the system restores the default when it calls
#else
    struct sigaction action {};
    action.sa_handler = OnInterrupt;
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigaction(signal, &action, nullptr);
#endif
}

std::FILE* OpenStream(const std::filesystem::path& path, File::Mode mode) {
#if defined(_WIN32)
    constexpr const wchar_t* kModes[] = {L"rb", L"wb", L"w+b"};
    return _wfopen(path.c_str(), kModes[static_cast<int>(mode)]);
#else
    constexpr const char* kModes[] = {"rb", "wb", "w+b"};
    return std::fopen(path.c_str(), kModes[static_cast<int>(mode)]);
#endif
}

int SeekStream(std::FILE* stream, std::int64_t offset, int origin) {
#if defined(_WIN32)
    return _fseeki64(stream, offset, origin);
#else
    return fseeko(stream, static_cast<off_t>(offset), origin);
#endif
}

std::int64_t TellStream(std::FILE* stream) {
#if defined(_WIN32)
    return _ftelli64(stream);
#else
    return ftello(stream);
#endif
}

}  // namespace

File::File(std::FILE* stream, std::string name) : m_stream(stream), m_name(std::move(name)), m_owned(false) {}

File::File(const std::filesystem::path& path, Mode mode, std::string name)
    : m_stream(OpenStream(path, mode)), m_name(std::move(name)) {
    if (!m_stream) throw UserError(m_name + ": " + std::strerror(errno));
}

File::File(File&& other) noexcept
    : m_stream(std::exchange(other.m_stream, nullptr)),
      m_name(std::move(other.m_name)),
      m_owned(other.m_owned),
      m_error(other.m_error) {}

File::~File() {
    if (m_stream && m_owned) std::fclose(m_stream);
}

File File::StandardInput() { return File(stdin, "standard input"); }
File File::StandardOutput() { return File(stdout, "standard output"); }

std::size_t File::Read(void* bytes, std::size_t count) {
    errno = 0;
    const std::size_t done = std::fread(bytes, 1, count, m_stream);
    if (done < count && std::ferror(m_stream) && m_error == 0) m_error = errno ? errno : EIO;
    return done;
}

std::size_t File::Write(const void* bytes, std::size_t count) {
    errno = 0;
    const std::size_t done = m_error == 0 ? std::fwrite(bytes, 1, count, m_stream) : 0;
    if (done < count && m_error == 0) m_error = errno ? errno : EIO;
    return done;
}

bool File::Seek(std::int64_t offset, int origin) { return SeekStream(m_stream, offset, origin) == 0; }
std::int64_t File::Position() { return TellStream(m_stream); }

std::int64_t File::Length() {
    const std::int64_t position = Position();
    if (position < 0 || !Seek(0, SEEK_END)) return -1;
    const std::int64_t length = Position();
    Seek(position);
    return length;
}

void File::ThrowIfFailed() const {
    if (m_error == 0) return;
    CheckInterrupted();
    throw IoError(m_name + ": " + std::strerror(m_error));
}

void File::Close() {
    if (!m_stream) return;
    errno = 0;
    const bool flushed = std::fflush(m_stream) == 0;
    if (!flushed && m_error == 0) m_error = errno ? errno : EIO;
    const bool closed = !m_owned || std::fclose(m_stream) == 0;
    if (!closed && m_error == 0) m_error = errno ? errno : EIO;
    m_stream = nullptr;
    ThrowIfFailed();
}

bool IsTerminal(std::FILE* stream) {
#if defined(_WIN32)
    return _isatty(_fileno(stream)) != 0;
#else
    return isatty(fileno(stream)) != 0;
#endif
}

void PrepareProcess() {
#if defined(_WIN32)
    _setmode(_fileno(stdin), _O_BINARY);
    _setmode(_fileno(stdout), _O_BINARY);
#else
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
#endif
    CatchInterrupt(SIGINT);
    CatchInterrupt(SIGTERM);
}

void CheckInterrupted() {
    if (g_interrupted) throw Interrupted();
}

void Print(const std::string& text) {
    errno = 0;
    if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size() || std::fflush(stdout) != 0)
        throw IoError(std::string("standard output: ") + std::strerror(errno));
}

void PrintMessage(const std::string& text) { std::fprintf(stderr, "dsphost: %s\n", text.c_str()); }

}  // namespace dsphost
