#pragma once

#include <filesystem>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "File.h"

namespace dsphost {

// What every command that writes knows about its outputs.
struct OutputRules {
    bool overwrite = false;           // -y
    std::vector<std::string> inputs;  // never overwritten, not even with -y
};

// An output that appears whole or not at all: it is written beside its place, in NAME.*.part, and renamed at
// Commit. "-" is standard output; a device or a named pipe is written straight. Without Commit nothing stays
// behind. A file that it replaces gives it its owner and permissions.
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
    // Stores everything on the disk and renames; throws IoError, and nothing stays behind.
    void Commit();

private:
    friend void CommitTogether(std::span<OutputFile* const> files);
    void OpenPartial();
    void Complete();
    void Place(SignalsWait& wait, bool keepOld);
    void TakeBack(SignalsWait& wait);

    std::string m_name;
    std::filesystem::path m_target, m_partial, m_old;
    std::optional<File> m_file;
    bool m_overwrite = false, m_existed = false, m_placed = false;
};

// All of them, or none: what cannot be put in its place takes the others back.
void CommitTogether(std::span<OutputFile* const> files);

// Throws UserError when two of these outputs would be one file; call it before there is any.
void RefuseSameOutputs(const std::vector<std::string>& paths);

}  // namespace dsphost
