#include "OutputFile.h"

#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <random>

#include "Errors.h"
#include "Text.h"

#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
#else
#include <fcntl.h>
#include <unistd.h>
#endif

namespace dsphost {
namespace {

namespace fs = std::filesystem;

// Where the bytes end up: links lead to the file behind them, so that it is replaced and not the link. A link
// is left only by links in a circle.
fs::path Target(const std::string& path) {
    constexpr int kMostLinks = 40;
    std::error_code error;
    // Absolute first: weakly_canonical leaves a relative path relative when nothing of it exists.
    fs::path place = fs::absolute(PathOf(path), error);
    // A link to a file that does not exist is followed here; weakly_canonical would stop at it.
    for (int i = 0; i < kMostLinks && !fs::exists(place, error) && fs::is_symlink(place, error); ++i)
        place = place.parent_path() / fs::read_symlink(place, error);
    const auto resolved = fs::weakly_canonical(place, error);
    return error ? place : resolved;
}

std::optional<FileIdentity> IdentityOfInput(const std::string& path) {
    return path == "-" ? IdentityOf(stdin) : IdentityOf(PathOf(path));
}
std::optional<FileIdentity> IdentityOfOutput(const std::string& path) {
    return path == "-" ? IdentityOf(stdout) : IdentityOf(PathOf(path));
}

void RefuseInputs(const std::string& path, const OutputRules& rules) {
    const auto identity = IdentityOfOutput(path);
    for (const auto& input : rules.inputs)
        if (identity && identity == IdentityOfInput(input))
            throw UserError((path == "-" ? "standard output" : path) +
                            ": is an input of this command and is never overwritten; write elsewhere");
}

// A name that is not taken, in the same folder; short enough for any file system, whatever the file's is.
fs::path UnusedName(const fs::path& target) {
    constexpr std::size_t kLongestStem = 100;
    std::random_device random;
    for (;;) {
        char tag[32];
        std::snprintf(tag, sizeof tag, ".%08x.part", static_cast<unsigned>(random()));
        std::string stem = Shortened(NameOf(target.filename()), kLongestStem);
        auto candidate = target.parent_path() / PathOf(stem + tag);
        std::error_code error;
        if (!fs::exists(fs::symlink_status(candidate, error))) return candidate;
    }
}

bool MayBeWritten(const fs::path& path, const fs::file_status& status) {
    constexpr auto kWrite = fs::perms::owner_write | fs::perms::group_write | fs::perms::others_write;
    if ((status.permissions() & kWrite) == fs::perms::none) return false;
#if defined(_WIN32)
    return _waccess(path.c_str(), 2) == 0;
#else
    return faccessat(AT_FDCWD, path.c_str(), W_OK, AT_EACCESS) == 0;
#endif
}

#if defined(_WIN32)

bool SameName(const fs::path& a, const fs::path& b) { return _wcsicmp(a.c_str(), b.c_str()) == 0; }

std::error_code LastError() { return {static_cast<int>(GetLastError()), std::system_category()}; }

std::error_code Replace(const fs::path& from, const fs::path& to) {
    // The first keeps what belongs to the old file; it needs one.
    if (ReplaceFileW(to.c_str(), from.c_str(), nullptr, 0, nullptr, nullptr)) return {};
    return MoveFileExW(from.c_str(), to.c_str(), MOVEFILE_REPLACE_EXISTING) ? std::error_code{} : LastError();
}

std::error_code MoveToFreePlace(const fs::path& from, const fs::path& to) {
    if (MoveFileExW(from.c_str(), to.c_str(), 0)) return {};
    const auto error = LastError();
    return error.value() == ERROR_ALREADY_EXISTS || error.value() == ERROR_FILE_EXISTS
               ? std::make_error_code(std::errc::file_exists)
               : error;
}

#else

bool SameName(const fs::path& a, const fs::path& b) { return a == b; }

std::error_code Replace(const fs::path& from, const fs::path& to) {
    std::error_code error;
    fs::rename(from, to, error);
    return error;
}

std::error_code MoveToFreePlace(const fs::path& from, const fs::path& to) {
#if defined(RENAME_NOREPLACE)
    if (renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_NOREPLACE) == 0) return {};
    if (errno != EINVAL && errno != ENOSYS) return {errno, std::generic_category()};
#endif
    // Not every file system can do that: takes the place with an empty file, and replaces that.
    const int place = open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    if (place < 0) return {errno, std::generic_category()};
    close(place);
    const auto error = Replace(from, to);
    if (error) unlink(to.c_str());
    return error;
}

#endif

}  // namespace

OutputFile::OutputFile(const std::string& path, const OutputRules& rules)
    : m_name(path), m_overwrite(rules.overwrite) {
    if (path.empty()) throw UserError("the output has an empty name");
    RefuseInputs(path, rules);
    if (path == "-") {
        if (IsTerminal(stdout)) throw UserError("standard output is a terminal; redirect it or name a file");
        m_name = "standard output";
        m_file.emplace(File::StandardOutput());
        return;
    }
    m_target = Target(path);
    std::error_code error;
    const auto status = fs::status(m_target, error);
    if (!fs::status_known(status)) throw UserError(path + ": " + error.message());
    if (fs::is_directory(status)) throw UserError(path + ": is a directory; name a file");
    m_existed = fs::exists(status);
    if (!m_existed && fs::is_symlink(m_target, error))
        throw UserError(path + ": is a link that leads back to itself; name a file");
    if (m_existed && !fs::is_regular_file(status)) {
        m_file.emplace(m_target, File::Mode::Write, path);
        return;
    }
    if (m_existed && !m_overwrite) throw UserError(path + ": exists already; -y overwrites it");
    if (m_existed && !MayBeWritten(m_target, status))
        throw UserError(path + ": is write-protected and stays as it is; write elsewhere");
    if (!m_target.has_parent_path()) m_target = "." / m_target;
    if (!fs::is_directory(m_target.parent_path(), error))
        throw UserError(path + ": there is no directory " + NameOf(m_target.parent_path()));
    OpenPartial();
    if (m_existed && !m_file->BecomeLike(m_target))
        PrintMessage("warning: " + path + ": its owner cannot be kept; the new file is yours");
}

void OutputFile::OpenPartial() {
    SignalsWait wait;
    m_partial = UnusedName(m_target);
    try {
        m_file.emplace(m_partial, File::Mode::New, m_name);
    } catch (const UserError&) {
        m_partial.clear();
        throw;
    }
    wait.BeginFile(m_partial);
}

OutputFile::~OutputFile() {
    m_file.reset();
    SignalsWait wait;
    std::error_code error;
    for (const auto& path : {m_partial, m_old}) {
        if (path.empty()) continue;
        fs::remove(path, error);
        wait.EndFile(path);
    }
}

void OutputFile::Commit() { CommitTogether(std::array{this}); }

void OutputFile::Complete() {
    if (!IsStream()) m_file->Sync();
    m_file->Close();
}

void OutputFile::Place(SignalsWait& wait, bool keepOld) {
    if (IsStream()) return;
    std::error_code error;
    const auto status = fs::status(m_target, error);  // it may have come or changed meanwhile
    m_existed = fs::exists(status);
    if (m_existed && m_overwrite && !MayBeWritten(m_target, status))
        throw IoError(m_name + ": is write-protected by now and stays as it is");
    if (fs::is_regular_file(status) && m_overwrite && keepOld) {
        m_old = UnusedName(m_target);
        fs::create_hard_link(m_target, m_old, error);
        if (error) fs::rename(m_target, m_old, error);  // some file systems have no links
        if (error) m_old.clear();                       // without it nothing can be taken back
        if (!m_old.empty()) wait.BeginFile(m_old);
    }
    error = m_overwrite ? Replace(m_partial, m_target) : MoveToFreePlace(m_partial, m_target);
    if (error == std::errc::file_exists)
        throw IoError(m_name + ": has appeared meanwhile and stays as it is; -y overwrites it");
    if (error) throw IoError(m_name + ": " + error.message());
    wait.EndFile(m_partial);
    m_partial.clear();
    m_placed = true;
}

void OutputFile::TakeBack(SignalsWait& wait) {
    std::error_code error;
    if (!m_placed && (m_old.empty() || fs::exists(m_target, error))) return;
    if (!m_existed) fs::remove(m_target, error);
    if (m_old.empty()) return;
    if (Replace(m_old, m_target))
        PrintMessage("warning: " + m_name + ": what it was before is left in " + NameOf(m_old));
    wait.EndFile(m_old);
    m_old.clear();
}

void CommitTogether(std::span<OutputFile* const> files) {
    for (auto* const file : files) file->Complete();
    SignalsWait wait;
    try {
        for (auto* const file : files) file->Place(wait, files.size() > 1);
    } catch (const IoError&) {
        for (auto* const file : files) file->TakeBack(wait);
        throw;
    }
}

void RefuseSameOutputs(const std::vector<std::string>& paths) {
    for (auto a = paths.begin(); a != paths.end(); ++a)
        for (auto b = paths.begin(); b != a; ++b) {
            if (a->empty() || b->empty()) continue;
            if (*a == "-" && *b == "-") throw UserError("only one output can go to standard output");
            std::error_code error;
            const bool device = *a != "-" && fs::is_character_file(PathOf(*a), error);
            const auto identity = IdentityOfOutput(*a);
            const bool same = identity ? identity == IdentityOfOutput(*b)
                                       : *a != "-" && *b != "-" && SameName(Target(*a), Target(*b));
            if (same && !device)
                throw UserError(*b + " and " + *a + " are one file; each output needs its own");
        }
}

}  // namespace dsphost
