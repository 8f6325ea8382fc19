# SPDX-License-Identifier: Apache-2.0
"""Evaluated objects as mesh files."""

import numpy as np

from . import glb

SURFACES = {"MESH", "CURVE", "SURFACE", "FONT", "META"}


def write(object, path):
    """Writes what the evaluated object shows, modifiers applied, in its own space. Returns the slots
    that have triangles; none for an object without any, of which no file is written."""
    owned = object.type != "MESH"
    mesh = object.to_mesh() if owned else object.data
    if mesh is None:
        return []
    try:
        corners, triangles, slots = _arrays(mesh)
        return glb.write(path, corners, triangles, slots) if len(triangles) else []
    finally:
        if owned:
            object.to_mesh_clear()


def _get(collection, name, width, kind=np.float32):
    values = np.empty(len(collection) * width, kind)
    collection.foreach_get(name, values)
    return values.reshape(-1, width)


def _arrays(mesh):
    mesh.calc_loop_triangles()
    triangles = _get(mesh.loop_triangles, "loops", 3, np.int32)
    slots = _get(mesh.loop_triangles, "material_index", 1, np.int32)[:, 0]
    vertices = _get(mesh.loops, "vertex_index", 1, np.int32)[:, 0]
    corners = {
        "POSITION": _get(mesh.vertices, "co", 3)[vertices],
        "NORMAL": _normals(mesh),
    }
    layers = sorted(mesh.uv_layers, key=lambda layer: not layer.active_render)
    for number, layer in enumerate(layers[:2]):
        corners[f"TEXCOORD_{number}"] = _get(layer.data, "uv", 2)
    color = _color(mesh)
    if color is not None:
        values = _get(color.data, "color", 4)
        corners["COLOR_0"] = values[vertices] if color.domain == "POINT" else values
    return corners, triangles, slots


def _normals(mesh):
    if hasattr(mesh, "corner_normals"):  # Blender 4.1 and later
        return _get(mesh.corner_normals, "vector", 3)
    mesh.calc_normals_split()
    return _get(mesh.loops, "normal", 3)


def _color(mesh):
    """The colours that a render shows; there may be attributes of other domains."""
    colors = [a for a in mesh.color_attributes if a.domain in {"POINT", "CORNER"}]
    if not colors:
        return None
    shown = mesh.color_attributes.render_color_index
    chosen = mesh.color_attributes[shown] if 0 <= shown < len(mesh.color_attributes) else colors[0]
    return chosen if chosen in colors else colors[0]
