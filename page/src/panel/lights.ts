// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {isObject, type JsonObject} from "../base/json";
import {session} from "../session/session";
import {classChooser, classRows} from "./entry";
import {fieldRows, type Field} from "./fields";

const kPlace: Field[] = [
  {key: "position", meaning: "where it is", type: "point", otherwise: [0, 0, 0]},
  {key: "target", meaning: "the point it shines at", type: "point", otherwise: [0, 0, 0]}];
const kRadius: Field = {key: "radius", meaning: "above 0: a ball, for soft shadows", type: "number", otherwise: 0, maximum: 2};
const kColor: Field = {key: "color", meaning: "linear; what arrives at distance 1", type: "color", otherwise: [1, 1, 1]};
const kEmission: Field = {key: "emission", meaning: "radiance, linear: what the camera sees of it", type: "color", otherwise: [1, 1, 1]};

/** Lights of the program's own, by `kind` (docs/scene-format.md). */
const kKinds: Record<string, Field[]> = {
  point: [kColor, kPlace[0]!, kRadius],
  spot: [kColor, ...kPlace,
    {key: "angle", meaning: "of the cone, degrees across", type: "number", otherwise: 45, maximum: 180},
    {key: "innerAngle", meaning: "full within it, degrees", type: "number", otherwise: 45, maximum: 180}, kRadius],
  sun: [{...kColor, meaning: "linear; what arrives"},
    {key: "direction", meaning: "towards it", type: "point", otherwise: [0, 0, 1]},
    {key: "angle", meaning: "width, degrees", type: "number", otherwise: 0.53, maximum: 20}],
  rectangle: [kEmission, ...kPlace, {key: "size", meaning: "width and height", type: "pair", otherwise: [1, 1]}],
  disc: [kEmission, ...kPlace, {...kRadius, meaning: "of the disc", otherwise: 1, maximum: 5}],
  mesh: [kEmission],
};

/** Stands where the light before stood, as far as that can be told. */
function fresh(kind: string, before: JsonObject): JsonObject {
  const place = {position: before.position ?? [0, -3, 4], target: before.target ?? [0, 0, 0]};
  const rest: Record<string, JsonObject> = {
    point: {position: place.position, color: [10, 10, 10]},
    spot: {...place, color: [20, 20, 20], angle: 40},
    sun: {direction: [1, -1, 2], color: [2, 2, 2]},
    rectangle: {...place, emission: [5, 5, 5], size: [1, 1]},
    disc: {...place, emission: [5, 5, 5], radius: 0.5},
  };
  return {kind, ...rest[kind]};
}

export function addLight(): void {
  const lights = session.valueAt("lights");
  const taken = isObject(lights) ? lights : {};
  let name = "light";
  for (let i = 2; name in taken; ++i) name = `light${i}`;
  session.set(`lights.${name}`, fresh("rectangle", {}));
  session.select({section: "lights", name});
}

export function lightPanel(name: string, filter: string): TemplateResult {
  const path = `lights.${name}`;
  const entry = session.valueAt(path);
  if (!isObject(entry)) return html`<p class="hint">The scene has no lights of its own.</p>
    <button @click=${addLight}>Add a light</button>`;
  const {class: className, parameters: _, kind, ...rest} = entry;
  const now = typeof kind === "string" ? kind : typeof className === "string" ? className : "";
  const others = Object.keys(kKinds).filter((k) => k !== "mesh" || k === now).map((k) => ({name: k, value: fresh(k, entry)}));
  const placed = Object.fromEntries(Object.entries(rest).filter(([key]) => ["position", "target", "axis", "radius"].includes(key)));
  return html`
    ${classChooser("light", path, now, placed, others)}
    ${typeof kind === "string" ? fieldRows(path, kKinds[kind] ?? []) : nothing}
    ${typeof className === "string" ? html`
      ${fieldRows(path, [...kPlace, kRadius])}
      ${classRows(path, {}, filter)}` : nothing}
    <div class="line"><button @click=${addLight}>Add a light</button>
      <button @click=${() => session.set(path, null)}>Remove this one</button></div>`;
}
