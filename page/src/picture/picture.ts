// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, state} from "lit/decorators.js";
import {styles} from "../base/styles";
import type {Vec3} from "../base/vector";
import {SessionElement} from "../session/element";
import {session} from "../session/session";
import type {Picked, Tile} from "../session/protocol";
import {cameraOf, depthOf} from "./camera";
import {Comparer} from "./comparer";
import {Navigation} from "./navigation";
import {TilePainter} from "./tiles";
import {Zoom} from "./zoom";

/** What a click on the picture does; the toolbar sets it, Alt and double clicks go round it. */
export type Tool = "select" | "focus";

const kInspectEvery = 60; // milliseconds

/** The picture: tiles as they come, moves of the camera, picking, and the comparison over it. */
@customElement("zsi-picture")
export class PictureElement extends SessionElement {
  @state() tool: Tool = "select";
  @state() isInspecting = false;
  @state() private message = "";

  readonly comparer = new Comparer(() => this.requestUpdate());
  private painter?: TilePainter;
  private zoom?: Zoom;
  private canvas?: HTMLCanvasElement;
  private lastInspect = 0;
  private hover?: {x: number; y: number}; // pixel of the picture
  private pointer?: {x: number; y: number}; // the same in the window

  override firstUpdated(): void {
    const canvas = this.querySelector("canvas");
    const place = this.querySelector<HTMLElement>(".place");
    if (!canvas || !place) return;
    this.canvas = canvas;
    this.painter = new TilePainter(canvas);
    new Navigation(canvas, (event) => void this.clicked(event));
    this.zoom = new Zoom(canvas.parentElement!, canvas);
    canvas.addEventListener("dblclick", (event) => void this.centre(event));
    canvas.addEventListener("pointermove", (event) => {
      this.hover = this.pixel(event);
      this.pointer = {x: event.clientX, y: event.clientY};
      this.inspect();
    });
    new ResizeObserver(() => this.fit(place)).observe(place);
    this.listen("tile", (tile) => this.draw(tile));
    this.listen("comparison", (comparison) => {
      this.zoom?.reset();
      this.comparer.begin(comparison);
    });
  }

  override updated(changes: Map<PropertyKey, unknown>): void {
    if (changes.has("tool") || changes.has("isInspecting")) this.dispatchEvent(new CustomEvent("tool"));
    const {frame} = session;
    if (!frame || !this.canvas) return;
    this.painter?.fit(frame);
    this.canvas.dataset.samples = String(frame.samples); // for tests and the curious
    this.canvas.dataset.generation = String(frame.generation);
    this.canvas.dataset.state = frame.state;
    this.inspect();
  }

  private fit(place: HTMLElement): void {
    const by = Math.min(window.devicePixelRatio, 2);
    session.view(Math.max(16, Math.floor(place.clientWidth * by)), Math.max(16, Math.floor(place.clientHeight * by)));
  }

  private draw(tile: Tile): void {
    if (tile.kind >= 2) {
      void this.comparer.take(tile);
      return;
    }
    if (session.frame) this.painter?.fit(session.frame);
    this.painter?.draw(tile);
    if (!this.canvas) return;
    if (tile.y + tile.height === tile.frameHeight) this.canvas.dataset.whole = String(tile.generation);
    this.canvas.dataset.shown = `${tile.generation}/${tile.samples}/${tile.kind}`;
  }

  /** Of the frame, where the pointer is. */
  private pixel(event: MouseEvent): {x: number; y: number} {
    const box = this.canvas!.getBoundingClientRect();
    return {
      x: ((event.clientX - box.left) / box.width) * this.canvas!.width - 0.5,
      y: ((event.clientY - box.top) / box.height) * this.canvas!.height - 0.5,
    };
  }

  private async clicked(event: PointerEvent): Promise<void> {
    const {x, y} = this.pixel(event);
    await this.pickAt(x, y, this.tool === "focus" || event.altKey);
  }

  /** By key: the middle of the picture. */
  async pickMiddle(): Promise<void> {
    if (this.canvas) await this.pickAt(this.canvas.width / 2, this.canvas.height / 2, this.tool === "focus");
  }

  private async pickAt(x: number, y: number, isFocus: boolean): Promise<void> {
    const picked = await session.pick(x, y);
    if (isFocus) this.focusOn(picked);
    else if (picked.light !== undefined) session.select({section: "lights", name: picked.light});
    else if (picked.material !== null) session.select({section: "materials", name: picked.material});
    else session.select({section: "environment", name: ""});
    if (!isFocus) this.message = `${picked.light ?? picked.material ?? "environment"} selected`;
  }

  private focusOn(picked: Picked): void {
    if (!picked.position) return;
    const distance = depthOf(cameraOf(session.document), picked.position as Vec3);
    session.set("camera.focusDistance", Number(distance.toFixed(4)));
    this.message = `focus at ${distance.toFixed(2)}`;
    this.tool = "select";
  }

  /** The camera turns to what was clicked on, and around it from then on. */
  private async centre(event: MouseEvent): Promise<void> {
    const {x, y} = this.pixel(event);
    const picked = await session.pick(x, y);
    if (picked.position) session.set("camera.target", picked.position.map((v) => Number(v.toFixed(5))));
  }

  toggleFocus(): void {
    this.tool = this.tool === "focus" ? "select" : "focus";
    if (this.tool === "focus") this.message = "Click where the focus shall be";
  }

  enlarge(): void {
    this.zoom?.enlarge(this.pointer);
  }

  wholePicture(): void {
    this.zoom?.reset();
  }

  toggleInspecting(): void {
    this.isInspecting = !this.isInspecting;
  }

  private inspect(): void {
    const now = performance.now();
    if (!this.isInspecting || !this.hover || now - this.lastInspect < kInspectEvery) return;
    const x = Math.round(this.hover.x), y = Math.round(this.hover.y);
    if (x < 0 || y < 0 || x >= this.canvas!.width || y >= this.canvas!.height) return;
    this.lastInspect = now;
    session.inspect(x, y);
  }

  override render(): TemplateResult {
    const {frame} = session;
    const aspect = frame ? frame.width / frame.height : 1.5;
    return html`
      <div class="place">
        <div class="frame" ${styles({"--aspect": String(aspect)})}>
          <canvas width="16" height="16" tabindex="0" role="img"
            aria-label="Rendered picture. Arrow keys turn the camera, with Shift they move it, plus and minus
              go nearer and further, Enter selects what is in the middle."
            class=${this.tool === "focus" || this.isInspecting ? "aims" : ""}
            @keydown=${(e: KeyboardEvent) => e.key === "Enter" && void this.pickMiddle()}></canvas>
          ${this.comparer.isOpen ? this.comparer.render() : nothing}
          ${session.isConnected ? nothing : html`<div class="lost" role="alert">
            Connection lost; looking for zsi view…</div>`}
        </div>
      </div>
      <div class="hidden" role="status" aria-live="polite">${this.message}</div>`;
  }
}
