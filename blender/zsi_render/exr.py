# SPDX-License-Identifier: Apache-2.0
"""Pictures of many float layers as OpenEXR files: what the renderer writes is read, and pictures that
only Blender has are written for it. Blender's Python knows no other way to all layers of a file."""

import struct
import zlib

import numpy as np

_MAGIC = 20000630
_UNCOMPRESSED, _ZIPS, _ZIP = 0, 2, 3
_LINES = {_UNCOMPRESSED: 1, _ZIPS: 1, _ZIP: 16}  # of a chunk
_TYPES = {0: "<u4", 1: "<f2", 2: "<f4"}


class Picture:
    """`channels`: arrays (height, width) by name, rows from the top. `window`: x0, y0, x1, y1 of
    them, the end exclusive, in a frame of `size` = (width, height). `texts`: the header's strings."""

    def __init__(self, channels, window, size, texts):
        self.channels, self.window, self.size, self.texts = channels, window, size, texts

    def stack(self, names):
        """Channels side by side, (height, width, N); None where one is missing."""
        if not all(name in self.channels for name in names):
            return None
        return np.stack([self.channels[name] for name in names], axis=-1)


def read(path):
    """Raises ValueError for a file that is not such a picture, or not whole."""
    with open(path, "rb") as file:
        data = file.read()
    try:
        return _decode(data)
    except (struct.error, zlib.error, IndexError, KeyError) as error:
        raise ValueError(f"{path}: not a whole picture: {error}") from error


def _text(data, at):
    end = data.index(b"\0", at)
    return data[at:end].decode("utf-8", "replace"), end + 1


def _decode(data):
    magic, version = struct.unpack_from("<ii", data)
    if magic != _MAGIC or version & ~0x400 != 2:  # long names are welcome; tiles and parts are not
        raise ValueError("not an OpenEXR file of scan lines")
    at, header, texts = 8, {}, {}
    while data[at]:
        name, at = _text(data, at)
        kind, at = _text(data, at)
        (size,) = struct.unpack_from("<i", data, at)
        header[name] = data[at + 4 : at + 4 + size]
        if kind == "string":
            texts[name] = header[name].decode("utf-8", "replace")
        at += 4 + size
    at += 1
    x0, y0, x1, y1 = struct.unpack("<4i", header["dataWindow"])
    left, top, right, bottom = struct.unpack("<4i", header["displayWindow"])
    width, height = x1 - x0 + 1, y1 - y0 + 1
    compression = header["compression"][0]
    lines = _LINES[compression]
    names, formats = [], []
    entry = 0
    while header["channels"][entry]:
        name, entry = _text(header["channels"], entry)
        names.append(name)
        formats.append(np.dtype(_TYPES[struct.unpack_from("<i", header["channels"], entry)[0]]))
        entry += 16
    line = np.dtype({"names": names, "formats": [(f, width) for f in formats]})
    rows = np.empty(height, line)
    for offset in struct.unpack_from(f"<{-(-height // lines)}Q", data, at):
        y, size = struct.unpack_from("<ii", data, offset)
        count = min(lines, y1 + 1 - y)
        block = data[offset + 8 : offset + 8 + size]
        if compression != _UNCOMPRESSED and size < count * line.itemsize:
            block = _unpredicted(zlib.decompress(block))
        rows[y - y0 : y - y0 + count] = np.frombuffer(block, line, count)
    return Picture(
        {name: rows[name] for name in names},
        (x0 - left, y0 - top, x1 + 1 - left, y1 + 1 - top),
        (right - left + 1, bottom - top + 1),
        texts,
    )


def _unpredicted(block):
    """Bytes are differences from those before, the even ones of the values first."""
    values = np.frombuffer(block, np.uint8).astype(np.uint8)
    values[1:] -= 128
    values = np.cumsum(values, dtype=np.uint8)
    half = (len(values) + 1) // 2
    result = np.empty_like(values)
    result[0::2], result[1::2] = values[:half], values[half:]
    return result.tobytes()


def write(path, pixels):
    """`pixels`: (height, width, 4), RGBA, rows from the top; uncompressed floats."""
    height, width, _ = pixels.shape
    order = "ABGR"  # channels stand by the alphabet

    def attribute(name, kind, value):
        return f"{name}\0{kind}\0".encode() + struct.pack("<i", len(value)) + value

    window = struct.pack("<4i", 0, 0, width - 1, height - 1)
    channels = b"".join(c.encode() + b"\0" + struct.pack("<4i", 2, 0, 1, 1) for c in order)
    header = struct.pack("<ii", _MAGIC, 2) + b"".join(
        (
            attribute("channels", "chlist", channels + b"\0"),
            attribute("compression", "compression", b"\0"),
            attribute("dataWindow", "box2i", window),
            attribute("displayWindow", "box2i", window),
            attribute("lineOrder", "lineOrder", b"\0"),
            attribute("pixelAspectRatio", "float", struct.pack("<f", 1)),
            attribute("screenWindowCenter", "v2f", struct.pack("<2f", 0, 0)),
            attribute("screenWindowWidth", "float", struct.pack("<f", 1)),
            b"\0",
        )
    )
    line = np.dtype([("y", "<i4"), ("size", "<i4"), ("values", "<f4", (4, width))])
    rows = np.empty(height, line)
    rows["y"], rows["size"] = np.arange(height), 16 * width
    rows["values"] = np.asarray(pixels)[:, :, ["RGBA".index(c) for c in order]].transpose(0, 2, 1)
    first = len(header) + 8 * height
    offsets = first + line.itemsize * np.arange(height, dtype="<u8")
    with open(path, "wb") as file:
        file.write(header + offsets.tobytes() + rows.tobytes())
