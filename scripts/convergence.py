#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""How fast pictures converge: variance x CPU time of both integrators beside Blender's Cycles.

    scripts/convergence.py [--seeds N] [--samples N] [--zsi build/zsi] [--pictures FOLDER] [SCENE ...]

Five like scenes at 160 x 90, every process on one core, renderers and seeds taking turns. The variance
is that between pictures of different seeds, so each renderer is measured against its own mean; bright
samples are clipped at 4. The time is the CPU's for a picture less that for one of 2 samples: without
loading and building. Ratios are to Cycles; below 1 is better than it. "Smoothed" is the variance after a
Gaussian blur of one pixel, as a share of what independent pixels would leave: how far noise of neighbours
cancels, for path, shade and Cycles. The last column says how far the means of our two integrators lie
apart, in standard errors, at the worst of 12 parts of the picture.

Needs python3-numpy, python3-scipy, python3-openimageio and, for the ratios, blender; without it the numbers stand alone.
"""
import argparse
import json
import math
import os
import resource
import shutil
import subprocess
import sys
import tempfile

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
WIDTH, HEIGHT, FEW, CLIP = 160, 90, 2, 4


# ---- scenes, as zsi reads them ------------------------------------------------------------------

def ward(color):
    return {"class": "corvid_Mtl_Ward", "parameters": {
        "u_diffuseColor": color, "u_additionalColor": [0, 0, 0], "u_roughValue": 0.3,
        "u_brdf00Reflectivity": 0, "u_brdf90Reflectivity": 0}}


def metal(color, rough):
    return {"class": "corvid_Mtl_Metal", "parameters": {"u_reflectColor": color, "u_roughValue": rough}}


def paint(color, rough):
    return {"class": "corvid_Mtl_MetallicPaint", "parameters": {
        "u_baseColor": color, "u_flakeDensity": 0, "u_coatReflectivity": 0.04, "u_coatRoughValue": rough}}


MATERIALS = {"grey": ward([0.5, 0.5, 0.5]), "clay": ward([0.5, 0.3, 0.2]), "red": paint([0.6, 0.05, 0.03], 0.05),
             "gold": metal([1.0, 0.71, 0.29], 0.12), "steel": metal([0.6, 0.6, 0.62], 0.3),
             "chrome": metal([0.9, 0.9, 0.9], 0.02),
             "glass": {"class": "corvid_Mtl_Dielectric", "parameters": {"u_ior": 1.5, "u_reflectance": 0.04}}}


def scene(meshes, instances, environment, intensity, position, target, fov):
    meshes = dict(meshes, ground={"plane": {"size": [60, 60]}})
    instances = [("ground", "grey", 1, 0, [0, 0, 0])] + instances
    return {
        "camera": {"position": position, "target": target, "fov": fov},
        "film": {"width": WIDTH, "height": HEIGHT, "alpha": False},
        "settings": {"maxDepth": 12, "sampleClamp": CLIP},
        "meshes": meshes, "materials": {name: MATERIALS[name] for name in {i[1] for i in instances}},
        "instances": {f"{n}": {"mesh": m, "material": material, "transform": {
            "scale": s, "rotate": [0, 0, 1, turn], "translate": place}}
            for n, (m, material, s, turn, place) in enumerate(instances)},
        "environment": {"file": f"{ROOT}/assets/{environment}", "intensity": intensity}}


def spheres(environment, intensity):
    balls = [("ball", m, 1, 0, [2.2 * i - 4.4, 0, 1]) for i, m in enumerate(["red", "gold", "clay", "steel", "chrome"])]
    return scene({"ball": {"sphere": {"radius": 1, "segments": 96}}}, balls, environment, intensity,
                 [0, -11, 3.5], [0, 0, 0.8], 32)


HEAD = {"head": {"file": f"{ROOT}/assets/suzanne.ply", "up": "y"}}


def heads():
    kinds = ["glass", "gold", "red", "chrome", "glass", "steel", "clay"]
    return scene(HEAD, [("head", m, 1.2, 15 * (3 - i), [1.9 * (i - 3), abs(i - 3) * 0.3, 0.9]) for i, m in enumerate(kinds)],
                 "studio_reflection.exr", 0.5, [0, -13, 3.5], [0, 0, 0.8], 26)


def hills(folder):
    """A million triangles."""
    n, path = 708, os.path.join(folder, "hills.ply")
    if not os.path.exists(path):
        import numpy
        x, y = numpy.meshgrid(numpy.linspace(-10, 10, n), numpy.linspace(-10, 10, n))
        z = 0.6 + 0.5 * numpy.sin(1.3 * x) * numpy.cos(0.9 * y) + 0.12 * numpy.sin(5.1 * x + 2.0 * y) * numpy.sin(4.3 * y)
        vertices = numpy.stack([x, y, z], -1).astype("<f4").reshape(-1, 3)
        a = (numpy.arange(n - 1)[:, None] * n + numpy.arange(n - 1)[None]).reshape(-1)
        corners = numpy.concatenate([numpy.stack([a, a + 1, a + n + 1], -1), numpy.stack([a, a + n + 1, a + n], -1)])
        faces = numpy.empty(len(corners), [("n", "u1"), ("i", "<i4", 3)])
        faces["n"], faces["i"] = 3, corners
        with open(path, "wb") as f:
            f.write(f"ply\nformat binary_little_endian 1.0\nelement vertex {len(vertices)}\n"
                    "property float x\nproperty float y\nproperty float z\n"
                    f"element face {len(faces)}\nproperty list uchar int vertex_indices\nend_header\n".encode())
            f.write(vertices.tobytes() + faces.tobytes())
    return scene({"hills": {"file": path}}, [("hills", "clay", 1, 0, [0, 0, 0])], "sunset.exr", 1, [0, -12, 5], [0, 0, 0.4], 35)


def thousand():
    kinds = ["clay", "red", "gold", "steel"]
    return scene(HEAD, [("head", kinds[(x + 3 * y) % 4], 0.35, 37 * x + 71 * y, [0.8 * (x - 19.5), 0.9 * y - 4, 0.35])
                        for x in range(40) for y in range(25)], "city.exr", 1, [0, -10, 6], [0, 2, 0], 40)


def scenes(folder):
    return {"studio": lambda: spheres("studio_diffuse.exr", 0.5), "lamps": lambda: spheres("studio.exr", 0.1),
            "heads": heads, "hills": lambda: hills(folder), "thousand": thousand}


# ---- the other renderer: reads the same files, in a process of its own -----------------------------

def in_blender():
    import bpy
    from mathutils import Matrix, Vector

    def material(name, m):
        p, result = m["parameters"], bpy.data.materials.new(name)
        result.use_nodes = True
        nodes = result.node_tree.nodes
        nodes.clear()
        kind = m["class"].split("_")[-1]
        shader = nodes.new({"Ward": "ShaderNodeBsdfDiffuse", "MetallicPaint": "ShaderNodeBsdfPrincipled", "Metal": "ShaderNodeBsdfGlossy",
                            "Dielectric": "ShaderNodeBsdfGlass"}[kind])
        if kind == "Ward":
            shader.inputs["Color"].default_value = [*p["u_diffuseColor"], 1]
        elif kind == "MetallicPaint":
            shader.inputs["Base Color"].default_value = [*p["u_baseColor"], 1]
            shader.inputs["Roughness"].default_value = math.sqrt(p["u_coatRoughValue"])
        elif kind == "Metal":
            shader.distribution = "GGX"
            shader.inputs["Color"].default_value = [*p["u_reflectColor"], 1]
            shader.inputs["Roughness"].default_value = math.sqrt(p["u_roughValue"])
        else:
            shader.distribution = "SHARP"
            shader.inputs["IOR"].default_value = p["u_ior"]
        output = nodes.new("ShaderNodeOutputMaterial")
        result.node_tree.links.new(shader.outputs[0], output.inputs["Surface"])
        return result

    def mesh(m):
        if "file" in m:
            bpy.ops.import_mesh.ply(filepath=m["file"])
        elif "sphere" in m:
            bpy.ops.mesh.primitive_uv_sphere_add(segments=m["sphere"]["segments"], ring_count=m["sphere"]["segments"] // 2)
        else:
            bpy.ops.mesh.primitive_plane_add(size=m["plane"]["size"][0])
        made = bpy.context.object
        data = made.data
        bpy.data.objects.remove(made)
        if m.get("up") == "y":
            data.transform(Matrix.Rotation(math.pi / 2, 4, "X"))
        data.polygons.foreach_set("use_smooth", [True] * len(data.polygons))
        return data

    def load(path):
        bpy.ops.wm.read_factory_settings(use_empty=True)
        bpy.ops.preferences.addon_enable(module="io_mesh_ply")
        with open(path) as f:
            s = json.load(f)
        out = bpy.context.scene
        meshes = {k: mesh(m) for k, m in s["meshes"].items()}
        materials = {k: material(k, m) for k, m in s["materials"].items()}
        for name, i in s["instances"].items():
            kind = (i["mesh"], i["material"])
            if kind not in meshes:
                meshes[kind] = meshes[i["mesh"]].copy()
                meshes[kind].materials.clear()
                meshes[kind].materials.append(materials[i["material"]])
            o = bpy.data.objects.new(name, meshes[kind])
            t = i["transform"]
            o.matrix_world = (Matrix.Translation(t["translate"])
                              @ Matrix.Rotation(math.radians(t["rotate"][3]), 4, Vector(t["rotate"][:3]))
                              @ Matrix.Scale(t["scale"], 4))
            out.collection.objects.link(o)
        camera = bpy.data.objects.new("camera", bpy.data.cameras.new("camera"))
        camera.data.sensor_fit = "VERTICAL"
        camera.data.angle = math.radians(s["camera"]["fov"])
        camera.location = s["camera"]["position"]
        camera.rotation_euler = (Vector(s["camera"]["target"]) - camera.location).to_track_quat("-Z", "Y").to_euler()
        out.collection.objects.link(camera)
        out.camera = camera

        out.world = bpy.data.worlds.new("sky")
        out.world.use_nodes = True
        tree = out.world.node_tree
        place, turn, sky = (tree.nodes.new(n) for n in
                            ("ShaderNodeTexCoord", "ShaderNodeMapping", "ShaderNodeTexEnvironment"))
        turn.inputs["Rotation"].default_value[2] = -math.pi / 2
        sky.image = bpy.data.images.load(s["environment"]["file"])
        tree.links.new(place.outputs["Generated"], turn.inputs["Vector"])
        tree.links.new(turn.outputs[0], sky.inputs["Vector"])
        tree.nodes["Background"].inputs["Strength"].default_value = s["environment"]["intensity"]
        tree.links.new(sky.outputs[0], tree.nodes["Background"].inputs["Color"])

        render, cycles = out.render, out.cycles
        render.engine = "CYCLES"
        render.resolution_x, render.resolution_y, render.resolution_percentage = WIDTH, HEIGHT, 100
        render.use_persistent_data = True
        render.image_settings.file_format, render.image_settings.color_depth = "OPEN_EXR", "32"
        cycles.use_adaptive_sampling = cycles.use_denoising = False
        cycles.filter_width = 3.0  # that of zsi: a radius of 1.5 pixels
        cycles.max_bounces = cycles.diffuse_bounces = cycles.glossy_bounces = cycles.transmission_bounces = 12
        cycles.sample_clamp_direct = cycles.sample_clamp_indirect = CLIP

    def cpu():
        r = resource.getrusage(resource.RUSAGE_SELF)
        return r.ru_utime + r.ru_stime

    load(sys.argv[-1])
    out = bpy.context.scene
    for line in sys.stdin:
        seed, samples, path = line.split()
        out.cycles.seed, out.cycles.samples, out.render.filepath = int(seed), int(samples), path
        before = cpu()
        bpy.ops.render.render(write_still=True)
        print("CPU", cpu() - before, flush=True)


class Cycles:
    def __init__(self, path, pin):
        self.process = subprocess.Popen([*pin, "blender", "-b", "-t", "1", "--factory-startup", "-P", os.path.abspath(__file__),
                                         "--", path], stdin=subprocess.PIPE, stdout=subprocess.PIPE,
                                        stderr=subprocess.DEVNULL, text=True)

    def render(self, seed, samples, path):
        self.process.stdin.write(f"{seed} {samples} {path}\n")
        self.process.stdin.flush()
        for line in self.process.stdout:
            if line.startswith("CPU "):
                return float(line.split()[1])
        raise SystemExit("Blender ended without a picture")

    def close(self):
        self.process.stdin.close()
        self.process.wait()


class Zsi:
    def __init__(self, zsi, path, integrator, pin):
        self.command = [*pin, zsi, "render", path, "--quiet", "--threads", "1",
                        "--integrator", integrator]

    def render(self, seed, samples, path):
        before = resource.getrusage(resource.RUSAGE_CHILDREN)
        subprocess.run([*self.command, "--seed", str(seed), "--samples", str(samples), "-o", path], check=True)
        after = resource.getrusage(resource.RUSAGE_CHILDREN)
        return after.ru_utime + after.ru_stime - before.ru_utime - before.ru_stime

    def close(self):
        pass


# ---- measurement -------------------------------------------------------------------------------------

def pixels(path):
    import OpenImageIO
    image = OpenImageIO.ImageBuf(path).get_pixels(OpenImageIO.FLOAT)
    return image[:, :, :3].astype("f8")


def measure(renderers, samples, seeds, folder, keep):
    import numpy
    long, short = ({name: [] for name in renderers} for _ in range(2))
    pictures = {name: [] for name in renderers}
    for seed in range(1, seeds + 1):
        for name, renderer in renderers.items():
            path = os.path.join(folder, "picture.exr")
            if seed == 1:
                renderer.render(seed, FEW, path)  # what is built once is not counted
            short[name].append(renderer.render(seed, FEW, path))
            long[name].append(renderer.render(seed, samples, path))
            pictures[name].append(pixels(path))
            if keep and seed == 1:
                shutil.copy(path, f"{keep}-{name}.exr")
    result = {}
    for name in renderers:
        stack = numpy.minimum(numpy.array(pictures[name]), CLIP)
        cpu = ((numpy.median(long[name]) - numpy.median(short[name])) * samples / (samples - FEW)
               if samples > FEW else math.nan)  # too few to tell it from loading
        result[name] = (stack.var(axis=0, ddof=1).mean(), cpu, stack)
    return result


def smoothed(stack):
    """The share of independent pixels' variance that a Gaussian blur of one pixel leaves."""
    import numpy
    from scipy.ndimage import gaussian_filter
    noise = stack - stack.mean(axis=0)
    point = numpy.zeros((15, 15))
    point[7, 7] = 1
    independent = (noise ** 2).mean() * (gaussian_filter(point, 1) ** 2).sum()
    return (gaussian_filter(noise, (0, 1, 1, 0))[:, 4:-4, 4:-4] ** 2).mean() / independent


def apart(a, b):
    """The largest difference of means in standard errors over 4 x 3 parts of the picture."""
    import numpy
    worst = 0.0
    for rows in numpy.array_split(numpy.arange(HEIGHT), 3):
        for columns in numpy.array_split(numpy.arange(WIDTH), 4):
            x, y = (s[:, rows][:, :, columns].mean(axis=(1, 2, 3)) for s in (a, b))
            error = math.sqrt((x.var(ddof=1) + y.var(ddof=1)) / len(x)) + 1e-12
            worst = max(worst, abs(x.mean() - y.mean()) / error)
    return worst


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("scenes", nargs="*")
    parser.add_argument("--seeds", type=int, default=8)
    parser.add_argument("--samples", type=int, default=64)
    parser.add_argument("--zsi", default=f"{ROOT}/build/zsi")
    parser.add_argument("--core", type=int, default=0)
    parser.add_argument("--pictures", help="folder for the first picture of each")
    a = parser.parse_args()
    pin = ["taskset", "-c", str(a.core)]
    print(f"{'':9} {'variance x time':>17} {'variance':>15} {'time':>13}  {'smoothed':>20}  apart")
    print(f"{'':9} {'path':>8} {'shade':>8} {'path':>7} {'shade':>7} {'path':>6} {'shade':>6}"
          f"  {'path':>6} {'shade':>6} {'Cycles':>6}")
    with tempfile.TemporaryDirectory() as folder:
        known = scenes(folder)
        for name in a.scenes or known:
            path = os.path.join(folder, f"{name}.json")
            with open(path, "w") as f:
                json.dump(known[name](), f)
            renderers = {i: Zsi(a.zsi, path, i, pin) for i in ("path", "shade")}
            if shutil.which("blender"):
                renderers["cycles"] = Cycles(path, pin)
            keep = a.pictures and os.path.join(a.pictures, name)
            r = measure(renderers, a.samples, a.seeds, folder, keep)
            for renderer in renderers.values():
                renderer.close()
            (pv, pt, ps), (sv, st, ss) = r["path"], r["shade"]
            cv, ct = r["cycles"][:2] if "cycles" in r else (1, 1)
            even = [f"{smoothed(r[i][2]):6.2f}" if i in r else f"{'-':>6}" for i in ("path", "shade", "cycles")]
            print(f"{name:9} {pv * pt / cv / ct:8.3g} {sv * st / cv / ct:8.3g} {pv / cv:7.3g} {sv / cv:7.3g}"
                  f" {pt / ct:6.3g} {st / ct:6.3g}  {' '.join(even)}  {apart(ps, ss):.1f}", flush=True)


if "bpy" in sys.modules:
    in_blender()
elif __name__ == "__main__":
    main()
