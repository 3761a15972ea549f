/* The C interface, which every language can call: a compressor set up with texts, on loud sound. */
#include <math.h>
#include <stdio.h>

#include "C/dspdll.h"

enum { RATE = 48000, FRAMES = 512 };

static dsp_error error = {sizeof error, ""};

/* Every call gives a status; many also a sentence. */
static int ok(dsp_status status) {
    if (status != DSP_OK) fprintf(stderr, "%s: %s\n", dsp_status_text(status), error.text);
    return status == DSP_OK;
}

static int set(dsp_effect* effect, const char* name, const char* text) {
    int32_t parameter;
    float value;
    return ok(dsp_effect_find_parameter(effect, name, &parameter, &error)) &&
           ok(dsp_effect_text_to_value(effect, parameter, text, &value, &error)) &&
           ok(dsp_effect_set(effect, parameter, value));
}

int main(void) {
    dsp_format format = {sizeof format, RATE, 1, DSP_F32, FRAMES};
    dsp_effect* compressor = NULL;
    float block[FRAMES], before = 0.0f, after = 0.0f;

    for (int kind = 0; kind < dsp_effect_kinds(); ++kind) {
        char name[64];
        if (!ok(dsp_effect_kind_name(kind, name, sizeof name, NULL))) return 1;
        printf("%s%s", kind == 0 ? "there are " : ", ", name);
    }
    if (!ok(dsp_effect_create("Compressor", &compressor, &error))) return 1;
    if (!set(compressor, "Threshold L", "-20 dB") || !set(compressor, "Ratio L", "4")) return 1;
    if (!ok(dsp_effect_prepare(compressor, &format, &error))) return 1;

    for (int played = 0; played < RATE; played += FRAMES) { /* one second */
        before = after = 0.0f;
        for (int i = 0; i < FRAMES; ++i) {
            block[i] = (float)sin(0.1 * (played + i));
            before = fmaxf(before, fabsf(block[i]));
        }
        if (!ok(dsp_effect_process_f32(compressor, block, FRAMES))) return 1;
        for (int i = 0; i < FRAMES; ++i) after = fmaxf(after, fabsf(block[i]));
    }
    printf("\na peak of %.2f became %.2f\n", before, after);
    return ok(dsp_close(compressor)) && after > 0.05f && after < 0.5f * before ? 0 : 1;
}
