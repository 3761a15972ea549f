/* A host of another compiler family, with nothing but the header and the import library: it brings no C
 * library, because none of that family's is here. The exit status is the number of what failed first. */
#include "C/dspdll.h"
#include "C/dspdrawing.h"

int _fltused = 0; /* this family's compilers ask for it where numbers have fractions */

enum { kFrames = 64 };
static float g_samples[2 * kFrames];
static dsp_effect* g_gain;
static const void* volatile g_function;
static double g_asked;
static const dsp_format g_format = {sizeof(dsp_format), 48000, 2, DSP_F32, kFrames};

/* The program only starts when the DLL has every function of the headers. */
static void NeedAllFunctions(void) {
#define FUNCTION(name) g_function = (const void*)&name;
#include "functions.inc"
#undef FUNCTION
}

static void DSP_CALL Tempo(void* user, dsp_tempo* tempo) {
    *(double*)user += 1.0;
    tempo->bpm = 60.0;
}

static int CallsBack(void) {
    dsp_effect* echo = 0;
    const int played = dsp_effect_create("Echo", &echo, 0) == DSP_OK &&
                       dsp_effect_set_preset(echo, 1) == DSP_OK && /* its delay is in notes */
                       dsp_effect_tempo_callback(echo, Tempo, &g_asked) == DSP_OK &&
                       dsp_effect_prepare(echo, &g_format, 0) == DSP_OK &&
                       dsp_effect_process_f32(echo, g_samples, kFrames) == DSP_OK;
    return dsp_close(echo) == DSP_OK && played && g_asked > 0.0;
}

static int Halves(void) {
    float value = 0.0f;
    int32_t level = -1, i;
    if (dsp_effect_find_parameter(g_gain, "Gain", &level, 0) != DSP_OK ||
        dsp_effect_text_to_value(g_gain, level, "-6.0 dB", &value, 0) != DSP_OK ||
        dsp_effect_set(g_gain, level, value) != DSP_OK || dsp_effect_prepare(g_gain, &g_format, 0) != DSP_OK)
        return 0;
    for (i = 0; i < 2 * kFrames; ++i) g_samples[i] = 0.5f;
    if (dsp_effect_process_f32(g_gain, g_samples, kFrames) != DSP_OK) return 0;
    for (i = 0; i < 2 * kFrames; ++i)
        if (g_samples[i] < 0.2500f || g_samples[i] > 0.2512f) return 0; /* 0.5 * 10^(-6/20) = 0.25059 */
    return 1;
}

static int Check(void) {
    dsp_effect* const none = 0;
    NeedAllFunctions();
    if (dsp_version() >> 16 != 1) return 1;
    if (dsp_effect_create("Gain", &g_gain, 0) != DSP_OK) return 2;
    if (!Halves()) return 3;
    if (!CallsBack()) return 4;
    if (dsp_effect_reset(none) != DSP_NULL) return 5;
    if (dsp_close(g_gain) != DSP_OK) return 6;
    return dsp_effect_reset(g_gain) == DSP_CLOSED ? 0 : 7;
}

int mainCRTStartup(void) { return Check(); }
