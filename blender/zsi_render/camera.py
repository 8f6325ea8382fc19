# SPDX-License-Identifier: Apache-2.0
"""Cameras. Blender's own projection matrix holds lens, sensor fit, shift and zoom together, for
render and viewport alike; the renderer's camera looks through the middle of its film, so a shift
becomes a crop of a larger film."""

import math

_FAR = 1000.0  # an orthographic camera stands this many widths of its picture away


class View:
    """What a scene file says of the camera and the film."""

    def __init__(self, camera, film):
        self.camera, self.film = camera, film


def view(matrix, projection, width, height, border=None):
    """`matrix`: of the camera to the world; `projection`: of OpenGL's kind; a picture of `width` x
    `height` pixels, `border`: the part (x0, y0, x1, y1) of it in pixels from the upper left."""
    right, up, back = (matrix.col[i].to_3d().normalized() for i in range(3))
    position = matrix.translation
    is_perspective = projection[3][3] == 0.0
    # How far the picture's middle lies from the axis, in half pixels: to the right and up.
    column, sign = (2, 1) if is_perspective else (3, -1)
    shift_x = round(sign * projection[0][column] * width)
    shift_y = round(sign * projection[1][column] * height)
    film_width, film_height = width + abs(shift_x), height + abs(shift_y)
    left, top = max(shift_x, 0), max(-shift_y, 0)
    x0, y0, x1, y1 = border or (0, 0, width, height)
    half_height = film_height / height / projection[1][1]
    if is_perspective:
        fov = math.degrees(2.0 * math.atan(half_height))
    else:
        away = _FAR * max(half_height, half_height * film_width / film_height)
        # Blender's orthographic view has things behind the camera too.
        position = position + back * away
        fov = math.degrees(2.0 * math.atan(half_height / away))
    camera = {
        "position": list(position),
        "target": list(position - back * max(1.0, position.length)),
        "up": list(up),
        "fov": fov,
    }
    film = {"width": film_width, "height": film_height}
    crop = [left + x0, top + y0, left + x1, top + y1]
    if crop != [0, 0, film_width, film_height]:
        film["crop"] = crop
    return View(camera, film)


def focus(camera, matrix):
    """Keys of the camera for depth of field: of camera data at `matrix`."""
    dof = camera.dof
    if not dof.use_dof or camera.type != "PERSP":
        return {}
    distance = dof.focus_distance
    if dof.focus_object:
        to = dof.focus_object.matrix_world.translation - matrix.translation
        distance = abs(to.dot(matrix.col[2].to_3d().normalized()))
    # The lens is in millimetres, Blender's unit counts as a metre.
    radius = camera.lens * 1e-3 / (2.0 * max(dof.aperture_fstop, 1e-5))
    return {"lensRadius": radius, "focusDistance": max(distance, 1e-5)}
