#include "Drawing/DrawingFont.h"

#include <mutex>

#include "Platform/CriticalSection.h"

namespace Corvo {
namespace {

using Lock = std::lock_guard<CriticalSection>;

CriticalSection& FileLock() {
    static CriticalSection lock;
    return lock;
}

std::string& File() {
    static std::string file;
    return file;
}

}  // namespace

void DrawingFont::SetFile(const std::string& path) {
    const Lock lock(FileLock());
    File() = path;
}

std::string DrawingFont::GetFile() {
    const Lock lock(FileLock());
    return File();
}

}  // namespace Corvo
