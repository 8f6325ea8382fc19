// SPDX-License-Identifier: Apache-2.0
import {html, LitElement, nothing, type TemplateResult} from "lit";
import {customElement, property} from "lit/decorators.js";
import {rounded} from "../base/color";
import {unique} from "../session/element";

export interface Change<T> {
  value: T;
  /** The same for all changes of one drag. */
  group: string;
}

export function tellChange<T>(from: HTMLElement, value: T, group = ""): void {
  from.dispatchEvent(new CustomEvent<Change<T>>("edit", {detail: {value, group}}));
}

/** A slider with its number beside it. The slider's ends are where a person would drag; the number may
 * be any. */
@customElement("zsi-number")
export class NumberControl extends LitElement {
  @property({type: Number}) value = 0;
  @property({type: Number}) minimum = 0;
  @property({type: Number}) maximum = 1;
  @property({type: Number}) step = 0;
  @property({type: Boolean}) whole = false;
  @property() label = "";
  @property({type: Boolean}) bare = false; // without a slider

  private group = "";
  private dragged?: number; // what the server says meanwhile is older

  override createRenderRoot(): HTMLElement {
    return this;
  }

  private drag(event: Event): void {
    if (this.dragged === undefined) this.group = unique("drag");
    this.dragged = rounded(Number((event.target as HTMLInputElement).value));
    tellChange(this, this.dragged, this.group);
    this.requestUpdate();
  }

  private drop(): void {
    this.dragged = undefined;
  }

  private type(event: Event): void {
    const input = event.target as HTMLInputElement;
    const value = input.valueAsNumber;
    if (Number.isFinite(value) && value !== this.value) tellChange(this, this.whole ? Math.round(value) : value);
    else input.value = String(rounded(this.value));
  }

  override render(): TemplateResult {
    const shown = this.dragged ?? this.value;
    const low = Math.min(this.minimum, shown), high = Math.max(this.maximum, shown);
    // Some hundred steps of round numbers, for keys too.
    const step = this.step || (this.whole ? 1 : 10 ** Math.floor(Math.log10((high - low) / 100)));
    return html`
      ${this.bare ? nothing : html`<input type="range" min=${low} max=${high} step=${step} .value=${String(shown)}
        aria-label=${this.label} @input=${this.drag} @change=${this.drop} @dblclick=${() => tellChange(this, null)}
        title="Double click: the default" />`}
      <input type="number" step=${this.whole ? 1 : "any"} .value=${String(rounded(shown))}
        aria-label=${this.label} @change=${this.type} />`;
  }
}
