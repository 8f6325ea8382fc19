// SPDX-License-Identifier: Apache-2.0
import type {Json, JsonObject} from "../base/json";
import {parseTile, type Tile} from "./protocol";

export type Message = JsonObject & {type: string};

export interface Listener {
  opened(): void;
  lost(): void;
  message(message: Message): void;
  tile(tile: Tile): void;
}

const kFirstWait = 250, kLongestWait = 4000; // milliseconds

/** The WebSocket to `zsi view`, opened again whenever it is lost. */
export class Connection {
  private socket?: WebSocket;
  private wait = kFirstWait;

  constructor(private readonly listener: Listener) {
    this.open();
  }

  send(message: {type: string; [key: string]: Json | undefined}): boolean {
    if (this.socket?.readyState !== WebSocket.OPEN) return false;
    this.socket.send(JSON.stringify(message));
    return true;
  }

  private open(): void {
    const socket = new WebSocket(address("session").replace(/^http/, "ws"));
    socket.binaryType = "arraybuffer";
    socket.onopen = () => {
      this.wait = kFirstWait;
      this.listener.opened();
    };
    socket.onmessage = (event: MessageEvent<string | ArrayBuffer>) => {
      if (typeof event.data === "string") {
        this.listener.message(JSON.parse(event.data) as Message);
        return;
      }
      const tile = parseTile(event.data);
      if (!tile) return;
      this.listener.tile(tile);
      if (tile.kind < 2) // the others are not counted
        this.send({type: "ack", generation: tile.generation, bytes: event.data.byteLength});
    };
    socket.onclose = () => {
      this.listener.lost();
      setTimeout(() => this.open(), this.wait);
      this.wait = Math.min(2 * this.wait, kLongestWait);
    };
    this.socket = socket;
  }
}

/** Of a file of this session, with the token that the page was opened with. */
export function address(name: string, query: Record<string, string | string[]> = {}): string {
  const url = new URL(name, location.href);
  const words = new URLSearchParams({token: new URLSearchParams(location.search).get("token") ?? ""});
  for (const [key, values] of Object.entries(query)) for (const value of [values].flat()) words.append(key, value);
  url.search = words.toString();
  return url.href;
}
