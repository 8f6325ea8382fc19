#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Writes assets/shaderball.ply: a hollow ball with a wedge cut out, closed and watertight.

The outer sphere (radius 1) and the inner one (radius 0.8) are joined by the two faces of the cut,
so that a glass shows its thickness and a paint its edge. Axis z; the wedge opens around +x over
`CUT` degrees. uv: u around the axis, v from pole to pole; the cut faces map radius and angle.
"""
import math
import struct
import sys

CUT = 100.0
OUTER, INNER = 1.0, 0.8
AROUND, DOWN, ACROSS = 84, 64, 3

vertices, texcoords, normals, faces = [], [], [], []


def vertex(p, uv, n):
    vertices.append(p)
    texcoords.append(uv)
    normals.append(n)
    return len(vertices)


def direction(azimuth, polar):
    s = math.sin(polar)
    return (s * math.cos(azimuth), s * math.sin(azimuth), math.cos(polar))


def scaled(v, k):
    return tuple(k * c for c in v)


def grid(rows, columns, make, flip):
    index = [[make(i / rows, j / columns) for j in range(columns + 1)] for i in range(rows + 1)]
    for i in range(rows):
        for j in range(columns):
            a, b, c, d = index[i][j], index[i + 1][j], index[i + 1][j + 1], index[i][j + 1]
            for tri in ((a, b, c), (a, c, d)):
                if len({vertices[k - 1] for k in tri}) == 3:  # none at the poles
                    faces.append(tuple(reversed(tri)) if flip else tri)


first = math.radians(CUT / 2)
last = 2 * math.pi - first


def sphere(radius, side):
    def make(v, u):
        d = direction(first + (last - first) * u, math.pi * v)
        p = tuple(round(c, 5) + 0.0 for c in scaled(d, radius))
        return vertex(p, (4 * u, 2 * (1 - v)), scaled(d, side))
    grid(DOWN, AROUND, make, side < 0)


def cut(azimuth, side):
    n = (-math.sin(azimuth) * side, math.cos(azimuth) * side, 0.0)

    def make(v, w):
        d = direction(azimuth, math.pi * v)
        p = tuple(round(c, 5) + 0.0 for c in scaled(d, INNER + (OUTER - INNER) * w))
        return vertex(p, (w * 0.2, 2 * (1 - v)), n)
    grid(DOWN, ACROSS, make, side > 0)


sphere(OUTER, 1)
sphere(INNER, -1)
cut(first, -1)
cut(last, 1)

header = """ply
format binary_little_endian 1.0
comment made by tools/make_shaderball.py
element vertex %d
property float x
property float y
property float z
property float nx
property float ny
property float nz
property float s
property float t
element face %d
property list uchar uint vertex_indices
end_header
""" % (len(vertices), len(faces))

with open(sys.argv[1] if len(sys.argv) > 1 else "assets/shaderball.ply", "wb") as f:
    f.write(header.encode())
    for p, n, t in zip(vertices, normals, texcoords):
        f.write(struct.pack("<8f", *p, *n, *t))
    for tri in faces:
        f.write(struct.pack("<B3I", 3, *(k - 1 for k in tri)))
