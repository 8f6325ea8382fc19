# SPDX-License-Identifier: Apache-2.0
"""Cards of all classes as one page: cards.py ZSI DOCS FOLDER (see scripts/cards.sh)."""
import html
import json
import pathlib
import re
import shutil
import subprocess
import sys

# Where the manual tells what a class stands on: page and heading ("": all of the page).
MODELS = [
    (r"corvid_Mtl_Metal$", "metal.md", "Metal"),
    (r"corvid_Mtl_MetallicPaint", "metal.md", "Metallic paint"),
    (r"corvid_Mtl_(Glazing|Dielectric)", "physical.md", ""),
    (r"corvid_Mtl_Mirror", "physical.md", "Behaviour to know"),
    (r"corvid_Mtl_Ward_", "ward-networks.md", ""),
    (r"corvid_Mtl_Ward", "ward.md", ""),
    (r"MarlowLegacy", "legacy.md", "MarlowLegacy"),
    (r"XRite", "legacy.md", "XRite"),
    (r"BackgroundGeometry|corvid_Env_", "backdrops.md", ""),
]
NAME = r"[A-Z][\w-]+"
CITATION = re.compile(rf"{NAME}(?: et al\.|(?:, {NAME})*,? and {NAME})?,? (?:19|20)\d\d(?!\d)")

STYLE = """
:root { color-scheme: light dark; font: 15px/1.5 system-ui, sans-serif; }
body { max-width: 78rem; margin: 0 auto; padding: 1.5rem; background: Canvas; color: CanvasText; }
nav { columns: 16rem; margin-bottom: 2rem; }
nav a { display: block; }
article { display: grid; grid-template-columns: minmax(0, 22rem) minmax(0, 1fr); gap: 0 1.5rem; padding: 1.5rem 0; border-top: 1px solid #8886; }
h2, .words, details { grid-column: 2; margin: 0 0 0.5rem; }
article > a { grid-row: 1 / span 4; }
article img { width: 100%; border-radius: 8px; }
table { border-collapse: collapse; width: 100%; font-size: 0.9rem; }
td, th { text-align: left; vertical-align: top; padding: 0.15rem 0.6rem 0.15rem 0; border-bottom: 1px solid #8883; overflow-wrap: anywhere; }
th[colspan] { padding-top: 0.7rem; }
summary { cursor: pointer; }
.soft { opacity: 0.75; }
@media (max-width: 46rem) { article { grid-template-columns: minmax(0, 1fr); } h2, .words, details, article > a { grid-column: 1; grid-row: auto; } }
"""


def section(text, heading):
    """From a heading of the second level to the next."""
    found = re.search(rf"^## {re.escape(heading)}\n(.*?)(?=^## |\Z)", text, re.M | re.S) if heading else None
    if heading and not found:
        sys.exit(f"cards: no heading \"{heading}\" in the manual")
    return found[1] if found else text


def models(docs, name):
    """Page of the manual and the papers that it names for a class; papers in its order, each once."""
    pages = [(page, heading) for pattern, page, heading in MODELS if re.match(pattern, name)]
    papers = [" ".join(c.split()) for page, heading in pages
              for c in CITATION.findall(section((docs / page).read_text(), heading))]
    return [page for page, _ in pages], list(dict.fromkeys(papers))


def shown(value):
    return "" if value is None else "(" + ", ".join(f"{v:g}" for v in value) + ")" if isinstance(value, list) \
        else f"{value:g}" if isinstance(value, float) else json.dumps(value)


def rows(parameters):
    group, text = None, ""
    for row in parameters:
        if row.get("group", "") != group:
            group = row.get("group", "")
            text += f'<tr><th colspan="4">{html.escape(group)}</th></tr>'
        limits = f'{row["minimum"]:g} .. {row["maximum"]:g}' if "minimum" in row and "maximum" in row else ""
        text += "<tr>" + "".join(f"<td>{html.escape(cell)}</td>" for cell in (
            row["name"], shown(row["default"]), limits, row["meaning"])) + "</tr>"
    return text


def card(shader, docs, folder):
    name = shader["name"]
    shutil.copy(docs / "gallery" / f"{name}.jpg", folder)
    pages, papers = models(docs, name)
    stands = (f'Stands on {html.escape("; ".join(papers))}. ' if papers else "") + \
        (f'More: {", ".join(f"docs/{page}" for page in pages)}.' if pages else "")
    count = len(shader["parameters"])
    return f"""<article id="{name}">
<a href="{name}.jpg"><img src="{name}.jpg" alt="{name}" loading="lazy"></a>
<h2>{name}</h2>
<p class="words">{html.escape(shader["description"].strip())}<br>
<span class="soft">{shader["kind"]}: {", ".join(shader["entryPoints"])}</span></p>
<p class="words soft">{stands}</p>
<details><summary>{count} parameters</summary><table>
<tr><th>name</th><th>default</th><th>range</th><th>meaning</th></tr>{rows(shader["parameters"])}</table></details>
</article>
"""


def main(zsi, docs, folder):
    docs, folder = pathlib.Path(docs), pathlib.Path(folder)

    def info(*words):
        return json.loads(subprocess.run([zsi, "info", "--json", *words], check=True, capture_output=True).stdout)

    folder.mkdir(parents=True, exist_ok=True)
    names = [c["name"] for c in info()["classes"]]
    cards = "".join(card(info(name), docs, folder) for name in names)
    index = "".join(f'<a href="#{name}">{name}</a>' for name in names)
    (folder / "index.html").write_text(f"""<!doctype html>
<html lang="en"><head><meta charset="utf-8"><title>Zephyr shaders</title>
<meta name="viewport" content="width=device-width, initial-scale=1"><style>{STYLE}</style></head>
<body><h1>Zephyr shaders</h1><nav>{index}</nav>
{cards}</body></html>
""")
    print(f"The cards: {(folder / 'index.html').resolve()}")


if __name__ == "__main__":
    main(*sys.argv[1:])
