#pragma once

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <span>
#include <string>

namespace Fuzz {

// Bytes under a path, in memory and gone with the object: as a file, or as a pipe whose writer has finished.
class MemoryPath {
public:
    enum class Kind { File, Pipe };

    // A pipe takes what fits: 64 KiB.
    MemoryPath(std::span<const std::uint8_t> bytes, Kind kind) {
        int ends[2]{-1, -1};
        if (kind == Kind::File)
            ends[0] = ends[1] = memfd_create("fuzz", MFD_CLOEXEC);
        else if (pipe(ends) != 0)
            std::abort();
        const auto count = std::min<std::size_t>(bytes.size(), kind == Kind::File ? SIZE_MAX : 65536);
        if (ends[1] < 0 || write(ends[1], bytes.data(), count) != static_cast<ssize_t>(count)) std::abort();
        if (kind == Kind::Pipe) close(ends[1]);
        m_end = ends[0];
    }
    ~MemoryPath() { close(m_end); }
    MemoryPath(const MemoryPath&) = delete;
    MemoryPath& operator=(const MemoryPath&) = delete;

    std::string Path() const { return "/proc/self/fd/" + std::to_string(m_end); }

private:
    int m_end = -1;
};

}  // namespace Fuzz
