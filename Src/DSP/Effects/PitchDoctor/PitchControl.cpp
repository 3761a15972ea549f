#include "DSP/Effects/PitchDoctor/PitchControl.h"

#include <numbers>

namespace Corvo::DSP {
namespace {

// Seconds.
constexpr double kKeepCorrection = 0.03, kForgetNote = 0.06, kGap = 0.0107, kQuickHold = 0.01;
constexpr double kYoung = 0.12, kMayStartAgain = 0.08, kVibratoMean = 0.182, kToleranceMean = 0.08;
constexpr double kMedianHolds = 1.3, kMedianLeast = 0.016, kMedianMost = 0.027;
// Cents.
constexpr double kOutlier = 350.0, kAgree = 100.0, kYoungHysteresis = 5.0, kFar = 200.0, kNearer = 50.0;
constexpr double kLargestMean = 50.0, kLargestError = 1300.0, kNothing = 0.01;

constexpr std::size_t kMostMedian = 32;

}  // namespace

std::int64_t PitchControl::Frames(double seconds) const {
    return static_cast<std::int64_t>(std::lround(seconds / m_frame));
}

// Over the end of this voiced stretch, and how many frames that were.
std::pair<double, std::size_t> PitchControl::Median(const PitchTrack& track, std::int64_t now,
                                                    double hold) const {
    std::array<double, kMostMedian> values{};
    std::size_t count = 0;
    const auto reach = Frames(std::clamp(kMedianHolds * hold, kMedianLeast, kMedianMost));
    const auto first =
        std::max({now - reach, now - static_cast<std::int64_t>(kMostMedian) + 1, m_judgedFrom});
    for (std::int64_t i = now; i >= first && track.At(i).hz > 0.0; --i) values[count++] = track.At(i).cents;
    if (count % 2 == 0) --count;  // leaps up and down count alike
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(count / 2);
    std::nth_element(values.begin(), middle, values.begin() + static_cast<std::ptrdiff_t>(count));
    return {*middle, count};
}

bool PitchControl::IsCalm(const PitchTrack& track, std::int64_t now) const {
    const auto onset = Frames(kOnset);
    if (now < onset) return false;
    for (std::int64_t i = now - onset + 1; i <= now; ++i)
        if (track.At(i).hz <= 0.0 || std::abs(track.At(i).cents - track.At(now).cents) >= kAgree)
            return false;
    return true;
}

// Another note takes over when it has been nearer for long enough; quickly where the voice has just set in or
// is far away.
void PitchControl::ChooseNote(double cents, const PitchScale& scale, const PitchControlSettings& settings,
                              std::int64_t now) {
    const auto nearest = scale.Nearest(cents);
    const auto held = scale.Find(m_note.number);
    if (held.number < 0) return MoveTo(nearest, now);  // the scale was edited
    m_note = held;
    const bool young = static_cast<double>(now - m_voiceStart) * m_frame < kYoung;
    const double gain = std::abs(cents - m_note.cents) - std::abs(cents - nearest.cents);
    if (nearest.number == m_note.number || gain <= (young ? kYoungHysteresis : settings.hysteresis)) {
        m_rivalFrames = 0;
        return;
    }
    m_rivalFrames = nearest.number == m_rival ? m_rivalFrames + 1 : 1;
    m_rival = nearest.number;
    const bool quick = young || std::abs(cents - m_note.cents) > kFar;
    if (m_rivalFrames * m_frame < (quick ? std::min(settings.hold, kQuickHold) : settings.hold)) return;
    MoveTo(nearest, now);
}

void PitchControl::MoveTo(const PitchScale::Note& note, std::int64_t now) {
    m_from = m_output;
    m_note = note;
    m_since = 0.0;
    m_rivalFrames = 0;
    m_noteStart = now;
}

// Far from the note, with another one clearly nearer.
bool PitchControl::IsElsewhere(double cents, const PitchScale::Note& nearest) const {
    const double off = std::abs(m_note.cents - cents);
    return off > kFar && off > std::abs(nearest.cents - cents) + kNearer;
}

double PitchControl::Target(double transition) {
    m_target = m_note.cents;
    if (m_since < transition) {
        m_target = m_from +
                   (m_note.cents - m_from) * (0.5 - 0.5 * std::cos(std::numbers::pi * m_since / transition));
        m_since += m_frame;
    }
    return m_target;
}

double PitchControl::MeanSinceNote(const PitchTrack& track, std::int64_t now) const {
    double sum = 0.0;
    int count = 0;
    const auto reach = std::max<std::int64_t>(Frames(kVibratoMean), 1);  // one may be longer than the mean
    for (std::int64_t i = std::max(m_noteStart, now - reach + 1); i <= now; ++i)
        if (track.At(i).hz > 0.0) {
            sum += track.At(i).steady;
            ++count;
        }
    return sum / count;
}

// 0 while the mean error stays within the tolerance, 1 from twice the tolerance up.
double PitchControl::Weight(double error, double tolerance, bool fresh) {
    if (!(tolerance > 0.0)) return 1.0;
    if (fresh)
        m_meanError = 0.0;
    else
        m_meanError += (1.0 - std::exp(-m_frame / kToleranceMean)) *
                       (std::clamp(error, -kLargestMean, kLargestMean) - m_meanError);
    const double u = std::clamp(std::abs(m_meanError) / tolerance - 1.0, 0.0, 1.0);
    return u * u * (3.0 - 2.0 * u);
}

// The frames that had to agree before the note was decided; they are not played yet.
void PitchControl::Fill(PitchTrack& track, std::int64_t now, double target,
                        const PitchControlSettings& settings, double keep) {
    for (std::int64_t i = now - Frames(kOnset) + 1; i < now; ++i) {
        auto& frame = track.At(i);
        const double error = std::clamp(target - frame.cents, -kLargestError, kLargestError);
        m_correction = keep * m_correction + (1.0 - keep) * (settings.ratio * error + settings.shift);
        frame.correction = m_correction;
    }
}

void PitchControl::NameOnset(PitchTrack& track, std::int64_t now) const {
    for (std::int64_t i = now - FramesOpen(); i <= now; ++i) {
        track.At(i).note = m_note.number;
        track.At(i).noteCents = m_note.cents;
    }
}

// A frame without a decision.
void PitchControl::Rest(PitchTrack::Frame& frame, double correction) {
    frame.correction = m_correction = correction;
}

void PitchControl::Step(PitchTrack& track, double place, double hz, const PitchScale& scale,
                        const PitchControlSettings& settings) {
    const std::int64_t now = track.Count();
    PitchTrack::Frame& frame = track.Add({place, hz, hz > 0.0 ? scale.CentsOf(hz) : 0.0});
    frame.steady = frame.cents;
    const auto silent = static_cast<double>(now - m_lastVoiced) * m_frame;
    if (!(hz > 0.0)) {
        if (silent > kForgetNote) m_note = {};
        return Rest(frame, silent < kKeepCorrection ? m_correction : settings.shift);
    }
    m_lastVoiced = now;
    const bool fresh = m_note.number < 0;
    if (!fresh && silent > kGap + m_frame / 2.0) {
        m_voiceStart = m_noteStart = now;
        m_correction = settings.shift;
        m_output = m_target;
    }
    const auto nearest = scale.Nearest(frame.cents);
    if (nearest.number < 0 || (fresh && !IsCalm(track, now))) return Rest(frame, settings.shift);

    const auto [decisive, frames] = Median(track, now, settings.hold);
    const bool outlier = frames >= 3 && std::abs(frame.cents - decisive) > kOutlier;
    const double heard = frame.steady = outlier ? decisive : frame.cents;
    if (fresh) {
        m_note = scale.Nearest(decisive);
        m_since = 1e9;
        m_rivalFrames = 0;
        m_noteStart = m_voiceStart = now;
        m_correction = settings.shift;
    } else {
        ChooseNote(decisive, scale, settings, now);
    }
    const bool early = static_cast<double>(now - m_voiceStart) * m_frame < kMayStartAgain;
    if (!fresh && early && IsElsewhere(frame.cents, nearest)) {
        // A leap right after the voice set in: what was heard before was wrong.
        if (outlier) m_judgedFrom = now;
        m_note = {};
        return Rest(frame, outlier ? settings.shift : m_correction);
    }
    const double target = Target(settings.transition);
    const double error = target - heard + settings.keepVibrato * (heard - MeanSinceNote(track, now));
    const double weight = Weight(error, settings.tolerance, fresh);
    const double keep = settings.retune > 0.0 ? std::exp(-m_frame / settings.retune) : 0.0;
    if (fresh) NameOnset(track, now);
    if (fresh && weight == 1.0) Fill(track, now, target, settings, keep);
    const double wanted =
        settings.ratio * weight * std::clamp(error, -kLargestError, kLargestError) + settings.shift;
    m_correction = keep * m_correction + (1.0 - keep) * wanted;
    if (std::abs(m_correction) < kNothing) m_correction = 0.0;
    m_output = settings.ratio > 0.0 ? heard + (m_correction - settings.shift) / settings.ratio : target;
    frame.correction = m_correction;
    frame.note = m_note.number;
    frame.noteCents = m_note.cents;
}

}  // namespace Corvo::DSP
