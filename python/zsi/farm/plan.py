# SPDX-License-Identifier: Apache-2.0
"""A picture in units: tiles by blocks of samples."""

from __future__ import annotations

import math
from collections.abc import Iterable, Iterator
from typing import NamedTuple

UNITS_PER_WORKER = 32
"""Fewer leave workers idle at the end."""
MOST_UNITS = 160000
"""More take the scheduler longer than five minutes; but every worker gets two. Both numbers are from scripts/farm-model.py; docs/farm.md has its tables."""
TILES = (256, 128, 64, 32)
"""Sides in pixels, the largest first. Below 32 a unit's header and its message outweigh its sums."""


class Box(NamedTuple):
    """Pixels from (x0, y0) to before (x1, y1), samples from begin to before end."""

    x0: int
    y0: int
    x1: int
    y1: int
    begin: int
    end: int

    def size(self) -> int:
        """Pixels times samples."""
        return (self.x1 - self.x0) * (self.y1 - self.y0) * (self.end - self.begin)


def unit_size(width: int, height: int, samples: int, workers: int) -> tuple[int, int]:
    """Side of a tile in pixels and samples of a block, for a picture of this size.

    The largest tiles of which there are enough, with all samples in one block: each
    further block brings all sums over the network once more. Where tiles alone are too few, the
    samples are divided as well.
    """
    workers = max(1, workers)
    wanted = min(UNITS_PER_WORKER * workers, max(MOST_UNITS, 2 * workers))
    for tile in TILES:
        tiles = math.ceil(width / tile) * math.ceil(height / tile)
        if tiles >= wanted:
            break
    blocks = min(samples, math.ceil(wanted / tiles))
    return tile, math.ceil(samples / blocks)


def units(boxes: Iterable[Box], tile: int, block: int) -> Iterator[Box]:
    """What is missing, in units, the first samples of all pixels first.

    Their edges lie on one grid, whatever the boxes are, so that what an earlier run left over makes
    whole units.
    """
    def parts(begin: int, end: int, step: int) -> Iterator[tuple[int, int]]:
        at = begin
        while at < end:
            stop = min((at // step + 1) * step, end)
            yield at, stop
            at = stop

    found = [Box(x0, y0, x1, y1, a, b) for box in boxes
             for a, b in parts(box.begin, box.end, block)
             for y0, y1 in parts(box.y0, box.y1, tile) for x0, x1 in parts(box.x0, box.x1, tile)]
    return iter(sorted(found, key=lambda u: (u.begin, u.y0, u.x0)))
