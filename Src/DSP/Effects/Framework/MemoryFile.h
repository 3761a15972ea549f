#pragma once

#include <cstdint>
#include <vector>

#include "DSP/Effects/Framework/CorvoException.h"
#include "Platform/Export.h"

namespace KivFiles {

// A byte stream. For hosts and for settings that do not fit a fixed layout, such as the Denoiser's. The order
// of the virtual operations is part of the contract.
class DSP_API CFileBase {
public:
    // What Seek counts from.
    enum Origin : int { FromStart = 0, FromCurrent = 1, FromEnd = 2 };

    CFileBase();
    CFileBase(const CFileBase&) = delete;
    CFileBase& operator=(const CFileBase&) = delete;

    // Both return the number of bytes transferred.
    virtual std::int64_t Write(const void* source, std::int64_t count) = 0;
    virtual std::int64_t Read(void* destination, std::int64_t count) = 0;
    // Returns the new position.
    virtual std::int64_t Seek(std::int64_t offset, int origin) = 0;
    virtual ~CFileBase();
    // In bytes from the start.
    virtual std::int64_t GetPosition();
    // Cuts the file off at the position.
    virtual void Truncate() = 0;
    virtual std::int64_t GetLength();  // the position stays where it was
    // True unless a stream says otherwise.
    virtual bool IsReadable();
    virtual bool IsWritable();
};

// A byte stream in memory, for settings chunks too irregular for a fixed layout. One thread at a time.
//
// Cost: a read or write copies its bytes, some 10 ns for a few of them. Growing makes room for
// 100 KB more, and may move all that is there.
class DSP_API CMemoryFile : public CFileBase {
public:
    CMemoryFile();
    // Reads and overwrites `size` bytes that the caller keeps; growing past them moves the contents to a
    // buffer of the file's own. Null or a negative size is an empty file.
    CMemoryFile(std::uint8_t* data, std::int64_t size);
    ~CMemoryFile() override;

    // Writes `count` bytes at the position, growing the file; a gap left by seeking past the end is not
    // cleared at the seek, but memory is zeroed when it is obtained. A count of 0 only makes the
    // file reach to the position. A negative position or count, or null,
    // writes nothing and returns 0. Throws CorvoException with the system's error text when memory runs
    // out; the file is not usable afterwards.
    std::int64_t Write(const void* source, std::int64_t count) override;
    // Reads up to `count` bytes; fewer at the end, 0 at a negative position or past the end.
    std::int64_t Read(void* destination, std::int64_t count) override;
    // FromEnd counts back from the end. An unknown origin leaves the position; no bound is enforced.
    std::int64_t Seek(std::int64_t offset, int origin) override;
    void Truncate() override;  // throws CorvoException("Not implemented")

    // The bytes, which the file keeps until it grows or is destroyed, and how many it has room for.
    const std::uint8_t* Data() const { return m_data; }
    std::int32_t Capacity() const { return m_capacity; }
    // Unbounded: reads are limited by the buffer instead of the valid size, FromEnd is disabled.
    void SetUnbounded(bool unbounded) { m_unbounded = unbounded; }

private:
    void Reserve(std::int64_t size);

    std::uint8_t* m_data = nullptr;
    std::int64_t m_size = 0;
    std::int64_t m_position = 0;
    bool m_unbounded = false;
    bool m_owns_data = true;
    std::int32_t m_capacity = 0;
};

// An array of doubles as a 4-byte count and 8 bytes per element, little-endian. Both throw CorvoException
// ("Error writing data", "Error reading data") when the file transfers fewer bytes than asked; reading
// also when the count is negative or promises more than the file has left, and `values` is then untouched.
DSP_API void WriteDoubles(CFileBase& file, const std::vector<double>& values);
DSP_API void ReadDoubles(CFileBase& file, std::vector<double>& values);

}  // namespace KivFiles
