// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {isObject, type Json} from "../base/json";
import type {Change} from "../controls/number";
import {session} from "../session/session";
import {classChooser, classRows} from "./entry";
import {fieldRows} from "./fields";
import "../controls/texture";

const kMatrix = "globalIBLMatrix"; // of the classes that turn

/** Degrees around z; undefined where the scene turns it in another way. */
function turnOf(matrix: Json | undefined): number | undefined {
  if (matrix === undefined) return 0;
  if (!isObject(matrix) || matrix.scale !== undefined) return undefined;
  const turn = matrix.rotate;
  if (turn === undefined) return 0;
  return Array.isArray(turn) && turn.length === 4 && turn[0] === 0 && turn[1] === 0 && turn[2] === 1 ? Number(turn[3]) : undefined;
}

/** Turns are sliders of a whole turn, whichever way the scene writes them. */
function rotation(path: string, angle: number, write: (degrees: number) => Json): TemplateResult {
  return html`<div class="row" data-parameter="environment.rotation">
    <span class="name">rotation</span>
    <span class="control"><zsi-number label="rotation of the environment" .value=${angle} .minimum=${-180} .maximum=${180}
      @edit=${(e: CustomEvent<Change<number | null>>) => session.set(path, e.detail.value === null ? null : write(e.detail.value), e.detail.group)}></zsi-number></span>
    <small>degrees around the vertical</small></div>`;
}

export function environmentPanel(filter: string): TemplateResult {
  const entry = session.valueAt("environment");
  const isFile = isObject(entry) && entry.file !== undefined;
  const className = isObject(entry) && typeof entry.class === "string" ? entry.class : "";
  const none = {name: "none", value: null};
  const shader = session.shaderClass(className);
  const turn = turnOf(session.valueAt(`environment.parameters.${kMatrix}`));
  const turns = shader?.parameters.some((row) => row.name === kMatrix) && turn !== undefined;
  return html`
    ${classChooser("environment", "environment", className || (isFile ? "a picture" : none.name),
      isObject(entry) && entry.visible !== undefined ? {visible: entry.visible} : {},
      isFile ? [none, {name: "a picture", value: entry}] : [none])}
    <div class="row" data-parameter="environment.file"><span class="name">picture</span><span class="control">
      <zsi-texture label="picture around the scene" key="file" .value=${isFile ? entry : null}
        @edit=${(e: CustomEvent<Change<Json>>) => session.set("environment", e.detail.value)}></zsi-texture></span>
      <small>${className ? "around the scene, in place of the class" : "around the scene, by latitude and longitude"}</small></div>
    ${fieldRows("film", [{key: "exposure", meaning: "stops, of what is shown and of 8-bit files", type: "number", otherwise: 0,
      minimum: -6, maximum: 6}])}
    ${turns ? rotation(`environment.parameters.${kMatrix}`, turn, (v) => ({rotate: [0, 0, 1, v]})) : nothing}
    ${isFile ? html`
      ${rotation("environment.rotate", Number(entry.rotate ?? 0), (v) => v)}
      ${fieldRows("environment", [
        {key: "intensity", meaning: "factor", type: Array.isArray(entry.intensity) ? "color" : "number", otherwise: 1, maximum: 4},
        {key: "diffuseBlur", meaning: "degrees, against the noise of small lamps", type: "number", otherwise: 0, maximum: 90},
        {key: "background", meaning: "what the camera sees where the picture is not visible", type: "color", otherwise: [0, 0, 0]}])}` : nothing}
    ${entry === undefined ? nothing : fieldRows("environment", [
      {key: "visible", meaning: "the camera sees it", type: "bool", otherwise: isFile}])}
    ${classRows("environment", {}, filter)}`;
}
