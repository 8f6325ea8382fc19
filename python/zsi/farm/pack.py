# SPDX-License-Identifier: Apache-2.0
"""Scenes with all their files, by what they hold."""

from __future__ import annotations

import hashlib
import json
import os
from dataclasses import asdict, dataclass, field
from typing import Any

from .. import __version__, _core
from .._scene import Scene

PIECE = 32 << 20
"""Bytes of a file that go over the network, and lie in a worker's memory, at a time."""


@dataclass(frozen=True)
class Changes:
    """What the command line puts in the place of what the scene says; None: nothing."""

    size: tuple[int, int] | None = None
    crop: tuple[int, int, int, int] | None = None
    samples: int | None = None
    seed: int | None = None
    integrator: str | None = None
    layers: tuple[str, ...] | None = None

    def apply(self, scene: Scene) -> None:
        """Raises zsi.Error for what the scene cannot have."""
        if self.size:
            scene.resize(*self.size)
        film: dict[str, Any] = {"crop": self.crop and list(self.crop),
                                "layers": self.layers and list(self.layers)}
        settings: dict[str, Any] = {"samples": self.samples, "seed": self.seed,
                                    "integrator": self.integrator}
        scene.film.update(**{k: v for k, v in film.items() if v is not None})
        scene.settings.update(**{k: v for k, v in settings.items() if v is not None})


@dataclass(frozen=True)
class File:
    """A file by what it holds; ``name``: in the scene's text."""

    name: str
    digest: str
    size: int

    def pieces(self) -> list[tuple[int, int]]:
        """Begin and end of each."""
        return [(at, min(at + PIECE, self.size)) for at in range(0, max(self.size, 1), PIECE)]


@dataclass(frozen=True)
class Pack:
    """All that a worker needs to know of a scene. Small: files go by themselves."""

    version: str
    text: str
    changes: Changes
    files: tuple[File, ...]
    name: str = field(default="", compare=False)
    """Of what it holds: two that are alike have the same."""

    def named(self) -> Pack:
        whole = json.dumps(asdict(self), sort_keys=True)
        return Pack(self.version, self.text, self.changes, self.files,
                    hashlib.sha256(whole.encode()).hexdigest()[:24])


def digest_of(file: str | os.PathLike[str]) -> str:
    with open(file, "rb") as stream:
        return hashlib.file_digest(stream, "sha256").hexdigest()


class Packer:
    """Packs scenes; a file that several have is read once."""

    def __init__(self) -> None:
        self.places: dict[str, str] = {}
        """Where the contents of a digest are here."""
        self._known: dict[tuple[str, int, int], str] = {}

    def pack(self, file: str, assignments: list[str], changes: Changes
             ) -> tuple[Scene, Pack]:
        """Loads a scene and packs it. Raises zsi.Error as `zsi.load` does."""
        core, text, named = _core.pack(file, assignments)
        scene = Scene(_core_scene=core)
        changes.apply(scene)
        files = tuple(self._file(name, here) for name, here in named)
        return scene, Pack(__version__, text, changes, files).named()

    def _file(self, name: str, here: str) -> File:
        status = os.stat(here)
        key = here, status.st_size, status.st_mtime_ns
        if key not in self._known:
            self._known[key] = digest_of(here)
        self.places[self._known[key]] = here
        return File(name, self._known[key], status.st_size)
