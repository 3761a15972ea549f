#include "DSP/Pitch/VoicePitchDetector.h"

#include "DSP/Pitch/VoicePitchAnalysis.h"
#include "Platform/DenormalGuard.h"

namespace Corvo::DSP {

VoicePitchDetector::VoicePitchDetector(const VoicePitchSettings& settings)
    : m_analysis(std::make_unique<VoicePitchAnalysis>(settings)) {
    m_analysis->Prepare();
    m_analysis->Clear();
}
VoicePitchDetector::~VoicePitchDetector() = default;

void VoicePitchDetector::Clear() { m_analysis->Clear(); }
void VoicePitchDetector::SetHighest(double hz) { m_analysis->SetHighest(hz); }
void VoicePitchDetector::SetSilence(double decibels) { m_analysis->SetSilence(decibels); }
int VoicePitchDetector::HopSamples() const { return m_analysis->Hop(); }
int VoicePitchDetector::DelaySamples() const { return m_analysis->Delay(); }
int VoicePitchDetector::StepSamples() const { return m_analysis->Step(); }

void VoicePitchDetector::Push(const float* samples, int count) {
    const DenormalGuard guard;
    m_analysis->Push(samples, count);
}
void VoicePitchDetector::Push(const double* samples, int count) {
    const DenormalGuard guard;
    m_analysis->Push(samples, count);
}

bool VoicePitchDetector::Take(VoicePitchFrame& frame) { return m_analysis->TakeFrame(frame); }
std::span<const VoicePitchCandidate> VoicePitchDetector::Candidates() const {
    return m_analysis->Candidates();
}

}  // namespace Corvo::DSP
