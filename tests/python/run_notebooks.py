# SPDX-License-Identifier: Apache-2.0
"""Runs the code of notebooks from top to bottom, as a kernel would; a cell that raises ends it.

usage: run_notebooks.py FOLDER NOTEBOOK...   figures and what cells show go to FOLDER
"""

import ast
import json
import sys
import traceback
from pathlib import Path

import matplotlib

matplotlib.use("Agg")
import matplotlib.pyplot as plt  # noqa: E402


def run(notebook: Path, folder: Path) -> bool:
    """False where a cell raises, which is told."""
    scope: dict[str, object] = {"__name__": "__main__"}
    cells = [c for c in json.loads(notebook.read_text())["cells"] if c["cell_type"] == "code"]
    for number, cell in enumerate(cells):
        place = f"{notebook.name}[{number}]"
        tree = ast.parse("".join(cell["source"]), place)
        last = tree.body.pop() if tree.body and isinstance(tree.body[-1], ast.Expr) else None
        try:
            exec(compile(tree, place, "exec"), scope)
            shown = last and eval(compile(ast.Expression(last.value), place, "eval"), scope)
        except Exception:
            traceback.print_exc()
            print(f"{place}: {''.join(cell['source'])}", file=sys.stderr)
            return False
        name = folder / f"{notebook.stem}-{number}.png"
        if hasattr(shown, "_repr_png_"):
            name.write_bytes(shown._repr_png_())
        for figure in map(plt.figure, plt.get_fignums()):
            figure.savefig(name, dpi=80)
        plt.close("all")
    return True


folder = Path(sys.argv[1])
folder.mkdir(parents=True, exist_ok=True)
sys.exit(not all([run(Path(name), folder) for name in sys.argv[2:]]))
