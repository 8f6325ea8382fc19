# SPDX-License-Identifier: Apache-2.0
"""Layers of the renderer as Blender's passes."""

from dataclasses import dataclass

import numpy as np

_FAR = 1e10  # where Blender's depth has nothing
_LEVELS = 3  # pictures of two pairs each, of an object or material matte


@dataclass(frozen=True)
class Pass:
    """`layer`: the renderer's name of it. `switch`: Blender's own property of
    view layers, else there is one of the add-on's by the layer's name."""

    layer: str
    name: str
    channels: str
    kind: str
    switch: str = ""
    about: str = ""
    values: tuple = ()  # what the file calls the channels, where that differs

    def wanted(self, view_layer):
        """Whether the user has switched it on."""
        owner = view_layer if self.switch else view_layer.zsi
        return getattr(owner, self.switch or self.layer)

    def names(self):
        """Of the file's channels."""
        return [f"{self.layer}.{channel}" for channel in self.values or self.channels]


_OWN = (
    Pass("direct", "Direct", "RGB", "COLOR", about="Light that one surface has sent on"),
    Pass("indirect", "Indirect", "RGB", "COLOR", about="Light that several surfaces have sent on"),
    Pass("albedo", "Albedo", "RGB", "COLOR", about="The first rough surface under light of 1"),
    Pass("denoiseNormal", "Denoise Normal", "XYZ", "VECTOR", about="Normal of that surface"),
    Pass("denoiseDepth", "Denoise Depth", "Z", "VALUE", about="Length of the way to that surface"),
    Pass("variance", "Variance", "RGB", "COLOR", about="As if samples were independent"),
    Pass("samples", "Samples", "N", "VALUE", about="How many a pixel got", values=("count",)),
)
_BLENDERS = (
    Pass("depth", "Depth", "Z", "VALUE", "use_pass_z"),
    Pass("normal", "Normal", "XYZ", "VECTOR", "use_pass_normal"),
    Pass("position", "Position", "XYZ", "VECTOR", "use_pass_position"),
    Pass("emission", "Emit", "RGB", "COLOR", "use_pass_emit"),
    Pass("environment", "Env", "RGB", "COLOR", "use_pass_environment"),
)
_MATTES = (
    ("objectId", "CryptoObject", "use_pass_cryptomatte_object"),
    ("shaderId", "CryptoMaterial", "use_pass_cryptomatte_material"),
)
SWITCHES = _OWN


def wanted(view_layer):
    """Passes beside the beauty."""
    result = [p for p in (*_BLENDERS, *_OWN) if p.wanted(view_layer)]
    for layer, name, switch in _MATTES:
        if getattr(view_layer, switch):
            result += (
                Pass(f"{layer}{level:02}", f"{name}{level:02}", "RGBA", "COLOR", switch)
                for level in range(_LEVELS)
            )
    return result


def layers(passes):
    """The renderer's names to ask for; a matte's levels are one."""
    mattes = [layer for layer, _, _ in _MATTES]
    found = (next((m for m in mattes if p.layer.startswith(m)), p.layer) for p in passes)
    return list(dict.fromkeys(found))


def fill(result, picture, passes, view):
    """Puts a picture into Blender's result of the same size. `view`: what it was rendered from."""
    target = result.layers[0].passes
    _put(target["Combined"], picture.stack("RGBA"))
    for wanted_pass in passes:
        values = picture.stack(wanted_pass.names())
        if values is None or wanted_pass.name not in target:
            continue
        if wanted_pass.layer == "depth":
            values = _along_axis(values, picture, view)
        _put(target[wanted_pass.name], values)


def _put(target, values):
    target.rect = values[::-1].reshape(-1, values.shape[2])


def _along_axis(depth, picture, view):
    """Blender measures along the camera's axis, the renderer along the ray."""
    x0, y0, x1, y1 = picture.window
    width, height = picture.size
    half = np.tan(np.radians(view.camera["fov"]) / 2.0)
    x = (2.0 * np.arange(x0, x1) + 1.0 - width) / height * half
    y = (2.0 * np.arange(y0, y1) + 1.0 - height) / height * half
    along = depth[:, :, 0] / np.sqrt(1.0 + x[None, :] ** 2 + y[:, None] ** 2)
    return np.where(depth[:, :, 0] > 0.0, along, _FAR)[:, :, None]


def tell_mattes(result, picture, view_layer):
    """Names and hashes of mattes, by which the compositor lets objects be picked. The keys stand for
    Blender's own names of the layers."""
    found = {}
    for key, text in picture.texts.items():
        if key.startswith("cryptomatte/"):
            _, matte, field = key.split("/")
            found.setdefault(matte, {})[field] = text
    for layer, name, _ in _MATTES:
        for matte, fields in found.items():
            if fields.get("name") == layer:
                for field, text in {**fields, "name": f"{view_layer.name}.{name}"}.items():
                    result.stamp_data_add_field(f"cryptomatte/{matte}/{field}", text)
