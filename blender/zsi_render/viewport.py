# SPDX-License-Identifier: Apache-2.0
"""The rendered viewport: a coarse picture first, then the fine one with more and more samples. Every
change of the scene or of the view starts again."""

import os
import shutil
import tempfile
import weakref

import bpy
import gpu
import numpy as np
from gpu_extras.presets import draw_texture_2d

from . import camera, exr, preferences, properties
from .program import ProgramError, Render
from .scene import Exporter

_COARSE = 4  # a pixel of the first picture, in pixels of the view
_POLL_SECONDS = 0.1
_LOOK_SECONDS = 0.5  # between two pictures of the program


class Viewport:
    """Of one engine of one view."""

    def __init__(self, engine):
        self._engine = weakref.ref(engine)
        self._folder = tempfile.mkdtemp(prefix="zsi-view-")
        self._exporter = Exporter(self._folder, properties.classes)
        self._process = self._output = self._written = self._texture = None
        self._shown = self._pending = None
        self._poll_bound = self._poll  # the timer knows its function by identity
        bpy.app.timers.register(self._poll_bound, first_interval=_POLL_SECONDS)

    def close(self):
        """Ends the program and takes its files away."""
        if bpy.app.timers.is_registered(self._poll_bound):
            bpy.app.timers.unregister(self._poll_bound)
        self._stop()
        shutil.rmtree(self._folder, ignore_errors=True)

    def update(self, context, depsgraph):
        """The scene is another one."""
        self._exporter.changed(depsgraph)
        self._begin(context, depsgraph)

    def draw(self, context, depsgraph):
        """Draws what is there, and starts anew when the view is another one."""
        if self._state(context) != self._shown:
            self._begin(context, depsgraph)
        if self._texture is None:
            return
        engine, region = self._engine(), context.region
        gpu.state.blend_set("ALPHA_PREMULT")
        engine.bind_display_space_shader(depsgraph.scene)
        draw_texture_2d(self._texture, (0, 0), region.width, region.height)
        engine.unbind_display_space_shader()
        gpu.state.blend_set("NONE")

    @staticmethod
    def _state(context):
        region, view = context.region, context.region_data
        return (
            (region.width, region.height),
            tuple(map(tuple, view.view_matrix)),
            tuple(map(tuple, view.window_matrix)),
        )

    def _begin(self, context, depsgraph):
        self._stop()
        self._shown = self._state(context)
        (width, height), _, _ = self._shown
        view = context.region_data
        seen = camera.view(view.view_matrix.inverted(), view.window_matrix, width, height)
        if view.view_perspective == "CAMERA" and depsgraph.scene.camera:
            object = depsgraph.scene.camera.evaluated_get(depsgraph)
            if object.type == "CAMERA":
                seen.camera |= camera.focus(object.data, object.matrix_world)
        settings = depsgraph.scene.zsi
        written = settings.written(0, settings.viewport_samples)
        try:
            program, shader_path = preferences.command()
            path = self._exporter.write(depsgraph, seen, written)
        except (ProgramError, OSError) as error:
            self._engine().update_stats("", f"zsi: {error}")
            return
        # A crop in the scene keeps its share of the picture when the size is another one.
        film = seen.film
        coarse = f"{-(-film['width'] // _COARSE)}x{-(-film['height'] // _COARSE)}"
        fine = ["--preview-every", str(_LOOK_SECONDS)]
        self._pending = [
            (program, shader_path, path, ["--size", coarse, "--samples", "1"]),
            (program, shader_path, path, fine),
        ]
        self._next()

    def _next(self):
        """Starts the next of the pending renders."""
        program, shader_path, path, arguments = self._pending.pop(0)
        self._output = os.path.join(self._folder, f"view{len(self._pending)}.exr")
        self._written = None
        if os.path.exists(self._output):
            os.remove(self._output)
        self._process = Render(program, shader_path, path, self._output, arguments)

    def _stop(self):
        if self._process:
            self._process.cancel()
        self._process, self._pending = None, []

    def _poll(self):
        """Called by Blender's timer: the next picture, or the next render."""
        engine = self._engine()
        if engine is None:
            return None
        try:
            if self._process:
                self._look(engine)
        except (ProgramError, OSError, ValueError) as error:
            self._stop()
            engine.update_stats("", f"zsi: {error}")
        except ReferenceError:  # Blender has freed the engine
            return None
        return _POLL_SECONDS

    def _look(self, engine):
        is_over = self._process.wait(0)
        try:
            time = os.stat(self._output).st_mtime_ns
        except FileNotFoundError:
            time = None
        if time and time != self._written:
            self._written = time
            self._texture = _texture(exr.read(self._output).stack("RGBA"))
            engine.tag_redraw()
        if not is_over:
            engine.update_stats("", self._process.stage.capitalize())
            return
        self._process.check()
        self._process = None
        if self._pending:
            self._next()
        else:
            engine.update_stats("", "")


def _texture(pixels):
    height, width, _ = pixels.shape
    values = np.ascontiguousarray(pixels[::-1], np.float32).ravel()
    data = gpu.types.Buffer("FLOAT", len(values), values)
    return gpu.types.GPUTexture((width, height), format="RGBA16F", data=data)
