// SPDX-License-Identifier: Apache-2.0
import {html, LitElement, nothing, type TemplateResult} from "lit";
import {customElement, property} from "lit/decorators.js";
import {isObject, numbers, type Json, type JsonObject} from "../base/json";
import {tellChange} from "./number";
import "./color";

/** How a matrix is written: of texture coordinates, of directions, of places (docs/scene-format.md). */
export type Form = "uv" | "directions" | "places";

const kParts: Record<Form, {key: string; title: string; otherwise: number[]}[]> = {
  uv: [{key: "scale", title: "scale", otherwise: [1, 1]}, {key: "rotate", title: "rotate °", otherwise: [0]},
       {key: "translate", title: "translate", otherwise: [0, 0]}],
  directions: [{key: "scale", title: "scale", otherwise: [1, 1, 1]},
               {key: "rotate", title: "axis, °", otherwise: [0, 0, 1, 0]}],
  places: [{key: "scale", title: "scale", otherwise: [1, 1, 1]},
           {key: "rotate", title: "axis, °", otherwise: [0, 0, 1, 0]},
           {key: "translate", title: "translate", otherwise: [0, 0, 0]}],
};

/** A matrix as scale, turn and move; one that the scene has as numbers stays numbers. */
@customElement("zsi-transform")
export class TransformControl extends LitElement {
  @property({attribute: false}) value: Json = null;
  @property() form: Form = "places";
  @property() label = "";

  override createRenderRoot(): HTMLElement {
    return this;
  }

  private partOf(object: JsonObject, key: string, otherwise: number[]): number[] | undefined {
    const value = object[key];
    if (value === undefined) return otherwise;
    if (typeof value === "number") return otherwise.map(() => value);
    const read = numbers(value, []);
    return read.length === otherwise.length ? read : undefined; // several turns, one after another
  }

  private write(object: JsonObject, key: string, value: number[], otherwise: number[]): void {
    const after = {...object};
    if (value.every((v, i) => v === otherwise[i])) delete after[key];
    else after[key] = value.length === 1 ? value[0]! : value;
    tellChange(this, after);
  }

  private type(event: Event): void {
    const area = event.target as HTMLTextAreaElement;
    try {
      const value = JSON.parse(area.value) as Json;
      area.setCustomValidity("");
      tellChange(this, value);
    } catch {
      area.setCustomValidity("expected JSON, such as {\"scale\": 2} or 16 numbers in brackets");
      area.reportValidity();
    }
  }

  override render(): TemplateResult {
    const object = isObject(this.value) ? this.value : {};
    const parts = kParts[this.form].map((p) => ({...p, value: this.partOf(object, p.key, p.otherwise)}));
    if (Array.isArray(this.value) || parts.some((p) => p.value === undefined))
      return html`<textarea rows="3" spellcheck="false" aria-label="${this.label}, as JSON"
        .value=${JSON.stringify(this.value)} @change=${this.type}></textarea>`;
    return html`${parts.map((p) => p.value ? html`<label class="part"><span>${p.title}</span>
      <zsi-vector label="${this.label}, ${p.title}" .value=${p.value}
        @edit=${(e: CustomEvent<{value: number[]}>) => this.write(object, p.key, e.detail.value, p.otherwise)}>
      </zsi-vector></label>` : nothing)}`;
  }
}
