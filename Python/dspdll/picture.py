"""PNG files from pixels."""

from __future__ import annotations

import operator
import struct
import zlib
from typing import Any

import numpy as np

from . import _native

DRAWS = hasattr(_native, "draw_spectrum")


def png(pixels: Any) -> bytes:
    """`pixels`: (height, width) of 0x00RRGGBB."""
    height, width = pixels.shape
    rgb = np.stack([pixels >> 16, pixels >> 8, pixels], axis=-1).astype(np.uint8)
    # Each row begins with the number of its filter: 0, none.
    rows = np.hstack([np.zeros((height, 1), np.uint8), rgb.reshape(height, 3 * width)])

    def chunk(kind: bytes, data: bytes) -> bytes:
        return struct.pack(">I", len(data)) + kind + data + struct.pack(">I", zlib.crc32(kind + data))

    header = struct.pack(">IIBBBBB", width, height, 8, 2, 0, 0, 0)
    return (b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", header) + chunk(b"IDAT", zlib.compress(rows.tobytes(), 6))
            + chunk(b"IEND", b""))


class Drawn:
    """A result that the library can draw."""

    def _pixels(self, width: int, height: int, dpi: float) -> Any:
        raise NotImplementedError

    def png(self, width: int = 1280, height: int = 720, dpi: float = 96.0) -> bytes:
        """The library's own picture as the bytes of a PNG file; sides in pixels."""
        if not DRAWS:
            raise RuntimeError("this build of the library does not draw")
        return png(self._pixels(operator.index(width), operator.index(height), float(dpi)))

    def save(self, path: Any, width: int = 1280, height: int = 720, dpi: float = 96.0) -> None:
        """Writes the picture into a PNG file."""
        data = self.png(width, height, dpi)
        with open(path, "wb") as file:
            file.write(data)

    def _repr_png_(self) -> Any:
        return self.png(960, 540) if DRAWS else None
