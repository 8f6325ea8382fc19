# SPDX-License-Identifier: Apache-2.0
"""A session of `zsi view` as pages and others meet it. view_test.py ZSI"""
import base64
import io
import json
import pathlib
import signal
import socket
import struct
import subprocess
import sys
import tempfile
import time
import unittest

from PIL import Image

from client import Closed, Page, Server

ZSI = sys.argv.pop(1)
SCENE = {
    "camera": {"position": [0, -6, 2], "target": [0, 0, 0.8], "fov": 30},
    "film": {"width": 72, "height": 48},
    "settings": {"samples": 4, "integrator": "path"},
    "meshes": {"ball": {"sphere": {"radius": 0.9, "segments": 24}}, "floor": {"plane": {"size": 20}}},
    "materials": {
        "paint": {"class": "corvid_Mtl_Ward", "parameters": {"u_diffuseColor": [0.6, 0.2, 0.1], "u_additionalColor": [0, 0, 0]}},
        "ground": {"class": "corvid_Mtl_Ward", "parameters": {"u_diffuseColor": [0.3, 0.3, 0.3], "u_additionalColor": [0, 0, 0]}},
    },
    "instances": {
        "ball": {"mesh": "ball", "material": "paint", "transform": {"translate": [0, 0, 0.9]}},
        "floor": {"mesh": "floor", "material": "ground"},
    },
    "lights": {"key": {"kind": "rectangle", "position": [-3, -3, 5], "target": [0, 0, 0], "size": [2, 2],
                       "emission": [9, 9, 9]}},
    "environment": {"class": "corvid_Env_Default"},
}


def rgb(rgba):
    return bytes(b for i, b in enumerate(rgba) if i % 4 != 3)


class Session(unittest.TestCase):
    def setUp(self):
        self.folder = pathlib.Path(self.enterContext(tempfile.TemporaryDirectory()))
        (self.folder / "scenes").mkdir()
        Image.new("RGB", (8, 4), (200, 100, 50)).save(self.folder / "scenes" / "map.png")
        Image.new("RGB", (8, 4)).save(self.folder / "secret.png")
        self.scene = self.folder / "scenes" / "scene.json"
        self.scene.write_text(json.dumps(SCENE))
        self.server = Server(ZSI, self.scene)
        self.addCleanup(self.server.kill)

    def page(self):
        page = Page(self.server)
        self.addCleanup(page.close)
        self.assertEqual(page.status, 101)
        page.until("scene")
        return page

    def edit(self, page, path, value, **more):
        page.send(type="set", path=path, value=value, **more)
        return page.until("changed")

    def rendered(self, scene):
        """The picture that `zsi render` makes of a file."""
        goal = self.folder / "rendered.png"
        subprocess.run([ZSI, "render", scene, "-o", goal, "--quiet"], check=True)
        return Image.open(goal).convert("RGB").tobytes()

    def test_every_edit_gives_the_picture_of_render(self):
        page = self.page()
        page.finished()
        copy, last = self.scene.with_name("copy.json"), b""
        lamp = {"class": "voPointLight", "position": [2, -2, 3], "parameters": {"attenuationFactors": [20, 2, 0]}}
        for path, value in [
                ("materials.paint.parameters.u_roughValue", 0.4),
                ("materials.paint", {"class": "corvid_Mtl_Dielectric"}),
                ("camera.position", [1, -5, 3]),
                ("instances.ball.transform", {"translate": [0.5, 0, 1]}),
                ("instances.ball.material", "ground"),
                ("lights.key.emission", [3, 6, 9]),
                ("lights.key.position", [3, -1, 4]),
                ("lights.lamp", lamp),
                ("lights.lamp.position", [-2, -2, 3]),
                ("environment", {"file": "map.png", "rotate": 40}),
                ("materials.ground.parameters.u_additionalColor", [0, 0.2, 0]),
                ("meshes.ball.sphere.radius", 0.5),
                ("film.exposure", 1.5),
                ("settings.samples", 6),
                ("film.width", 60),
        ]:
            with self.subTest(path):
                before = page.generation
                page.send(type="set", path=path, value=value)
                same = path in ("film.exposure", "settings.samples")
                page.until("scene" if path in ("meshes.ball.sphere.radius", "lights.lamp") else "changed")
                if path == "settings.samples":
                    page.until("frame", target=value)
                pixels = page.finished(before - same)
                self.assertEqual(page.generation == before, same)
                if path == "film.exposure": # the rows of before may be what has come
                    pixels = Image.open(io.BytesIO(self.server.file("picture.png"))).tobytes()
                else:
                    pixels = rgb(pixels)
                copy.write_bytes(self.server.file("scene.json"))
                self.assertEqual(pixels, self.rendered(copy))
                self.assertNotEqual(pixels, last)
                last = pixels

    def test_undo_and_refusals_leave_what_was(self):
        page, other = self.page(), self.page()
        first = page.finished()
        for step in range(5):
            self.edit(page, "materials.paint.parameters.u_roughValue", 0.1 * step, group="drag")
        told = self.edit(page, "camera.fov", 40, group="zoom")
        self.assertEqual(other.until("changed", revision=told["revision"])["edits"], told["edits"])
        document = self.server.file("scene.json")
        for path, value, why in [
                ("materials.paint.parameters.u_roughValu", 1, "u_roughValue"),
                ("materials.paint.parameters.u_roughValue", "rough", "number"),
                ("materials.paint.class", "corvid_Mtl_Glas", "corvid_Mtl_Glazing"),
                ("instances.ball.mesh", "bal", "ball"),
                ("environment", {"file": "absent.png"}, "absent.png"),
                ("camera.fov", 200, "fov"),
                ("film.view", "neutrl", "neutral"),
                ("film.layers", ["nrmal"], "normal"),
                ("nothing.at.all", 1, "nothing"),
                ("camera.position[7]", 1, "element"),
                ("", 1, "path")]:
            page.send(type="set", path=path, value=value)
            with self.subTest(path), self.assertRaisesRegex(AssertionError, why):
                page.until("changed")
        self.assertEqual(self.server.file("scene.json"), document)
        page.send(type="undo")
        self.assertEqual(page.until("changed")["edits"], [{"path": "camera.fov", "value": 30}])
        before = page.generation
        page.send(type="undo")  # the drag is one step
        told = page.until("changed")
        self.assertIsNone(told["undo"])
        self.assertEqual(page.finished(before), first)
        page.send(type="redo")
        self.assertEqual(page.until("changed")["edits"][0]["value"], 0.4)

    def test_saves_below_its_folder_alone(self):
        page = self.page()
        self.edit(page, "environment", {"file": "map.png"})
        for name in ["../out.json", "/tmp/out.json", "a/../../out.json", "scene.png", ".json"]:
            page.send(type="save", path=name)
            with self.subTest(name), self.assertRaises(AssertionError):
                page.until("saved")
        page.send(type="save", path="saved.json")
        page.until("saved")
        self.assertEqual({f.name for f in self.folder.rglob("*.json")}, {"scene.json", "saved.json"})
        self.assertEqual(self.scene.read_text(), json.dumps(SCENE))
        saved = self.scene.with_name("saved.json")
        self.assertEqual(json.loads(saved.read_text()), json.loads(self.server.file("scene.json")))
        again = Server(ZSI, saved)
        self.addCleanup(again.kill)
        reloaded = Page(again)
        self.addCleanup(reloaded.close)
        self.assertEqual(reloaded.finished(), page.finished())

    def test_a_model_is_edited_and_saved_as_a_scene(self):
        def data(kind, content):
            return f"data:{kind};base64," + base64.b64encode(content).decode()

        (self.folder / "scenes" / "model.gltf").write_text(json.dumps({
            "asset": {"version": "2.0"}, "scenes": [{"nodes": [0]}], "nodes": [{"mesh": 0}],
            "materials": [{"name": "M", "extensions": {"KHR_materials_sheen": {}}, "pbrMetallicRoughness": {
                "metallicFactor": 0, "baseColorTexture": {"index": 0}}}],
            "textures": [{"source": 0}],
            "images": [{"uri": data("image/png", (self.folder / "scenes" / "map.png").read_bytes())}],
            "meshes": [{"primitives": [{"attributes": {"POSITION": 0}, "material": 0}]}],
            "accessors": [{"bufferView": 0, "componentType": 5121, "count": 3, "type": "VEC3"}],
            "bufferViews": [{"buffer": 0, "byteLength": 9}],
            "buffers": [{"byteLength": 9, "uri": data("application/octet-stream", bytes([0, 0, 0, 1, 0, 0, 0, 1, 0]))}]}))
        server = Server(ZSI, self.scene.with_name("model.gltf"))
        self.addCleanup(server.kill)
        shown = Image.open(io.BytesIO(server.file("thumbnail", file="model.gltf", image=0)))
        self.assertEqual((shown.size, shown.convert("RGB").getpixel((0, 0))), ((8, 4), (200, 100, 50)))
        page = Page(server)
        self.addCleanup(page.close)
        self.assertTrue(any("sheen" in warning for warning in page.until("scene")["warnings"]))
        for path, value in [("film.width", 30), ("film.height", 20), ("settings.samples", 2),
                            ("materials.M.parameters.u_coatRoughValue", 0.1)]:
            self.edit(page, path, value)
        page.send(type="save", path="edited.json")
        page.until("saved")
        self.assertEqual(rgb(page.finished()), self.rendered(self.scene.with_name("edited.json")))

    def test_strangers_are_turned_away(self):
        own = f"127.0.0.1:{self.server.port}"
        token = self.server.token
        good = f"/scene.json?token={token}"
        for target, headers, method, status in [
                (good, {}, "GET", 200),
                (good, {"Origin": f"http://{own}"}, "GET", 200),
                (good, {"Host": f"localhost:{self.server.port}"}, "GET", 200),
                ("/scene.json", {}, "GET", 403),
                ("/", {}, "GET", 403),
                (f"/scene.json?token={token[:-1]}", {}, "GET", 403),
                (f"/scene.json?token={'0' * 32}", {}, "GET", 403),
                (f"/scene.json?token={token}0", {}, "GET", 403),
                (good, {"Host": f"evil.example:{self.server.port}"}, "GET", 403),
                (good, {"Host": "127.0.0.1"}, "GET", 403),
                (good, {"Origin": "http://evil.example"}, "GET", 403),
                (good, {"Origin": "null"}, "GET", 403),
                (good, {}, "POST", 405),
                (good, {"X-Long": "x" * 20000}, "GET", 413),
                (f"/absent?token={token}", {}, "GET", 404),
                (f"/class?token={token}&name=Nothing", {}, "GET", 404),
                (f"/lab?token={token}", {}, "GET", 404),
                (f"/lab?token={token}&material=pain", {}, "GET", 404),
                (f"/lab?token={token}&class=/etc/passwd:x", {}, "GET", 404),
                (f"/lab?token={token}&class=corvid_Mtl_Metal&u_rough=1", {}, "GET", 404),
                (f"/session?token={token}", {}, "GET", 426),
                (f"/thumbnail?token={token}&file=map.png", {}, "GET", 200),
                (f"/thumbnail?token={token}&file=../secret.png", {}, "GET", 404),
                (f"/thumbnail?token={token}&file=%2fetc%2fpasswd", {}, "GET", 404)]:
            with self.subTest(target=target, headers=headers, method=method):
                self.assertEqual(self.server.get(target, headers, method)[0], status)
        for key, headers in [("1" * 32, {}), (None, {"Origin": "http://evil.example"}),
                             (None, {"Host": f"evil.example:{self.server.port}"})]:
            stranger = Page(self.server, key, headers)
            self.addCleanup(stranger.close)
            self.assertEqual(stranger.status, 403)
        with socket.create_connection(("127.0.0.1", self.server.port), 10) as connection:
            connection.sendall(b"\x16\x03\x01\x02\x00 what is this\r\n\r\n")
            self.assertTrue(connection.recv(100).startswith(b"HTTP/1.1 400"))

    def test_wrong_messages_hurt_nobody(self):
        page, witness = self.page(), self.page()
        for text in [b"{", b"", b"7", b"[]", b"{}", b'{"type": 5}', b'{"type": "fly"}', b"[" * 100000,
                     b'{"type": "set"}', b'{"type": "set", "path": 5, "value": 1}', b"\xff\xfe",
                     b'{"type": "set", "path": "a.b.c", "value": ' + b"[" * 40 + b"]" * 40 + b"}",
                     b'{"type": "view", "width": 1e30, "height": 50}', b'{"type": "view", "width": -5, "height": 5}',
                     b'{"type": "inspect", "x": 72, "y": 0}', b'{"type": "inspect", "x": 2147483648, "y": 0}',
                     b'{"type": "layer", "name": "nrmal"}', b'{"type": "compare"}',
                     b'{"type": "restore", "slot": "a"}', b'{"type": "keep", "slot": "c"}', b'{"type": "undo"}',
                     b'{"type": "turntable", "frames": 0, "samples": 1}', b'{"type": "class", "name": "x"}']:
            with self.subTest(text[:60]):
                page.send_bytes(text)
                if b"\xff" in text:  # no text at all: the end of the connection
                    with self.assertRaises((Closed, OSError)):
                        page.until("fly")
                    page = self.page()
                    continue
                with self.assertRaises(AssertionError):
                    page.until("fly")
        with self.assertRaises((Closed, OSError)):
            page.send_bytes(b'{"type": "set", "path": "' + b"x" * (2 << 20) + b'", "value": 1}')
            page.until("fly")
        page = self.page()
        page.socket.sendall(struct.pack(">BBQ", 0x81, 0xFF, 1 << 62) + b"abcd")  # announces 4 EiB
        with self.assertRaises((Closed, OSError)):
            page.until("fly")
        self.edit(witness, "camera.fov", 35)

    def test_crowds_and_sleepers_stall_nobody(self):
        page = self.page()
        page.finished()
        idle = [socket.create_connection(("127.0.0.1", self.server.port)) for _ in range(100)]
        self.addCleanup(lambda: [connection.close() for connection in idle])
        pages = [Page(self.server) for _ in range(40)]
        self.addCleanup(lambda: [one.close() for one in pages])
        self.assertEqual([one.status for one in pages], [101] * 31 + [503] * 9)
        # None of these 31 ever reads. One asks for more than it takes, of the largest pictures.
        page.send(type="view", width=1200, height=800)
        page.until("frame", width=1200)
        begin = time.monotonic()
        for step in range(20):
            self.edit(page, "camera.fov", 30 + 0.1 * step, group="zoom")
            time.sleep(0.02)
        self.assertLess(time.monotonic() - begin, 40)  # a stalled one would take until the idle timeout, 60 s
        # A picture is 4 MB, and all of them see the same one.
        self.assertLess(self.server.memory(), 1 << 30)  # half of it is what the address sanitizer keeps
        pages[0].close()
        for _ in range(50):
            if (late := Page(self.server)).status == 101:
                break
            late.close()
            time.sleep(0.05)
        self.addCleanup(late.close)
        self.assertEqual(late.status, 101)  # there is room again

    def test_layers_values_and_comparisons_agree(self):
        page = self.page()
        page.finished()
        page.send(type="pick", x=36, y=20, id=1)
        told = page.until("picked", id=1)
        self.assertEqual((told["material"], told["object"]), ("paint", "ball"))
        ray = [p - q for p, q in zip(told["position"], SCENE["camera"]["position"])]
        self.assertAlmostEqual(sum(v * v for v in ray) ** 0.5, told["distance"], places=4)
        radius = sum((p - q) ** 2 for p, q in zip(told["position"], (0, 0, 0.9))) ** 0.5
        self.assertTrue(0.885 < radius <= 0.9001, radius)  # facets lie up to 1 - cos(7.5 degrees) twice below
        page.send(type="pick", x=36, y=-400, id=2)
        self.assertIsNone(page.until("picked", id=2)["material"])
        before = page.generation
        page.send(type="layer", name="depth")
        page.finished(before)
        page.send(type="inspect", x=36, y=20, id=3)
        told_values = page.until("values", id=3)
        self.assertAlmostEqual(told_values["layers"]["depth"][0], told["distance"], 1)
        shown = Image.open(io.BytesIO(self.server.file("picture.png"))).getpixel((36, 20))
        self.assertEqual(tuple(told_values["shown"]), shown)

        page.send(type="keep", slot="a")
        page.until("kept")
        page.send(type="compare", id=4)
        same = page.until("comparison", id=4)
        self.assertEqual((same["rmse"], same["flip"], same["max"]), (0, 0, 0))
        before = page.generation
        self.edit(page, "lights.key.emission", [1, 1, 1])
        page.finished(before)
        page.send(type="compare", id=5)
        told = page.until("comparison", id=5)
        self.assertGreater(told["rmse"], 0)
        self.assertTrue(0.01 < told["flip"] < 1, told)
        kinds = [page.receive_picture() for _ in range(3)]
        self.assertEqual([kind for kind, _ in kinds], [2, 3, 4])
        self.assertEqual(Image.open(io.BytesIO(kinds[1][1])).tobytes(),
                         Image.open(io.BytesIO(self.server.file("picture.png"))).tobytes())
        before = page.generation
        page.send(type="restore", slot="a")
        self.assertEqual(page.until("changed")["edits"], [{"path": "lights.key.emission", "value": [9, 9, 9]}])
        page.finished(before)
        page.send(type="compare", id=6)
        self.assertEqual(page.until("comparison", id=6)["max"], 0)

    def test_the_lab_measures_what_the_scene_has_now(self):
        page = self.page()
        before = json.loads(self.server.file("lab", material="paint"))
        self.edit(page, "materials.paint", {"class": "corvid_Mtl_Metal", "parameters": {"u_roughValue": 0.7}})
        now = json.loads(self.server.file("lab", material="paint"))
        named = json.loads(self.server.get(f"/lab?token={self.server.token}&class=corvid_Mtl_Metal&u_roughValue=0.7")[1])
        for told in (before, now, named):
            for series in told["albedo"]["series"]:
                del series["material"]
        self.assertEqual(now["albedo"], named["albedo"])
        self.assertNotEqual(now["albedo"], before["albedo"])

    def test_turntable_and_denoising(self):
        page = self.page()
        page.finished()
        picture = Image.open(io.BytesIO(self.server.file("picture.png")))
        page.send(type="turntable", frames=4, samples=4)
        frames = page.until("turntable")["frames"]
        self.assertEqual(len(frames), 4)
        shots = [Image.open(io.BytesIO(self.server.file(f[1:]))) for f in frames]
        self.assertEqual(shots[0].tobytes(), picture.tobytes())
        self.assertEqual(len({shot.tobytes() for shot in shots}), 4)
        page.send(type="denoise", on=True)
        while page.kind != 1:
            page.receive()
        page.send(type="denoise", on=False)
        while page.kind != 0:
            page.receive()
        while len(page.rows) < page.size[1]:
            page.receive()
        self.assertEqual(rgb(page.pixels), picture.tobytes())

    def test_ends_at_once_while_it_renders(self):
        page = self.page()
        self.edit(page, "settings.samples", 100000)
        status, seconds = self.server.end(signal.SIGTERM)
        self.assertEqual(status, 0)
        self.assertLess(seconds, 3)
        with self.assertRaises(Closed):
            page.until("bye")
            page.receive()


if __name__ == "__main__":
    unittest.main()
