"""Conversion, pitch, equaliser and analysers, against their definitions."""

import io

import dspdll as dsp
import numpy as np
import pytest
from support import RATE, noise, sine


def test_convert_keeps_the_sine_in_its_place():
    for dtype in (np.float32, np.float64):
        y = dsp.convert(sine(997, 1.0, dtype=dtype), RATE, 44100)
        error = y - sine(997, 1.0, 44100)
        assert y.dtype == dtype and y.shape == (44100,) and np.abs(error[500:-500]).max() < 5e-4
    x = noise(3000)
    assert np.array_equal(dsp.convert(x.T, RATE, 96000, axis=1).T, dsp.convert(x, RATE, 96000))
    many = np.repeat(x[:, :1], 5, axis=1)
    assert np.array_equal(dsp.convert(many, RATE, 8000)[:, 4], dsp.convert(x[:, 0], RATE, 8000))
    for wrong in ((RATE, 500), (RATE, 44100.5)):
        with pytest.raises(ValueError):
            dsp.convert(x, *wrong)


def test_pitch_moves_by_semitones_and_stays_in_its_place():
    x = sine(220, 2.0) * (np.arange(2 * RATE) > RATE)
    y = dsp.pitch(x, RATE, 12)
    assert y.shape == x.shape and y.dtype == x.dtype
    assert dsp.tune(y, RATE).frequency == pytest.approx(440, rel=0.003)
    loud = np.flatnonzero(np.abs(y) > 0.25)
    assert abs(loud[0] - RATE) < 0.05 * RATE and loud[-1] > 1.95 * RATE
    assert dsp.pitch(noise(5000), RATE, 3, engine="classic", quality=2).shape == (5000, 2)
    assert len(dsp.pitch(x, RATE, 0, speed=2.0)) == RATE
    for wrong in (dict(semitones=40), dict(semitones=1, engine="best"), dict(semitones=1, speed=99)):
        with pytest.raises(ValueError):
            dsp.pitch(x, RATE, **wrong)


def test_the_equaliser_does_what_its_response_says():
    equaliser = dsp.Equalizer(["80 highpass", "2500 peak -6 q=200", dsp.Band(9000, "highshelf", 3)])
    assert repr(equaliser) == "Equalizer(['80 highpass', '2500 peak -6 q=200', '9000 highshelf 3'])"
    impulse = np.zeros(8 * 8192)
    impulse[0] = 1
    f = np.fft.rfftfreq(len(impulse), 1 / RATE)[1:-1]
    measured = np.fft.rfft(equaliser(impulse, RATE))[1:-1]
    response = equaliser.response(f.reshape(-1, 1), RATE)
    assert response.shape == (len(f), 1) and np.abs(response[:, 0] - measured).max() < 1e-4
    assert 20 * np.log10(abs(equaliser.response(2500.0, RATE))) == pytest.approx(-6, abs=0.1)
    assert np.array_equal(dsp.Equalizer(["80 highpass"], invert=True)(impulse, RATE),
                          -dsp.Equalizer(["80 highpass"])(impulse, RATE))


@pytest.mark.parametrize("window", [np.hanning, np.blackman])
def test_spectrum_is_the_mean_of_windowed_transforms(window):
    x, length = noise(20000), 1024
    found = dsp.spectrum(x, RATE, length=length, window=window.__name__.replace("hanning", "hann"), overlap=0.5)
    # Windows of a transform have their last zero outside.
    shape = window(length + 1)[:-1]
    mono = x.mean(axis=1)
    powers = [np.abs(np.fft.rfft(mono[i:i + length] * shape)[:length // 2] * 2 / shape.sum())**2
              for i in range(0, len(mono) - length + 1, length // 2)]
    expected = 10 * np.log10(np.mean(powers, axis=0)), 10 * np.log10(np.max(powers, axis=0))
    assert np.abs(found.levels - expected[0])[2:].max() < 0.1 and np.abs(found.peaks - expected[1])[2:].max() < 0.1
    turned = dsp.sonogram(x.T, RATE, length=length, window=found.window, axis=-1)
    assert turned.png() == dsp.sonogram(x, RATE, length=length, window=found.window).png() and turned != found
    every = dsp.sonogram(x, RATE, length=length, window=found.window, overlap=0.5)
    assert every.levels.shape == (512, len(powers)) and every.times[1] == pytest.approx(1024 / RATE)
    assert np.abs(every.levels - 10 * np.log10(powers).T)[2:].max() < 0.5


def test_a_full_scale_sine_is_0_decibels():
    hz, level = dsp.spectrum(2 * sine(RATE * 100 / 4096, 1.0), RATE).peak
    assert hz == pytest.approx(RATE * 100 / 4096) and level == pytest.approx(0, abs=0.01)
    assert dsp.spectrum(np.zeros(10), RATE).levels.max() < -200
    for wrong in (dict(length=1000), dict(window="round"), dict(overlap=1.0), dict(axis=3)):
        with pytest.raises(ValueError):
            dsp.spectrum(noise(9), RATE, **wrong)


def test_the_tuner_hears_the_note_and_when_it_ends():
    heard = dsp.tune(np.concatenate([sine(442, 1.5, dtype=np.float32), np.zeros(RATE, np.float32)]), RATE)
    assert heard.note == "A4" and heard.frequency == pytest.approx(442, abs=0.1)
    assert heard.error == pytest.approx(1200 * np.log2(442 / 440), abs=0.2)
    last = heard.times[np.isfinite(heard.frequencies)][-1]
    assert 1.3 < last < 2.0 and heard.notes[-1] == "" and len(heard.times) == len(heard.cents)
    nothing = dsp.tune(np.zeros(RATE), RATE)
    assert nothing.note == "" and np.isnan(nothing.frequency) and nothing._repr_png_()


def test_pictures_show_what_was_heard(tmp_path):
    image = pytest.importorskip("PIL.Image")

    def pixels(png):
        image.open(io.BytesIO(png)).verify()
        return np.asarray(image.open(io.BytesIO(png)).convert("RGB")).astype(int)

    x = sine(1000, 3.0)
    spectrum = dsp.spectrum(x, RATE)
    share = np.log(1000 / 20) / np.log(RATE / 2 / 20)
    curve = pixels(spectrum.png(800, 400))
    assert curve.shape == (400, 800, 3)
    blue = (curve[:, :, 2] - curve[:, :, 0] > 60).sum(axis=0)  # of the filled curve
    assert abs(blue[60:].argmax() + 60 - 800 * share) < 40
    sonogram = pixels(dsp.sonogram(x, RATE).png(800, 400))
    assert abs(sonogram[:, 200:600].sum(axis=(1, 2)).argmax() - 400 * (1 - share)) < 30
    assert pixels(dsp.tune(x, RATE)._repr_png_()).std() > 10
    spectrum.save(tmp_path / "s.png")
    assert (tmp_path / "s.png").read_bytes() == spectrum.png() and "1007" in repr(spectrum) or "996" in repr(spectrum)
    with pytest.raises(ValueError, match="16384"):
        spectrum.png(0, 10)


def test_plots():
    matplotlib = pytest.importorskip("matplotlib")
    matplotlib.use("Agg")
    x = sine(440, 1.0)
    for drawn in (dsp.spectrum(x, RATE), dsp.sonogram(x, RATE), dsp.tune(x, RATE), dsp.Equalizer(["80 highpass"])):
        axes = drawn.plot()
        assert axes.get_xlabel() and (axes.lines or axes.collections)
        matplotlib.pyplot.close(axes.figure)
