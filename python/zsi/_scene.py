# SPDX-License-Identifier: Apache-2.0
"""Scenes: loaded or made, and edited."""

from __future__ import annotations

import json
import os
import re
import warnings
from collections.abc import Callable, Iterator, Mapping
from typing import Any, Generic, TypeVar

import numpy.typing as npt

from . import _core
from ._shaders import FloatArray, Material, Shader, shader_class

T = TypeVar("T")


class Section:
    """Camera, film or settings of a scene: attributes by the names of the scene format.

    A value is checked as in a scene file when it is set; ``update`` sets several that only fit
    together.
    """

    _get: Callable[[], dict[str, Any]]
    _set: Callable[[dict[str, Any]], None]

    def __init__(self, get: Callable[[], dict[str, Any]],
                 set: Callable[[dict[str, Any]], None]) -> None:
        object.__setattr__(self, "_get", get)
        object.__setattr__(self, "_set", set)

    def __getattr__(self, name: str) -> Any:
        values = self._get()
        if name not in values:
            raise AttributeError(f"{name}: known are {', '.join(values)}")
        return values[name]

    def __setattr__(self, name: str, value: Any) -> None:
        self._set({name: value})

    def update(self, **values: Any) -> None:
        """Sets several values at once."""
        self._set(values)

    def __dir__(self) -> list[str]:
        return [*super().__dir__(), *self._get()]

    def __repr__(self) -> str:
        return repr(self._get())


class Light(Shader):
    """A light of a scene: its place and the parameters of its shader, if it has one.

    point, spot: position, color, radius, axis, angle, innerAngle (degrees; 360: all around). sun:
    direction (towards it), color, angle (degrees). rectangle, disc, mesh: emission. A shader's:
    position, axis, radius, and its parameters.
    """

    _scene: _core.Scene
    _index: int

    def __init__(self, scene: _core.Scene, index: int) -> None:
        object.__setattr__(self, "_scene", scene)
        object.__setattr__(self, "_index", index)
        object.__setattr__(self, "_handle", scene.light_shader(index))
        object.__setattr__(self, "class_name", self._handle.class_name if self._handle else "")

    def __getattr__(self, name: str) -> Any:
        values = self._scene.get_light(self._index)
        if name in values:
            return values[name]
        if not self._handle:
            raise AttributeError(f"{name}: known are {', '.join(values)}")
        return super().__getattr__(name)

    def __setattr__(self, name: str, value: Any) -> None:
        if self._scene.set_light(self._index, name, value):
            return
        if not self._handle:
            known = ", ".join(self._scene.get_light(self._index))
            raise _core.Error(f"{name}: unknown; the light has {known}")
        self._handle.set(name, value)

    def parameters(self) -> dict[str, Any]:
        """All values by name."""
        own = self._scene.get_light(self._index)
        return own | (super().parameters() if self._handle else {})

    def __repr__(self) -> str:
        return f"<light {self.class_name} {self._scene.get_light(self._index)}>"


class Environment(Shader):
    """What rays see that leave the scene."""


class Instance:
    """A mesh in a place and a material."""

    def __init__(self, scene: _core.Scene, index: int) -> None:
        self._scene = scene
        self._index = index

    @property
    def mesh(self) -> str:
        """The mesh's name."""
        return self._scene.get_mesh(self._index)

    @property
    def material(self) -> str | None:
        """The material's name; None for the surface of a light."""
        return self._scene.get_material(self._index)

    @material.setter
    def material(self, name: str) -> None:
        self._scene.set_material(self._index, name)

    @property
    def transform(self) -> FloatArray:
        """Object to world, (4, 4); points are row vectors. Also set by a mapping with scale,
        rotate and translate as in scene files."""
        return self._scene.get_transform(self._index)

    @transform.setter
    def transform(self, matrix: npt.ArrayLike | Mapping[str, Any]) -> None:
        self._scene.set_transform(self._index, matrix)

    def __repr__(self) -> str:
        return f"<instance of {self.mesh} in {self.material}>"


class Named(Mapping[str, T], Generic[T]):
    """Things of a scene by name."""

    def __init__(self, what: str, names: Callable[[], list[str]], get: Callable[[int], T]) -> None:
        self._what, self._names, self._get = what, names, get

    def __getitem__(self, name: str) -> T:
        names = self._names()
        if name not in names:
            raise KeyError(f"no {self._what} {name}; there are {', '.join(names) or 'none'}")
        return self._get(names.index(name))

    def __iter__(self) -> Iterator[str]:
        return iter(self._names())

    def __len__(self) -> int:
        return len(self._names())

    def __repr__(self) -> str:
        return f"<{self._what}s {', '.join(self)}>"


class Scene:
    """A scene; empty when made so, with a camera at (0, -5, 1) that looks at the origin.

    ``zsi.render`` renders it. It can be edited between renderings, not while one runs.
    """

    def __init__(self, *, _core_scene: _core.Scene | None = None) -> None:
        self._core = _core_scene or _core.Scene()

    @property
    def file(self) -> str:
        """Where it came from; empty for none."""
        return self._core.file

    @property
    def camera(self) -> Section:
        """position, target, up, fov (vertical, degrees), lensRadius, focusDistance."""
        return Section(self._core.get_camera, self._core.set_camera)

    @property
    def film(self) -> Section:
        """width, height, crop, exposure, alpha, layers."""
        return Section(self._core.get_film, self._core.set_film)

    @property
    def settings(self) -> Section:
        """samples, maxDepth, seed, integrator and the other settings of the scene format."""
        return Section(self._core.get_settings, self._core.set_settings)

    @property
    def materials(self) -> Named[Material]:
        """Materials by name; their parameters are attributes."""
        return Named("material", self._core.material_names,
                     lambda i: _typed(self._core.material(i), Material))

    @property
    def instances(self) -> Named[Instance]:
        """Instances by name; parts of a mesh as "name/part", surfaces of lights by theirs."""
        return Named("instance", self._core.instance_names, lambda i: Instance(self._core, i))

    @property
    def lights(self) -> Named[Light]:
        """Lights by name."""
        return Named("light", self._core.light_names, lambda i: Light(self._core, i))

    @property
    def meshes(self) -> list[str]:
        """Names of the meshes; surfaces of lights have none."""
        return [name for name in self._core.mesh_names() if name]

    @property
    def environment(self) -> Environment | None:
        """What rays see that leave the scene. Set by a picture file (latitude and longitude), by
        a mapping as in scene files ({"file": ..., "rotate": ..., "intensity": ...} or
        {"class": ..., "parameters": {...}}), or to None for black."""
        handle = self._core.environment()
        return _typed(handle, Environment) if handle else None

    @environment.setter
    def environment(self, value: str | os.PathLike[str] | Mapping[str, Any] | None) -> None:
        self._core.set_environment(
            {"file": value} if isinstance(value, (str, os.PathLike)) else value)
        self._warn()

    def resize(self, width: int, height: int) -> None:
        """Other pixels for the same view: crop and backplate keep their share."""
        self._core.resize(width, height)

    def add_mesh(self, name: str, positions: npt.ArrayLike | None = None,
                 triangles: npt.ArrayLike | None = None, *, normals: npt.ArrayLike | None = None,
                 uv: npt.ArrayLike | None = None, colors: npt.ArrayLike | None = None,
                 **source: Any) -> None:
        """A mesh from arrays: positions (N, 3), triangles (M, 3) of indices, counterclockwise seen
        from outside, and for each position normals (N, 3), uv (N, 2), colors (N, 4). Without
        normals it is smooth, without uv they are projected from the sides of a box.

        Or from what a scene file would name: ``file="ball.obj"``, ``sphere={"radius": 1}``,
        ``box={}``, ``plane={"size": 4}``. Warns of what is mended; raises Error for arrays that do
        not fit together.
        """
        if source:
            self._core.add_mesh(name, source)
        elif positions is None or triangles is None:
            raise _core.Error(f"scene: meshes.{name}: expected positions and triangles, or a file "
                              "or shape")
        else:
            self._core.add_mesh_of_arrays(name, positions, triangles, normals, uv, colors)
        self._warn()

    def add_material(self, name: str, material: str | Material, **parameters: Any) -> Material:
        """A new material of a class, or a copy of a material, with its parameters."""
        if isinstance(material, Material):
            added = _typed(self._core.add_material_copy(name, material._handle), Material)
            added.set(**parameters)
        else:
            added = _typed(self._core.add_material(
                name, {"class": material, "parameters": parameters}), Material)
        self._warn()
        return added

    def add_instance(self, name: str, mesh: str, material: str,
                     transform: npt.ArrayLike | Mapping[str, Any] | None = None) -> Instance:
        """A mesh in a material, both by name; transform as in `Instance.transform`."""
        keys: dict[str, Any] = {"mesh": mesh, "material": material}
        if transform is not None:
            keys["transform"] = transform
        self._core.add_instance(name, keys)
        return self.instances[name]

    def add_light(self, name: str, kind: str, **keys: Any) -> Light:
        """A light: kind "point", "spot", "sun", "rectangle", "disc" or "mesh", or a shader class, with the
        keys that scene files have for it, such as position, color, emission."""
        what = "class" if kind in _core.class_names() else "kind"
        self._core.add_light(name, {what: kind, **keys})
        self._warn()
        return self.lights[name]

    def get(self, path: str) -> Any:
        """A value by its path in the scene format, such as
        ``materials.paint.parameters.u_roughValue``, ``camera.fov`` or ``lights.key.color``."""
        holder, name = self._find(path)
        return getattr(holder, name)

    def set(self, path: str, value: Any) -> None:
        """Sets a value by its path."""
        holder, name = self._find(path)
        setattr(holder, name, value)

    def _find(self, path: str) -> tuple[Any, str]:
        section, _, rest = path.partition(".")
        if section in ("camera", "film", "settings") and rest:
            return getattr(self, section), rest
        if section == "environment" and self.environment is not None:
            return self.environment, rest.removeprefix("parameters.")
        if section in ("materials", "lights", "instances"):
            things: Mapping[str, Any] = getattr(self, section)
            match = re.fullmatch(r"(.*?)(?:\.parameters)?\.([^.]+)", rest)
            if match:
                try:
                    return things[match[1]], match[2]
                except KeyError as error:
                    raise _core.Error(f"{path}: {error.args[0]}") from None
        raise _core.Error(f"{path}: no such value in the scene; expected a path such as "
                          "materials.NAME.parameters.u_x or camera.fov")

    def _warn(self) -> None:
        for warning in self._core.take_warnings():
            warnings.warn(warning, stacklevel=3)

    def __repr__(self) -> str:
        return (f"<scene {self.file}: {len(self.instances)} instances, {len(self.materials)} "
                f"materials, {len(self.lights)} lights>")


S = TypeVar("S", bound=Shader)


def _typed(handle: _core.Shader, base: type[S]) -> S:
    made = shader_class(handle.class_name, base)(handle)
    assert isinstance(made, base)
    return made


def load(file: str | os.PathLike[str], *, set: Mapping[str, Any] | None = None,
         texture_cache: int = 0) -> Scene:
    """Reads a scene file.

    set: values that take the place of the file's, by path, as ``zsi render --set`` does; None takes
    one out. texture_cache: megabytes of pictures in memory, 0 for the usual. Warns of what the
    command warns of. Raises Error with the command's message.
    """
    assignments = [f"{path}={json.dumps(value, default=_listed)}"
                   for path, value in (set or {}).items()]
    scene = Scene(_core_scene=_core.load(os.fspath(file), assignments, texture_cache))
    scene._warn()
    return scene


def _listed(value: Any) -> Any:
    """numpy's values and paths for JSON."""
    return value.tolist() if hasattr(value, "tolist") else os.fspath(value)
