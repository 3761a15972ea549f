#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "Process.h"

namespace dsphost {

// File names are UTF-8 in all of the program.
std::filesystem::path PathOf(const std::string& name);
std::string NameOf(const std::filesystem::path& path);

// Two names of one file, or a name and a stream, have the same.
struct FileIdentity {
    std::uint64_t volume, file;
    bool operator==(const FileIdentity&) const = default;
};
// Of an existing regular file or, but for Windows, a pipe; nothing otherwise.
std::optional<FileIdentity> IdentityOf(const std::filesystem::path& path);
std::optional<FileIdentity> IdentityOf(std::FILE* stream);

// A stream of bytes with 64-bit positions, the same on every system. Reading and writing never throw, so
// that a C library can call them; the first failure is kept, and ThrowIfFailed reports it.
class File {
public:
    // New: written and read, and there must be nothing of that name.
    enum class Mode { Read, Write, New };

    // Throws UserError with the system's reason. Messages call the file `name`.
    File(const std::filesystem::path& path, Mode mode, std::string name);
    // Written and read, in the folder for temporary files, where no other program sees it and nothing is left
    // of it, however this one ends. Throws IoError.
    static File Temporary();
    static File StandardInput();
    static File StandardOutput();
    File(File&& other) noexcept;
    File& operator=(File&&) = delete;
    ~File();

    // Bytes transferred; fewer than asked only at the end of the file or after a failure.
    std::size_t Read(void* bytes, std::size_t count);
    std::size_t Write(const void* bytes, std::size_t count);
    // Up to `count` of the bytes that the next Read gets, from a file that is read forwards only.
    std::string Peek(std::size_t count);
    // False where the file cannot seek (pipes).
    bool Seek(std::int64_t offset, int origin = SEEK_SET);
    std::int64_t Position();  // -1 where the file has none
    std::int64_t Length();    // -1 where the file has none
    bool Appends() const;     // all that is written goes to the end, wherever it was sought

    const std::string& Name() const { return m_name; }
    std::FILE* Stream() const { return m_stream; }
    // Throws IoError naming the file and the system's reason.
    void ThrowIfFailed() const;
    // Takes the owner, the group and the permissions of another file. False where the owner cannot be kept.
    bool BecomeLike(const std::filesystem::path& other);
    // Lets the system begin to store what it was given, where it can, so that Sync waits for less.
    void BeginSync();
    // Waits until everything is on the disk. Errors are kept for Close.
    void Sync();
    // Hands everything over to the system; throws IoError if it does not take it. The standard streams
    // stay open.
    void Close();

private:
    File(std::FILE* stream, std::string name, bool owned);
    void EnlargeBuffer();

    std::FILE* m_stream;
    std::string m_name;
    bool m_owned = true;
    int m_error = 0;
    std::string m_ahead;               // peeked at, not yet read
    std::unique_ptr<char[]> m_buffer;  // the stream's
};

// The whole of a small file, of `most` bytes. Throws UserError where it is larger or cannot be read.
std::string ReadWhole(const std::string& name, std::size_t most);

}  // namespace dsphost
