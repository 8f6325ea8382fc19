# SPDX-License-Identifier: Apache-2.0
"""Panels: settings of a render, and the parameters of a shader class in their groups."""

import bpy

from . import passes, properties


class _Panel:
    """Shown while the engine is chosen."""

    bl_space_type = "PROPERTIES"
    bl_region_type = "WINDOW"

    @classmethod
    def poll(cls, context):
        return context.engine == "ZSI"


def _column(layout):
    layout.use_property_split = True
    layout.use_property_decorate = True
    return layout.column()


class ZSI_PT_sampling(_Panel, bpy.types.Panel):
    """Of the scene."""

    bl_label = "Sampling"
    bl_context = "render"

    def draw(self, context):
        settings, column = context.scene.zsi, _column(self.layout)
        for name in ("samples", "viewport_samples", "noise", "seconds", "denoise"):
            column.prop(settings, name)
        column.separator()
        for name in ("integrator", "max_depth", "clamp", "seed", "animate_seed"):
            column.prop(settings, name)


class ZSI_PT_film(_Panel, bpy.types.Panel):
    """Of the scene."""

    bl_label = "Film"
    bl_context = "render"

    def draw(self, context):
        _column(self.layout).prop(context.scene.render, "film_transparent", text="Transparent")


class ZSI_PT_passes(_Panel, bpy.types.Panel):
    """Of a view layer."""

    bl_label = "Passes"
    bl_context = "view_layer"

    def draw(self, context):
        layer, column = context.view_layer, _column(self.layout)
        for name in ("use_pass_z", "use_pass_normal", "use_pass_position"):
            column.prop(layer, name)
        column.separator()
        for name in ("use_pass_emit", "use_pass_environment"):
            column.prop(layer, name)
        for p in passes.SWITCHES:
            column.prop(layer.zsi, p.layer)
        column.separator()
        column.prop(layer, "use_pass_cryptomatte_object", text="Cryptomatte Object")
        column.prop(layer, "use_pass_cryptomatte_material", text="Cryptomatte Material")


class _ShaderPanel(_Panel):
    """The class chosen for a material, world or light, and its parameters."""

    bl_label = "Shader"

    @staticmethod
    def owner(context):
        """The datablock."""
        raise NotImplementedError

    @classmethod
    def poll(cls, context):
        return super().poll(context) and cls.owner(context) is not None

    def draw(self, context):
        owner = self.owner(context)
        _column(self.layout).prop(owner.zsi, "shader", text="Shader")
        chosen = next((c for c in properties.classes if c.name == owner.zsi.shader), None)
        if chosen is None:
            self.draw_nodes(owner)
            return
        for extra in {"visible", "radius"} & set(owner.zsi.bl_rna.properties.keys()):
            self.layout.prop(owner.zsi, extra)
        self.layout.label(text=chosen.summary)
        values = getattr(owner.zsi, chosen.name)
        for group, parameters in chosen.shown().items():
            box = self.layout.box() if group else self.layout
            if group:
                box.label(text=group.capitalize())
            for parameter in parameters:
                self._draw_parameter(box.column(), chosen, parameter, values)

    def draw_nodes(self, owner):
        """Where no class is chosen."""
        raise NotImplementedError

    @staticmethod
    def _draw_parameter(layout, chosen, parameter, values):
        layout.active = chosen.is_read(parameter, values)
        if parameter.is_texture:
            layout.label(text=parameter.label)
            layout.template_ID(values, parameter.id, new="image.new", open="image.open")
            return
        layout.use_property_split = True
        if parameter.is_uv:
            layout.label(text=parameter.label)
            for part in ("scale", "rotate", "translate"):
                layout.prop(values, f"{parameter.id}_{part}")
            return
        layout.prop(values, parameter.id)


class ZSI_PT_material(_ShaderPanel, bpy.types.Panel):
    """Of a material."""

    bl_context = "material"

    @staticmethod
    def owner(context):
        return context.material

    def draw_nodes(self, owner):
        self.layout.prop(owner, "use_nodes")
        if not owner.use_nodes:
            column = _column(self.layout)
            for name in ("diffuse_color", "metallic", "roughness"):
                column.prop(owner, name)
            return
        output = owner.node_tree.get_output_node("ALL")
        if output:
            socket = output.inputs["Surface"]
            self.layout.template_node_view(owner.node_tree, output, socket)


class ZSI_PT_world(_ShaderPanel, bpy.types.Panel):
    """Of a world."""

    bl_context = "world"

    @staticmethod
    def owner(context):
        return context.world

    def draw_nodes(self, owner):
        if owner.use_nodes:
            background = owner.node_tree.get_output_node("ALL")
            if background:
                self.layout.template_node_view(owner.node_tree, background, background.inputs[0])
        else:
            self.layout.prop(owner, "color")


class ZSI_PT_light(_ShaderPanel, bpy.types.Panel):
    """Of a light."""

    bl_context = "data"

    @staticmethod
    def owner(context):
        return context.light

    def draw_nodes(self, owner):
        column = _column(self.layout)
        column.prop(owner, "type")
        column.prop(owner, "color")
        column.prop(owner, "energy")
        names = {
            "POINT": ("shadow_soft_size",),
            "SPOT": ("shadow_soft_size", "spot_size", "spot_blend"),
            "SUN": ("angle",),
            "AREA": ("shape", "size", "size_y"),
        }
        for name in names[owner.type]:
            if hasattr(owner, name):
                column.prop(owner, name)


CLASSES = (
    ZSI_PT_sampling,
    ZSI_PT_film,
    ZSI_PT_passes,
    ZSI_PT_material,
    ZSI_PT_world,
    ZSI_PT_light,
)

_FOREIGN = {  # panels of other engines that show what this one has itself
    "MATERIAL_PT_preview", "EEVEE_MATERIAL_PT_context_material", "MATERIAL_PT_custom_props",
    "DATA_PT_context_light", "DATA_PT_custom_props_light", "WORLD_PT_context_world",
    "RENDER_PT_color_management",
}  # fmt: skip


def shared():
    """Blender's own panels that say which engines they are for and that this one wants too: all that
    the plain renderer has, and those of materials."""
    for panel in bpy.types.Panel.__subclasses__():
        engines = getattr(panel, "COMPAT_ENGINES", None)
        if engines is not None and ("BLENDER_RENDER" in engines or panel.__name__ in _FOREIGN):
            yield panel
