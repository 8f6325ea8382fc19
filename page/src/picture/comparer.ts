// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {styles} from "../base/styles";
import type {Comparison, Tile} from "../session/protocol";

type Mode = "swipe" | "difference";
const kA = 2, kB = 3, kDifference = 4; // kinds of tiles

/** Two kept states over each other with a line between them, or their difference. */
export class Comparer {
  isOpen = false;
  private numbers?: Comparison;
  private readonly pictures = new Map<number, string>(); // kind -> address of a blob
  private mode: Mode = "swipe";
  private at = 50; // per cent from the left

  constructor(private readonly changed: () => void) {}

  begin(numbers: Comparison): void {
    this.close();
    this.numbers = numbers;
  }

  async take(tile: Tile): Promise<void> {
    this.pictures.set(tile.kind, URL.createObjectURL(new Blob([new Uint8Array(tile.payload)], {type: "image/png"})));
    this.isOpen = this.pictures.size === 3;
    this.changed();
  }

  close(): void {
    for (const address of this.pictures.values()) URL.revokeObjectURL(address);
    this.pictures.clear();
    this.isOpen = false;
    this.changed();
  }

  private move(value: number): void {
    this.at = value;
    this.changed();
  }

  private show(mode: Mode): void {
    this.mode = mode;
    this.changed();
  }

  render(): TemplateResult {
    const isSwipe = this.mode === "swipe";
    return html`
      <div class="compare" @keydown=${(e: KeyboardEvent) => e.key === "Escape" && this.close()}>
        ${isSwipe
          ? html`
            <img alt="state B" src=${this.pictures.get(kB) ?? ""} />
            <img alt="state A" src=${this.pictures.get(kA) ?? ""}
              ${styles({"clip-path": `inset(0 ${100 - this.at}% 0 0)`})} />
            <div class="line" ${styles({left: `${this.at}%`})}></div>
            <span class="mark a">A</span><span class="mark b">B</span>
            <input type="range" class="swipe" min="0" max="100" step="0.1" .value=${String(this.at)}
              aria-label="Line between the states A and B"
              @input=${(e: Event) => this.move(Number((e.target as HTMLInputElement).value))} />`
          : html`<img alt="difference as the eye sees it, brighter is more" src=${this.pictures.get(kDifference) ?? ""} />`}
        <div class="compare-bar">
          <button aria-pressed=${isSwipe} @click=${() => this.show("swipe")}>Swipe</button>
          <button aria-pressed=${!isSwipe} @click=${() => this.show("difference")}>Difference</button>
          ${this.numbers ? html`
            <span title="root of the mean squared difference of linear values">RMSE
              <b>${this.numbers.rmse.toPrecision(3)}</b></span>
            <span title="mean difference as the eye sees it, 0 to 1 (FLIP, Andersson 2020)">FLIP
              <b>${this.numbers.flip.toFixed(4)}</b></span>
            <span title="largest difference of a linear value">max <b>${this.numbers.max.toPrecision(3)}</b></span>`
            : nothing}
          <button @click=${() => this.close()}>Close</button>
        </div>
      </div>`;
  }
}
