# SPDX-License-Identifier: Apache-2.0
"""What stands behind the sockets of a material's nodes, as far as a shader without nodes can show it:
a value, or a picture with its place."""

from dataclasses import dataclass, field
from math import cos, sin

from .shader_classes import uv_transform

_CHANNELS = {"R": 0, "Red": 0, "G": 1, "Green": 1, "B": 2, "Blue": 2}


@dataclass
class Texture:
    """An image, one channel of it where a number is wanted."""

    image: object
    transform: list
    channel: int = 0
    is_alpha: bool = False


@dataclass
class Input:
    """`value` counts where there is no `texture`."""

    value: object
    texture: Texture | None = None
    bump: tuple | None = field(default=None)


def source(socket):
    """The node and its socket that feed a socket, through reroutes; None twice without."""
    while socket is not None and socket.links and not socket.links[0].is_muted:
        link = socket.links[0]
        if link.from_node.type != "REROUTE":
            return link.from_node, link.from_socket
        socket = link.from_node.inputs[0]
    return None, None


class Reader:
    """Reads the inputs of one shader node; `note(text)` gets what is left out."""

    def __init__(self, node, note):
        self._node, self._note = node, note

    def socket(self, *names):
        """Of the first name that this Blender's node has."""
        for name in names:
            if name in self._node.inputs:
                return self._node.inputs[name]
        return None

    def __call__(self, *names, default=0.0):
        socket = self.socket(*names)
        if socket is None:
            return Input(default)
        value = socket.default_value
        value = list(value)[:3] if hasattr(value, "__len__") else value
        node, output = source(socket)
        if node is None:
            return Input(value)
        if node.type == "RGB":
            return Input(list(node.outputs[0].default_value)[:3])
        if node.type == "VALUE":
            return Input(node.outputs[0].default_value)
        return Input(value, self._texture(node, output, socket.name))

    def _texture(self, node, output, what):
        channel = 0
        if node.type in {"SEPRGB", "SEPARATE_COLOR", "SEPXYZ"}:
            channel = _CHANNELS.get(output.name, 0)
            node, output = source(node.inputs[0])
        if node is None or node.type != "TEX_IMAGE" or node.image is None:
            named = f'"{node.name}"' if node else "a node"
            self._note(f"{named} at {what} is left out; an image texture is what is read")
            return None
        if node.projection != "FLAT":
            self._note(f'"{node.name}": its projection is left out, uv are taken')
        return Texture(node.image, self._place(node, what), channel, output.name == "Alpha")

    def _place(self, texture, what):
        node, _ = source(texture.inputs["Vector"])
        if node is None or node.type in {"UVMAP", "TEX_COORD"}:
            return uv_transform((1, 1), 0.0, (0, 0))
        if node.type != "MAPPING" or node.vector_type not in {"POINT", "TEXTURE"}:
            self._note(f'"{node.name}" before the texture at {what} is left out; Mapping is read')
            return uv_transform((1, 1), 0.0, (0, 0))
        scale, turn = node.inputs["Scale"].default_value, node.inputs["Rotation"].default_value[2]
        move = node.inputs["Location"].default_value
        if node.vector_type == "POINT":
            return uv_transform(scale, turn, move)
        # The inverse: moved back, turned back, scaled down.
        x, y = (1.0 / (s or 1.0) for s in scale[:2])
        c, s = cos(turn), sin(turn)
        return [
            [c * x, -s * y, 0.0],
            [s * x, c * y, 0.0],
            [-(move[0] * c + move[1] * s) * x, (move[0] * s - move[1] * c) * y, 1.0],
        ]

    def height(self):
        """The picture of a Bump node at the normal and its depth; None without."""
        socket = self.socket("Normal")
        node, _ = source(socket) if socket else (None, None)
        if node is None:
            return None
        if node.type != "BUMP":
            self._note(f'"{node.name}" at Normal is left out: no shader reads pictures of normals')
            return None
        texture_node, output = source(node.inputs["Height"])
        if texture_node is None:
            return None
        texture = self._texture(texture_node, output, "Height")
        depth = node.inputs["Strength"].default_value * node.inputs["Distance"].default_value
        return texture and (texture, -depth if node.invert else depth)
