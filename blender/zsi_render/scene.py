# SPDX-License-Identifier: Apache-2.0
"""An evaluated scene of Blender's as a scene file with its meshes and pictures."""

import json
import os

import bpy
import numpy as np

from . import camera, lights, materials, meshes, world
from .glb import part_name
from .images import Images
from .shader_classes import rows

_SILENT = {"EMPTY", "CAMERA", "LIGHT_PROBE", "ARMATURE", "LATTICE", "SPEAKER"}


class Exporter:
    """Writes into `folder`, again and again as the scene changes: a mesh or picture that is there
    already stays until `changed` names it. `notes`: what of the last scene is not shown as Blender
    would, a line each."""

    def __init__(self, folder, classes):
        self._folder, self._classes = folder, {c.name: c for c in classes}
        self._meshes = {}
        self._files = 0
        self._images = Images(folder, self._note)
        self.notes = []

    def changed(self, depsgraph):
        """Forgets what the updates of the depsgraph have touched."""
        if any(u.is_updated_geometry for u in depsgraph.updates):
            self._meshes.clear()
        if any(isinstance(u.id, bpy.types.Image) for u in depsgraph.updates):
            self._images = Images(self._folder, self._note)

    def _note(self, text):
        if text not in self.notes:
            self.notes.append(text)

    def write(self, depsgraph, view, settings, layers=()):
        """Writes the scene file as `view` (camera.View) sees it, and returns its path."""
        self.notes.clear()
        scene = depsgraph.scene
        is_visible = not scene.render.film_transparent
        document = {
            "camera": view.camera,
            "film": {**view.film, "alpha": True, "layers": list(layers)},
            "settings": settings,
            "meshes": {},
            "materials": {},
            "instances": {},
            "lights": {},
        }
        environment = world.entry(
            scene.world, is_visible, self._classes, self._images, self._folder, self._note
        )
        if environment:
            document["environment"] = environment
        for instance in depsgraph.object_instances:
            if instance.show_self:
                self._add(document, instance)
        path = os.path.join(self._folder, "scene.json")
        with open(path, "w", encoding="utf-8") as file:
            json.dump(document, file, indent=1)
        return path

    def _add(self, document, instance):
        object, matrix = instance.object, instance.matrix_world.copy()
        if object.type == "LIGHT":
            light = lights.entry(
                object.data, matrix, self._classes, self._images.picture, self._note
            )
            if light:
                document["lights"][_unused(document["lights"], object.name)] = light
        elif object.type in meshes.SURFACES:
            self._add_surface(document, object, matrix)
        elif object.type not in _SILENT:
            self._note(f'object "{object.name}": {object.type.lower()} is left out')

    def _add_surface(self, document, object, matrix):
        if object.data is None:
            return
        name, slots = self._mesh(object)
        if not slots:
            return
        if matrix.determinant() == 0.0:
            self._note(f'object "{object.name}": is flattened to nothing')
            return
        document["meshes"][name] = {"file": f"{name}.glb", "up": "z"}
        looks = {slot: self._material(document["materials"], object, slot) for slot in slots}
        entry = {"mesh": name, "transform": rows(matrix)}
        if len(looks) == 1:  # mattes then have the object's name as it is
            entry["material"] = looks[slots[0]]
        else:
            entry["materials"] = {part_name(slot): look for slot, look in looks.items()}
        document["instances"][_unused(document["instances"], object.name)] = entry

    def _mesh(self, object):
        """Its name, which is that of its file, and the slots that it uses. Objects that share their
        evaluated data share the mesh."""
        key = object.data.as_pointer() if object.type == "MESH" else object.original.name_full
        if key not in self._meshes:
            self._files += 1
            name = f"mesh{self._files}"
            slots = meshes.write(object, os.path.join(self._folder, f"{name}.glb"))
            self._meshes[key] = name, slots
        return self._meshes[key]

    def _material(self, written, object, slot):
        """The name of the material in the slot."""
        own, shared = object.material_slots, object.data.materials
        material = None
        if slot < len(own) and own[slot].link == "OBJECT":
            material = own[slot].material
        elif len(shared):
            material = shared[min(slot, len(shared) - 1)]
        name = material.name_full if material else "none"
        if name not in written:
            written[name] = materials.entry(material, self._classes, self._images, self._note)
        return name


def _unused(taken, name):
    """For things of which Blender has several by one name, such as instances of a collection."""
    result, number = name, 1
    while result in taken:
        number += 1
        result = f"{name} #{number}"
    return result


def resolution(render):
    """Width and height of the whole picture, and the border's part of it (x0, y0, x1, y1) in pixels
    from the upper left."""
    width = max(1, render.resolution_x * render.resolution_percentage // 100)
    height = max(1, render.resolution_y * render.resolution_percentage // 100)
    border = (0, 0, width, height)
    if render.use_border:
        # In single precision, as Blender cuts it.
        x0, x1 = (int(np.float32(x) * width) for x in (render.border_min_x, render.border_max_x))
        y0, y1 = (int(np.float32(y) * height) for y in (render.border_min_y, render.border_max_y))
        if x1 > x0 and y1 > y0:
            border = (x0, height - y1, x1, height - y0)
    return width, height, border


def camera_view(depsgraph, engine):
    """What the scene's camera sees, and its data; None without a camera."""
    scene = depsgraph.scene
    if scene.camera is None:
        return None
    object = scene.camera.evaluated_get(depsgraph)
    width, height, border = resolution(scene.render)
    matrix = engine.camera_model_matrix(object)
    projection = object.calc_matrix_camera(
        depsgraph,
        x=width,
        y=height,
        scale_x=scene.render.pixel_aspect_x,
        scale_y=scene.render.pixel_aspect_y,
    )
    view = camera.view(matrix, projection, width, height, border)
    view.camera |= camera.focus(object.data, matrix)
    return view
