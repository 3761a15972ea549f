#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "File.h"

namespace dsphost {

// What every command that writes knows about its outputs.
struct OutputRules {
    bool overwrite = false;           // -y
    std::vector<std::string> inputs;  // never overwritten, not even with -y
};

// An output that appears whole or not at all: it is written beside its place and renamed at Commit. "-" is
// standard output; a device or a named pipe is written straight. Without Commit nothing stays behind.
class OutputFile {
public:
    // Throws UserError when the place is taken, is an input, or cannot be written.
    OutputFile(const std::string& path, const OutputRules& rules);
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;
    ~OutputFile();

    File& Bytes() { return *m_file; }
    const std::string& Name() const { return m_name; }
    // True for standard output, devices and pipes.
    bool IsStream() const { return m_partial.empty(); }
    // Closes and renames; throws IoError, and nothing stays behind.
    void Commit();

    // A name for an unfinished file in `directory` that is not taken.
    static std::filesystem::path UnusedName(const std::filesystem::path& directory, const std::string& stem);

private:
    std::string m_name;
    std::filesystem::path m_target, m_partial;
    std::optional<File> m_file;
};

}  // namespace dsphost
