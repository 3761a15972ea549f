#!/usr/bin/env python3
"""Python: a chain on an array, the same as a stream, and what the result is made of."""

import numpy as np

import dspdll as dsp

rate = 48000
seconds = np.arange(2 * rate) / rate
voice = 0.3 * np.sin(2 * np.pi * 220 * seconds) + 0.1 * np.sin(2 * np.pi * 60 * seconds)  # a note, and mains hum
voice = np.stack([voice, voice], axis=1)  # frames, channels

chain = dsp.Chain([dsp.Equalizer(["120 highpass", "120 highpass"]), dsp.Echo(mix="30 %")])
chain[1].depth = "250 ms"  # both sides; chain[1].parameters shows everything there is
print(chain)

# An array at once: as long as it was, and in its place.
result = chain(voice, rate)
assert result.shape == voice.shape

# The same in blocks, as a player would.
stream = chain.stream(rate, 2)
blocks = [stream(voice[start : start + 512]) for start in range(0, len(voice), 512)]
assert np.allclose(np.concatenate(blocks), result)

# What is in it: the hum has gone, the note is in tune.
before, after = dsp.spectrum(voice, rate, length=16384), dsp.spectrum(result, rate, length=16384)
hum = np.argmin(np.abs(before.frequencies - 60))
print(f"hum: {before.levels[hum]:.0f} dB before, {after.levels[hum]:.0f} dB after; {dsp.tune(result, rate)}")
assert after.levels[hum] < before.levels[hum] - 12
assert dsp.tune(result, rate).note == "A3"
