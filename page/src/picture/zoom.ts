// SPDX-License-Identifier: Apache-2.0

const kMost = 32; // screen pixels for one of the picture
const kWheelStep = 1.25;

/** Magnifies the pixels of the picture, without rendering anew: Ctrl with the wheel around the pointer,
 * Ctrl with a drag moves it. */
export class Zoom {
  private factor = 1;
  private x = 0; // of the picture's middle off the frame's, screen pixels
  private y = 0;

  constructor(private readonly frame: HTMLElement, private readonly canvas: HTMLElement) {
    // Before the canvas, where the same gestures move the camera.
    frame.addEventListener("wheel", (e) => this.wheel(e), {capture: true, passive: false});
    frame.addEventListener("pointerdown", (e) => this.down(e), {capture: true});
  }

  reset(): void {
    this.set(1, 0, 0);
  }

  /** Twice as large around what is below (x, y), of the window; the middle if not given. */
  enlarge(at?: {x: number; y: number}): void {
    if (this.factor >= kMost) return this.reset();
    const box = this.frame.getBoundingClientRect();
    this.around(at?.x ?? box.left + box.width / 2, at?.y ?? box.top + box.height / 2, 2);
  }

  private around(clientX: number, clientY: number, by: number): void {
    const box = this.frame.getBoundingClientRect();
    const factor = Math.max(1, Math.min(kMost, this.factor * by)), change = factor / this.factor;
    const px = clientX - box.left - box.width / 2, py = clientY - box.top - box.height / 2;
    this.set(factor, px - (px - this.x) * change, py - (py - this.y) * change);
  }

  /** No further than the picture's edge at the frame's. */
  private set(factor: number, x: number, y: number): void {
    const room = (size: number) => ((factor - 1) * size) / 2;
    const within = (v: number, most: number) => Math.max(-most, Math.min(most, v));
    this.factor = factor;
    this.x = within(x, room(this.frame.clientWidth));
    this.y = within(y, room(this.frame.clientHeight));
    this.canvas.style.transform = factor === 1 ? "" : `translate(${this.x}px, ${this.y}px) scale(${factor})`;
    this.canvas.classList.toggle("magnified", factor > 1);
  }

  private wheel(event: WheelEvent): void {
    if (!event.ctrlKey) return;
    event.preventDefault();
    event.stopPropagation();
    this.around(event.clientX, event.clientY, event.deltaY < 0 ? kWheelStep : 1 / kWheelStep);
  }

  private down(event: PointerEvent): void {
    if (!event.ctrlKey || event.button !== 0) return;
    event.preventDefault();
    event.stopPropagation();
    const ended = new AbortController();
    const from = {x: this.x - event.clientX, y: this.y - event.clientY};
    window.addEventListener("pointermove", (e) => this.set(this.factor, from.x + e.clientX, from.y + e.clientY),
      {signal: ended.signal});
    for (const end of ["pointerup", "pointercancel"]) window.addEventListener(end, () => ended.abort(), {signal: ended.signal});
  }
}
