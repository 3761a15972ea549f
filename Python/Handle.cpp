#include "Handle.h"

#include <new>
#include <stdexcept>

namespace python {

void Throw(dsp_status status, const char* text) {
    const std::string sentence = *text ? text : dsp_status_text(status);
    switch (status) {
        case DSP_NO_MEMORY:
            throw std::bad_alloc();
        case DSP_OUT_OF_RANGE:
        case DSP_UNKNOWN:
        case DSP_NOT_UNDERSTOOD:
        case DSP_UNSUPPORTED:
            throw std::invalid_argument(sentence);
        default:
            throw std::runtime_error(sentence);
    }
}

void DSP_CALL TellTempo(void* bpm, dsp_tempo* tempo) { tempo->bpm = *static_cast<const double*>(bpm); }

}  // namespace python
