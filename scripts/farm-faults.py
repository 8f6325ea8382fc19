#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""Renders on a farm whose workers and scheduler are killed and frozen at random, and compares the
pictures byte for byte with those of one process.

usage: farm-faults.py [--seconds 600] [--workers 8] [--scene FILE] [--seed N]
"""

from __future__ import annotations

import argparse
import os
import random
import signal
import subprocess
import sys
import tempfile
import time
from collections import Counter
from pathlib import Path

ROOT = Path(__file__).resolve().parents[1]
sys.path.append(str(ROOT / "scripts/lib"))
from farm_cluster import Cluster  # noqa: E402

ZSI = os.environ.get("ZSI", str(ROOT / "build/zsi"))


class Round:
    """One picture, rendered while its farm is hurt."""

    def __init__(self, folder: Path, scene: list[str], workers: int, chance: random.Random,
                 hurts: Counter[str]) -> None:
        self.folder, self.scene, self.workers = folder, scene, workers
        self.chance, self.hurts = chance, hurts
        self.clusters = 0

    def _start(self) -> None:
        folder = self.folder / f"cluster{self.clusters}"
        folder.mkdir()
        self.clusters += 1
        self.cluster = Cluster(folder, Path(ZSI).parent / "python")
        self.alive = [self.cluster.worker() for _ in range(self.workers)]
        self.command = subprocess.Popen(
            [ZSI, "farm", *self.scene, "-o", "got.exr", "--scheduler", self.cluster.address(),
             "--picture-every", "5"], cwd=self.folder, stdout=subprocess.DEVNULL,
            stderr=open(self.folder / "farm.log", "ab"))

    def run(self) -> None:
        """Until the picture is there."""
        self._start()
        due = {time.monotonic() + 3: self.hurt}
        while self.command.poll() is None:
            now = time.monotonic()
            for at in [at for at in due if at <= now]:
                for wait, then in due.pop(at)() or []:
                    due[now + wait + 1e-6 * len(due)] = then
            time.sleep(0.05)
        self.cluster.close()
        if self.command.returncode:
            raise SystemExit(f"the farm ended with {self.command.returncode}: "
                             + (self.folder / "farm.log").read_text()[-2000:])

    def hurt(self):
        """Does something bad; gives what is to follow, and when."""
        what = self.chance.choices(["kill", "freeze", "scheduler"], [10, 5, 1])[0]
        again = [(self.chance.uniform(0.5, 4), self.hurt)]
        if what == "scheduler":
            self.hurts["schedulers killed"] += 1
            self.cluster.close()
            self.command.kill()
            self.command.wait()
            self._start()
            return [(5, self.hurt)]
        if not self.alive:
            return again
        victim = self.alive.pop(self.chance.randrange(len(self.alive)))
        if what == "kill":
            self.hurts["workers killed"] += 1
            victim.kill()
            return [*again, (self.chance.uniform(1, 6), self.replace)]
        self.hurts["workers frozen"] += 1
        victim.send_signal(signal.SIGSTOP)

        def wake() -> None:
            if victim.poll() is None:
                victim.send_signal(signal.SIGCONT)

        return [*again, (self.chance.uniform(1, 20), wake), (2, self.replace)]

    def replace(self) -> None:
        self.alive.append(self.cluster.worker())


def main() -> None:
    p = argparse.ArgumentParser(description=__doc__)
    p.add_argument("--seconds", type=float, default=600)
    p.add_argument("--workers", type=int, default=8)
    p.add_argument("--scene", default=str(ROOT / "scenes/demo.json"))
    p.add_argument("--size", default="480x270")
    p.add_argument("--samples", default="64")
    p.add_argument("--seed", type=int, default=1)
    a = p.parse_args()
    chance, hurts, rounds = random.Random(a.seed), Counter(), 0
    scene = [a.scene, "--size", a.size, "--samples", a.samples]
    begun = time.monotonic()
    with tempfile.TemporaryDirectory() as name:
        folder = Path(name)
        subprocess.run([ZSI, "render", *scene, "-o", "want.exr", "-q"], cwd=folder, check=True)
        spent = time.monotonic()
        print(f"one process: {spent - begun:.0f} s", flush=True)
        while time.monotonic() - spent < a.seconds:
            rounds += 1
            place = folder / str(rounds)
            place.mkdir()
            Round(place, scene, a.workers, chance, hurts).run()
            if (place / "got.exr").read_bytes() != (folder / "want.exr").read_bytes():
                raise SystemExit(f"round {rounds}: another picture")
            print(f"round {rounds}: the same picture; so far "
                  + ", ".join(f"{n} {what}" for what, n in hurts.items()), flush=True)
    print(f"{rounds} pictures in {time.monotonic() - spent:.0f} s: all the same")


if __name__ == "__main__":
    main()
