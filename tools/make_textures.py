#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Writes the small textures of the gallery scenes into assets/textures/. All tile."""
import math
import random
import struct
import sys
import zlib

SIZE = 256
FOLDER = sys.argv[1] if len(sys.argv) > 1 else "assets/textures"


def byte(x):
    return max(0, min(255, int(round(255 * x))))


def png(name, pixel, channels, size=SIZE):
    """pixel(u, v) -> `channels` numbers in 0..1; v runs upwards."""
    rows = bytearray()
    for y in range(size):
        rows.append(0)
        for x in range(size):
            value = pixel((x + 0.5) / size, 1 - (y + 0.5) / size)
            rows += bytes(byte(c) for c in value)
    kind = {1: 0, 3: 2, 4: 6}[channels]

    def chunk(tag, data):
        body = tag + data
        return struct.pack(">I", len(data)) + body + struct.pack(">I", zlib.crc32(body))

    with open(f"{FOLDER}/{name}.png", "wb") as f:
        f.write(b"\x89PNG\r\n\x1a\n")
        f.write(chunk(b"IHDR", struct.pack(">IIBBBBB", size, size, 8, kind, 0, 0, 0)))
        f.write(chunk(b"IDAT", zlib.compress(bytes(rows), 9)))
        f.write(chunk(b"IEND", b""))


def smooth(a, b, x):
    t = max(0.0, min(1.0, (x - a) / (b - a)))
    return t * t * (3 - 2 * t)


class Noise:
    """Value noise that repeats after `period` cells."""

    def __init__(self, period, seed):
        generator = random.Random(seed)
        self.period = period
        self.grid = [[generator.random() for _ in range(period)] for _ in range(period)]

    def at(self, u, v, stretch=1):
        x, y = u * self.period, v * self.period * stretch
        i, j = math.floor(x), math.floor(y)
        fx, fy = x - i, y - j
        fx, fy = fx * fx * (3 - 2 * fx), fy * fy * (3 - 2 * fy)
        g = lambda a, b: self.grid[a % self.period][b % self.period]
        low = g(i, j) * (1 - fx) + g(i + 1, j) * fx
        high = g(i, j + 1) * (1 - fx) + g(i + 1, j + 1) * fx
        return low * (1 - fy) + high * fy


octaves = [Noise(4, 1), Noise(8, 2), Noise(16, 3), Noise(32, 4)]


def fractal(u, v):
    return sum(n.at(u, v) / 2 ** k for k, n in enumerate(octaves)) / 1.875


# checker: two greys with thin lines, for grounds
def checker(u, v):
    x, y = u * 4, v * 4
    g = 0.70 if (math.floor(x) + math.floor(y)) % 2 else 0.62
    edge = min(x % 1, 1 - x % 1, y % 1, 1 - y % 1)
    g *= 0.86 + 0.14 * smooth(0.0, 0.03, edge)
    return g, g, g


# uv grid: u in red, v in green, a line every eighth
def uv_grid(u, v):
    x, y = u * 8 % 1, v * 8 % 1
    line = smooth(0.0, 0.05, min(x, 1 - x, y, 1 - y))
    return 0.15 + 0.75 * u * line, 0.15 + 0.75 * v * line, 0.35 * line + 0.1


# brushed: streaks along u
rows_of = [Noise(64, 11), Noise(128, 12)]


def brushed(u, v):
    s = 0.5 * rows_of[0].at(u / 16, v) + 0.5 * rows_of[1].at(u / 32, v)
    return (s,)


# leaf: outline |x| < w(y), veins, and its mask
def leaf_inside(u, v):
    x, y = abs(u - 0.5), v
    if not 0.06 < y < 0.96:
        return -1.0
    t = (y - 0.06) / 0.9
    width = 0.36 * math.sin(math.pi * t) ** 0.8 * (1.15 - 0.55 * t)
    width *= 1 + 0.05 * math.sin(40 * t)
    return (width - x) * 30


def leaf(u, v):
    x, y = u - 0.5, v
    mid = smooth(0.0, 0.012, abs(x))
    side = (y - 0.55 * abs(x)) * 9 % 1
    vein = smooth(0.0, 0.10, min(side, 1 - side) + 0.02)
    k = vein * mid  # 1 on the blade, 0 on a vein
    shade = 0.75 + 0.5 * fractal(u, v)
    return (0.58 - 0.30 * k) * shade, (0.68 - 0.20 * k) * shade, (0.34 - 0.22 * k) * shade


# decal: a ring and a star, transparent around
def decal(u, v):
    x, y = u - 0.5, v - 0.5
    r, a = math.hypot(x, y), math.atan2(y, x)
    ring = smooth(0.43, 0.42, r) * smooth(0.35, 0.36, r)
    point = abs((a / (2 * math.pi) * 5 - 0.25) % 1 - 0.5) * 2
    star = smooth(0.0, 0.01, 0.13 + 0.19 * point - r)
    alpha = max(ring, star)
    return (0.85, 0.12, 0.10, alpha) if star < ring or star <= 0 else (0.95, 0.80, 0.15, alpha)


# clay and mortar: fired brick with darker pores, and sandy grey
def clay(u, v):
    k = fractal(u, v)
    pore = smooth(0.30, 0.42, fractal(2 * u + 0.3, 2 * v))
    shade = (0.70 + 0.6 * k) * (0.72 + 0.28 * pore)
    return 0.60 * shade, (0.30 + 0.05 * k) * shade, (0.22 + 0.03 * k) * shade


def mortar(u, v):
    shade = 0.85 + 0.3 * (fractal(3 * u, 3 * v) - 0.5)
    return 0.74 * shade, 0.71 * shade, 0.66 * shade


# flakes: a normal per cell as (2x - 1, 2y - 1, z), cells by nearest point
generator = random.Random(21)
CELLS = 40
points = [[(generator.random(), generator.random(), generator.random(), generator.random())
           for _ in range(CELLS)] for _ in range(CELLS)]


def flakes(u, v):
    x, y = u * CELLS, v * CELLS
    best, found = 9.0, None
    for i in range(math.floor(x) - 1, math.floor(x) + 2):
        for j in range(math.floor(y) - 1, math.floor(y) + 2):
            p = points[i % CELLS][j % CELLS]
            d = (i + p[0] - x) ** 2 + (j + p[1] - y) ** 2
            if d < best:
                best, found = d, p
    tilt = 0.45 * math.sqrt(found[2])
    angle = 2 * math.pi * found[3]
    nx, ny = math.sin(tilt) * math.cos(angle), math.sin(tilt) * math.sin(angle)
    return nx * 0.5 + 0.5, ny * 0.5 + 0.5, math.cos(tilt)


png("checker", checker, 3)
png("uv_grid", uv_grid, 3)
png("height", lambda u, v: (fractal(u, v),), 1)
png("brushed", brushed, 1)
png("leaf", leaf, 3)
png("leaf_mask", lambda u, v: (max(0.0, min(1.0, leaf_inside(u, v))),), 1)
png("decal", decal, 4)
png("clay", clay, 3, 128)
png("mortar", mortar, 3, 128)
png("flakes", flakes, 3)
