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
#include "Spectrum/Sonogram/SonogramPalette.h"
#include "Spectrum/Sonogram/SonogramRows.h"

namespace Corvo {
namespace {

constexpr int kRefreshesPerSecond = 30;
constexpr int kColumnsPerSecond[] = {5, 10, 15, 30, 60, 90, 150, 300, 450};
constexpr int kFastest = static_cast<int>(std::size(kColumnsPerSecond)) - 1;
constexpr int kUsualRate = 44100;
constexpr float kSilent = 0.0f;  // no pitch
constexpr std::uint32_t kFullLevel = 255;

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
      m_map(SonogramAxis{0, m_samplingRate, m_frequencies}.Map()) {
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
    for (int shade = 0; shade < kShades; ++shade) {
        const float share = static_cast<float>(shade) / (kShades - 1);
        const auto level = static_cast<std::uint32_t>(share * kFullLevel + 0.5f);
        m_pixels[static_cast<std::size_t>(shade)] = level << 24 | ColourAt(*palette, share);
    }
    Recolour(m_range);
}

void Sonogram::FollowScales(const SpectrumDrawer& drawer) {
    const SpectrumSettings& settings = drawer.GetSettings();
    m_offset = LevelOffset(settings);
    if (const float range = VerticalRangeOf(settings); range != m_range) {
        const float oldRange = std::exchange(m_range, range);
        Recolour(oldRange);
        m_columnsStale = true;
    }
    SonogramAxis axis = Axis();
    axis.scale = FrequencyScaleOf(settings);
    if (drawer.GetSamplingFrequency() > 0) axis.samplingRate = drawer.GetSamplingFrequency();
    if (axis != Axis()) Reshape(m_bitmap.width, axis);
}

// Silence stays silence: a wider range must not bring out a floor that was never measured.
void Sonogram::Recolour(float oldRange) {
    std::array<std::uint32_t, kFullLevel + 1> pixels;
    pixels[0] = m_pixels[0];
    for (std::size_t level = 1; level <= kFullLevel; ++level) {
        const float share = static_cast<float>(level) / static_cast<float>(kFullLevel);
        pixels[level] = m_pixels[static_cast<std::size_t>(ShadeOf((share - 1.0f) * oldRange))];
    }
    for (std::uint32_t& pixel : m_bitmap.pixels) pixel = pixels[pixel >> 24];
    m_bitmap.Changed();
}

void Sonogram::CheckPixelBufferSize(const RectF& rectangle, int rows) {
    FollowColours();
    const int width = Pixels(rectangle.width);
    const int height = rows >= 1 ? rows : Pixels(rectangle.height);
    SonogramAxis axis = Axis();
    axis.height = DrawingBitmap::LimitedHeight(width, height);
    if (width != m_bitmap.width || axis != Axis()) Reshape(width, axis);
}

// Of several rows that become one the loudest stays; it is the largest pixel too.
void Sonogram::Reshape(int width, const SonogramAxis& axis) {
    DrawingBitmap reshaped;
    reshaped.opaque = true;
    reshaped.Size(width, axis.height);
    const int kept = std::min(width, m_bitmap.width), added = width - kept;
    const std::vector<RowRange> rows = RowsWithin(Axis(), axis);
    for (int y = 0; y < axis.height; ++y) {
        const RowRange sources = rows[static_cast<std::size_t>(y)];
        std::uint32_t* const row = reshaped.Row(y);
        std::fill_n(row, width, m_pixels[0]);
        for (int source = sources.first; source < sources.end; ++source) {
            const std::uint32_t* const pixels = m_bitmap.Row(source) + (m_bitmap.width - kept);
            for (int x = 0; x < kept; ++x) row[added + x] = std::max(row[added + x], pixels[x]);
        }
    }
    std::vector<float> pitches(static_cast<std::size_t>(width), kSilent);
    for (int x = 0; x < kept; ++x)
        pitches[static_cast<std::size_t>(added + x)] = GetPitch(m_bitmap.width - kept + x);

    reshaped.Changed();
    m_bitmap = std::move(reshaped);
    m_pitches = std::move(pitches);
    m_oldestPitch = 0;
    m_heardColumns = std::min(m_heardColumns, kept);
    m_samplingRate = axis.samplingRate;
    m_frequencies = axis.scale;
    m_map = axis.Map();
    m_columnsStale = true;
}

bool Sonogram::Step(const SpectrumDrawer& drawer, bool newFrame, float pitchHz) {
    FollowColours();
    FollowScales(drawer);
    m_frameWaits = m_frameWaits || newFrame;
    const int columns = ColumnsDue();
    if (columns == 0 || m_bitmap.IsEmpty()) return false;
    const bool stale = m_columnsStale || m_newest->Height() != m_bitmap.height;
    if (stale || m_frameWaits) ComputeColumn(drawer.GetPowerSmoothed(), m_bitmap.height);
    WriteColumns(m_frameWaits && !stale ? *m_previous : *m_newest, columns);
    RememberPitch(pitchHz, columns);
    m_frameWaits = m_columnsStale = false;
    return true;
}

void Sonogram::InitDrawCounter() {
    m_columnsPerSecond = g_columnsPerSecond;
    m_drawCounter = m_columnsPerSecond <= kRefreshesPerSecond ? kRefreshesPerSecond / m_columnsPerSecond
                                                              : 1 - m_columnsPerSecond / kRefreshesPerSecond;
    m_refreshes = 0;
}
int Sonogram::GetDrawCounter() const { return m_drawCounter; }

int Sonogram::ColumnsDue() {
    if (m_columnsPerSecond != g_columnsPerSecond) InitDrawCounter();
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
void Sonogram::WriteColumns(const SonogramColumn& from, int columns) {
    const int written = std::min(columns, m_bitmap.width);
    ScrollPixels(written);
    m_heardColumns = std::min(m_heardColumns + written, m_bitmap.width);
    const float* const newest = m_newest->Levels();
    const float* const old = from.Levels();
    for (int y = 0; y < m_bitmap.height; ++y) {
        const float step = (newest[y] - old[y]) / static_cast<float>(columns);
        std::uint32_t* const end = m_bitmap.Row(y) + m_bitmap.width;
        for (int back = written; back > 0; --back)
            end[-back] =
                m_pixels[static_cast<std::size_t>(ShadeOf(newest[y] - step * static_cast<float>(back - 1)))];
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
    m_heardColumns = 0;
    m_bitmap.Changed();
    ClearColumn();
}

void Sonogram::ClearColumn() {
    for (const auto& column : {m_newest.get(), m_previous.get()}) column->Fill(m_bitmap.height, -m_range);
    m_columnsStale = m_frameWaits = false;
}

int Sonogram::ShadeOf(float decibels) const {
    const float share = decibels / m_range + 1.0f;
    return share > 0.0f ? static_cast<int>(std::min(share, 1.0f) * (kShades - 1) + 0.5f) : 0;
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

void Sonogram::RememberPitch(float pitchHz, int columns) {
    const float pitch = pitchHz > 0.0f && std::isfinite(pitchHz) ? pitchHz : kSilent;
    for (int i = std::min(columns, m_bitmap.width); i > 0; --i) {
        m_pitches[static_cast<std::size_t>(m_oldestPitch)] = pitch;
        m_oldestPitch = (m_oldestPitch + 1) % m_bitmap.width;
    }
}

float Sonogram::GetPitch(int column) const {
    if (column < 0 || column >= m_bitmap.width || m_pitches.empty()) return kSilent;
    return m_pitches[static_cast<std::size_t>((m_oldestPitch + column) % m_bitmap.width)];
}

int Sonogram::GetHeardColumns() const { return m_heardColumns; }

void Sonogram::SetTimeAtRightEdge(double seconds) {
    m_timeAtRightEdge = std::isfinite(seconds) ? seconds : 0.0;
}
double Sonogram::GetTimeAtRightEdge() const { return m_timeAtRightEdge; }

}  // namespace Corvo
