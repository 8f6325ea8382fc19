# SPDX-License-Identifier: Apache-2.0
"""The Python package, as users call it. ZSI_COMMAND: the command, whose messages are compared."""

import json
import os
import pathlib
import signal
import subprocess
import tempfile
import threading
import time
import unittest

import numpy as np
import zsi

Z = [0.0, 0.0, 1.0]


def directions(n, seed=1):
    """n unit vectors above the surface."""
    d = np.random.default_rng(seed).normal(size=(n, 3))
    d[:, 2] = abs(d[:, 2]) + 0.05
    return (d / np.linalg.norm(d, axis=1, keepdims=True)).astype(np.float32)


def matte(reflectance=0.5):
    return zsi.material("corvid_Mtl_Ward", u_diffuseColor=[reflectance] * 3,
                        u_brdf00Reflectivity=0, u_brdf90Reflectivity=0)


def ball(**film):
    """A matte ball on a floor under a lamp, made without a file."""
    scene = zsi.Scene()
    scene.film.update(width=24, height=16, **film)
    scene.camera.update(position=[0, -5, 2], target=[0, 0, 0.5])
    scene.settings.samples = 4
    scene.add_mesh("ball", sphere={"radius": 1, "segments": 24})
    scene.add_mesh("floor", plane={"size": 8})
    scene.add_material("paint", matte(0.6))
    scene.add_material("ground", "corvid_Mtl_Ward", u_diffuseColor=[0.3, 0.3, 0.3],
                       u_additionalColor=[0, 0, 0])
    scene.add_instance("ball", "ball", "paint", {"translate": [0, 0, 1]})
    scene.add_instance("floor", "floor", "ground")
    scene.add_light("lamp", "point", position=[2, -3, 4], color=[20, 20, 20])
    return scene


def same(a, b):
    return all(np.array_equal(a[layer], b[layer]) for layer in a)


class Measuring(unittest.TestCase):
    def test_eval_is_the_scattering_value_in_any_form_of_array(self):
        wi, wo = directions(1000, 1), directions(1000, 2)
        value = matte().eval(wi, wo)
        np.testing.assert_allclose(value, 0.5 / np.pi, rtol=2e-6)
        np.testing.assert_allclose(matte().eval(wi, wo, cosine=True),
                                   value * wo[:, 2:], rtol=2e-6)
        m = zsi.material("corvid_Mtl_Ward", u_roughValue=0.3, u_anisotropyValue=2)
        value = m.eval(wi, wo)
        self.assertGreater(np.ptp(value), 0.1)
        np.testing.assert_array_equal(m.eval(wi, wo, threads=1), value)
        np.testing.assert_array_equal(m.eval(wi[::-1], wo[::-1].astype(float)), value[::-1])
        np.testing.assert_array_equal(m.eval(wi[7], wo), m.eval(np.tile(wi[7], (1000, 1)), wo))
        self.assertEqual(m.eval(wi[0], wo[0]).tolist(), value[0].tolist())
        self.assertEqual(m.eval(-wi, wo).max(), 0)  # opaque
        out = np.empty((1000, 3), np.float32)
        self.assertIs(m.eval(wi, wo, out=out), out)
        np.testing.assert_array_equal(out, value)
        for wrong in (out[:9], out.astype(float), np.asfortranarray(out)):
            with self.assertRaisesRegex(zsi.Error, "^out: expected"):
                m.eval(wi, wo, out=wrong)

    def test_draws_agree_with_values_albedo_and_histogram(self):
        m = zsi.material("corvid_Mtl_Ward", u_diffuseColor=[0.4, 0.2, 0.1], u_roughValue=0.3,
                         u_brdfCurvePower=5)
        wi = directions(3)
        s = m.sample(wi, 512, seed=5)
        self.assertEqual(s.direction.shape, (3, 512, 3))
        taken = s.type == 2
        self.assertGreater(taken.mean(), 0.8)
        for i in range(3):
            cosine_value = m.eval(wi[i], s.direction[i], cosine=True)
            np.testing.assert_allclose(cosine_value[taken[i]] / s.density[i][taken[i], None],
                                       s.weight[i][taken[i]], rtol=1e-4)
        theta = np.arccos(wi[0, 2])
        turned = [np.sin(theta), 0, np.cos(theta)]
        np.testing.assert_allclose(m.albedo([[theta]], 1 << 14)[0, 0],
                                   m.sample(turned, 1 << 14, seed=9).weight.mean(0), rtol=0.02)
        self.assertFalse(np.array_equal(s.direction, m.sample(wi, 512, seed=6).direction))

        n, rows, columns = 1 << 18, 8, 4
        h = matte().pdf_histogram(turned, n, rows=rows, columns=columns)
        # A cosine distribution: 1 - z^2 of it lies below z.
        z = 1 - 2 * np.arange(rows + 1) / rows
        share = np.diff(-np.clip(z, 0, 1) ** 2) / columns
        expected = np.repeat(share[:, None], columns, 1) * rows * columns / (4 * np.pi)
        np.testing.assert_allclose(h.density, expected, atol=4 * np.sqrt(expected.max() / n * 10))
        np.testing.assert_allclose(h.coverage[:rows // 2 - 1], 1, atol=0.03)
        self.assertEqual(h.coverage[rows // 2:].max(), 0)

    def test_parameters_are_documented_attributes(self):
        m = zsi.material("corvid_Mtl_Dielectric")
        m.u_ior = 1.25
        self.assertEqual(m.u_ior, 1.25)
        self.assertIn("index", type(m).u_ior.__doc__)
        for name in zsi.classes():
            kind = zsi.shader_class(name)
            self.assertFalse(set(dir(zsi.Material)) & set(vars(kind)) - {
                "__doc__", "__module__", "class_name", "__dict__", "__weakref__"})
        picture = pathlib.Path(__file__).parents[2] / "assets"
        with self.assertRaisesRegex(zsi.Error, "did you mean.*u_ior"):
            m.u_iro = 1
        with self.assertRaisesRegex(zsi.Error, "u_ior: expected a number, got \"x\""):
            zsi.material("corvid_Mtl_Dielectric", u_ior="x")
        with self.assertRaisesRegex(ValueError, "did you mean corvid_Mtl_Ward"):
            zsi.material("corvid_Mtl_Wad")
        with self.assertRaisesRegex(zsi.Error, "transfer"):
            zsi.material("corvid_Mtl_Unlit").eval(Z, Z)
        for wrong in ([[0, 1]], directions(3)):
            with self.assertRaisesRegex(zsi.Error, "^wo: expected"):
                matte().eval(directions(2), wrong)
        ward = zsi.material("corvid_Mtl_Ward")
        texture = next(p for p in picture.rglob("*.jpg"))
        ward.u_diffuseMap = texture
        self.assertTrue(ward.u_diffuseMap)
        ward.u_diffuseMap = None
        self.assertFalse(ward.u_diffuseMap)


class Scenes(unittest.TestCase):
    def test_a_session_after_edits_is_a_new_rendering(self):
        scene = ball()
        session = zsi.Session(scene)
        picture = session.render()
        self.assertTrue(same(picture, zsi.render(scene, threads=1)))

        def edit(path, value):
            return lambda: scene.set(path, value)

        turn = {"scale": 0.5, "translate": [1, 0, 1]}
        for change in (edit("materials.paint.parameters.u_diffuseColor", [1, 0, 0]),
                       edit("camera.fov", 30), edit("instances.ball.transform", turn),
                       edit("lights.lamp.position", [-2, -3, 4]),
                       edit("instances.ball.material", "ground"),
                       lambda: setattr(scene, "environment", {
                           "class": "corvid_Env_Default",
                           "parameters": {"backgroundColor": [1, 2, 3]}}),
                       edit("environment.parameters.backgroundColor", [0, 1, 0]),
                       lambda: scene.add_light("sun", "sun", direction=[0, -1, 1]),
                       lambda: scene.add_instance("second", "ball", "paint",
                                                  {"translate": [-2, 0, 1]}),
                       edit("film.layers", ["normal", "depth"])):
            change()
            before, picture = picture, session.render()
            self.assertFalse(same(before, picture) and set(before) == set(picture))
            self.assertTrue(same(picture, zsi.render(scene)))
        self.assertEqual(picture["depth"].shape, (16, 24, 1))
        self.assertEqual(scene.instances["floor"].material, "ground")

    def test_a_mesh_of_arrays_is_that_of_the_shape(self):
        pictures = []
        for arrays in (False, True):
            scene = ball()
            if arrays:
                corners = np.array([[-1, -1, 0], [1, -1, 0], [1, 1, 0], [-1, 1, 0]])
                scene.add_mesh("card", corners, [[0, 1, 2], [0, 2, 3]],
                               normals=[Z] * 4, uv=(corners[:, :2] + 1) / 2)
            else:
                scene.add_mesh("card", plane={"size": 2})
            scene.add_instance("card", "card", "paint", {"translate": [0, 0, 2.5]})
            pictures.append(zsi.render(scene))
        np.testing.assert_allclose(*(p["beauty"] for p in pictures), atol=1e-5)
        self.assertFalse(same(pictures[0], zsi.render(ball())))
        for positions, triangles, normals, message in (
                ([[0, 0]], [[0, 1, 2]], None, r"positions: expected an array of shape \(N, 3\)"),
                ([[0, 0, 0]], [[0, 1, 2]], None, r"triangles\[0\]: there is no position 1"),
                (np.eye(3), [[0, 1, 2]], [Z], r"normals: expected an array of shape \(3, 3\)"),
                (np.zeros((3, 3)), [[0, 1, 2]], None, "no triangles that can be seen")):
            with self.assertRaisesRegex(zsi.Error, "meshes.x.*" + message):
                zsi.Scene().add_mesh("x", positions, triangles, normals=normals)
        with tempfile.TemporaryDirectory() as folder:
            file = pathlib.Path(folder) / "x.obj"
            file.write_bytes(b"v 0 0 \xb1\n")  # no UTF-8
            with self.assertRaisesRegex(zsi.Error, r'x.obj:1: expected a number, found "\\xb1"'):
                zsi.Scene().add_mesh("x", file=str(file))

    def test_values_are_checked_as_in_a_file(self):
        scene = ball()
        for path, value, message in (
                ("camera.position", [0, 0, 0.5], "the target has no direction"),
                ("film.width", 0, "film.width: expected"),
                ("settings.integrator", "pat", "settings.integrator: expected"),
                ("lights.lamp.radius", -1, "lights.lamp.radius: expected"),
                ("instances.ball.transform", np.zeros((4, 4)), "last column"),
                ("instances.ball.material", "pant", "did you mean paint"),
                ("materials.pant.parameters.u_x", 1, "no material pant"),
                ("lights.lamp.colour", 1, "unknown"),
                ("film.crop", [0, 0, 99, 9], "film.crop"), ("nothing", 1, "no such value")):
            with self.subTest(path), self.assertRaisesRegex(zsi.Error, message):
                scene.set(path, value)
        self.assertTrue(same(zsi.render(scene), zsi.render(ball())))
        # Whatever a file can say of them is here.
        schema = json.loads(subprocess.check_output([os.environ["ZSI_COMMAND"], "schema"]))
        for section in ("camera", "film", "settings"):
            self.assertEqual(set(schema["properties"][section]["properties"]),
                             set(getattr(scene, section)._get()))

    def test_files_are_those_of_the_command(self):
        with tempfile.TemporaryDirectory() as folder:
            file = os.path.join(folder, "scene.json")
            pathlib.Path(file).write_text(
                '{"film": {"width": 8, "height": 6, "exposure": 1}, "settings": {"samples": 2},'
                ' "environment": {"class": "corvid_Env_Default",'
                ' "parameters": {"backgroundColor": [0.1, 0.2, 0.3]}}}')
            command = [os.environ["ZSI_COMMAND"], "render", file, "-q"]
            for extension in ("exr", "png"):
                mine, its = (os.path.join(folder, f"{who}.{extension}") for who in ("me", "it"))
                path = "environment.parameters.backgroundColor"
                subprocess.run([*command, "-o", its, "--set", path + "=[0.3,0.2,0.1]"], check=True)
                scene = zsi.load(file, set={path: np.array([0.3, 0.2, 0.1])})
                zsi.write(mine, zsi.render(scene))
                self.assertEqual(pathlib.Path(mine).read_bytes(), pathlib.Path(its).read_bytes())
            its = subprocess.run([*command, "-o", "x.png", "--set", "camera.fov=-1"],
                                 capture_output=True, text=True, cwd=folder)
            with self.assertRaises(zsi.Error) as mine:
                zsi.load(file, set={"camera.fov": -1})
            self.assertEqual(its.stderr, f"zsi: {mine.exception}\n")

    def test_pictures_are_arrays_that_can_be_written(self):
        picture = zsi.render(ball(crop=[4, 2, 20, 12]))
        self.assertEqual((picture.window, picture.frame), ((4, 2, 20, 12), (24, 16)))
        self.assertEqual(picture["beauty"].shape, (10, 16, 4))
        with tempfile.TemporaryDirectory() as folder:
            from PIL import Image

            picture["beauty"][...] = [0.5, 0.0, 0.0, 1.0]
            for given, expected in ((picture, (188, 0, 0)), (np.ones((3, 5)) * 0.5, (188,) * 3)):
                file = os.path.join(folder, "picture.png")
                zsi.write(file, given, view="plain")
                self.assertEqual(Image.open(file).getpixel((2, 1))[:3], expected)
            with self.assertRaisesRegex(zsi.Error, "expected an array"):
                zsi.write(file, np.zeros((3, 5, 7)))

    def test_a_denoised_picture_is_nearer_to_the_truth(self):
        scene = ball(layers=["halves"])
        scene.film.update(width=96, height=64)
        noisy, truth = zsi.render(scene, samples=8), zsi.render(scene, samples=512)["beauty"]
        with tempfile.TemporaryDirectory() as folder:
            file = os.path.join(folder, "noisy.exr")
            zsi.write(file, noisy)
            read = zsi.read(file)
        self.assertTrue(same(read, noisy))
        clean = zsi.denoise(read)
        self.assertTrue(same(clean, zsi.denoise(noisy, threads=1)))
        error = [np.mean((p["beauty"] - truth) ** 2) for p in (noisy, clean)]
        self.assertLess(error[1], 0.7 * error[0])
        with self.assertRaisesRegex(zsi.Error, "halves"):
            zsi.denoise(zsi.render(ball()))

    def test_rendering_can_be_ended_and_refuses_edits_meanwhile(self):
        scene = ball()
        scene.settings.samples = 1 << 20
        begun = time.monotonic()
        threading.Timer(0.3, os.kill, (os.getpid(), signal.SIGINT)).start()
        with self.assertRaises(KeyboardInterrupt):
            zsi.render(scene)
        self.assertLess(time.monotonic() - begun, 5)
        self.assertLess(zsi.render(scene, seconds=0.3).report["seconds"], 5)
        scene.settings.noise = 0.5
        self.assertEqual(zsi.render(scene, samples=4).report["samples"], 4)
        self.assertLess(zsi.render(scene).report["noise"], 0.5)
        scene.settings.noise = 0

        def edit(done):
            scene.materials["paint"].u_roughValue = 1

        with self.assertRaisesRegex(zsi.Error, "being rendered"):
            zsi.render(scene, on_progress=edit)
        done = []
        self.assertTrue(same(zsi.render(scene, samples=4, on_progress=done.append),
                             zsi.render(ball())))
        self.assertEqual((done, done[-1]), (sorted(done), 1.0))

    def test_a_sweep_is_a_grid_of_the_pictures(self):
        scene = ball()
        colors = "materials.paint.parameters.u_diffuseColor"
        sheet = zsi.sweep(scene, {"camera.fov": [30, 60], colors: [[1, 0, 0], [0, 1, 0], [0, 0, 1]]})
        self.assertEqual(sheet.shape, (2, 3))
        self.assertTrue(same(zsi.render(scene), zsi.render(ball())))  # as it was
        scene.set("camera.fov", 60)
        scene.set(colors, [0, 1, 0])
        self.assertTrue(same(sheet.pictures[4], zsi.render(scene)))
        image = np.asarray(sheet.image())
        self.assertEqual(image.shape, (2 * (16 + 24 + 4) + 4, 3 * (24 + 4) + 4, 3))
        tile = image[48 + 4:48 + 12, 32 + 8:32 + 16]  # the green ball seen from farther off
        self.assertGreater(int(tile[..., 1].max()), int(tile[..., 0].max()) + 20)
        with self.assertRaisesRegex(zsi.Error, "no material pant"):
            zsi.sweep(scene, {"materials.pant.parameters.u_x": [1]})


class Measured(unittest.TestCase):
    def test_tables_are_read_where_they_were_written(self):
        wi, wo = zsi.merl.directions()
        above = (wi[..., 2] > 0) & (wo[..., 2] > 0)
        cells = np.arange(above.size, dtype=float).reshape(above.shape)
        table = np.stack([cells, 2 * cells, 3 * cells], -1)
        chosen = np.flatnonzero(above)[::997]
        a, b = wi.reshape(-1, 3)[chosen], wo.reshape(-1, 3)[chosen]
        turn = np.array([[0.6, 0.8, 0], [-0.8, 0.6, 0], [0, 0, 1]])  # isotropic, reciprocal
        for x, y in ((a, b), (a @ turn, b @ turn), (b, a)):
            np.testing.assert_array_equal(zsi.merl.look_up(table, x, y)[:, 1],
                                          2 * cells.ravel()[chosen])
        with tempfile.TemporaryDirectory() as folder:
            file = os.path.join(folder, "matte.binary")
            zsi.merl.write(file, table)
            np.testing.assert_allclose(zsi.merl.read(file), table, rtol=1e-12)
            # Red comes first, in units of 1/1500.
            self.assertEqual(np.fromfile(file, "<f8", 2, offset=12)[1], 1500)
            pathlib.Path(file).write_bytes(b"\0" * 100)
            with self.assertRaisesRegex(zsi.Error, "matte.binary: expected a MERL table"):
                zsi.merl.read(file)

    def test_the_command_reads_tables_as_the_package_writes_them(self):
        metal = zsi.material("corvid_Mtl_Metal", u_reflectColor=[1, 0.6, 0.2], u_roughValue=0.3)
        wi, wo = (d.reshape(-1, 3).astype(np.float32) for d in zsi.merl.directions())
        values = np.where((wi[:, 2:] > 0) & (wo[:, 2:] > 0), metal.eval(wi, wo), -1)
        with tempfile.TemporaryDirectory() as folder:
            file = os.path.join(folder, "metal.binary")
            zsi.merl.write(file, values.reshape(*zsi.merl.SHAPE, 3))
            subprocess.run([os.environ["ZSI_COMMAND"], "lab", "corvid_Mtl_Metal", "-q",
                            "u_reflectColor=1,0.6,0.2", "u_roughValue=0.3", "+", "corvid_Mtl_Metal",
                            "--merl", file, "-o", folder], check=True)
            same, other = json.loads(
                pathlib.Path(folder, "lab.json").read_text())["tableError"]["pairs"]
            self.assertLess(same["meanRelative"], 1e-4)
            self.assertGreater(other["meanRelative"], 0.5)


if __name__ == "__main__":
    unittest.main()
