// SPDX-License-Identifier: Apache-2.0
import type {Frame, Tile} from "../session/protocol";

/** Puts tiles together. Those of an older generation are dropped; a coarse picture is scaled up, the
 * picture before stays until it is covered. */
export class TilePainter {
  private generation = 0;
  private readonly scratch = document.createElement("canvas");

  constructor(private readonly canvas: HTMLCanvasElement) {}

  /** Gives the canvas the frame's size; what it showed is scaled. */
  fit(frame: Frame): void {
    const {canvas} = this;
    if (canvas.width === frame.width && canvas.height === frame.height) return;
    this.scratch.width = canvas.width;
    this.scratch.height = canvas.height;
    this.scratch.getContext("2d")?.drawImage(canvas, 0, 0);
    canvas.width = frame.width;
    canvas.height = frame.height;
    if (this.generation > 0) this.context().drawImage(this.scratch, 0, 0, frame.width, frame.height);
  }

  draw(tile: Tile): void {
    if (tile.generation < this.generation) return;
    this.generation = tile.generation;
    const {canvas} = this;
    const data = new ImageData(new Uint8ClampedArray(tile.payload), tile.width, tile.height);
    if (tile.frameWidth === canvas.width && tile.frameHeight === canvas.height) {
      this.context().putImageData(data, tile.x, tile.y);
      return;
    }
    this.scratch.width = tile.width;
    this.scratch.height = tile.height;
    this.scratch.getContext("2d")?.putImageData(data, 0, 0);
    const x = canvas.width / tile.frameWidth, y = canvas.height / tile.frameHeight;
    this.context().drawImage(
      this.scratch, tile.x * x, tile.y * y, tile.width * x, tile.height * y);
  }

  private context(): CanvasRenderingContext2D {
    const context = this.canvas.getContext("2d");
    if (!context) throw new Error("the browser gives no canvas");
    return context;
  }
}
