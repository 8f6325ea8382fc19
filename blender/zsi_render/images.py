# SPDX-License-Identifier: Apache-2.0
"""Blender's images as files that the renderer reads."""

import os
import re

import bpy
import numpy as np

from . import exr

_LINEAR = {"Non-Color", "Raw", "Linear", "Linear Rec.709", "Generic Data"}
_READABLE = {
    "BMP", "PNG", "JPEG", "JPEG2000", "TARGA", "TARGA_RAW", "OPEN_EXR", "OPEN_EXR_MULTILAYER",
    "HDR", "TIFF", "WEBP", "IRIS", "CINEON", "DPX",
}  # fmt: skip
_EXTENSIONS = {
    "PNG": ".png", "JPEG": ".jpg", "JPEG2000": ".jp2", "TARGA": ".tga", "TARGA_RAW": ".tga",
    "OPEN_EXR": ".exr", "OPEN_EXR_MULTILAYER": ".exr", "HDR": ".hdr", "TIFF": ".tif", "BMP": ".bmp",
    "WEBP": ".webp", "IRIS": ".rgb", "CINEON": ".cin", "DPX": ".dpx",
}  # fmt: skip


class Images:
    """Files of images, each made once; `note(text)` gets what cannot be shown as Blender does."""

    def __init__(self, folder, note):
        self._folder, self._note, self._made = folder, note, {}

    def picture(self, image, cube=False):
        """The value of a texture parameter."""
        return {
            "cube" if cube else "texture": self.file(image),
            "colorSpace": "linear" if self._is_linear(image) else self._space(image),
        }

    def squared(self, image, channel=0, factor=1.0):
        """The same of the square of one channel, in all of them: widths of lobes of roughness."""
        key = (image.original.as_pointer(), channel, factor)
        if key not in self._made:
            values = np.repeat(self._pixels(image)[:, :, channel : channel + 1] * factor, 4, axis=2)
            path = self._place(image, ".squared.exr")
            exr.write(path, values * values)
            self._made[key] = path
        return {"texture": self._made[key], "colorSpace": "linear"}

    def mean(self, image, channel=0):
        """Of one channel, as it is stored."""
        return float(self._pixels(image)[:, :, channel].mean())

    def file(self, image):
        """A file with what the image is: its own, its packed bytes, or its pixels written out."""
        image = image.original
        key = image.as_pointer()
        if key not in self._made:
            self._made[key] = self._file(image)
        return self._made[key]

    def _file(self, image):
        if image.source == "TILED":
            self._note(f'image "{image.name}": only its first tile is shown')
        if image.source == "MOVIE":
            self._note(f'image "{image.name}": movies are shown as they are in Blender now')
        elif image.source in {"FILE", "SEQUENCE", "TILED"} and not image.is_dirty:
            if image.packed_file and image.file_format in _READABLE:
                path = self._place(image, _EXTENSIONS[image.file_format])
                with open(path, "wb") as file:
                    file.write(image.packed_file.data)
                return path
            path = bpy.path.abspath(image.filepath_raw, library=image.library)
            path = os.path.realpath(path.replace("<UDIM>", "1001"))
            if image.file_format in _READABLE or not image.has_data:
                return path  # where it is missing, the renderer says so by its name
        path = self._place(image, ".exr")
        exr.write(path, self._pixels(image))
        return path

    def _place(self, image, extension):
        name = re.sub(r"[^A-Za-z0-9_-]+", "_", image.name)[:40]
        return os.path.join(self._folder, f"{len(self._made)}_{name}{extension}")

    @staticmethod
    def _pixels(image):
        """RGBA as stored, rows from the top; grey where Blender has no pixels."""
        width, height = image.size
        if not width or not height:
            return np.full((1, 1, 4), 0.5, np.float32)
        values = np.empty(width * height * image.channels, np.float32)
        image.pixels.foreach_get(values)
        values = values.reshape(height, width, image.channels)[::-1]
        if image.channels == 4:
            return values
        rgba = np.ones((height, width, 4), np.float32)
        rgba[:, :, : min(3, image.channels)] = values[:, :, :3]
        return rgba

    @staticmethod
    def _is_linear(image):
        return image.colorspace_settings.name in _LINEAR or image.is_float

    def _space(self, image):
        name = image.colorspace_settings.name
        if name != "sRGB":
            self._note(f'image "{image.name}": its colour space {name} is taken as sRGB')
        return "srgb"
