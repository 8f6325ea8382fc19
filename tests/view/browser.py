# SPDX-License-Identifier: Apache-2.0
"""The page of `zsi view` in Debian's chromium, without a screen."""
import base64
import io
import time

from PIL import Image
from selenium import webdriver
from selenium.webdriver.chrome.service import Service
from selenium.webdriver.common.by import By
from selenium.webdriver.support.wait import WebDriverWait


class Browser:
    def __init__(self, width=1200, height=800):
        options = webdriver.ChromeOptions()
        options.binary_location = "/usr/bin/chromium"
        # Containers give it no sandbox and little shared memory; it opens this one page.
        for argument in ("--headless=new", "--no-sandbox", "--disable-gpu", "--disable-dev-shm-usage",
                         "--hide-scrollbars", f"--window-size={width},{height}"):
            options.add_argument(argument)
        options.set_capability("goog:loggingPrefs", {"browser": "ALL"})
        self.driver = webdriver.Chrome(service=Service("/usr/bin/chromedriver"), options=options)
        self.driver.set_script_timeout(30)
        self.resize(width, height)

    def resize(self, width, height):
        self.driver.execute_cdp_cmd("Emulation.setDeviceMetricsOverride",
                                    {"width": width, "height": height, "deviceScaleFactor": 1, "mobile": False})

    def find(self, css):
        return self.driver.find_element(By.CSS_SELECTOR, css)

    def click(self, css):
        self.find(css).click()

    def run(self, script, *arguments):
        return self.driver.execute_script(script, *arguments)

    def wait(self, condition, seconds=30):
        return WebDriverWait(self.driver, seconds, 0.05).until(lambda _: condition())

    def finished(self, other_than=None):
        """The picture when all of it is there and no edit is on its way."""
        self.wait(lambda: self.pixels() != other_than)
        before, same = None, 0
        while same < 3:
            self.wait(lambda: self.run("""const {shown, generation, samples, state} = document.querySelector('canvas').dataset;
                return state === 'done' && shown === `${generation}/${samples}/0`"""))
            now = self.pixels()
            same = same + 1 if now == before else 0
            before = now
            time.sleep(0.1)
        return before

    def pixels(self):
        """What the canvas shows, as a PNG."""
        url = self.run("return document.querySelector('canvas').toDataURL()")
        return base64.b64decode(url.partition(",")[2])

    def complaints(self):
        """Errors of scripts and of the security policy."""
        return [line["message"] for line in self.driver.get_log("browser") if line["level"] == "SEVERE"]


def difference(a, b):
    """Mean difference of two PNG, 0 to 255."""
    a, b = (Image.open(io.BytesIO(data)).convert("RGB") for data in (a, b))
    if a.size != b.size:
        raise AssertionError(f"sizes {a.size} and {b.size}")
    return sum(abs(x - y) for p, q in zip(a.getdata(), b.getdata()) for x, y in zip(p, q)) / (3 * a.width * a.height)
