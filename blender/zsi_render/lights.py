# SPDX-License-Identifier: Apache-2.0
"""Blender's lights as the scene's. A light of colour 1 shows 1 on a white diffuse surface that faces
it: irradiance over pi. Blender's watts, by what Cycles makes of them:

    point, spot   watts / (4 pi) per steradian            colour at distance 1: watts / (4 pi^2)
    sun           watts per square metre of irradiance    colour: strength / pi
    area          watts / (4 area) of radiance            emission: the same

with the inverse square over Blender's units, whatever the scene's unit scale says they are."""

import math


def _color(light):
    """Watts of each channel; a light's nodes may tint and scale it."""
    color = [light.energy * c for c in light.color]
    if light.use_nodes and light.node_tree:
        output = light.node_tree.get_output_node("ALL")
        links = output.inputs["Surface"].links if output else ()
        node = links[0].from_node if links else None
        if node and node.type == "EMISSION":
            strength = node.inputs["Strength"].default_value
            color = [
                c * tint * strength for c, tint in zip(color, node.inputs["Color"].default_value)
            ]
    return color


def _scaled(color, factor):
    return [c * factor for c in color]


def entry(light, matrix, classes, picture, note):
    """What a scene file says of the light at `matrix`; None for what has nothing to shine with."""
    position = list(matrix.translation)
    axis = list(-matrix.col[2].to_3d().normalized())
    chosen = classes.get(light.zsi.shader)
    if chosen:
        values = getattr(light.zsi, chosen.name)
        result = {
            "class": chosen.name,
            "position": position,
            "axis": axis,
            "radius": light.zsi.radius,
            "parameters": chosen.written(values, picture),
        }
        return result
    color = _color(light)
    if light.type == "SUN":
        return {
            "kind": "sun",
            "direction": [-a for a in axis],
            "color": _scaled(color, 1.0 / math.pi),
            "angle": min(math.degrees(light.angle), 180.0),
        }
    if light.type in {"POINT", "SPOT"}:
        result = {
            "kind": "point",
            "position": position,
            "color": _scaled(color, 0.25 / math.pi**2),
            "radius": light.shadow_soft_size,
        }
        if light.type == "SPOT":
            outer = light.spot_size / 2.0
            # Blender blends over a share of the cosine's range.
            inner = math.acos(math.cos(outer) + light.spot_blend * (1.0 - math.cos(outer)))
            result |= {
                "kind": "spot",
                "axis": axis,
                "angle": math.degrees(2.0 * outer),
                "innerAngle": math.degrees(2.0 * inner),
            }
        return result
    return _area(light, matrix, position, axis, color, note)


def _area(light, matrix, position, axis, color, note):
    # The object's scale makes the light larger but not stronger.
    width = light.size * matrix.col[0].to_3d().length
    height = light.size if light.shape in {"SQUARE", "DISK"} else light.size_y
    height *= matrix.col[1].to_3d().length
    is_round = light.shape in {"DISK", "ELLIPSE"}
    area = width * height * (math.pi / 4.0 if is_round else 1.0)
    if not area > 0.0:
        note(f'light "{light.name}": has no area')
        return None
    if light.spread < math.pi * 0.999:
        note(f'light "{light.name}": its spread is left out, it shines to all sides')
    result = {"position": position, "axis": axis, "emission": _scaled(color, 0.25 / area)}
    if is_round:
        if abs(width - height) > 1e-3 * max(width, height):
            note(f'light "{light.name}": its ellipse is a disc of the same area')
        return {"kind": "disc", "radius": math.sqrt(width * height) / 2.0, **result}
    up = list(matrix.col[1].to_3d().normalized())
    return {"kind": "rectangle", "up": up, "size": [width, height], **result}
