#include "OutputFile.h"

#include <cstdio>
#include <random>

#include "Errors.h"

namespace dsphost {
namespace {

namespace fs = std::filesystem;

// Where the bytes end up: links lead to the file behind them, so that it is replaced and not the link.
fs::path Target(const std::string& path) {
    std::error_code error;
    const auto resolved = fs::weakly_canonical(path, error);
    return error ? fs::path(path) : resolved;
}

void RefuseInputs(const std::string& path, const OutputRules& rules) {
    for (const auto& input : rules.inputs) {
        std::error_code error;
        if (input != "-" && fs::equivalent(path, input, error) && !error && fs::is_regular_file(path, error))
            throw UserError(path + ": is an input of this command and is never overwritten; write elsewhere");
    }
}

}  // namespace

fs::path OutputFile::UnusedName(const fs::path& directory, const std::string& stem) {
    std::random_device random;
    for (;;) {
        char tag[32];
        std::snprintf(tag, sizeof tag, ".%08x.part", static_cast<unsigned>(random()));
        auto candidate = directory / (stem + tag);
        std::error_code error;
        if (!fs::exists(candidate, error)) return candidate;
    }
}

OutputFile::OutputFile(const std::string& path, const OutputRules& rules) : m_name(path) {
    if (path.empty()) throw UserError("the output has an empty name");
    if (path == "-") {
        if (IsTerminal(stdout)) throw UserError("standard output is a terminal; redirect it or name a file");
        m_name = "standard output";
        m_file.emplace(File::StandardOutput());
        return;
    }
    RefuseInputs(path, rules);
    m_target = Target(path);
    std::error_code error;
    const auto status = fs::status(m_target, error);
    if (fs::is_directory(status)) throw UserError(path + ": is a directory; name a file");
    if (fs::exists(status) && !fs::is_regular_file(status)) {
        m_file.emplace(m_target, File::Mode::Write, path);
        return;
    }
    if (fs::exists(status) && !rules.overwrite) throw UserError(path + ": exists already; -y overwrites it");
    const auto directory = m_target.has_parent_path() ? m_target.parent_path() : fs::path(".");
    if (!fs::is_directory(directory, error))
        throw UserError(path + ": there is no directory " + directory.string());
    auto partial = UnusedName(directory, m_target.filename().string());
    m_file.emplace(partial, File::Mode::WriteRead, path);
    m_partial = std::move(partial);
    if (fs::exists(status)) fs::permissions(m_partial, status.permissions(), error);
}

OutputFile::~OutputFile() {
    m_file.reset();
    std::error_code error;
    if (!m_partial.empty()) fs::remove(m_partial, error);
}

void OutputFile::Commit() {
    m_file->Close();
    if (m_partial.empty()) return;
    std::error_code error;
    fs::rename(m_partial, m_target, error);
    if (error) throw IoError(m_name + ": " + error.message());
    m_partial.clear();
}

}  // namespace dsphost
