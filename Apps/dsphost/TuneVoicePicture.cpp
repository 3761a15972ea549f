#include "TuneVoicePicture.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>

#include "TuneVoiceNotes.h"

namespace dsphost {
namespace {

using Corvo::ColourFromRgb;
using Corvo::ColourReference;
using Corvo::DrawTarget;
using Corvo::PointF;
using Corvo::RectF;
using Corvo::TextAlign;

// The library's colours and sizes (1/96 inch).
constexpr ColourReference kGround = ColourFromRgb(0x0E1116), kPlot = ColourFromRgb(0x161B23);
constexpr ColourReference kGrid = ColourFromRgb(0x323C48), kMinorGrid = ColourFromRgb(0x222A33);
constexpr ColourReference kLabel = ColourFromRgb(0xA3AFBE), kText = ColourFromRgb(0xE8EDF3);
constexpr ColourReference kNote = ColourFromRgb(0x4CC2FF), kHeard = ColourFromRgb(0xF2A65A),
                          kCorrected = ColourFromRgb(0x7CFF6B);
constexpr std::uint8_t kNoteOpacity = 56;
constexpr float kLabelSize = 11.0f, kTitleSize = 12.0f, kGap = 4.0f;
constexpr float kLeft = 44.0f, kTop = 30.0f, kRight = 16.0f, kBottom = 26.0f;
constexpr float kHeardWidth = 1.5f, kCorrectedWidth = 2.0f, kSample = 22.0f;
constexpr double kLabelSpacing = 90.0;

constexpr int kLeastRows = 12, kRowsAround = 2;
constexpr int kAnyLowest = 48, kAnyHighest = 72;  // where nothing was decided

int NoteOfOctave(int note) { return (note % 12 + 12) % 12; }
bool IsBlackKey(int note) {
    constexpr std::array kBlack{0, 1, 0, 1, 0, 0, 1, 0, 1, 0, 1, 0};
    return kBlack[static_cast<std::size_t>(NoteOfOctave(note))] != 0;
}
// Where rows are too low for every name, these stand at least two rows apart.
bool IsNamedFirst(int note) {
    constexpr std::array kFirst{1, 0, 1, 0, 1, 0, 0, 1, 0, 1, 0, 0};
    return kFirst[static_cast<std::size_t>(NoteOfOctave(note))] != 0;
}

class Roll {
public:
    Roll(DrawTarget& target, const RectF& whole, const VoiceCurve& curve)
        : m_target(target), m_curve(curve), m_whole(whole), m_scale(target.Scale()) {
        m_plot = {whole.x + kLeft * m_scale, whole.y + kTop * m_scale,
                  std::max(whole.width - (kLeft + kRight) * m_scale, 1.0f),
                  std::max(whole.height - (kTop + kBottom) * m_scale, 1.0f)};
        ChooseRows();
    }

    void Draw() {
        m_target.FillRectangle(m_whole, {kGround});
        DrawRows();
        DrawSeconds();
        m_target.PushClip(m_plot);
        DrawNotes();
        DrawPitch(kHeard, kHeardWidth, false);
        DrawPitch(kCorrected, kCorrectedWidth, true);
        m_target.PopClip();
        DrawLegend();
    }

private:
    void ChooseRows() {
        m_lowest = kAnyLowest;
        m_highest = kAnyHighest;
        const auto& notes = m_curve.notes;
        if (notes.empty()) return;
        const auto [low, high] = std::ranges::minmax(notes, {}, &Corvo::DSP::DecidedNote::note);
        m_lowest = low.note - kRowsAround;
        m_highest = high.note + kRowsAround;
        while (m_highest - m_lowest + 1 < kLeastRows) ++m_highest, --m_lowest;
    }

    // Of a pitch in semitones, as MIDI counts them; a row is centred on its note.
    float Y(double semitones) const {
        const double rows = m_highest - m_lowest + 1;
        return m_plot.y + m_plot.height * static_cast<float>((m_highest + 0.5 - semitones) / rows);
    }
    float X(double seconds) const {
        return m_plot.x + m_plot.width * static_cast<float>(seconds / std::max(m_curve.seconds, 1e-3));
    }
    double Seconds(std::int64_t position) const { return static_cast<double>(position) / m_curve.rate; }
    float Line() const { return std::max(std::round(m_scale), 1.0f); }

    void DrawRows() {
        m_target.FillRectangle(m_plot, {kPlot});
        const float height = m_plot.height / static_cast<float>(m_highest - m_lowest + 1);
        const float label = 1.2f * kLabelSize * m_scale;
        const float capitals = Corvo::kCapHeight * kLabelSize * m_scale;
        for (int note = m_lowest; note <= m_highest; ++note) {
            const float top = std::round(Y(note + 0.5)), bottom = std::round(Y(note - 0.5));
            if (IsBlackKey(note))
                m_target.FillRectangle({m_plot.x, top, m_plot.width, bottom - top}, {kGround});
            m_target.FillRectangle({m_plot.x, bottom - Line(), m_plot.width, Line()},
                                   {NoteOfOctave(note) == 0 ? kGrid : kMinorGrid});
            const bool isC = NoteOfOctave(note) == 0;
            const bool shown = height >= label || (2.0f * height >= label && IsNamedFirst(note)) || isC;
            if (shown)
                m_target.Text(NoteName(note), {m_plot.x - 1.5f * kGap * m_scale, Y(note) + capitals / 2.0f},
                              TextAlign::Right, kLabelSize * m_scale, {isC ? kText : kLabel});
        }
    }

    void DrawSeconds() {
        double step = 0.01;
        for (int i = 0; m_plot.width / std::max(m_curve.seconds, 1e-3) * step <
                        kLabelSpacing * static_cast<double>(m_scale);
             ++i)
            step *= i % 3 == 1 ? 2.5 : 2.0;
        const int decimals = step < 0.1 ? 2 : step < 1.0 ? 1 : 0;
        const float baseline = m_plot.y + m_plot.height + (kGap + kLabelSize) * m_scale;
        for (int i = 0; i * step <= m_curve.seconds; ++i) {
            const float x = std::round(X(i * step));
            m_target.FillRectangle({x, m_plot.y, Line(), m_plot.height}, {kMinorGrid});
            std::array<char, 32> text;
            const auto end = std::to_chars(text.data(), text.data() + text.size(), i * step,
                                           std::chars_format::fixed, decimals)
                                 .ptr;
            m_target.Text(std::string(text.data(), end) + " s", {x, baseline},
                          i == 0 ? TextAlign::Left : TextAlign::Centre, kLabelSize * m_scale, {kLabel});
        }
    }

    void DrawNotes() {
        for (const auto& note : m_curve.notes) {
            const float left = X(Seconds(note.start)), right = X(Seconds(note.end));
            const float top = Y(note.note + 0.5), bottom = Y(note.note - 0.5);
            m_target.FillRoundedRectangle({left, top, std::max(right - left, Line()), bottom - top},
                                          3.0f * m_scale, {kNote, kNoteOpacity});
        }
    }

    // A line for each stretch without a pause or a leap.
    void DrawPitch(ColourReference colour, float width, bool corrected) {
        constexpr double kLongestStep = 0.02, kLeap = 3.0;  // seconds, semitones
        std::vector<PointF> line;
        double lastTime = 0.0, lastPitch = 0.0;
        const auto flush = [&] {
            m_target.Polyline(line.data(), static_cast<int>(line.size()), {{colour}, width * m_scale});
            line.clear();
        };
        for (const auto& reading : m_curve.readings) {
            if (!reading.IsVoiced()) continue;
            const double time = Seconds(reading.position);
            double pitch = 69.0 + 12.0 * std::log2(static_cast<double>(reading.heardHz) / 440.0);
            if (corrected) pitch += static_cast<double>(reading.correctionCents) / 100.0;
            if (time - lastTime > kLongestStep || std::abs(pitch - lastPitch) > kLeap) flush();
            lastTime = time;
            lastPitch = pitch;
            line.push_back({X(time), Y(pitch)});
        }
        flush();
    }

    void DrawLegend() {
        const float size = kTitleSize * m_scale, baseline = m_whole.y + (kTop - 10.0f) * m_scale;
        const float middle = baseline - Corvo::kCapHeight * size / 2.0f;
        float x = m_plot.x;
        const auto entry = [&](const char* text, auto sample) {
            sample(x);
            x += (kSample + kGap) * m_scale;
            m_target.Text(text, {x, baseline}, TextAlign::Left, size, {kText});
            x += m_target.MeasureText(text, size).width + 5.0f * kGap * m_scale;
        };
        const auto stroke = [&](ColourReference colour, float width) {
            return [=, this](float left) {
                m_target.Line({left, middle}, {left + kSample * m_scale, middle},
                              {{colour}, width * m_scale});
            };
        };
        entry("heard", stroke(kHeard, kHeardWidth));
        entry("corrected", stroke(kCorrected, kCorrectedWidth));
        entry("note", [&](float left) {
            const float height = 10.0f * m_scale;
            m_target.FillRoundedRectangle({left, middle - height / 2.0f, kSample * m_scale, height},
                                          3.0f * m_scale, {kNote, 2 * kNoteOpacity});
        });
        m_target.Text(m_curve.title, {m_plot.x + m_plot.width, baseline}, TextAlign::Right, size, {kLabel});
    }

    DrawTarget& m_target;
    const VoiceCurve& m_curve;
    RectF m_whole, m_plot;
    float m_scale;
    int m_lowest = 0, m_highest = 0;
};

}  // namespace

void DrawVoiceCurve(DrawTarget& target, const RectF& whole, const VoiceCurve& curve) {
    Roll(target, whole, curve).Draw();
}

}  // namespace dsphost
