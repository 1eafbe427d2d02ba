"""The queries usually asked of the auction data, evaluated again over a parsed document."""
from __future__ import annotations

from pathlib import Path
from typing import Any

import page
from bench import Bench
from engines import Ours, peers
from running import Failed

TITLE = "Queries"
SIZES = (10, 100)
LIMIT = 60
# As often for each size: an index is made once a query has been asked a few times, and a virtual
# machine compiles what it has run often.
REPEATS = 10


def measure(bench: Bench) -> dict[str, Any]:
    engines = [Ours(bench.build), *peers()]
    figures: dict[str, Any] = {}
    for size in SIZES:
        document = bench.document("auction", size)
        for query in bench.published():
            row = figures.setdefault(query.name.split(".")[0], {})
            row[str(size)] = {engine.name: hot(engine, document, query, REPEATS)
                              for engine in engines}
    return figures


def hot(engine: Any, document: Path, query: Path, repeat: int) -> float | None:
    """What takes too long often is tried once; none where that does, too."""
    for times in (repeat, 1):
        try:
            return engine.hot(document, query, times, LIMIT)
        except Failed:
            continue
    return None


def ratios(figures: dict[str, Any], size: int, peer: str | None = None) -> list[float | None]:
    """Of each query, our time over a peer's, or over that of the faster one."""
    found: list[float | None] = []
    for row in figures.values():
        times = {name: time for name, time in row[str(size)].items() if time is not None}
        others = [time for name, time in times.items()
                  if name != Ours.name and peer in (None, name)]
        found.append(page.ratio(times.get(Ours.name), min(others, default=None)))
    return found


def names_of_peers(figures: dict[str, Any]) -> list[str]:
    first = next(iter(figures.values()))
    return [name for name in first[str(SIZES[0])] if name != Ours.name]


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    others = names_of_peers(figures)
    text = [
        "The twenty queries usually asked of generated auction data, in the form they are usually",
        "printed in, over a document that is parsed already: time to evaluate and to print, over that",
        "of each peer. Below 1 this engine is faster.", "",
    ]
    head = ["query"] + [f"/ {peer}, {size} MB" for size in SIZES for peer in others]
    columns = [ratios(figures, size, peer) for size in SIZES for peer in others]
    rows = [[query, *(column[i] for column in columns)] for i, query in enumerate(figures)]
    rows.append(["geometric mean", *(page.mean(column) for column in columns)])
    plot = plots / "queries.svg"
    page.bars(plot, "Time over the faster peer's", list(figures),
              {f"{size} MB": ratios(figures, size) for size in SIZES}, "ratio")
    return text + page.table(head, rows) + page.image(plot, "times of queries beside the peers")


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    return [(f"the twenty auction queries over {size} MB, geometric mean, beside the faster of "
             + " and ".join(names_of_peers(figures)), page.number(page.mean(ratios(figures, size))))
            for size in SIZES]
