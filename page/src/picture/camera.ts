// SPDX-License-Identifier: Apache-2.0
import {numbers, valueAt, type JsonObject} from "../base/json";
import {add, cross, dot, length, normalize, scale, subtract, turned, type Vec3} from "../base/vector";
import type {Edit} from "../session/protocol";

/** A scene's camera; what it does not write has the defaults of docs/scene-format.md. */
export interface Camera {
  position: Vec3;
  target: Vec3;
  up: Vec3;
  fov: number; // vertical, degrees
}

const kSteepest = 0.999; // sine of the angle to the level plane
const kFullTurn = 2 * Math.PI;

export function cameraOf(document: JsonObject): Camera {
  const vector = (key: string, otherwise: Vec3) =>
    numbers(valueAt(document, `camera.${key}`), otherwise) as Vec3;
  const fov = valueAt(document, "camera.fov");
  return {
    position: vector("position", [0, -5, 1]),
    target: vector("target", [0, 0, 0]),
    up: normalize(vector("up", [0, 0, 1])),
    fov: typeof fov === "number" ? fov : 40,
  };
}

export function cameraEdits(camera: Camera): Edit[] {
  const written = (v: Vec3) => v.map((x) => Number(x.toFixed(5)));
  return [
    {path: "camera.position", value: written(camera.position)},
    {path: "camera.target", value: written(camera.target)},
  ];
}

function rightOf(camera: Camera): Vec3 {
  return normalize(cross(subtract(camera.target, camera.position), camera.up));
}

/** Around the target; in heights of the picture, a whole one being half a turn. */
export function orbited(camera: Camera, dx: number, dy: number): Camera {
  const right = rightOf(camera);
  const from = subtract(camera.position, camera.target);
  let way = turned(from, right, (-dy * kFullTurn) / 2);
  if (Math.abs(dot(normalize(way), camera.up)) > kSteepest) way = from;
  return {...camera, position: add(camera.target, turned(way, camera.up, (-dx * kFullTurn) / 2))};
}

/** So that what is at the target's distance follows the pointer; in heights of the picture. */
export function panned(camera: Camera, dx: number, dy: number): Camera {
  const right = rightOf(camera);
  const view = subtract(camera.target, camera.position);
  const above = normalize(cross(right, view));
  const height = 2 * length(view) * Math.tan((camera.fov * Math.PI) / 360);
  const by = add(scale(right, -dx * height), scale(above, dy * height));
  return {...camera, position: add(camera.position, by), target: add(camera.target, by)};
}

/** To `factor` times the distance. */
export function dollied(camera: Camera, factor: number): Camera {
  const from = scale(subtract(camera.position, camera.target), factor);
  return length(from) > 1e-4 ? {...camera, position: add(camera.target, from)} : camera;
}

/** Along the direction of view: what focusDistance counts. */
export function depthOf(camera: Camera, point: Vec3): number {
  const view = normalize(subtract(camera.target, camera.position));
  return dot(subtract(point, camera.position), view);
}
