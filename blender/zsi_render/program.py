# SPDX-License-Identifier: Apache-2.0
"""The command zsi: where it is, what it tells of shader classes, and a render of it that runs beside
Blender. A process of its own works with every Blender's Python, can be ended at any time, and takes
nothing down with it."""

import json
import os
import re
import shutil
import subprocess
import threading

_USUAL = ("/usr/local/bin/zsi", "/usr/bin/zsi", "/opt/zsi/bin/zsi", "~/.local/bin/zsi")


class ProgramError(Exception):
    """What a user has to be told, in one line."""


def find(wanted=""):
    """The command: what the user wants, else on PATH, else in the usual places."""
    if wanted:
        path = os.path.expanduser(wanted)
        if os.path.isdir(path):
            path = os.path.join(path, "zsi")
        if not os.access(path, os.X_OK):
            raise ProgramError(f"{path}: no such program; see the add-on's preferences")
        return path
    for path in (shutil.which("zsi"), *map(os.path.expanduser, _USUAL)):
        if path and os.access(path, os.X_OK):
            return path
    raise ProgramError(
        "zsi is not on PATH nor in the usual places; say in the add-on's preferences where it is"
    )


def _arguments(program, shader_path):
    return [program, *(["--shader-path", shader_path] if shader_path else [])]


def describe(program, shader_path):
    """What the loaded libraries have, as `zsi info CLASS --json` tells it; kinds in between that a
    scene cannot use are left out."""

    def info(*what):
        command = [*_arguments(program, shader_path), "info", *what, "--json"]
        try:
            done = subprocess.run(command, capture_output=True, text=True, timeout=60)
        except (OSError, subprocess.TimeoutExpired) as error:
            raise ProgramError(f"{program}: {error}") from error
        if done.returncode != 0:
            raise ProgramError(_last_line(done.stderr) or f"{program} ended with {done.returncode}")
        return json.loads(done.stdout)

    return [info(entry["name"]) for entry in info()["classes"]]


def _last_line(text):
    lines = [line.strip() for line in text.splitlines() if line.strip()]
    return lines[-1] if lines else ""


class Render:
    """A running `zsi render`. `progress` and `stage` tell how far it is, `warnings` are its lines."""

    def __init__(self, program, shader_path, scene, output, arguments=()):
        self.progress, self.stage, self.warnings = 0.0, "", []
        self._errors, self._scene = [], scene
        command = [*_arguments(program, shader_path), "render", scene, "-o", output, "--progress"]
        try:
            self._process = subprocess.Popen(
                [*command, *arguments],
                stdin=subprocess.DEVNULL,
                stdout=subprocess.DEVNULL,
                stderr=subprocess.PIPE,
                text=True,
                errors="replace",
            )
        except OSError as error:
            raise ProgramError(f"{program}: {error.strerror}") from error
        # Reads on while nobody asks, so that the pipe never fills.
        self._reader = threading.Thread(target=self._read, daemon=True)
        self._reader.start()

    def _read(self):
        for line in self._process.stderr:
            text = line.strip().removeprefix("zsi: ")
            if text.startswith("progress "):
                _, share, self.stage = text.split(" ", 2)
                self.progress = float(share)
            elif text.startswith("warning: "):
                self.warnings.append(self._plain(text.removeprefix("warning: ")))
            elif text:
                self._errors.append(self._plain(text))

    def _plain(self, text):
        """Without the scene file, which nobody but this add-on has seen."""
        return re.sub(re.escape(self._scene) + r"(:\d+)?: ", "", text)

    def wait(self, seconds):
        """Whether it has ended within so long."""
        try:
            self._process.wait(seconds)
        except subprocess.TimeoutExpired:
            return False
        self._reader.join(5)
        return True

    def check(self):
        """After its end: raises what went wrong."""
        if self._process.returncode != 0:
            ended = f"zsi ended with {self._process.returncode}"
            raise ProgramError(self._errors[-1] if self._errors else ended)

    def cancel(self):
        """Ends it: the command stops within a sample, and by force if it does not."""
        self._process.terminate()
        if not self.wait(0.8):
            self._process.kill()
            self.wait(5)
