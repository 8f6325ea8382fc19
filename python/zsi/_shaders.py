# SPDX-License-Identifier: Apache-2.0
"""Shader classes as Python classes, and what can be measured of a material."""

from __future__ import annotations

import json
from functools import lru_cache
from typing import Any, NamedTuple

import numpy as np
import numpy.typing as npt

from . import _core

FloatArray = npt.NDArray[np.float32]


class Samples(NamedTuple):
    """Directions that a material drew; N directions in, n draws each."""

    direction: FloatArray
    """(N, n, 3): wo, unit; 0 where the material declined."""
    weight: FloatArray
    """(N, n, 3): value times cosine over density; the mean over n is the albedo."""
    density: FloatArray
    """(N, n), 1/sr: as the material tells it; 1 for perfectly specular draws."""
    type: npt.NDArray[np.uint32]
    """(N, n): 0 declined, 2 mixture of diffuse and glossy, 4 straight, 16 rough, 32 smooth."""


class Histogram(NamedTuple):
    """Draws counted over the sphere in cells of one solid angle, 4 pi / (rows * columns).

    Row i spans z from 1 - 2 i / rows to 1 - 2 (i + 1) / rows, column j azimuths from
    2 pi j / columns on, counted from +x over +y.
    """

    density: FloatArray
    """(rows, columns), 1/sr: share of the draws over the cell's solid angle."""
    coverage: FloatArray
    """(rows, columns): 1 where the densities that the material tells are those that it draws with
    and the cell can be reached as a whole; 0 where it never is."""
    declined: float
    """Share of draws that gave no direction."""


class Shader:
    """An object of a shader class; its parameters are attributes."""

    _handle: _core.Shader
    class_name: str

    def __init__(self, handle: _core.Shader) -> None:
        object.__setattr__(self, "_handle", handle)

    def __getattr__(self, name: str) -> Any:
        if name.startswith("__"):
            raise AttributeError(name)
        try:
            return self._handle.get(name)
        except _core.Error as error:
            raise AttributeError(str(error)) from None

    def __setattr__(self, name: str, value: Any) -> None:
        self._handle.set(name, value)

    def set(self, **parameters: Any) -> None:
        """Sets several parameters."""
        for name, value in parameters.items():
            setattr(self, name, value)

    def parameters(self) -> dict[str, Any]:
        """All values by name, in the order of the manual."""
        return {p["name"]: self._handle.get(p["name"]) for p in describe(self.class_name)["parameters"]}

    def __dir__(self) -> list[str]:
        return [*super().__dir__(), *self.parameters()]

    def __repr__(self) -> str:
        fresh = {p["name"]: p["default"] for p in describe(self.class_name)["parameters"]}
        changed = (f"{name}={value}" for name, value in self.parameters().items()
                   if fresh[name] is not None and not np.array_equal(
                       np.asarray(value, np.float32), np.asarray(fresh[name], np.float32).reshape(
                           np.shape(value))))
        return f"<{self.class_name} {' '.join(changed)}>".replace(" >", ">")


class Material(Shader):
    """A material of a scene, or one by itself (`zsi.material`).

    It is measured at a point of a flat surface with normal z, tangent x, bitangent y and uv
    (0.5, 0.5), seen by a camera ray, without lights. On the side of -z a material that bounds a
    medium is seen from within. Measuring releases the interpreter's lock and uses ``threads``
    threads, 0 for one per processor; results do not depend on their number.
    """

    def eval(self, wi: npt.ArrayLike, wo: npt.ArrayLike, *, cosine: bool = False,
             threads: int = 0, out: FloatArray | None = None) -> FloatArray:
        """The scattering value for each pair of directions, 1/sr.

        wi, wo: (N, 3) or (3,), unit, away from the surface; one for all where only one is (3,).
        cosine: with the factor |cos wo| in it; without, a Lambertian of reflectance r gives r / pi.
        out: an array for the result, which saves fresh memory in loops over many directions.
        Returns (N, 3) float32, linear RGB; (3,) for two single directions. Perfectly specular
        parts have no value. Raises Error for other shapes and for a class without ``transfer``.
        """
        return self._handle.eval(wi, wo, cosine, threads, out)

    def sample(self, wi: npt.ArrayLike, n: int = 1, *, seed: int = 1, threads: int = 0) -> Samples:
        """n draws of a direction to go on with, for each wi.

        wi: (N, 3) or (3,), unit, away from the surface; for (3,) the results lack the axis N. The
        first 2^k draws of a direction are stratified. The same seed gives the same draws. Raises
        Error for a class without ``sample``.
        """
        return Samples(*self._handle.sample(wi, n, seed, threads))

    def pdf_histogram(self, wi: npt.ArrayLike, n: int = 1 << 20, *, rows: int = 64,
                      columns: int = 128, seed: int = 1, threads: int = 0) -> Histogram:
        """n draws for one wi, (3,), counted over the sphere."""
        return Histogram(*self._handle.histogram(wi, n, rows, columns, seed, threads))

    def albedo(self, theta: npt.ArrayLike, n: int = 4096, *, seed: int = 1,
               threads: int = 0) -> FloatArray:
        """The share of light that comes back in a white furnace.

        theta: angles of wi from the normal towards x, radians, any shape. n: draws for each.
        Returns theta's shape + (3,), linear RGB.
        """
        return self._handle.albedo(theta, n, seed, threads)


@lru_cache(maxsize=None)
def describe(class_name: str) -> dict[str, Any]:
    """What ``zsi info CLASS --json`` tells."""
    return json.loads(_core.class_json(class_name))  # type: ignore[no-any-return]


def classes() -> dict[str, str]:
    """Name and one line about each shader class, by name."""
    return {name: describe(name)["summary"] for name in _core.class_names()}


def _parameter(row: dict[str, Any]) -> property:
    name = row["name"]
    default = "none, to be written" if not row["hasDefault"] else (
        "no texture" if row["default"] is None else row["default"])
    doc = f"{row['meaning']}. {row['type']}, default {default}"
    if "minimum" in row:
        doc += f", usually {row['minimum']} to {row['maximum']}"
    if row["type"].startswith("texture"):
        doc += "; a file, {'texture' or 'cube': file, 'colorSpace': ...}, or None; reads as bool"
    return property(lambda self: self._handle.get(name), None, None, doc + ".")


_made: dict[tuple[str, type[Shader]], type[Shader]] = {}


def shader_class(class_name: str, base: type[Shader] = Material) -> type[Shader]:
    """The Python class of a shader class: its help is the manual, its parameters properties."""
    if (class_name, base) in _made:
        return _made[class_name, base]
    rows = describe(class_name)["parameters"]
    members: dict[str, Any] = {row["name"]: _parameter(row) for row in rows}
    members.update(class_name=class_name, __doc__=_core.class_text(class_name),
                   __module__="zsi")
    made = _made[class_name, base] = type(class_name, (base,), members)
    return made


def material(class_name: str, **parameters: Any) -> Material:
    """A material by itself, with its parameters.

    Values are as scene files write them: numbers, sequences, for textures a file, relative to the
    current folder. Raises Error for an unknown class or parameter (with the nearest names) and for
    values of another type.
    """
    made = shader_class(class_name)(_core.material(class_name))
    assert isinstance(made, Material)
    made.set(**parameters)
    return made
