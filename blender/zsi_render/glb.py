# SPDX-License-Identifier: Apache-2.0
"""Triangle meshes as glTF 2.0 binary files, one part for each material slot. Of the formats that the
renderer reads it alone has two sets of texture coordinates, colours and parts."""

import json
import struct

import numpy as np

_FLOAT, _UNSIGNED = 5126, 5125
_VERTICES, _INDICES = 34962, 34963
_SHAPES = {2: "VEC2", 3: "VEC3", 4: "VEC4"}


def part_name(slot):
    """What the file calls the part of a material slot."""
    return f"slot {slot}"


def write(path, corners, triangles, slots):
    """`corners`: arrays of one row for each corner, by glTF's attribute names ("POSITION", "NORMAL",
    "TEXCOORD_0" with v upwards, ...). `triangles`: (N, 3) indices of corners. `slots`: of N.
    Returns the slots that have triangles. Axes are left as they are."""
    blob, views, accessors, primitives = [], [], [], []
    used = [int(slot) for slot in np.unique(slots)]

    def add(values, target, **more):
        values = np.ascontiguousarray(values)
        offset = sum(map(len, blob))
        blob.append(values.tobytes())
        place = {"byteOffset": offset, "byteLength": values.nbytes}
        views.append({"buffer": 0, **place, "target": target})
        accessors.append({"bufferView": len(views) - 1, "count": len(values), **more})
        return len(accessors) - 1

    for material, slot in enumerate(used):
        corner, index = np.unique(triangles[slots == slot], return_inverse=True)
        attributes = {}
        for name, values in corners.items():
            values = np.asarray(values, np.float32)[corner]
            if name.startswith("TEXCOORD"):
                # glTF's v runs downwards.
                values = values * np.float32([1, -1]) + np.float32([0, 1])
            bounds = {}
            if name == "POSITION":
                bounds = {"min": values.min(axis=0).tolist(), "max": values.max(axis=0).tolist()}
            attributes[name] = add(
                values, _VERTICES, componentType=_FLOAT, type=_SHAPES[values.shape[1]], **bounds
            )
        indices = add(
            index.astype(np.uint32).ravel(), _INDICES, componentType=_UNSIGNED, type="SCALAR"
        )
        primitives.append({"attributes": attributes, "indices": indices, "material": material})
    binary = b"".join(blob)
    document = {
        "asset": {"version": "2.0"},
        "scene": 0,
        "scenes": [{"nodes": [0]}],
        "nodes": [{"mesh": 0, "name": "mesh"}],
        "meshes": [{"primitives": primitives}],
        "materials": [{"name": part_name(slot)} for slot in used],
        "buffers": [{"byteLength": len(binary)}],
        "bufferViews": views,
        "accessors": accessors,
    }
    text = json.dumps(document, separators=(",", ":")).encode()
    text += b" " * (-len(text) % 4)
    with open(path, "wb") as file:
        file.write(struct.pack("<4sII", b"glTF", 2, 12 + 8 + len(text) + 8 + len(binary)))
        file.write(struct.pack("<I4s", len(text), b"JSON") + text)
        file.write(struct.pack("<I4s", len(binary), b"BIN\0") + binary)
    return used
