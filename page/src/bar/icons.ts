// SPDX-License-Identifier: Apache-2.0
import {html, type TemplateResult} from "lit";

/** Strokes on a field of 16 x 16. */
const kPaths = {
  undo: "M6 3 2.5 6.5 6 10M3 6.5h6.5a4 4 0 0 1 0 8H7",
  redo: "m10 3 3.5 3.5L10 10M13 6.5H6.5a4 4 0 0 0 0 8H9",
  focus: "M2 5V2h3M11 2h3v3M14 11v3h-3M5 14H2v-3M8 6a2 2 0 1 0 0 4 2 2 0 0 0 0-4",
  inspect: "m9.5 4.5 2 2M13.3 2.7a1.8 1.8 0 0 0-2.6 0L9 4.4 11.6 7l1.7-1.7a1.8 1.8 0 0 0 0-2.6M10 5.5l-6.5 6.5-1 2 2-1L11 6.5",
  pause: "M5 3v10M11 3v10",
  play: "M4.5 2.5v11l9-5.5z",
  compare: "M8 1v14M2 4h4M2 8h4M2 12h4M10 3h4v10h-4",
  denoise: "M2 11c2-6 4-6 6-3s4 3 6-3M2 14h12",
  save: "M8 2v8M4.5 7 8 10.5 11.5 7M2 13.5h12",
  help: "M5.5 5.5a2.5 2.5 0 1 1 3.6 2.2c-.8.4-1.1.9-1.1 1.8M8 12.4v.2",
} as const;

export function icon(name: keyof typeof kPaths): TemplateResult {
  return html`<svg class="icon" viewBox="0 0 16 16" aria-hidden="true"><path d=${kPaths[name]}></path></svg>`;
}
