# SPDX-License-Identifier: Apache-2.0
"""The render engine: final renders, previews of materials, the viewport."""

import os
import shutil
import tempfile
import weakref

import bpy

from . import exr, passes, preferences, properties
from .program import ProgramError, Render
from .scene import Exporter, camera_view
from .viewport import Viewport

_PREVIEW_SAMPLES = 16  # of a material's preview
_LOOK_SECONDS = 1.0  # between two looks at the picture so far
_POLL_SECONDS = 0.05  # between two looks at the program


class ZsiRenderEngine(bpy.types.RenderEngine):
    """Blender's side of the renderer."""

    bl_idname = "ZSI"
    bl_label = "zsi"
    bl_use_preview = True
    bl_use_eevee_viewport = True  # the viewport's material preview
    bl_use_postprocess = True
    bl_use_shading_nodes_custom = False  # nodes are those that Cycles has

    _viewport = None

    def update_render_passes(self, scene=None, renderlayer=None):
        self.register_pass(scene, renderlayer, "Combined", 4, "RGBA", "COLOR")
        for p in passes.wanted(renderlayer):
            self.register_pass(scene, renderlayer, p.name, len(p.channels), p.channels, p.kind)

    def render(self, depsgraph):
        folder = tempfile.mkdtemp(prefix="zsi-")
        try:
            self._render(depsgraph, folder)
        except (ProgramError, OSError, ValueError) as error:
            if not self.is_preview:
                self.report({"ERROR"}, f"zsi: {error}")
            self.error_set(f"zsi: {error}")
        finally:
            shutil.rmtree(folder, ignore_errors=True)

    def _render(self, depsgraph, folder):
        scene, settings = depsgraph.scene, depsgraph.scene.zsi
        program, shader_path = preferences.command()
        view = camera_view(depsgraph, self)
        if view is None:
            raise ProgramError("the scene has no camera")
        self.update_stats("", "Writing the scene")
        wanted = [] if self.is_preview else passes.wanted(depsgraph.view_layer)
        samples = _PREVIEW_SAMPLES if self.is_preview else None
        exporter = Exporter(folder, properties.classes)
        path = exporter.write(
            depsgraph, view, settings.written(scene.frame_current, samples), passes.layers(wanted)
        )
        output = os.path.join(folder, "picture.exr")
        process = Render(program, shader_path, path, output, self._arguments(scene, settings))
        written = None
        while not process.wait(_POLL_SECONDS):
            if self.test_break():
                process.cancel()
                break
            self.update_progress(process.progress)
            self.update_stats("", process.stage.capitalize())
            if written != (written := _time(output)):
                self._show(output, [], view, depsgraph)
        else:
            process.check()
        if _time(output):  # that of a cancelled render is there as far as it came
            self._show(output, wanted, view, depsgraph, is_last=True)
        if not self.is_preview:
            for text in dict.fromkeys((*exporter.notes, *process.warnings)):
                self.report({"WARNING"}, f"zsi: {text}")

    def _arguments(self, scene, settings):
        result = []
        if scene.render.threads_mode == "FIXED":
            result += ["--threads", str(scene.render.threads)]
        if self.is_preview:
            return result
        result += ["--preview-every", str(_LOOK_SECONDS)]
        if settings.denoise:
            result.append("--denoise")
        if settings.seconds > 0.0:
            result += ["--time", str(settings.seconds), "--samples", str(settings.samples)]
        return result

    def _show(self, path, wanted, view, depsgraph, is_last=False):
        """Hands on what the file has; while it is rendered the beauty alone, for speed."""
        picture = exr.read(path)
        x0, y0, x1, y1 = picture.window
        layer = depsgraph.view_layer
        for p in wanted:
            self.add_pass(p.name, len(p.channels), p.channels, layer=layer.name)
        result = self.begin_result(0, 0, x1 - x0, y1 - y0, layer=layer.name)
        if result is None:
            return
        passes.fill(result, picture, wanted, view)
        if is_last:
            passes.tell_mattes(self.get_result(), picture, layer)
        self.end_result(result)

    def view_update(self, context, depsgraph):
        self._view().update(context, depsgraph)

    def view_draw(self, context, depsgraph):
        self._view().draw(context, depsgraph)

    def _view(self):
        if self._viewport is None:
            self._viewport = Viewport(self)
            # Blender takes the engine away before Python could run its __del__.
            weakref.finalize(self, self._viewport.close)
        return self._viewport


def _time(path):
    """When a file was last written; None where there is none."""
    try:
        return os.stat(path).st_mtime_ns
    except FileNotFoundError:
        return None
