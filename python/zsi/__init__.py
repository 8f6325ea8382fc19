# SPDX-License-Identifier: Apache-2.0
"""Materials, lights and environments of shader libraries, and a renderer for them.

    import zsi
    m = zsi.material("corvid_Mtl_Ward", u_roughValue=0.2)
    m.eval([0, 0, 1], [0.6, 0, 0.8])         # what goes from one direction to another, 1/sr
    scene = zsi.load("scene.json")
    scene.materials["paint"].u_roughValue = 0.1
    picture = zsi.render(scene, samples=16)   # picture["beauty"]: an array (height, width, 4)
    zsi.write("picture.exr", picture)

Conventions, everywhere:

- Colours are linear RGB. The world is right-handed with z up. Lengths are scene units.
- Directions of a material are unit vectors in its own frame, z the normal, x the tangent, and
  point away from the surface: ``wi`` to where the viewing ray came from, ``wo`` to where it
  goes on, such as to a light.
- Arrays are numpy's. float32 in C order is taken as it is, anything else is converted once.
- Matrices are as in scene files: points are row vectors, a translation is the last row.
- Names and values of a scene's parts are those of the scene format (docs/scene-format.md).
- Bad input raises ``zsi.Error``, a ``ValueError`` with one line that names place and reason.
"""

import os as _os
from pathlib import Path as _Path

from . import _core, merl
from ._core import Error
from ._picture import Picture, Session, denoise, read, render, to_screen, write
from ._place import INSTALLED_SHADERS as _INSTALLED
from ._scene import Environment, Instance, Light, Scene, load
from ._shaders import Histogram, Material, Samples, classes, material, shader_class
from ._sweep import Sheet, sweep

__version__: str = _core.version
__all__ = [
    "Environment", "Error", "Histogram", "Instance", "Light", "Material", "Picture", "Samples",
    "Scene", "Session", "Sheet", "classes", "denoise", "load", "load_shaders", "material", "merl", "read",
    "render", "shader_class", "sweep", "to_screen", "write",
]


def load_shaders(folder: str | _os.PathLike[str]) -> None:
    """Adds the shader libraries (``*.so``) of a folder. A class that is there already stays."""
    import warnings

    for left_out in _core.load_shaders(_os.fspath(folder)):
        warnings.warn(left_out, stacklevel=2)


def _load_default_shaders() -> None:
    """Those of ZSI_SHADER_PATH, else of the wheel, the build tree or the installation."""
    here = _Path(__file__).resolve().parent
    folders = [_Path(f) for f in _os.environ.get("ZSI_SHADER_PATH", "").split(":") if f]
    if not folders:
        usual = (here / "shaders", here / "../../shaders", here / _INSTALLED)
        folders = [f.resolve() for f in usual if any(f.glob("*.so"))][:1]
    for folder in folders:
        load_shaders(folder)


_load_default_shaders()
