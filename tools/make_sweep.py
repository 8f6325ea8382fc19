#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Writes assets/sweep.obj: a photographer's sweep, a floor that runs into a wall by a quarter arc.

The floor faces +z, the wall -y, towards the camera. uv: x and the way along the paper, scene units.
"""
import math
import sys

FRONT, BEND, RADIUS, TOP, HALF_WIDTH, STEPS = -14.0, 3.5, 3.0, 11.0, 14.0, 24

profile = [(FRONT, 0.0, (0.0, 1.0))]  # y, z, normal
for step in range(STEPS + 1):
    sine, cosine = math.sin(math.pi / 2 * step / STEPS), math.cos(math.pi / 2 * step / STEPS)
    profile.append((BEND + RADIUS * sine, RADIUS - RADIUS * cosine, (-sine, cosine)))
profile.append((BEND + RADIUS, TOP, (-1.0, 0.0)))

with open(sys.argv[1] if len(sys.argv) > 1 else 'assets/sweep.obj', 'w', encoding='ascii') as out:
    way = 0.0
    for i, (y, z, normal) in enumerate(profile):
        way += math.hypot(y - profile[i - 1][0], z - profile[i - 1][1]) if i else 0.0
        for x in (-HALF_WIDTH, HALF_WIDTH):
            out.write(f'v {x:g} {y:.5g} {z:.5g}\nvt {x:g} {way:.5g}\n')
        out.write(f'vn 0 {normal[0]:.5g} {normal[1]:.5g}\n')
    for i in range(1, len(profile)):
        a = 2 * i - 1
        out.write(f'f {a}/{a}/{i} {a + 1}/{a + 1}/{i} '
                  f'{a + 3}/{a + 3}/{i + 1} {a + 2}/{a + 2}/{i + 1}\n')
