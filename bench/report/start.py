"""What a question costs from the shell: to start, and to ask a file something."""
from __future__ import annotations

from pathlib import Path
from typing import Any

import page
from bench import Bench
from engines import Ours, all_peers
from running import in_turn, run

TITLE = "From the shell"
SIZE = 10
QUESTION = "count(//item)"


def measure(bench: Bench) -> dict[str, Any]:
    engines = [Ours(bench.build), *all_peers()]
    document = bench.document("auction", SIZE)
    return {
        "start, evaluate 1 and end": in_turn(
            {each.name: lambda each=each: run(each.alone()).seconds for each in engines},
            bench.rounds),
        f"{QUESTION} over a file of {SIZE} MB": in_turn(
            {each.name: lambda each=each: run(each.once(document, QUESTION)).seconds
             for each in engines}, bench.rounds),
    }


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    others = [name for name in next(iter(figures.values())) if name != Ours.name]
    text = ["The whole time of a command on the clock, from its start to its end, over that of each",
            "peer's.", ""]
    rows = [[what, *(page.ratio(times[Ours.name], times[peer]) for peer in others)]
            for what, times in figures.items()]
    return text + page.table(["", *(f"/ {peer}" for peer in others)], rows)


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    rows = []
    for what, times in figures.items():
        least = min((time for name, time in times.items() if name != Ours.name and time),
                    default=None)
        rows.append((f"{what}, beside the fastest peer", page.number(page.ratio(times[Ours.name], least))))
    return rows
