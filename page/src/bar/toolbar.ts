// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, property} from "lit/decorators.js";
import type {PictureElement} from "../picture/picture";
import {SessionElement} from "../session/element";
import {session} from "../session/session";
import {icon} from "./icons";

/** What can be done with the whole scene and its picture. */
@customElement("zsi-toolbar")
export class Toolbar extends SessionElement {
  @property({attribute: false}) picture?: PictureElement;
  @property({attribute: false}) openSaving: () => void = () => undefined;
  @property({attribute: false}) openHelp: () => void = () => undefined;

  private button(name: Parameters<typeof icon>[0], label: string, run: () => void,
    {pressed, disabled = false, text = ""}: {pressed?: boolean; disabled?: boolean; text?: string} = {}): TemplateResult {
    return html`<button class="tool" data-tool=${name} aria-label=${label} title=${label} ?disabled=${disabled}
      aria-pressed=${pressed ?? nothing} @click=${run}>${icon(name)}${text ? html`<span class="text">${text}</span>` : nothing}</button>`;
  }

  private states(): TemplateResult {
    const slot = (name: "a" | "b") => {
      const letter = name.toUpperCase(), samples = session.kept.get(name);
      return html`<button class="tool" data-tool="keep-${name}" aria-label="Keep what is there as state ${letter}"
          title="Keep the scene and its picture as ${letter}${samples ? ` (kept, ${samples} samples)` : ""}"
          ?data-kept=${samples !== undefined} @click=${() => session.keep(name)}>${letter}</button>
        <button class="tool slim" data-tool="restore-${name}" aria-label="Back to state ${letter}"
          title="Back to ${letter}" ?disabled=${samples === undefined} @click=${() => session.restore(name)}>↩</button>`;
    };
    return html`<div class="tools" role="group" aria-label="Two states">
      ${slot("a")}${slot("b")}
      ${this.button("compare", "Compare A with B, or with now (C)", () => session.compare(),
        {disabled: session.kept.size === 0, text: "Compare"})}
    </div>`;
  }

  override render(): TemplateResult {
    const {hello, undoLabel, redoLabel, frame} = session;
    const isPaused = frame?.state === "paused";
    const {picture} = this;
    return html`
      <h1>${hello?.scene ?? "zsi view"}</h1>
      <div class="tools" role="group" aria-label="Steps">
        ${this.button("undo", `Undo${undoLabel ? " " + undoLabel : ""} (Ctrl+Z)`, () => session.undo(), {disabled: !undoLabel})}
        ${this.button("redo", `Redo${redoLabel ? " " + redoLabel : ""} (Ctrl+Shift+Z)`, () => session.redo(), {disabled: !redoLabel})}
      </div>
      <div class="tools" role="group" aria-label="Picture">
        ${this.button("focus", "The next click sets the focus (F)", () => picture?.toggleFocus(),
          {pressed: picture?.tool === "focus"})}
        ${this.button("inspect", "Show values of the pixel below the pointer (I)", () => picture?.toggleInspecting(),
          {pressed: picture?.isInspecting ?? false})}
        ${this.button("denoise", "Denoise the picture (D)", () => session.setDenoise(!session.denoise), {pressed: session.denoise})}
        ${this.button(isPaused ? "play" : "pause", isPaused ? "Go on (P)" : "Pause (P)", () => session.pause(!isPaused), {pressed: isPaused})}
        <select aria-label="Layer" title="Layer (L: the next one)" data-tool="layer"
          @change=${(e: Event) => session.showLayer((e.target as HTMLSelectElement).value)}>
          ${(hello?.layers ?? ["beauty"]).map((name) => html`<option ?selected=${name === session.layer}>${name}</option>`)}
        </select>
      </div>
      ${this.states()}
      <div class="tools end">
        ${this.button("save", "Save the scene, the picture, a turntable (Ctrl+S)", this.openSaving, {text: "Save"})}
        ${this.button("help", "Keys and mouse (?)", this.openHelp)}
      </div>`;
  }
}
