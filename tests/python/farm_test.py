# SPDX-License-Identifier: Apache-2.0
"""Pictures of a farm whose workers die, freeze, lack room or are others than they ought to be."""

import os
import resource
import signal
import subprocess
import sys
import tempfile
import time
import unittest
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
sys.path.append(str(ROOT / "scripts/lib"))
from farm_cluster import Cluster  # noqa: E402

from zsi.farm.plan import Box, unit_size, units  # noqa: E402

ZSI = os.environ["ZSI_COMMAND"]
PACKAGE = Path(ZSI).parent / "python"
SCENE = [str(ROOT / "scenes/demo.json"), "--size", "240x135", "--samples", "8"]


class Farm(unittest.TestCase):
    def setUp(self):
        self.temporary = tempfile.TemporaryDirectory()
        self.addCleanup(self.temporary.cleanup)
        self.folder = Path(self.temporary.name)

    def cluster(self, name="cluster"):
        (self.folder / name).mkdir()
        cluster = Cluster(self.folder / name, PACKAGE)
        self.addCleanup(cluster.close)
        return cluster

    def farm(self, cluster, *options, file_limit=-1):
        """The running command, with its units kept in `units`. file_limit: bytes that a file may
        have."""
        command = subprocess.Popen([ZSI, "farm", *SCENE, "-o", "got.exr", "--scheduler",
                                    cluster.address(), "--keep", "units", *options], text=True,
                                   cwd=self.folder, stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                                   preexec_fn=lambda: resource.setrlimit(
                                       resource.RLIMIT_FSIZE, (file_limit, file_limit)))
        self.addCleanup(command.communicate)
        self.addCleanup(command.kill)
        return command

    def wait_for_units(self, command, count):
        while command.poll() is None and len(self.kept()) < count:
            time.sleep(0.02)
        self.assertIsNone(command.poll(), "ended by itself")

    def kept(self):
        return {f: f.stat().st_mtime_ns for f in self.folder.glob("units/*/*.exr")}

    def is_picture(self, file="got.exr"):
        subprocess.run([ZSI, "render", *SCENE, "-o", "want.exr", "-q"], cwd=self.folder, check=True)
        return (self.folder / file).read_bytes() == (self.folder / "want.exr").read_bytes()

    def test_what_happens_to_workers_does_not_show(self):
        cluster = self.cluster()
        # They come one after another, so that the first have units before the last are there.
        full = cluster.worker(file_limit=100000,
                              environment={"ZSI_FARM_CACHE": str(self.folder / "full")})
        old = cluster.worker(before="import zsi; zsi.__version__ = '0.1'")
        killed, frozen, _ = (cluster.worker() for _ in range(3))
        command = self.farm(cluster, "--tile", "32", "--block", "8", "--picture-every", "0.5")
        self.wait_for_units(command, 4)
        frozen.send_signal(signal.SIGSTOP)
        killed.kill()
        out, err = command.communicate(timeout=90)
        self.assertEqual(command.returncode, 0, err)
        self.assertTrue(self.is_picture())
        self.assertIn("is gone", err)
        self.assertIn("has version 0.1 of the library", err)
        self.assertIn("File too large", err)
        self.assertRegex(out, r"got.exr: 8 samples a pixel, 40 units, \d+ rays")
        self.assertEqual([full.poll(), old.poll()], [None, None])
        # No room here is told by file, in one line beside the engine's workers that were lost.
        for options, limit, why in (
                (["--keep", "full"], 2000, r"^zsi: full/.*\.exr: cannot be written: File too large$"),
                (["--scheduler", "tls://127.0.0.1:1"], -1, "tls.*: expected --tls-ca, --tls-cert")):
            command = self.farm(cluster, *options, file_limit=limit)
            last = command.communicate(timeout=60)[1]
            self.assertEqual(command.returncode, 1)
            self.assertRegex(last.splitlines()[-1], why)
            self.assertNotIn("Traceback", last)
        self.assertNotIn("distributed.client", err)
        # The units are what `zsi merge` takes, and each file of the scene is there once.
        subprocess.run([ZSI, "merge", *self.kept(), "-o", "merged.exr", "-q"], cwd=self.folder,
                       check=True)
        self.assertTrue(self.is_picture("merged.exr"))
        self.assertEqual(list((cluster.folder / "cache").glob("*.part")), [])

    def test_after_the_scheduler_died_only_what_is_missing_is_rendered(self):
        first = self.cluster("first")
        first.worker()
        command = self.farm(first, "--tile", "32", "--picture-every", "0")
        self.wait_for_units(command, 5)
        command.send_signal(signal.SIGINT)
        command.communicate(timeout=30)
        self.assertEqual(command.returncode, 130)
        command = self.farm(first, "--tile", "32", "--picture-every", "0")
        self.wait_for_units(command, 10)
        first.close()
        # It waits for half a minute, as for a network that is down.
        command.kill()
        command.communicate()
        self.assertFalse((self.folder / "got.exr").exists())
        before = self.kept()
        list(before)[3].write_bytes(b"nothing")
        second = self.cluster("second")
        second.worker()
        # Another division than before.
        command = self.farm(second, "--tile", "128", "--block", "3")
        out, err = command.communicate(timeout=60)
        self.assertIn("it is rendered again", err)
        self.assertTrue(self.is_picture())
        now = self.kept()
        self.assertGreaterEqual(len(before), 10)
        same = [f for f in before if now.get(f) == before[f]]
        self.assertEqual(len(same), len(before) - 1)

    def test_what_fails_everywhere_ends_with_its_reason(self):
        cluster = self.cluster()
        for _ in range(2):
            cluster.worker(environment={
                "ZSI_SHADER_PATH": str(PACKAGE.parent / "tests/fixtures/tinyShaders")})
        command = self.farm(cluster)
        out, err = command.communicate(timeout=60)
        self.assertEqual(command.returncode, 1)
        last = err.splitlines()[-1]
        self.assertRegex(last, r"^zsi: samples 0 to \d of .* cannot be rendered: .*corvid_.* "
                               r"\(on tcp://.*, tcp://.*\)$")
        # What is wrong with the scene itself is told before anybody is asked.
        command = self.farm(cluster, "--set", "camera.fov=-1")
        self.assertIn("camera.fov", command.communicate(timeout=30)[1])
        self.assertEqual(command.returncode, 1)

    def test_several_pictures_are_those_of_the_values_that_they_tell(self):
        small = ["--size", "64x36", "--samples", "2", "-q"]
        subprocess.run([ZSI, "farm", SCENE[0], *small, "-o", "s.png", "--local", "2",
                        "--sweep", "camera.fov=20,30", "--turntable", "2"],
                       cwd=self.folder, check=True, timeout=60)
        names = [f"s.{i:04}.png" for i in range(1, 5)]
        self.assertEqual(sorted(f.name for f in self.folder.iterdir()), names)
        for name, fov, position in ((names[0], 20, "[0.2, -9.8, 2.9]"),
                                    (names[3], 30, "[-0.2, 10.4, 2.9]")):
            subprocess.run([ZSI, "render", SCENE[0], *small, "-o", "want.png", "--set",
                            f"camera.fov={fov}", "--set", f"camera.position={position}"],
                           cwd=self.folder, check=True)
            self.assertEqual((self.folder / name).read_bytes(),
                             (self.folder / "want.png").read_bytes(), name)


class Plan(unittest.TestCase):
    def test_units_cover_what_is_missing_once(self):
        boxes = [Box(3, 5, 200, 90, 0, 70), Box(0, 90, 64, 100, 16, 33)]
        seen = {}
        for u in units(boxes, 64, 16):
            self.assertLessEqual(max(u.x1 - u.x0, u.y1 - u.y0), 64)
            self.assertEqual((u.begin // 16, u.x0 // 64), ((u.end - 1) // 16, (u.x1 - 1) // 64))
            for x in range(u.x0, u.x1):
                for y in range(u.y0, u.y1):
                    seen[x, y] = seen.get((x, y), 0) + u.end - u.begin
        self.assertEqual(len(seen), 197 * 85 + 64 * 10)
        self.assertEqual((seen[3, 5], seen[0, 99]), (70, 17))

    def test_there_are_enough_units_and_no_more_blocks_than_that_takes(self):
        for size, samples, workers in (((1920, 1080), 256, 4), ((3840, 2160), 1024, 1000),
                                       ((640, 360), 64, 10000), ((16, 16), 1, 8)):
            tile, block = unit_size(*size, samples, workers)
            count = len(list(units([Box(0, 0, *size, 0, samples)], tile, block)))
            most = -(-size[0] // 32) * -(-size[1] // 32) * samples
            self.assertGreaterEqual(count, min(8 * workers, most))
            if workers == 4:
                self.assertEqual(block, samples)


if __name__ == "__main__":
    unittest.main()
