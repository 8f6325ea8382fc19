// SPDX-License-Identifier: Apache-2.0
import {html, type TemplateResult} from "lit";
import {kPictureKeys, type Shortcut} from "../keys";

export function helpDialog(shortcuts: readonly Shortcut[]): TemplateResult {
  const row = (keys: string, does: string) =>
    html`<tr><th scope="row">${keys.split(", ").map((k) => html`<kbd>${k}</kbd> `)}</th><td>${does}</td></tr>`;
  return html`<dialog id="help" aria-labelledby="help-title">
    <form method="dialog"><h2 id="help-title">Keys and mouse</h2><button aria-label="Close">×</button></form>
    <div class="columns">
      <table><caption>On the picture</caption><tbody>${kPictureKeys.map(([keys, does]) => row(keys, does))}</tbody></table>
      <table><caption>Everywhere</caption><tbody>${shortcuts.map((s) => row(s.keys, s.does))}</tbody></table>
    </div>
    <p class="hint">A slider goes to its default by a double click; its number may lie beyond its ends. Names with a dot
      are written in the scene, those in grey are not read at the present settings.</p>
  </dialog>`;
}
