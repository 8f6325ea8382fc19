// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, property} from "lit/decorators.js";
import {styles} from "../base/styles";
import {SessionElement} from "../session/element";
import {session} from "../session/session";

/** To four digits; what is no number comes as its name. */
function text(value: number | string): string {
  return typeof value === "number" ? String(Number(value.toPrecision(4))) : value;
}

/** How far the picture is; below it the values of the pixel that is looked at. */
@customElement("zsi-status")
export class Status extends SessionElement {
  @property({type: Boolean}) inspecting = false;

  private values(): TemplateResult {
    const {values} = session;
    if (!values) return html`<p class="values">Point at the picture to see its values.</p>`;
    const [r, g, b] = values.shown;
    return html`<div class="values" aria-label="Values of a pixel">
      <span class="swatch" ${styles({"background-color": `rgb(${r}, ${g}, ${b})`})}></span>
      <span class="pair"><b>pixel</b> ${values.x}, ${values.y}</span>
      <span class="pair"><b>shown</b> ${values.shown.join(" ")}</span>
      ${Object.entries(values.layers).map(([name, numbers]) => html`<span class="pair" data-layer=${name}>
        <b>${name}</b> ${numbers.map(text).join(" ")}</span>`)}
      <span class="pair"><b>samples</b> ${values.samples}</span>
    </div>`;
  }

  override render(): TemplateResult {
    const {frame, warnings} = session;
    const done = frame ? Math.min(1, frame.samples / Math.max(1, frame.target)) : 0;
    return html`
      ${this.inspecting ? this.values() : nothing}
      <div class="facts">
        <div class="progress" role="progressbar" aria-label="Samples of the picture" aria-valuemin="0" aria-valuemax="100"
          aria-valuenow=${Math.round(100 * done)}><i ${styles({transform: `scaleX(${done})`})}></i></div>
        ${frame ? html`
          <span>${frame.width} × ${frame.height}</span>
          <span data-fact="samples">${frame.samples} / ${frame.target} samples</span>
          <span class="wide">${frame.seconds.toFixed(1)} s</span>
          ${frame.noise === null ? nothing : html`<span class="wide" title="of the picture, relative">noise ${frame.noise.toPrecision(2)}</span>`}
          <span class="wide">${(frame.raysPerSecond / 1e6).toFixed(1)} M rays/s</span>
          <span data-fact="state">${frame.state}</span>` : html`<span>waiting for the first picture…</span>`}
        ${warnings.length > 0 ? html`<details class="warnings"><summary>${warnings.length}
          ${warnings.length === 1 ? "warning" : "warnings"}</summary><ul>${warnings.map((w) => html`<li>${w}</li>`)}</ul></details>` : nothing}
        <span class="grow"></span>
        <span class=${session.isConnected ? "link on" : "link off"}>${session.isConnected ? "connected" : "not connected"}</span>
      </div>`;
  }
}
