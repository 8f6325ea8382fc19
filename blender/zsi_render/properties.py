# SPDX-License-Identifier: Apache-2.0
"""The add-on's properties of scenes, view layers, materials, worlds and lights."""

import bpy
from bpy.props import BoolProperty, EnumProperty, FloatProperty, IntProperty, PointerProperty

from . import passes
from .shader_classes import ShaderClass, changed, make_owner


class SceneSettings(bpy.types.PropertyGroup):
    """Keys of a scene file's settings, and how long a render goes on."""

    samples: IntProperty(
        name="Samples", default=64, min=1, max=1 << 20, description="Of a pixel, at most"
    )
    noise: FloatProperty(
        name="Noise",
        min=0.0,
        soft_max=0.1,
        precision=3,
        description="Parts of the picture whose noise is below it get no more samples; 0: all "
        "samples everywhere",
    )
    seconds: FloatProperty(
        name="Time Limit",
        min=0.0,
        subtype="TIME",
        unit="TIME_ABSOLUTE",
        description="Seconds after which a render ends; 0: none",
    )
    viewport_samples: IntProperty(
        name="Viewport", default=16, min=1, max=1 << 20, description="Samples in the viewport"
    )
    denoise: BoolProperty(name="Denoise", description="Take the noise out of final renders")
    integrator: EnumProperty(
        name="Integrator",
        items=(
            ("path", "Paths", "Paths by what the materials sample, with lobes as wide as they are"),
            ("shade", "Shade", "The materials' own shading"),
        ),
    )
    max_depth: IntProperty(
        name="Depth", default=64, min=0, max=1000, description="Bends and bounces after another"
    )
    clamp: FloatProperty(
        name="Clamp",
        min=0.0,
        description="Brightest channel that a sample of a pixel may have; 0: no limit",
    )
    seed: IntProperty(name="Seed", default=1, min=0, description="Of all random numbers")
    animate_seed: BoolProperty(
        name="Animate Seed", default=True, description="Other noise in each frame"
    )

    def written(self, frame, samples=None):
        """The settings of a scene file."""
        return {
            "samples": samples or self.samples,
            "noise": self.noise if samples is None else 0.0,
            "maxDepth": self.max_depth,
            "sampleClamp": self.clamp,
            "seed": (self.seed + frame * self.animate_seed) % (1 << 32),
            "integrator": self.integrator,
        }


_groups = []
_owners = {}
classes = []
"""ShaderClass of each class, while the add-on is registered."""


def register(descriptions):
    """Makes the properties of the classes so described."""
    classes[:] = [ShaderClass(description) for description in descriptions]
    nodes = ("NODES", "Nodes", "What is nearest to the material's nodes")
    layer_switches = {
        p.layer: BoolProperty(name=p.name, description=p.about) for p in passes.SWITCHES
    }
    owners = {
        bpy.types.Scene: SceneSettings,
        bpy.types.ViewLayer: type(
            "ZSI_PG_ViewLayer", (bpy.types.PropertyGroup,), {"__annotations__": layer_switches}
        ),
        bpy.types.Material: make_owner("ZSI_PG_Material", "material", classes, [nodes]),
        bpy.types.World: make_owner(
            "ZSI_PG_World",
            "environment",
            classes,
            [("NODES", "Nodes", "The picture or colour of the world's nodes")],
            visible=BoolProperty(
                name="Visible",
                default=True,
                description="The camera sees what is reflected",
                update=changed,
            ),
        ),
        bpy.types.Light: make_owner(
            "ZSI_PG_Light",
            "light",
            classes,
            [("BLENDER", "Blender", "The light as Blender has it, by its watts")],
            radius=FloatProperty(
                name="Radius",
                min=0.0,
                unit="LENGTH",
                description="Above 0: soft shadows",
                update=changed,
            ),
        ),
    }
    _groups[:] = [*(c.properties for c in classes), *owners.values()]
    for group in _groups:
        bpy.utils.register_class(group)
    for owner, group in owners.items():
        owner.zsi = PointerProperty(type=group)
    _owners.update(owners)


def unregister():
    """Takes them back; values stay in the file."""
    for owner in _owners:
        del owner.zsi
    _owners.clear()
    for group in reversed(_groups):
        bpy.utils.unregister_class(group)
    _groups.clear()
    classes.clear()
