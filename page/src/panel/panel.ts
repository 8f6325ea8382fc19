// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, state} from "lit/decorators.js";
import {isObject, type Json} from "../base/json";
import {SessionElement} from "../session/element";
import {session, type Selection} from "../session/session";
import {classChooser, classRows} from "./entry";
import {environmentPanel} from "./environment";
import {lightPanel} from "./lights";
import {scenePanel} from "./scene";
import "./lab";

type Tab = Selection["section"];
const kTabs: {tab: Tab; title: string}[] = [
  {tab: "materials", title: "Materials"}, {tab: "lights", title: "Lights"},
  {tab: "environment", title: "Environment"}, {tab: "scene", title: "Scene"}];

/** Files that the document names, for slots to offer. */
function filesOf(value: Json, found: Set<string>): Set<string> {
  if (typeof value === "string" && /\.(png|jpe?g|exr|hdr|tiff?)$/i.test(value)) found.add(value);
  else if (Array.isArray(value)) value.forEach((v) => filesOf(v, found));
  else if (isObject(value)) Object.values(value).forEach((v) => filesOf(v, found));
  return found;
}

/** Everything that can be set of what is selected. */
@customElement("zsi-panel")
export class Panel extends SessionElement {
  @state() private filter = "";

  private namesOf(tab: Tab): string[] {
    const section = session.document[tab];
    return (tab === "materials" || tab === "lights") && isObject(section) ? Object.keys(section) : [];
  }

  private open(tab: Tab): void {
    if (tab !== session.selection.section) session.select({section: tab, name: this.namesOf(tab)[0] ?? ""});
  }

  private tabKey(event: KeyboardEvent): void {
    const by = event.key === "ArrowRight" ? 1 : event.key === "ArrowLeft" ? -1 : 0;
    if (by === 0) return;
    event.preventDefault();
    const at = kTabs.findIndex((t) => t.tab === session.selection.section);
    const {tab} = kTabs[(at + by + kTabs.length) % kTabs.length]!;
    this.open(tab);
    this.querySelector<HTMLElement>(`#tab-${tab}`)?.focus();
  }

  private content(): TemplateResult {
    const {section} = session.selection;
    const names = this.namesOf(section);
    const name = names.includes(session.selection.name) ? session.selection.name : names[0] ?? "";
    if (section === "environment") return environmentPanel(this.filter);
    if (section === "scene") return scenePanel();
    if (section === "lights") return lightPanel(name, this.filter);
    const material = session.materials.find((m) => m.name === name);
    if (!material) return html`<p class="hint">Nothing is selected. Click on the picture.</p>`;
    return html`${classChooser("material", `materials.${name}`, material.class, {})}
      ${classRows(`materials.${name}`, material.unwritten, this.filter)}
      <zsi-lab name=${name}></zsi-lab>`;
  }

  override render(): TemplateResult {
    const {section, name} = session.selection;
    const names = this.namesOf(section);
    return html`
      <div role="tablist" aria-label="Parts of the scene" class="tabs" @keydown=${(e: KeyboardEvent) => this.tabKey(e)}>
        ${kTabs.map(({tab, title}) => html`<button role="tab" id="tab-${tab}" aria-selected=${tab === section}
          aria-controls="panel" tabindex=${tab === section ? 0 : -1} @click=${() => this.open(tab)}>${title}</button>`)}
      </div>
      <div role="tabpanel" id="panel" class="panel" aria-labelledby="tab-${section}">
        ${names.length > 0 ? html`<label class="class"><span>${section === "lights" ? "light" : "material"}</span>
          <select data-control="name" @change=${(e: Event) => session.select({section, name: (e.target as HTMLSelectElement).value})}>
            ${names.map((n) => html`<option ?selected=${n === name}>${n}</option>`)}</select></label>` : nothing}
        ${section === "scene" ? nothing : html`<input type="search" id="filter" placeholder="Find a parameter  ( / )"
          aria-label="Find a parameter by its name or meaning" .value=${this.filter}
          @input=${(e: Event) => (this.filter = (e.target as HTMLInputElement).value)} />`}
        ${this.content()}
        <datalist id="scene-files">${[...filesOf(session.document, new Set())].map((f) => html`<option value=${f}></option>`)}</datalist>
      </div>`;
  }
}
