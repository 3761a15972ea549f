#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <string>

namespace dsphost {

// A stream of bytes with 64-bit positions, the same on every system. Reading and writing never throw, so
// that a C library can call them; the first failure is kept, and ThrowIfFailed reports it.
class File {
public:
    enum class Mode { Read, Write, WriteRead };  // both kinds of writing start with an empty file

    // Throws UserError with the system's reason. Messages call the file `name`.
    File(const std::filesystem::path& path, Mode mode, std::string name);
    static File StandardInput();
    static File StandardOutput();
    File(File&& other) noexcept;
    File& operator=(File&&) = delete;
    ~File();

    // Bytes transferred; fewer than asked only at the end of the file or after a failure.
    std::size_t Read(void* bytes, std::size_t count);
    std::size_t Write(const void* bytes, std::size_t count);
    // False where the file cannot seek (pipes).
    bool Seek(std::int64_t offset, int origin = SEEK_SET);
    std::int64_t Position();  // -1 where the file has none
    std::int64_t Length();    // -1 where the file has none

    const std::string& Name() const { return m_name; }
    // Throws IoError naming the file and the system's reason.
    void ThrowIfFailed() const;
    // Hands everything over to the system; throws IoError if it does not take it. The standard streams
    // stay open.
    void Close();

private:
    File(std::FILE* stream, std::string name);

    std::FILE* m_stream;
    std::string m_name;
    bool m_owned = true;
    int m_error = 0;
};

// True where a person would see what is written there.
bool IsTerminal(std::FILE* stream);
// Standard input and output as bytes, signals that would end the program turned into errors.
void PrepareProcess();
// Throws Interrupted once the user has asked to stop; call it in every long loop.
void CheckInterrupted();

// Writes to standard output; throws IoError.
void Print(const std::string& text);
// One line on standard error, headed by the program's name.
void PrintMessage(const std::string& text);

}  // namespace dsphost
