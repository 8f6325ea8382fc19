// SPDX-License-Identifier: Apache-2.0
// Bundles the page.  usage: node build.mjs [FOLDER]    where to; dist by default
import {copyFileSync, mkdirSync} from "node:fs";
import {dirname, join} from "node:path";
import {fileURLToPath} from "node:url";
import {build} from "esbuild";

const here = dirname(fileURLToPath(import.meta.url));
const folder = process.argv[2] ?? join(here, "dist");
mkdirSync(folder, {recursive: true});
await build({
  absWorkingDir: here,
  entryPoints: {app: "src/main.ts"},
  outdir: folder,
  bundle: true,
  minify: true,
  format: "esm",
  target: "es2022",
  legalComments: "eof",
  logLevel: "warning",
});
for (const name of ["index.html", "app.css", "icon.svg"])
  copyFileSync(join(here, "src", name), join(folder, name));
