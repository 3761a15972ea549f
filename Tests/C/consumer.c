/* A host in plain C: uses every part of the interface once, as its header says, and checks what comes back.
 */
#include <math.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "C/dspdll.h"
#ifdef DSP_TEST_DRAWS
#include "C/dspdrawing.h"
#endif

enum { kRate = 48000, kFrames = 48000 };
static const double kPi = 3.14159265358979323846;

static dsp_error g_error = {sizeof(dsp_error), ""};

static void Expect(int holds, const char* what, int line) {
    if (holds) return;
    fprintf(stderr, "consumer.c:%d: %s (%s)\n", line, what, g_error.text);
    exit(1);
}
#define EXPECT(condition) Expect(condition, #condition, __LINE__)
#define OK(call) EXPECT((call) == DSP_OK)

static void Sine(float* samples, int frames, double hz) {
    int i;
    for (i = 0; i < frames; ++i) samples[i] = 0.5f * (float)sin(2.0 * kPi * hz * i / kRate);
}

static double TempoAsked = 0.0;
static void DSP_CALL Tempo(void* user, dsp_tempo* tempo) {
    *(double*)user += 1.0;
    tempo->bpm = 60.0;
}

static void UseEffects(float* samples) {
    const dsp_format format = {sizeof format, kRate, 1, DSP_F32, 512};
    const dsp_point points[] = {{0, 1.0f, 0.0f}, {1000, 0.0f, 0.0f}};
    dsp_parameter record = {sizeof record, 0, 0, 0.0f};
    dsp_effect *gain = NULL, *echo = NULL;
    char text[64];
    void* state;
    size_t needed = 0;
    int32_t level = -1, count = 0, i;
    float value = 0.0f, before;

    for (i = 0; i < dsp_effect_kinds(); ++i) {
        dsp_effect* effect = NULL;
        OK(dsp_effect_kind_name(i, text, sizeof text, NULL));
        OK(dsp_effect_create(text, &effect, &g_error));
        OK(dsp_close(effect));
        EXPECT(dsp_effect_latency(effect, &count) == DSP_CLOSED);
    }
    EXPECT(dsp_effect_create("Megaphone", &gain, &g_error) == DSP_UNKNOWN);
    EXPECT(strstr(g_error.text, "Megaphone") && strstr(g_error.text, "Reverb"));

    OK(dsp_effect_create("gain", &gain, &g_error));
    EXPECT(dsp_effect_process_f32(gain, samples, 10) == DSP_UNPREPARED);
    OK(dsp_effect_find_parameter(gain, "gain", &level, &g_error));
    OK(dsp_effect_parameter(gain, level, &record));
    EXPECT(record.kind == DSP_CONTINUOUS);
    OK(dsp_effect_text_to_value(gain, level, "-6 dB", &value, &g_error));
    OK(dsp_effect_set(gain, level, value));
    OK(dsp_effect_parameter_text(gain, level, DSP_TEXT_VALUE, text, sizeof text, &needed));
    EXPECT(needed == strlen(text) + 1 && strstr(text, "-6"));
    EXPECT(dsp_effect_text_to_value(gain, level, "loud", &value, &g_error) == DSP_NOT_UNDERSTOOD);
    EXPECT(strstr(g_error.text, "loud") && strstr(g_error.text, "accepted"));

    OK(dsp_effect_state(gain, NULL, 0, &needed));
    state = malloc(needed);
    OK(dsp_effect_state(gain, state, needed, NULL));
    OK(dsp_effect_set(gain, level, 0.0f));
    OK(dsp_effect_set_state(gain, state, needed, &g_error));
    OK(dsp_effect_get(gain, level, &before));
    OK(dsp_effect_value_to_text(gain, level, before, text, sizeof text, NULL));
    EXPECT(strstr(text, "-6") != NULL);
    OK(dsp_effect_value_to_text(gain, level, 0.0f, text, sizeof text, NULL));
    EXPECT(strcmp(text, "-Inf. dB") == 0);
    OK(dsp_effect_text_to_value(gain, level, "-inf", &value, &g_error));
    EXPECT(dsp_effect_set_state(gain, state, 3, &g_error) == DSP_NOT_UNDERSTOOD);
    free(state);

    /* A block longer than the longest piece. */
    OK(dsp_effect_prepare(gain, &format, &g_error));
    for (i = 0; i < 2000; ++i) samples[i] = 0.5f;
    OK(dsp_effect_process_f32(gain, samples, 2000));
    EXPECT(fabs(samples[0] - 0.2506) < 0.001 && samples[1999] == samples[0]);
    EXPECT(dsp_effect_automate(gain, level, points, 2) == DSP_UNSUPPORTED);
    EXPECT(dsp_close(gain) == DSP_OK && dsp_close(gain) == DSP_CLOSED);

    OK(dsp_effect_create("Echo", &echo, &g_error));
    OK(dsp_effect_presets(echo, &count));
    EXPECT(count > 1 && dsp_effect_set_preset(echo, count) == DSP_OUT_OF_RANGE);
    OK(dsp_effect_default_preset(echo, &i));
    EXPECT(i >= 0 && i < count);
    OK(dsp_effect_set_preset(echo, 1));
    OK(dsp_effect_automate(echo, 0, points, 2));
    OK(dsp_effect_automate(echo, 0, NULL, 0));
    OK(dsp_effect_tempo_callback(echo, Tempo, &TempoAsked));
    OK(dsp_effect_prepare(echo, &format, &g_error));
    memset(samples, 0, kFrames * sizeof *samples);
    samples[0] = 1.0f;
    OK(dsp_effect_process_f32(echo, samples, kFrames));
    EXPECT(TempoAsked > 0.0);
    for (i = 1, value = 0.0f; i < kFrames; ++i) value = fmaxf(value, fabsf(samples[i]));
    EXPECT(value > 0.01f);
    OK(dsp_effect_tempo_callback(echo, NULL, NULL));
    OK(dsp_effect_reset(echo));
    OK(dsp_effect_seek(echo, 1000));
    samples[0] = 1.0f;
    OK(dsp_effect_process_f32(echo, samples, 256));
    OK(dsp_effect_rewind(echo, 0));
    memset(samples, 0, kFrames * sizeof *samples);
    OK(dsp_effect_process_f32(echo, samples, kFrames));
    for (i = 0; i < kFrames; ++i) EXPECT(samples[i] == 0.0f);
    EXPECT(dsp_effect_seek(echo, INT64_MAX) == DSP_OUT_OF_RANGE);
    OK(dsp_close(echo));
}

/* A reverb rings for as long as it may, in blocks that are longer than the longest piece. */
static void UseTail(float* samples) {
    const dsp_format format = {sizeof format, kRate, 1, DSP_F32, 256};
    dsp_effect* reverb = NULL;
    int32_t frames = 0, finished = 0, total = 0;
    OK(dsp_effect_create("Reverb", &reverb, &g_error));
    OK(dsp_effect_prepare(reverb, &format, &g_error));
    OK(dsp_effect_start_tail(reverb, 10000));
    while (!finished) {
        memset(samples, 0, 1000 * sizeof *samples);
        OK(dsp_effect_process_f32(reverb, samples, 1000));
        OK(dsp_effect_tail(reverb, &frames, &finished));
        total += frames;
    }
    EXPECT(total == 10000);
    OK(dsp_effect_end_tail(reverb));
    OK(dsp_close(reverb));
}

/* What the other input says decides how far a compressor turns down. */
static void UseSidechain(float* samples) {
    const dsp_format format = {sizeof format, kRate, 1, DSP_F32, 512};
    dsp_effect* compressor = NULL;
    float* const loud = malloc(kRate * sizeof *loud);
    const float* channels[1];
    int32_t busses = 0, i;
    channels[0] = loud;
    for (i = 0; i < kRate; ++i) loud[i] = i % 2 ? 0.9f : -0.9f, samples[i] = 0.01f;
    OK(dsp_effect_create("Compressor", &compressor, &g_error));
    OK(dsp_effect_set_preset(compressor, 5));
    OK(dsp_effect_sidechain_busses(compressor, &busses));
    EXPECT(busses == 1);
    OK(dsp_effect_sidechain_channels(compressor, 0, 1));
    OK(dsp_effect_prepare(compressor, &format, &g_error));
    OK(dsp_effect_process_f32(compressor, samples, kRate / 2));
    OK(dsp_effect_sidechain_f32(compressor, 0, channels));
    OK(dsp_effect_process_f32(compressor, samples + kRate / 2, kRate / 2));
    EXPECT(fabsf(samples[kRate - 1]) < 0.9f * fabsf(samples[kRate / 2 - 1]));
    free(loud);
    OK(dsp_close(compressor));
}

static void UseEqualiser(void) {
    const dsp_format format = {sizeof format, kRate, 1, DSP_F64, 512};
    dsp_band band = {sizeof band, DSP_PEAK, 1000, 200, 0, 0, -12.0};
    const double hz[] = {1000.0, 20.0};
    double real[2], imaginary[2];
    dsp_equaliser* equaliser = NULL;
    int32_t inverted = 0;
    OK(dsp_equaliser_create(&equaliser, &g_error));
    OK(dsp_equaliser_set_bands(equaliser, &band, 1, &g_error));
    OK(dsp_equaliser_prepare(equaliser, &format, &g_error));
    OK(dsp_equaliser_response(equaliser, hz, real, imaginary, 2));
    EXPECT(fabs(20.0 * log10(hypot(real[0], imaginary[0])) + 12.0) < 0.01);
    EXPECT(fabs(hypot(real[1], imaginary[1]) - 1.0) < 0.01);
    OK(dsp_equaliser_invert(equaliser, 1));
    OK(dsp_equaliser_is_inverted(equaliser, &inverted));
    EXPECT(inverted == 1);
    band.gain = 0.05;
    EXPECT(dsp_equaliser_set_bands(equaliser, &band, 1, &g_error) == DSP_OUT_OF_RANGE);
    OK(dsp_close(equaliser));
}

/* The level of one frequency, by correlation over the middle half. */
static double Level(const float* samples, int frames, double hz, double rate) {
    double re = 0.0, im = 0.0;
    int i, first = frames / 4, last = frames * 3 / 4;
    for (i = first; i < last; ++i) {
        re += samples[i] * cos(2.0 * kPi * hz * i / rate);
        im += samples[i] * sin(2.0 * kPi * hz * i / rate);
    }
    return 2.0 * hypot(re, im) / (last - first);
}

static void UseConverterAndPitchShift(const float* sine) {
    const dsp_conversion conversion = {sizeof conversion, kRate,   44100,           1,
                                       DSP_F32,           DSP_F32, DSP_DITHER_NONE, 0};
    const dsp_shift shift = {sizeof shift, kRate, 1, DSP_ENGINE_NEW, 0, 0, 12.0, 1.0};
    float* const out = malloc(2 * kFrames * sizeof *out);
    dsp_converter* converter = NULL;
    dsp_pitch_shift* pitch = NULL;
    int64_t frames = 0, most = 0;
    int32_t written = 0, total = 0;
    OK(dsp_converter_create(&conversion, &converter, &g_error));
    OK(dsp_converter_frames(converter, kFrames, &frames, &most));
    EXPECT(frames == 44100 && most >= frames);
    OK(dsp_converter_factors(converter, &total, &written));
    EXPECT(total == 147 && written == 160);
    EXPECT(dsp_converter_process(converter, sine, kFrames, out, 44000, &written) == DSP_TOO_SMALL);
    OK(dsp_converter_process(converter, sine, kFrames, out, (int32_t)most, &total));
    do {
        OK(dsp_converter_finish(converter, out + total, 2 * kFrames - total, &written));
        total += written;
    } while (written > 0);
    EXPECT(total == 44100);
    EXPECT(fabs(Level(out, total, 440.0, 44100.0) - 0.5) < 0.001);
    OK(dsp_close(converter));

    OK(dsp_pitch_shift_create(&shift, &pitch, &g_error));
    OK(dsp_pitch_shift_feed(pitch, sine, kFrames));
    OK(dsp_pitch_shift_finish(pitch));
    OK(dsp_pitch_shift_take(pitch, out, 2 * kFrames, &written));
    EXPECT(written == kFrames);
    EXPECT(Level(out, written, 880.0, kRate) > 0.3);
    OK(dsp_close(pitch));
    free(out);
}

static void UseTransform(void) {
    double values[8] = {1.0, 0.0, -1.0, 0.0, 1.0, 0.0, -1.0, 0.0};
    dsp_transform* transform = NULL;
    OK(dsp_transform_create(8, 0, &transform, &g_error));
    OK(dsp_transform_f64(transform, values, 0));
    EXPECT(fabs(values[4] - 4.0) < 1e-12 && fabs(values[2]) < 1e-12);
    OK(dsp_transform_f64(transform, values, 1));
    EXPECT(fabs(values[0] - 1.0) < 1e-12);
    EXPECT(dsp_transform_create(9, 0, &transform, &g_error) == DSP_OUT_OF_RANGE);
    OK(dsp_close(transform));
}

static void UseAnalyser(const float* sine) {
    dsp_tuner_reading reading = {sizeof reading, 0, 0, 0, 0.0, 0.0, 0.0, 0.0};
    dsp_analyser* analyser = NULL;
    uint32_t* pixels;
    float *levels, *frequencies;
    size_t bins = 0, rows = 0, loudest = 0, k;
    double hz = 0.0, level = 0.0;
    char name[8];
    int32_t fresh = 0, checked = 0, command = 0, i;
    OK(dsp_analyser_create(kRate, &analyser, &g_error));
    for (i = 0; i < dsp_menu_entries(); ++i) {
        OK(dsp_menu_command(i, &command));
        OK(dsp_analyser_is_checked(analyser, command, &checked));
    }
    EXPECT(dsp_analyser_command(analyser, 1) == DSP_UNKNOWN);
    OK(dsp_analyser_switch(analyser, DSP_TUNER_ON, 1));
    OK(dsp_analyser_switch(analyser, DSP_SHOW_SONOGRAM, 1));
    OK(dsp_analyser_is_on(analyser, DSP_SHOW_SONOGRAM, &checked));
    OK(dsp_analyser_is_on(analyser, DSP_FROZEN, &fresh));
    EXPECT(checked == 1 && fresh == 0);
    OK(dsp_sonogram_resize(analyser, 64, 32));
    for (i = 0; i + 1600 <= kFrames; i += 1600) {
        OK(dsp_analyser_feed_f32(analyser, sine + i, 1600, 1));
        OK(dsp_analyser_refresh(analyser, &fresh));
    }
    EXPECT(fresh);
    OK(dsp_analyser_tuner(analyser, &reading));
    EXPECT(reading.note == 0 && reading.octave == 4 && fabs(reading.cents) < 2.0);
    OK(dsp_note_name(reading.note, name, sizeof name, NULL));
    EXPECT(strcmp(name, "A") == 0);
    OK(dsp_analyser_highest_peak(analyser, 0.0, &hz, &level));
    EXPECT(fabs(hz - 440.0) < 1.0 && fabs(level + 6.02) < 0.5);

    OK(dsp_analyser_spectrum(analyser, DSP_SPECTRUM_NOW, NULL, 0, &bins));
    levels = malloc(bins * sizeof *levels);
    frequencies = malloc(bins * sizeof *frequencies);
    OK(dsp_analyser_spectrum(analyser, DSP_SPECTRUM_NOW, levels, bins, NULL));
    OK(dsp_analyser_frequencies(analyser, frequencies, bins, NULL));
    for (k = 1; k < bins; ++k)
        if (levels[k] > levels[loudest]) loudest = k;
    EXPECT(fabs(frequencies[loudest] - 440.0) < frequencies[1]);
    EXPECT(dsp_analyser_spectrum(analyser, DSP_SPECTRUM_NOW, levels, bins - 1, NULL) == DSP_TOO_SMALL);

    pixels = calloc(320 * 200, sizeof *pixels);
    OK(dsp_sonogram_pixels(analyser, pixels, 320 * 200, &rows));
    EXPECT(rows == 64 * 32);
    for (k = 0, loudest = 0; k < 32; ++k)
        if (pixels[k * 64 + 63] >> 24 > pixels[loudest * 64 + 63] >> 24) loudest = k;
    OK(dsp_sonogram_frequencies(analyser, frequencies, bins, &rows));
    EXPECT(rows == 32 && fabs(log2(frequencies[loudest] / 440.0)) < 0.5);
#ifdef DSP_TEST_DRAWS
    {
        const dsp_picture picture = {sizeof picture, 320, 200, 320 * 4, pixels, 96.0f, 0.0f};
        dsp_drawing* drawing = NULL;
        OK(dsp_drawing_create(&drawing, &g_error));
        memset(pixels, 0, 320 * 200 * sizeof *pixels);
        OK(dsp_draw(drawing, analyser, DSP_VIEW_SPECTRUM, &picture, &g_error));
        for (k = 0, i = 0; k < 320 * 200; ++k) i += pixels[k] != pixels[0];
        EXPECT(i > 320);
        EXPECT(dsp_draw(drawing, analyser, 99, &picture, &g_error) == DSP_OUT_OF_RANGE);
        EXPECT(dsp_draw((dsp_drawing*)analyser, analyser, 0, &picture, NULL) == DSP_OTHER_KIND);
        OK(dsp_close(drawing));
    }
#endif
    free(levels);
    free(frequencies);
    free(pixels);
    OK(dsp_close(analyser));
}

int main(void) {
    float* const samples = malloc(kFrames * sizeof *samples);
    UseEffects(samples);
    UseTail(samples);
    UseSidechain(samples);
    UseEqualiser();
    Sine(samples, kFrames, 440.0);
    UseConverterAndPitchShift(samples);
    UseTransform();
    UseAnalyser(samples);
    free(samples);
    printf("version %u: every part of the C interface answers\n", (unsigned)dsp_version() >> 16);
    return 0;
}
