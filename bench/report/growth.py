"""How times grow with the document."""
from __future__ import annotations

from pathlib import Path
from typing import Any

import page
from bench import Bench
from engines import Ours, peers
from queries import REPEATS, hot

TITLE = "Growth"
SIZES = (1, 3, 10, 30, 100, 300)
QUERIES = ("01-exact-match", "08-join", "11-join-on-inequality", "14-text-search", "19-sorting")


def measure(bench: Bench) -> dict[str, Any]:
    figures: dict[str, Any] = {}
    for query in bench.published():
        # By its number: what follows that is free to change.
        if query.name.split("-")[0] not in {each.split("-")[0] for each in QUERIES}:
            continue
        sides: dict[str, list[float | None]] = {}
        for engine in (Ours(bench.build), *peers()):
            for size in SIZES:
                times = sides.setdefault(engine.name, [])
                # What could not be had of a smaller document is not asked of a larger one.
                given_up = bool(times) and times[-1] is None
                times.append(None if given_up else hot(
                    engine, bench.document("auction", size), query, REPEATS))
        figures[query.name.split(".")[0]] = sides
    return figures


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    text = ["The time of a query over a document, over its own time at 10 MB, which would grow as the",
            "first line does if it were in proportion to the document; a dash where it took over a",
            "minute, or more memory than there is.", ""]
    here = SIZES.index(10)
    rows: list[list[str | float | None]] = [["in proportion", "", *(size / 10 for size in SIZES)]]
    for query, sides in figures.items():
        for side, times in sides.items():
            rows.append([query, side, *(page.ratio(time, times[here]) for time in times)])
    text += page.table(["query", "", *(f"{size} MB" for size in SIZES)], rows)
    for query, sides in figures.items():
        own = sides[Ours.name][here]
        plot = plots / f"growth-{query}.svg"
        page.lines(plot, query, SIZES,
                   {side: [page.ratio(time, own) for time in times] for side, times in sides.items()},
                   ("MB", "time, 1 is ours at 10 MB"))
        text += page.image(plot, f"growth of {query}")
    return text


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    return []
