"""An effect with its parameters. The classes themselves are made in effects.py from the library's tables."""

from __future__ import annotations

import difflib
import re
from dataclasses import dataclass
from typing import Any, ClassVar, Dict, Iterable, Iterator, List, Mapping, Optional, Tuple, Union

import numpy as np

from . import _native
from .processor import Audio, Processor, Stream, is_number

Value = Union[float, str, bool]
_CONTINUOUS, _SWITCH = 0, 1
_MOST_STEPS = 10**7  # of one parameter's automation


def read_number(text: str) -> Optional[float]:
    """The number that a parameter's text begins with; None where it is a word or a fraction."""
    match = re.match(r"\s*([+-]?)(\d+\.?\d*|\.\d+|inf)\b\.?(.?)", text, re.I)
    if not match or match[3] == "/":
        return None
    return float(match[1] + match[2])


def attribute_name(label: str) -> str:
    """ "Wet level L" is called wet_level_l in Python."""
    return re.sub(r"\W+", "_", label.replace("#", " sharp").strip()).strip("_").lower()


@dataclass(frozen=True)
class Parameter:
    """One parameter of an effect.

    name: as fx[name] takes it. attribute: as Python code does. unit: may be empty. range: the texts of its
    lowest and highest value. choices: all texts of a list or switch, else empty. default: the text that a new
    effect shows. text: the text of its present value."""

    name: str
    attribute: str
    unit: str
    range: Tuple[str, str]
    choices: Tuple[str, ...]
    default: str
    text: str

    @property
    def accepted(self) -> str:
        """What can be given, as a sentence's end."""
        return ", ".join(self.choices) if self.choices else f"{self.range[0]} to {self.range[1]}"


class Parameters(Mapping[str, Parameter]):
    """An effect's parameters by name; prints as a table."""

    def __init__(self, rows: Iterable[Parameter]) -> None:
        self._rows = {row.name: row for row in rows}

    def __getitem__(self, name: str) -> Parameter:
        return self._rows[name]

    def __iter__(self) -> Iterator[str]:
        return iter(self._rows)

    def __len__(self) -> int:
        return len(self._rows)

    def _cells(self) -> List[Tuple[str, ...]]:
        head: Tuple[str, ...] = ("parameter", "attribute", "accepted", "default", "now")
        return [head, *((p.name, p.attribute, p.accepted, p.default, p.text) for p in self.values())]

    def __repr__(self) -> str:
        cells = self._cells()
        widths = [max(len(row[column]) for row in cells) for column in range(len(cells[0]))]
        return "\n".join("  ".join(cell.ljust(width) for cell, width in zip(row, widths)).rstrip() for row in cells)

    def _repr_html_(self) -> str:
        from html import escape

        def line(tag: str, row: Iterable[str]) -> str:
            return "<tr>" + "".join(f"<{tag}>{escape(cell)}</{tag}>" for cell in row) + "</tr>"

        head, *rows = self._cells()
        return "<table>" + line("th", head) + "".join(line("td", row) for row in rows) + "</table>"


class Table:
    """What all effects of one kind have in common: read once from the library."""

    def __init__(self, kind: str) -> None:
        native = _native.Effect(kind)
        self.kind = kind
        self.presets: Tuple[str, ...] = tuple(native.presets())
        self.default_preset = self.presets[native.default_preset()] if self.presets else None
        self.sidechain_channels: int = native.sidechain_channels()
        self.parameters = native.parameters()
        self.defaults = [shown(native, index) for index in range(len(self.parameters))]
        # Lists whose texts are more than a number: "512 + 2048" and "512 + 4096".
        self.wordy = {index for index, parameter in enumerate(self.parameters)
                      if len({read_number(choice.text) for choice in parameter.choices}) < len(parameter.choices)}
        # By label, and both of a left/right pair by the name without a side.
        self.labels: Dict[str, List[int]] = {}
        names: Dict[str, List[int]] = {}
        for index, parameter in enumerate(self.parameters):
            self.labels.setdefault(parameter.label.strip(), []).append(index)
            names.setdefault(parameter.name.strip(), []).append(index)
        self.names = {**names, **self.labels}
        self.attributes = {attribute_name(name): indices for name, indices in self.names.items()}
        self._found = {name.lower(): indices for name, indices in self.names.items()}

    def find(self, name: str) -> List[int]:
        indices = self._found.get(str(name).strip().lower())
        if indices is None:
            raise UnknownParameter(f"{self.kind} has no parameter {name!r}; " + self.suggestion(str(name), self.names))
        return indices

    def accepted(self, index: int, native: _native.Effect) -> str:
        choices = [choice.text.strip() for choice in self.parameters[index].choices]
        return ", ".join(choices) if choices else " to ".join(ends(native, index))

    def is_side(self, name: str) -> bool:
        """Whether `name`, a label or its attribute, is one side of a pair that has a name, too."""
        indices = self.names.get(name, self.attributes.get(name, []))
        return any(len(other) > len(indices) and set(other) > set(indices) for other in self.names.values())

    def suggestion(self, name: str, accepted: Iterable[str]) -> str:
        """For names of parameters: those of one side are left out."""
        return suggestion(name, accepted, [a for a in accepted if not self.is_side(a)])

    def describe(self, label: str, native: _native.Effect) -> Parameter:
        index = self.labels[label][0]
        parameter = self.parameters[index]
        return Parameter(label, attribute_name(label), parameter.unit.strip(), ends(native, index),
                         tuple(choice.text.strip() for choice in parameter.choices), self.defaults[index],
                         shown(native, index))


def shown(native: _native.Effect, index: int) -> str:
    return native.text(index)


def ends(native: _native.Effect, index: int) -> Tuple[str, str]:
    """The texts of the lowest and highest value; a mode beside the parameter may change them."""
    return native.value_to_text(index, 0.0), native.value_to_text(index, 1.0)


def suggestion(name: str, accepted: Iterable[str], told: Iterable[str]) -> str:
    close = difflib.get_close_matches(name.lower(), [a.lower() for a in accepted], 1, 0.7)
    meant = [a for a in accepted if a.lower() in close]
    return (f"did you mean {meant[0]!r}? " if meant else "") + "accepted: " + ", ".join(told)


def _slack(end: float) -> float:
    return 1e-3 * max(1.0, abs(end)) if np.isfinite(end) else 0.0


class UnknownParameter(KeyError):
    """There is no parameter of this name."""

    def __str__(self) -> str:
        return str(self.args[0])


class Effect(Processor):
    """An effect of the library. Call it with an array, or make a stream(); help(type(fx)) tells its parameters.

    fx["Threshold"] = "-20 dB", fx["Threshold"] = -20.0 and fx.threshold = -20.0 mean the same. A name without
    its side sets both sides of a left/right pair and reads the left one. What is read is a number where the
    effect shows one, True or False for a switch, else the text. What an effect cannot do is a ValueError and
    changes nothing."""

    _table: ClassVar[Table]
    _native: _native.Effect
    _preset: Optional[str]
    _tempo: float
    _automation: Dict[int, List[Tuple[float, float]]]

    def __init__(self, preset: Optional[str] = None, *, tempo: float = 120.0, **parameters: Value) -> None:
        if not hasattr(type(self), "_table"):
            raise TypeError("Effect is what all effects have in common; make one of these: "
                            + ", ".join(c.__name__ for c in Effect.__subclasses__()))
        self._native = _native.Effect(self._table.kind)
        self._preset = self._table.default_preset
        self._automation = {}
        self.tempo = tempo
        if preset is not None:
            self.preset = preset
        table = self._table
        parameters = {name: value for name, value in parameters.items() if value is not None}
        for name in parameters:
            if name not in table.attributes:
                raise TypeError(f"{type(self).__name__} has no parameter {name!r}; "
                                + table.suggestion(name, table.attributes))
        # Lists and switches first: they say what some numbers mean.
        kinds = {name: table.parameters[table.attributes[name][0]].kind for name in parameters}
        for name in sorted(parameters, key=lambda name: kinds[name] == _CONTINUOUS):
            self._set(table.attributes[name], parameters[name])

    # Parameters.

    def __getitem__(self, name: str) -> Any:
        return self._get(self._table.find(name))

    __iter__ = None
    __contains__ = None

    def __setitem__(self, name: str, value: Value) -> None:
        self._set(self._table.find(name), value)

    def _get(self, indices: List[int]) -> Any:
        text = shown(self._native, indices[0])
        if self._table.parameters[indices[0]].kind == _SWITCH and text.lower() in ("off", "on"):
            return text.lower() == "on"
        number = read_number(text)
        return text if number is None or indices[0] in self._table.wordy else number

    def _set(self, indices: List[int], value: Value) -> None:
        values = [self._normalised(index, value) for index in indices]
        for index, normalised in zip(indices, values):
            self._native.set(index, normalised)
        self._changed()

    def _normalised(self, index: int, value: Value) -> float:
        if isinstance(value, (bool, np.bool_)):
            text = "On" if value else "Off"
        elif isinstance(value, str):
            # "-Inf. dB", as some show it, is not the only way to write it.
            text = f"{read_number(value):g}" if np.isinf(read_number(value) or 0.0) else value.strip()
        elif not is_number(value):
            raise TypeError(f"a parameter is set by a number, a text, True or False, not by {value!r}")
        elif np.isnan(value):
            raise ValueError("a parameter cannot be NaN")
        elif np.isinf(value):
            text = "inf" if value > 0 else "-inf"
        else:
            text = np.format_float_positional(float(value), trim="-")
        number, lowest, highest = map(read_number, (text, *ends(self._native, index)))
        try:
            normalised = self._native.text_to_value(index, text)
            # What the library limits would be another value than the one asked for, as a number among words is.
            if number is None or self._table.parameters[index].choices:
                fits = True
            elif lowest is None or highest is None:
                fits = lowest is not highest
            else:
                fits = (normalised not in (0.0, 1.0)
                        or lowest - _slack(lowest) <= number <= highest + _slack(highest))
        except ValueError:
            fits = False
        if not fits:
            label = self._table.parameters[index].label
            raise ValueError(f"{label} cannot be {value!r}; accepted: "
                             + self._table.accepted(index, self._native))
        return normalised

    def __setattr__(self, name: str, value: Any) -> None:
        if not name.startswith("_") and not hasattr(type(self), name):
            raise AttributeError(f"{type(self).__name__} has no parameter {name!r}; "
                                 + self._table.suggestion(name, self._table.attributes))
        object.__setattr__(self, name, value)

    def __getattr__(self, name: str) -> Any:
        if name.startswith("_"):
            raise AttributeError(name)
        raise AttributeError(f"{type(self).__name__} has no parameter {name!r}; "
                             + self._table.suggestion(name, self._table.attributes))

    def __dir__(self) -> Iterable[str]:
        return [name for name in super().__dir__() if not name.startswith("_") or name.startswith("__")]

    @property
    def parameters(self) -> Parameters:
        """The table of parameters: name, attribute, unit, range or choices, default, present text."""
        return Parameters(self._table.describe(label, self._native) for label in self._table.labels)

    # Presets and state.

    @property
    def presets(self) -> Tuple[str, ...]:
        """The names of all presets; may be none."""
        return self._table.presets

    @property
    def preset(self) -> Optional[str]:
        """The preset chosen last; what was set since stays set. Choosing one sets all parameters."""
        return self._preset

    @preset.setter
    def preset(self, name: str) -> None:
        lower = [preset.lower() for preset in self.presets]
        if str(name).strip().lower() not in lower:
            known = suggestion(str(name), self.presets, self.presets) if lower else "it has none"
            raise ValueError(f"{type(self).__name__} has no preset {name!r}; {known}")
        index = lower.index(str(name).strip().lower())
        self._native.set_preset(index)
        self._preset = self.presets[index]
        self._changed()

    @property
    def state(self) -> bytes:
        """All settings as the library's bytes, to be stored and given back."""
        return self._native.state()

    @state.setter
    def state(self, state: bytes) -> None:
        self._native.set_state(bytes(state))
        self._changed()

    @property
    def tempo(self) -> float:
        """In beats per minute, 120 at first: for effects that follow one, as an echo in notes does."""
        return self._tempo

    @tempo.setter
    def tempo(self, bpm: float) -> None:
        if not is_number(bpm) or not 1.0 <= bpm <= 1000.0:
            raise ValueError(f"the tempo can be 1 to 1000 bpm, not {bpm!r}")
        self._tempo = float(bpm)
        self._native.set_tempo(self._tempo)
        self._changed()

    def automate(self, name: str, points: Iterable[Tuple[float, Value]], *, ramp: Optional[float] = None) -> None:
        """Lets a parameter move while a recording is processed; no points end that.

        points: (seconds, value). A value is a number from 0, the parameter's lowest, to 1, its highest, or a
            text with its unit: "-20 dB". From a point on the parameter has its value, and before the first
            point that of the first.
        ramp: straight lines from point to point instead, in steps of so many seconds."""
        indices = self._table.find(name)
        if not self._native.plays_automation():
            raise ValueError(f"{type(self).__name__} plays no automation")
        lanes = {index: self._lane(index, points_list, ramp)
                 for points_list in [list(points)] for index in indices}
        self._automation = {**{i: lane for i, lane in self._automation.items() if i not in lanes},
                            **{i: lane for i, lane in lanes.items() if lane}}
        self._changed()

    def _lane(self, index: int, points: List[Tuple[float, Value]], ramp: Optional[float]) -> List[Tuple[float, float]]:
        lane = []
        for point in points:
            try:
                seconds, value = point
            except (TypeError, ValueError):
                raise ValueError(f"a point is (seconds, value), not {point!r}") from None
            normalised = self._normalised(index, value) if isinstance(value, str) else float(value)
            if not 0.0 <= normalised <= 1.0:
                raise ValueError("a point's value is a number from 0, the lowest, to 1, the highest, or a text such as "
                                 f"{self._table.defaults[index]!r}; not {value!r}")
            if not is_number(seconds) or not 0.0 <= seconds < 1e9:
                raise ValueError(f"a point's time is in seconds from 0 on, not {seconds!r}")
            lane.append((float(seconds), normalised))
        lane.sort(key=lambda point: point[0])
        if ramp is None or len(lane) < 2:
            return lane
        times, values = zip(*lane)
        if not ramp > 0.0 or (times[-1] - times[0]) / ramp > _MOST_STEPS:
            raise ValueError(f"ramp is in seconds above 0, for up to {_MOST_STEPS} steps, not {ramp!r}")
        steps = np.append(np.arange(times[0], times[-1], ramp), times[-1])
        return list(zip(steps.tolist(), np.interp(steps, times, values).tolist()))

    # Processing.

    def _add_to(self, line: Stream, key_channels: int) -> None:
        line._add_effect(self._table.kind, self.state, sorted(self._automation.items()), self._tempo, key_channels)

    def _key_channels(self, sidechain: Audio, axis: int) -> int:
        most = self._table.sidechain_channels
        if most == 0:
            raise ValueError(f"{type(self).__name__} has no side-chain")
        channels = sidechain.shape[1 - axis] if sidechain.ndim == 2 else 1
        if not 1 <= channels <= most:
            raise ValueError(f"a side-chain of {type(self).__name__} has 1 to {most} channels, not {channels}")
        return channels

    # Copies and texts.

    def __getstate__(self) -> Dict[str, Any]:
        return {**super().__getstate__(), "_native": self.state}

    def __setstate__(self, kept: Dict[str, Any]) -> None:
        native = _native.Effect(self._table.kind)
        native.set_state(kept["_native"])
        native.set_tempo(kept["_tempo"])
        super().__setstate__({**kept, "_native": native})

    def __repr__(self) -> str:
        """Shows the preset, and what differs from it; automation is not shown."""
        return f"{type(self).__name__}({', '.join(self._differences())})"

    def _differences(self) -> Iterator[str]:
        plain = _native.Effect(self._table.kind)
        plain.set_tempo(self._tempo)
        if self._preset is not None:
            plain.set_preset(self.presets.index(self._preset))
            yield f"preset={self._preset!r}"
        if self._tempo != 120.0:
            yield f"tempo={self._tempo!r}"
        now = [shown(self._native, index) for index in range(len(self._table.parameters))]
        left = {index for index, text in enumerate(now) if text != shown(plain, index)}
        # Names stand before labels: both sides at once where they say the same.
        for name, indices in self._table.attributes.items():
            if left.intersection(indices) and len({now[index] for index in indices}) == 1:
                left.difference_update(indices)
                yield f"{name}={now[indices[0]]!r}"
