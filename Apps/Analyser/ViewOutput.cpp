#include <charconv>
#include <cmath>
#include <string>
#include <string_view>

#include <cairo-pdf.h>
#include <cairo-svg.h>
#include <cairo.h>

#include "Files.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/Tuner/Tuner.h"
#include "View.h"

// The present picture and its numbers, as files and as text.
namespace analyser {
namespace {

using Plot = Corvo::AnalyserReading::Plot;

cairo_status_t Append(void* to, const unsigned char* bytes, unsigned count) noexcept try {
    static_cast<std::string*>(to)->append(reinterpret_cast<const char*>(bytes), count);
    return CAIRO_STATUS_SUCCESS;
} catch (...) {
    return CAIRO_STATUS_NO_MEMORY;
}

std::string Fixed(double value, int decimals) {
    char text[64];
    const auto result = std::to_chars(text, text + sizeof text, value, std::chars_format::fixed, decimals);
    return {text, result.ptr};
}

double Decibels(double power) { return 10.0 * std::log10(std::max(power, 1e-30)); }

}  // namespace

// The smoothed spectrum as it is shown, and what the tuner hears.
std::string View::Numbers() const {
    const kivspectrum& first = GetAnalyser();
    const Tuner& tuner = *first.GetTuner();
    std::string text;
    if (first.GetDisplayMode() == kivspectrum::display_tuner) {
        text = "note,octave,error_cents,frequency_hz,reference_hz\n";
        if (tuner.IsTuned())
            text += std::string(tuner.GetTunedNoteName()) + "," + std::to_string(tuner.GetOctave()) + "," +
                    Fixed(static_cast<double>(tuner.GetErrorCents()), 2) + "," +
                    Fixed(tuner.GetFrequency(), 3) + "," + Fixed(4.0 * Tuner::GetCalibrationBase(), 2) + "\n";
        return text;
    }
    const SpectrumDrawer& drawer = *first.GetSpectrumDrawer();
    const auto& settings = drawer.GetSettings();
    const auto &power = drawer.GetPowerSmoothed(), &peaks = drawer.GetPeaks();
    const double full = Corvo::FullScalePower(settings), perBin = 1.0 * Rate() / settings.fft_length;
    text = "frequency_hz,level_db,peak_db\n";
    for (std::size_t bin = 0; bin < power.size(); ++bin) {
        text += Fixed(static_cast<double>(bin) * perBin, 4) + ",";
        text += Fixed(Decibels(static_cast<double>(power[bin]) / full), 3) + ",";
        if (bin < peaks.size()) text += Fixed(Decibels(static_cast<double>(peaks[bin]) / full), 3);
        text += "\n";
    }
    return text;
}

// What is pointed at, or else what the tuner hears, or else the highest peak.
std::string View::DescribeHeard() const {
    const auto reading = ReadingAt(m_pointer.x, m_pointer.y);
    if (reading.plot != Plot::None)
        return Fixed(reading.frequency, 2) + " Hz, " + Fixed(reading.level, 1) + " dB" +
               (reading.plot == Plot::Sonogram ? ", " + Fixed(reading.seconds, 2) + " s" : "");
    const Tuner& tuner = *GetAnalyser().GetTuner();
    if (GetAnalyser().GetTunerOn() && tuner.IsTuned())
        return std::string(tuner.GetTunedNoteName()) + std::to_string(tuner.GetOctave()) + " " +
               tuner.GetTuningErrorStr() + ", " + Fixed(tuner.GetFrequency(), 2) + " Hz";
    const auto peak = GetAnalyser().GetSpectrumDrawer()->HighestPeak(20.0);
    return Fixed(peak.frequency, 2) + " Hz, " + Fixed(peak.level, 1) + " dB";
}

void View::Save(Kind kind) {
    if (m_width < 1 || m_height < 1) return;
    const std::string said = m_said;  // no sentence of the last time in the picture
    m_said.clear();
    std::string bytes;
    const double scale = 72.0 / static_cast<double>(m_dpi);  // of a paper's points
    cairo_surface_t* const surface =
        kind == Kind::Png ? cairo_image_surface_create(CAIRO_FORMAT_RGB24, m_width, m_height)
        : kind == Kind::Svg
            ? cairo_svg_surface_create_for_stream(Append, &bytes, m_width * scale, m_height * scale)
            : cairo_pdf_surface_create_for_stream(Append, &bytes, m_width * scale, m_height * scale);
    if (kind != Kind::Png) cairo_surface_set_device_scale(surface, scale, scale);
    cairo_t* const context = cairo_create(surface);
    Draw(context, m_width, m_height, m_dpi);
    bool made = cairo_status(context) == CAIRO_STATUS_SUCCESS;
    cairo_destroy(context);
    if (kind == Kind::Png)
        made = made && cairo_surface_write_to_png_stream(surface, Append, &bytes) == CAIRO_STATUS_SUCCESS;
    else
        cairo_surface_finish(surface);
    made = made && cairo_surface_status(surface) == CAIRO_STATUS_SUCCESS;
    cairo_surface_destroy(surface);

    const std::filesystem::path folder = m_folder.empty() ? PictureFolder() : std::filesystem::path(m_folder);
    const std::string name = FreshName(folder);
    const char* const ending = kind == Kind::Png ? ".png" : kind == Kind::Svg ? ".svg" : ".pdf";
    made = made && WriteWhole(folder / (name + ending), bytes);
    if (kind == Kind::Png) made = made && WriteWhole(folder / (name + ".csv"), Numbers());
    Say(made ? "Wrote " + (folder / (name + ending)).string() + (kind == Kind::Png ? " and .csv" : "")
             : "Nothing can be written to " + folder.string());
}

}  // namespace analyser
