# SPDX-License-Identifier: Apache-2.0
"""Sends units out, merges what comes back and sees to workers that fail.

The engine's scheduler decides which worker renders a unit, and gives the units of a lost worker to
others. What it does not do is here: workers get the files of a scene before its units, the number of
units on their way is bounded, results are merged and forgotten, and what a worker says of itself is
told.
"""

from __future__ import annotations

import asyncio
import shutil
import statistics
import time
import uuid
from collections import deque
from collections.abc import Callable
from concurrent.futures import CancelledError, ThreadPoolExecutor
from contextlib import suppress
from dataclasses import dataclass, field
from pathlib import Path
from typing import Any

from distributed import KilledWorker

import zsi

from .. import Picture, denoise, write
from .. import _core
from . import worker
from .frames import Frame
from .pack import Changes, Pack, Packer
from .plan import Box, unit_size, units

Future = Any
"""The engine's, of a client that runs in this loop."""
LATE = 3.0
"""Where nothing else is left to do, a unit that takes so many times the usual goes to a second
worker, too (the backup tasks of Dean and Ghemawat 2004, "MapReduce")."""
TURNS = 5
"""How often a unit may fail or lose its workers by the engine's count, on however few workers."""
WORKERS = 3
"""On how many workers a unit must have failed to be given up."""
RETRY = 30.0
"""Seconds until a worker that could not take the scene is asked again."""
PATIENCE = 30.0
"""Seconds to wait for others where no worker can be used."""


@dataclass
class Options:
    """How a farm is run; what is to be rendered is in the frames."""

    changes: Changes = Changes()
    keep: str | None = None
    """Folder of finished units, which stays; None: beside the picture until it is complete."""
    tile: int = 0
    block: int = 0
    """Instead of the planned ones, where above 0."""
    picture_every: float = 30.0
    denoise: bool = False
    view: str | None = None
    ocio: str = ""


@dataclass(eq=False)
class Unit:
    """A unit that is to be rendered."""

    job: Job
    box: Box
    attempts: list[Future] = field(default_factory=list)
    begun: float = 0.0
    errors: list[tuple[str, str]] = field(default_factory=list)
    """Worker and what went wrong there."""
    done: bool = False


class Job:
    """A frame while it is rendered."""

    def __init__(self, frame: Frame, pack: Pack, origin: _core.UnitOrigin, keep: Path) -> None:
        self.frame, self.pack, self.origin = frame, pack, origin
        self.merging = _core.Merging(origin)
        self.folder = keep / pack.name
        self.marker = keep / (pack.name + ".done")
        self.pending: deque[Unit] | None = None
        """None: not planned yet."""
        self.ready: set[str] = set()
        x0, y0, x1, y1 = origin.window
        self.whole = self.open = (x1 - x0) * (y1 - y0) * origin.samples
        """Pixels times samples, and how many of them are to come."""
        self.rays = self.written = 0
        self.is_ending = False

    def read_kept(self) -> list[str]:
        """Adds what an earlier run has left; gives what was wrong with some of it."""
        wrong = []
        for file in sorted(self.folder.glob("*.exr")) if self.folder.is_dir() else []:
            try:
                self.merging.add_file(str(file))
            except zsi.Error as error:
                wrong.append(f"{error}; it is rendered again")
                file.unlink()
        self._count()
        return wrong

    def _count(self) -> None:
        """For others than the thread that merges."""
        self.open = self.merging.missing_samples
        self.rays = self.merging.rays

    def add(self, box: Box, data: bytes) -> None:
        """Merges a unit and keeps its file."""
        name = "{0}-{1}-{2}-{3}-{4}-{5}.exr".format(*box)
        self.merging.add(name, data)
        part = self.folder / (name + ".part")
        try:
            self.folder.mkdir(parents=True, exist_ok=True)
            part.write_bytes(data)
            part.replace(self.folder / name)
        except OSError as error:
            with suppress(OSError):
                part.unlink()
            raise Failed(f"{self.folder / name}: cannot be written: {error.strerror}") from None
        self._count()

    def picture(self, options: Options, finished: bool) -> None:
        """Writes the picture as far as it is."""
        if self.merging.units == self.written and not finished:
            return
        self.written = self.merging.units
        picture = Picture({}, _core_picture=self.merging.picture())
        picture._view = self.origin.view
        if options.denoise and finished:
            picture = denoise(picture)
        write(self.frame.output, picture, view=options.view, ocio_config=options.ocio)


@dataclass
class Status:
    """For who looks on."""

    done: float
    """Of all, 0 to 1."""
    frame: int
    frames: int
    workers: int
    rays: float
    """A second, of late."""


class Failed(zsi.Error):
    """The farm cannot go on; what is finished is kept."""


class Farm:
    """Renders frames on the workers of a client."""

    def __init__(self, client: Any, frames: list[Frame], options: Options,
                 tell: Callable[[str], object] = lambda _: None,
                 show: Callable[[Status], object] = lambda _: None) -> None:
        self.client, self.frames, self.options = client, frames, options
        self.tell, self.show = tell, show
        self.jobs: list[Job] = []  # those that are being rendered
        self.finished: list[tuple[Frame, str]] = []
        """Frames, and what is to be said of each."""
        self.unfit: dict[str, str] = {}  # workers that are not asked again, and why
        self.workers: dict[str, dict[str, Any]] = {}
        self.running: set[Unit] = set()
        self.lengths: deque[float] = deque(maxlen=200)  # seconds of the last units
        self.failures: list[tuple[str, str]] = []  # since the last unit that was rendered
        self._packer = Packer()
        self._preparing: dict[str, asyncio.Task[None]] = {}
        self._pieces: dict[tuple[str, int], Future] = {}
        self._tasks: set[asyncio.Task[Any]] = set()
        self._end: asyncio.Future[None] = asyncio.get_running_loop().create_future()
        self._pool = ThreadPoolExecutor(1)  # merging and writing, one at a time
        self._rays: deque[tuple[float, int]] = deque(maxlen=40)
        self._past_rays = 0
        self._next = 0
        self._wake = asyncio.Event()

    # --- the whole -----------------------------------------------------------------------------

    async def run(self) -> None:
        """Raises Failed. When cancelled, what there is of the pictures is written."""
        self._spawn(self._feed())
        self._spawn(self._watch())
        self._spawn(self._pictures())
        try:
            await self._end
        except BaseException:
            for job in self.jobs:
                if job.open < job.whole and self.options.picture_every > 0:
                    with suppress(zsi.Error):
                        await self._in_pool(job.picture, self.options, False)
            raise
        finally:
            tasks = [*self._tasks, *self._preparing.values()]
            for task in tasks:
                task.cancel()
            await asyncio.gather(*tasks, return_exceptions=True)
            self._pool.shutdown()
        for frame in self.frames:
            self._forget(frame)

    def _spawn(self, work: Any) -> None:
        task = asyncio.create_task(work)
        self._tasks.add(task)

        def ended(task: asyncio.Task[Any]) -> None:
            self._tasks.discard(task)
            if not task.cancelled() and (error := task.exception()):
                self._fail(error)

        task.add_done_callback(ended)

    def _fail(self, error: BaseException) -> None:
        if not self._end.done():
            self._end.set_exception(error)

    async def _in_pool(self, work: Callable[..., Any], *arguments: Any) -> Any:
        return await asyncio.get_running_loop().run_in_executor(self._pool, work, *arguments)

    # --- frames --------------------------------------------------------------------------------

    def _keep(self, frame: Frame) -> Path:
        return Path(self.options.keep or frame.output + ".units")

    def _forget(self, frame: Frame) -> None:
        """Once all frames are there."""
        if not self.options.keep:
            shutil.rmtree(self._keep(frame), ignore_errors=True)

    async def _begin_next(self) -> None:
        """Packs the next frame and takes what is kept of it."""
        frame = self.frames[self._next]
        self._next += 1

        def begin() -> tuple[Job, list[str]]:
            scene, pack = self._packer.pack(frame.scene, list(frame.assignments),
                                            self.options.changes)
            job = Job(frame, pack, _core.unit_origin(scene._core), self._keep(frame))
            return job, [] if job.marker.exists() else job.read_kept()

        job, wrong = await self._in_pool(begin)
        for text in wrong:
            self.tell(text)
        if job.marker.exists() and Path(frame.output).exists():
            self.finished.append((frame, "was finished before"))
            return
        self.jobs.append(job)
        if not job.open:
            await self._finish(job)

    def _plan(self, job: Job) -> deque[Unit]:
        x0, y0, x1, y1 = job.origin.window
        tile, block = unit_size(x1 - x0, y1 - y0, job.origin.samples, len(self.workers))
        missing = [Box(*box) for box in job.merging.missing()]
        return deque(Unit(job, box) for box in units(missing, self.options.tile or tile,
                                                     self.options.block or block))

    async def _finish(self, job: Job) -> None:
        if job.is_ending:
            return
        job.is_ending = True
        await self._in_pool(job.picture, self.options, True)
        m = job.merging
        self.finished.append((job.frame, f"{m.samples:.4g} samples a pixel, {m.units} units, "
                              f"{m.rays} rays, {m.non_finite} non-finite results left out"))
        self._past_rays += job.rays
        self.jobs.remove(job)
        self._wake.set()
        if not self.options.keep:
            await self._in_pool(lambda: shutil.rmtree(job.folder, ignore_errors=True))
        if len(self.frames) > 1:
            job.marker.parent.mkdir(parents=True, exist_ok=True)
            job.marker.touch()

    async def _pictures(self) -> None:
        every = self.options.picture_every
        while every > 0:
            await asyncio.sleep(every)
            for job in list(self.jobs):
                if job.open < job.whole and not job.is_ending:
                    await self._in_pool(job.picture, self.options, False)

    # --- units ---------------------------------------------------------------------------------

    async def _feed(self) -> None:
        """Keeps as many units on their way as the workers can have, and one more for each."""
        while True:
            self._wake.clear()
            while (job := self._next_job()) is None and self._next < len(self.frames):
                await self._begin_next()
            if job is None and not self.jobs:
                if not self._end.done():
                    self._end.set_result(None)
                return
            if job and job.pending is None and self.workers:
                job.pending = self._plan(job)  # their number decides how it is divided
            while job and job.pending and len(self.running) < 2 * len(job.ready):
                self._send(job.pending.popleft())
            await self._wake.wait()

    def _next_job(self) -> Job | None:
        """The first one of which units are still to be sent."""
        return next((j for j in self.jobs if not j.is_ending and (j.pending is None or j.pending)),
                    None)

    def _send(self, unit: Unit) -> None:
        unit.begun = time.monotonic()
        self.running.add(unit)
        self._spawn(self._attempt(unit))

    async def _attempt(self, unit: Unit) -> None:
        pack = unit.job.pack.name
        future = self.client.submit(
            worker.render_unit, pack, tuple(unit.box), pure=False, retries=0,
            key=f"zsi-unit-{pack}-{uuid.uuid4().hex}", resources={worker.resource(pack): 1, "zsi": 1})
        unit.attempts.append(future)
        try:
            address, seconds, data, error = await future
        except KilledWorker as killed:
            address = str(getattr(killed.last_worker, "address", killed.last_worker))
            data, error = None, "the workers that had it died one after another"
        except (CancelledError, OSError):  # the scheduler has lost it
            address, data, error = "", None, ""
        finally:
            unit.attempts.remove(future)
            future.release()
        if unit.done:
            return
        if data is not None:
            unit.done = True
            for other in unit.attempts:
                await other.cancel()
            try:
                await self._in_pool(unit.job.add, unit.box, data)
            except Failed:
                raise
            except zsi.Error as wrong:  # such as another build that counts otherwise
                unit.done, error = False, str(wrong)
        if unit.done:
            self.running.discard(unit)
            self.lengths.append(seconds)
            self.failures.clear()
            self._wake.set()
            if not unit.job.open:
                await self._finish(unit.job)
            return
        if error:
            unit.errors.append((address, error))
            self.failures.append((address, error))
            self.tell(f"worker {address}: {_place(unit.box)}: {error}")
            if self._is_hopeless(unit):
                self._fail(Failed(f"{_place(unit.box)} of {unit.job.frame.output} cannot be "
                                  f"rendered: {error} (on {self._addresses(unit)})"))
                return
        if not unit.attempts:
            self.running.discard(unit)
            assert unit.job.pending is not None
            unit.job.pending.appendleft(unit)
            self._wake.set()

    def _is_hopeless(self, unit: Unit) -> bool:
        """It has failed on several workers, or all units have of late."""
        enough = min(WORKERS, max(1, len(unit.job.ready)))
        return len(unit.errors) >= TURNS * WORKERS or any(
            len(errors) >= WORKERS and len({address for address, _ in errors}) >= enough
            for errors in (unit.errors, self.failures))

    def _addresses(self, unit: Unit) -> str:
        return ", ".join(sorted({address or "?" for address, _ in unit.errors + self.failures}))

    def _help_late_ones(self) -> None:
        if self._next_job() or not self.lengths:
            return
        idle = max((len(job.ready) for job in self.jobs), default=0) - len(self.running)
        limit = LATE * statistics.median(self.lengths) + 1
        for unit in sorted(self.running, key=lambda u: u.begun):
            if idle > 0 and len(unit.attempts) == 1 and time.monotonic() - unit.begun > limit:
                idle -= 1
                self._spawn(self._attempt(unit))

    # --- workers -------------------------------------------------------------------------------

    async def _watch(self) -> None:
        begun = time.monotonic()
        told = False
        while True:
            if self.client.status in ("closing", "closed"):
                raise Failed("the scheduler is gone")
            now = self.client.scheduler_info().get("workers", {})
            for address in [a for a in self.workers if a not in now]:
                self._lost(address)
            if self.workers.keys() != now.keys():
                self._wake.set()
            self.workers = dict(now)
            for address in now:
                for job in self.jobs:
                    if address not in job.ready and address not in self.unfit \
                            and address not in self._preparing and self._may_prepare(job):
                        self._preparing[address] = asyncio.create_task(
                            self._prepare(address, job))
            self._help_late_ones()
            if any(address not in self.unfit for address in now):
                begun = time.monotonic()
            elif now and time.monotonic() - begun > PATIENCE:
                raise Failed(f"no worker can be used: {next(iter(now))} "
                             f"{self.unfit[next(iter(now))]}")
            elif not now and not told and time.monotonic() - begun > 5:
                told = True
                self.tell("no workers yet")
            self._report()
            await asyncio.sleep(0.2 if len(now) < 100 else 1.0)

    def _may_prepare(self, job: Job) -> bool:
        """Files go from worker to worker: as many get them at a time as have them."""
        return len(self._preparing) < max(4, len(job.ready))

    def _lost(self, address: str) -> None:
        info = self.workers[address]
        for job in self.jobs:
            job.ready.discard(address)
        if task := self._preparing.get(address):
            task.cancel()
        silent = time.time() - info.get("last_seen", time.time())
        memory, limit = info.get("metrics", {}).get("memory", 0), info.get("memory_limit") or 0
        why = f", silent for {silent:.0f} s" if silent > 5 else ""
        if limit and memory > 0.9 * limit:
            why += f", at {100 * memory / limit:.0f} % of its memory"
        self.tell(f"worker {address} is gone{why}; its units go elsewhere")

    async def _prepare(self, address: str, job: Job) -> None:
        """Gives a worker the files that it lacks."""
        try:
            wrong = await self._give_files(address, job)
            if wrong:
                self.tell(f"worker {address}: {wrong}")
                await asyncio.sleep(RETRY)
            elif address not in self.unfit:
                job.ready.add(address)
        except (CancelledError, OSError):
            pass  # a piece was lost with the worker that had it: the next round tries again
        except Exception as error:  # such as a machine without this package
            self.unfit[address] = f"cannot be used: {type(error).__name__}: {error}"
            self.tell(f"worker {address} {self.unfit[address]}")
        finally:
            self._preparing.pop(address, None)
            if not self._preparing:
                self._pieces.clear()  # those who have the files give them no more
            self._wake.set()

    async def _give_files(self, address: str, job: Job) -> str:
        async def there(function: Callable[..., Any], *arguments: Any) -> Any:
            return await self.client.submit(
                function, *arguments, workers=[address], allow_other_workers=False, pure=False,
                priority=100, key=f"zsi-{function.__name__}-{uuid.uuid4().hex}")

        files = job.pack.files
        _, version, missing, wrong = await there(worker.look, job.pack.version, list(files))
        if version != job.pack.version:
            self.unfit[address] = f"has version {version} of the library, expected " \
                f"{job.pack.version}"
            self.tell(f"worker {address} {self.unfit[address]}; its units go elsewhere")
            return ""
        for i in missing:
            for begin, end in files[i].pieces():
                if not wrong:
                    piece = await self._piece(files[i].digest, begin, end)
                    _, wrong = await there(worker.store, files[i], begin, piece)
        if not wrong:
            _, wrong = await there(worker.offer, job.pack)
        return str(wrong)

    async def _piece(self, digest: str, begin: int, end: int) -> Future:
        """A piece of a file among the workers' data; it is sent to one of them, once."""
        key = digest, begin
        known = self._pieces.get(key)
        if known is None or known.status in ("cancelled", "lost", "error"):
            with open(self._packer.places[digest], "rb") as stream:
                stream.seek(begin)
                data = stream.read(end - begin)
            name = f"zsi-piece-{digest}-{begin}"
            self._pieces[key] = (await self.client.scatter({name: data}))[name]
        return self._pieces[key]

    # --- what is told --------------------------------------------------------------------------

    def _report(self) -> None:
        rays = self._past_rays + sum(job.rays for job in self.jobs)
        self._rays.append((time.monotonic(), rays))
        seconds = self._rays[-1][0] - self._rays[0][0]
        done = float(len(self.finished))
        for job in self.jobs:
            done += 1 - job.open / job.whole
        ready = {address for job in self.jobs for address in job.ready}
        self.show(Status(done / len(self.frames), min(len(self.finished) + 1, len(self.frames)),
                         len(self.frames), len(ready),
                         (rays - self._rays[0][1]) / seconds if seconds > 0 else 0.0))


def _place(box: Box) -> str:
    return "samples {4} to {5} of {0},{1},{2},{3}".format(*box)
