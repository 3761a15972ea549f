#include <benchmark/benchmark.h>

#include <cstddef>
#include <vector>

#include <cairo.h>

#include "Drawing/Backends/DrawingCairo.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

// What does a whole frame cost, spectrum, sonogram and tuner analysed and drawn at 1280x720? It may take
// three times what filling the same surface and stroking the same polyline takes in bare Cairo
// (BM_BareCairo).
namespace {

constexpr int kWidth = 1280, kHeight = 720, kRate = 48000, kRefresh = kRate / 30;
constexpr Corvo::RectF kSpectrum{0, 0, 800, 300}, kTuner{800, 0, 480, 300}, kSonogram{0, 300, kWidth, 420};

class Surface {
public:
    Surface() : m_surface(cairo_image_surface_create(CAIRO_FORMAT_RGB24, kWidth, kHeight)) {
        context = cairo_create(m_surface);
    }
    ~Surface() {
        cairo_destroy(context);
        cairo_surface_destroy(m_surface);
    }
    Surface(const Surface&) = delete;
    Surface& operator=(const Surface&) = delete;
    cairo_t* context;

private:
    cairo_surface_t* m_surface;
};

// A tone in noise, as long as the sound that the frames go through.
class Scene {
public:
    Scene() : m_sound(TestSupport::Noise<float>(kRefresh * 64, 0.05)) {
        const auto tone = TestSupport::Sine<float>(m_sound.size(), 441.0, kRate, 0.5);
        for (std::size_t i = 0; i < tone.size(); ++i) m_sound[i] += tone[i];
        kivspectrum::settings = {};
        kivspectrum::SetAnalysisWindowsOverlap(0.9f);
        analyser.set_parameters(kRate);
        analyser.SetOn(true);
        analyser.SetTunerOn(true);
        analyser.ShowSonogram(true);
        analyser.ObserverUpdate();
        for (int i = 0; i < 30; ++i) Hear();
    }
    ~Scene() { kivspectrum::settings = {}; }
    Scene(const Scene&) = delete;
    Scene& operator=(const Scene&) = delete;

    void Hear() {
        analyser.Feed(m_sound.data() + m_position, kRefresh, 1, 1);
        m_position = (m_position + kRefresh) % m_sound.size();
        analyser.Refresh();
    }
    void Draw(Corvo::DrawingCairo::DrawTarget& target) {
        using Corvo::DrawingCairo;
        analyser.DoDrawSpectrum<DrawingCairo>(target, kSpectrum);
        analyser.DrawTuner<DrawingCairo>(target, kTuner);
        analyser.DrawSonogramComponents<DrawingCairo>(target, kSonogram);
    }
    kivspectrum analyser;

private:
    std::vector<float> m_sound;
    std::size_t m_position = 0;
};

// Drawn once before the clock runs: that gives the sonogram its size, and the back-end its texts.
void BM_WholeFrame(benchmark::State& state) {
    Scene scene;
    Surface surface;
    Corvo::DrawingCairo drawing;
    {
        Corvo::DrawingCairo::DrawTarget target(drawing, surface.context, 96.0f);
        scene.Draw(target);
    }
    for (auto _ : state) {
        if (state.range(0) != 1) scene.Hear();
        if (state.range(0) == 2) continue;
        Corvo::DrawingCairo::DrawTarget target(drawing, surface.context, 96.0f);
        scene.Draw(target);
        benchmark::ClobberMemory();
    }
    const char* const labels[] = {"analysis and drawing", "drawing alone", "analysis alone"};
    state.SetLabel(labels[state.range(0)]);
}
BENCHMARK(BM_WholeFrame)->Arg(0)->Arg(1)->Arg(2);

void BM_BareCairo(benchmark::State& state) {
    Scene scene;
    Surface surface;
    Corvo::DrawingCairo drawing;
    {
        Corvo::DrawingCairo::DrawTarget target(drawing, surface.context, 96.0f);
        scene.Draw(target);
    }
    const std::vector<Corvo::PointF> points = scene.analyser.GetSpectrumDrawer()->GetXYPoints();
    for (auto _ : state) {
        cairo_set_source_rgb(surface.context, 0.05, 0.06, 0.08);
        cairo_paint(surface.context);
        cairo_set_source_rgb(surface.context, 0.3, 0.76, 1.0);
        cairo_set_line_width(surface.context, 1.5);
        cairo_set_line_join(surface.context, CAIRO_LINE_JOIN_ROUND);
        for (const auto& point : points) cairo_line_to(surface.context, point.x, point.y);
        cairo_stroke(surface.context);
        benchmark::ClobberMemory();
    }
    state.SetLabel("fill, and stroke the spectrum's curve");
}
BENCHMARK(BM_BareCairo);

}  // namespace
