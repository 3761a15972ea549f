"""Effects, equaliser, sample-rate conversion, pitch shift and analysers for NumPy arrays of audio.

    import dspdll as dsp
    y = dsp.Compressor(preset="Studio Vocal")(x, 48000)

Arrays are (frames,) or (frames, channels), float32 or float64, full scale being 1: as soundfile.read gives
them. axis=1 takes (channels, frames). Results have the input's order and type. Wherever samples are
processed, other threads go on.

dsp.effects.__all__ lists the effects; help(dsp.Echo) tells every parameter of one.
"""

from . import effects
from ._native import version as __version__
from .analysis import Sonogram, Spectrum, Tuning, sonogram, spectrum, tune
from .chain import Chain
from .conversion import convert, pitch
from .effect import Effect, Parameter, Parameters
from .effects import *
from .equalizer import Band, Equalizer
from .files import render
from .processor import Processor, Stream

__all__ = [
    "Band", "Chain", "Effect", "Equalizer", "Parameter", "Parameters", "Processor", "Sonogram", "Spectrum",
    "Stream", "Tuning", "convert", "effects", "pitch", "render", "sonogram", "spectrum", "tune",
]
__all__ += effects.__all__
