// SPDX-License-Identifier: Apache-2.0
/** A class's parameters as controls, in the groups and with the words of its rows. */
import {html, nothing, type TemplateResult} from "lit";
import {isObject, numbers, type Json, type JsonObject} from "../base/json";
import type {Change} from "../controls/number";
import type {Form} from "../controls/transform";
import type {Row, ShaderClass} from "../session/protocol";
import {session} from "../session/session";
import "../controls/color";
import "../controls/number";
import "../controls/texture";
import "../controls/transform";

/** What nearly every material has, and what few use, come after what makes it what it is. */
const kCommonGroups = ["bump", "ambient occlusion", "masking"];

/** What numbers mean, where a row tells it: "-1 off, 0 constant, 1 UV". */
export function choicesOf(row: Row): {value: number; name: string}[] {
  if (row.type !== "int" || row.minimum === undefined || row.maximum === undefined) return [];
  const found = new Map<number, string>();
  for (const match of row.meaning.matchAll(/(?:^|[,:;] *|or )(-?\d+) ([^,;]+)/g))
    found.set(Number(match[1]), match[2]!.trim());
  const choices = [];
  for (let value = row.minimum; value <= row.maximum; ++value)
    choices.push({value, name: found.get(value) ?? ""});
  return choices.length <= 12 && found.size >= 2 ? choices : [];
}

const isColor = (row: Row) =>
  /^Vec[34]f$/.test(row.type) && /colou?r|tint|gain|light|absorption|pivot|ambient/i.test(row.name + row.meaning)
  && !/axis|position|direction|repeats/i.test(row.meaning);

function formOf(row: Row): Form {
  return row.type === "Mat4f" ? "places" : /uv|transform/i.test(row.name) ? "uv" : "directions";
}

/** Whether the shader reads the row at the values there are: all conditions hold, each for one of its
 * parameters at least. */
function isRead(row: Row, valueOf: (name: string) => Json): boolean {
  return (row.when ?? []).every((condition) => condition.parameters.some((name) => {
    const value = valueOf(name);
    if (condition.from === undefined || condition.to === undefined) return value !== null && value !== false && value !== 0;
    return Number(value) >= condition.from && Number(value) <= condition.to;
  }));
}

function control(row: Row, value: Json, edit: (event: CustomEvent<Change<Json>>) => void): TemplateResult {
  const label = row.name;
  const plain = (v: Json) => edit(new CustomEvent("edit", {detail: {value: v, group: ""}}));
  const components = {Vec2f: 2, Vec3f: 3, Vec4f: 4}[row.type];
  if (components) {
    const now = numbers(value, new Array<number>(components).fill(0));
    return isColor(row)
      ? html`<zsi-color label=${label} .value=${now} @edit=${edit}></zsi-color>`
      : html`<zsi-vector label=${label} .value=${now} @edit=${edit}></zsi-vector>`;
  }
  if (row.type.startsWith("texture"))
    return html`<zsi-texture label=${label} .value=${value} key=${row.type === "textureCube" ? "cube" : "texture"}
      @edit=${edit}></zsi-texture>`;
  if (row.type.startsWith("Mat"))
    return html`<zsi-transform label=${label} .value=${value} form=${formOf(row)} @edit=${edit}></zsi-transform>`;
  if (row.type === "bool")
    return html`<input type="checkbox" aria-label=${label} .checked=${value === true}
      @change=${(e: Event) => plain((e.target as HTMLInputElement).checked)} />`;
  const number = Number(value);
  if (row.type === "int" && row.minimum === 0 && row.maximum === 1 && (number === 0 || number === 1))
    return html`<input type="checkbox" aria-label=${label} .checked=${number === 1}
      @change=${(e: Event) => plain(Number((e.target as HTMLInputElement).checked))} />`;
  const choices = choicesOf(row);
  if (choices.length > 0)
    return html`<select aria-label=${label} @change=${(e: Event) => plain(Number((e.target as HTMLSelectElement).value))}>
      ${choices.some((c) => c.value === number) ? nothing : html`<option value=${number} selected>${number}</option>`}
      ${choices.map((c) => html`<option value=${c.value} ?selected=${c.value === number}>${c.value} ${c.name}</option>`)}
    </select>`;
  return html`<zsi-number label=${label} .value=${number} ?whole=${row.type === "int"} .minimum=${row.minimum ?? 0}
    .maximum=${row.maximum ?? Math.max(1, 2 * Math.abs(number))} .step=${row.step ?? 0} @edit=${edit}></zsi-number>`;
}

function rowTemplate(row: Row, base: string, written: JsonObject, unwritten: JsonObject, isIdle: boolean): TemplateResult {
  const isWritten = row.name in written;
  const value = written[row.name] ?? unwritten[row.name] ?? row.default;
  const path = `${base}.parameters.${row.name}`;
  return html`<div class="row ${isWritten ? "written" : ""} ${isIdle ? "idle" : ""}" data-parameter=${row.name}>
    <span class="name" title="${row.meaning}${isIdle ? " (not read at the present settings)" : ""}">${row.name}
      ${isWritten ? html`<button class="small reset" aria-label="${row.name}: the default" title="the default again"
        @click=${() => session.set(path, null)}>↺</button>` : nothing}</span>
    <span class="control">${control(row, value, (e) => session.set(path, e.detail.value, e.detail.group))}</span>
    <small>${row.meaning}</small>
  </div>`;
}

/** All of a class, or those that have `filter` in their words. `base`: such as "materials.glass". */
export function parameterRows(shader: ShaderClass, base: string, entry: Json | undefined, unwritten: JsonObject,
  filter: string): TemplateResult {
  const written = isObject(entry) && isObject(entry.parameters) ? entry.parameters : {};
  const rows = new Map(shader.parameters.map((row) => [row.name, row]));
  const valueOf = (name: string): Json => written[name] ?? unwritten[name] ?? rows.get(name)?.default ?? null;
  const words = filter.toLowerCase().split(/\s+/).filter((w) => w !== "");
  const groups = new Map<string, Row[]>();
  for (const row of shader.parameters) {
    const text = `${row.name} ${row.meaning} ${row.group ?? ""}`.toLowerCase();
    if (!words.every((w) => text.includes(w) || (w === "*" && row.name in written))) continue;
    const group = row.group ?? "";
    groups.set(group, [...(groups.get(group) ?? []), row]);
  }
  if (groups.size === 0) return html`<p class="hint">No parameter has that in its name or meaning.</p>`;
  let index = 0;
  const isCommon = ([group]: [string, Row[]]) => kCommonGroups.includes(group);
  const ordered = [...[...groups].filter((g) => !isCommon(g)), ...[...groups].filter(isCommon)];
  return html`${ordered.map(([group, members]) => {
    const isOpen = filter !== "" || members.some((row) => row.name in written) || index++ < 1;
    const count = members.filter((row) => row.name in written).length;
    return html`<details ?open=${isOpen} data-group=${group}>
      <summary>${group || "general"}${count ? html` <span class="count" title="written in the scene">${count}</span>` : nothing}</summary>
      ${members.map((row) => rowTemplate(row, base, written, unwritten, !isRead(row, valueOf)))}
    </details>`;
  })}`;
}
