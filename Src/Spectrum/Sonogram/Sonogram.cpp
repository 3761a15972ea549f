#include "Spectrum/Sonogram/Sonogram.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <iterator>
#include <utility>

#include "Picture/DrawingColour.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Scales/PowerToDecibels.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/Sonogram/SonogramColumn.h"
#include "Spectrum/Sonogram/SonogramHistory.h"
#include "Spectrum/Sonogram/SonogramPalette.h"
#include "Spectrum/Sonogram/SonogramRows.h"

namespace Corvo {
namespace {

constexpr int kRefreshesPerSecond = PitchTrace::kRefreshesPerSecond;
constexpr int kColumnsPerSecond[] = {5, 10, 15, 30, 60, 90, 150, 300, 450};
constexpr int kFastest = static_cast<int>(std::size(kColumnsPerSecond)) - 1;
constexpr int kUsualRate = 44100;
constexpr float kSilent = 0.0f;  // no pitch
constexpr std::uint32_t kFullLevel = 255;
constexpr int kTicksPerSecond = SonogramHistory::kTicksPerSecond;

std::atomic<int> g_speedIndex{3};
std::atomic<int> g_colourScheme{0};
std::atomic<int> g_columnsPerSecond{kColumnsPerSecond[3]};
std::atomic<const SonogramPalette*> g_palette{nullptr};  // until the first sonogram is made

// Looks again after the store: had another thread set the index meanwhile, `derived` could stay behind it.
template <typename Value, typename Function>
void Derive(const std::atomic<int>& index, std::atomic<Value>& derived, Function function) {
    int used;
    do {
        used = index;
        derived = function(used);
    } while (index != used);
}

float LevelOffset(const SpectrumSettings& settings) {
    const double gain = settings.gain;
    return static_cast<float>(10.0 * std::log10(gain * gain / FullScalePower(settings)));
}

int Pixels(float length) {
    constexpr float kMost = DrawingBitmap::kLargestSide;
    return length > 0.0f ? static_cast<int>(std::lround(std::min(length, kMost))) : 0;
}

// Where `position` falls among `count` equal parts of a stretch; -1 outside, and when it is not a number.
int PartAt(float position, float start, float length, int count) {
    const float part = (position - start) / length * static_cast<float>(count);
    return part >= 0.0f && part < static_cast<float>(count) ? static_cast<int>(part) : -1;
}

// The columns from `from` on of a picture `width` columns wide that begins at `left`.
struct PaintedTime {
    std::int64_t left, ticks;
    int from, width;

    std::int64_t At(int column) const { return left + column * ticks; }
    int ColumnAt(std::int64_t tick) const {
        return static_cast<int>(std::clamp<std::int64_t>((tick - left) / ticks, from, width));
    }
    ColumnRange ColumnsAt(const SonogramStretch& past, int column) const {
        return past.Within(At(column), At(column + 1));
    }
};

// Calls visit(stretch, its first column in the picture, the one behind its last), the newest first.
template <typename Visit>
void ForShown(const SonogramHistory& history, const PaintedTime& time, Visit visit) {
    const std::int64_t end = time.At(time.width);
    const auto& stretches = history.Stretches();
    for (auto past = stretches.rbegin(); past != stretches.rend() && past->End() > time.At(time.from); ++past)
        if (past->begin < end)
            visit(*past, time.ColumnAt(past->begin),
                  time.ColumnAt(std::min(past->End(), end) + time.ticks - 1));
}

void PlacePitches(const SonogramHistory& history, PaintedTime time, std::vector<float>& pitches) {
    std::ranges::fill(pitches, kSilent);
    time.from = 0;
    ForShown(history, time, [&](const SonogramStretch& past, int begin, int end) {
        for (int x = begin; x < end; ++x) {
            const ColumnRange columns = time.ColumnsAt(past, x);
            for (int column = columns.first; column < columns.end; ++column)
                if (const float pitch = past.pitches[static_cast<std::size_t>(column)]; pitch > 0.0f)
                    pitches[static_cast<std::size_t>(x)] = pitch;
        }
    });
}

}  // namespace

void Sonogram::SetSpeedIndex(int index) {
    g_speedIndex = std::clamp(index, 0, kFastest);
    UpdateSettings();
}
int Sonogram::GetSpeedIndex() { return g_speedIndex; }
int Sonogram::GetColumnsPerSecond() { return g_columnsPerSecond; }

void Sonogram::SetColourScheme(int scheme) {
    g_colourScheme = scheme;
    UpdateSettings();
}
int Sonogram::GetColourScheme() { return g_colourScheme; }

void Sonogram::UpdateSettings() {
    Derive(g_speedIndex, g_columnsPerSecond, [](int index) { return kColumnsPerSecond[index]; });
    CookSettings();
}

void Sonogram::CookSettings() {
    Derive(g_colourScheme, g_palette, [](int scheme) { return &SonogramPaletteOf(scheme); });
}

Sonogram::Sonogram()
    : m_samplingRate(kUsualRate),
      m_frequencies(FrequencyScaleOf({})),
      m_range(VerticalRangeOf({})),
      m_offset(LevelOffset({})),
      m_rows(std::make_unique<SonogramRows>()),
      m_newest(std::make_unique<SonogramColumn>()),
      m_previous(std::make_unique<SonogramColumn>()),
      m_map(SonogramAxis{0, m_samplingRate, m_frequencies}.Map()),
      m_history(std::make_unique<SonogramHistory>()) {
    m_bitmap.opaque = true;
    m_intensityScale.opaque = true;
    CookSettings();
    FollowColours();
    InitDrawCounter();
}

Sonogram::~Sonogram() = default;

SonogramAxis Sonogram::Axis() const { return {m_bitmap.height, m_samplingRate, m_frequencies}; }

void Sonogram::FollowColours() {
    const SonogramPalette* const palette = g_palette;
    if (palette == m_palette) return;
    m_palette = palette;
    for (std::uint32_t level = 0; level <= kFullLevel; ++level)
        m_pixels[level] = level << 24 | ColourAt(*palette, static_cast<float>(level) / kFullLevel);
    for (std::uint32_t& pixel : m_bitmap.pixels) pixel = m_pixels[pixel >> 24];
    m_bitmap.Changed();
}

void Sonogram::FollowScales(const SpectrumDrawer& drawer) {
    const SpectrumSettings& settings = drawer.GetSettings();
    m_offset = LevelOffset(settings);
    SonogramAxis axis = Axis();
    axis.scale = FrequencyScaleOf(settings);
    if (drawer.GetSamplingFrequency() > 0) axis.samplingRate = drawer.GetSamplingFrequency();
    const float range = VerticalRangeOf(settings);
    if (range == m_range && axis == Axis()) return;
    m_range = range;
    m_samplingRate = axis.samplingRate;
    m_frequencies = axis.scale;
    m_map = axis.Map();
    m_columnsStale = m_pictureStale = true;
}

void Sonogram::FollowSpeed() {
    if (m_columnsPerSecond != g_columnsPerSecond) InitDrawCounter();
}

void Sonogram::CheckPixelBufferSize(const RectF& rectangle, int rows) {
    FollowColours();
    FollowSpeed();
    const int width = Pixels(rectangle.width);
    const int height = DrawingBitmap::LimitedHeight(width, rows >= 1 ? rows : Pixels(rectangle.height));
    const bool resized = width != m_bitmap.width || height != m_bitmap.height;
    if (!resized && !m_pictureStale) return;
    m_history->Keep(static_cast<std::size_t>(width) * static_cast<std::size_t>(height));
    DrawingBitmap picture;
    picture.opaque = true;
    picture.Size(width, height);
    std::vector<float> pitches(static_cast<std::size_t>(width));
    PlaceRightEdge(width);
    Paint(picture, pitches, 0);
    picture.Changed();
    m_bitmap = std::move(picture);
    m_pitches = std::move(pitches);
    m_map = Axis().Map();
    m_columnsStale = m_columnsStale || resized;
    m_pictureStale = false;
}

// Where the picture is to end, and how much of it was heard. As the oldest columns go, a picture that looks
// back and is full moves along; one that is not moves when its last column would go.
void Sonogram::PlaceRightEdge(int width) {
    const std::int64_t now = m_history->Now(), ticks = kTicksPerSecond / m_columnsPerSecond;
    const int heard = m_heardColumns >= m_bitmap.width ? width : std::max(m_heardColumns - 1, 1);
    const std::int64_t earliest = std::min(m_history->Oldest() + heard * ticks, now);
    if (m_looksBack && m_rightEdge < earliest) {
        m_rightEdge = earliest;
        m_pictureStale = true;
    }
    if (!m_looksBack) m_rightEdge = now;
    m_looksBack = m_rightEdge < now;
    m_heardColumns = static_cast<int>(
        std::clamp<std::int64_t>((m_rightEdge - m_history->Oldest() + ticks - 1) / ticks, 0, width));
}

// The columns from `from` on, and all pitches: what is heard now may tell of columns before. Of several rows
// or columns that become one the loudest stays, and silence stays silence: a wider range must not bring out a
// floor that was never measured.
void Sonogram::Paint(DrawingBitmap& picture, std::vector<float>& pitches, int from) const {
    const int width = picture.width;
    for (int y = 0; y < picture.height; ++y) std::fill_n(picture.Row(y) + from, width - from, m_pixels[0]);
    const SonogramAxis axis{picture.height, m_samplingRate, m_frequencies};
    const std::int64_t ticks = kTicksPerSecond / m_columnsPerSecond;
    const PaintedTime time{m_rightEdge - width * ticks, ticks, from, width};
    PlacePitches(*m_history, time, pitches);
    std::vector<RowRange> rows;
    const SonogramAxis* rowsOf = nullptr;
    ForShown(*m_history, time, [&](const SonogramStretch& past, int begin, int end) {
        const SonogramScale& scale = past.scale;
        const bool sameRows = scale.axis == axis;
        if (!sameRows && (!rowsOf || scale.axis != *rowsOf)) rows = RowsWithin(scale.axis, axis);
        rowsOf = sameRows ? rowsOf : &scale.axis;
        std::array<std::uint32_t, kLevels> shown{m_pixels[0]};
        for (std::uint32_t level = 1; level <= kFullLevel; ++level) {
            const float share = static_cast<float>(level) / kFullLevel;
            shown[level] = m_pixels[static_cast<std::size_t>(LevelOf((share - 1.0f) * scale.range))];
        }
        // In bands of rows: each row of the picture is a page of memory of its own.
        constexpr int kBand = 64;
        for (int top = 0; top < picture.height; top += kBand)
            for (int x = begin; x < end; ++x) {
                const ColumnRange columns = time.ColumnsAt(past, x);
                for (int column = columns.first; column < columns.end; ++column) {
                    const std::uint8_t* const levels = past.Column(column);
                    std::uint32_t* pixel = picture.Row(top) + x;
                    for (int y = top; y < std::min(top + kBand, picture.height); ++y, pixel += width) {
                        const RowRange range =
                            sameRows ? RowRange{y, y + 1} : rows[static_cast<std::size_t>(y)];
                        for (int row = range.first; row < range.end; ++row)
                            *pixel = std::max(*pixel, shown[levels[row]]);
                    }
                }
            }
    });
}

bool Sonogram::Step(const SpectrumDrawer& drawer, bool newFrame, float pitchHz) {
    FollowColours();
    FollowScales(drawer);
    const float pitch = m_history->Hear(pitchHz > 0.0f && std::isfinite(pitchHz) ? pitchHz : kSilent);
    m_frameWaits = m_frameWaits || newFrame;
    const int columns = ColumnsDue();
    if (columns == 0 || m_bitmap.IsEmpty()) return false;
    const bool stale = m_columnsStale || m_newest->Height() != m_bitmap.height;
    if (stale || m_frameWaits) ComputeColumn(drawer.GetPowerSmoothed(), m_bitmap.height);
    Remember(m_frameWaits && !stale ? *m_previous : *m_newest, columns, pitch);
    m_frameWaits = m_columnsStale = false;
    m_pictureStale = m_pictureStale || m_hidden;
    if (m_hidden) return true;
    PlaceRightEdge(m_bitmap.width);
    if (m_looksBack && !m_pictureStale) return true;
    const int first = m_pictureStale ? 0 : std::max(m_bitmap.width - columns, 0);
    if (first > 0) ScrollPixels(columns);
    Paint(m_bitmap, m_pitches, first);
    m_bitmap.Changed();
    m_pictureStale = false;
    return true;
}

void Sonogram::LookBack(double seconds) {
    FollowSpeed();
    const std::int64_t now = m_history->Now(), ticks = kTicksPerSecond / m_columnsPerSecond;
    const double most = static_cast<double>(now - m_history->Oldest()) / kTicksPerSecond;
    const auto columns =
        seconds > 0.0 ? std::llround(std::min(seconds, most) * static_cast<double>(m_columnsPerSecond)) : 0;
    m_rightEdge = now - columns * ticks;
    m_heardColumns = 0;
    m_looksBack = true;
    m_pictureStale = true;
    PlaceRightEdge(m_bitmap.width);
}

double Sonogram::GetSecondsBack() const {
    return m_looksBack ? static_cast<double>(m_history->Now() - m_rightEdge) / kTicksPerSecond : 0.0;
}

void Sonogram::InitDrawCounter() {
    m_columnsPerSecond = g_columnsPerSecond;
    m_drawCounter = m_columnsPerSecond <= kRefreshesPerSecond ? kRefreshesPerSecond / m_columnsPerSecond
                                                              : 1 - m_columnsPerSecond / kRefreshesPerSecond;
    m_refreshes = 0;
    m_pictureStale = true;
}
int Sonogram::GetDrawCounter() const { return m_drawCounter; }

int Sonogram::ColumnsDue() {
    FollowSpeed();
    if (m_drawCounter <= 0) return 1 - m_drawCounter;
    if (++m_refreshes < m_drawCounter) return 0;
    m_refreshes = 0;
    return 1;
}

void Sonogram::ScrollPixels(int columns) {
    if (m_bitmap.IsEmpty()) return;
    const auto moved = static_cast<std::size_t>(std::clamp(columns, 1, m_bitmap.width));
    std::uint32_t* const pixels = m_bitmap.pixels.data();
    std::memmove(pixels, pixels + moved, (m_bitmap.pixels.size() - moved) * sizeof *pixels);
    m_bitmap.Changed();
}

// Counted from the last column, which is the newest spectrum exactly.
void Sonogram::Remember(const SonogramColumn& from, int columns, float pitchHz) {
    const SonogramScale scale{Axis(), m_range, kTicksPerSecond / m_columnsPerSecond};
    const float* const newest = m_newest->Levels();
    const float* const old = from.Levels();
    for (int back = columns - 1; back >= 0; --back) {
        const float share = static_cast<float>(back) / static_cast<float>(columns);
        std::uint8_t* const levels = m_history->Add(scale, pitchHz);
        for (int y = 0; y < scale.axis.height; ++y)
            levels[y] = static_cast<std::uint8_t>(LevelOf(newest[y] - (newest[y] - old[y]) * share));
    }
}

void Sonogram::ComputeColumn(const std::vector<float>& spectrum, int height) {
    std::swap(m_newest, m_previous);
    const int rows = std::clamp(height, 0, DrawingBitmap::kLargestSide);
    m_newest->Fill(rows, -m_range);
    if (spectrum.empty() || rows == 0) return;
    m_decibels.resize(spectrum.size());
    PowerToDecibels(spectrum.data(), m_decibels.data(), spectrum.size(), m_offset);
    for (float& level : m_decibels) level = level > -m_range ? std::min(level, 0.0f) : -m_range;
    SonogramAxis axis = Axis();
    axis.height = rows;
    m_rows->Prepare(axis, static_cast<int>(spectrum.size()));
    m_rows->Levels(m_decibels.data(), m_newest->Levels(), -m_range);
}

const float* Sonogram::GetColumn() const { return m_newest->Levels(); }
int Sonogram::GetColumnHeight() const { return m_newest->Height(); }

void Sonogram::Clear() {
    std::fill(m_bitmap.pixels.begin(), m_bitmap.pixels.end(), m_pixels[0]);
    std::fill(m_pitches.begin(), m_pitches.end(), kSilent);
    m_history->Clear();
    m_looksBack = false;
    PlaceRightEdge(m_bitmap.width);
    m_bitmap.Changed();
    ClearColumn();
}

void Sonogram::ClearColumn() {
    for (const auto& column : {m_newest.get(), m_previous.get()}) column->Fill(m_bitmap.height, -m_range);
    m_columnsStale = m_frameWaits = false;
}

int Sonogram::LevelOf(float decibels) const {
    const float share = decibels / m_range + 1.0f;
    return share > 0.0f ? static_cast<int>(std::min(share, 1.0f) * (kLevels - 1) + 0.5f) : 0;
}

std::uint32_t Sonogram::ColorFromAmplitude(float decibels, bool asColourReference) const {
    const std::uint32_t rgb = ColourAt(*g_palette.load(), decibels / m_range + 1.0f);
    return asColourReference ? ColourFromRgb(rgb) : rgb;
}

const DrawingBitmap& Sonogram::PrepareIntensityScale(int width, int height) {
    const SonogramPalette* const palette = g_palette;
    DrawingBitmap& bar = m_intensityScale;
    const std::uint32_t version = bar.version;
    bar.Size(width, height);
    if (bar.version == version && palette == m_barPalette) return bar;
    m_barPalette = palette;
    for (int y = 0; y < bar.height; ++y) {
        const float share = 1.0f - static_cast<float>(y) / static_cast<float>(std::max(bar.height - 1, 1));
        std::fill_n(bar.Row(y), bar.width, kFullLevel << 24 | ColourAt(*palette, share));
    }
    bar.Changed();
    return bar;
}

const DrawingBitmap& Sonogram::GetBitmap() const { return m_bitmap; }

float Sonogram::GetPointAmplitude(float x, float y, const RectF& rectangle) const {
    const int column = PartAt(x, rectangle.x, rectangle.width, m_bitmap.width);
    const int row = PartAt(y, rectangle.y, rectangle.height, m_bitmap.height);
    if (column < 0 || row < 0) return -m_range;
    const std::uint32_t level = m_bitmap.Row(row)[column] >> 24;
    return (static_cast<float>(level) / static_cast<float>(kFullLevel) - 1.0f) * m_range;
}

float Sonogram::GetRange() const { return m_range; }
const CoordinatesAndFrequencies& Sonogram::GetFrequencyMap() const { return m_map; }

float Sonogram::GetPitch(int column) const {
    return column >= 0 && column < m_bitmap.width ? m_pitches[static_cast<std::size_t>(column)] : kSilent;
}

int Sonogram::GetHeardColumns() const { return m_heardColumns; }

void Sonogram::SetTimeAtRightEdge(double seconds) {
    m_timeAtRightEdge = std::isfinite(seconds) ? seconds : 0.0;
}
double Sonogram::GetTimeAtRightEdge() const { return m_timeAtRightEdge - GetSecondsBack(); }

}  // namespace Corvo
