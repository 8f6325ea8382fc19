#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""What limits one picture on 10 to 10,000 workers, by simulation, and which units suit.

    farm-model.py             the tables of docs/farm.md
    farm-model.py --measure   renders with 1, 2, 4 and 8 workers of one thread on this machine and
                              sets the times beside those that the model gives for its processors

The model: units are handed out in order by a scheduler that needs a time for each; a worker has the
next unit while it renders one; results cross the client's line and are merged one after another. The
scene reaches the workers in waves, each worker that has it giving it to another. Costs of units
differ, workers differ in speed, a few are slow, and some die with what they have.
"""

from __future__ import annotations

import argparse
import heapq
import math
import os
import random
import subprocess
import sys
import tempfile
import time
from dataclasses import dataclass, replace
from pathlib import Path

ROOT = Path(__file__).resolve().parents[1]
ZSI = os.environ.get("ZSI", str(ROOT / "build/zsi"))
sys.path[:0] = [str(ROOT / "scripts/lib"), str(Path(ZSI).parent / "python")]
from zsi.farm import plan  # noqa: E402


@dataclass
class Farm:
    """Costs of what a farm does beside rendering, in seconds and bytes, measured on this project's
    machine (two shared cores, --measure); networks as they usually are."""

    scheduler: float = 2e-3  # a unit through scheduler and client, both on one core
    unit: float = 0.7e-3  # merging: of a unit, and
    pixel: float = 250e-9  # of a pixel of it
    pixel_bytes: float = 28  # of a unit's file; with halves and three layers 153
    begin: float = 5e-3  # a worker's, of each unit: message, film, file
    line: float = 1.25e8  # bytes a second, of the client and of each worker (1 Gbit/s)
    scene: float = 1e9  # bytes of files
    load: float = 20.0  # a worker's, until the scene is ready
    spread: float = 0.6  # of the units' costs, as the deviation of their logarithm
    speeds: float = 0.1  # of the workers', likewise
    slow: float = 0.02  # share of workers of a third of the speed
    deaths: float = 0.05  # a worker and hour
    late: bool = True  # the last units go to a second worker


@dataclass
class Result:
    time: float
    units: int
    gigabytes: float
    limits: dict[str, float]  # seconds that each alone would take


def simulate(work: float, workers: int, size: tuple[int, int, int], farm: Farm,
             tile: int, block: int) -> Result:
    """A picture of `work` seconds of one worker; size: width, height, samples."""
    chance = random.Random(7)
    boxes = list(plan.units([plan.Box(0, 0, size[0], size[1], 0, size[2])], tile, block))
    mean = work / len(boxes)
    shift = -farm.spread ** 2 / 2
    costs = [mean * math.exp(chance.gauss(shift, farm.spread)) for _ in boxes]
    bytes_of = farm.pixel_bytes * tile * tile
    merge = max(farm.unit + farm.pixel * tile * tile, bytes_of / farm.line)
    wave = farm.scene / farm.line
    spread_time = wave * math.ceil(math.log2(workers + 1))
    ready = []
    for i in range(workers):
        speed = math.exp(chance.gauss(0, farm.speeds)) / (3 if chance.random() < farm.slow else 1)
        ready.append((wave * (1 + math.floor(math.log2(i + 1))) + farm.load, i, speed))
    heapq.heapify(ready)
    scheduler = merged = 0.0
    queue = list(reversed(costs))
    ends = []
    while queue:
        free, i, speed = heapq.heappop(ready)
        scheduler = max(scheduler, free - farm.scheduler) + farm.scheduler
        cost = queue.pop()
        begin = max(free, scheduler)
        took = cost / speed + farm.begin
        if chance.random() < farm.deaths * took / 3600:
            queue.append(cost)
            heapq.heappush(ready, (begin + took / 2 + 60 + farm.load, i, speed))
            continue
        ends.append((begin + took, begin, cost))
        heapq.heappush(ready, (begin + took, i, speed))
    if farm.late:  # who is idle at the end takes over what takes long
        usual = sorted(end - begin for end, begin, _ in ends)[len(ends) // 2]
        idle = min(free for free, _, _ in ready)
        ends = [(min(end, max(idle, begin + 3 * usual) + cost + farm.begin), begin, cost)
                for end, begin, cost in ends]
    for end, _, _ in sorted(ends):
        merged = max(merged, end) + merge
    n = len(boxes)
    return Result(merged, n, n * bytes_of / 1e9, {
        "rendering": work / workers, "scheduler": n * farm.scheduler, "merging": n * merge,
        "scene": spread_time + farm.load})


PICTURE = (3840, 2160, 1024)
HOUR = 3600.0


def planned(workers: int, per_worker: int = 0) -> tuple[int, int]:
    """The default division, or one of so many units for each worker."""
    before = plan.UNITS_PER_WORKER, plan.MOST_UNITS
    if per_worker:
        plan.UNITS_PER_WORKER, plan.MOST_UNITS = per_worker, per_worker * workers
    try:
        return plan.unit_size(*PICTURE, workers)
    finally:
        plan.UNITS_PER_WORKER, plan.MOST_UNITS = before


def table(*rows: list[str]) -> None:
    for i, row in enumerate(rows):
        print("| " + " | ".join(row) + " |")
        if i == 0:
            print("|---" * len(row) + "|")


FARMS = ((10, 100 * HOUR), (100, 100 * HOUR), (1000, 100 * HOUR), (1000, 1000 * HOUR),
         (10000, 1000 * HOUR))


def tables() -> None:
    farm = Farm()
    names = [f"{n:,}, {work / HOUR:,.0f} h" for n, work in FARMS]
    print("3840 x 2160 pixels of 1024 samples in the default division\n")
    rows = [["workers, work of one", "tile, block", "units", "GB", "time", "efficiency",
             "what else there is to do takes alone"]]
    for name, (workers, work) in zip(names, FARMS):
        tile, block = planned(workers)
        r = simulate(work, workers, PICTURE, farm, tile, block)
        others = sorted(((v, k) for k, v in r.limits.items() if k != "rendering"), reverse=True)
        rows.append([name, f"{tile}, {block}", f"{r.units:,}", f"{r.gigabytes:.1f}",
                     f"{r.time:,.0f} s", f"{100 * work / workers / r.time:.0f} %",
                     ", ".join(f"{k} {v:.0f} s" for v, k in others)])
    table(*rows)
    counts = (2, 4, 8, 16, 32, 64)
    print("\nEfficiency in % by units for each worker\n")
    table(["", *map(str, counts)],
          *([name, *(f"{100 * work / n / simulate(work, n, PICTURE, farm, *planned(n, c)).time:.0f}"
                     for c in counts)] for name, (n, work) in zip(names, FARMS)))
    print("\nTime when one thing is otherwise\n")
    rows = [["", *names[2:]]]
    for change, other in (("as above", farm), ("the scene is there already", replace(farm, scene=0)),
                          ("lines of 10 Gbit/s", replace(farm, line=1.25e9)),
                          ("no second workers for late units", replace(farm, late=False)),
                          ("a scheduler five times as fast", replace(farm, scheduler=4e-4)),
                          ("three more layers and halves",
                           replace(farm, pixel_bytes=153, pixel=1.6e-6))):
        rows.append([change, *(f"{simulate(work, n, PICTURE, other, *planned(n)).time:,.0f} s"
                               for n, work in FARMS[2:])])
    table(*rows)


def measure() -> None:
    from farm_cluster import Cluster

    size, samples = (480, 270), 48
    scene = [str(ROOT / "scenes/demo.json"), "-q", "--picture-every", "0"]
    cores = len(os.sched_getaffinity(0))
    print(f"{cores} processors, others at work on them: load {os.getloadavg()[0]:.1f}\n")
    print("| workers | tile, block | measured | model |\n|---|---|---|---|")
    with tempfile.TemporaryDirectory() as name:
        def run(cluster: Cluster, *options: str) -> float:
            begun = time.monotonic()
            subprocess.run([ZSI, "farm", *scene, "-o", "x.exr", "--scheduler", cluster.address(),
                            *options], check=True, cwd=name)
            return time.monotonic() - begun

        work = 0.0
        for workers in (1, 2, 4, 8):
            folder = Path(name) / str(workers)
            folder.mkdir()
            with Cluster(folder, Path(ZSI).parent / "python") as cluster:
                for _ in range(workers):
                    cluster.worker()
                small = ["--size", "16x9", "--samples", "1"]
                run(cluster, *small)  # all are there, and have loaded what they need
                start = min(run(cluster, *small, "--seed", str(i)) for i in range(2, 4))
                took = min(run(cluster, "--size", f"{size[0]}x{size[1]}", "--samples",
                               str(samples), "--seed", str(i)) for i in range(2, 4))
            tile, block = plan.unit_size(*size, samples, workers)
            work = work or took - start
            here = Farm(scene=0, load=0, slow=0, deaths=0, speeds=0)
            r = simulate(work, min(workers, cores), (*size, samples), here, tile, block)
            print(f"| {workers} | {tile}, {block} | {took:.1f} s | {start + r.time:.1f} s |",
                  flush=True)


if __name__ == "__main__":
    p = argparse.ArgumentParser(description=__doc__,
                                formatter_class=argparse.RawDescriptionHelpFormatter)
    p.add_argument("--measure", action="store_true")
    measure() if p.parse_args().measure else tables()
