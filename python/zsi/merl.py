# SPDX-License-Identifier: Apache-2.0
"""Measured isotropic materials in the binary format of the MERL database.

A table over half angle, difference angle and its azimuth (Rusinkiewicz 1998, "A New Change of
Variables for Efficient BRDF Representation"; Matusik et al. 2003, "A Data-Driven Reflectance
Model"): 90 x 90 x 180 cells, three of 32 bits that tell the size, then doubles, channel after
channel, red and green and blue in units of 1/1500, 1.15/1500 and 1.66/1500 per steradian.
"""

from __future__ import annotations

import os
from pathlib import Path

import numpy as np
import numpy.typing as npt

from ._core import Error

SHAPE = (90, 90, 180)
"""Half angle (0 to pi/2, finer towards 0), difference angle (0 to pi/2), its azimuth (0 to pi)."""
_UNITS = np.array([1.0, 1.15, 1.66]) / 1500.0

Array = npt.NDArray[np.float64]


def read(file: str | os.PathLike[str]) -> Array:
    """The table as (90, 90, 180, 3), 1/sr, linear RGB; negative where nothing was measured."""
    data = Path(file).read_bytes()
    count = int(np.prod(SHAPE))
    size = tuple(np.frombuffer(data[:12], "<i4"))
    if size != SHAPE or len(data) != 12 + 3 * count * 8:
        raise Error(f"{os.fspath(file)}: expected a MERL table of {SHAPE} cells, "
                    f"{12 + 3 * count * 8} bytes; got {len(data)} bytes, cells {size}")
    values = np.frombuffer(data, "<f8", offset=12).reshape(3, *SHAPE)
    table: Array = np.moveaxis(values, 0, -1) * _UNITS
    return table


def write(file: str | os.PathLike[str], table: npt.ArrayLike) -> None:
    """Writes a table of shape (90, 90, 180, 3), 1/sr, linear RGB."""
    values = np.asarray(table, np.float64)
    if values.shape != (*SHAPE, 3):
        raise Error(f"{os.fspath(file)}: expected a table of shape {(*SHAPE, 3)}, "
                    f"got {values.shape}")
    Path(file).write_bytes(np.array(SHAPE, "<i4").tobytes()
                           + np.moveaxis(values / _UNITS, -1, 0).astype("<f8").tobytes())


def directions() -> tuple[Array, Array]:
    """wi and wo of each cell's middle, (90, 90, 180, 3), unit, away from the surface. wo can lie
    below the surface, where there is nothing to measure."""
    i, j, k = (np.arange(n) + 0.5 for n in SHAPE)
    half, difference, azimuth = np.meshgrid(
        np.pi / 2 * (i / SHAPE[0]) ** 2, np.pi / 2 * j / SHAPE[1], np.pi * k / SHAPE[2],
        indexing="ij")
    x, y, z = (np.sin(difference) * np.cos(azimuth), np.sin(difference) * np.sin(azimuth),
               np.cos(difference))
    # The difference vector is wi where the half vector is the normal: tilt both by the half angle.
    c, s = np.cos(half), np.sin(half)
    wi = np.stack([c * x + s * z, y, c * z - s * x], -1)
    h = np.stack([s, np.zeros_like(s), c], -1)
    wo = 2 * (wi * h).sum(-1, keepdims=True) * h - wi
    return wi, wo


def look_up(table: npt.ArrayLike, wi: npt.ArrayLike, wo: npt.ArrayLike) -> Array:
    """The values of the cells for directions (N, 3), unit, away from the surface: (N, 3), 1/sr."""
    values = np.asarray(table, np.float64)
    a, b = np.atleast_2d(np.asarray(wi, np.float64)), np.atleast_2d(np.asarray(wo, np.float64))
    h = a + b
    h /= np.linalg.norm(h, axis=-1, keepdims=True)
    half = np.arccos(np.clip(h[:, 2], -1, 1))
    # wi turned so that the half vector is the normal.
    phi = np.arctan2(h[:, 1], h[:, 0])
    x = np.cos(phi) * a[:, 0] + np.sin(phi) * a[:, 1]
    y = np.cos(phi) * a[:, 1] - np.sin(phi) * a[:, 0]
    dx, dz = np.cos(half) * x - np.sin(half) * a[:, 2], np.sin(half) * x + np.cos(half) * a[:, 2]
    difference = np.arccos(np.clip(dz, -1, 1))
    azimuth = np.arctan2(y, dx) % np.pi  # reciprocal: a turn by pi swaps wi and wo

    def cell(share: Array, axis: int) -> npt.NDArray[np.intp]:
        return np.clip((share * SHAPE[axis]).astype(np.intp), 0, SHAPE[axis] - 1)

    found: Array = values[cell(np.sqrt(half / (np.pi / 2)), 0), cell(difference / (np.pi / 2), 1),
                          cell(azimuth / np.pi, 2)]
    return found
