// SPDX-License-Identifier: Apache-2.0
/** A scene's JSON, and places in it by paths such as "materials.glass.parameters.u_ior". */

export type Json = null | boolean | number | string | Json[] | {[key: string]: Json};
export type JsonObject = {[key: string]: Json};

export function isObject(value: Json | undefined): value is JsonObject {
  return typeof value === "object" && value !== null && !Array.isArray(value);
}

/** Names may have points in them: at each step the longest key that fits. */
function nextKey(object: JsonObject, rest: string): string {
  let best = "";
  for (const key of Object.keys(object))
    if (key.length > best.length && (rest === key || rest.startsWith(key + "."))) best = key;
  return best || (rest.split(".", 1)[0] ?? "");
}

export function valueAt(root: Json, path: string): Json | undefined {
  let at: Json | undefined = root;
  for (let rest = path; rest !== ""; ) {
    if (!isObject(at)) return undefined;
    const key = nextKey(at, rest);
    at = at[key];
    rest = rest.slice(key.length + 1);
  }
  return at;
}

/** Puts `value` there; null takes out what is there. Objects on the way are made. */
export function setAt(root: JsonObject, path: string, value: Json): void {
  let at = root;
  for (let rest = path; ; ) {
    const key = nextKey(at, rest);
    rest = rest.slice(key.length + 1);
    if (rest === "") {
      if (value === null) delete at[key];
      else at[key] = value;
      return;
    }
    const next = at[key];
    at = isObject(next) ? next : (at[key] = {});
  }
}

export function numbers(value: Json | undefined, otherwise: readonly number[]): number[] {
  return Array.isArray(value) && value.every((v) => typeof v === "number")
    ? (value as number[]).slice()
    : otherwise.slice();
}
