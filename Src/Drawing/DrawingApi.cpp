#include "Drawing/DrawingApi.h"

#include <atomic>

namespace Corvo {
namespace {
std::atomic<bool> g_enableD2d{false};
}

DrawingApi::~DrawingApi() = default;

void DrawingApi::SetEnableD2d(bool enable) { g_enableD2d = enable; }
bool DrawingApi::GetEnableD2d() { return g_enableD2d; }

}  // namespace Corvo
