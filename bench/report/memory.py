"""The most memory a command holds to ask a file something."""
from __future__ import annotations

from pathlib import Path
from typing import Any

import page
from bench import Bench
from engines import Ours, all_peers
from running import Failed, run

TITLE = "Memory"
SIZES = (1, 10, 100, 300)
PROJECTED = "count(//item)"
# A step upwards from the document, which finds nothing, has the whole tree made.
WHOLE = "count(//item[/..]) + count(//item)"


def measure(bench: Bench) -> dict[str, Any]:
    figures: dict[str, Any] = {"bytes": []}
    ours = Ours(bench.build)
    sides = {"xquery": (ours, PROJECTED), "xquery, whole tree": (ours, WHOLE)}
    sides |= {each.name: (each, PROJECTED) for each in all_peers()}
    for size in SIZES:
        document = bench.document("auction", size)
        figures["bytes"].append(document.stat().st_size)
        for side, (engine, query) in sides.items():
            try:
                peak = run(engine.once(document, query)).peak
            except Failed:
                peak = None
            figures.setdefault(side, []).append(peak)
    return figures


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    text = ["The most memory that a command holds to count the items of a file, in bytes for each byte",
            "of the file. What a question does not need of a document is not kept, therefore our second",
            "line, of a question that needs all of it.", ""]
    sizes = figures["bytes"]
    sides = {side: [page.ratio(peak, size) for peak, size in zip(peaks, sizes)]
             for side, peaks in figures.items() if side != "bytes"}
    text += page.table(["", *(f"{size} MB" for size in SIZES)],
                       [[side, *values] for side, values in sides.items()])
    plot = plots / "memory.svg"
    page.lines(plot, "Memory", SIZES, sides, ("MB", "bytes a byte"))
    return text + page.image(plot, "memory for each byte of text")


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    at = SIZES.index(100)
    least = min((peaks[at] for side, peaks in figures.items()
                 if not side.startswith(("xquery", "bytes")) and peaks[at]), default=None)
    return [("most memory for count(//item) over a file of 100 MB, beside the most frugal peer",
             page.number(page.ratio(figures["xquery"][at], least)))]
