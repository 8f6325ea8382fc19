// SPDX-License-Identifier: Apache-2.0
import {html, type TemplateResult} from "lit";
import {session} from "../session/session";
import {fieldRows, type Field} from "./fields";

/** The keys and defaults of docs/scene-format.md. */
const kCamera: Field[] = [
  {key: "fov", meaning: "vertical opening, degrees", type: "number", otherwise: 40, minimum: 1, maximum: 120},
  {key: "lensRadius", meaning: "0: everything is sharp", type: "number", otherwise: 0, maximum: 0.5},
  {key: "focusDistance", meaning: "0: at the target", type: "number", otherwise: 0},
  {key: "position", meaning: "where it stands", type: "point", otherwise: [0, -5, 1]},
  {key: "target", meaning: "in the middle of the picture", type: "point", otherwise: [0, 0, 0]}];

const kFilm = (): Field[] => [
  {key: "exposure", meaning: "stops", type: "number", otherwise: 0, minimum: -6, maximum: 6},
  {key: "view", meaning: "how light is shown", type: session.hello?.views ?? ["neutral"], otherwise: "neutral"},
  {key: "width", meaning: "pixels of a rendered file", type: "whole", otherwise: 640},
  {key: "height", meaning: "pixels", type: "whole", otherwise: 360}];

const kSettings = (): Field[] => [
  {key: "integrator", meaning: "the materials' own shading, or paths", type: session.hello?.integrators ?? ["shade"], otherwise: "shade"},
  {key: "samples", meaning: "per pixel, at most", type: "whole", otherwise: 64, minimum: 1, maximum: 1024},
  {key: "noise", meaning: "above 0: tiles below it get no more samples", type: "number", otherwise: 0, maximum: 0.1},
  {key: "maxDepth", meaning: "rays one after another", type: "whole", otherwise: 64, maximum: 64},
  {key: "occlusionSamples", meaning: "rays of a query at the first hit", type: "whole", otherwise: 4, minimum: 1, maximum: 32},
  {key: "indirectSamples", meaning: "rays of a query at the first hit", type: "whole", otherwise: 1, minimum: 1, maximum: 32},
  {key: "sampleClamp", meaning: "brightest that a sample may be; 0: no limit", type: "number", otherwise: 0, maximum: 20},
  {key: "ambient", meaning: "for materials that ask for it", type: "color", otherwise: [0, 0, 0]},
  {key: "seed", meaning: "of all random numbers", type: "whole", otherwise: 1}];

export function scenePanel(): TemplateResult {
  return html`
    <details open><summary>camera</summary>${fieldRows("camera", kCamera)}</details>
    <details open><summary>film</summary>${fieldRows("film", kFilm())}</details>
    <details open><summary>settings</summary>${fieldRows("settings", kSettings())}</details>`;
}
