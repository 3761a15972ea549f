/* The library for every language that can call C: effects, equaliser, conversion, pitch shift, transform,
 * analyser, tuner, sonogram. C11, and C++11 and later.
 *
 * Handles. What is created is known by a handle; dsp_close ends it, on any thread, while no other uses it. A
 * handle that is null, was closed, or is of another kind gets a status, never a crash.
 *
 * Errors. Every function that can fail returns a dsp_status. Where a sentence says more than the status, the
 * function takes a dsp_error, which may be null; it is written on failure only. A function that failed has
 * changed nothing, unless it says otherwise.
 *
 * Texts are UTF-8. A function that gives one takes a buffer, its size in bytes and `needed`, where it stores
 * the size that the whole text needs, with the zero at its end; `needed` may be null. A null buffer of size 0
 * asks for the size alone and is DSP_OK. What is too small gets as many whole characters as fit, and
 * DSP_TOO_SMALL. Arrays are given the same way, counted in elements, but are left alone where they do not
 * fit.
 *
 * Records begin with their own size, which the caller sets: dsp_format format = {sizeof format}. Later
 * versions may add members at the end, which count as 0 for a caller that does not know them; members that
 * this version does not know are not read. An array of records steps by the first one's size.
 *
 * Threads. An object is used by one thread at a time, but for what the sections below say. Functions for the
 * audio thread neither allocate nor wait once their object is prepared.
 *
 * Cost. A block costs some nanoseconds a frame; create and prepare make memory, up to some megabytes; texts
 * and states copy what they give; a transform takes n log n. */
#ifndef DSPDLL_C_H
#define DSPDLL_C_H

#include <stddef.h>
#include <stdint.h>

#if !defined(_WIN32)
/* What the library exports. */
#define DSP_C_API __attribute__((visibility("default")))
/* How functions are called; it means something in 32-bit programs on Windows only. */
#define DSP_CALL
#else
#define DSP_CALL __cdecl
#if defined(DSPDLL_BUILDING)
#define DSP_C_API __declspec(dllexport)
#elif defined(DSPDLL_STATIC)
#define DSP_C_API
#else
#define DSP_C_API __declspec(dllimport)
#endif
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Status, version, handles ---- */

/* What every function that can fail returns. */
typedef int32_t dsp_status;
/* Its values. */
enum {
    DSP_OK = 0,             /* done */
    DSP_NULL = 1,           /* a pointer or handle that must not be null is */
    DSP_CLOSED = 2,         /* the handle was closed, or never was one */
    DSP_OTHER_KIND = 3,     /* the handle is of another kind */
    DSP_OUT_OF_RANGE = 4,   /* a number is outside what the function accepts */
    DSP_TOO_SMALL = 5,      /* the buffer is; `needed` says how large it has to be */
    DSP_UNKNOWN = 6,        /* there is nothing of this name */
    DSP_NOT_UNDERSTOOD = 7, /* the text or the bytes mean nothing here */
    DSP_UNPREPARED = 8,     /* the object is not prepared for this call */
    DSP_UNSUPPORTED = 9,    /* the object cannot do this at all */
    DSP_NO_MEMORY = 10,     /* there was none; the call may be repeated */
    DSP_BAD_RECORD = 11,    /* a record's size is none that it ever had */
    DSP_FAILED = 12         /* anything else; the dsp_error says what */
};

/* Where a function may write what went wrong. */
typedef struct dsp_error {
    uint32_t size;  /* 0 gets no text */
    char text[508]; /* a sentence */
} dsp_error;

/* What a status means, in a few words; static. Never null. */
DSP_C_API const char* DSP_CALL dsp_status_text(dsp_status status);
/* Of the library that is loaded: major << 16 | minor << 8 | patch. Within a major version the functions and
 * records below only become more. */
DSP_C_API uint32_t DSP_CALL dsp_version(void);
/* Ends what a handle stands for, of any kind. Null is DSP_OK. */
DSP_C_API dsp_status DSP_CALL dsp_close(void* handle);

/* How a sample is stored. Functions whose names end in _f32 and _f64 take floats and doubles. */
enum { DSP_S16 = 0, DSP_S24 = 1, DSP_F32 = 2, DSP_F64 = 3 };

/* What blocks look like. */
typedef struct dsp_format {
    uint32_t size;      /* of this record, in bytes */
    int32_t rate;       /* Hz, above 0 */
    int32_t channels;   /* 1 or 2 */
    int32_t sample;     /* DSP_F32 or DSP_F64 */
    int32_t max_frames; /* the longest piece processed at once, 1 to 1048576; longer blocks are cut */
} dsp_format;

/* ---- Effects ----
 *
 * Create, set up, prepare, then process block by block; prepare again when the format changes. Processing,
 * seek, rewind, the side-chain's samples, the tail and its gap belong to the audio thread. Parameters,
 * presets, state, texts, latency and tempo_changed belong to one other thread, at the same time. Prepare,
 * reset, automate, the tempo callback and the side-chain's channels are called while neither thread uses the
 * effect.
 */

/* One effect. */
typedef struct dsp_effect dsp_effect;

/* How many kinds there are, and their names, from 0; DSP_OUT_OF_RANGE for others. Constant; any thread. */
DSP_C_API int32_t DSP_CALL dsp_effect_kinds(void);
DSP_C_API dsp_status DSP_CALL dsp_effect_kind_name(int32_t kind, char* buffer, size_t size, size_t* needed);
/* By name, in letters of either case, with the default preset; DSP_UNKNOWN for another name. */
DSP_C_API dsp_status DSP_CALL dsp_effect_create(const char* name, dsp_effect** effect, dsp_error* error);
/* The name of its kind. */
DSP_C_API dsp_status DSP_CALL dsp_effect_name(dsp_effect* effect, char* buffer, size_t size, size_t* needed);

/* Makes all memory and starts the stream at position 0. A format that cannot be changes nothing and is
 * DSP_OUT_OF_RANGE; after DSP_NO_MEMORY the effect is not prepared. */
DSP_C_API dsp_status DSP_CALL dsp_effect_prepare(dsp_effect* effect, const dsp_format* format,
                                                 dsp_error* error);
/* Forgets the sound and starts the stream anew, prepared as before; DSP_UNPREPARED if it never was. */
DSP_C_API dsp_status DSP_CALL dsp_effect_reset(dsp_effect* effect);
/* Processes a block in place, any number of frames: interleaved, or one pointer per channel. The samples are
 * what the effect was prepared for, else DSP_UNPREPARED. DSP_OUT_OF_RANGE for a negative number. */
DSP_C_API dsp_status DSP_CALL dsp_effect_process_f32(dsp_effect* effect, float* samples, int32_t frames);
DSP_C_API dsp_status DSP_CALL dsp_effect_process_f64(dsp_effect* effect, double* samples, int32_t frames);
DSP_C_API dsp_status DSP_CALL dsp_effect_process_planar_f32(dsp_effect* effect, float* const* channels,
                                                            int32_t frames);
DSP_C_API dsp_status DSP_CALL dsp_effect_process_planar_f64(dsp_effect* effect, double* const* channels,
                                                            int32_t frames);
/* How many frames the output is later than the input, at the prepared format; may change with parameters.
 * DSP_UNPREPARED before. */
DSP_C_API dsp_status DSP_CALL dsp_effect_latency(dsp_effect* effect, int32_t* frames);
/* The stream position of the next block, in frames, which automation is played by; negative while an earlier
 * latency runs out. What sounds goes on: see reset. DSP_OUT_OF_RANGE beyond 2^61 either way. */
DSP_C_API dsp_status DSP_CALL dsp_effect_seek(dsp_effect* effect, int64_t position);
/* Seek for a playback that jumps: the delay lines of Echo, Chorus, Cantrix and Denoiser are cleared, at a
 * small part of what reset costs. What other effects remember goes on. */
DSP_C_API dsp_status DSP_CALL dsp_effect_rewind(dsp_effect* effect, int64_t position);

/* Ringing out, when the stream has ended: start with the most frames the tail may have; process blocks of
 * silence until `finished`; of each block the first `frames` are output; end. What still sounds then, as
 * an echo's feedback does, comes out of further blocks of silence; `gap` is how many seconds may
 * pass between two echoes: wait as long for the next before taking silence for the end. A negative
 * `max_frames` counts as 0: the tail is over with its first block. */
DSP_C_API dsp_status DSP_CALL dsp_effect_start_tail(dsp_effect* effect, int64_t max_frames);
DSP_C_API dsp_status DSP_CALL dsp_effect_tail(dsp_effect* effect, int32_t* frames, int32_t* finished);
DSP_C_API dsp_status DSP_CALL dsp_effect_end_tail(dsp_effect* effect);
DSP_C_API dsp_status DSP_CALL dsp_effect_longest_gap(dsp_effect* effect, double* gap);

/* Side-chain: how many busses there are, and how many channels a bus can have. Announce a bus's channels
 * before preparing; 0 takes it away. Its planar samples, as many as the next block has, hold for that block
 * only; without them the block uses its own signal. DSP_OUT_OF_RANGE for a bus, or a number of channels, that
 * there is not; DSP_UNPREPARED for samples of a bus that was not announced, or other than prepared for. */
DSP_C_API dsp_status DSP_CALL dsp_effect_sidechain_busses(dsp_effect* effect, int32_t* busses);
DSP_C_API dsp_status DSP_CALL dsp_effect_sidechain_most_channels(dsp_effect* effect, int32_t bus,
                                                                 int32_t* channels);
DSP_C_API dsp_status DSP_CALL dsp_effect_sidechain_channels(dsp_effect* effect, int32_t bus,
                                                            int32_t channels);
DSP_C_API dsp_status DSP_CALL dsp_effect_sidechain_f32(dsp_effect* effect, int32_t bus,
                                                       const float* const* channels);
DSP_C_API dsp_status DSP_CALL dsp_effect_sidechain_f64(dsp_effect* effect, int32_t bus,
                                                       const double* const* channels);

/* Tempo. The callback fills the record, which holds 120 bpm and 4/4, on either of the effect's threads; it
 * must neither wait nor throw. Null takes it away. Call dsp_effect_tempo_changed when it would answer
 * something new. */
typedef struct dsp_tempo {
    uint32_t size;                  /* of this record, in bytes */
    int32_t numerator, denominator; /* of the time signature, each above 0 */
    int32_t reserved;               /* 0 */
    double bpm;                     /* beats a minute, above 0 */
} dsp_tempo;
/* What the host fills in when it is asked. */
typedef void(DSP_CALL* dsp_tempo_callback)(void* user, dsp_tempo* tempo);
/* `user` is handed to the callback as it is. */
DSP_C_API dsp_status DSP_CALL dsp_effect_tempo_callback(dsp_effect* effect, dsp_tempo_callback callback,
                                                        void* user);
/* The next block asks for the tempo again. */
DSP_C_API dsp_status DSP_CALL dsp_effect_tempo_changed(dsp_effect* effect);

/* Parameters are numbered from 0. Their values are normalised, 0 to 1; one may stand for a left/right pair.
 * Of these kinds they are: */
enum { DSP_CONTINUOUS = 0, DSP_SWITCH = 1, DSP_LIST = 2 };
enum {
    DSP_TEXT_NAME = 0,  /* what a control is called; both of a left/right pair have the same */
    DSP_TEXT_LABEL = 1, /* the name with its side: different for every parameter */
    DSP_TEXT_UNIT = 2,  /* may be empty */
    DSP_TEXT_VALUE = 3  /* the present value, unit included */
};
/* What a parameter is. */
typedef struct dsp_parameter {
    uint32_t size;   /* of this record, in bytes */
    int32_t kind;    /* DSP_CONTINUOUS, DSP_SWITCH or DSP_LIST */
    int32_t choices; /* of a switch or list */
    float neutral;   /* where a control rests */
} dsp_parameter;
/* How many there are; what one is; its texts, of which `which` is a DSP_TEXT_... DSP_OUT_OF_RANGE for a
 * parameter or text that there is not, here and below. */
DSP_C_API dsp_status DSP_CALL dsp_effect_parameters(dsp_effect* effect, int32_t* count);
DSP_C_API dsp_status DSP_CALL dsp_effect_parameter(dsp_effect* effect, int32_t parameter,
                                                   dsp_parameter* record);
DSP_C_API dsp_status DSP_CALL dsp_effect_parameter_text(dsp_effect* effect, int32_t parameter, int32_t which,
                                                        char* buffer, size_t size, size_t* needed);
/* By label or name, in letters of either case; the left one of a pair that is named without its side.
 * DSP_UNKNOWN for another name. */
DSP_C_API dsp_status DSP_CALL dsp_effect_find_parameter(dsp_effect* effect, const char* name,
                                                        int32_t* parameter, dsp_error* error);
/* A choice's text and the value that sets it, from 0. To see which one is chosen compare texts: other values
 * may mean the same choice. DSP_OUT_OF_RANGE for a choice that there is not. */
DSP_C_API dsp_status DSP_CALL dsp_effect_choice(dsp_effect* effect, int32_t parameter, int32_t choice,
                                                float* value, char* buffer, size_t size, size_t* needed);
/* Its value, 0 to 1. */
DSP_C_API dsp_status DSP_CALL dsp_effect_get(dsp_effect* effect, int32_t parameter, float* value);
/* Takes effect with the next block. DSP_OUT_OF_RANGE for a value outside 0 to 1, or not a number. */
DSP_C_API dsp_status DSP_CALL dsp_effect_set(dsp_effect* effect, int32_t parameter, float value);
/* The text that the effect shows at a value, and the value that a text means: a choice, or a number with or
 * without its unit. Numbers beyond the range are limited to it; DSP_NOT_UNDERSTOOD for what is neither, and
 * DSP_OUT_OF_RANGE for a value outside 0 to 1. Neither changes the effect; both try the value on a copy of
 * it, which takes up to some milliseconds. */
DSP_C_API dsp_status DSP_CALL dsp_effect_value_to_text(dsp_effect* effect, int32_t parameter, float value,
                                                       char* buffer, size_t size, size_t* needed);
DSP_C_API dsp_status DSP_CALL dsp_effect_text_to_value(dsp_effect* effect, int32_t parameter,
                                                       const char* text, float* value, dsp_error* error);

/* From `frame` of the stream on the parameter has this value, before its first point that of the first. */
typedef struct dsp_point {
    int64_t frame;  /* stream position */
    float value;    /* 0 to 1 */
    float reserved; /* 0 */
} dsp_point;
/* Replaces the automation of one parameter by `count` points, which are copied. They are in ascending order
 * and are met to the frame; 0 points end the automation. DSP_UNSUPPORTED where the effect plays none;
 * DSP_OUT_OF_RANGE for points that descend, values outside 0 to 1, and frames beyond 2^61 either way. */
DSP_C_API dsp_status DSP_CALL dsp_effect_automate(dsp_effect* effect, int32_t parameter,
                                                  const dsp_point* points, size_t count);

/* How many there are, from 0; the name of one; and all settings of one at once. DSP_OUT_OF_RANGE for a preset
 * that there is not. */
DSP_C_API dsp_status DSP_CALL dsp_effect_presets(dsp_effect* effect, int32_t* count);
DSP_C_API dsp_status DSP_CALL dsp_effect_preset_name(dsp_effect* effect, int32_t preset, char* buffer,
                                                     size_t size, size_t* needed);
DSP_C_API dsp_status DSP_CALL dsp_effect_set_preset(dsp_effect* effect, int32_t preset);
/* The preset that a new effect has; -1 where there are none. */
DSP_C_API dsp_status DSP_CALL dsp_effect_default_preset(dsp_effect* effect, int32_t* preset);

/* All settings as bytes, to be stored and given back. DSP_NOT_UNDERSTOOD, with nothing changed, for bytes
 * that are no settings of this effect. */
DSP_C_API dsp_status DSP_CALL dsp_effect_state(dsp_effect* effect, void* bytes, size_t size, size_t* needed);
DSP_C_API dsp_status DSP_CALL dsp_effect_set_state(dsp_effect* effect, const void* bytes, size_t size,
                                                   dsp_error* error);

/* ---- Equaliser ----
 *
 * Up to 20 bands. One thread. */

/* One equaliser. */
typedef struct dsp_equaliser dsp_equaliser;
/* Types of bands. */
enum {
    DSP_HIGHPASS = 0,
    DSP_HIGHSHELF_BUTTERWORTH = 1,
    DSP_PEAK = 2,
    DSP_LOWSHELF_BUTTERWORTH = 3,
    DSP_LOWPASS = 4,
    DSP_HIGHSHELF = 5,
    DSP_LOWSHELF = 6
};
/* One band. */
typedef struct dsp_band {
    uint32_t size;     /* of this record, in bytes */
    int32_t type;      /* DSP_HIGHPASS to DSP_LOWSHELF */
    int32_t frequency; /* Hz, 1 to 1000000; limited to below half the rate where it is not a peak's */
    int32_t q; /* 1 to 100000; a peak is q/133 octaves wide, shelves slope and passes resonate with q/50 */
    int32_t bypass;   /* other than 0: the band is left out */
    int32_t reserved; /* 0 */
    double gain;      /* dB in tenths, -100 to 100 */
} dsp_band;
/* Without bands, not prepared. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_create(dsp_equaliser** equaliser, dsp_error* error);
/* How many bands were set. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_bands(dsp_equaliser* equaliser, int32_t* count);
/* All bands at once. While it is prepared, each place in the array glides to its new shape within some 3200
 * frames. A band that is new, removed, bypassed or flat (0 dB, no pass) is so from the next frame on, as the
 * equaliser leaves it out: take a peak or shelf to 0.1 dB first and let it arrive, where that would click. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_set_bands(dsp_equaliser* equaliser, const dsp_band* bands,
                                                      int32_t count, dsp_error* error);
/* One of them as it was set; DSP_OUT_OF_RANGE for one that there is not. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_band(dsp_equaliser* equaliser, int32_t band, dsp_band* record);
/* Inverted polarity. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_invert(dsp_equaliser* equaliser, int32_t invert);
DSP_C_API dsp_status DSP_CALL dsp_equaliser_is_inverted(dsp_equaliser* equaliser, int32_t* inverted);
/* `max_frames` is not used: nothing is cut. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_prepare(dsp_equaliser* equaliser, const dsp_format* format,
                                                    dsp_error* error);
/* Any number of interleaved frames in place, of the samples it was prepared for, else DSP_UNPREPARED;
 * DSP_OUT_OF_RANGE for a negative number. Neither allocates nor waits. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_process_f32(dsp_equaliser* equaliser, float* samples,
                                                        int32_t frames);
DSP_C_API dsp_status DSP_CALL dsp_equaliser_process_f64(dsp_equaliser* equaliser, double* samples,
                                                        int32_t frames);
/* The curve at `count` frequencies in Hz, when all glides have ended: real and imaginary parts, either may be
 * null. DSP_UNPREPARED before the equaliser knows a rate. */
DSP_C_API dsp_status DSP_CALL dsp_equaliser_response(dsp_equaliser* equaliser, const double* frequencies,
                                                     double* real, double* imaginary, size_t count);

/* ---- Converter ----
 *
 * Sample rate and sample format; frame n of the output stands where n * in_rate / out_rate of the input
 * stood. One thread. */

/* One conversion under way. */
typedef struct dsp_converter dsp_converter;
/* No dither, white noise, and noise moved to where the ear hears less of it, a little and as far as it goes.
 */
enum { DSP_DITHER_NONE = 0, DSP_DITHER_FLAT = 1, DSP_DITHER_GENTLE = 2, DSP_DITHER_STRONG = 3 };
/* What is converted into what. */
typedef struct dsp_conversion {
    uint32_t size;                 /* of this record, in bytes */
    int32_t in_rate, out_rate;     /* 1000 to 768000 Hz */
    int32_t channels;              /* 1 to 48, interleaved */
    int32_t in_sample, out_sample; /* DSP_S16 to DSP_F64 */
    int32_t dither;                /* DSP_DITHER_..., for DSP_S16 and DSP_S24 */
    int32_t nearest; /* 1: small factors, quicker, refused where they miss the rate by over 20 cents */
} dsp_conversion;
/* Ready for the first block. DSP_OUT_OF_RANGE, with a sentence, for what it cannot convert. */
DSP_C_API dsp_status DSP_CALL dsp_converter_create(const dsp_conversion* conversion,
                                                   dsp_converter** converter, dsp_error* error);
/* Frames that a recording of so many becomes, and the most that one block of so many gives. DSP_OUT_OF_RANGE
 * below 0 and from 2^38 on. */
DSP_C_API dsp_status DSP_CALL dsp_converter_frames(dsp_converter* converter, int64_t in_frames,
                                                   int64_t* out_frames, int64_t* most_of_a_block);
/* It converts by up / down, which differs from the rates' ratio only with `nearest`. Either may be null. */
DSP_C_API dsp_status DSP_CALL dsp_converter_factors(dsp_converter* converter, int32_t* up, int32_t* down);
/* Converts a block into `out`, which has room for `capacity` frames: at least the most that the block gives,
 * else DSP_TOO_SMALL and nothing is done. The buffers must not overlap. DSP_OUT_OF_RANGE for a negative
 * number of frames, DSP_UNPREPARED after finish. */
DSP_C_API dsp_status DSP_CALL dsp_converter_process(dsp_converter* converter, const void* in, int32_t frames,
                                                    void* out, int32_t capacity, int32_t* written);
/* After the last block, until it writes nothing: what is left. `capacity` as for a block of 1 frame. */
DSP_C_API dsp_status DSP_CALL dsp_converter_finish(dsp_converter* converter, void* out, int32_t capacity,
                                                   int32_t* written);

/* ---- Pitch shift of whole recordings ----
 *
 * Aligned and, but for the speed, as long as they were. One thread; it allocates as it goes. */

/* One recording under way. */
typedef struct dsp_pitch_shift dsp_pitch_shift;
/* Classic works in frames of a fixed length; new lays pieces of the sound where they fit best. */
enum { DSP_ENGINE_CLASSIC = 0, DSP_ENGINE_NEW = 1 };
/* What is done to it. */
typedef struct dsp_shift {
    uint32_t size;    /* of this record, in bytes */
    int32_t rate;     /* 1000 to 768000 Hz */
    int32_t channels; /* 1 or 2, interleaved */
    int32_t engine;   /* DSP_ENGINE_... */
    int32_t quality;  /* from 0, fastest first */
    int32_t reserved; /* 0 */
    double semitones; /* -36 to 36 */
    double speed;     /* 0.1 to 10, 1 for DSP_ENGINE_CLASSIC; 0 counts as 1 */
} dsp_shift;
/* Ready for the recording. DSP_OUT_OF_RANGE, with a sentence, for what it cannot do. */
DSP_C_API dsp_status DSP_CALL dsp_pitch_shift_create(const dsp_shift* shift, dsp_pitch_shift** pitch_shift,
                                                     dsp_error* error);
/* The next frames, which are copied. DSP_OUT_OF_RANGE for a negative number, DSP_UNPREPARED after finish. */
DSP_C_API dsp_status DSP_CALL dsp_pitch_shift_feed(dsp_pitch_shift* pitch_shift, const float* samples,
                                                   int32_t frames);
/* The recording has ended; nothing is fed after that. */
DSP_C_API dsp_status DSP_CALL dsp_pitch_shift_finish(dsp_pitch_shift* pitch_shift);
/* What is ready, at most `capacity` frames; DSP_OUT_OF_RANGE where that is negative. */
DSP_C_API dsp_status DSP_CALL dsp_pitch_shift_take(dsp_pitch_shift* pitch_shift, float* samples,
                                                   int32_t capacity, int32_t* written);

/* ---- Transform ----
 *
 * In place, of one length, a power of two from 2 to 524288. One thread.
 *
 * Real: `length` values become the packed spectrum: the real parts of bin 0 and of bin length/2, then real
 * and imaginary part of bins 1, 2 and so on. Complex: `length` points, real and imaginary parts in turn.
 * Forward is unscaled, inverse scaled by 1/length. */

/* Transforms of one length. */
typedef struct dsp_transform dsp_transform;
/* Of `length` real values or, where `complex_points` is not 0, as many points. All memory is made here.
 * DSP_OUT_OF_RANGE for any other length than those above. */
DSP_C_API dsp_status DSP_CALL dsp_transform_create(int32_t length, int32_t complex_points,
                                                   dsp_transform** transform, dsp_error* error);
/* `inverse`: 0 forward, else back. Takes `length` values, or twice as many where they are points. */
DSP_C_API dsp_status DSP_CALL dsp_transform_f32(dsp_transform* transform, float* values, int32_t inverse);
DSP_C_API dsp_status DSP_CALL dsp_transform_f64(dsp_transform* transform, double* values, int32_t inverse);

/* ---- Analyser, tuner, sonogram ----
 *
 * Feed belongs to the audio thread, all else to the display thread. A command reaches every analyser of the
 * process: give it on the display thread, or while none is refreshed, read or drawn. */

/* One analyser, with its tuner and its sonogram. */
typedef struct dsp_analyser dsp_analyser;
/* For sound of `rate` Hz, above 0, else DSP_OUT_OF_RANGE; on, its tuner off. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_create(int32_t rate, dsp_analyser** analyser, dsp_error* error);
/* Switches: the analyser (on at first), its tuner, its frozen state, and what a drawing of it shows beside
 * the spectrum. Off or frozen, it hears nothing; its sonogram goes on behind a gap of that length. */
enum { DSP_ANALYSER_ON = 0, DSP_TUNER_ON = 1, DSP_FROZEN = 2, DSP_SHOW_SONOGRAM = 3, DSP_SHOW_INFO = 4 };
/* Turns one of them on, or off with 0, and says whether it is on. DSP_OUT_OF_RANGE for another switch. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_switch(dsp_analyser* analyser, int32_t which, int32_t on);
DSP_C_API dsp_status DSP_CALL dsp_analyser_is_on(dsp_analyser* analyser, int32_t which, int32_t* on);
/* Interleaved; the mean of the channels, 1 to 64, is analysed. DSP_OUT_OF_RANGE for other numbers of channels
 * and for a negative number of frames. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_feed_f32(dsp_analyser* analyser, const float* samples,
                                                    int32_t frames, int32_t channels);
DSP_C_API dsp_status DSP_CALL dsp_analyser_feed_f64(dsp_analyser* analyser, const double* samples,
                                                    int32_t frames, int32_t channels);
/* One refresh of the display, 30 times a second; `fresh` says whether there is something new. May be null. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_refresh(dsp_analyser* analyser, int32_t* fresh);
/* Levels of the bins from 0 Hz up, dB below a full-scale sine, and their frequencies, Hz. Bin 0 also holds
 * what stands at half the rate. */
enum { DSP_SPECTRUM_NOW = 0, DSP_SPECTRUM_SMOOTHED = 1, DSP_SPECTRUM_PEAKS = 2 };
/* `which` is a DSP_SPECTRUM_..., else DSP_OUT_OF_RANGE. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_spectrum(dsp_analyser* analyser, int32_t which, float* decibels,
                                                    size_t count, size_t* needed);
/* As many as levels. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_frequencies(dsp_analyser* analyser, float* hz, size_t count,
                                                       size_t* needed);
/* The highest peak from `lowest` Hz up, between bins; 0 Hz and -300 dB where there is none. DSP_OUT_OF_RANGE
 * where `lowest` is not a number. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_highest_peak(dsp_analyser* analyser, double lowest, double* hz,
                                                        double* decibels);
/* The peaks begin anew. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_forget_peaks(dsp_analyser* analyser);

/* The menu: entries from 0, each with its command, its group's title and its text. It is constant: these may
 * be asked on any thread. A command goes to the analyser on the display thread, as does the question whether
 * it has a tick. DSP_OUT_OF_RANGE for an entry, DSP_UNKNOWN for a command that the menu does not have. */
DSP_C_API int32_t DSP_CALL dsp_menu_entries(void);
DSP_C_API dsp_status DSP_CALL dsp_menu_command(int32_t entry, int32_t* command);
DSP_C_API dsp_status DSP_CALL dsp_menu_group(int32_t entry, char* buffer, size_t size, size_t* needed);
DSP_C_API dsp_status DSP_CALL dsp_menu_text(int32_t entry, char* buffer, size_t size, size_t* needed);
DSP_C_API dsp_status DSP_CALL dsp_analyser_command(dsp_analyser* analyser, int32_t command);
DSP_C_API dsp_status DSP_CALL dsp_analyser_is_checked(dsp_analyser* analyser, int32_t command,
                                                      int32_t* checked);

/* What a tuner shows. */
typedef struct dsp_tuner_reading {
    uint32_t size;     /* of this record, in bytes */
    int32_t note;      /* 0 A to 11 G#; -1 for none, and then the rest is 0 */
    int32_t octave;    /* changes at C: 440 Hz is the A of octave 4 */
    int32_t centred;   /* within the cents that count as tuned */
    double frequency;  /* Hz, of the note shown */
    double heard;      /* Hz, of what was heard last; 0 for nothing: the note is shown for a while longer */
    double cents;      /* positive when sharp */
    double prominence; /* dB */
} dsp_tuner_reading;
/* What the tuner shows now. */
DSP_C_API dsp_status DSP_CALL dsp_analyser_tuner(dsp_analyser* analyser, dsp_tuner_reading* reading);
/* The name of note 0 to 11 in the naming that the menu chose, without its octave; DSP_OUT_OF_RANGE for
 * others. Any thread. */
DSP_C_API dsp_status DSP_CALL dsp_note_name(int32_t note, char* buffer, size_t size, size_t* needed);

/* The sonogram's picture: as wide and high as asked for, each side 1 to 16384 and at most 2^26 pixels, until
 * a drawing of it needs another size; it moves with every refresh while DSP_SHOW_SONOGRAM is on. Pixels are
 * 0xLLRRGGBB, L the level from 0, silence, to 255, full scale; rows from the highest frequency down, the
 * newest column at the right. DSP_OUT_OF_RANGE for another size. */
DSP_C_API dsp_status DSP_CALL dsp_sonogram_resize(dsp_analyser* analyser, int32_t width, int32_t height);
DSP_C_API dsp_status DSP_CALL dsp_sonogram_pixels(dsp_analyser* analyser, uint32_t* pixels, size_t count,
                                                  size_t* needed);
/* The frequency at the middle of each row, from the top, and what the tuner heard at each column, 0 for
 * nothing that lasted for four refreshes. */
DSP_C_API dsp_status DSP_CALL dsp_sonogram_frequencies(dsp_analyser* analyser, float* hz, size_t count,
                                                       size_t* needed);
DSP_C_API dsp_status DSP_CALL dsp_sonogram_pitches(dsp_analyser* analyser, float* hz, size_t count,
                                                   size_t* needed);

#ifdef __cplusplus
}
#endif
#endif
