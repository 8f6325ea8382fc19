// SPDX-License-Identifier: Apache-2.0
/** What `zsi view` and its pages say to each other; docs/view.md tells it in words. */
import type {Json, JsonObject} from "../base/json";

export interface ClassSummary {
  name: string;
  kind: "material" | "light" | "environment";
  summary: string;
}

export interface Condition {
  parameters: string[];
  from?: number;
  to?: number;
}

/** A parameter of a class, as `zsi info CLASS --json` has it. */
export interface Row {
  name: string;
  type: string;
  hasDefault: boolean;
  default: Json;
  meaning: string;
  group?: string;
  minimum?: number;
  maximum?: number;
  step?: number;
  when?: Condition[];
  objectSize?: number;
}

export interface ShaderClass extends ClassSummary {
  description: string;
  parameters: Row[];
}

export interface SceneMaterial {
  name: string;
  class: string;
  /** What the loader has filled in, where the scene says nothing. */
  unwritten: JsonObject;
}

export interface Hello {
  version: string;
  scene: string;
  classes: ClassSummary[];
  layers: string[];
  views: string[];
  integrators: string[];
  canSave: boolean;
}

export interface Frame {
  generation: number;
  width: number;
  height: number;
  samples: number;
  target: number;
  noise: number | null;
  seconds: number;
  state: "rendering" | "done" | "paused";
  raysPerSecond: number;
}

export interface Picked {
  id: Json;
  material: string | null;
  light?: string;
  object?: string;
  instance?: string;
  position?: [number, number, number];
  distance?: number;
}

export interface Values {
  id: Json;
  x: number;
  y: number;
  layers: Record<string, (number | string)[]>;
  shown: number[];
  samples: number;
}

export interface Comparison {
  id: Json;
  rmse: number;
  flip: number;
  max: number;
}

export interface Edit {
  path: string;
  value: Json;
}

/** A part of a picture. Kinds: 0 as rendered, 1 denoised, 2 and 3 the two of a comparison, 4 their
 * difference. */
export interface Tile {
  generation: number;
  x: number;
  y: number;
  width: number;
  height: number;
  frameWidth: number;
  frameHeight: number;
  samples: number;
  kind: number;
  isPng: boolean;
  payload: Uint8Array;
}

const kMagic = 0x4c49545a, kHeader = 32;

export function parseTile(data: ArrayBuffer): Tile | undefined {
  if (data.byteLength < kHeader) return undefined;
  const view = new DataView(data);
  const size = view.getUint32(28, true);
  if (view.getUint32(0, true) !== kMagic || size !== data.byteLength - kHeader) return undefined;
  const short = (at: number) => view.getUint16(at, true);
  return {
    generation: view.getUint32(4, true),
    x: short(8), y: short(10), width: short(12), height: short(14),
    frameWidth: short(16), frameHeight: short(18),
    samples: view.getUint32(20, true),
    kind: view.getUint8(24),
    isPng: view.getUint8(25) === 1,
    payload: new Uint8Array(data, kHeader, size),
  };
}
