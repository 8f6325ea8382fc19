// SPDX-License-Identifier: Apache-2.0
import {LitElement} from "lit";
import {session, type Events} from "./session";

/** An element that shows the session and is drawn again when that changes. Its content stands in the
 * page itself, so that one style sheet and every screen reader reach it. */
export class SessionElement extends LitElement {
  private readonly ends: (() => void)[] = [];

  override createRenderRoot(): HTMLElement {
    return this;
  }

  override connectedCallback(): void {
    super.connectedCallback();
    this.listen("change", () => this.requestUpdate());
  }

  override disconnectedCallback(): void {
    super.disconnectedCallback();
    this.ends.splice(0).forEach((end) => end());
  }

  protected listen<Name extends keyof Events>(name: Name, call: (detail: Events[Name]) => void): void {
    this.ends.push(session.on(name, call));
  }
}

let last = 0;
/** A name that no other drag, control or label has. */
export function unique(prefix: string): string {
  return `${prefix}-${++last}`;
}
