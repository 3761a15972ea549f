#include "DSP/Effects/Framework/MemoryFile.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <limits>

#include "DSP/Effects/Framework/FileValues.h"

namespace KivFiles {
namespace {

using Corvo::CorvoException;

// Growth is linear on purpose: the files are small, and 32-bit hosts are short of contiguous memory.
constexpr std::int32_t kGrowth = 102400;

constexpr std::int32_t kFirstRoom = 4096;  // elements to make room for before they have been seen

}  // namespace

CFileBase::CFileBase() = default;
CFileBase::~CFileBase() = default;
std::int64_t CFileBase::GetPosition() { return Seek(0, FromCurrent); }

std::int64_t CFileBase::GetLength() {
    const std::int64_t position = Seek(0, FromCurrent);
    const std::int64_t end = Seek(0, FromEnd);
    const std::int64_t start = Seek(0, FromStart);
    Seek(position, FromStart);
    return end - start;
}

bool CFileBase::IsReadable() { return true; }
bool CFileBase::IsWritable() { return true; }

CMemoryFile::CMemoryFile() = default;

CMemoryFile::CMemoryFile(std::uint8_t* data, std::int64_t size) {
    if (!data || size <= 0 || size > std::numeric_limits<std::int32_t>::max()) return;
    m_data = data;
    m_size = size;
    m_owns_data = false;
    m_capacity = static_cast<std::int32_t>(size);
}

CMemoryFile::~CMemoryFile() {
    if (m_owns_data) std::free(m_data);
}

void CMemoryFile::Reserve(std::int64_t size) {
    if (size <= m_capacity) return;
    const std::int64_t steps = (size - m_capacity + kGrowth - 1) / kGrowth;
    const std::int64_t capacity = m_capacity + steps * kGrowth;
    void* grown = nullptr;
    if (capacity <= std::numeric_limits<std::int32_t>::max()) {
        grown = std::realloc(m_owns_data ? m_data : nullptr, static_cast<std::size_t>(capacity));
        if (grown && m_capacity > 0 && !m_owns_data)
            std::memcpy(grown, m_data, static_cast<std::size_t>(m_capacity));
    } else {
        errno = ENOMEM;
    }
    if (!grown) {
        const CorvoException failure(std::strerror(errno));
        if (m_owns_data) std::free(m_data);
        m_data = nullptr;
        m_size = m_position = m_capacity = 0;
        throw failure;
    }
    m_data = static_cast<std::uint8_t*>(grown);
    std::memset(m_data + m_capacity, 0, static_cast<std::size_t>(capacity - m_capacity));
    m_owns_data = true;
    m_capacity = static_cast<std::int32_t>(capacity);
}

std::int64_t CMemoryFile::Write(const void* source, std::int64_t count) {
    if (m_position < 0 || count < 0 || (!source && count > 0)) return 0;
    // Past the largest file there is: fails in Reserve like any other shortage of memory.
    const std::int64_t room = std::numeric_limits<std::int64_t>::max() - kGrowth - m_position;
    const std::int64_t end =
        count > room ? std::numeric_limits<std::int64_t>::max() - kGrowth : m_position + count;
    Reserve(end);
    if (end > m_size) m_size = end;
    if (count > 0) std::memcpy(m_data + m_position, source, static_cast<std::size_t>(count));
    m_position += count;
    return count;
}

std::int64_t CMemoryFile::Read(void* destination, std::int64_t count) {
    const std::int64_t limit = m_unbounded ? m_capacity : m_size;
    if (m_position < 0 || m_position >= limit || count <= 0 || !destination) return 0;
    if (count > limit - m_position) count = limit - m_position;
    std::memcpy(destination, m_data + m_position, static_cast<std::size_t>(count));
    m_position += count;
    return count;
}

std::int64_t CMemoryFile::Seek(std::int64_t offset, int origin) {
    // Unsigned sums wrap where signed ones would be undefined; the result is a position out of range.
    const auto sum = [](std::int64_t a, std::int64_t b) {
        return static_cast<std::int64_t>(static_cast<std::uint64_t>(a) + static_cast<std::uint64_t>(b));
    };
    if (origin == FromStart) m_position = offset;
    if (origin == FromCurrent) m_position = sum(m_position, offset);
    if (origin == FromEnd && !m_unbounded) m_position = sum(m_size, sum(~offset, 1));
    return m_position;
}

void CMemoryFile::Truncate() { throw CorvoException("Not implemented"); }

void WriteDoubles(CFileBase& file, const std::vector<double>& values) {
    if (values.size() > static_cast<std::size_t>(std::numeric_limits<std::int32_t>::max()))
        throw CorvoException("Error writing data");
    WriteValue(file, static_cast<std::int32_t>(values.size()));
    for (const double value : values) WriteValue(file, value);
}

void ReadDoubles(CFileBase& file, std::vector<double>& values) {
    const auto count = ReadValue<std::int32_t>(file);
    if (count < 0) throw CorvoException("Error reading data");
    std::vector<double> read;
    // Grows with what is really there: the count may promise more than the file has left.
    read.reserve(static_cast<std::size_t>(std::min(count, kFirstRoom)));
    for (std::int32_t i = 0; i < count; ++i) read.push_back(ReadValue<double>(file));
    values = std::move(read);
}

}  // namespace KivFiles
