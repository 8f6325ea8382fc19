// SPDX-License-Identifier: Apache-2.0
/** Keys of the whole page; the list of help is made of them. Those over the picture: navigation.ts. */

export interface Shortcut {
  keys: string; // as shown, and as matched: modifiers with +, then the key
  does: string;
  run: () => void;
}

export const kPictureKeys: readonly (readonly [string, string])[] = [
  ["drag", "orbit"],
  ["Shift + drag, middle button", "pan"],
  ["wheel, right button, two fingers", "dolly"],
  ["Ctrl + wheel, Ctrl + drag", "magnify the picture's pixels, move them"],
  ["click", "select the material, light or environment there"],
  ["Alt + click", "focus there"],
  ["double click", "turn to that place and orbit it"],
  ["arrow keys", "orbit; with Shift: pan"],
  ["+, -", "dolly"],
  ["Enter", "select what is in the middle"],
];

function nameOf(event: KeyboardEvent): string {
  const key = event.key.length === 1 ? event.key.toUpperCase() : event.key;
  const isLetter = /^[A-Z]$/.test(key);
  return (event.ctrlKey || event.metaKey ? "Ctrl+" : "") + (event.shiftKey && isLetter ? "Shift+" : "") + key;
}

/** In fields that take text only keys with Ctrl count, and undoing there is the field's own. */
export function listenForKeys(shortcuts: readonly Shortcut[]): void {
  document.addEventListener("keydown", (event) => {
    const field = event.target instanceof HTMLInputElement && !/^(range|checkbox|color)$/.test(event.target.type);
    const isText = field || event.target instanceof HTMLTextAreaElement;
    const isChoice = event.target instanceof HTMLSelectElement;
    const name = nameOf(event);
    if (event.altKey || (isText && name !== "Ctrl+S") || (isChoice && !name.startsWith("Ctrl+"))) return;
    if (document.querySelector("dialog[open]")) return;
    const shortcut = shortcuts.find((s) => s.keys.split(", ").includes(name));
    if (!shortcut) return;
    event.preventDefault();
    shortcut.run();
  });
}
