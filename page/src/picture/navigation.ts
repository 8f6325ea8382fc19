// SPDX-License-Identifier: Apache-2.0
import {session} from "../session/session";
import {unique} from "../session/element";
import {cameraEdits, cameraOf, dollied, orbited, panned, type Camera} from "./camera";

type Move = "orbit" | "pan" | "dolly";

const kClick = 4; // pixels that a hand may move during a click
const kPause = 400; // milliseconds: turns of the wheel within it are one step to undo
const kKeyStep = 1 / 24; // of the picture's height

/** Turns what pointers, wheel and keys do over the picture into moves of the camera. */
export class Navigation {
  private readonly pointers = new Map<number, PointerEvent>();
  private move: Move = "orbit";
  private group = "";
  private travelled = 0;
  private lastWheel = 0;

  constructor(
    private readonly place: HTMLElement,
    private readonly clicked: (event: PointerEvent) => void,
  ) {
    place.addEventListener("pointerdown", (e) => this.down(e));
    place.addEventListener("pointermove", (e) => this.moved(e));
    place.addEventListener("pointerup", (e) => this.up(e));
    place.addEventListener("pointercancel", (e) => this.pointers.delete(e.pointerId));
    place.addEventListener("wheel", (e) => this.wheel(e), {passive: false});
    place.addEventListener("contextmenu", (e) => e.preventDefault());
    place.addEventListener("keydown", (e) => this.key(e));
  }

  private change(change: (camera: Camera) => Camera): void {
    session.edit(cameraEdits(change(cameraOf(session.document))), this.group);
  }

  private down(event: PointerEvent): void {
    this.place.setPointerCapture(event.pointerId);
    this.pointers.set(event.pointerId, event);
    if (this.pointers.size > 1) return;
    this.move = event.button === 2 ? "dolly" : event.button === 1 || event.shiftKey ? "pan" : "orbit";
    this.group = unique("camera");
    this.travelled = 0;
  }

  private moved(event: PointerEvent): void {
    const before = this.pointers.get(event.pointerId);
    if (!before) return;
    const distance = this.spread();
    this.pointers.set(event.pointerId, event);
    const height = this.place.clientHeight;
    const dx = (event.clientX - before.clientX) / height, dy = (event.clientY - before.clientY) / height;
    this.travelled += Math.hypot(dx, dy) * height;
    if (this.travelled < kClick || (dx === 0 && dy === 0)) return;
    if (this.pointers.size === 2) { // two fingers: both at once
      const factor = distance / Math.max(1, this.spread());
      this.change((camera) => dollied(panned(camera, dx / 2, dy / 2), factor));
    } else if (this.move === "orbit") {
      this.change((camera) => orbited(camera, dx, dy));
    } else if (this.move === "pan") {
      this.change((camera) => panned(camera, dx, dy));
    } else {
      this.change((camera) => dollied(camera, Math.exp(2 * dy)));
    }
  }

  private up(event: PointerEvent): void {
    this.pointers.delete(event.pointerId);
    if (this.travelled < kClick && event.button === 0 && this.pointers.size === 0) this.clicked(event);
  }

  /** Between two fingers, pixels. */
  private spread(): number {
    const [a, b] = [...this.pointers.values()];
    return a && b ? Math.hypot(a.clientX - b.clientX, a.clientY - b.clientY) : 0;
  }

  private wheel(event: WheelEvent): void {
    event.preventDefault();
    if (event.timeStamp - this.lastWheel > kPause) this.group = unique("camera");
    this.lastWheel = event.timeStamp;
    const lines = event.deltaMode === WheelEvent.DOM_DELTA_PIXEL ? event.deltaY / 40 : event.deltaY;
    this.change((camera) => dollied(camera, Math.exp(Math.max(-3, Math.min(3, lines)) * 0.04)));
  }

  private key(event: KeyboardEvent): void {
    if (event.ctrlKey || event.metaKey || event.altKey) return;
    const ways: Record<string, [number, number]> = {
      ArrowLeft: [-kKeyStep, 0], ArrowRight: [kKeyStep, 0], ArrowUp: [0, -kKeyStep], ArrowDown: [0, kKeyStep]};
    const way = ways[event.key];
    const dolly = event.key === "+" || event.key === "=" ? 1 / 1.1 : event.key === "-" ? 1.1 : 0;
    if (!way && !dolly) return;
    event.preventDefault();
    if (!event.repeat) this.group = unique("camera");
    if (dolly) this.change((camera) => dollied(camera, dolly));
    else if (way && event.shiftKey) this.change((camera) => panned(camera, way[0], way[1]));
    else if (way) this.change((camera) => orbited(camera, way[0], way[1]));
  }
}
