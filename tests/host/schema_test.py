#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Every shipped scene is as `zsi schema` says scenes are, and what the loader refuses is not.

usage: schema_test.py SCHEMA
"""
import copy
import json
import pathlib
import re
import sys

import jsonschema

COMMENT = re.compile(r'("(?:\\.|[^"\\])*")|//[^\n]*|/\*.*?\*/', re.S)
root = pathlib.Path(__file__).resolve().parents[2]
schema = json.loads(pathlib.Path(sys.argv[1]).read_text())
jsonschema.Draft202012Validator.check_schema(schema)
validator = jsonschema.Draft202012Validator(schema)
failed = []


def scene(path):
    return json.loads(COMMENT.sub(lambda m: m[1] or '', path.read_text()))


for path in sorted(root.glob('scenes/**/*.json')):
    failed += [f'{path}: {"/".join(map(str, e.absolute_path))}: {e.message}'
               for e in validator.iter_errors(scene(path))]

stage = scene(root / 'scenes/gallery/stage.json')
for place, value in (('camera/fow', 40), ('camera/fov', 180), ('film/layers', ['depht']),
                     ('settings/integrator', 'paths'), ('materials/core/class', 'corvid_Mtl_Wart'),
                     ('materials/core/parameters/u_rough', 1), ('meshes/ball/sphere', 1),
                     ('materials/core/parameters/u_diffuseColor', [1, 1]),
                     ('environment/parameters/reflectionCube', {'texture': 'a.exr'})):
    damaged = copy.deepcopy(stage)
    *way, last = place.split('/')
    at = damaged
    for key in way:
        at = at[key]
    at[last] = value
    if validator.is_valid(damaged):
        failed.append(f'{place} = {value} is taken')
sys.exit('\n'.join(failed) or 0)
