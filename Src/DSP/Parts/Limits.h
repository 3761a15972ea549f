#pragma once

namespace Corvo::DSP {

// Upper bound for memory that follows the sampling rate, in Hz; faster formats share it.
constexpr double kFastestHz = 768e3;

}  // namespace Corvo::DSP
