// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, property, state} from "lit/decorators.js";
import {isObject} from "../base/json";
import {address} from "../session/connection";
import {SessionElement} from "../session/element";
import {session} from "../session/session";

interface Density {
  chiSquare?: number;
  degreesOfFreedom?: number;
  pValue?: number;
}

interface Measured {
  figures: Record<string, string>; // SVG documents
  density?: Density | Density[];
  tableError?: {unit: string; pairs: {material: string; table: string; rms: number; meanRelative: number}[]};
}

const kTitles: Record<string, string> = {
  "lobe-polar": "lobe, polar", lobe: "lobe", slice: "slice over half and difference angle", albedo: "albedo over angle",
  density: "density of sample", "density-deviation": "deviation of the density", reciprocity: "reciprocity",
  light: "one light: shade beside transfer"};
const kRest = 400; // milliseconds after an edit before it is measured again

/** What the material does to light, measured by the server: open, it follows the edits. Another
 * material and a measured one may be laid over it. */
@customElement("zsi-lab")
export class Lab extends SessionElement {
  @property() name = "";
  @state() private beside = "";
  @state() private table = "";
  @state() private measured?: Measured;
  @state() private trouble = "";
  private isOpen = false;
  private measuredAt = ""; // name and parameters
  private timer = 0;

  override connectedCallback(): void {
    super.connectedCallback();
    this.listen("change", () => this.follow());
  }

  private get materials(): string[] {
    return this.others.includes(this.beside) ? [this.name, this.beside] : [this.name];
  }

  private get others(): string[] {
    const all = session.valueAt("materials");
    return isObject(all) ? Object.keys(all).filter((name) => name !== this.name) : [];
  }

  private toggled(event: Event): void {
    this.isOpen = (event.target as HTMLDetailsElement).open;
    this.follow();
  }

  private follow(): void {
    const now = JSON.stringify([this.table, ...this.materials.map((name) => [name, session.valueAt(`materials.${name}`)])]);
    if (!this.isOpen || now === this.measuredAt) return;
    this.measuredAt = now;
    window.clearTimeout(this.timer);
    this.timer = window.setTimeout(() => void this.measure(now), kRest);
  }

  private async measure(at: string): Promise<void> {
    try {
      const response = await fetch(address("lab", {material: this.materials, merl: this.table ? [this.table] : []}));
      if (at !== this.measuredAt) return; // edited meanwhile
      this.trouble = response.ok ? "" : await response.text();
      this.measured = response.ok ? ((await response.json()) as Measured) : undefined;
    } catch {
      this.measuredAt = ""; // the connection tells of it
    }
  }

  private verdict(name: string): TemplateResult {
    const {density} = this.measured ?? {};
    const first = Array.isArray(density) ? density[0] : density;
    if (name !== "density" || first?.chiSquare === undefined || first.pValue === undefined) return html`${nothing}`;
    return html` – χ² ${first.chiSquare.toFixed(1)} of ${first.degreesOfFreedom ?? "?"}, p ${first.pValue.toPrecision(2)}`;
  }

  override updated(): void {
    this.follow();
  }

  override render(): TemplateResult {
    const figures = this.measured?.figures ?? {};
    const names = [...Object.keys(kTitles).filter((n) => n in figures), ...Object.keys(figures).filter((n) => !(n in kTitles))];
    return html`<details class="lab" @toggle=${(e: Event) => this.toggled(e)}><summary>lab: what it does to light</summary>
      <div class="line">
        <label>beside <select data-control="beside" @change=${(e: Event) => (this.beside = (e.target as HTMLSelectElement).value)}>
          <option value="">nothing</option>
          ${this.others.map((name) => html`<option ?selected=${name === this.beside}>${name}</option>`)}</select></label>
        <label>measured <input type="text" data-control="merl" placeholder="MERL file in the scene's folder" spellcheck="false"
          @change=${(e: Event) => (this.table = (e.target as HTMLInputElement).value.trim())} /></label></div>
      ${this.trouble ? html`<p class="hint">${this.trouble}</p>` : nothing}
      ${this.measured || this.trouble ? nothing : html`<p class="hint" role="status">measuring…</p>`}
      ${this.measured?.tableError?.pairs.map((pair) => html`<p class="hint" data-error=${pair.material}>${pair.material} to
        ${pair.table}: RMS ${pair.rms.toPrecision(3)}, mean ${(100 * pair.meanRelative).toPrecision(3)} %</p>`) ?? nothing}
      ${names.map((name) => html`<figure data-figure=${name}><figcaption>${kTitles[name] ?? name}${this.verdict(name)}</figcaption>
        <img alt="Plot of ${this.name}: ${kTitles[name] ?? name}"
          src="data:image/svg+xml;charset=utf-8,${encodeURIComponent(figures[name] ?? "")}" /></figure>`)}
    </details>`;
  }
}
