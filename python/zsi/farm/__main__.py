# SPDX-License-Identifier: Apache-2.0
"""The command ``zsi farm``."""

from __future__ import annotations

import argparse
import asyncio
import importlib
import logging
import os
import signal
import sys
import time
import warnings
from collections.abc import AsyncIterator
from contextlib import asynccontextmanager
from typing import Any, NoReturn

import zsi

MISSING = "zsi: farm: needs Dask distributed: apt install python3-distributed"

# What suits renders of hours, for schedulers and workers that are started here; docs/farm.md tells
# how to give it to others.
LONG_RENDERS = {
    "distributed.scheduler.allowed-failures": 100,
    "distributed.scheduler.worker-ttl": "60s",
    "distributed.comm.timeouts.connect": "60s",
}


class Parser(argparse.ArgumentParser):
    """Errors as those of the other commands."""

    def error(self, message: str) -> NoReturn:
        sys.stderr.write(f"zsi: farm: {message}\n")
        sys.exit(2)


def numbers(count: int, separator: str) -> Any:
    def parse(text: str) -> tuple[int, ...]:
        parts = tuple(int(part) for part in text.split(separator))
        if len(parts) != count or min(parts) < 0:
            raise ValueError
        return parts

    parse.__name__ = f"list of {count} numbers"
    return parse


def parser() -> Parser:
    p = Parser(prog="zsi farm", description="Render pictures on many machines, bit for bit those of "
               "one (docs/farm.md).", epilog="Units of a render that was interrupted, or whose "
               "scheduler died, lie in FILE.units: the same command goes on from them.")
    p.add_argument("scenes", metavar="SCENE", nargs="+", help="a scene file; several: a sequence")
    p.add_argument("-o", "--output", metavar="FILE", required=True,
                   help="the picture; of several FILE's name gets a number, as name.0001.exr")
    where = p.add_mutually_exclusive_group(required=True)
    where.add_argument("--scheduler", metavar="ADDRESS", help="such as tcp://host:8786")
    where.add_argument("--local", metavar="N", type=int, help="N workers on this machine")
    p.add_argument("--turntable", metavar="N", type=int, default=0,
                   help="N pictures, the camera once around its target")
    p.add_argument("--sweep", metavar="PATH=V,V", action="append", default=[],
                   help="a picture for each value; several: every combination")
    p.add_argument("--set", metavar="PATH=VALUE", action="append", default=[], dest="assignments",
                   help="put a value in the place of the scene's")
    p.add_argument("--samples", metavar="N", type=int, help="samples a pixel")
    p.add_argument("--size", metavar="WxH", type=numbers(2, "x"), help="size in pixels")
    p.add_argument("--crop", metavar="X0,Y0,X1,Y1", type=numbers(4, ","),
                   help="render only this part of the picture")
    p.add_argument("--seed", metavar="N", type=int, help="seed of the random numbers")
    p.add_argument("--integrator", metavar="NAME", help="how light is gathered")
    p.add_argument("--layers", metavar="NAME,NAME", help="layers of an .exr beside the beauty")
    p.add_argument("--view", metavar="NAME", help="how 8-bit pictures show light")
    p.add_argument("--ocio", metavar="FILE", default=os.environ.get("OCIO", ""),
                   help="an OpenColorIO config")
    p.add_argument("--denoise", action="store_true", help="take the noise out of the pictures")
    p.add_argument("--keep", metavar="FOLDER", help="keep finished units there; without it they lie "
                   "in FILE.units until the picture is complete")
    p.add_argument("--tile", metavar="PIXELS", type=int, default=0, help="side of a unit")
    p.add_argument("--block", metavar="N", type=int, default=0, help="samples of a unit")
    p.add_argument("--picture-every", metavar="SECONDS", type=float, default=30,
                   help="write the picture so far; 0: only when it is complete")
    p.add_argument("--direct", action="store_true", help="take results from the workers themselves, "
                   "where this machine can reach them, and not by way of the scheduler")
    p.add_argument("--tls-ca", metavar="FILE", help="certificates of those who may take part")
    p.add_argument("--tls-cert", metavar="FILE", help="this one's certificate")
    p.add_argument("--tls-key", metavar="FILE", help="and its key")
    p.add_argument("-q", "--quiet", action="store_true", help="tell of nothing but errors")
    p.add_argument("-v", "--verbose", action="store_true", help="with the engine's own messages")
    return p


class Bar:
    """One line on a terminal, redrawn in place; nothing elsewhere."""

    def __init__(self, wanted: bool) -> None:
        self.wanted = wanted and sys.stderr.isatty()
        self.begun = time.monotonic()

    def show(self, status: Any) -> None:
        if not self.wanted:
            return
        taken = time.monotonic() - self.begun
        left = taken / status.done - taken if status.done > 0.01 else 0
        frame = f"picture {status.frame} of {status.frames}, " if status.frames > 1 else ""
        line = f"rendering {100 * status.done:3.0f} %, {frame}{status.workers} workers, " \
            f"{status.rays * 1e-6:.2f} million rays/s"
        if left:
            line += f", {int(left) // 60}:{int(left) % 60:02} left"
        sys.stderr.write("\r" + line[:os.get_terminal_size(2).columns - 1] + "\033[K")
        sys.stderr.flush()

    def wipe(self) -> None:
        if self.wanted:
            sys.stderr.write("\r\033[K")


def engine() -> Any:
    """Dask distributed, which is not there with every installation of this package."""
    return importlib.import_module("distributed")


def security(a: argparse.Namespace) -> Any:
    """Raises zsi.Error where an encrypted scheduler lacks what it asks for."""
    if not (a.tls_ca or a.tls_cert or a.tls_key):
        # The engine's own configuration may name the files.
        if (a.scheduler or "").startswith("tls://") and \
                not engine().Security().get_connection_args("client").get("ssl_context"):
            raise zsi.Error(f"{a.scheduler}: expected --tls-ca, --tls-cert and --tls-key")
        return None
    for file in (a.tls_ca, a.tls_cert, a.tls_key):
        if not file or not os.access(file, os.R_OK):
            raise zsi.Error(f"{file}: cannot be read" if file else
                            "TLS needs all of --tls-ca, --tls-cert and --tls-key")
    return engine().Security(tls_ca_file=a.tls_ca, tls_client_cert=a.tls_cert, tls_client_key=a.tls_key,
                             tls_worker_cert=a.tls_cert, tls_worker_key=a.tls_key,
                             tls_scheduler_cert=a.tls_cert, tls_scheduler_key=a.tls_key,
                             require_encryption=True)


@asynccontextmanager
async def connected(a: argparse.Namespace) -> AsyncIterator[Any]:
    """A client of the scheduler, or of one that is started here with its workers."""
    with importlib.import_module("dask").config.set(LONG_RENDERS):
        if a.local is None:
            try:
                client = await engine().Client(a.scheduler, asynchronous=True, security=security(a),
                                               direct_to_workers=a.direct or None,
                                               timeout="20s")
            except (OSError, ValueError) as error:
                raise zsi.Error(f"{a.scheduler}: no scheduler answers: {error}") from None
            async with client:
                yield client
            return
        threads = max(1, len(os.sched_getaffinity(0)) // a.local)
        async with engine().LocalCluster(
                n_workers=a.local, threads_per_worker=threads, processes=True, asynchronous=True,
                dashboard_address="127.0.0.1:0", host="127.0.0.1", security=security(a),
                protocol="tls" if a.tls_ca else None,
                silence_logs=not a.verbose and logging.CRITICAL) as cluster, \
                engine().Client(cluster, asynchronous=True, direct_to_workers=True) as client:
            yield client


async def farm(a: argparse.Namespace) -> int:
    from .frames import frames
    from .pack import Changes
    from .run import Farm, Options

    layers = tuple(a.layers.split(",")) if a.layers else None
    if a.denoise:
        layers = (*(layers or ()), "halves")
    options = Options(Changes(a.size, a.crop, a.samples, a.seed, a.integrator, layers), a.keep,
                      a.tile, a.block, a.picture_every, a.denoise, a.view, a.ocio)
    todo = frames(a.scenes, a.output, a.assignments, turns=a.turntable, sweeps=a.sweep)
    bar = Bar(not a.quiet)

    def tell(text: str) -> None:
        if not a.quiet:
            bar.wipe()
            sys.stderr.write(f"zsi: warning: {text}\n")

    task = asyncio.current_task()
    assert task
    for number in (signal.SIGINT, signal.SIGTERM):
        asyncio.get_running_loop().add_signal_handler(number, task.cancel)
    begun = time.monotonic()
    try:
        async with connected(a) as client:
            run = Farm(client, todo, options, tell, bar.show)
            await run.run()
    except asyncio.CancelledError:
        bar.wipe()
        sys.stderr.write("zsi: interrupted; what is finished is kept, the same command goes on\n")
        return 130
    bar.wipe()
    if not a.quiet:
        for frame, text in run.finished:
            print(f"{frame.output}: {text}")
        print(f"{len(todo)} pictures, {time.monotonic() - begun:.2f} s" if len(todo) > 1 else
              f"{time.monotonic() - begun:.2f} s")
    return 0


def main() -> int:
    a = parser().parse_args()
    if a.local is not None and a.local < 1:
        parser().error("argument --local: expected 1 or more")
    if a.turntable and a.turntable < 1:
        parser().error("argument --turntable: expected 1 or more")
    warnings.formatwarning = lambda message, *_: f"zsi: warning: {message}\n"
    if a.quiet:
        warnings.simplefilter("ignore")
    try:
        engine()
    except ImportError:
        sys.stderr.write(MISSING + "\n")
        return 1
    if not a.verbose:
        for name in list(logging.root.manager.loggerDict):  # some have a level of their own
            if name.partition(".")[0] in ("distributed", "tornado"):
                logging.getLogger(name).setLevel(logging.CRITICAL)
    try:
        return asyncio.run(farm(a))
    except (zsi.Error, OSError) as error:
        sys.stderr.write(f"zsi: {error}\n")
        return 1


if __name__ == "__main__":
    sys.exit(main())
