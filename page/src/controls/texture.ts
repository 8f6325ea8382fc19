// SPDX-License-Identifier: Apache-2.0
import {html, LitElement, nothing, type TemplateResult} from "lit";
import {customElement, property} from "lit/decorators.js";
import {isObject, type Json} from "../base/json";
import {session} from "../session/session";
import {tellChange} from "./number";

const kThumbnail = 48; // pixels
const kSpaces = ["auto", "srgb", "linear"];

/** A picture's file, its colour space, and what it looks like. `key`: of the file's name. */
@customElement("zsi-texture")
export class TextureControl extends LitElement {
  @property({attribute: false}) value: Json = null;
  @property() key: "texture" | "cube" | "file" = "texture";
  @property() label = "";

  override createRenderRoot(): HTMLElement {
    return this;
  }

  private get file(): string {
    const file = isObject(this.value) ? this.value[this.key] : undefined;
    return typeof file === "string" ? file : "";
  }

  /** Of a picture in a model. */
  private get image(): number | undefined {
    const image = isObject(this.value) ? this.value.image : undefined;
    return typeof image === "number" ? image : undefined;
  }

  private write(file: string, space: string): void {
    if (file === "") return tellChange(this, null);
    const others = isObject(this.value) ? {...this.value} : {};
    delete others.colorSpace;
    if (file !== this.file) delete others.image;
    tellChange(this, {...others, [this.key]: file, ...(space === "auto" ? {} : {colorSpace: space})});
  }

  override render(): TemplateResult {
    const {file} = this;
    const space = isObject(this.value) && typeof this.value.colorSpace === "string" ? this.value.colorSpace : "auto";
    return html`
      ${file ? html`<img class="thumbnail" alt="" width=${kThumbnail} height=${kThumbnail}
        src=${session.thumbnail(file, 2 * kThumbnail, this.image)} />` : nothing}
      <input type="text" class="file" .value=${file} placeholder="no picture" list="scene-files"
        aria-label="${this.label}, file, from the scene's folder" spellcheck="false"
        @change=${(e: Event) => this.write((e.target as HTMLInputElement).value.trim(), space)} />
      ${file ? html`
        <select aria-label="${this.label}, colour space" title="colour space"
          @change=${(e: Event) => this.write(file, (e.target as HTMLSelectElement).value)}>
          ${kSpaces.map((s) => html`<option ?selected=${s === space}>${s}</option>`)}
        </select>
        <button class="small" aria-label="${this.label}: take the picture out" title="take out"
          @click=${() => this.write("", "")}>×</button>` : nothing}`;
  }
}
