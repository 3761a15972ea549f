#include "DSP/Effects/PitchDoctor/PitchDoctorEngine.h"

#include <algorithm>

namespace Corvo::DSP {
namespace {

constexpr double kLatencyPeriods = 1.6;
constexpr int kLatencyUnit = 64;
constexpr double kShortLatencyHz = 100.0;  // from here on the latency is short, and hops are too
constexpr double kKeptSeconds = 0.083, kMixSeconds = 0.005, kMixReached = 1e-6;
constexpr double kLimit = 1e9;  // of what is listened to: its square still is a float
// Places stay below this, so that a double leaves 30 bits for the fraction.
constexpr std::int64_t kRebaseAt = 1 << 22, kRebaseBy = 1 << 21;

constexpr double LongestPeriod(double rate, double lowestHz) { return rate / lowestHz; }

VoicePitchSettings DetectorSettings(double rate, double lowestHz) {
    VoicePitchSettings settings;
    settings.rate = rate;
    settings.lowestHz = lowestHz;
    settings.shortHop = lowestHz > kShortLatencyHz;
    return settings;
}

}  // namespace

int PitchDoctorEngine::LatencyOf(double rate, double lowestHz) {
    const double frames = kLatencyPeriods * LongestPeriod(rate, lowestHz);
    return static_cast<int>(std::ceil(frames / kLatencyUnit)) * kLatencyUnit;
}

PitchDoctorEngine::PitchDoctorEngine(double rate, double lowestHz)
    : m_longestPeriod(LongestPeriod(rate, lowestHz)),
      m_latency(LatencyOf(rate, lowestHz)),
      m_mixShare(1.0 - std::exp(-1.0 / (kMixSeconds * rate))),
      m_detector(DetectorSettings(rate, lowestHz)),
      m_track(rate),
      m_control(m_detector.Hop() / rate),
      m_marks(rate, m_longestPeriod, m_latency),
      m_grains(rate),
      m_behind(kKeptSeconds * rate) {}

void PitchDoctorEngine::Prepare(Arena& arena) {
    m_detector.Prepare(arena);
    m_track.Prepare(arena);
    m_marks.Prepare(arena);
    m_grains.Prepare(arena);
    for (auto& input : m_input)
        input.Prepare(arena, m_latency + static_cast<std::int64_t>(3.0 * m_longestPeriod) + 64);
}

void PitchDoctorEngine::Clear(std::int64_t start) {
    m_detector.Clear();
    m_track.Clear();
    m_control.Clear();
    m_marks.Clear();
    m_grains.Clear();
    for (auto& input : m_input) input.Clear();
    m_untilStep = m_detector.Step();
    m_origin = 0;
    m_start = start;
    m_fresh = true;
}

void PitchDoctorEngine::Cook(const PitchDoctorVoice& voice) {
    m_voice = voice;
    m_detector.SetHighest(voice.highestHz);
    m_detector.SetSilence(voice.silence);
    if (m_fresh) m_mix = voice.mix;
}

void PitchDoctorEngine::Run(int channels, int frames) {
    const auto count = static_cast<std::size_t>(frames);
    Block heard;
    for (std::size_t i = 0; i < count; ++i) {
        double sum = 0.0;
        for (std::size_t c = 0; c < static_cast<std::size_t>(channels); ++c) {
            m_input[c].Push(m_block[c][i]);
            sum += m_block[c][i];
        }
        heard[i] = std::clamp(channels == 2 ? 0.5 * sum : sum, -kLimit, kLimit);
        m_marks.Push(heard[i]);
    }
    m_detector.Push(heard.data(), frames);
    m_fresh = false;
    const std::int64_t from = m_input[0].End() - frames - m_latency;
    m_grains.Render({&m_input[0], &m_input[1]}, channels, from, frames, m_wet);
    for (std::size_t i = 0; i < count; ++i) {
        m_mix += m_mixShare * (m_voice.mix - m_mix);
        if (std::abs(m_voice.mix - m_mix) < kMixReached) m_mix = m_voice.mix;
        for (std::size_t c = 0; c < static_cast<std::size_t>(channels); ++c) {
            const double dry = *m_input[c].At(from + static_cast<std::int64_t>(i));
            m_block[c][i] = m_mix == 1.0 ? m_wet[c][i] : dry + m_mix * (m_wet[c][i] - dry);
        }
    }
}

void PitchDoctorEngine::Step(PitchReadingRing* readings) {
    VoicePitchFrame frame;
    while (m_detector.TakeFrame(frame)) {
        m_control.Step(m_track, static_cast<double>(frame.end - m_origin) - frame.age, frame.hz,
                       m_voice.scale, m_voice.control);
        if (readings) Publish(*readings);
    }
    m_marks.Extend(m_track);
    const auto output = static_cast<double>(m_input[0].End() - m_latency);
    m_grains.Place(m_marks, m_track, m_voice.grains, output + m_detector.Step() - 1);
    m_marks.Forget(output - m_behind, m_grains.Newest() - 2);
    if (m_input[0].End() >= kRebaseAt) Rebase();
}

void PitchDoctorEngine::Publish(PitchReadingRing& readings) const {
    const std::int64_t index = m_track.Count() - 1 - m_control.FramesOpen();
    if (index < 0) return;
    const auto& frame = m_track.At(index);
    PitchReading reading;
    reading.position = m_start + std::max<std::int64_t>(m_origin + std::llround(frame.place), 0);
    reading.heardHz = static_cast<float>(frame.hz);
    reading.correctionCents = static_cast<float>(frame.correction);
    reading.note = frame.note;
    if (frame.note >= 0)
        reading.noteHz =
            static_cast<float>(m_voice.scale.concertHz * std::exp2((frame.noteCents - 6900.0) / 1200.0));
    readings.Push(reading);
}

void PitchDoctorEngine::Rebase() {
    for (auto& input : m_input) input.Rebase(kRebaseBy);
    m_marks.Rebase(kRebaseBy);
    m_track.Rebase(static_cast<double>(kRebaseBy));
    m_grains.Rebase(kRebaseBy);
    m_origin += kRebaseBy;
}

}  // namespace Corvo::DSP
