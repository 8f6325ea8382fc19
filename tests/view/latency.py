#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Time from a slider's move to the first whole picture of it on the page's canvas, in the browser itself:
   ZSI_COMMAND=build/zsi tests/view/latency.py SCENE MATERIAL PARAMETER"""
import os
import signal
import statistics
import sys

from browser import Browser
from client import Server

kMoves = 40

# Waits for rows of a newer generation down to the last one, then for the frame that shows them.
SCRIPT = """
const [name, moves, done] = arguments;
const input = document.querySelector(`[data-parameter='${name}'] input[type=range]`);
const canvas = document.querySelector('canvas');
const times = [];
let generation = 0, begin = 0;
const now = () => Number((canvas.dataset.shown ?? '0').split('/')[0]);
const isWhole = () => canvas.dataset.whole === canvas.dataset.shown.split('/')[0];
const move = () => {
  if (times.length === moves) return done(times);
  generation = now();
  input.value = Number(input.min) + (Number(input.max) - Number(input.min)) * ((times.length * 7 + 3) % 19) / 20;
  begin = performance.now();
  input.dispatchEvent(new Event('input', {bubbles: true}));
};
new MutationObserver(() => {
  if (begin === 0 || now() <= generation || !isWhole()) return;
  const from = begin;
  begin = 0;
  requestAnimationFrame(() => { times.push(performance.now() - from); setTimeout(move, 150); });
}).observe(canvas, {attributes: true});
move();
"""


def main(scene, material, parameter):
    server = Server(os.environ["ZSI_COMMAND"], scene)
    browser = Browser(1440, 900)
    try:
        browser.driver.get(f"http://127.0.0.1:{server.port}/?token={server.token}")
        browser.wait(lambda: browser.run("return document.querySelector('canvas')?.dataset.whole"))
        browser.run("const s = document.querySelector('[data-control=name]'); s.value = arguments[0];"
                    "s.dispatchEvent(new Event('change'))", material)
        browser.wait(lambda: browser.run("return document.querySelector(`[data-parameter='${arguments[0]}']`)", parameter))
        times = sorted(browser.driver.execute_async_script(SCRIPT, parameter, kMoves))
    finally:
        browser.driver.quit()
        server.end(signal.SIGINT)
    print(f"{scene}: {material}.{parameter}, {kMoves} moves: median {statistics.median(times):.0f} ms, "
          f"nine of ten below {times[int(0.9 * kMoves)]:.0f} ms, longest {times[-1]:.0f} ms")


if __name__ == "__main__":
    main(*sys.argv[1:])
