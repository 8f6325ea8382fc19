#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""The add-on's zip, with the descriptions of the shader classes in it.

usage: package.py PROGRAM SHADERS VERSION ZIP
"""

import json
import pathlib
import sys
import zipfile

sys.path.insert(0, str(pathlib.Path(__file__).parent / "zsi_render"))
import program  # needs nothing of Blender

EPOCH = (1980, 1, 1, 0, 0, 0)  # the same add-on is the same file


def main():
    command, shaders, version, goal = sys.argv[1:]
    classes = json.dumps(program.describe(command, shaders), separators=(",", ":"))
    numbers = tuple(map(int, version.split(".")))
    folder = pathlib.Path(__file__).parent / "zsi_render"
    with zipfile.ZipFile(goal, "w", zipfile.ZIP_DEFLATED) as archive:

        def add(name, text):
            archive.writestr(
                zipfile.ZipInfo(f"zsi_render/{name}", EPOCH), text, zipfile.ZIP_DEFLATED
            )

        for source in sorted(folder.glob("*.py")):
            text = source.read_text(encoding="utf-8")
            if source.name == "__init__.py":
                text = text.replace("(0, 0, 0)", str(numbers))
            add(source.name, text)
        add("classes.json", classes)


main()
