"""Writes what type checkers read of the effects: python-stubs.py FILE, with the package on the path."""

import sys

from dspdll import effects


def stub(cls):
    table = cls._table
    presets = ", ".join(map(repr, table.presets))
    preset = f"Optional[Literal[{presets}]]" if presets else "None"
    doc = cls.__doc__.replace("\\", "\\\\").replace("\n", "\n    ").replace("\n    \n", "\n\n")
    lines = [f"class {cls.__name__}(Effect):", f'    """{doc}\n    """',
             f"    def __init__(self, preset: {preset} = ..., *, tempo: float = ..., "
             + ", ".join(f"{a}: Value = ..." for a in table.attributes) + ") -> None: ..."]
    # Any: a number, a text or a switch, as the parameter is.
    return "\n".join(lines + [f"    {a}: Any" for a in table.attributes])


classes = [getattr(effects, name) for name in effects.__all__]
with open(sys.argv[1], "w", encoding="utf-8") as file:
    file.write("# Made by python-stubs.py from the library's tables.\n"
               "from typing import Any, Literal, Optional\n\n"
               "from .effect import Effect, Value\n\n"
               f"__all__ = {effects.__all__!r}\n\n")
    file.write("\n\n".join(map(stub, classes)) + "\n")
