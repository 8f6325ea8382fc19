#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Writes assets/models: small glTF 2.0 files, and expected.json, what their pictures show as numbers.

Each model looks along -z at tiles around the origin, almost in parallel, and holds all the light that
there is. The numbers are closed forms of the format's own models, worked out here and not by the
renderer; tests/host/models_test.py compares the two.
"""
import base64
import json
import math
import pathlib
import struct
import zlib

import numpy as np

DISTANCE, HALF = 40.0, 1.0  # of the camera from z = 0; half of what it sees there from top to bottom
ASPECT = 1.5
FOLDER = pathlib.Path(__file__).resolve().parents[1] / "assets/models"
FLOAT, UNSIGNED = 5126, 5125


class Model:
    """A glTF document in the making: everything that is used twice is stored once."""

    def __init__(self, name, why, within, samples=16):
        self.name, self.why, self.within, self.samples = name, why, within, samples
        self.blob, self.probes, self.used = bytearray(), [], {"KHR_lights_punctual"}
        self.json = {
            "asset": {"version": "2.0", "generator": "tools/make_models.py"},
            "scene": 0, "scenes": [{"nodes": []}], "nodes": [], "meshes": [], "materials": [],
            "cameras": [{"type": "perspective", "perspective": {
                "yfov": 2 * math.atan(HALF / DISTANCE), "aspectRatio": ASPECT, "znear": 1}}],
            "accessors": [], "bufferViews": []}
        self.node(name="camera", camera=0, translation=[0, 0, DISTANCE])

    def _view(self, data):
        self.blob += b"\0" * (-len(self.blob) % 4)
        self.json["bufferViews"].append(
            {"buffer": 0, "byteOffset": len(self.blob), "byteLength": len(data)})
        self.blob += data
        return len(self.json["bufferViews"]) - 1

    def _accessor(self, values, kind):
        values = np.asarray(values, np.uint32 if kind == "SCALAR" else np.float32)
        bounds = {}
        if kind == "VEC3":
            bounds = {"min": values.min(axis=0).tolist(), "max": values.max(axis=0).tolist()}
        self.json["accessors"].append({
            "bufferView": self._view(values.tobytes()), "count": len(values), "type": kind,
            "componentType": UNSIGNED if kind == "SCALAR" else FLOAT, **bounds})
        return len(self.json["accessors"]) - 1

    def node(self, **node):
        self.json["nodes"].append(node)
        self.json["scenes"][0]["nodes"].append(len(self.json["nodes"]) - 1)

    def geometry(self, positions, normals, uvs, indices, tangents=None):
        """Attributes and indices, for `tile` and its like."""
        attributes = {"POSITION": self._accessor(positions, "VEC3"),
                      "NORMAL": self._accessor(normals, "VEC3"),
                      "TEXCOORD_0": self._accessor(uvs, "VEC2")}
        if tangents is not None:
            attributes["TANGENT"] = self._accessor(tangents, "VEC4")
        return {"attributes": attributes, "indices": self._accessor(np.ravel(indices), "SCALAR")}

    def square(self):
        """2 x 2, facing +z; u to the right, v downwards."""
        return self.geometry([[-1, -1, 0], [1, -1, 0], [1, 1, 0], [-1, 1, 0]], [[0, 0, 1]] * 4,
                             [[0, 1], [1, 1], [1, 0], [0, 0]], [[0, 1, 2], [0, 2, 3]])

    def box(self):
        """2 x 2 x 1 with its front at z = 0."""
        corners, normals, uvs, faces = [], [], [], []
        for axis in range(3):
            for side in (-1, 1):
                n = np.eye(3)[axis] * side
                u, v = np.eye(3)[(axis + 1) % 3], np.eye(3)[(axis + 2) % 3] * side
                first = len(corners)
                faces += [[first, first + 1, first + 2], [first, first + 2, first + 3]]
                for a, b in ((-1, -1), (1, -1), (1, 1), (-1, 1)):
                    p = n + a * u + b * v
                    corners.append([p[0], p[1], (p[2] - 1) / 2])
                    normals.append(n)
                    uvs.append([(a + 1) / 2, (b + 1) / 2])
        return self.geometry(corners, normals, uvs, faces)

    def disc(self, rings=(0.05, 1.0), around=64):
        """Radius 1, facing +z; the tangents run around it, as on a turned lid."""
        angle = np.linspace(0, 2 * math.pi, around, endpoint=False)
        out = np.stack([np.cos(angle), np.sin(angle), 0 * angle], -1)
        tangent = np.stack([-np.sin(angle), np.cos(angle), 0 * angle, 0 * angle + 1], -1)
        positions = np.concatenate([r * out for r in rings])
        faces = []
        for i in range(around):
            j = (i + 1) % around
            faces += [[i, around + i, around + j], [i, around + j, j]]
        uvs = positions[:, :2] * [0.5, -0.5] + 0.5
        return self.geometry(positions, [[0, 0, 1]] * len(positions), uvs, faces,
                             np.concatenate([tangent] * len(rings)))

    def material(self, name, color=(1, 1, 1, 1), metallic=0.0, roughness=1.0, *, extensions=None,
                 **more):
        """`more`: further keys of the material, baseColorTexture among those of its model."""
        pbr = {"baseColorFactor": [*color, 1][:4], "metallicFactor": metallic,
               "roughnessFactor": roughness}
        if "baseColorTexture" in more:
            pbr["baseColorTexture"] = more.pop("baseColorTexture")
        entry = {"name": name, "pbrMetallicRoughness": pbr, **more}
        if extensions:
            self.used |= set(extensions)
            entry["extensions"] = extensions
        self.json["materials"].append(entry)
        return len(self.json["materials"]) - 1

    def tile(self, geometry, material, at, scale=1.0, name=None, **node):
        """An instance of `geometry` with a material, its own mesh as the format wants it."""
        self.json["meshes"].append({"primitives": [{**geometry, "material": material}]})
        scale = [scale] * 3 if np.isscalar(scale) else list(scale)
        self.node(name=name or self.json["materials"][material]["name"],
                  mesh=len(self.json["meshes"]) - 1, translation=list(at), scale=scale, **node)

    def card(self, color, z, facing=1):
        """Shines behind the tiles (facing 1), or behind the camera towards them (-1)."""
        matter = self.material("card " + " ".join(map(str, color)), (0, 0, 0), emissiveFactor=color,
                               extensions={"KHR_materials_specular": {"specularFactor": 0}})
        turn = {} if facing > 0 else {"rotation": [0, 1, 0, 0]}
        self.tile(self.square(), matter, (0, 0, z), 8, **turn)

    def light(self, kind, color, intensity, at=(0, 0, 0), rotation=(0, 0, 0, 1), **more):
        lights = self.json.setdefault("extensions", {}).setdefault(
            "KHR_lights_punctual", {"lights": []})["lights"]
        lights.append({"type": kind, "color": color, "intensity": intensity, **more})
        self.node(name=f"{kind} {len(lights)}", translation=list(at), rotation=list(rotation),
                  extensions={"KHR_lights_punctual": {"light": len(lights) - 1}})

    def sun(self, degrees, lux):
        """From the right, that many degrees off +z."""
        half = math.radians(degrees) / 2
        self.light("directional", [1, 1, 1], lux, rotation=[0, math.sin(half), 0, math.cos(half)])

    def expect(self, at, rgb, within=None):
        """`at`: (x, y) on the plane z = 0."""
        self.probes.append({
            "at": [round(0.5 + at[0] / (2 * HALF * ASPECT), 5), round(0.5 - at[1] / (2 * HALF), 5)],
            "rgb": [round(float(c), 5) for c in rgb], "within": within or self.within})

    def write(self, expected):
        if "extensions" not in self.json:
            self.light("point", [0, 0, 0], 0)  # models with lights of their own get no studio
        document = {k: v for k, v in self.json.items() if v or k == "scene"}
        if self.used:
            document["extensionsUsed"] = sorted(self.used)
        data = bytes(self.blob) + b"\0" * (-len(self.blob) % 4)
        document["buffers"] = [{"byteLength": len(data)}]
        if self.name.endswith(".glb"):
            text = json.dumps(document, separators=(",", ":")).encode()
            text += b" " * (-len(text) % 4)
            size = 12 + 8 + len(text) + 8 + len(data)
            (FOLDER / self.name).write_bytes(
                struct.pack("<4sII", b"glTF", 2, size) + struct.pack("<I4s", len(text), b"JSON")
                + text + struct.pack("<I4s", len(data), b"BIN\0") + data)
        else:
            document["buffers"][0]["uri"] = (
                "data:application/octet-stream;base64," + base64.b64encode(data).decode())
            (FOLDER / self.name).write_text(json.dumps(document, indent=1) + "\n")
        expected[self.name] = {"why": self.why, "samples": self.samples, "probes": self.probes}


def columns(count, width=2 * HALF * ASPECT):
    """Their middles from left to right, and the scale of a tile that leaves a gap."""
    step = width / count
    return [(i + 0.5) * step - width / 2 for i in range(count)], 0.45 * step


# --- the format's models ---------------------------------------------------------------------

def schlick(f0, cosine):
    return f0 + (1 - f0) * (1 - cosine) ** 5


def ggx(h, l, v, at, ab):
    """Normal distribution times height-correlated masking over 4 nl nv (Heitz 2014); directions are
    arrays of unit vectors in the frame of tangent, bitangent, normal."""
    d = 1 / (math.pi * at * ab * ((h[..., 0] / at) ** 2 + (h[..., 1] / ab) ** 2 + h[..., 2] ** 2) ** 2)

    def length(w):
        return np.sqrt((at * w[..., 0]) ** 2 + (ab * w[..., 1]) ** 2 + w[..., 2] ** 2)

    return d / (2 * (l[..., 2] * length(v) + v[..., 2] * length(l)))


def unit(v):
    v = np.asarray(v, float)
    return v / np.linalg.norm(v, axis=-1, keepdims=True)


def albedo(v, at, ab, steps=256):
    """What a white facet model of one bounce returns towards unit `v`, by normals drawn from its
    distribution."""
    i, j = np.meshgrid((np.arange(steps) + 0.5) / steps, (np.arange(steps) + 0.5) / steps)
    slope = np.sqrt(i / (1 - i))
    h = unit(np.stack([at * slope * np.cos(2 * np.pi * j), ab * slope * np.sin(2 * np.pi * j),
                       1 + 0 * i], -1))
    vh = h @ v
    l = 2 * vh[..., None] * h - v
    good = (l[..., 2] > 1e-6) & (vh > 1e-6)
    safe = np.where(good[..., None], l, [0, 0, 1.0])
    # Value times cosine over the density of l, which is that of h over 4 vh.
    d = 1 / (math.pi * at * ab * ((h[..., 0] / at) ** 2 + (h[..., 1] / ab) ** 2 + h[..., 2] ** 2) ** 2)
    value = ggx(h, safe, np.broadcast_to(v, h.shape), at, ab) * safe[..., 2] * 4 * np.abs(vh)
    return float(np.mean(np.where(good, value / (d * h[..., 2]), 0)))


def bounced(f0, l, v, at, ab):
    """The light of further bounces as a broad lobe (Kulla and Conty 2017)."""
    mean, turns = 0.0, (np.arange(4) + 0.5) * math.pi / 8
    for cosine in (np.arange(16) + 0.5) / 16:
        sine = math.sqrt(1 - cosine**2)
        for turn in turns if at != ab else turns[:1]:
            w = np.array([sine * math.cos(turn), sine * math.sin(turn), cosine])
            mean += 2 * cosine * albedo(w, at, ab, 64) / (16 * (4 if at != ab else 1))
    lobe = (1 - albedo(l, at, ab)) * (1 - albedo(v, at, ab)) / (math.pi * (1 - mean))
    f = f0 + (1 - f0) / 21
    return lobe * f * f * mean / (1 - f * (1 - mean))


def pane(ior, through=1.0):
    """Reflected and transmitted at normal incidence; `through`: of the way inside. The glass class
    reflects at the face that is met from outside alone, so what an exact pane would send back and
    forth between its faces goes on."""
    f = ((ior - 1) / (ior + 1)) ** 2
    return f, (1 - f) * through


def linear(byte):
    c = byte / 255
    return c / 12.92 if c <= 0.04045 else ((c + 0.055) / 1.055) ** 2.4


# --- the models ------------------------------------------------------------------------------

def roughness_and_metal():
    model = Model("roughness_metal.gltf",
                  "GGX of width roughness squared, lit 30 degrees off the normal: metal above, with "
                  "the light of further bounces, a dielectric below", 0.02)
    color = np.array([0.9, 0.6, 0.3])
    square, (xs, size) = model.square(), columns(6)
    light = unit([math.sin(math.radians(30)), 0, math.cos(math.radians(30))])
    model.sun(30, math.pi)
    for x, roughness in zip(xs, (0.3, 0.4, 0.5, 0.6, 0.8, 1.0)):
        for y, metallic in ((0.5, 1.0), (-0.5, 0.0)):
            matter = model.material(f"metallic {metallic} roughness {roughness}", color, metallic,
                                    roughness)
            model.tile(square, matter, (x, y, 0), size, name=f"tile {x} {y}")
            view = unit([-x, -y, DISTANCE])
            h = unit(light + view)
            alpha = roughness**2
            lobe = ggx(h, light, view, alpha, alpha)
            vh = float(h @ view)
            if metallic:
                value = schlick(color, vh) * lobe + bounced(color, light, view, alpha, alpha)
                model.expect((x, y), math.pi * value * light[2])
            else:
                f = schlick(0.04, vh)
                value = f * lobe + (1 - f) * color / math.pi
                # A coat over a base is another model than the format's blend, and its width ends at
                # 0.5.
                model.expect((x, y), math.pi * value * light[2], 0.03 if roughness < 0.8 else 0.06)
    return model


def index():
    model = Model("index.gltf",
                  "panes of glass before a red card, a green one behind the camera: reflected and "
                  "transmitted light at normal incidence", 0.02, 64)
    model.card([1, 0, 0], -6)
    model.card([0, 1, 0], 2 * DISTANCE, -1)
    box, (xs, size) = model.box(), columns(6)
    for x, ior in zip(xs, (1.1, 1.2, 1.33, 1.5, 1.8, 2.4)):
        matter = model.material(f"index {ior}", roughness=0.0, extensions={
            "KHR_materials_transmission": {"transmissionFactor": 1},
            "KHR_materials_volume": {"thicknessFactor": 1}, "KHR_materials_ior": {"ior": ior}})
        model.tile(box, matter, (x, 0, 0), (size, 0.8, 0.3))
        reflected, through = pane(ior)
        model.expect((x, 0), (through, reflected, 0))
    return model


def attenuation():
    model = Model("attenuation.gltf",
                  "steps of tinted glass before a white card: Beer's law", 0.02, 64)
    model.card([1, 1, 1], -6)
    color, distance = np.array([0.8, 0.5, 0.2]), 0.5
    box, (xs, size) = model.box(), columns(5)
    matter = model.material("tinted", roughness=0.0, extensions={
        "KHR_materials_transmission": {"transmissionFactor": 1},
        "KHR_materials_volume": {"thicknessFactor": 1, "attenuationDistance": distance,
                                 "attenuationColor": color.tolist()},
        "KHR_materials_ior": {"ior": 1.5}})
    for x, thickness in zip(xs, (0.1, 0.2, 0.4, 0.8, 1.6)):
        model.tile(box, matter, (x, 0, 0), (size, 0.8, thickness), name=f"thickness {thickness}")
        model.expect((x, 0), [pane(1.5, c ** (thickness / distance))[1] for c in color])
    return model


def anisotropy():
    model = Model("anisotropy.gltf",
                  "turned metal of roughness 0.4, lit 30 degrees off the normal from the right: along "
                  "the grain at the top, across it at the right", 0.03)
    color = np.array([0.9, 0.6, 0.3])
    disc, (xs, size) = model.disc(), columns(3)
    light = unit([math.sin(math.radians(30)), 0, math.cos(math.radians(30))])
    model.sun(30, math.pi)
    for x, strength in zip(xs, (0.0, 0.5, 0.9)):
        extensions = {"KHR_materials_anisotropy": {"anisotropyStrength": strength}} if strength else None
        matter = model.material(f"strength {strength}", color, 1.0, 0.4, extensions=extensions)
        model.tile(disc, matter, (x, 0, 0), size)
        across = 0.4**2
        along = across + (1 - across) * strength**2
        for dx, dy in ((0.7 * size, 0), (0, 0.7 * size)):
            tangent = unit([-dy, dx, 0])
            frame = np.stack([tangent, np.cross([0, 0, 1], tangent), [0, 0, 1]])
            l, v = frame @ light, frame @ unit([-x - dx, -dy, DISTANCE])
            h = unit(l + v)
            value = schlick(color, float(h @ v)) * ggx(h, l, v, along, across)
            value = value + bounced(color, l, v, along, across)
            model.expect((x + dx, dy), math.pi * value * light[2])
    return model


def alpha_modes():
    model = Model("alpha.gltf",
                  "unlit tiles before a white card: OPAQUE, MASK below and above its cutoff, BLEND", 0.02)
    model.card([1, 1, 1], -2)
    square, (xs, size) = model.square(), columns(5)
    color = np.array([0.1, 0.3, 0.6])
    for x, mode, alpha, more, kept in zip(
            xs, ("OPAQUE", "MASK", "MASK", "BLEND", "BLEND"), (0.4, 0.4, 0.6, 0.25, 0.75),
            ({}, {}, {"alphaCutoff": 0.5}, {}, {}), (1, 0, 1, 0.25, 0.75)):
        matter = model.material(f"{mode} {alpha}", (*color, alpha), alphaMode=mode,
                                extensions={"KHR_materials_unlit": {}}, **more)
        model.tile(square, matter, (x, 0, 0), size)
        model.expect((x, 0), kept * color + (1 - kept))
    return model


def clear_coat():
    model = Model("clearcoat.gltf",
                  "without and with a clear coat, a green card behind the camera and a sun: the "
                  "coat mirrors the card and takes its share from what is below", 0.02, 64)
    model.card([0, 1, 0], 2 * DISTANCE, -1)
    model.sun(20, math.pi)
    square, (xs, size) = model.square(), columns(4)
    cosine = math.cos(math.radians(20))
    for x, coat, red in zip(xs, (0, 1, 0, 1), (0, 0, 0.5, 0.5)):
        extensions = {"KHR_materials_specular": {"specularFactor": 0}}
        if coat:
            extensions["KHR_materials_clearcoat"] = {"clearcoatFactor": coat}
        matter = model.material(f"coat {coat} red {red}", (red, 0, 0), extensions=extensions)
        model.tile(square, matter, (x, 0, 0), size)
        model.expect((x, 0), (red * cosine * (1 - 0.04 * coat), 0.04 * coat, 0), 0.03)
    return model


def punctual():
    model = Model("punctual.gltf",
                  "a white wall under a point light in red (candela over square metres), a spot in "
                  "green, a sun in blue (lux)", 0.01)
    matter = model.material("white", (0.8, 0.8, 0.8),
                            extensions={"KHR_materials_specular": {"specularFactor": 0}})
    model.tile(model.square(), matter, (0, 0, 0), 2)
    point, height = np.array([-0.7, 0.1, 0.8]), 2.0
    inner, outer = 0.1, 0.25
    model.light("point", [1, 0, 0], 2.0, point.tolist())
    model.light("spot", [0, 1, 0], 3.0, [0.6, 0, height],
                spot={"innerConeAngle": inner, "outerConeAngle": outer})
    half = math.radians(50) / 2
    model.light("directional", [0, 0, 1], 1.5, rotation=[-math.sin(half), 0, 0, math.cos(half)])
    for p in ((-0.7, 0.1), (-1.2, -0.6), (0.6, 0), (0.72, 0.05), (1.2, 0.2), (1.3, -0.7)):
        to = point - [*p, 0]
        red = 2.0 * to[2] / np.linalg.norm(to) ** 3
        to = np.array([0.6, 0, height]) - [*p, 0]
        cosine = to[2] / np.linalg.norm(to)
        green = 3.0 * cosine / float(to @ to)
        green *= cosine > math.cos(inner)  # none of the places is on the rim, whose shape is open
        blue = 1.5 * math.cos(math.radians(50))
        model.expect(p, 0.8 / math.pi * np.array([red, green, blue]))
    return model


def png(pixels):
    """(height, width, 3) bytes as a PNG file."""
    height, width, _ = pixels.shape
    rows = b"".join(b"\0" + row.tobytes() for row in pixels)

    def chunk(kind, data):
        body = kind + data
        return struct.pack(">I", len(data)) + body + struct.pack(">I", zlib.crc32(body))

    return (b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", struct.pack(">IIBBBBB", width, height, 8, 2, 0, 0, 0))
            + chunk(b"IDAT", zlib.compress(rows, 9)) + chunk(b"IEND", b""))


def textures():
    model = Model("textures.glb",
                  "an embedded picture of four colours, unlit: as it is, moved, turned, repeated, "
                  "mirrored and held at its edge", 0.02)
    fields = np.array([[[230, 40, 40], [40, 200, 60]], [[50, 70, 220], [240, 200, 60]]], np.uint8)
    picture = png(np.repeat(np.repeat(fields, 8, 0), 8, 1))
    model.json["images"] = [{"bufferView": model._view(picture), "mimeType": "image/png"}]
    wraps = {"repeat": 10497, "mirror": 33648, "clamp": 33071}
    model.json["samplers"] = [{"wrapS": w, "wrapT": w} for w in wraps.values()]
    model.json["textures"] = [{"source": 0, "sampler": i} for i in range(len(wraps))]
    square, (xs, size) = model.square(), columns(6)
    cases = ({}, {"offset": [0.5, 0]}, {"rotation": math.pi / 2, "offset": [0, 1]},
             {"scale": [2, 2]}, {"scale": [2, 2]}, {"scale": [2, 2]})
    for x, case, wrap in zip(xs, cases, ("repeat", "repeat", "repeat", "repeat", "mirror", "clamp")):
        texture = {"index": list(wraps).index(wrap)}
        if case:
            texture["extensions"] = {"KHR_texture_transform": case}
            model.used.add("KHR_texture_transform")
        matter = model.material(f"{wrap} {sorted(case)}", (1, 1, 1), baseColorTexture=texture,
                                extensions={"KHR_materials_unlit": {}})
        model.tile(square, matter, (x, 0, 0), size)
        for u, v in ((0.125, 0.125), (0.625, 0.125), (0.375, 0.625), (0.875, 0.875)):
            # uv' = translation rotation scale uv, as the format's matrices multiply
            angle, (su, sv) = case.get("rotation", 0), case.get("scale", (1, 1))
            c, s = math.cos(angle), math.sin(angle)
            ou, ov = case.get("offset", (0, 0))
            place = [c * su * u + s * sv * v + ou, -s * su * u + c * sv * v + ov]
            if wrap == "clamp":
                place = [min(max(p, 0.01), 0.99) for p in place]
            elif wrap == "mirror":
                place = [abs((p + 1) % 2 - 1) for p in place]
            field = fields[int(place[1] % 1 * 2), int(place[0] % 1 * 2)]
            model.expect((x + (2 * u - 1) * size, (1 - 2 * v) * size), [linear(b) for b in field])
    return model


def maps():
    model = Model("maps.glb",
                  "a normal map of ripples across the wall under a sun from the right, plain and at "
                  "half its scale, and a picture times its strength that glows", 0.03)
    slope = 0.45 * np.cos(2 * math.pi * (np.arange(64) + 0.5) / 64)
    ripples = unit(np.stack([-slope, 0 * slope, 1 + 0 * slope], -1)) * 0.5 + 0.5
    ripples = np.tile(np.round(ripples * 255).astype(np.uint8), (64, 1, 1))
    glowing = np.tile(np.array([200, 120, 60], np.uint8), (4, 4, 1))
    model.json["images"] = [{"bufferView": model._view(png(p)), "mimeType": "image/png"}
                            for p in (ripples, glowing)]
    model.json["textures"] = [{"source": 0}, {"source": 1}]
    flat = {"KHR_materials_specular": {"specularFactor": 0}}
    square, (xs, size) = model.square(), columns(4)
    color = np.array([0.7, 0.5, 0.3])
    light = unit([math.sin(math.radians(40)), 0, math.cos(math.radians(40))])
    for x, scale in ((xs[0], 0), (xs[1], 1), (xs[2], 0.5)):
        more = {"normalTexture": {"index": 0, "scale": scale}} if scale else {}
        matter = model.material(f"ripples times {scale}", color, extensions=flat, **more)
        model.tile(square, matter, (x, 0, 0), size)
        for u in (0.3, 0.5, 0.8):
            steep = 0.45 * math.cos(2 * math.pi * u) * scale
            normal = unit([-steep, 0, 1])
            model.expect((x + (2 * u - 1) * size, 0), color * float(normal @ light))
    model.sun(40, math.pi)
    matter = model.material("glowing", (0, 0, 0), emissiveFactor=[1, 0.5, 1],
                            emissiveTexture={"index": 1}, extensions={
                                **flat, "KHR_materials_emissive_strength": {"emissiveStrength": 3}})
    model.tile(square, matter, (xs[3], 0, 0), size)
    model.expect((xs[3], 0), 3 * np.array([1, 0.5, 1]) * [linear(b) for b in (200, 120, 60)])
    return model


if __name__ == "__main__":
    FOLDER.mkdir(parents=True, exist_ok=True)
    expected = {}
    for made in (roughness_and_metal, index, attenuation, anisotropy, alpha_modes, clear_coat,
                 punctual, textures, maps):
        made().write(expected)
    (FOLDER / "expected.json").write_text(json.dumps(expected, indent=1) + "\n")
