# SPDX-License-Identifier: Apache-2.0
"""The pictures of a command: one, a turntable, a sequence or a sweep, each in a file of its own."""

from __future__ import annotations

import itertools
import json
import math
from collections.abc import Sequence
from dataclasses import dataclass
from pathlib import Path

import numpy as np

import zsi

from .. import load


@dataclass(frozen=True)
class Frame:
    """A picture to be rendered."""

    scene: str
    assignments: tuple[str, ...]
    output: str


def numbered(output: str, number: int, count: int) -> str:
    """``out.exr`` as ``out.0007.exr``, or by a pattern such as ``out.%d.exr``; plain for one."""
    if "%" in output:
        try:
            return output % number
        except (TypeError, ValueError):
            raise zsi.Error(f"{output}: expected a pattern with one number, such as out.%04d.exr"
                            ) from None
    path = Path(output)
    return output if count == 1 else str(path.with_name(f"{path.stem}.{number:04}{path.suffix}"))


def turntable(scene: str, assignments: Sequence[str], count: int) -> list[tuple[str, ...]]:
    """The camera goes around its target once, about its up direction, against the clock seen from
    there; the first picture is the scene's own. Raises zsi.Error as `zsi.load` does."""
    camera = load(scene, set=_split(assignments)).camera
    position, target, up = (np.array(camera._get()[name], float)
                            for name in ("position", "target", "up"))
    axis = up / np.linalg.norm(up)
    arm = position - target
    along = axis * (arm @ axis)
    out, side = arm - along, np.cross(axis, arm)
    frames: list[tuple[str, ...]] = []
    for i in range(count):
        angle = 2 * math.pi * i / count
        here = target + along + math.cos(angle) * out + math.sin(angle) * side
        place = [float(f"{v:.7g}") for v in here]  # as exact as scenes are, and fit to be typed
        frames.append((*assignments, "camera.position=" + json.dumps(place)))
    return frames


def _split(assignments: Sequence[str]) -> dict[str, object]:
    return {path: _value(text) for path, _, text in (a.partition("=") for a in assignments)}


def _value(text: str) -> object:
    try:
        return json.loads(text)
    except ValueError:
        return text


def sweep(assignments: Sequence[str], sweeps: Sequence[str]) -> list[tuple[str, ...]]:
    """Every combination of ``PATH=VALUE,VALUE``, the last path's values in turn. Values are JSON,
    or strings as they are. Raises zsi.Error where there are none."""
    choices = []
    for text in sweeps:
        path, equals, values = text.partition("=")
        if not equals or not values:
            raise zsi.Error(f"--sweep {text}: expected PATH=VALUE,VALUE")
        try:
            parts = [json.dumps(value) for value in json.loads(f"[{values}]")]
        except ValueError:
            parts = values.split(",")
        choices.append([f"{path}={part}" for part in parts])
    return [(*assignments, *chosen) for chosen in itertools.product(*choices)]


def frames(scenes: Sequence[str], output: str, assignments: Sequence[str], *, turns: int = 0,
           sweeps: Sequence[str] = ()) -> list[Frame]:
    """All pictures, in order."""
    variants = [(scene, chosen) for scene in scenes
                for swept in sweep(assignments, sweeps)
                for chosen in (turntable(scene, swept, turns) if turns else [swept])]
    return [Frame(scene, chosen, numbered(output, i + 1, len(variants)))
            for i, (scene, chosen) in enumerate(variants)]
