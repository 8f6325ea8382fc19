# SPDX-License-Identifier: Apache-2.0
"""A scheduler and workers as processes of their own, for scripts and tests that hurt them."""

from __future__ import annotations

import json
import os
import resource
import signal
import subprocess
import sys
import time
from pathlib import Path
from typing import Any

# Renders end within minutes here: what is lost is to be noticed within seconds.
CONFIG = {"DASK_DISTRIBUTED__SCHEDULER__WORKER_TTL": "6s",
          "DASK_DISTRIBUTED__SCHEDULER__ALLOWED_FAILURES": "1000"}


class Cluster:
    """Processes below a folder; all end with it."""

    def __init__(self, folder: Path, package: Path) -> None:
        self.folder = folder
        self.environment = os.environ | CONFIG | {
            "PYTHONPATH": str(package), "ZSI_FARM_CACHE": str(folder / "cache"),
            "PYTHONDONTWRITEBYTECODE": "1"}
        self.processes: list[subprocess.Popen[bytes]] = []
        self.file = folder / "scheduler.json"
        self.scheduler = self._start(["distributed.cli.dask_scheduler", "--port", "0",
                                      "--no-dashboard", "--scheduler-file", str(self.file)])

    def _start(self, module: list[str], *, before: str = "pass", file_limit: int = 0,
               environment: dict[str, str] = {}) -> subprocess.Popen[bytes]:
        def limit() -> None:
            if file_limit:
                resource.setrlimit(resource.RLIMIT_FSIZE, (file_limit, file_limit))
                signal.signal(signal.SIGXFSZ, signal.SIG_IGN)

        code = f"import sys, runpy; {before}; sys.argv = sys.argv[1:]; " \
            "runpy.run_module(sys.argv[0], run_name='__main__')"
        with open(self.folder / f"log.{len(self.processes)}", "wb") as log:
            process = subprocess.Popen(
                [sys.executable, "-c", code, *module], env=self.environment | environment,
                cwd=self.folder, preexec_fn=limit, stdout=subprocess.DEVNULL, stderr=log)
        self.processes.append(process)
        return process

    def worker(self, *, before: str = "pass", **options: Any) -> subprocess.Popen[bytes]:
        """A worker of one thread. before: Python that it runs first. file_limit: bytes that a file
        may have."""
        return self._start(["distributed.cli.dask_worker", "--scheduler-file", str(self.file),
                            "--no-nanny", "--nthreads", "1", "--no-dashboard",
                            "--local-directory", str(self.folder / "work")],
                           before=before, **options)

    def address(self) -> str:
        """The scheduler's, once it is there."""
        end = time.monotonic() + 60
        while time.monotonic() < end:
            try:
                return str(json.loads(self.file.read_text())["address"])
            except (OSError, ValueError):
                time.sleep(0.05)
        raise TimeoutError("no scheduler")

    def close(self) -> None:
        for process in self.processes:
            if process.poll() is None:
                process.kill()
        for process in self.processes:
            process.wait()

    def __enter__(self) -> Cluster:
        return self

    def __exit__(self, *_: object) -> None:
        self.close()
