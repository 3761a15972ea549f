#include <charconv>
#include <cmath>
#include <span>
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

// What the tuner hears.
std::string View::TunerNumbers() const {
    const Tuner& tuner = *GetAnalyser().GetTuner();
    std::string text = "note,octave,error_cents,frequency_hz,reference_hz";
    text += m_apart ? ",channel\n" : "\n";
    if (!tuner.IsTuned()) return text;
    return text + tuner.GetTunedNoteName() + "," + std::to_string(tuner.GetOctave()) + "," +
           Fixed(static_cast<double>(tuner.GetErrorCents()), 2) + "," + Fixed(tuner.GetFrequency(), 3) + "," +
           Fixed(4.0 * Tuner::GetCalibrationBase(), 2) + (m_apart ? ",left\n" : "\n");
}

// The smoothed spectrum as it is shown, of both channels where they are apart; or what the tuner hears.
std::string View::Numbers() const {
    if (GetAnalyser().GetDisplayMode() == kivspectrum::display_tuner) return TunerNumbers();
    const SpectrumDrawer& first = *GetAnalyser().GetSpectrumDrawer();
    const double full = Corvo::FullScalePower(first.GetSettings());
    const double perBin = 1.0 * Rate() / first.GetSettings().fft_length;
    std::string text = m_apart ? "frequency_hz,left_level_db,left_peak_db,right_level_db,right_peak_db\n"
                               : "frequency_hz,level_db,peak_db\n";
    const auto add = [&](const std::vector<float>& power, std::size_t bin) {
        text += ',';
        if (bin < power.size()) text += Fixed(Decibels(static_cast<double>(power[bin]) / full), 3);
    };
    for (std::size_t bin = 0; bin < first.GetPowerSmoothed().size(); ++bin) {
        text += Fixed(static_cast<double>(bin) * perBin, 4);
        for (const kivspectrum& each : std::span(m_analysers).first(m_apart ? 2 : 1)) {
            const SpectrumDrawer& drawer = *each.GetSpectrumDrawer();
            add(drawer.GetPowerSmoothed(), bin);
            add(drawer.GetPeaks(), bin);
        }
        text += "\n";
    }
    return text;
}

// Which of them a place of the picture is of; empty while they are together.
const char* View::ChannelAt(float x, float y) const {
    if (!m_apart) return "";
    return GetAnalyser().GetReading(x, y).plot != Plot::None ? ", left" : ", right";
}

// What is pointed at, or else what the tuner hears, or else the highest peak.
std::string View::DescribeHeard() const {
    const auto reading = ReadingAt(m_pointer.x, m_pointer.y);
    if (reading.plot != Plot::None)
        return Fixed(reading.frequency, 2) + " Hz, " + Fixed(reading.level, 1) + " dB" +
               (reading.plot == Plot::Sonogram ? ", " + Fixed(reading.seconds, 2) + " s" : "") +
               ChannelAt(m_pointer.x, m_pointer.y);
    const Tuner& tuner = *GetAnalyser().GetTuner();
    const std::string left = m_apart ? ", left" : "";
    if (GetAnalyser().GetTunerOn() && tuner.IsTuned())
        return std::string(tuner.GetTunedNoteName()) + std::to_string(tuner.GetOctave()) + " " +
               tuner.GetTuningErrorStr() + ", " + Fixed(tuner.GetFrequency(), 2) + " Hz" + left;
    const auto peak = GetAnalyser().GetSpectrumDrawer()->HighestPeak(20.0);
    return Fixed(peak.frequency, 2) + " Hz, " + Fixed(peak.level, 1) + " dB" + left;
}

void View::Save(Kind kind) {
    if (m_width < 1 || m_height < 1) return;
    std::string bytes;
    const double scale = 72.0 / static_cast<double>(m_dpi);  // of a paper's points
    cairo_surface_t* const surface =
        kind == Kind::Png ? cairo_image_surface_create(CAIRO_FORMAT_RGB24, m_width, m_height)
        : kind == Kind::Svg
            ? cairo_svg_surface_create_for_stream(Append, &bytes, m_width * scale, m_height * scale)
            : cairo_pdf_surface_create_for_stream(Append, &bytes, m_width * scale, m_height * scale);
    if (kind != Kind::Png) cairo_surface_set_device_scale(surface, scale, scale);
    cairo_t* const context = cairo_create(surface);
    DrawFor(For::File, context, m_width, m_height, m_dpi);
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
    const std::string picture = (folder / (name + ending)).string();
    if (!made || !WriteWhole(picture, bytes)) return Say("Nothing can be written to " + folder.string());
    if (kind != Kind::Png) return Say("Wrote " + picture);
    const bool numbers = WriteWhole(folder / (name + ".csv"), Numbers());
    Say("Wrote " + picture + (numbers ? " and .csv" : "; its numbers (.csv) cannot be written"));
}

}  // namespace analyser
