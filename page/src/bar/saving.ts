// SPDX-License-Identifier: Apache-2.0
import {html, nothing, type TemplateResult} from "lit";
import {customElement, state} from "lit/decorators.js";
import {address} from "../session/connection";
import {SessionElement} from "../session/element";
import {session} from "../session/session";

const kFramesPerSecond = 12;

/** The scene as a file, the picture as a file, and the turntable. */
@customElement("zsi-saving")
export class Saving extends SessionElement {
  @state() private saved = "";
  @state() private frames: string[] = [];
  @state() private at = 0;
  private timer = 0;

  override connectedCallback(): void {
    super.connectedCallback();
    this.listen("saved", (path) => (this.saved = path));
    this.listen("turntable", (frames) => {
      this.frames = frames.map((frame) => address(frame));
      this.at = 0;
      this.play(true);
    });
  }

  open(): void {
    this.saved = "";
    this.querySelector("dialog")?.showModal();
  }

  private save(event: Event): void {
    event.preventDefault();
    session.save(this.querySelector<HTMLInputElement>("#save-name")!.value.trim());
  }

  private turn(event: Event): void {
    event.preventDefault();
    this.play(false);
    this.frames = [];
    const value = (id: string) => this.querySelector<HTMLInputElement>(id)!.valueAsNumber;
    session.turntable(value("#turn-frames"), value("#turn-samples"));
  }

  private play(on: boolean): void {
    window.clearInterval(this.timer);
    this.timer = on ? window.setInterval(() => (this.at = (this.at + 1) % this.frames.length), 1000 / kFramesPerSecond) : 0;
    this.requestUpdate();
  }

  private turntable(): TemplateResult {
    const total = this.querySelector<HTMLInputElement>("#turn-frames")?.valueAsNumber ?? 24;
    if (session.turntableDone !== undefined)
      return html`<p role="status"><progress max=${total} .value=${session.turntableDone}></progress>
        ${session.turntableDone} of ${total} <button @click=${() => session.cancel()}>Stop</button></p>`;
    if (this.frames.length === 0) return html`${nothing}`;
    return html`<figure class="turntable">
      <img alt="Turntable, frame ${this.at + 1} of ${this.frames.length}" src=${this.frames[this.at] ?? ""} />
      <figcaption>
        <button @click=${() => this.play(this.timer === 0)}>${this.timer ? "Stop" : "Play"}</button>
        <input type="range" min="0" max=${this.frames.length - 1} .value=${String(this.at)} aria-label="Frame"
          @input=${(e: Event) => { this.play(false); this.at = (e.target as HTMLInputElement).valueAsNumber; }} />
        <a href=${this.frames[this.at] ?? ""} download>this frame</a>
      </figcaption></figure>`;
  }

  override render(): TemplateResult {
    const {hello, layer} = session;
    return html`<dialog id="saving" aria-labelledby="saving-title" @close=${() => this.play(false)}>
      <form method="dialog"><h2 id="saving-title">Save</h2><button aria-label="Close">×</button></form>
      <section><h3>Scene</h3>
        ${hello?.canSave
          ? html`<form class="line" @submit=${(e: Event) => this.save(e)}>
              <input id="save-name" type="text" aria-label="Name of the file" .value=${hello.scene} spellcheck="false" />
              <button class="main" data-tool="save-scene">Save beside the scene</button></form>
            <p role="status" class="hint">${this.saved ? `Saved: ${this.saved}` : "Comments of the file are lost where it is written over."}</p>`
          : html`<p class="hint">Start zsi view with --save FOLDER to save there.</p>`}
        <p><a href=${address("scene.json")} download>Download the scene as JSON</a></p>
      </section>
      <section><h3>Picture</h3>
        <p><a href=${address("picture.png", {layer})} download>PNG, as shown${layer === "beauty" ? "" : ` (${layer})`}</a>
          <a href=${address("picture.exr")} download>EXR, linear, all layers there are</a></p>
      </section>
      <section><h3>Turntable</h3>
        <form class="line" @submit=${(e: Event) => this.turn(e)}>
          <label>frames <input id="turn-frames" type="number" min="2" max="360" value="24" /></label>
          <label>samples <input id="turn-samples" type="number" min="1" max="1024" value="8" /></label>
          <button data-tool="turntable">Render</button></form>
        ${this.turntable()}
      </section>
    </dialog>`;
  }
}
