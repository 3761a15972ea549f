"""One class for every effect of the library, made from the library's own tables when the package is imported."""

import inspect
import re
import textwrap

from . import _native
from .effect import Effect, Table


def _told(table, index, native):
    return f"{table.accepted(index, native)}; {table.defaults[index]} at first"


def _document(name, table, native):
    """The class's help: every parameter, and the presets."""
    lines = [f"{name}(preset=None, *, tempo=120.0, **parameters)", "",
             f"{table.kind}, with these parameters; Effect tells how it is used.", ""]
    for attribute, indices in table.attributes.items():
        if table.is_side(attribute):
            continue
        label = next(n for n, i in table.names.items() if i is indices)
        sides = [a for a, i in table.attributes.items() if table.is_side(a) and set(i) < set(indices)]
        alone = f" ({', '.join(sides)}: one side)" if sides else ""
        lines += [f'{attribute}, "{label}"{alone}', f"    {_told(table, indices[0], native)}"]
    if table.presets:
        quoted = ", ".join(f'"{preset}"' for preset in table.presets)
        lines += ["", f"Presets, {table.default_preset!r} at first:"]
        lines += textwrap.wrap(quoted, 100, initial_indent="    ", subsequent_indent="    ")
    if table.sidechain_channels:
        lines += ["", f"It can listen to a side-chain of 1 to {table.sidechain_channels} channels."]
    return "\n".join(lines)


def _property(indices, doc):
    return property(lambda self: self._get(indices), lambda self, value: self._set(indices, value), doc=doc)


def _class(kind):
    table, native = Table(kind), _native.Effect(kind)
    name = re.sub(r"\W+", "", kind)
    # What every effect has keeps its name; a parameter called the same gets an underscore.
    table.attributes = {attribute + "_" * hasattr(Effect, attribute): indices
                        for attribute, indices in table.attributes.items()}
    members = {"_table": table, "__doc__": _document(name, table, native), "__module__": __package__}
    for attribute, indices in table.attributes.items():
        members[attribute] = _property(indices, _told(table, indices[0], native))
    keywords = [inspect.Parameter(a, inspect.Parameter.KEYWORD_ONLY, default=None) for a in table.attributes]
    preset = inspect.Parameter("preset", inspect.Parameter.POSITIONAL_OR_KEYWORD, default=None)
    tempo = inspect.Parameter("tempo", inspect.Parameter.KEYWORD_ONLY, default=120.0)
    members["__signature__"] = inspect.Signature([preset, tempo, *keywords])
    return type(name, (Effect,), members)


_classes = [_class(kind) for kind in _native.kinds()]
__all__ = [c.__name__ for c in _classes]
globals().update((c.__name__, c) for c in _classes)
