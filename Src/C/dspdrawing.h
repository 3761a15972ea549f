/* Drawing an analyser into pixels. On Windows DSPDll has these functions; elsewhere the library DSPDrawing,
 * so that a host that does not draw does not load Cairo. */
#ifndef DSPDRAWING_C_H
#define DSPDRAWING_C_H

#include "C/dspdll.h"

#ifdef __cplusplus
extern "C" {
#endif

/* What can be drawn. */
enum {
    DSP_VIEW_DISPLAY = 0,  /* what the display mode says, the tuner in a strip above it while that is on */
    DSP_VIEW_SPECTRUM = 1, /* with its scales */
    DSP_VIEW_SONOGRAM = 2, /* with its scales */
    DSP_VIEW_BOTH = 3,     /* the spectrum above the sonogram */
    DSP_VIEW_COLOURS = 4,  /* the sonogram's scale of colours */
    DSP_VIEW_TUNER = 5,    /* all of it: note and dial */
    DSP_VIEW_NOTE = 6,     /* between ripples that light up with its error */
    DSP_VIEW_NEEDLE = 7    /* a dial, and what there is to read below it */
};

/* Fills a picture. */
typedef struct dsp_picture {
    uint32_t size;         /* of this record, in bytes */
    int32_t width, height; /* pixels, 1 to 16384 */
    int32_t stride;        /* bytes from one row to the next, a multiple of 4; rows go down */
    uint32_t* pixels;      /* 0xRRGGBB in the machine's byte order; the top byte means nothing */
    float dpi;             /* dots per inch, above 0; 96 is 100 % */
    float reserved;        /* 0 */
} dsp_picture;

/* What is kept between pictures: brushes, texts, the typeface. One thread draws, the analysers' display
 * thread. */
typedef struct dsp_drawing dsp_drawing;
/* With the typeface of now. */
DSP_C_API dsp_status DSP_CALL dsp_drawing_create(dsp_drawing** drawing, dsp_error* error);
/* Fills `picture` with a DSP_VIEW_... of the analyser; may allocate. */
DSP_C_API dsp_status DSP_CALL dsp_draw(dsp_drawing* drawing, dsp_analyser* analyser, int32_t view,
                                       const dsp_picture* picture, dsp_error* error);
/* The file of the typeface of drawings made from now on; null or empty for the installed one. A file that
 * cannot be read is as none. */
DSP_C_API dsp_status DSP_CALL dsp_drawing_font(const char* path, dsp_error* error);

#ifdef __cplusplus
}
#endif
#endif
