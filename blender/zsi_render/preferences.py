# SPDX-License-Identifier: Apache-2.0
"""Where the renderer is, and which shader classes it has."""

import json
import os

import bpy
from bpy.props import StringProperty

from . import program


class Preferences(bpy.types.AddonPreferences):
    """Of the add-on."""

    bl_idname = __package__

    program: StringProperty(
        name="zsi",
        subtype="FILE_PATH",
        description="The command; empty: the one on PATH, else that of the usual places",
    )
    shader_path: StringProperty(
        name="Shaders",
        description="Folders of further shader libraries, with colons between them; empty: those "
        "of zsi. Classes that are new get their panels when the add-on is enabled again",
    )

    def draw(self, _context):
        layout = self.layout
        layout.prop(self, "program")
        layout.prop(self, "shader_path")
        try:
            layout.label(text=f"Found: {program.find(self.program)}", icon="CHECKMARK")
        except program.ProgramError as error:
            layout.label(text=str(error), icon="ERROR")


def current():
    """The add-on's preferences."""
    return bpy.context.preferences.addons[__package__].preferences


def command():
    """The program and the shader path. Raises ProgramError where it is not found."""
    chosen = current()
    return program.find(chosen.program), chosen.shader_path


def descriptions():
    """Of all shader classes: those that the add-on was built with, and with a shader path of the
    user's those of its libraries. Panels are there before the program is found."""
    with open(os.path.join(os.path.dirname(__file__), "classes.json"), encoding="utf-8") as file:
        found = {entry["name"]: entry for entry in json.load(file)}
    if current().shader_path:
        try:
            found |= {entry["name"]: entry for entry in program.describe(*command())}
        except program.ProgramError as error:
            print(f"zsi_render: {error}")
    return list(found.values())
