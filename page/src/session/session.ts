// SPDX-License-Identifier: Apache-2.0
import {isObject, setAt, valueAt, type Json, type JsonObject} from "../base/json";
import {address, Connection, type Message} from "./connection";
import type {Comparison, Edit, Frame, Hello, Picked, SceneMaterial, ShaderClass, Tile, Values} from "./protocol";

/** What is selected: a section of the scene and a name in it ("" where it has none). "scene": the rest. */
export interface Selection {
  section: "materials" | "lights" | "environment" | "scene";
  name: string;
}

export interface Events {
  change: undefined; // anything below is different
  tile: Tile;
  comparison: Comparison;
  saved: string;
  error: string;
  turntable: string[];
}

/** The scene as the server has it, and what the page has asked about it. One for the whole page. */
export class Session {
  hello?: Hello;
  document: JsonObject = {};
  materials: SceneMaterial[] = [];
  warnings: string[] = [];
  undoLabel: string | null = null;
  redoLabel: string | null = null;
  frame?: Frame;
  values?: Values;
  isConnected = false;
  layer = "beauty";
  denoise = false;
  kept = new Map<string, number>(); // slot -> samples
  turntableDone?: number;
  selection: Selection = {section: "materials", name: ""};

  private readonly classes = new Map<string, ShaderClass | "asked">();
  private readonly target = new EventTarget();
  private readonly connection: Connection;
  private readonly picks = new Map<number, (picked: Picked) => void>();
  private lastId = 0;
  private isEditing = false; // an edit is on its way
  private waiting?: {edits: Edit[]; group: string}; // what comes after it
  private viewSize?: {width: number; height: number};
  private firstCamera?: Json;

  constructor() {
    this.connection = new Connection({
      opened: () => this.opened(),
      lost: () => {
        this.isConnected = this.isEditing = false;
        this.waiting = undefined;
        this.changed();
      },
      message: (message) => this.receive(message),
      tile: (tile) => this.tell("tile", tile),
    });
  }

  on<Name extends keyof Events>(name: Name, listener: (detail: Events[Name]) => void): () => void {
    const call = (event: Event) => listener((event as CustomEvent<Events[Name]>).detail);
    this.target.addEventListener(name, call);
    return () => this.target.removeEventListener(name, call);
  }

  valueAt(path: string): Json | undefined {
    return valueAt(this.document, path);
  }

  /** One edit; `value` null is the default again. Edits of one `group` are undone in one step. */
  set(path: string, value: Json, group = ""): void {
    this.edit([{path, value}], group);
  }

  /** While an edit is on its way only the newest of those that follow waits: the picture keeps up with a
   * slider, whatever it costs. */
  edit(edits: Edit[], group = ""): void {
    for (const {path, value} of edits) setAt(this.document, path, value);
    if (this.isEditing && this.waiting && this.waiting.group === group && group !== "") {
      const paths = new Set(edits.map((e) => e.path));
      const before = this.waiting.edits.filter((e) => !paths.has(e.path));
      this.waiting = {edits: [...before, ...edits], group};
    } else if (this.isEditing && group !== "") {
      this.flush();
      this.waiting = {edits, group};
    } else {
      this.flush();
      this.sendEdits(edits, group);
    }
    this.changed();
  }

  undo(): void { this.act({type: "undo"}); }
  redo(): void { this.act({type: "redo"}); }
  pause(on: boolean): void { this.act({type: "pause", on}); }
  keep(slot: "a" | "b"): void { this.act({type: "keep", slot}); }
  restore(slot: "a" | "b"): void { this.act({type: "restore", slot}); }
  compare(): void { this.act({type: "compare", id: ++this.lastId}); }
  inspect(x: number, y: number): void { this.act({type: "inspect", x, y, id: ++this.lastId}); }
  save(path: string): void { this.act({type: "save", path}); }
  turntable(frames: number, samples: number): void {
    this.turntableDone = 0;
    this.act({type: "turntable", frames, samples});
  }
  cancel(): void {
    this.turntableDone = undefined;
    this.act({type: "cancel"});
  }

  resetCamera(): void {
    if (this.firstCamera !== undefined) this.set("camera", this.firstCamera);
  }

  showLayer(name: string): void {
    this.layer = name;
    this.act({type: "layer", name});
  }

  setDenoise(on: boolean): void {
    this.denoise = on;
    this.act({type: "denoise", on});
  }

  /** Size of the place for the picture, in pixels of the screen. */
  view(width: number, height: number): void {
    if (this.viewSize?.width === width && this.viewSize.height === height) return;
    this.viewSize = {width, height};
    this.act({type: "view", width, height});
  }

  /** Pixels may lie between those of the frame. */
  pick(x: number, y: number): Promise<Picked> {
    const id = ++this.lastId;
    return new Promise((resolve) => {
      this.picks.set(id, resolve);
      this.act({type: "pick", x, y, id});
    });
  }

  select(selection: Selection): void {
    this.selection = selection;
    this.changed();
  }

  /** Undefined until the server has told it. */
  shaderClass(name: string): ShaderClass | undefined {
    const known = this.classes.get(name);
    if (known === undefined && name !== "") {
      this.classes.set(name, "asked");
      this.connection.send({type: "class", name});
    }
    return typeof known === "object" ? known : undefined;
  }

  /** `image`: the number of a picture in a model. */
  thumbnail(file: string, size: number, image?: number): string {
    return address("thumbnail", {file, size: String(size), ...(image === undefined ? {} : {image: String(image)})});
  }

  private opened(): void {
    this.isConnected = true;
    for (const [name, known] of this.classes) if (known === "asked") this.classes.delete(name);
    if (this.viewSize) this.act({type: "view", ...this.viewSize});
    if (this.layer !== "beauty") this.act({type: "layer", name: this.layer});
    if (this.denoise) this.act({type: "denoise", on: true});
    this.changed();
  }

  private act(message: {type: string; [key: string]: Json | undefined}): void {
    this.flush();
    this.connection.send(message);
    this.changed();
  }

  private sendEdits(edits: Edit[], group: string): void {
    this.isEditing = this.connection.send({
      type: "setMany", edits: edits.map(({path, value}) => ({path, value})), ...(group ? {group} : {})});
  }

  private flush(): void {
    const waiting = this.waiting;
    this.waiting = undefined;
    if (waiting) this.sendEdits(waiting.edits, waiting.group);
  }

  private edited(): void {
    this.isEditing = false;
    this.flush();
  }

  private receive(message: Message): void {
    switch (message.type) {
      case "hello":
        this.hello = message as unknown as Hello;
        document.title = `${this.hello.scene} - zsi view`;
        break;
      case "scene":
        this.document = message.document as JsonObject;
        this.firstCamera ??= structuredClone(this.document.camera ?? null);
        this.readState(message);
        this.edited();
        this.keepSelection();
        break;
      case "changed":
        for (const {path, value} of message.edits as unknown as Edit[])
          if (!this.waiting?.edits.some((e) => e.path === path)) setAt(this.document, path, value);
        this.readState(message);
        this.edited();
        break;
      case "frame":
        this.frame = message as unknown as Frame;
        break;
      case "picked": {
        const picked = message as unknown as Picked;
        this.picks.get(Number(picked.id))?.(picked);
        this.picks.delete(Number(picked.id));
        break;
      }
      case "values":
        this.values = message as unknown as Values;
        break;
      case "class":
        this.classes.set(message.name as string, message as unknown as ShaderClass);
        break;
      case "kept":
        this.kept.set(message.slot as string, message.samples as number);
        break;
      case "comparison":
        this.tell("comparison", message as unknown as Comparison);
        break;
      case "saved":
        this.tell("saved", message.path as string);
        break;
      case "progress":
        this.turntableDone = message.done as number;
        break;
      case "turntable":
        this.turntableDone = undefined;
        this.tell("turntable", message.frames as string[]);
        break;
      case "error":
        this.edited();
        this.tell("error", message.message as string);
        this.reloadDocument();
        break;
    }
    this.changed();
  }

  private readState(message: Message): void {
    this.undoLabel = message.undo as string | null;
    this.redoLabel = message.redo as string | null;
    this.materials = message.materials as unknown as SceneMaterial[];
    this.warnings = message.warnings as string[];
  }

  /** After an error: what the page has put in its own copy may not be so. */
  private reloadDocument(): void {
    void fetch(address("scene.json")).then(async (response) => {
      this.document = (await response.json()) as JsonObject;
      this.changed();
    }).catch(() => undefined); // the connection tells of it
  }

  private keepSelection(): void {
    const {section, name} = this.selection;
    const there = this.document[section];
    if (section === "scene" || section === "environment" || (isObject(there) && name in there)) return;
    const first = this.materials.find((m) => !/floor|ground|wall/i.test(m.name)) ?? this.materials[0];
    if (first) this.selection = {section: "materials", name: first.name};
  }

  private tell<Name extends keyof Events>(name: Name, detail: Events[Name]): void {
    this.target.dispatchEvent(new CustomEvent(name, {detail}));
  }

  private changed(): void {
    this.tell("change", undefined);
  }
}

export const session = new Session();
