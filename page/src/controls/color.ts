// SPDX-License-Identifier: Apache-2.0
import {html, LitElement, type TemplateResult} from "lit";
import {customElement, property} from "lit/decorators.js";
import {fromHex, rounded, toHex} from "../base/color";
import {unique} from "../session/element";
import {tellChange} from "./number";

/** A linear colour: its three numbers as scenes have them, and the screen's picker, which shows sRGB. */
@customElement("zsi-color")
export class ColorControl extends LitElement {
  @property({attribute: false}) value: number[] = [0, 0, 0];
  @property() label = "";
  private group = "";

  override createRenderRoot(): HTMLElement {
    return this;
  }

  /** Light brighter than 1 keeps its strength, the picker gives its hue. */
  private pick(event: Event): void {
    if (this.group === "") this.group = unique("colour");
    const strength = Math.max(1, ...this.value.slice(0, 3));
    const rgb = fromHex((event.target as HTMLInputElement).value).map((v) => rounded(v * strength));
    tellChange(this, [...rgb, ...this.value.slice(3)], this.group);
  }

  private type(at: number, event: Event): void {
    const number = (event.target as HTMLInputElement).valueAsNumber;
    if (!Number.isFinite(number)) return;
    const value = this.value.slice();
    value[at] = number;
    tellChange(this, value);
  }

  override render(): TemplateResult {
    return html`
      <input type="color" .value=${toHex(this.value)} aria-label="${this.label}, picker in sRGB"
        title="shown in sRGB; the numbers are linear" @input=${this.pick} @change=${() => (this.group = "")} />
      ${this.value.map((v, i) => html`<input type="number" step="any" .value=${String(rounded(v))}
        aria-label="${this.label}, ${["red", "green", "blue", "fourth"][i] ?? ""}, linear"
        @change=${(e: Event) => this.type(i, e)} />`)}`;
  }
}

/** Two to four numbers. */
@customElement("zsi-vector")
export class VectorControl extends LitElement {
  @property({attribute: false}) value: number[] = [0, 0, 0];
  @property() label = "";

  override createRenderRoot(): HTMLElement {
    return this;
  }

  override render(): TemplateResult {
    return html`${this.value.map((v, i) => html`<input type="number" step="any" .value=${String(rounded(v))}
      aria-label="${this.label}, ${"xyzw"[i] ?? ""}" @change=${(e: Event) => {
        const number = (e.target as HTMLInputElement).valueAsNumber;
        if (Number.isFinite(number)) tellChange(this, this.value.map((o, j) => (j === i ? number : o)));
      }} />`)}`;
  }
}
