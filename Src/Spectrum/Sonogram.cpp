#include "Spectrum/Sonogram.h"

#include <algorithm>
#include <atomic>

namespace Corvo {
namespace {

constexpr int kSlowest = 0, kFastest = 8;
std::atomic<int> g_speedIndex{3};
std::atomic<int> g_colourScheme{0};

}  // namespace

void Sonogram::SetSpeedIndex(int index) { g_speedIndex = std::clamp(index, kSlowest, kFastest); }
int Sonogram::GetSpeedIndex() { return g_speedIndex; }
void Sonogram::SetColourScheme(int scheme) { g_colourScheme = scheme; }
int Sonogram::GetColourScheme() { return g_colourScheme; }

}  // namespace Corvo
