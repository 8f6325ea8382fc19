# SPDX-License-Identifier: Apache-2.0
"""The add-on as a user of Blender meets it: installed from its zip, a scene built, rendered and
compared with what the command makes of the same scene written by hand.

usage: blender -b --factory-startup -P addon_test.py -- ZIP ZSI FOLDER
"""

import json
import math
import os
import signal
import subprocess
import sys
import threading
import time
import traceback

import bpy
import numpy as np

ZIP, ZSI, FOLDER = sys.argv[sys.argv.index("--") + 1 :]
WIDTH, HEIGHT, SAMPLES = 96, 64, 32


def preferences():
    return bpy.context.preferences.addons["zsi_render"].preferences


def install():
    bpy.ops.preferences.addon_install(filepath=ZIP, overwrite=True)
    bpy.ops.preferences.addon_enable(module="zsi_render")
    preferences().program = ZSI


def empty():
    """An empty scene for the renderer."""
    bpy.ops.wm.read_factory_settings(use_empty=True)
    install()
    scene = bpy.context.scene
    scene.render.engine = "ZSI"
    scene.render.resolution_x, scene.render.resolution_y = WIDTH, HEIGHT
    scene.render.image_settings.file_format = "OPEN_EXR_MULTILAYER"
    scene.render.image_settings.color_depth = "32"
    scene.zsi.samples = SAMPLES
    scene.zsi.animate_seed = False
    return scene


def add(name, data, location=(0, 0, 0), rotation=(0, 0, 0)):
    result = bpy.data.objects.new(name, data)
    result.location, result.rotation_euler = location, rotation
    bpy.context.scene.collection.objects.link(result)
    return result


def primitive(kind, name, material=None, **keys):
    getattr(bpy.ops.mesh, f"primitive_{kind}_add")(**keys)
    result = bpy.context.object
    result.name = result.data.name = name
    if material:
        result.data.materials.append(material)
    return result


def material(name, shader, **values):
    result = bpy.data.materials.new(name)
    result.zsi.shader = shader
    for key, value in values.items():
        setattr(getattr(result.zsi, shader), key, value)
    return result


def nodes(name, **inputs):
    result = bpy.data.materials.new(name)
    result.use_nodes = True
    for key, value in inputs.items():
        shader = result.node_tree.nodes["Principled BSDF"]
        shader.inputs[key.replace("_", " ")].default_value = value
    return result


def camera(location, rotation=(0, 0, 0), **values):
    data = bpy.data.cameras.new("camera")
    for key, value in values.items():
        setattr(data, key, value)
    bpy.context.scene.camera = add("camera", data, location, rotation)
    return bpy.context.scene.camera


def rendered(name, **keys):
    """Layers by name, as the add-on's own reader tells them."""
    from zsi_render import exr

    scene = bpy.context.scene
    scene.render.filepath = os.path.join(FOLDER, name)
    bpy.ops.render.render(write_still=True, **keys)
    return named(exr.read(scene.render.filepath))


def named(picture):
    """Channels without Blender's names of scene and view layer."""
    picture.channels = {
        name.removeprefix("ViewLayer."): values for name, values in picture.channels.items()
    }
    return picture


def stack(picture, layer, channels):
    return picture.stack([f"{layer}.{c}" for c in channels])


def beauty(picture):
    return stack(picture, "Combined", "RGBA")


def alone(name, scene, layers=()):
    """The command's picture of a scene file's content."""
    from zsi_render import exr

    path = os.path.join(FOLDER, f"{name}.json")
    scene["film"] = {"width": WIDTH, "height": HEIGHT, "alpha": True, **scene.get("film", {})}
    scene["film"]["layers"] = list(layers)
    scene["settings"] = {"samples": SAMPLES, "integrator": "path", **scene.get("settings", {})}
    with open(path, "w", encoding="utf-8") as file:
        json.dump(scene, file)
    output = os.path.join(FOLDER, f"{name}.alone.exr")
    subprocess.run([ZSI, "render", "-q", path, "-o", output], check=True)
    return exr.read(output)


def expect_near(seen, wanted, what, tolerance=2e-3):
    """The same samples: only rays that graze an edge may differ, by rounding."""
    assert seen.shape == wanted.shape, f"{what}: {seen.shape} and {wanted.shape}"
    apart = np.abs(seen - wanted) > tolerance * (1.0 + np.abs(wanted))
    assert apart.mean() < 0.005, f"{what}: {apart.mean():.2%} of the values differ"


def test_a_scene_is_that_of_the_command():
    """Modifier, instances, two classes, nodes, lights, world, lens, shift, border, a frame."""
    scene = empty()
    red = material("red", "corvid_Mtl_Ward", u_diffuseColor=(0.7, 0.1, 0.1), u_reflectivity=0.1)
    gold = material("gold", "corvid_Mtl_Metal", u_reflectColor=(1.0, 0.8, 0.3), u_roughValue=0.3)
    glossy = nodes("glossy", Base_Color=(0.1, 0.3, 0.6, 1), Roughness=0.5, Specular=0.5)
    floor = primitive("plane", "floor", glossy, size=12)
    # A box whose lids are gold, doubled by a modifier.
    box = primitive("cube", "box", red, size=1, location=(-1, 0, 0.5))
    box.data.materials.append(gold)
    for face in box.data.polygons:
        face.material_index = int(abs(face.normal.z) > 0.5)
    array = box.modifiers.new("twice", "ARRAY")
    array.use_relative_offset, array.use_constant_offset = False, True
    array.constant_offset_displace = (2, 0, 0)
    # A collection of one tile, shown twice, from another place than its own.
    tile = primitive("plane", "tile", gold, size=0.6, location=(50, 0, 0))
    for collection in tile.users_collection:
        collection.objects.unlink(tile)
    tiles = bpy.data.collections.new("tiles")
    tiles.objects.link(tile)
    tiles.instance_offset = (50, 0, 0)
    for x in (-0.5, 0.5):
        holder = add(f"holder{x}", None, (x, -1.5, 0.3), (0.5, 0, 0))
        holder.instance_type, holder.instance_collection = "COLLECTION", tiles
    # The box turns: a quarter turn in frame 10.
    box.keyframe_insert("rotation_euler", frame=1)
    box.rotation_euler.z = math.pi / 2
    box.keyframe_insert("rotation_euler", frame=10)
    scene.frame_set(10)
    lamp = bpy.data.lights.new("lamp", "POINT")
    lamp.energy, lamp.shadow_soft_size = 300, 0.2
    add("lamp", lamp, (2, -3, 4))
    sun = bpy.data.lights.new("sun", "SUN")
    sun.energy, sun.angle = 2.0, 0.02
    add("sun", sun, (0, 0, 9), (0.6, 0, 0))
    scene.world = bpy.data.worlds.new("world")
    scene.world.use_nodes = True
    scene.world.node_tree.nodes["Background"].inputs["Color"].default_value = (0.2, 0.3, 0.4, 1)
    scene.world.node_tree.nodes["Background"].inputs["Strength"].default_value = 0.5
    eye = camera((0, -7, 2.5), (math.radians(75), 0, 0), lens=40, shift_x=-0.125, shift_y=-0.0625)
    eye.data.dof.use_dof, eye.data.dof.focus_distance, eye.data.dof.aperture_fstop = True, 6.5, 0.5
    scene.render.use_border, scene.render.use_crop_to_border = True, True
    scene.render.border_min_x, scene.render.border_max_x = 0.0, 0.75
    scene.render.border_min_y, scene.render.border_max_y = 0.0, 0.75
    layer = bpy.context.view_layer
    layer.use_pass_normal = layer.use_pass_z = layer.use_pass_cryptomatte_object = True
    layer.zsi.direct = True
    seen = rendered("scene.exr")

    forward = [0, math.sin(math.radians(75)), -math.cos(math.radians(75))]
    # 0.125 and 0.0625 of the longer side: the film grows by twice that, to the other side.
    shift = (24, 12)
    tall = HEIGHT + shift[1]
    half = 36 / 40 / 2 * (HEIGHT / WIDTH) * (tall / HEIGHT)
    white = os.path.join(FOLDER, "white.exr")
    from zsi_render import exr

    exr.write(white, np.ones((1, 1, 4), np.float32))
    ward = {
        "class": "corvid_Mtl_Ward",
        "parameters": {"u_diffuseColor": [0.7, 0.1, 0.1], "u_reflectivity": 0.1},
    }
    metal = {
        "class": "corvid_Mtl_Metal",
        "parameters": {"u_reflectColor": [1, 0.8, 0.3], "u_roughValue": 0.3},
    }
    lids = os.path.join(FOLDER, "lids.obj")
    with open(lids, "w", encoding="utf-8") as file:
        for z, order in ((-0.5, "1 3 4 2"), (0.5, "5 6 8 7")):
            for y in (-0.5, 0.5):
                for x in (-0.5, 0.5):
                    file.write(f"v {x} {y} {z}\n")
        file.write("f 1 3 4 2\nf 5 6 8 7\n")
    sides = os.path.join(FOLDER, "sides.obj")
    with open(lids, encoding="utf-8") as source, open(sides, "w", encoding="utf-8") as file:
        file.write("".join(line for line in source if line.startswith("v")))
        file.write("f 1 2 6 5\nf 2 4 8 6\nf 4 3 7 8\nf 3 1 5 7\n")
    wanted = alone(
        "scene",
        {
            "camera": {
                "position": [0, -7, 2.5],
                "target": [0, -7 + 6.5 * forward[1], 2.5 + 6.5 * forward[2]],
                "fov": math.degrees(2 * math.atan(half)),
                "lensRadius": 0.04,
            },
            "film": {
                "width": WIDTH + shift[0],
                "height": tall,
                "crop": [0, 12 + 16, 72, 12 + HEIGHT],
            },
            "meshes": {
                "floor": {"plane": {"size": 12}},
                "lids": {"file": lids, "normals": "flat"},
                "sides": {"file": sides, "normals": "flat"},
                "tile": {"plane": {"size": 0.6}},
            },
            "materials": {
                "red": ward,
                "gold": metal,
                "glossy": {
                    "class": "corvid_Mtl_MetallicPaint",
                    "parameters": {
                        "u_baseColor": [0.1, 0.3, 0.6],
                        "u_baseRoughValue": 0,
                        "u_flakeDensity": 0,
                        "u_coatReflectivity": 0.04,
                        "u_coatRoughValue": 0.25,
                    },
                },
            },
            "instances": {
                "floor": {"mesh": "floor", "material": "glossy"},
                **{
                    f"{part} {y}": {
                        "mesh": part,
                        "material": look,
                        # Turned, the copy of the modifier lies along y.
                        "transform": {"rotate": [0, 0, 1, 90], "translate": [-1, y, 0.5]},
                    }
                    for part, look in (("lids", "gold"), ("sides", "red"))
                    for y in (0, 2)
                },
                **{
                    f"tile {x}": {
                        "mesh": "tile",
                        "material": "gold",
                        "transform": {
                            "rotate": [1, 0, 0, math.degrees(0.5)],
                            "translate": [x, -1.5, 0.3],
                        },
                    }
                    for x in (-0.5, 0.5)
                },
            },
            "lights": {
                "lamp": {
                    "kind": "point",
                    "position": [2, -3, 4],
                    "color": [300 / (4 * math.pi**2)] * 3,
                    "radius": 0.2,
                },
                "sun": {
                    "kind": "sun",
                    "direction": [0, -math.sin(0.6), math.cos(0.6)],
                    "color": [2 / math.pi] * 3,
                    "angle": math.degrees(0.02),
                },
            },
            "environment": {"file": white, "intensity": [0.1, 0.15, 0.2]},
        },
        ("normal", "depth", "position", "direct"),
    )
    # The order of triangles is another one, so that only means over samples agree.
    assert beauty(seen).shape == (48, 72, 4)
    expect_near(stack(seen, "Normal", "XYZ"), stack(wanted, "normal", "XYZ"), "normal", 0.02)
    expect_near(beauty(seen), wanted.stack("RGBA"), "beauty", 0.02)
    expect_near(stack(seen, "Direct", "RGB"), stack(wanted, "direct", "RGB"), "direct", 0.02)
    # Blender's depth is that along the axis, far where nothing is.
    place = stack(wanted, "position", "XYZ")
    along = np.where(wanted.channels["depth.Z"] > 0, (place - [0, -7, 2.5]) @ forward, 1e10)
    expect_near(seen.channels["Depth.Z"], along, "depth", 0.02)
    names = next(t for k, t in seen.texts.items() if k.endswith("/manifest"))
    assert {"floor", "box/mesh", "tile", "tile #2"} == set(json.loads(names)), names


def picture_of(name, pixels, packed=False):
    """An image datablock of RGB values, rows from the bottom as Blender has them."""
    pixels = np.asarray(pixels, np.float32)
    height, width, _ = pixels.shape
    result = bpy.data.images.new(name, width, height, float_buffer=True)
    rgba = np.concatenate([pixels, np.ones((height, width, 1), np.float32)], axis=2)
    result.pixels.foreach_set(rgba.ravel())
    if packed:
        result.pack()
    return result


def by_cycles_too(name, samples=64):
    """What both engines show."""
    scene = bpy.context.scene
    scene.zsi.samples = samples
    ours = beauty(rendered(f"{name}.exr"))
    scene.render.engine = "CYCLES"
    scene.cycles.samples, scene.cycles.use_denoising = samples, False
    theirs = beauty(rendered(f"{name}.cycles.exr"))
    scene.render.engine = "ZSI"
    return ours[:, :, :3], theirs[:, :, :3]


def coarse(pixels):
    """Means of blocks of 8 x 8 pixels."""
    height, width, channels = pixels.shape
    return pixels.reshape(height // 8, 8, width // 8, 8, channels).mean(axis=(1, 3))


def matt(name):
    """A diffuse material and its colour socket."""
    result = bpy.data.materials.new(name)
    result.use_nodes = True
    tree = result.node_tree
    tree.nodes.remove(tree.nodes["Principled BSDF"])
    shader = tree.nodes.new("ShaderNodeBsdfDiffuse")
    tree.links.new(shader.outputs[0], tree.nodes["Material Output"].inputs[0])
    return result, shader.inputs["Color"]


def test_lights_are_as_strong_as_in_cycles():
    scene = empty()
    scene.render.resolution_x = scene.render.resolution_y = 32
    primitive("plane", "floor", matt("matt")[0], size=30)
    camera((0, 0, 4))
    cases = {
        "POINT": {"energy": 500, "color": (1, 0.5, 0.25)},
        "SUN": {"energy": 3},
        "SPOT": {"energy": 500, "spot_size": 0.7, "spot_blend": 0.3},
        "AREA": {"energy": 200, "shape": "RECTANGLE", "size": 3, "size_y": 0.5},
        "AREA ": {"energy": 200, "shape": "DISK", "size": 2},
    }
    for kind, values in cases.items():
        lamp = bpy.data.lights.new(kind, kind.strip())
        for key, value in values.items():
            setattr(lamp, key, value)
        placed = add(kind, lamp, (0, 0, 6), (0.3, 0, 0.2))
        placed.scale = (1, 2, 1)
        ours, theirs = by_cycles_too("light")
        ratio = ours.sum(axis=(0, 1)) / theirs.sum(axis=(0, 1))
        # Cycles dims the rim of a spot by the cosine of the angle.
        allowed = 0.05 if kind == "SPOT" else 0.01
        assert np.all(np.abs(ratio - 1) < allowed), f"{kind}: {ratio} of Cycles"
        bpy.data.objects.remove(placed)


def test_pictures_lie_as_in_cycles():
    """World and textures: handedness, rotation, uv, mapping, packed pixels, an orthographic view."""
    scene = empty()
    random = np.random.default_rng(1)
    sky = picture_of("sky", random.random((4, 8, 3)).repeat(16, 0).repeat(16, 1), packed=True)
    scene.world = bpy.data.worlds.new("world")
    scene.world.use_nodes = True
    tree = scene.world.node_tree
    around = tree.nodes.new("ShaderNodeTexEnvironment")
    mapping, place = tree.nodes.new("ShaderNodeMapping"), tree.nodes.new("ShaderNodeTexCoord")
    around.image = sky
    mapping.inputs["Rotation"].default_value = (0.2, 0.3, 0.7)
    tree.links.new(place.outputs["Generated"], mapping.inputs["Vector"])
    tree.links.new(mapping.outputs["Vector"], around.inputs["Vector"])
    tree.links.new(around.outputs["Color"], tree.nodes["Background"].inputs["Color"])
    look, color = matt("textured")
    tree = look.node_tree
    texture, mapping = tree.nodes.new("ShaderNodeTexImage"), tree.nodes.new("ShaderNodeMapping")
    texture.image = picture_of("tiles", random.random((4, 4, 3)).repeat(8, 0).repeat(8, 1))
    place = tree.nodes.new("ShaderNodeTexCoord")
    mapping.inputs["Scale"].default_value = (1.5, 0.7, 1)
    mapping.inputs["Rotation"].default_value = (0, 0, 0.4)
    mapping.inputs["Location"].default_value = (0.1, 0.2, 0)
    tree.links.new(place.outputs["UV"], mapping.inputs["Vector"])
    tree.links.new(mapping.outputs["Vector"], texture.inputs["Vector"])
    tree.links.new(texture.outputs["Color"], color)
    primitive("plane", "card", look, size=2, location=(0, 0, 0), rotation=(1.2, 0, 0))
    eye = camera((0, -5, 0.5), (math.radians(85), 0, 0.1))
    for kind, turn, fit in (("PERSP", 0.1, "HORIZONTAL"), ("ORTHO", -0.1, "VERTICAL")):
        eye.data.type, eye.rotation_euler.z, eye.data.sensor_fit = kind, turn, fit
        eye.data.shift_x, eye.data.shift_y = 0.05, -0.08
        ours, theirs = map(coarse, by_cycles_too(kind, 128))
        apart = np.abs(ours - theirs)
        assert apart.mean() < 0.01 and apart.max() < 0.08, f"{kind}: {apart.mean()}, {apart.max()}"


def exported():
    """The scene file of the present scene."""
    from zsi_render import camera as cameras, properties, scene as scenes
    from mathutils import Matrix

    depsgraph = bpy.context.evaluated_depsgraph_get()
    exporter = scenes.Exporter(FOLDER, properties.classes)
    view = cameras.view(Matrix(), Matrix.Identity(4), 8, 8)
    with open(exporter.write(depsgraph, view, {}), encoding="utf-8") as file:
        return json.load(file), exporter.notes


def test_nodes_become_the_nearest_class():
    empty()
    cases = {
        "plastic": (
            {"Roughness": 0.5, "Specular": 0.5},
            "corvid_Mtl_MetallicPaint",
            {"u_coatRoughValue": 0.25, "u_coatReflectivity": 0.04},
        ),
        "steel": ({"Roughness": 0.6, "Metallic": 1.0}, "corvid_Mtl_Metal", {"u_roughValue": 0.36}),
        "glass": (
            {"Roughness": 0.0, "Transmission": 1.0, "IOR": 1.5},
            "corvid_Mtl_Dielectric",
            {"u_ior": 1.5, "u_reflectance": 0.04},
        ),
        "leaf": ({"Alpha": 0.25}, "corvid_Mtl_MetallicPaint", {"maskingColor": [0.75] * 3}),
        "lamp": (
            {"Emission": (1, 0.5, 0, 1), "Emission_Strength": 2.0},
            "corvid_Mtl_Ward",
            {"u_additionalColor": [2, 1, 0]},
        ),
    }
    for number, (name, (inputs, _, _)) in enumerate(cases.items()):
        primitive("plane", name, nodes(name, **inputs), location=(3 * number, 0, 0))
    rough = nodes("rough", Metallic=1.0)
    texture = rough.node_tree.nodes.new("ShaderNodeTexImage")
    texture.image = picture_of("roughness", np.full((2, 2, 3), 0.5))
    shader = rough.node_tree.nodes["Principled BSDF"]
    rough.node_tree.links.new(texture.outputs["Color"], shader.inputs["Roughness"])
    noise = rough.node_tree.nodes.new("ShaderNodeTexNoise")
    rough.node_tree.links.new(noise.outputs["Color"], shader.inputs["Base Color"])
    primitive("plane", "rough", rough)
    late = bpy.data.materials["steel"]
    late.zsi.shader = "corvid_Mtl_Ward"
    for value in (0.5, 0.75):  # also after everything has been evaluated
        late.zsi.corvid_Mtl_Ward.u_roughValue = value
        assert exported()[0]["materials"]["steel"]["parameters"]["u_roughValue"] == value
    late.zsi.shader = "NODES"
    scene, notes = exported()
    for name, (_, wanted, parameters) in cases.items():
        found = scene["materials"][name]
        assert found["class"] == wanted, f"{name}: {found}"
        for key, value in parameters.items():
            assert np.allclose(found["parameters"][key], value, atol=1e-5), f"{name}: {key} {found}"
    from zsi_render import exr

    squared = exr.read(scene["materials"]["rough"]["parameters"]["u_roughMap"]["texture"])
    assert np.all(squared.channels["R"] == 0.25), "roughness is squared once"
    assert any('"Noise Texture"' in n and '"rough"' in n for n in notes), notes


def test_every_class_has_its_panel():
    """Parameters that are set, and no others, come back as values that the command takes."""
    scene = empty()
    from zsi_render import properties

    def changed(values, name):
        rna = values.bl_rna.properties[name]
        if rna.type == "POINTER":
            return None
        if rna.type == "BOOLEAN":
            return not getattr(values, name)
        if rna.is_array:
            return [0.25] * rna.array_length
        return 1

    camera((0, 0, 6))
    scene.world = bpy.data.worlds.new("world")
    lamp = bpy.data.lights.new("lamp", "POINT")
    add("lamp", lamp, (0, 0, 3))
    assert len(properties.classes) == 27
    grid = bpy.data.images.new("grid", 8, 8)
    for number, shader in enumerate(properties.classes):
        if shader.kind == "material":
            owner = bpy.data.materials.new(shader.name)
            primitive("plane", shader.name, owner, location=(number % 5 - 2, number // 5 - 2, 0))
        else:
            owner = {"environment": scene.world, "light": lamp}[shader.kind]
        owner.zsi.shader = shader.name
        values = getattr(owner.zsi, shader.name)
        for parameter in shader.parameters:
            if parameter.is_texture:
                setattr(values, parameter.id, grid)
            elif parameter.type not in ("Mat3f", "Mat4f"):
                setattr(values, parameter.id, changed(values, parameter.id))
        written = shader.written(values, lambda *_: "picture")
        assert set(written) == {p.name for p in shader.parameters}
        assert sum(map(len, shader.shown().values())) >= len(shader.parameters) - 2
    scene.zsi.samples = 1
    rendered("classes.exr")
    metal = next(c for c in properties.classes if c.name == "corvid_Mtl_Metal")
    fresh = bpy.data.materials.new("fresh").zsi.corvid_Mtl_Metal
    kinds = {p.type for p in metal.parameters if p.name in metal.written(fresh, None)}
    assert kinds == {"Mat3f", "Mat4f"}, "what nobody has set keeps the class's own default"
    named = {p.name: p for p in metal.parameters}
    assert not metal.is_read(named["u_reflectTransform"], fresh)
    fresh.u_reflectMapEnable, fresh.u_reflectMap = True, grid
    assert metal.is_read(named["u_reflectTransform"], fresh)


def fails(*words):
    """Renders and expects an error with these words."""
    try:
        bpy.ops.render.render()
    except RuntimeError as error:
        assert all(word in str(error) for word in words), error
    else:
        raise AssertionError(f"no error of {words}")


def test_errors_reach_the_user():
    scene = empty()
    fails("no camera")
    camera((0, 0, 6))
    preferences().program = "/nowhere/zsi"
    fails("/nowhere/zsi", "preferences")
    preferences().program = ZSI
    broken = bpy.data.images.new("broken", 4, 4)
    broken.source, broken.filepath = "FILE", os.path.join(FOLDER, "broken.png")
    glass = material("glass", "corvid_Mtl_Metal", u_reflectMap=broken, u_reflectMapEnable=True)
    primitive("plane", "pane", glass)
    fails("broken.png")
    scene.zsi.samples = 1
    bpy.data.objects.remove(bpy.data.objects["pane"])
    bpy.ops.render.render()


def test_cancelling_takes_less_than_a_second():
    scene = empty()
    camera((0, 0, 6))
    primitive("monkey", "head", material("head", "corvid_Mtl_Metal"))
    scene.zsi.samples = 1 << 20
    stopped = []

    def stop():
        stopped.append(time.monotonic())
        os.kill(os.getpid(), signal.SIGINT)  # as Esc does in a window

    threading.Timer(2.0, stop).start()
    bpy.ops.render.render()
    took = time.monotonic() - stopped[0]
    assert took < 1.0, f"{took} s"
    left = subprocess.run(["pgrep", "-P", str(os.getpid()), "zsi"], capture_output=True)
    assert not left.stdout, "the program runs on"


def main():
    install()
    chosen = os.environ.get("TESTS", "").split()
    every = [(name, test) for name, test in globals().items() if name.startswith("test_")]
    tests = [(name, test) for name, test in every if not chosen or name in chosen]
    failed = 0
    for name, test in tests:
        begin = time.monotonic()
        try:
            test()
            verdict = "passed"
        except Exception:
            traceback.print_exc()
            verdict, failed = "FAILED", failed + 1
        print(f"{name}: {verdict}, {time.monotonic() - begin:.1f} s", flush=True)
    print(f"{len(tests) - failed} of {len(tests)} tests passed")
    sys.stdout.flush()
    os._exit(1 if failed else 0)  # Blender's own status tells nothing of a script


main()
