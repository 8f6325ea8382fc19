// SPDX-License-Identifier: Apache-2.0
/** Linear Rec. 709 as scenes have it, sRGB (IEC 61966-2-1) as screens and pickers have it. */

export function toSrgb(linear: number): number {
  const v = Math.min(1, Math.max(0, linear));
  return v <= 0.0031308 ? 12.92 * v : 1.055 * v ** (1 / 2.4) - 0.055;
}

export function toLinear(srgb: number): number {
  return srgb <= 0.04045 ? srgb / 12.92 : ((srgb + 0.055) / 1.055) ** 2.4;
}

/** "#rrggbb"; what is brighter than 1 keeps its hue. */
export function toHex(linear: readonly number[]): string {
  const by = Math.max(1, ...linear);
  return "#" + linear.slice(0, 3)
    .map((v) => Math.round(255 * toSrgb(v / by)).toString(16).padStart(2, "0")).join("");
}

/** Linear, of "#rrggbb"; to four digits, as people would write it. */
export function fromHex(hex: string): number[] {
  return [1, 3, 5].map((at) => rounded(toLinear(parseInt(hex.slice(at, at + 2), 16) / 255)));
}

/** To four significant digits. */
export function rounded(v: number): number {
  return Number(v.toPrecision(4));
}
