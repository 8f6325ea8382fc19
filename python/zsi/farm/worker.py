# SPDX-License-Identifier: Apache-2.0
"""What workers run: they keep files by what they hold, one scene ready, and render units of it.

Results are tuples whose first part is the worker's address. What goes wrong with a unit is a text in
the result, so that it is told with the worker that it happened on.
"""

from __future__ import annotations

import json
import os
import tempfile
import threading
import time
import warnings
from pathlib import Path
from typing import Any

from distributed import get_worker

import zsi

from .. import _core
from .._picture import Session
from .._scene import Scene, load
from .pack import File, Pack, digest_of

REST = 2.0
"""Seconds before the next unit after one that failed; doubled each time. A worker that fails at once
would otherwise draw all units to itself."""
LONGEST_REST = 300.0
CACHE_SIZE = 20 << 30
"""Bytes of files that are kept for later renders."""


def cache() -> Path:
    """The folder of this machine's files: ZSI_FARM_CACHE, else one of the user's in $TMPDIR."""
    usual = Path(tempfile.gettempdir()) / f"zsi-farm-{os.getuid()}"
    folder = Path(os.environ.get("ZSI_FARM_CACHE", usual))
    folder.mkdir(mode=0o700, parents=True, exist_ok=True)
    if folder.stat().st_uid != os.getuid():
        raise zsi.Error(f"{folder}: belongs to somebody else (ZSI_FARM_CACHE)")
    return folder


def resource(pack: str) -> str:
    """What workers offer that have the files of a pack."""
    return "zsi-" + pack


_checked: dict[str, tuple[int, int]] = {}  # size and time of files whose contents were looked at


def _is_whole(file: File) -> bool:
    path = cache() / file.digest
    try:
        status = path.stat()
        seen = status.st_size, status.st_mtime_ns
        if _checked.get(file.digest) != seen:
            if status.st_size != file.size or digest_of(path) != file.digest:
                path.unlink(missing_ok=True)
                return False
            _checked[file.digest] = seen
        return True
    except FileNotFoundError:
        return False


def look(version: str, files: list[File]) -> tuple[str, str, list[int], str]:
    """Address, version, which of the files are missing here, and what is wrong."""
    address = get_worker().address
    if version != zsi.__version__:
        return address, zsi.__version__, [], ""
    try:
        _make_room(files)
        missing = [i for i, file in enumerate(files) if not _is_whole(file)]
        return address, zsi.__version__, missing, ""
    except (OSError, zsi.Error) as error:
        return address, zsi.__version__, [], str(error)


def _make_room(wanted: list[File]) -> None:
    """Removes what was not used for longest where the files would take too much."""
    keep = {file.digest for file in wanted}
    room = CACHE_SIZE - sum(file.size for file in wanted)
    old = []
    for path in cache().iterdir():
        if path.is_file() and path.name not in keep:
            status = path.stat()
            old.append((status.st_atime, status.st_size, path))
    for _, size, path in sorted(old, reverse=True):
        room -= size
        if room < 0:
            path.unlink(missing_ok=True)


def store(file: File, begin: int, data: bytes) -> tuple[str, str]:
    """Puts a piece of a file into the cache, the last one under its name. Gives what is wrong."""
    worker = get_worker()
    part = cache() / f"{file.digest}.{os.uname().nodename}.{os.getpid()}.part"
    try:
        with open(part, "r+b" if begin else "wb") as stream:
            stream.seek(begin)
            stream.write(data)
        if begin + len(data) >= file.size:
            if digest_of(part) != file.digest:
                raise OSError(f"{file.name}: other contents than were sent")
            part.replace(cache() / file.digest)
        return worker.address, ""
    except OSError as error:
        part.unlink(missing_ok=True)
        return worker.address, str(error)


def offer(pack: Pack) -> tuple[str, str]:
    """Puts the files of a pack to their names and offers to render units of it."""
    worker = get_worker()
    try:
        folder = cache() / ("scene-" + pack.name)
        for file in pack.files:
            place = folder / file.name
            place.parent.mkdir(parents=True, exist_ok=True)
            _link(cache() / file.digest, place)
        temporary = folder / f"scene.{os.getpid()}.json"
        folder.mkdir(exist_ok=True)
        temporary.write_text(pack.text)
        temporary.replace(folder / "scene.json")
    except OSError as error:
        return worker.address, str(error)
    _packs[pack.name] = pack
    # One unit at a time, with all the worker's threads.
    worker.loop.add_callback(worker.set_resources, **{resource(pack.name): 1, "zsi": 1})
    return worker.address, ""


def _link(goal: Path, place: Path) -> None:
    temporary = place.with_name(f"{place.name}.{os.getpid()}")
    temporary.symlink_to(goal)
    temporary.replace(place)


class _Resident:
    """The scene that is ready here."""

    def __init__(self, pack: Pack) -> None:
        self.pack = pack
        with warnings.catch_warnings():  # the client has told of them
            warnings.simplefilter("ignore")
            self.scene: Scene = load(cache() / ("scene-" + pack.name) / "scene.json")
        pack.changes.apply(self.scene)
        self.session = Session(self.scene)
        self.origin = _core.unit_origin(self.scene._core)

    def become(self, pack: Pack) -> bool:
        """Goes over to a scene that has another camera and is otherwise the same."""
        before, after = json.loads(self.pack.text), json.loads(pack.text)
        camera = after.get("camera", {})
        if (pack.files, pack.changes) != (self.pack.files, self.pack.changes) or \
                before.get("camera", {}).keys() != camera.keys() or \
                before | {"camera": None} != after | {"camera": None}:
            return False
        self.scene.camera.update(**camera)
        self.origin = _core.unit_origin(self.scene._core)
        self.pack = pack
        return True


_packs: dict[str, Pack] = {}
_resident: _Resident | None = None
_lock = threading.Lock()
_failures = 0


def _scene_of(pack: str) -> _Resident:
    global _resident
    if _resident and _resident.pack.name == pack:
        return _resident
    if not (_resident and _resident.become(_packs[pack])):
        _resident = None  # two would need twice the memory
        _resident = _Resident(_packs[pack])
    return _resident


def render_unit(pack: str, place: tuple[int, int, int, int, int, int]
                ) -> tuple[str, float, bytes | None, str]:
    """Address, seconds, the unit's bytes or None, and what went wrong."""
    global _failures, _resident
    worker = get_worker()
    with _lock:
        if _failures:
            time.sleep(min(REST * 2 ** (_failures - 1), LONGEST_REST))
        begun = time.monotonic()
        try:
            resident = _scene_of(pack)
            unit = resident.session._core.render_unit(resident.origin, place,
                                                      worker.state.nthreads, None)
        except MemoryError:
            _failures += 1
            _resident = None
            return worker.address, 0.0, None, "out of memory"
        except Exception as error:
            _failures += 1
            _resident = None
            return worker.address, 0.0, None, _one_line(error)
        _failures = 0
        return worker.address, time.monotonic() - begun, unit, ""


def _one_line(error: Any) -> str:
    kind = "" if isinstance(error, zsi.Error) else type(error).__name__ + ": "
    return kind + " ".join(str(error).split())
