// Drawing into a window's pixels: a siren in spectrum and sonogram, 30 pictures a second.
// A window would show the surface after each; here the last one becomes siren.png.
#include <cairo.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <numbers>
#include <set>
#include <vector>

#include "Drawing/Backends/DrawingCairo.h"
#include "Picture/Geometry.h"
#include "Spectrum/kivspectrum.h"

int main() {
    constexpr int rate = 48000, refresh = rate / 30, width = 640, height = 400;
    kivspectrum analyser;
    analyser.set_parameters(rate);
    analyser.ShowSonogram(true);
    analyser.SetOn(true);

    std::vector<std::uint32_t> pixels(width * height);  // the window's own memory
    cairo_surface_t* const surface = cairo_image_surface_create_for_data(
        reinterpret_cast<unsigned char*>(pixels.data()), CAIRO_FORMAT_RGB24, width, height, 4 * width);
    cairo_t* const context = cairo_create(surface);
    Corvo::DrawingCairo drawing;  // kept from picture to picture: it holds brushes and the typeface

    std::vector<float> block(refresh);
    double phase = 0.0;
    int pictures = 0;
    for (int i = 0; i < 150; ++i) {
        const double frequency = 800.0 * std::exp2(std::sin(0.15 * i));
        for (float& sample : block) {
            sample = static_cast<float>(0.3 * std::sin(phase) + 0.03 * std::sin(2.0 * phase));
            phase += 2.0 * std::numbers::pi * frequency / rate;
        }
        analyser.Feed(block.data(), refresh, 1, 1);  // the audio thread
        if (!analyser.Refresh()) continue;           // the display thread: nothing new, nothing to draw
        Corvo::DrawingCairo::DrawTarget target(drawing, context, 96);  // dots per inch; 192 on a fine screen
        analyser.DoDrawSonogramAndSpectrum<Corvo::DrawingCairo>(target, {0, 0, width, height});
        ++pictures;
    }
    cairo_surface_flush(surface);
    const std::set<std::uint32_t> colours(pixels.begin(), pixels.end());
    const bool written = cairo_surface_write_to_png(surface, "siren.png") == CAIRO_STATUS_SUCCESS;
    cairo_destroy(context);
    cairo_surface_destroy(surface);
    std::printf("%d pictures; the last one has %zu colours\n", pictures, colours.size());
    return written && pictures > 100 && colours.size() > 50 ? 0 : 1;
}
