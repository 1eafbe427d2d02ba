"""What threads gain that share one query and one document."""
from __future__ import annotations

import re
from pathlib import Path
from typing import Any

import page
from bench import Bench
from running import run

TITLE = "Threads"
COLUMNS = ("sharing", "apart", "processes")


def measure(bench: Bench) -> dict[str, Any]:
    only = "=sorting" if bench.quick else ""
    # Status 1 says that a kind gains less than it should.
    said = run([bench.build / "xquery_bench", f"--threads{only}"], 1800, good=(0, 1)).output
    figures: dict[str, Any] = {}
    for line in said.splitlines():
        row = re.match(r"(.+?)\s+[\d.]+/s" + r"\s+([\d.]+)" * len(COLUMNS), line)
        if row:
            figures[row.group(1)] = dict(zip(COLUMNS, map(float, row.groups()[1:])))
    return figures


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    text = ["Evaluations that two threads make in the time in which one makes 1: sharing query and",
            "document, with one of each for each, and as two processes, which is what the machine",
            "allows.", ""]
    rows = [[kind, *(values[column] for column in COLUMNS)] for kind, values in figures.items()]
    return text + page.table(["kind of query", *COLUMNS], rows)


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    return []  # what is gained is no ratio to anybody else
