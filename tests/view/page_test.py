# SPDX-License-Identifier: Apache-2.0
"""The page as people use it, in a browser. ZSI_COMMAND: the command; ZSI_ASSETS: the folder."""
import io
import json
import os
import pathlib
import signal
import struct
import tempfile
import unittest
from urllib.parse import unquote

from browser import Browser, difference
from client import Server
from PIL import Image
from relay import Relay
from selenium.webdriver import ActionChains
from selenium.webdriver.common.by import By
from selenium.webdriver.common.actions.wheel_input import ScrollOrigin
from selenium.webdriver.common.keys import Keys

ZSI = os.environ["ZSI_COMMAND"]
EXPOSURE = "[data-parameter='film.exposure']"
SCENE = {
    "camera": {"position": [0, -6, 1], "target": [0, 0, 0], "fov": 30},
    "film": {"width": 160, "height": 90},
    "settings": {"samples": 8, "maxDepth": 4},
    "meshes": {"ball": {"sphere": {"radius": 1}}, "box": {"box": {"size": 0.9}}},
    "materials": {
        "metal": {"class": "corvid_Mtl_Metal", "parameters": {"u_reflectColor": [0.9, 0.6, 0.2], "u_roughValue": 0.3}},
        "plain": {"class": "corvid_Mtl_Solid", "parameters": {}}},
    "instances": {"ball": {"mesh": "ball", "material": "metal"},
                  "box": {"mesh": "box", "material": "plain", "transform": {"translate": [2, 0, 0]}}},
    "lights": {"key": {"kind": "point", "position": [-2, -4, 4], "color": [20, 20, 20]}},
    "environment": {"file": os.environ["ZSI_ASSETS"] + "/studio.exr"}}


class PageTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.browser = Browser()
        cls.addClassCleanup(cls.browser.driver.quit)

    def setUp(self):
        self.folder = pathlib.Path(self.entered(tempfile.TemporaryDirectory()))
        (self.folder / "scene.json").write_text(json.dumps(SCENE))
        self.server = self.serve("scene.json")
        self.open(self.server.port)

    def entered(self, context):
        self.addCleanup(context.__exit__, None, None, None)
        return context.__enter__()

    def serve(self, name):
        server = Server(ZSI, self.folder / name)
        self.addCleanup(lambda: server.process.poll() is None and server.end(signal.SIGINT))
        return server

    def open(self, port):
        # Its canvas small: the point is the way there, not rendering.
        self.browser.resize(760, 500)
        self.browser.driver.get(f"http://127.0.0.1:{port}/?token={self.server.token}")
        self.browser.wait(lambda: self.browser.driver.find_elements(By.CSS_SELECTOR, "canvas[data-shown]"))

    def tearDown(self):
        self.assertEqual([c for c in self.browser.complaints() if "WebSocket" not in c], [])

    def document(self):
        return json.loads(self.server.file("scene.json"))

    def choose(self, css, value):
        """Of a list, or typed into a field."""
        self.browser.run("""const s = document.querySelector(arguments[0]);
            s.value = arguments[1]; s.dispatchEvent(new Event('change'))""", css, value)

    def drag(self, css, by):
        """In steps, as a hand would; `by` in pixels."""
        at = self.browser.find(css)
        chain = ActionChains(self.browser.driver, duration=20).move_to_element(at).click_and_hold()
        for _ in range(8):
            chain.move_by_offset(by[0] / 8, by[1] / 8)
        chain.release().perform()

    def drag_with(self, key, by):
        """The picture, with a key held down."""
        ActionChains(self.browser.driver).key_down(key).perform()
        self.drag(".frame", by)
        ActionChains(self.browser.driver).key_up(key).perform()

    def settled(self, act):
        """The picture before and after something that changes it."""
        before = self.browser.finished()
        act()
        return before, self.browser.finished(other_than=before)

    def test_a_slider_changes_the_picture_and_undo_brings_it_back(self):
        slider = "[data-parameter='u_roughValue'] input[type=range]"
        before, after = self.settled(lambda: self.drag(slider, (60, 0)))
        value = self.document()["materials"]["metal"]["parameters"]["u_roughValue"]
        self.assertGreater(value, 0.35)
        self.assertGreater(difference(before, after), 1)
        shown = self.browser.find("[data-parameter='u_roughValue'] input[type=number]")
        self.assertAlmostEqual(float(shown.get_attribute("value")), value)

        _, back = self.settled(lambda: self.browser.find("canvas").send_keys(Keys.CONTROL, "z"))
        self.assertEqual(self.document(), SCENE, "the whole drag is one step")
        self.assertEqual(back, before)

    def test_what_is_on_the_picture_is_orbited_and_picked(self):
        before, after = self.settled(lambda: self.drag("canvas", (-80, 0)))
        camera = self.document()["camera"]
        # Dragged to the left, the camera goes to the right, as far from its target as before.
        self.assertGreater(camera["position"][0], 0.5)
        self.assertAlmostEqual(sum(x * x for x in camera["position"]), 37, places=2)
        self.assertEqual(camera["position"][2], 1)
        self.assertGreater(difference(before, after), 1)
        self.settled(lambda: self.browser.find("canvas").send_keys(Keys.CONTROL, "z"))

        canvas = self.browser.find("canvas")
        name = lambda: self.browser.find("[data-control=name]").get_attribute("value")
        # The box: 2 to the right of the middle, at a distance where 3.25 fill the picture's height.
        right = 2 / (2 * 37 ** 0.5 * 0.26795) * canvas.size["height"]
        self.assertEqual(name(), "metal")
        ActionChains(self.browser.driver).move_to_element_with_offset(canvas, int(right), 0).click().perform()
        self.browser.wait(lambda: name() == "plain")
        ActionChains(self.browser.driver).move_to_element_with_offset(canvas, 0, -canvas.size["height"] // 2 + 4).click().perform()
        self.browser.wait(lambda: self.browser.find("#tab-environment").get_attribute("aria-selected") == "true")
        # The ball's front is nearer than its middle by nearly its radius.
        self.browser.click("[data-tool=focus]")
        ActionChains(self.browser.driver).move_to_element(canvas).click().perform()
        self.browser.wait(lambda: "focusDistance" in self.document()["camera"])
        self.assertAlmostEqual(self.document()["camera"]["focusDistance"], 37 ** 0.5 - 1, places=2)

    def test_edits_of_every_part_are_saved_and_give_the_same_picture_again(self):
        browser = self.browser
        choose = self.choose
        browser.run("""const c = document.querySelector("[data-parameter='u_reflectColor'] input[type=color]");
            c.value = '#bc0000'; c.dispatchEvent(new Event('input'))""")
        browser.click("#tab-lights")
        self.drag("[data-parameter='lights.key.radius'] input[type=range]", (20, 0))
        browser.click("#tab-environment")
        self.drag("[data-parameter='environment.rotation'] input[type=range]", (40, 0))
        self.drag(EXPOSURE + " input[type=range]", (10, 0))
        browser.click("#tab-materials")
        choose("[data-control=name]", "plain")
        _, edited = self.settled(lambda: choose("[data-control=class]", "corvid_Mtl_Unlit"))

        document = self.document()
        # 188 of 255 in sRGB is half of the light (IEC 61966-2-1).
        self.assertAlmostEqual(document["materials"]["metal"]["parameters"]["u_reflectColor"][0], 0.5029, places=3)
        self.assertEqual(document["materials"]["plain"]["class"], "corvid_Mtl_Unlit")
        self.assertGreater(document["lights"]["key"]["radius"], 0)
        self.assertGreater(document["environment"]["rotate"], 0)
        self.assertGreater(document["film"]["exposure"], 0)

        browser.find("canvas").send_keys(Keys.CONTROL, "s")
        name = browser.find("#save-name")
        name.clear()
        name.send_keys("saved.json")
        browser.click("[data-tool=save-scene]")
        browser.wait(lambda: (self.folder / "saved.json").exists())
        self.server.end(signal.SIGINT)
        self.server = self.serve("saved.json")
        browser.driver.get("about:blank")
        self.open(self.server.port)
        self.assertEqual(browser.finished(), edited)

    def test_two_states_are_compared_and_values_are_read(self):
        browser = self.browser
        browser.finished()
        browser.click("[data-tool=keep-a]")
        browser.click("#tab-environment")
        self.settled(lambda: self.drag(EXPOSURE + " input[type=range]", (20, 0)))
        browser.click("[data-tool=compare]")
        bar = browser.wait(lambda: (browser.driver.find_elements(By.CSS_SELECTOR, ".compare-bar") or [None])[0]).text
        # Exposure changes what is shown, not the light.
        numbers = {word: float(value) for word, value in zip(bar.split(), bar.split()[1:]) if word in ("RMSE", "FLIP")}
        self.assertEqual(numbers["RMSE"], 0)
        self.assertGreater(numbers["FLIP"], 0.02)
        browser.find(".swipe").send_keys(Keys.ARROW_RIGHT)
        self.assertNotEqual(browser.run("return document.querySelector('.compare .line').style.left"), "50%")
        browser.find("body").send_keys("c")
        browser.wait(lambda: not browser.driver.find_elements(By.CSS_SELECTOR, ".compare"))

        browser.find("body").send_keys("i")
        ActionChains(browser.driver).move_to_element(browser.find("canvas")).move_by_offset(5, 5).perform()
        text = browser.wait(lambda: (browser.driver.find_elements(By.CSS_SELECTOR, "[data-layer=beauty]") or [None])[0]).text
        self.assertTrue(all(float(v) >= 0 for v in text.split()[1:4]), text)

    def test_the_lab_measures_what_was_edited(self):
        summary = self.browser.find(".lab summary")
        self.browser.run("arguments[0].scrollIntoView(); arguments[0].click()", summary)
        plot = lambda: self.browser.run("""const i = document.querySelector("[data-figure='light'] img");
            return i && i.complete && i.naturalWidth > 0 ? i.src : ''""")
        before = self.browser.wait(plot)
        self.browser.run("""const r = document.querySelector("[data-parameter='u_roughValue'] input[type=number]");
            r.value = '0.9'; r.dispatchEvent(new Event('change'))""")
        alone = self.browser.wait(lambda: plot() not in ("", before) and plot())
        self.choose("[data-control=beside]", "plain")
        both = self.browser.wait(lambda: plot() not in ("", alone) and plot())
        self.assertIn("plain", unquote(both), "the legend names both")

        # Half red, measured: the ball's metal is another thing, by a number.
        with open(self.folder / "half.binary", "wb") as file:
            cells = 90 * 90 * 180
            file.write(struct.pack("<3i", 90, 90, 180) + struct.pack("<d", 500) * cells + bytes(16 * cells))
        self.browser.run("""const f = document.querySelector("[data-control=merl]");
            f.value = 'half.binary'; f.dispatchEvent(new Event('change'))""")
        text = self.browser.wait(lambda: [e.text for e in self.browser.driver.find_elements(By.CSS_SELECTOR, "[data-error=metal]")])[0]
        self.assertGreater(float(text.partition("RMS ")[2].partition(",")[0]), 0.01)

    def test_a_lost_connection_comes_back_with_the_state(self):
        relay = Relay(self.server.port)
        self.addCleanup(relay.close)
        self.open(relay.port)
        self.browser.click("#tab-environment")
        _, before = self.settled(lambda: self.drag(EXPOSURE + " input[type=range]", (20, 0)))
        exposure = self.document()["film"]["exposure"]
        relay.pull_out()
        self.browser.wait(lambda: self.browser.driver.find_elements(By.CSS_SELECTOR, ".lost[role=alert]"))
        self.assertEqual(self.browser.pixels(), before, "the last picture stays")
        relay.put_in()
        self.browser.wait(lambda: not self.browser.driver.find_elements(By.CSS_SELECTOR, ".lost"))
        number = self.browser.find(EXPOSURE + " input[type=number]")
        self.assertAlmostEqual(float(number.get_attribute("value")), exposure)
        _, after = self.settled(lambda: self.drag(EXPOSURE + " input[type=range]", (-40, 0)))
        self.assertGreater(difference(before, after), 1)

    def test_pictures_are_chosen_by_file(self):
        Image.new("RGB", (8, 8), (0, 188, 0)).save(self.folder / "green.png")
        Image.new("RGB", (8, 4), (188, 0, 0)).save(self.folder / "red.png")
        seen = lambda css: self.browser.wait(lambda: self.browser.run(
            "const i = document.querySelector(arguments[0]); return i && i.complete && i.naturalWidth", css + " .thumbnail"))
        row = "[data-parameter='u_reflectMap']"
        self.browser.run("document.querySelector(arguments[0]).closest('details').open = true", row)
        self.choose(row + " .file", "green.png")
        seen(row)
        self.settled(lambda: self.browser.run("document.querySelector(arguments[0]).click()", "[data-parameter='u_reflectMapEnable'] input"))
        self.assertEqual(self.document()["materials"]["metal"]["parameters"]["u_reflectMap"], {"texture": "green.png"})

        # Around a scene that has nothing around it.
        self.browser.click("#tab-environment")
        self.settled(lambda: self.choose("[data-control=class]", "none"))
        self.assertNotIn("environment", self.document())
        row = "[data-parameter='environment.file']"
        _, lit = self.settled(lambda: self.choose(row + " .file", "red.png"))
        seen(row)
        self.assertEqual(self.document()["environment"], {"file": "red.png"})
        corner = Image.open(io.BytesIO(lit)).convert("RGB").getpixel((1, 1))
        self.assertGreater(corner[0], 10 * max(corner[1:]))

    def test_hand_and_wheel_move_the_camera_and_the_rest_of_the_bar_works(self):
        browser, canvas = self.browser, self.browser.find("canvas")
        browser.finished()
        camera = lambda: self.document()["camera"]
        distance = lambda: sum((a - b) ** 2 for a, b in zip(camera()["position"], camera()["target"])) ** 0.5
        self.drag_with(Keys.SHIFT, (40, 0))
        browser.wait(lambda: camera()["target"] != [0, 0, 0])
        # What is under the hand stays under it: 3.26 fill the height.
        self.assertAlmostEqual(camera()["target"][0], -40 / canvas.size["height"] * 2 * 37 ** 0.5 * 0.26795, delta=0.1)
        self.assertAlmostEqual(distance(), 37 ** 0.5, places=2)
        ActionChains(browser.driver).scroll_from_origin(ScrollOrigin.from_element(canvas), 0, -400).perform()
        browser.wait(lambda: distance() < 0.95 * 37 ** 0.5)

        # Magnified eight times around a corner of the picture: what is below the pointer stays there.
        box = lambda: browser.run("const b = document.querySelector('canvas').getBoundingClientRect(); return [b.left, b.top, b.width]")
        left, top, width = box()
        still = camera()
        ActionChains(browser.driver).move_to_element(canvas).move_by_offset(-60, -30).perform()
        for _ in range(3):
            browser.find("body").send_keys("z")
        large = box()
        self.assertAlmostEqual(large[2], 8 * width, delta=1)
        middle = left + width / 2 - 60
        self.assertAlmostEqual((middle - large[0]) / 8, middle - left, delta=1)
        self.drag_with(Keys.CONTROL, (32, 0))
        self.assertAlmostEqual(box()[0], large[0] + 32, delta=1)
        browser.find("body").send_keys(Keys.SHIFT, "z")
        self.assertEqual(box(), [left, top, width])
        self.assertEqual(camera(), still)

        # Denoised is what follows the last samples.
        browser.finished()
        browser.click("[data-tool=denoise]")
        browser.wait(lambda: browser.find("canvas").get_attribute("data-shown").endswith("/1"))
        browser.click("[data-tool=denoise]")

        browser.find("canvas").send_keys(Keys.CONTROL, "s")
        for field, value in (("#turn-frames", "3"), ("#turn-samples", "1")):
            self.choose(field, value)
        browser.click("[data-tool=turntable]")
        frame = lambda: browser.run("""const i = document.querySelector('.turntable img');
            return i && i.complete && i.naturalWidth ? i.src : ''""")
        seen = {browser.wait(frame)}
        browser.wait(lambda: seen.add(frame()) or len(seen - {""}) == 3)
        browser.find("body").send_keys(Keys.ESCAPE)

    def test_names_roles_and_narrow_windows(self):
        browser = self.browser
        for width in (390, 1440):
            browser.resize(width, 844)
            for tab in ("materials", "lights", "environment", "scene"):
                browser.click(f"#tab-{tab}")
                nameless = browser.run("""return [...document.querySelectorAll('button, input, select, textarea, canvas')]
                    .filter((e) => !(e.ariaLabel || e.textContent.trim() && e.localName === 'button' || e.labels?.length))
                    .map((e) => e.outerHTML.slice(0, 200))""")
                self.assertEqual(nameless, [])
                self.assertLessEqual(browser.run("return document.documentElement.scrollWidth"), width)
                wide = browser.run("return [...document.querySelectorAll('.row')].filter((r) => r.scrollWidth > r.clientWidth + 1).map((r) => r.dataset.parameter)")
                self.assertEqual(wide, [])
        browser.find("body").send_keys("?")
        self.assertTrue(browser.find("#help").is_displayed())


if __name__ == "__main__":
    unittest.main()
