"""Effects, chains and streams, against the C interface called directly and against what each of them promises."""

import copy
import ctypes
import pickle
import signal
import threading

import dspdll as dsp
import numpy as np
import pytest
from support import LIBRARY, RATE, noise, sine

EFFECTS = [getattr(dsp, name) for name in dsp.effects.__all__]
# Its engine works in steps of its own: not the same bits in blocks of another length.
BLOCKS = [effect for effect in EFFECTS if effect is not dsp.PitchShift]
each_effect = pytest.mark.parametrize("effect", EFFECTS, ids=lambda effect: effect.__name__)


class Format(ctypes.Structure):
    _fields_ = [(name, ctypes.c_int32) for name in ("size", "rate", "channels", "sample", "max_frames")]


def through_c(effect, x):
    """The effect's preset in C, as a stream of one block."""
    library, handle = ctypes.CDLL(LIBRARY), ctypes.c_void_p()
    samples = x.copy()
    format = Format(20, RATE, x.shape[1], 2 if x.dtype == np.float32 else 3, 1024)
    process = library.dsp_effect_process_f32 if x.dtype == np.float32 else library.dsp_effect_process_f64
    assert 0 == library.dsp_effect_create(effect._table.kind.encode(), ctypes.byref(handle), None)
    if effect.preset:
        assert 0 == library.dsp_effect_set_preset(handle, effect.presets.index(effect.preset))
    assert 0 == library.dsp_effect_prepare(handle, ctypes.byref(format), None)
    assert 0 == process(handle, ctypes.c_void_p(samples.ctypes.data), len(samples))
    assert 0 == library.dsp_close(handle)
    return samples


def presets(effect):
    return [effect(preset) for preset in effect().presets[1:4]] or [effect()]


def test_every_kind_of_the_library_is_a_class():
    assert [effect._table.kind for effect in EFFECTS] == dsp._native.kinds() and len(EFFECTS) >= 9


@each_effect
@pytest.mark.parametrize("dtype", [np.float32, np.float64])
def test_same_samples_as_in_c(effect, dtype):
    x = noise(5000, dtype)
    for fx in presets(effect):
        expected = through_c(fx, np.vstack([x, np.zeros((fx.stream(RATE).latency, 2), dtype)]))
        result = fx(x, RATE)
        assert result.dtype == dtype and np.array_equal(result, expected[len(expected) - len(x):]), fx
        assert np.array_equal(fx(x, RATE), result), "the second call begins afresh"


@each_effect
def test_layouts_and_copies(effect):
    fx = presets(effect)[0]
    x = noise(3000)
    y = fx(x, RATE)
    assert np.array_equal(fx(x.T, RATE, axis=1).T, y) and np.array_equal(fx(np.asfortranarray(x), RATE), y)
    assert np.array_equal(fx(np.repeat(x, 2, axis=0)[::2], RATE), y)
    left = fx(x[:, 0], RATE)
    assert left.shape == (3000,) and np.array_equal(fx(x[:, :1], RATE)[:, 0], left)
    for twin in (copy.copy(fx), copy.deepcopy(fx), pickle.loads(pickle.dumps(fx)), eval(repr(fx), vars(dsp))):
        assert twin is not fx and type(twin) is effect and repr(twin) == repr(fx) and np.array_equal(twin(x, RATE), y)
    assert fx(x[:0], RATE).shape == (0, 2)


@pytest.mark.parametrize("effect", BLOCKS, ids=lambda effect: effect.__name__)
def test_a_stream_is_the_recording_in_blocks(effect):
    fx = dsp.Chain([effect(), dsp.Equalizer(["900 peak 6"])])
    x = noise(20000, np.float64)
    expected = fx(x, RATE, tail=0.1)
    stream = fx.stream(RATE, 2)
    pieces = [stream(block) for block in np.split(x, [1, 65, 66, 3000, 12345])] + [stream.flush(0.1)]
    result = np.concatenate(pieces)
    assert stream.position == len(result) == 20000 + stream.latency + 4800
    assert np.allclose(result[stream.latency:], expected, rtol=0, atol=1e-9)


def test_latency_is_taken_out():
    x = sine(330, 1.0) * np.hanning(RATE)
    tube = dsp.Valvex(oversampling="16")
    for fx in (tube, dsp.Chain([tube, dsp.Chain([dsp.Equalizer([]), tube])])):
        assert fx.stream(RATE, 1).latency > 3
        expected = 2 * (fx(x[:, None] / 2, RATE)[:, 0])  # the amplifier is far from its limits
        for y in (fx(x, RATE), fx(x, RATE, tail="auto")[:len(x)]):
            assert y.shape == x.shape and np.abs(np.correlate(y[1000:-1000], x[990:-990])).argmax() in (9, 10, 11)
            assert np.abs(y - expected).max() < 0.2


def test_tails():
    x = np.zeros((1000, 2))
    x[0] = 0.5
    echo = dsp.Echo("Single delay", depth="500 ms", depth_mode="Time (linear)")
    whole = echo(x, RATE, tail="auto")
    loud = np.flatnonzero(np.abs(whole).max(axis=1) >= 1e-6)
    assert loud[-1] == len(whole) - 1 and loud[-1] > 0.2 * RATE
    assert np.array_equal(echo(x, RATE, tail=0.6)[:len(whole)], whole)
    assert len(echo(x, RATE, tail=0.6)) == 1000 + 0.6 * RATE and len(echo(x, RATE)) == 1000
    assert len(dsp.Gain()(x, RATE, tail="auto")) == 1000
    endless = dsp.Echo("Cosmic Feedback", decay="0 dB")(x, RATE, tail="auto")
    assert 55 * RATE < len(endless) <= 1000 + 60 * RATE
    for tail in (-1, "long", float("inf")):
        with pytest.raises(ValueError, match="tail"):
            echo(x, RATE, tail=tail)


def test_parameters():
    fx = dsp.Compressor("Studio Vocal")
    before = fx.state
    fx["Threshold"] = "-20 dB"
    by_text = fx.state
    fx.state = before
    fx["threshold"] = -20
    assert fx.state == by_text != before and fx.threshold == fx["Threshold R"] == -20.0
    assert dsp.Compressor("Studio Vocal", threshold=np.float32(-20)).state == by_text
    assert repr(fx) == "Compressor(preset='Studio Vocal', threshold='-20.0 dB')"
    fx.threshold_r = -float("inf")
    assert fx.threshold == -20.0 and fx.threshold_r == -float("inf") and "threshold_r='-Inf. dB'" in repr(fx)
    fx.auto_make_up_gain = True
    assert fx.auto_make_up_gain is True and fx["Auto Make-up Gain"] is True
    row = fx.parameters["Threshold L"]
    assert (row.attribute, row.unit, row.range, row.text) == ("threshold_l", "dB", ("-Inf. dB", "-1.0 dB"), "-20.0 dB")
    fx.preset = "narrator"
    assert fx.preset == "Narrator" and repr(fx) == "Compressor(preset='Narrator')"


@pytest.mark.parametrize("do, error, sentence", [
    (lambda fx: fx.__setitem__("Treshold", 1), KeyError, "no parameter 'Treshold'; did you mean 'Threshold'"),
    (lambda fx: setattr(fx, "treshold", 1), AttributeError, "did you mean 'threshold'"),
    (lambda fx: setattr(fx, "threshold", 5), ValueError, "Threshold L cannot be 5; accepted: -Inf. dB to -1.0 dB"),
    (lambda fx: setattr(fx, "threshold", float("nan")), ValueError, "NaN"),
    (lambda fx: setattr(fx, "stereo_link", "maybe"), ValueError, "accepted: Off, On"),
    (lambda fx: setattr(fx, "preset", "Studio Vocals"), ValueError, "did you mean 'Studio Vocal'"),
    (lambda fx: setattr(fx, "state", b"12"), ValueError, ""),
    (lambda fx: type(fx)(treshold=1), TypeError, "did you mean 'threshold'"),
    (lambda fx: fx(noise(9).T, RATE), ValueError, r"axis=1"),
    (lambda fx: fx(noise(9), 44100.5), ValueError, "whole number of Hz"),
    (lambda fx: fx((noise(9) * 9).astype(np.int16), RATE), TypeError, "int16.*float32 or float64"),
    (lambda fx: fx.stream(RATE, 1)("loud"), TypeError, "<U4"),
    (lambda fx: setattr(fx, "threshold", None), TypeError, "not by None"),
    (lambda fx: "Threshold" in fx, TypeError, "not .*iterable|not a container"),
    (lambda fx: dsp.Chain(fx), TypeError, r"list of effects: \[Compressor"),
    (lambda fx: dsp.Equalizer("80 highpass"), TypeError, "list of bands"),
    (lambda fx: fx.automate("Threshold", (0, 1)), ValueError, "a point is"),
    (lambda fx: fx.stream(RATE, 1)(noise(9)), ValueError, "1 channels, the block 2"),
    (lambda fx: fx.stream(RATE, 3), ValueError, "1 or 2"),
    (lambda fx: fx(noise(9), RATE, sidechain=noise(8)), ValueError, "8 frames, the signal 9"),
    (lambda fx: dsp.Reverb()(noise(9), RATE, sidechain=noise(9)), ValueError, "no side-chain"),
    (lambda fx: dsp.Chain([fx, abs]), TypeError, "not of <built-in"),
    (lambda fx: dsp.Gain().automate("Gain", [(0, 0)]), ValueError, "plays no automation"),
    (lambda fx: fx.automate("Threshold", [(0, -20.0)]), ValueError, "from 0, the lowest, to 1"),
    (lambda fx: dsp.Effect(), TypeError, "make one of these: Gain"),
    (lambda fx: dsp.Equalizer(["loud"]), ValueError, "FREQUENCY TYPE"),
    (lambda fx: dsp.Band(100, "peek"), ValueError, "accepted: highpass"),
    (lambda fx: dsp.Equalizer(["100 peak"] * 21), ValueError, "20 bands"),
])
def test_what_cannot_be_says_so_and_changes_nothing(do, error, sentence):
    fx = dsp.Compressor("Studio Vocal")
    before = fx.state
    with pytest.raises(error, match=sentence) as raised:
        do(fx)
    assert fx.state == before and "\n" not in str(raised.value)


def test_a_stream_keeps_its_type_and_lets_go_of_the_effect():
    fx = dsp.Gain()
    stream = fx.stream(RATE, 2)
    fx.gain = -20
    assert np.allclose(stream(noise(100)), noise(100))
    with pytest.raises(TypeError, match="other type"):
        stream(noise(100, np.float64))
    stream.reset()
    assert stream.position == 0 and stream(noise(100, np.float64)).dtype == np.float64


def test_a_rewound_stream_has_no_echoes():
    stream = dsp.Chain([dsp.Gain(), dsp.Echo()]).stream(RATE, 2)
    stream(noise(RATE))
    assert np.any(stream(np.zeros((100, 2), np.float32)))
    stream.rewind()
    assert stream.position == 0 and not np.any(stream(np.zeros((RATE, 2), np.float32)))


def test_automation_is_met_to_the_frame():
    level = dsp.Chorus("Off", wet_level=-float("inf"), dry_level=0)
    level.automate("Dry level", [(0.0, "0 dB"), (0.5, "-20 dB")])
    x = sine(1000, 1.0)
    y = np.abs(level(x, RATE))
    assert np.allclose(y[:24000], np.abs(x[:24000])) and y[24000:24100].max() < 0.49 and 0.04 < y[-100:].max() < 0.06
    # Behind an effect with latency it keeps its place in the music.
    late = np.abs(dsp.Chain([dsp.PitchShift(), level])(x, RATE))
    assert late[22900:23400].max() > 0.4 and late[25000:].max() < 0.1
    level.automate("Dry level", [(0.0, 0.0), (1.0, 1.0)], ramp=0.01)
    ramp = np.abs(level(x, RATE)).reshape(100, 480).max(axis=1)
    assert (np.diff(ramp[10:]) >= 0).all() and len(np.unique(ramp.round(9))) > 50
    level.automate("Dry level", [])
    assert np.allclose(level(x, RATE), x)


def test_sidechain_and_tempo():
    limiter = dsp.Compressor("Heavy Limiter")
    x = 0.01 * noise(RATE)
    alone, ducked = limiter(x, RATE), limiter(x, RATE, sidechain=sine(100, 1.0))
    assert np.std(ducked[RATE // 2:]) < 0.6 * np.std(alone[RATE // 2:])
    click = np.zeros((4 * RATE, 2))
    click[0] = 0.5
    places = []
    for bpm in (60, 120):
        echo = dsp.Echo("Single delay", depth_mode="Tempo (straight)", tempo=bpm)
        assert f"({240000 // bpm} ms)" in echo.parameters["Depth L"].range[1]
        assert eval(repr(echo), vars(dsp)).tempo == bpm
        with pytest.raises(ValueError, match=r"accepted: 1/256 .* to Measure"):
            echo.depth = 500
        places.append(np.flatnonzero(np.abs(echo(click, RATE)[100:, 0]) > 1e-3)[0] + 100)
    assert places[0] == pytest.approx(2 * places[1], abs=2)


def test_threads():
    """Several may use one object, and the interpreter's lock is free meanwhile."""
    chain = dsp.Chain([dsp.Compressor(), dsp.Reverb()])
    x = noise(20 * RATE)
    expected, results, counted = chain(x, RATE), [], 0
    threads = [threading.Thread(target=lambda: results.append(chain(x, RATE))) for _ in range(3)]
    for thread in threads:
        thread.start()
    while any(thread.is_alive() for thread in threads):
        counted += 1
    assert counted > 1000 and len(results) == 3 and all(np.array_equal(result, expected) for result in results)


class Quieter(dsp.Gain):
    """An effect of a user's own."""


def test_copies_keep_class_and_automation():
    fx = dsp.Chain([Quieter(gain=-20), dsp.Tremolo(), dsp.Equalizer(["80 highpass"], invert=True)])
    fx[1].automate("Mix", [(0, 0), (0.01, 1)])
    fx[1].tempo = 90
    expected = fx(noise(3000), RATE)
    for twin in (copy.deepcopy(fx), pickle.loads(pickle.dumps(fx))):
        assert type(twin[0]) is Quieter and np.array_equal(twin(noise(3000), RATE), expected)
        twin[1].tempo = fx[1].tempo + 1
        assert fx[1].tempo == 90


def test_an_interrupt_ends_a_long_call():
    stream = dsp.Cantrix().stream(RATE, 1)
    def stop(*_):
        raise KeyboardInterrupt
    before = signal.signal(signal.SIGALRM, stop)
    signal.setitimer(signal.ITIMER_REAL, 0.1)
    try:
        with pytest.raises(KeyboardInterrupt):
            stream(np.zeros(1000 * RATE, np.float32))
    finally:
        signal.signal(signal.SIGALRM, before)
    assert 0 < stream.position < 900 * RATE


def test_every_text_that_is_shown_can_be_set():
    for effect in EFFECTS:
        fx = effect()
        assert len(effect._table.attributes) == len(effect._table.names)
        for index, label in enumerate(effect._table.labels):
            fx._native.set(index, 0.35)
            text = fx.parameters[label].text
            fx[label] = text
            assert fx.parameters[label].text.split(" - ")[0] == text.split(" - ")[0]
    assert dsp.Denoiser(fft_size="512 + 4096").fft_size == "512 + 4096" and dsp.Valvex().oversampling == 1.0


def test_help_and_tables_tell_everything():
    for effect in EFFECTS:
        for name, indices in effect._table.attributes.items():
            assert isinstance(getattr(effect, name), property) and name in effect.__doc__
        assert all(repr(preset)[1:-1] in " ".join(effect.__doc__.split()) for preset in effect().presets)
        assert all(name in repr(effect().parameters) for name in effect().parameters)
