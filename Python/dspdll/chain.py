"""Processors one behind the other."""

from __future__ import annotations

from typing import Iterable, Iterator, List

from .processor import Processor


class Chain(Processor):
    """Effects, equalisers and other chains one behind the other: Chain([Compressor(), Reverb()]).

    It is used as one effect is: called with an array, or as a stream. Its parts stay what they are: chain[0]
    can be set up further, and may stand in other chains, too."""

    def __init__(self, processors: Iterable[Processor]) -> None:
        if isinstance(processors, Processor) or not isinstance(processors, Iterable):
            raise TypeError(f"a chain takes a list of effects: [{processors!r}]")
        self._parts = tuple(processors)
        for part in self._parts:
            if not isinstance(part, Processor):
                raise TypeError(f"a chain consists of effects, equalisers and chains, not of {part!r}")

    def _stations(self) -> List[Processor]:
        return [station for part in self._parts for station in part._stations()]

    def __getitem__(self, index: int) -> Processor:
        return self._parts[index]

    def __len__(self) -> int:
        return len(self._parts)

    def __iter__(self) -> Iterator[Processor]:
        return iter(self._parts)

    def __repr__(self) -> str:
        return f"Chain([{', '.join(map(repr, self._parts))}])"
