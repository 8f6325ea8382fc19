// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, query, state} from "lit/decorators.js";
import {helpDialog} from "./bar/help";
import type {Saving} from "./bar/saving";
import type {Toolbar} from "./bar/toolbar";
import {listenForKeys, type Shortcut} from "./keys";
import type {PictureElement} from "./picture/picture";
import {SessionElement} from "./session/element";
import {session} from "./session/session";
import "./bar/saving";
import "./bar/status";
import "./bar/toolbar";
import "./panel/panel";
import "./picture/picture";

const kErrorTime = 8000; // milliseconds

/** The page: bar, picture, panel, status. */
@customElement("zsi-app")
export class App extends SessionElement {
  @state() private error = "";
  @query("zsi-picture") private picture!: PictureElement;
  @query("zsi-toolbar") private toolbar!: Toolbar;
  @query("zsi-saving") private saving!: Saving;
  private errorTimer = 0;

  private readonly shortcuts: Shortcut[] = [
    {keys: "Ctrl+Z", does: "undo", run: () => session.undo()},
    {keys: "Ctrl+Shift+Z, Ctrl+Y", does: "redo", run: () => session.redo()},
    {keys: "Ctrl+S", does: "save the scene, the picture, a turntable", run: () => this.saving.open()},
    {keys: "F", does: "the next click sets the focus", run: () => this.picture.toggleFocus()},
    {keys: "I", does: "values of the pixel below the pointer", run: () => this.picture.toggleInspecting()},
    {keys: "Z", does: "pixels twice as large, around the pointer", run: () => this.picture.enlarge()},
    {keys: "Shift+Z", does: "the whole picture", run: () => this.picture.wholePicture()},
    {keys: "D", does: "denoise", run: () => session.setDenoise(!session.denoise)},
    {keys: "P", does: "pause, go on", run: () => session.pause(session.frame?.state !== "paused")},
    {keys: "L", does: "the next layer", run: () => this.nextLayer(1)},
    {keys: "Shift+L", does: "the layer before", run: () => this.nextLayer(-1)},
    {keys: "A", does: "keep as state A", run: () => session.keep("a")},
    {keys: "B", does: "keep as state B", run: () => session.keep("b")},
    {keys: "C", does: "compare A with B, or with now", run: () => this.compare()},
    {keys: "Home", does: "the camera as this page found it", run: () => session.resetCamera()},
    {keys: "/", does: "find a parameter", run: () => this.querySelector<HTMLElement>("#filter")?.focus()},
    {keys: "?", does: "this list", run: () => this.showHelp()},
  ];

  override connectedCallback(): void {
    super.connectedCallback();
    listenForKeys(this.shortcuts);
    this.listen("error", (message) => this.tellError(message));
  }

  private tellError(message: string): void {
    this.error = message;
    window.clearTimeout(this.errorTimer);
    this.errorTimer = window.setTimeout(() => (this.error = ""), kErrorTime);
  }

  private compare(): void {
    if (this.picture.comparer.isOpen) this.picture.comparer.close();
    else if (session.kept.size > 0) session.compare();
  }

  private nextLayer(by: number): void {
    const layers = session.hello?.layers ?? [];
    const next = layers[(layers.indexOf(session.layer) + by + layers.length) % layers.length];
    if (next) session.showLayer(next);
  }

  /** Of the picture: bar and status show it. */
  private toolChanged(): void {
    this.requestUpdate();
    this.toolbar.requestUpdate();
  }

  private showHelp(): void {
    this.querySelector<HTMLDialogElement>("#help")?.showModal();
  }

  override render(): TemplateResult {
    return html`
      <header><zsi-toolbar .picture=${this.picture} .openSaving=${() => this.saving.open()}
        .openHelp=${() => this.showHelp()}></zsi-toolbar></header>
      <main><zsi-picture @tool=${() => this.toolChanged()}></zsi-picture></main>
      <aside aria-label="Parameters"><zsi-panel></zsi-panel></aside>
      <footer><zsi-status ?inspecting=${this.picture?.isInspecting ?? false}></zsi-status></footer>
      <div role="alert" class="errors">${this.error ? html`<p>${this.error}
        <button class="small" aria-label="Dismiss" @click=${() => (this.error = "")}>×</button></p>` : nothing}</div>
      <zsi-saving></zsi-saving>
      ${helpDialog(this.shortcuts)}`;
  }
}
