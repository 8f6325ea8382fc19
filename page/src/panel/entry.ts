// SPDX-License-Identifier: Apache-2.0
/** A thing of the scene that is made of a class: which one, and its parameters. */
import {html, nothing, type TemplateResult} from "lit";
import {keyed} from "lit/directives/keyed.js";
import {isObject, type Json, type JsonObject} from "../base/json";
import {address} from "../session/connection";
import type {ClassSummary, ShaderClass} from "../session/protocol";
import {session} from "../session/session";
import {parameterRows} from "./rows";

/** Another class in place of one; what both have under one name and type is kept. */
async function changeClass(path: string, to: string, rest: JsonObject): Promise<void> {
  const before = session.valueAt(path);
  const response = await fetch(address("class", {name: to}));
  if (!response.ok) return;
  const next = (await response.json()) as ShaderClass;
  const old = isObject(before) && typeof before.class === "string" ? session.shaderClass(before.class) : undefined;
  const written = isObject(before) && isObject(before.parameters) ? before.parameters : {};
  const types = new Map(old?.parameters.map((row) => [row.name, row.type]));
  const kept = Object.fromEntries(next.parameters
    .filter((row) => row.name in written && types.get(row.name) === row.type)
    .map((row) => [row.name, written[row.name]!]));
  session.set(path, {...rest, class: to, parameters: kept});
}

/** `rest`: keys beside class and parameters that a change of class leaves. */
export function classChooser(kind: ClassSummary["kind"], path: string, now: string, rest: JsonObject,
  others: {name: string; value: Json}[] = []): TemplateResult {
  const classes = session.hello?.classes.filter((c) => c.kind === kind) ?? [];
  const choose = (to: string) => {
    const other = others.find((o) => o.name === to);
    if (other) session.set(path, other.value);
    else void changeClass(path, to, rest);
  };
  return html`<label class="class"><span>class</span>
    <select data-control="class" @change=${(e: Event) => choose((e.target as HTMLSelectElement).value)}>
      ${others.map((o) => html`<option ?selected=${o.name === now}>${o.name}</option>`)}
      ${classes.map((c) => html`<option ?selected=${c.name === now} title=${c.summary}>${c.name}</option>`)}
    </select></label>
    ${classes.filter((c) => c.name === now).map((c) => html`<p class="summary">${c.summary}</p>`)}`;
}

export function classRows(path: string, unwritten: JsonObject, filter: string): TemplateResult {
  const entry = session.valueAt(path);
  const name = isObject(entry) && typeof entry.class === "string" ? entry.class : "";
  const shader = session.shaderClass(name);
  if (!shader) return html`${name ? html`<p class="hint">…</p>` : nothing}`;
  // A class of its own has elements of its own: which groups are open is not passed on.
  return html`${keyed(`${path} ${name}`, html`<div>${parameterRows(shader, path, entry, unwritten, filter)}</div>`)}`;
}
