// SPDX-License-Identifier: Apache-2.0
/** Keys of a scene that no class has: of the camera, the film, lights of the program's own. */
import {html, nothing, type TemplateResult} from "lit";
import {numbers, type Json} from "../base/json";
import type {Change} from "../controls/number";
import {session} from "../session/session";
import "../controls/color";
import "../controls/number";

export interface Field {
  key: string;
  meaning: string;
  type: "number" | "whole" | "color" | "point" | "pair" | "bool" | readonly string[];
  otherwise: Json; // where the scene says nothing
  minimum?: number;
  maximum?: number;
}

function control(field: Field, path: string, value: Json): TemplateResult {
  const edit = (e: CustomEvent<Change<Json>>) => session.set(path, e.detail.value, e.detail.group);
  const {type} = field;
  if (type === "number" || type === "whole")
    return html`<zsi-number label=${field.key} .value=${Number(value)} ?whole=${type === "whole"}
      ?bare=${field.maximum === undefined} .minimum=${field.minimum ?? 0} .maximum=${field.maximum ?? 1} @edit=${edit}></zsi-number>`;
  if (type === "bool")
    return html`<input type="checkbox" aria-label=${field.key} .checked=${value === true}
      @change=${(e: Event) => session.set(path, (e.target as HTMLInputElement).checked)} />`;
  if (typeof type !== "string")
    return html`<select aria-label=${field.key} @change=${(e: Event) => session.set(path, (e.target as HTMLSelectElement).value)}>
      ${type.map((name) => html`<option ?selected=${name === value}>${name}</option>`)}</select>`;
  const length = type === "pair" ? 2 : 3;
  const otherwise = typeof value === "number" ? new Array<number>(length).fill(value) : numbers(field.otherwise, new Array<number>(length).fill(0));
  const now = numbers(value, otherwise);
  return type === "color"
    ? html`<zsi-color label=${field.key} .value=${now} @edit=${edit}></zsi-color>`
    : html`<zsi-vector label=${field.key} .value=${now} @edit=${edit}></zsi-vector>`;
}

export function fieldRows(base: string, fields: readonly Field[]): TemplateResult {
  return html`${fields.map((field) => {
    const path = `${base}.${field.key}`;
    const written = session.valueAt(path);
    return html`<div class="row ${written === undefined ? "" : "written"}" data-parameter=${path}>
      <span class="name" title=${field.meaning}>${field.key}
        ${written === undefined ? nothing : html`<button class="small reset" aria-label="${field.key}: the default"
          title="the default again" @click=${() => session.set(path, null)}>↺</button>`}</span>
      <span class="control">${control(field, path, written ?? field.otherwise)}</span>
      <small>${field.meaning}</small></div>`;
  })}`;
}
