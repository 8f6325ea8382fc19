# SPDX-License-Identifier: Apache-2.0
"""Shader classes as Blender's properties, made from what `zsi info CLASS --json` tells: one property
group for each class, and back again the values that a scene file says of it."""

import re
import zlib
from math import cos, sin

import bpy
from bpy.props import (
    BoolProperty,
    EnumProperty,
    FloatProperty,
    FloatVectorProperty,
    IntProperty,
    PointerProperty,
)

_LONGEST = 50  # Blender's identifiers end at 63 characters, and a matrix appends to its own
_VECTORS = {"Vec2f": 2, "Vec3f": 3, "Vec4f": 4}
_TEXTURES = ("texture1D", "texture2D", "textureCube")
_INVERSE = "Inverse"
_COMMON = {"ambient occlusion", "masking"}


def identifier(parameter):
    """Of a parameter's name: Blender wants a letter in front, and not too many of them."""
    name = parameter.lstrip("_")
    if len(name) > _LONGEST:
        name = f"{name[: _LONGEST - 9]}_{zlib.crc32(name.encode()):08x}"
    return name


def label(parameter):
    """u_roughValue: Rough Value."""
    words = re.sub(r"^u?_+", "", parameter).replace("_", " ")
    words = re.sub(r"(?<=[a-z0-9])(?=[A-Z])", " ", words)
    return words[:1].upper() + words[1:]


def changed(values, _context):
    """Tells Blender that the datablock is another one, which it does not notice by itself."""
    values.id_data.update_tag()


class Parameter:
    """One row of a class: its properties in Blender, whether it is read, its value in a scene."""

    def __init__(self, description):
        self.name, self.type = description["name"], description["type"]
        self.id, self.label = identifier(self.name), label(self.name)
        self.group = description.get("group", "")
        self.when = description.get("when", [])
        self.default = description["default"] if description["hasDefault"] else None
        self.step = description.get("step")
        self.soft = {
            soft: description[key]
            for key, soft in (("minimum", "soft_min"), ("maximum", "soft_max"))
            if key in description
        }
        self.meaning = description.get("meaning", "")
        self.is_texture = self.type in _TEXTURES
        # Matrices start as what changes nothing, not as the 0 that the shader has: always written.
        self.is_placement = self.type == "Mat4f"
        self.is_turn = self.type == "Mat3f" and "rotation" in self.meaning
        self.is_uv = self.type == "Mat3f" and not self.is_turn

    def properties(self):
        """Identifiers and definitions."""
        about = {
            "name": self.label,
            "description": f"{self.meaning} ({self.name})",
            "update": changed,
        }
        if self.is_texture:
            return {self.id: PointerProperty(type=bpy.types.Image, **about)}
        if self.is_placement:
            about["description"] += ". Empty: none; else the object whose space the picture fills"
            return {self.id: PointerProperty(type=bpy.types.Object, **about)}
        if self.is_turn:
            return {self.id: FloatVectorProperty(subtype="EULER", **about)}
        if self.is_uv:
            return {
                f"{self.id}_scale": FloatVectorProperty(
                    **about | {"name": "Scale"}, size=2, default=(1, 1)
                ),
                f"{self.id}_rotate": FloatProperty(
                    **about | {"name": "Rotation"}, subtype="ANGLE"
                ),
                f"{self.id}_translate": FloatVectorProperty(
                    **about | {"name": "Location"}, size=2
                ),
            }
        if self.type == "bool":
            return {self.id: BoolProperty(default=bool(self.default), **about)}
        if self.type == "int":
            soft = {key: int(value) for key, value in self.soft.items()}
            return {self.id: IntProperty(default=self.default or 0, **soft, **about)}
        if self.type == "float":
            more = {"step": 100 * self.step} if self.step else {}
            return {
                self.id: FloatProperty(
                    default=self.default or 0.0, precision=4, **more, **self.soft, **about
                )
            }
        size = _VECTORS[self.type]
        if size > 2 and re.search(r"colou?r|diffuse$", self.name, re.IGNORECASE):
            about["subtype"] = "COLOR"
            self.soft = {"soft_min": 0.0, "soft_max": 1.0, **self.soft}
        default = self.default or (0.0,) * size
        return {
            self.id: FloatVectorProperty(
                size=size, default=default, precision=4, **self.soft, **about
            )
        }

    def value(self, values):
        """As far as conditions look at it: a number, or whether a texture is bound."""
        found = getattr(values, self.id)
        return int(found is not None) if self.is_texture else found


class ShaderClass:
    """A class of a shader library; `properties` is its property group."""

    def __init__(self, description):
        self.name, self.kind = description["name"], description["kind"]
        self.summary = description.get("summary", "")
        self.parameters = [Parameter(parameter) for parameter in description["parameters"]]
        self._named = {parameter.name: parameter for parameter in self.parameters}
        annotations = {}
        for parameter in self.parameters:
            if not self._inverted(parameter):
                annotations.update(parameter.properties())
        self.properties = type(
            f"ZSI_PG_{self.name}", (bpy.types.PropertyGroup,), {"__annotations__": annotations}
        )

    def _inverted(self, parameter):
        """The parameter that this one is the inverse of, if any: nobody has to set both."""
        if parameter.is_placement and parameter.name.endswith(_INVERSE):
            return self._named.get(parameter.name.removesuffix(_INVERSE))
        return None

    def shown(self):
        """Parameters that a person sets, by group in the class's own order; what nearly all
        classes have comes last."""
        groups = {}
        for parameter in self.parameters:
            if not self._inverted(parameter):
                groups.setdefault(parameter.group, []).append(parameter)
        for group in _COMMON & set(groups):
            groups[group] = groups.pop(group)
        return groups

    def is_read(self, parameter, values):
        """Whether the shader looks at it, with the others as they are. Each condition names
        parameters of which one has to be in a range; for switches and textures that is: on."""
        for condition in parameter.when:
            low, high = condition.get("from", 1), condition.get("to", float("inf"))
            others = (self._named[name] for name in condition["parameters"] if name in self._named)
            if not any(low <= other.value(values) <= high for other in others):
                return False
        return True

    def written(self, values, picture):
        """The parameters that a scene file has to say: those that somebody has set, and those
        without a default, such as matrices.
        `picture(image)`: the value of a texture."""
        result = {}
        for parameter in self.parameters:
            source = self._inverted(parameter) or parameter
            if parameter.is_texture:
                if image := getattr(values, parameter.id):
                    result[parameter.name] = picture(image, parameter.type == "textureCube")
            elif parameter.is_placement:
                placed = getattr(values, source.id)
                matrix = placed.matrix_world if placed else None
                if matrix is not None and source is parameter:
                    matrix = matrix.inverted_safe()
                result[parameter.name] = rows(matrix) if matrix is not None else {}
            elif parameter.is_turn:
                turn = getattr(values, parameter.id).to_matrix()
                result[parameter.name] = rows(turn)
            elif parameter.is_uv:
                result[parameter.name] = uv_transform(
                    getattr(values, f"{parameter.id}_scale"),
                    getattr(values, f"{parameter.id}_rotate"),
                    getattr(values, f"{parameter.id}_translate"),
                )
            elif parameter.default is None or values.is_property_set(parameter.id):
                value = getattr(values, parameter.id)
                result[parameter.name] = list(value) if parameter.type in _VECTORS else value
        return result


def rows(matrix):
    """Blender's column vectors as the scene file's row vectors."""
    return [list(row) for row in matrix.transposed()]


def uv_transform(scale, angle, translate):
    """Of texture coordinates, (u, v, 1) from the left: scaled, turned counterclockwise, moved."""
    c, s = cos(angle), sin(angle)
    return [
        [scale[0] * c, scale[0] * s, 0.0],
        [-scale[1] * s, scale[1] * c, 0.0],
        [translate[0], translate[1], 1.0],
    ]


def make_owner(name, kind, classes, first, **more):
    """A property group for materials, worlds or lights: `shader`, one of the classes or of the
    choices `first`, and one group for the values of each class."""
    mine = [c for c in classes if c.kind == kind]
    items = [*first, *((c.name, c.name, c.summary) for c in mine)]
    annotations = {
        "shader": EnumProperty(
            name="Shader", items=items, default=first[0][0], update=changed
        ),
        **{c.name: PointerProperty(type=c.properties) for c in mine},
        **more,
    }
    return type(name, (bpy.types.PropertyGroup,), {"__annotations__": annotations})
