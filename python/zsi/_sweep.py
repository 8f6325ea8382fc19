# SPDX-License-Identifier: Apache-2.0
"""One scene with other values, side by side."""

from __future__ import annotations

import io
import itertools
import os
from collections.abc import Callable, Iterator, Mapping, Sequence
from dataclasses import dataclass
from typing import TYPE_CHECKING, Any

import numpy as np

from ._picture import Picture, Session, to_screen
from ._scene import Scene

if TYPE_CHECKING:
    from PIL.Image import Image  # type: ignore[import]

_LINE, _LETTER, _GAP = 12, 6, 4  # pixels, of Pillow's built-in font


@dataclass
class Sheet:
    """Pictures of a scene for every combination of values."""

    values: dict[str, Sequence[Any]]
    """By path; the last one changes from column to column."""
    pictures: list[Picture]
    """In the order of itertools.product over the values."""

    @property
    def shape(self) -> tuple[int, int]:
        """Rows and columns."""
        columns = len(list(self.values.values())[-1])
        return len(self.pictures) // columns, columns

    def image(self) -> Image:
        """The contact sheet for the screen, each picture with its values below."""
        from PIL import Image, ImageDraw  # type: ignore[import]

        rows, columns = self.shape
        tiles = [Image.fromarray(to_screen(picture)) for picture in self.pictures]
        width, height = tiles[0].width + _GAP, tiles[0].height + _LINE * len(self.values) + _GAP
        sheet = Image.new("RGB", (columns * width + _GAP, rows * height + _GAP), "white")
        draw = ImageDraw.Draw(sheet)
        combinations = itertools.product(*self.values.values())
        for i, (tile, combination) in enumerate(zip(tiles, combinations)):
            x, y = i % columns * width + _GAP, i // columns * height + _GAP
            sheet.paste(tile, (x, y))
            for line, text in enumerate(self._label(combination, tile.width // _LETTER)):
                draw.text((x + 2, y + tile.height + _LINE * line), text, "black")
        return sheet

    def _label(self, combination: Sequence[Any], most: int) -> Iterator[str]:
        """A line for each path, in letters that the font has."""
        for path, value in zip(self.values, combination):
            text = f"{path.rpartition('.')[2]} {np.asarray(value).tolist()}"
            text = text.encode("latin-1", "replace").decode("latin-1")
            yield text if len(text) <= most else ".." + text[2 - most:]

    def save(self, file: str | os.PathLike[str]) -> None:
        """Writes the contact sheet, such as to a .png."""
        self.image().save(file)

    def _repr_png_(self) -> bytes:
        """Notebooks show the sheet."""
        data = io.BytesIO()
        self.image().save(data, "PNG")
        return data.getvalue()


def sweep(scene: Scene, values: Mapping[str, Sequence[Any]], *, samples: int | None = None,
          threads: int = 0, on_progress: Callable[[float], object] | None = None) -> Sheet:
    """Renders the scene for every combination of values and gives a labelled contact sheet.

    values: by path as in `Scene.set`, such as
    ``{"materials.paint.parameters.u_finishPeelamount": [0, 0.5, 1]}``; the last path runs along a
    row. The scene has its own values again afterwards. Raises Error for a path or value that the
    scene does not take, before anything is rendered.
    """
    before = {path: scene.get(path) for path in values}
    combinations = list(itertools.product(*values.values()))
    pictures: list[Picture] = []

    def part(i: int) -> Callable[[float], object] | None:
        def told(done: float) -> None:
            assert on_progress
            on_progress((i + done) / len(combinations))

        return told if on_progress else None

    try:
        for path, choices in values.items():
            for choice in choices:
                scene.set(path, choice)
        session = Session(scene)
        for i, combination in enumerate(combinations):
            for path, value in zip(values, combination):
                scene.set(path, value)
            pictures.append(session.render(samples=samples, threads=threads,
                                           on_progress=part(i)))
    finally:
        for path, value in before.items():
            scene.set(path, value)
    return Sheet({path: list(choices) for path, choices in values.items()}, pictures)
