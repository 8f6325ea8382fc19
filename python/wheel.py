# SPDX-License-Identifier: Apache-2.0
"""Zips the built package with its shaders into a wheel (PEP 427).

usage: wheel.py VERSION PACKAGE_FOLDER SHADER_FOLDER OUTPUT_FOLDER
"""

import base64
import hashlib
import sys
import sysconfig
import zipfile
from pathlib import Path

METADATA = """Metadata-Version: 2.1
Name: zsi
Version: {version}
Summary: Shader library for ray tracers, and a renderer for its materials and scenes
License: Apache-2.0
Requires-Python: >=3.{minor},<3.{next}
Requires-Dist: numpy
Requires-Dist: pillow; extra == "sweep"
Provides-Extra: sweep
Requires-Dist: distributed; extra == "farm"
Provides-Extra: farm
"""
WHEEL = """Wheel-Version: 1.0
Generator: zsi
Root-Is-Purelib: false
Tag: {tag}
"""


def main(version: str, package: Path, shaders: Path, output: Path) -> None:
    minor = sys.version_info.minor
    platform = sysconfig.get_platform().replace("-", "_").replace(".", "_")
    tag = f"cp3{minor}-cp3{minor}-{platform}"
    info = f"zsi-{version}.dist-info"
    files = {f"zsi/{file.relative_to(package)}": file.read_bytes()
             for file in sorted(package.rglob("*"))
             if file.is_file() and file.suffix != ".pyc"}
    files |= {f"zsi/shaders/{file.name}": file.read_bytes() for file in sorted(shaders.iterdir())
              if file.suffix in (".so", ".json")}
    files[f"{info}/METADATA"] = METADATA.format(version=version, minor=minor,
                                                next=minor + 1).encode()
    files[f"{info}/WHEEL"] = WHEEL.format(tag=tag).encode()

    def row(name: str, data: bytes) -> str:
        digest = base64.urlsafe_b64encode(hashlib.sha256(data).digest()).rstrip(b"=").decode()
        return f"{name},sha256={digest},{len(data)}"

    record = f"{info}/RECORD"
    rows = [row(name, data) for name, data in files.items()] + [f"{record},,"]
    files[record] = "\n".join(rows + [""]).encode()
    wheel = output / f"zsi-{version}-{tag}.whl"
    with zipfile.ZipFile(wheel, "w", zipfile.ZIP_DEFLATED) as archive:
        for name, data in files.items():  # one date for all, so that wheels repeat
            archive.writestr(zipfile.ZipInfo(name, (2020, 1, 1, 0, 0, 0)), data,
                             zipfile.ZIP_DEFLATED)
    print(wheel)


main(sys.argv[1], *map(Path, sys.argv[2:]))
