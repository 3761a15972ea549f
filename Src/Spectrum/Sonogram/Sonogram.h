#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <vector>

#include "Picture/DrawingBitmap.h"
#include "Platform/Export.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"

class SpectrumDrawer;

namespace Corvo {

struct ViewAccess;

class Analyser;
class SonogramColumn;
class SonogramHistory;
class SonogramRows;
struct SonogramAxis;
struct SonogramPalette;

// The scrolling picture of an analyser's spectra: time to the right, the newest column at the right edge,
// high frequencies at the top. What has left it is kept, 16 MiB of it and at least what the picture shows,
// and can be looked back at.
//
// Threads: speed and colour scheme are shared by all sonograms and may be read and set from any thread.
// Everything else belongs to the display thread of its analyser and takes no lock. A step works on every row
// of its new columns and moves the picture; once in a while it allocates.
class DSP_API Sonogram {
public:
    // 0..8: 5, 10, 15, 30, 60, 90, 150, 300 or 450 columns a second; an index outside is moved to the nearer
    // end.
    static void SetSpeedIndex(int index);
    static int GetSpeedIndex();
    static int GetColumnsPerSecond();
    // Kept as given; a scheme outside 0..6 has the colours of 0.
    static void SetColourScheme(int scheme);
    static int GetColourScheme();
    // Bring speed and colours in line with the indices; the setters do so at once, live sonograms follow with
    // their next step or check of the size. CookSettings does the colours alone.
    static void UpdateSettings();
    static void CookSettings();

    // Empty, with an axis of 44100 Hz until the first step.
    Sonogram();
    ~Sonogram();
    Sonogram(const Sonogram&) = delete;
    Sonogram& operator=(const Sonogram&) = delete;

    // Makes the picture as wide as the rectangle is in pixels, and `rows` high or, with less than 1, as high
    // as the rectangle; both within what DrawingBitmap allows, what is not a number being 0. The past fills
    // it as far as it is kept, every frequency and moment at its new place. When the size changes this and
    // the next step allocate; without memory they throw std::bad_alloc, and the picture stays as it was.
    void CheckPixelBufferSize(const RectF& rectangle, int rows);

    // One refresh of the display, of which there are 30 a second: adds as many columns as the speed wants,
    // and says whether there were any. They lead in equal steps of dB from the previous spectrum to the
    // drawer's smoothed one, or repeat the last when no frame came since the last columns. A change of the
    // drawer's sampling frequency, frequency scale or range, or of the speed, moves the past to where it
    // belongs now. `pitchHz` is what the tuner hears, 0 for nothing; the picture has it, from its beginning,
    // once it has lasted four refreshes, or eight an octave beside the note before. Once in a while it
    // allocates.
    bool Step(const SpectrumDrawer& drawer, bool newFrame, float pitchHz);

    // The picture ends so many seconds before now, in whole columns, and stays at that moment while new
    // columns come: at most with the oldest column. 0, less, or what is not a number: it ends now, and goes
    // on. The picture follows with the next check of its size.
    void LookBack(double seconds);
    // How long before now the picture ends; 0 while it goes on.
    double GetSecondsBack() const;

    // Starts counting refreshes for the current speed. The counter is how many of them a column takes or, at
    // 0 and below, one less how many columns each brings.
    void InitDrawCounter();
    int GetDrawCounter() const;
    // Moves the picture by 1..width columns, as one block: what leaves a row on the left appears at the end
    // of the row above, where the new columns are to be written.
    void ScrollPixels(int columns = 1);
    // The newest column becomes the previous one, and `spectrum` (powers of the bins from 0 Hz up to half the
    // sampling rate) the newest, `height` rows high.
    void ComputeColumn(const std::vector<float>& spectrum, int height);
    // The newest column's levels in dB, -range..0, top row first.
    const float* GetColumn() const;
    // How many levels that are.
    int GetColumnHeight() const;

    // The whole picture, the columns and the pitches at silence.
    void Clear();
    // The columns alone: what follows begins at silence.
    void ClearColumn();

    // `decibels` from -range to 0 below full scale, limited to it; silence for what is not a number.
    // 0xRRGGBB, or with red in the low byte.
    std::uint32_t ColorFromAmplitude(float decibels, bool asColourReference) const;
    // The colours as an upright bar, full scale in the top row. Made anew when the colours or the size
    // change; it stays this object's.
    const DrawingBitmap& PrepareIntensityScale(int width, int height);

    // Opaque, 0xLLRRGGBB: the level L from 0, silence, to 255, full scale, is what other colours or another
    // range are made from later.
    const DrawingBitmap& GetBitmap() const;
    // In dB, within 0.3 % of the range, where the picture is drawn over `rectangle`; silence outside.
    float GetPointAmplitude(float x, float y, const RectF& rectangle) const;
    // dB from silence to full scale.
    float GetRange() const;
    // The frequency axis: its x is the distance in rows from the lower edge of the picture.
    const CoordinatesAndFrequencies& GetFrequencyMap() const;
    // What the tuner heard at a column, 0 the left one; 0 where it heard nothing that lasted, or outside.
    float GetPitch(int column) const;
    // How many columns at the right were ever written.
    int GetHeardColumns() const;
    // What the timeline calls the newest column: 0, so that it counts back from now, unless a player tells
    // its place. Seconds; what is not a number counts as 0. The right edge's is earlier by what the picture
    // looks back.
    void SetTimeAtRightEdge(double seconds);
    double GetTimeAtRightEdge() const;

    // Drawing, with any back-end, into `rectangle`: the picture; its scale of colours with levels;
    // frequencies or notes, up to the rectangle's right edge; seconds before now, for a picture as wide as
    // the rectangle; what the tuner heard, over a picture that fills it. One thread at a time.
    template <class Drawing>
    void Draw(typename Drawing::DrawTarget& target, const RectF& rectangle);
    template <class Drawing>
    void DrawIntensityScale(typename Drawing::DrawTarget& target, const RectF& rectangle);
    template <class Drawing>
    void DrawFrequencyScale(typename Drawing::DrawTarget& target, const RectF& rectangle, bool noteNames);
    template <class Drawing>
    void DrawTimeline(typename Drawing::DrawTarget& target, const RectF& rectangle);
    template <class Drawing>
    void DrawPitchTrace(typename Drawing::DrawTarget& target, const RectF& rectangle);

private:
    friend struct ViewAccess;  // what the drawing routines keep inside
    friend class Analyser;

    static constexpr int kLevels = 256;

    SonogramAxis Axis() const;
    void FollowColours();
    void FollowScales(const SpectrumDrawer& drawer);
    void FollowSpeed();
    int ColumnsDue();
    void Remember(const SonogramColumn& from, int columns, float pitchHz);
    void PlaceRightEdge(int width);
    void Paint(DrawingBitmap& picture, std::vector<float>& pitches, int from) const;
    int LevelOf(float decibels) const;

    int m_columnsPerSecond = 0;
    int m_drawCounter = 0;
    int m_refreshes = 0;  // since the last column
    bool m_frameWaits = false;
    bool m_columnsStale = true;  // of another axis or range than the picture
    bool m_pictureStale = true;  // not as the history and the scales say
    bool m_looksBack = false;
    bool m_hidden = false;  // the history alone goes on

    // What the drawer's settings say.
    int m_samplingRate;
    FrequencyScale m_frequencies;
    float m_range;
    float m_offset;  // dB from a bin's power to its level

    std::unique_ptr<SonogramRows> m_rows;
    std::unique_ptr<SonogramColumn> m_newest, m_previous;
    CoordinatesAndFrequencies m_map;
    std::vector<float> m_decibels;  // of the bins

    const SonogramPalette* m_palette = nullptr;     // of the pixels
    std::array<std::uint32_t, kLevels> m_pixels{};  // from silence to full scale
    DrawingBitmap m_bitmap;
    const SonogramPalette* m_barPalette = nullptr;  // of the intensity scale
    DrawingBitmap m_intensityScale;

    std::unique_ptr<SonogramHistory> m_history;
    std::int64_t m_rightEdge = 0;  // of the picture in the history's ticks
    std::vector<float> m_pitches;  // one per column of the picture
    int m_heardColumns = 0;
    double m_timeAtRightEdge = 0.0;
    std::vector<PointF> m_trace;  // one stretch of them as drawn
};

}  // namespace Corvo
