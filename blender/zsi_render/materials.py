# SPDX-License-Identifier: Apache-2.0
"""Blender's materials as the scene's: a shader class that the user has chosen with its values, or what
is nearest to the material's nodes."""

from . import principled
from .nodes import source

GREY = {"class": "corvid_Mtl_MetallicPaint", "parameters": principled.paint([0.8] * 3, 0.04, 0.25)}
"""What has no material shows Blender's own default."""


def entry(material, classes, images, note):
    """What a scene file says of it."""
    if material is None:
        return GREY
    chosen = classes.get(material.zsi.shader)
    if chosen:
        values = getattr(material.zsi, chosen.name)
        return {"class": chosen.name, "parameters": chosen.written(values, images.picture)}

    def about(text):
        note(f'material "{material.name}": {text}')

    if not material.use_nodes:
        color, roughness = list(material.diffuse_color)[:3], material.roughness
        if material.metallic >= 0.5:
            return principled.metal(color, roughness**2)
        return {**GREY, "parameters": principled.paint(color, 0.04, roughness**2)}
    output = material.node_tree.get_output_node("ALL")
    node, _ = source(output.inputs["Surface"]) if output else (None, None)
    if node is None:
        about("nothing is linked to its surface")
        return principled.matt([0.0] * 3)
    if output.inputs["Displacement"].is_linked:
        about("its displacement is left out")
    mapped = principled.KINDS.get(node.type)
    if mapped is None:
        about(f'node "{node.name}" has no counterpart; the material is grey')
        return GREY
    return mapped(node, images, about)
