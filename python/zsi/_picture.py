# SPDX-License-Identifier: Apache-2.0
"""Rendering, pictures and their files."""

from __future__ import annotations

import os
from collections.abc import Callable, Iterator, Mapping
from typing import Any

import numpy as np
import numpy.typing as npt

from . import _core
from ._scene import Scene
from ._shaders import FloatArray


class Picture(Mapping[str, FloatArray]):
    """Layers by name: arrays (height, width, channels), rows from the top, linear.

    The first layer is the beauty, RGBA. The arrays are the picture's own: what is written into
    them is what `zsi.write` writes. A picture is also made from arrays of 1, 3 or 4 channels.
    """

    def __init__(self, layers: Mapping[str, npt.ArrayLike], *,
                 _core_picture: _core.Picture | None = None) -> None:
        self._core = _core_picture or _core.Picture(
            [_layer(name, values, i == 0) for i, (name, values) in enumerate(layers.items())])
        self._view = _core.ScreenView(0.0, False, "", "")
        self.report: dict[str, Any] = {}
        """What the rendering told: samples (of a pixel, in the mean), noise (or None), rays,
        surfaces (camera samples that saw one), nonFinite (results left out), seconds."""

    def __getitem__(self, layer: str) -> FloatArray:
        return self._core.values(layer)

    def __iter__(self) -> Iterator[str]:
        return iter(self._core.layers)

    def __len__(self) -> int:
        return len(self._core.layers)

    def channels(self, layer: str) -> list[str]:
        """Names of a layer's channels, such as R, G, B, A."""
        return self._core.channels(layer)

    @property
    def frame(self) -> tuple[int, int]:
        """Width and height of the whole picture, which a crop is a part of."""
        return self._core.frame

    @property
    def window(self) -> tuple[int, int, int, int]:
        """x0, y0, x1, y1: the pixels that are here."""
        return self._core.window

    def __repr__(self) -> str:
        x0, y0, x1, y1 = self.window
        return f"<picture {x1 - x0} x {y1 - y0}: {', '.join(self)}>"


def _layer(name: str, values: npt.ArrayLike, first: bool) -> tuple[str, list[str], FloatArray]:
    array = np.asarray(values, np.float32)
    if array.ndim == 2:
        array = array[..., None]
    if array.ndim != 3 or array.shape[2] not in (1, 3, 4):
        raise _core.Error(f"{name}: expected an array of shape (height, width) with 1, 3 or 4 "
                          f"channels, got {array.shape}")
    if first and array.shape[2] < 4:  # the beauty has colours and alpha
        opaque = np.ones((*array.shape[:2], 4), np.float32)
        opaque[..., :3] = array
        array = opaque
    return name, ["Y"] if array.shape[2] == 1 else list("RGBA")[:array.shape[2]], array


class Session:
    """Keeps a scene prepared: after an edit only what stands on it is built anew, and after that
    of a parameter, the camera, the film or the settings nothing at all."""

    def __init__(self, scene: Scene) -> None:
        self.scene = scene
        self._core = _core.Session(scene._core)

    def render(self, *, samples: int | None = None, seconds: float = 0, threads: int = 0,
               on_progress: Callable[[float], object] | None = None) -> Picture:
        """Renders the scene as it is now; see `zsi.render`."""
        made, report, view = self._core.render(samples, seconds, threads, on_progress)
        picture = Picture({}, _core_picture=made)
        picture.report, picture._view = report, view
        return picture


def render(scene: Scene, *, samples: int | None = None, seconds: float = 0, threads: int = 0,
           on_progress: Callable[[float], object] | None = None) -> Picture:
    """Renders a scene into a picture with the layers that its film names.

    samples: a pixel's, instead of the scene's; fewer where ``settings.noise`` is reached. seconds:
    above 0, ends the rendering after them. threads: 0 for one per processor. on_progress: is
    called on this thread with the share that is done, 0 to 1; what it raises ends the rendering,
    and so does Ctrl-C. The same scene and seed give the same bits with any number of threads.
    """
    return Session(scene).render(samples=samples, seconds=seconds, threads=threads,
                                 on_progress=on_progress)


def denoise(picture: Picture, *, threads: int = 0,
            on_progress: Callable[[float], object] | None = None) -> Picture:
    """The picture with its beauty freed from noise.

    It needs both halves of its samples: render with "halves" among ``scene.film.layers``, or read
    an EXR file that ``zsi render --denoise`` wrote. on_progress and Ctrl-C as for `render`. Raises
    Error for a picture without halves.
    """
    result = Picture({}, _core_picture=_core.denoise(picture._core, threads, on_progress))
    result.report, result._view = picture.report, picture._view
    return result


def read(file: str | os.PathLike[str]) -> Picture:
    """An EXR file with all its layers as a picture. Raises Error where it is none."""
    return Picture({}, _core_picture=_core.read(os.fspath(file)))


def _view(picture: Picture, exposure: float | None, alpha: bool | None, view: str | None,
          ocio_config: str | os.PathLike[str]) -> _core.ScreenView:
    scenes = picture._view
    return _core.ScreenView(scenes.exposure if exposure is None else exposure,
                            scenes.alpha if alpha is None else alpha,
                            scenes.view if view is None else view, os.fspath(ocio_config))


def to_screen(picture: Picture | npt.ArrayLike, *, exposure: float | None = None,
              view: str | None = None, ocio_config: str | os.PathLike[str] = ""
              ) -> npt.NDArray[np.uint8]:
    """The beauty for a screen, (height, width, 3), 8 bits; keywords as for `write`."""
    if not isinstance(picture, Picture):
        picture = Picture({"beauty": picture})
    signals = _core.to_screen(picture._core, _view(picture, exposure, None, view, ocio_config))
    bytes8: npt.NDArray[np.uint8] = np.rint(signals * 255).astype(np.uint8)
    return bytes8


def write(file: str | os.PathLike[str], picture: Picture | npt.ArrayLike, *,
          exposure: float | None = None, alpha: bool | None = None, view: str | None = None,
          ocio_config: str | os.PathLike[str] = "") -> None:
    """Writes a picture, or an array (height, width, 1, 3 or 4), by the file's extension.

    .exr: all layers, linear. .hdr: linear RGB. .png, .jpg: 8 bits for the screen, after exposure
    (stops) and view (a tone curve, "neutral", "plain" or "filmic", or a view of ocio_config, an
    OpenColorIO config file), PNG with alpha if wanted; what is not given is the scene's. The file
    is whole or as it was. Raises Error where it cannot be written.
    """
    if not isinstance(picture, Picture):
        picture = Picture({"beauty": picture})
    _core.write(os.fspath(file), picture._core, _view(picture, exposure, alpha, view, ocio_config))
