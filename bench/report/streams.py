"""Documents larger than memory, record by record."""
from __future__ import annotations

from pathlib import Path
from typing import Any

import page
from bench import Bench
from engines import Lxml, Ours
from running import Run, in_turn, run

TITLE = "Streams"
SIZE = 300
# Each: the question, and the same as lxml's users ask it.
QUESTIONS = {
    "count(/site/people/person)":
        "sum(1 for _, p in e.iterparse(f, tag='person') if [p.clear()])",
    "sum(/site/closed_auctions/closed_auction/price)":
        "sum(float(c.findtext('price')) for _, c in e.iterparse(f, tag='closed_auction'))",
}


def measure(bench: Bench) -> dict[str, Any]:
    document = bench.document("auction", SIZE)
    ours = Ours(bench.build)
    figures: dict[str, Any] = {}
    for query, iteration in QUESTIONS.items():
        commands: dict[str, list[str | Path]] = {
            "xquery": [ours.command, "--stream", "-e", query, document],
            "the reader alone": [ours.command, "--stream", "-e", "count(/site/none)", document],
        }
        if Lxml.installed():
            program = f"import sys, lxml.etree as e; f = sys.argv[1]; print({iteration})"
            commands["lxml"] = [Lxml.python, "-c", program, document]
        peaks: dict[str, int] = {}

        def taken(side: str) -> float:
            last: Run = run(commands[side])
            peaks[side] = last.peak
            return last.processor

        times = in_turn({side: lambda side=side: taken(side) for side in commands}, bench.rounds)
        figures[query] = {"times": times, "peaks": peaks}
    return figures


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    text = [f"Questions to {SIZE} MB of records that are read once and not kept (`--stream`): processor",
            "time over that of reading alone, and of lxml's `iterparse`; and the most memory in MiB.", ""]
    rows = []
    for query, sides in figures.items():
        times, peaks = sides["times"], sides["peaks"]
        rows.append([f"`{query}`", page.ratio(times["xquery"], times["the reader alone"]),
                     page.ratio(times["xquery"], times.get("lxml")), peaks["xquery"] / 2**20,
                     peaks["lxml"] / 2**20 if "lxml" in peaks else None])
    return text + page.table(["question", "/ reading alone", "/ lxml", "MiB", "lxml's MiB"], rows)


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    return []
