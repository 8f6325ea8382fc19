# SPDX-License-Identifier: Apache-2.0
"""Blender's world as the scene's environment."""

import math
import os

from mathutils import Euler, Matrix

import numpy as np

from . import exr


def entry(world, is_visible, classes, images, folder, note):
    """What a scene file says of it; None for a black one. `is_visible`: to the camera."""
    if world is None:
        return None
    chosen = classes.get(world.zsi.shader)
    if chosen:
        parameters = chosen.written(getattr(world.zsi, chosen.name), images.picture)
        return {"class": chosen.name, "visible": world.zsi.visible, "parameters": parameters}
    if not world.use_nodes:
        return _picture(_white(folder), list(world.color), Matrix.Identity(3), is_visible)
    output = world.node_tree.get_output_node("ALL")
    node = _source(output.inputs["Surface"]) if output else None
    if node is None:
        return None
    if node.type not in {"BACKGROUND", "EMISSION"}:
        note(f'world "{world.name}": node "{node.name}" is left out; Background is what is read')
        return None
    strength = node.inputs["Strength"].default_value
    if node.inputs["Strength"].is_linked:
        note(f'world "{world.name}": what is linked to the strength is left out')
    color = node.inputs["Color"]
    source = _source(color)
    if source is None:
        gain = [strength * c for c in color.default_value[:3]]
        return _picture(_white(folder), gain, Matrix.Identity(3), is_visible) if any(gain) else None
    is_picture = source.type == "TEX_ENVIRONMENT" and source.image
    if not is_picture or source.projection != "EQUIRECTANGULAR":
        note(
            f'world "{world.name}": node "{source.name}" is left out; an equirectangular picture '
            "is what is read"
        )
        return None
    value = images.picture(source.image)
    turn = _turn(source.inputs["Vector"], world, note)
    return _picture(value, [strength] * 3, turn, is_visible)


def _source(socket):
    """The node behind a socket, through reroutes."""
    while socket.links:
        node = socket.links[0].from_node
        if node.type != "REROUTE":
            return node
        socket = node.inputs[0]
    return None


def _turn(socket, world, note):
    """What is applied to directions before they are looked up."""
    node = _source(socket)
    if node is None or node.type == "TEX_COORD":
        return Matrix.Identity(3)
    if node.type == "MAPPING":
        rotation = Euler(node.inputs["Rotation"].default_value).to_matrix()
        if node.vector_type == "TEXTURE":
            rotation.transpose()
        if any(abs(s - 1.0) > 1e-5 for s in node.inputs["Scale"].default_value):
            note(f'world "{world.name}": the scale of its mapping is left out')
        return rotation
    note(f'world "{world.name}": node "{node.name}" is left out; Mapping is what is read')
    return Matrix.Identity(3)


def _white(folder):
    path = os.path.join(folder, "white.exr")
    exr.write(path, np.ones((1, 1, 4), np.float32))
    return {"texture": path, "colorSpace": "linear"}


def _picture(picture, gain, turn, is_visible):
    """The short form of a picture around the scene, with turns about any axis."""
    # In the middle of the picture Blender has +x, the renderer +y.
    turn = Matrix.Rotation(math.pi / 2.0, 3, "Z") @ turn
    cube = {"cube": picture["texture"], "colorSpace": picture["colorSpace"]}
    parameters = {
        "reflectionCube": cube,
        "diffuseCube": cube,
        "globalIBLMatrix": [list(row) for row in turn],  # of directions, before they are looked up
        "backgroundColor": [0.0, 0.0, 0.0],
    }
    for kind in ("reflect", "diffuse"):
        parameters |= {f"{kind}IBLGainMode": 1, f"{kind}IBLGain": gain}
    return {"class": "corvid_Env_Default", "visible": is_visible, "parameters": parameters}
