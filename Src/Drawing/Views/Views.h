#pragma once

#include "Drawing/DrawTarget.h"
#include "Platform/Export.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/kivspectrum.h"

// What can be drawn of an analyser and of its sonogram, on any target. Every back-end's header includes this
// file: it makes the drawing templates of both classes, which say what each of them draws.
namespace Corvo {

// Into `rectangle`, pixels of the target, of any size. On the thread that draws; throws std::bad_alloc. The
// members of kivspectrum that are made of them below say what each draws.
DSP_API void DrawWhole(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawSpectrum(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawSonogramAndSpectrum(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawSonogram(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawIntensityScale(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);

// The same, of the tuner.
DSP_API void DrawTuner(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawNote(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawNoteAndRipples(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawNeedleAndInfo(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawNeedle(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawNeedleInfo(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle);

// The same, of a sonogram; the members of Sonogram say what each draws.
DSP_API void DrawPicture(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawIntensityScale(Sonogram& sonogram, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawFrequencyScale(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle,
                                bool notes);
DSP_API void DrawTimeline(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle);
DSP_API void DrawPitchTrace(Sonogram& sonogram, DrawTarget& target, const RectF& rectangle);

}  // namespace Corvo

// clang-format off
template <class D> void kivspectrum::DoDraw(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawWhole(*this, t, r); }
template <class D> void kivspectrum::DoDrawSpectrum(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawSpectrum(*this, t, r); }
template <class D> void kivspectrum::DoDrawSonogramAndSpectrum(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawSonogramAndSpectrum(*this, t, r); }
template <class D> void kivspectrum::DrawSonogramComponents(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawSonogram(*this, t, r); }
template <class D> void kivspectrum::DrawSonogramIntensityScale(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawIntensityScale(*this, t, r); }
template <class D> void kivspectrum::DrawTuner(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawTuner(*this, t, r); }
template <class D> void kivspectrum::DoDrawBigLetter(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawNote(*this, t, r); }
template <class D> void kivspectrum::DrawTunerBigLetter(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawNoteAndRipples(*this, t, r); }
template <class D> void kivspectrum::DrawTunerWithNeedle(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawNeedleAndInfo(*this, t, r); }
template <class D> void kivspectrum::DrawNeedle(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawNeedle(*this, t, r); }
template <class D> void kivspectrum::DrawNeedleInfo(typename D::DrawTarget& t, const Corvo::RectF& r) { Corvo::DrawNeedleInfo(*this, t, r); }

template <class D> void Corvo::Sonogram::Draw(typename D::DrawTarget& t, const RectF& r) { DrawPicture(*this, t, r); }
template <class D> void Corvo::Sonogram::DrawIntensityScale(typename D::DrawTarget& t, const RectF& r) { Corvo::DrawIntensityScale(*this, t, r); }
template <class D> void Corvo::Sonogram::DrawFrequencyScale(typename D::DrawTarget& t, const RectF& r, bool noteNames) { Corvo::DrawFrequencyScale(*this, t, r, noteNames); }
template <class D> void Corvo::Sonogram::DrawTimeline(typename D::DrawTarget& t, const RectF& r) { Corvo::DrawTimeline(*this, t, r); }
template <class D> void Corvo::Sonogram::DrawPitchTrace(typename D::DrawTarget& t, const RectF& r) { Corvo::DrawPitchTrace(*this, t, r); }
// clang-format on
