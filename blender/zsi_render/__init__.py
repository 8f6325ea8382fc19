# SPDX-License-Identifier: Apache-2.0
"""zsi as a render engine of Blender."""

bl_info = {
    "name": "zsi",
    "description": "Renders with zsi and its shader classes",
    "author": "The Zephyr shaders authors",
    "version": (0, 0, 0),  # set by package.py
    "blender": (3, 4, 0),
    "category": "Render",
}

import bpy

from . import engine, panels, preferences, properties

_CLASSES = (engine.ZsiRenderEngine, *panels.CLASSES)


def register():
    bpy.utils.register_class(preferences.Preferences)
    properties.register(preferences.descriptions())
    for added in _CLASSES:
        bpy.utils.register_class(added)
    for panel in panels.shared():
        panel.COMPAT_ENGINES.add(engine.ZsiRenderEngine.bl_idname)


def unregister():
    for panel in panels.shared():
        panel.COMPAT_ENGINES.discard(engine.ZsiRenderEngine.bl_idname)
    for added in reversed(_CLASSES):
        bpy.utils.unregister_class(added)
    properties.unregister()
    bpy.utils.unregister_class(preferences.Preferences)
