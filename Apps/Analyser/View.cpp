#include "View.h"

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include "Commands.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"

namespace analyser {
namespace {

using Plot = Corvo::AnalyserReading::Plot;

constexpr float kHeard = 0.001f;       // -60 dB
constexpr float kDragDistance = 4.0f;  // in 1/96 inch
constexpr double kZoomStep = 0.8, kNarrowest = 1.0 / 16.0;
constexpr double kScrolled = 40.0;  // in 1/96 inch
constexpr int kSaidFor = 120;       // refreshes

Corvo::RectF Unit() { return {0.0f, 0.0f, 1.0f, 1.0f}; }

}  // namespace

std::atomic<int> View::s_views{0}, View::s_sensitivity{0};

View::View(Shell& shell) : m_shell(shell) {
    kivspectrum& first = GetAnalyser();
    first.SetOn(true);
    first.SetTunerOn(true);
    // What is shared stays as it was chosen in another.
    if (s_views++ == 0) {
        Do(kLargestOverlap);  // a new spectrum at every refresh
        Do(kFirstSpeed + 4);  // 60 columns a second: something to see within seconds
    }
    Do(kShowBoth);
    m_choices = 0;
}

View::~View() { --s_views; }

float View::Feed(const float* samples, int frames, int channels) {
    if (!samples || frames < 1 || channels < 1) return 0.0f;
    float peak = 0.0f;
    for (int i = 0; i < frames * channels; ++i) peak = std::max(peak, std::abs(samples[i]));
    if (peak > m_peak.load(std::memory_order_relaxed)) m_peak.store(peak, std::memory_order_relaxed);
    if (peak > kHeard) m_heard.store(true, std::memory_order_relaxed);
    const bool apart = m_apart.load(std::memory_order_relaxed) && channels > 1;
    m_analysers[0].Feed(samples, frames, channels, apart ? 1 : channels);
    m_analysers[1].Feed(samples + (apart ? 1 : 0), frames, channels, apart ? 1 : channels);
    return peak;
}

void View::SetSamplingRate(int rate) {
    m_rate = rate;
    for (kivspectrum& each : m_analysers) each.set_parameters(rate);
}

int View::Rate() const {
    const int prepared = GetAnalyser().GetSpectrumDrawer()->GetSamplingFrequency();
    return prepared > 0 ? prepared : m_rate;
}

void View::StartOver() {
    const std::vector<float> silence(
        static_cast<std::size_t>(std::max(kivspectrum::GetSettings().window_length, 1)));
    for (kivspectrum& each : m_analysers) {
        each.Feed(silence.data(), static_cast<int>(silence.size()), 1, 1);
        each.GetSonogram()->Clear();
        each.GetSonogram()->SetTimeAtRightEdge(0.0);
        each.GetTuner()->Forget();
        each.peak_reset();
    }
    m_dirty = true;
}

void View::SetTime(double seconds) {
    for (kivspectrum& each : m_analysers)
        if (each.GetOn() && !each.GetFrozen()) each.GetSonogram()->SetTimeAtRightEdge(seconds);
}

bool View::Refresh() {
    // Chosen in another, perhaps.
    if (m_apart != (kivspectrum::GetSettings().view_flag_a != 0)) FollowFirst();
    // A file that rests leaves its last picture as it is.
    const auto playback = m_shell.GetPlayback();
    if (!playback || (playback->playing && !playback->waits))
        for (kivspectrum& each : m_analysers)
            if (each.Refresh()) m_dirty = true;
    FollowLevel();
    if (m_saidFor > 0 && --m_saidFor == 0) {
        m_said.clear();
        m_dirty = true;
    }
    return std::exchange(m_dirty, false);
}

void View::FollowLevel() {
    constexpr float kSilence = -120.0f, kFall = 20.0f / 30.0f, kFull = 0.999f;
    const float peak = m_peak.exchange(0.0f, std::memory_order_relaxed);
    const float now = peak > 1e-6f ? 20.0f * std::log10(peak) : kSilence;
    const float level = std::max(now, std::max(m_level - kFall, kSilence));
    const bool wasTooLoud = m_tooLoudFor > 0;
    m_tooLoudFor = peak >= kFull ? kSaidFor : std::max(m_tooLoudFor - 1, 0);
    m_dirty = m_dirty || std::round(level) != std::round(m_level) || wasTooLoud != (m_tooLoudFor > 0);
    m_level = level;
}

// The channels apart: the second shows as the first does, but has no tuner of its own. Until they are it
// hears what the first one hears, so that their sonograms have the same past.
void View::FollowFirst() {
    const kivspectrum& first = GetAnalyser();
    kivspectrum& second = m_analysers[1];
    const bool apart = kivspectrum::GetSettings().view_flag_a != 0;
    m_apart.store(apart, std::memory_order_relaxed);
    second.SetOn(first.GetOn() && (apart || m_width > 0));  // nothing was shown before
    if (second.GetFrozen() != first.GetFrozen()) second.SetFrozen(first.GetFrozen());
    while (second.GetDisplayMode() != first.GetDisplayMode()) second.ToggleDisplayMode();
    second.SetFrequencySpan(first.GetFrequencySpan());
}

void View::ShowMode(kivspectrum::_display_mode mode) {
    kivspectrum& first = GetAnalyser();
    while (first.GetDisplayMode() != mode) first.ToggleDisplayMode();
    if (mode != kivspectrum::display_tuner || first.GetTunerOn()) return;
    first.ToggleTuner();
    first.ShowTuner(false);
}

Corvo::AnalyserReading View::ReadingAt(float x, float y) const {
    const Corvo::AnalyserReading reading = GetAnalyser().GetReading(x, y);
    return reading.plot != Plot::None || !m_apart ? reading : m_analysers[1].GetReading(x, y);
}

void View::Pin(const Corvo::AnalyserReading& reading) {
    for (kivspectrum& each : m_analysers) each.SetMarker(reading);
}

// Places along the whole axis, from 0 to 1.
void View::SetSpan(double low, double high) {
    const auto whole = SpectrumMap(Unit(), kivspectrum::GetSettings(), Rate());
    const bool all = high - low >= 0.9999;
    GetAnalyser().SetFrequencySpan(
        all ? Corvo::FrequencySpan{}
            : Corvo::FrequencySpan{whole.XToFrequency(low), whole.XToFrequency(high)});
    FollowFirst();
}

void View::Zoom(double aroundHz, double factor) {
    const auto whole = SpectrumMap(Unit(), kivspectrum::GetSettings(), Rate());
    const auto span = GetAnalyser().GetFrequencySpan();
    const bool all = span == Corvo::FrequencySpan{};
    const double low = all ? 0.0 : std::max(static_cast<double>(whole.FrequencyToX(span.lowest)), 0.0);
    const double high = all ? 1.0 : std::min(static_cast<double>(whole.FrequencyToX(span.highest)), 1.0);
    const double width = std::clamp((high - low) * factor, kNarrowest, 1.0);
    const double around = aroundHz > 0.0 ? whole.FrequencyToX(aroundHz) : (low + high) / 2.0;
    const double share = high > low ? std::clamp((around - low) / (high - low), 0.0, 1.0) : 0.5;
    const double from = std::clamp(around - share * width, 0.0, 1.0 - width);
    SetSpan(from, from + width);
}

// What stood at one frequency stands at another one's place then.
void View::Pan(double fromHz, double toHz) {
    const auto whole = SpectrumMap(Unit(), kivspectrum::GetSettings(), Rate());
    const auto span = GetAnalyser().GetFrequencySpan();
    if (span == Corvo::FrequencySpan{}) return;
    const double low = whole.FrequencyToX(span.lowest), width = whole.FrequencyToX(span.highest) - low;
    const double moved = whole.FrequencyToX(fromHz) - whole.FrequencyToX(toHz);
    const double from = std::clamp(low + moved, 0.0, std::max(1.0 - width, 0.0));
    SetSpan(from, from + width);
}

// The sonogram ends so long ago, or as long as it can. False when there is no sonogram.
bool View::LookBack(double seconds) {
    kivspectrum& first = GetAnalyser();
    if (!first.IsShowSonogram() && seconds > 0.0) return false;
    first.GetSonogram()->LookBack(seconds);
    m_analysers[1].GetSonogram()->LookBack(first.GetSonogram()->GetSecondsBack());
    m_dirty = true;
    return true;
}

// The same, but never further into what was not heard than it is already.
bool View::Scroll(double seconds) {
    const int before = UnheardColumns();
    if (!LookBack(seconds)) return false;
    const int more = UnheardColumns() - std::max(before, 0);
    if (more > 0) LookBack(SecondsBack() - 1.0 * more / Corvo::Sonogram::GetColumnsPerSecond());
    return true;
}

int View::UnheardColumns() const {
    const Corvo::Sonogram& sonogram = *GetAnalyser().GetSonogram();
    return sonogram.GetBitmap().width - sonogram.GetHeardColumns();
}

double View::SecondsBack() const {
    const kivspectrum& first = GetAnalyser();
    return first.IsShowSonogram() ? first.GetSonogram()->GetSecondsBack() : 0.0;
}

// What stood where the drag began to move in time stands at `x` then.
void View::DragTime(float x) {
    const double since = ReadingAt(m_drag->x, m_drag->y).since;
    if (!std::exchange(m_drag->inTime, true)) m_drag->start.since = since;
    const double moved = static_cast<double>(x - m_drag->x) / Corvo::Sonogram::GetColumnsPerSecond();
    Scroll(SecondsBack() + since - m_drag->start.since + moved);
}

void View::PointTo(float x, float y) {
    m_pointer = {x, y};
    m_dirty = true;
    if (m_menu.IsOpen()) {
        m_menu.PointTo(m_pointer);
        return;
    }
    for (kivspectrum& each : m_analysers) each.SetPointer(x, y);
    if (!m_drag) return;
    const float distance = kDragDistance * m_dpi / 96.0f;
    if (std::hypot(x - m_drag->x, y - m_drag->y) > distance) m_drag->moved = true;
    if (!m_drag->moved) return;
    if (m_drag->seeks) return SeekTo(x);
    if (m_drag->start.plot == Plot::Sonogram) {
        if (m_drag->inTime || std::abs(x - m_drag->x) > distance) DragTime(x);
        m_drag->inFrequency = m_drag->inFrequency || std::abs(y - m_drag->y) > distance;
        if (!m_drag->inFrequency) return;
    }
    const auto now = ReadingAt(x, y);
    if (now.plot != m_drag->start.plot || now.plot == Plot::None) return;
    Pan(m_drag->start.frequency, now.frequency);
}

void View::PointerLeft() {
    for (kivspectrum& each : m_analysers) each.ClearPointer();
    m_pointer = {-1.0f, -1.0f};
    m_dirty = true;
}

void View::Press(const PointerPress& press) {
    m_dirty = true;
    m_keysShown = false;
    const Corvo::PointF place{press.x, press.y};
    if (m_menu.IsOpen()) {
        if (const auto chosen = m_menu.Press(place)) Do(*chosen);
        return;
    }
    if (press.button == Button::Right) {
        for (kivspectrum& each : m_analysers) each.ClearPointer();
        return m_menu.Open(MakeMenu(), place);
    }
    const auto reading = ReadingAt(press.x, press.y);
    if (press.clicks == 2 && reading.plot != Plot::None) {
        m_drag.reset();
        Pin({});
        LookBack(0.0);
        Do(kWholeRange);
        return;
    }
    m_drag = Drag{reading, press.x, press.y};
    m_drag->seeks = Contains(m_bar.timeline, place);
    if (m_drag->seeks) SeekTo(press.x);
}

void View::Release(float x, float y) {
    if (!m_drag) return;
    const bool click = !m_drag->moved && !m_drag->seeks;
    m_drag.reset();
    const auto reading = ReadingAt(x, y);
    if (click && reading.plot != Plot::None) Pin(reading);
    m_dirty = true;
}

void View::SeekTo(float x) {
    const auto playback = m_shell.GetPlayback();
    if (!playback || m_bar.timeline.width <= 0.0f) return;
    const double share = std::clamp((x - m_bar.timeline.x) / m_bar.timeline.width, 0.0f, 1.0f);
    m_shell.Seek(share * playback->length);
    m_dirty = true;
}

void View::Wheel(float x, float y, float steps, bool control) {
    if (m_menu.IsOpen() || !std::isfinite(steps)) return;
    const auto reading = ReadingAt(x, y);
    if (control) {
        Do(steps > 0.0f ? kFaster : kSlower);
        const auto playback = m_shell.GetPlayback();
        const bool rests = GetAnalyser().GetFrozen() || (playback && !playback->playing);
        // What goes on keeps its end at now; else what is pointed at stays.
        if (reading.plot == Plot::Sonogram && (rests || SecondsBack() > 0.0))
            LookBack(SecondsBack() + ReadingAt(x, y).since - reading.since);
        return;
    }
    if (reading.plot == Plot::None) return;
    Zoom(reading.frequency, std::pow(kZoomStep, std::clamp(static_cast<double>(steps), -8.0, 8.0)));
    m_dirty = true;
}

void View::ScrollBack(float steps) {
    if (m_menu.IsOpen() || !std::isfinite(steps)) return;
    const double columns = kScrolled * static_cast<double>(steps * m_dpi / 96.0f);
    Scroll(SecondsBack() + columns / Corvo::Sonogram::GetColumnsPerSecond());
}

bool View::KeyDown(const KeyPress& press) {
    if (m_menu.IsOpen()) {
        m_dirty = true;
        if (const auto chosen = m_menu.KeyDown(press)) Do(*chosen);
        return true;
    }
    if (press.key == kKeyEscape) {
        const bool used = m_keysShown || GetAnalyser().GetMarker().plot != Plot::None;
        m_keysShown = false;
        Pin({});
        m_dirty = m_dirty || used;
        return used;
    }
    const CommandRow* const row = FindCommand(press);
    return row && Do(row->command);
}

void View::SetTrouble(std::string sentence) {
    if (sentence == m_trouble) return;
    m_trouble = std::move(sentence);
    m_dirty = true;
}

void View::Say(std::string sentence) {
    m_said = std::move(sentence);
    m_saidFor = kSaidFor;
    m_dirty = true;
}

}  // namespace analyser
