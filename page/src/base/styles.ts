// SPDX-License-Identifier: Apache-2.0
import {noChange} from "lit";
import {directive, Directive, type ElementPart} from "lit/directive.js";

/** Style properties of an element, `<div ${styles({"--at": "50%"})}>`: set one by one, since the page's
 * security policy refuses style attributes. */
class Styles extends Directive {
  override render(_properties: Record<string, string>): unknown {
    return noChange;
  }

  override update(part: ElementPart, [properties]: [Record<string, string>]): unknown {
    const {style} = part.element as HTMLElement;
    for (const [name, value] of Object.entries(properties)) style.setProperty(name, value);
    return noChange;
  }
}
export const styles = directive(Styles);
