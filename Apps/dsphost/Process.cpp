#include "Process.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <string_view>

#include "Errors.h"
#include "Text.h"

#if defined(_WIN32)
#include <fcntl.h>
#include <io.h>

#include "Platform/WindowsHeader.h"

#include <shellapi.h>
#else
#include <fcntl.h>
#include <poll.h>
#include <unistd.h>
#endif

namespace dsphost {
namespace {

// Messages repeat arguments, which may be of any length. What would be accepted stands at the end.
constexpr std::size_t kLongestMessage = 400;

constexpr int kFailed = 1, kInterrupted = 130;
constexpr std::string_view kInterruptedMessage = "dsphost: interrupted\n";

// Whoever changes the list of unfinished files, or reads it to end the program, has the lock. A signal that
// finds it taken leaves a note.
std::atomic_flag g_lock;
std::atomic<bool> g_signalled{false};
std::vector<std::filesystem::path> g_unfinished;
bool g_onTerminal = false;
std::size_t g_progressWidth = 0;

// Nothing in here allocates or waits: it runs at any moment.
[[noreturn]] void EndProgram() {
    const std::string_view message = kInterruptedMessage;
#if defined(_WIN32)
    for (const auto& path : g_unfinished) DeleteFileW(path.c_str());
    _write(2, message.data(), static_cast<unsigned>(message.size()));
    TerminateProcess(GetCurrentProcess(), kInterrupted);
    for (;;) Sleep(INFINITE);
#else
    for (const auto& path : g_unfinished) unlink(path.c_str());
    // Whoever shows it may have stopped to.
    pollfd shown{STDERR_FILENO, POLLOUT, 0};
    if (poll(&shown, 1, 0) != 1) _exit(kInterrupted);
    // The first line may hold the progress.
    if (g_onTerminal && write(STDERR_FILENO, "\n", 1) < 0) _exit(kInterrupted);
    if (write(STDERR_FILENO, message.data(), message.size()) < 0) _exit(kInterrupted);
    _exit(kInterrupted);
#endif
}

#if defined(_WIN32)
// Comes on a thread of its own. When it returns from some of the events, the system ends the program.
BOOL WINAPI OnConsoleEvent(DWORD) {
    g_signalled = true;
    while (g_lock.test_and_set()) Sleep(1);
    EndProgram();
}
#else
extern "C" void OnSignal(int) {
    g_signalled = true;
    if (!g_lock.test_and_set()) EndProgram();
}
#endif

#if defined(_WIN32)
// A console shows characters, whatever its code page is.
bool WriteToConsole(std::FILE* stream, const std::string& text) {
    if (!IsTerminal(stream)) return false;
    const auto wide = Wide(text);
    const auto handle = reinterpret_cast<HANDLE>(_get_osfhandle(_fileno(stream)));
    std::fflush(stream);
    return WriteConsoleW(handle, wide.data(), static_cast<DWORD>(wide.size()), nullptr, nullptr) != 0;
}
#else
bool WriteToConsole(std::FILE*, const std::string&) { return false; }
#endif

#if !defined(_WIN32)
// A file opened later would take the place of a closed stream, and get what is meant for that. What stands in
// for it cannot be used; only messages vanish.
void FillClosedStreams() {
    for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        if (fcntl(stream, F_GETFD) >= 0) continue;
        if (open("/dev/null", stream == STDOUT_FILENO ? O_RDONLY : O_WRONLY) != stream) _exit(kFailed);
    }
}
#endif

}  // namespace

void PrepareProcess() {
#if !defined(_WIN32)
    FillClosedStreams();
#endif
    g_onTerminal = IsTerminal(stderr);
#if defined(_WIN32)
    _setmode(_fileno(stdin), _O_BINARY);
    _setmode(_fileno(stdout), _O_BINARY);
    SetConsoleCtrlHandler(OnConsoleEvent, TRUE);
#else
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
    for (const int signal : {SIGHUP, SIGINT, SIGQUIT, SIGTERM, SIGXCPU}) {
        struct sigaction action {};
        sigaction(signal, nullptr, &action);
        if (action.sa_handler == SIG_IGN) continue;  // nohup, and what a shell runs in the background
        action = {};
        action.sa_handler = OnSignal;
        action.sa_flags = SA_RESTART;
        sigaction(signal, &action, nullptr);
    }
#endif
}

std::vector<std::string> Utf8Arguments([[maybe_unused]] int count, [[maybe_unused]] char** arguments) {
#if defined(_WIN32)
    std::vector<std::string> all;
    int wideCount = 0;
    wchar_t** const wide = CommandLineToArgvW(GetCommandLineW(), &wideCount);
    for (int i = 0; i < wideCount; ++i) all.push_back(Utf8(wide[i]));
    LocalFree(wide);
    return all;
#else
    return {arguments, arguments + count};
#endif
}

SignalsWait::SignalsWait() {
    while (g_lock.test_and_set()) continue;  // only while another thread ends the program
}

SignalsWait::~SignalsWait() {
    g_lock.clear();
#if !defined(_WIN32)
    if (g_signalled && !g_lock.test_and_set()) EndProgram();
#endif
}

void SignalsWait::BeginFile(const std::filesystem::path& path) { g_unfinished.push_back(path); }
void SignalsWait::EndFile(const std::filesystem::path& path) { std::erase(g_unfinished, path); }

bool IsTerminal(std::FILE* stream) {
#if defined(_WIN32)
    return _isatty(_fileno(stream)) != 0;
#else
    return isatty(fileno(stream)) != 0;
#endif
}

void Print(const std::string& text) {
    if (WriteToConsole(stdout, text)) return;
    errno = 0;
    if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size() || std::fflush(stdout) != 0)
        throw IoError(std::string("standard output: ") + std::strerror(errno));
}

void ShowProgress(const std::string& line) {
    std::fprintf(stderr, "\r%-*s", static_cast<int>(g_progressWidth), line.c_str());
    std::fflush(stderr);
    g_progressWidth = std::max(g_progressWidth, line.size());
}

void ClearProgress() {
    if (g_progressWidth > 0) std::fprintf(stderr, "\r%*s\r", static_cast<int>(g_progressWidth), "");
    g_progressWidth = 0;
}

void PrintMessage(const std::string& text) {
    ClearProgress();
    const std::string line = "dsphost: " + ShortenedInside(Escaped(text), kLongestMessage) + "\n";
    if (!WriteToConsole(stderr, line)) std::fputs(line.c_str(), stderr);
}

}  // namespace dsphost
