"""Measures what is asked for, keeps the figures, and writes the page of all that were measured."""
from __future__ import annotations

import argparse
import json
import sys
import time
from pathlib import Path
from typing import Any

import batch
import growth
import machine
import memory
import queries
import reading
import start
import streams
import threads
from bench import Bench
from engines import Ours, all_peers

SECTIONS = {"reading": reading, "queries": queries, "growth": growth, "start": start,
            "memory": memory, "threads": threads, "streams": streams, "batch": batch}
MARK = "<!-- table of docs/performance.md -->"


def main() -> None:
    options = argparse.ArgumentParser(prog="bench/report.sh")
    options.add_argument("--top", type=Path, required=True, help=argparse.SUPPRESS)
    options.add_argument("--quick", action="store_true")
    options.add_argument("sections", nargs="*", metavar="SECTION",
                         help=f"one of {', '.join(SECTIONS)}")
    chosen = options.parse_args()
    for section in chosen.sections:
        if section not in SECTIONS:
            options.error(f"no section {section}: {', '.join(SECTIONS)}")
    bench = Bench(chosen.top, chosen.quick)
    kept = bench.folder / ("quick.json" if bench.quick else "figures.json")
    figures: dict[str, Any] = json.loads(kept.read_text()) if kept.exists() else {}
    kept.parent.mkdir(parents=True, exist_ok=True)
    for name in chosen.sections or SECTIONS:
        began = time.monotonic()
        figures[name] = SECTIONS[name].measure(bench)
        kept.write_text(json.dumps(figures, indent=1))
        print(f"{name}: {time.monotonic() - began:.0f} s", file=sys.stderr, flush=True)
    versions = {each.name: each.version() for each in (Ours(bench.build), *all_peers())}
    write(bench, figures, machine.describe(versions))


def write(bench: Bench, figures: dict[str, Any], conditions: list[str]) -> None:
    folder = bench.folder / "quick" if bench.quick else bench.top / "docs"
    text = ["# Performance", "",
            "Made by `bench/report.sh`, which measures this engine beside what else is installed on the",
            "machine. All figures are ratios of two sides measured in turn in one run; below 1 this",
            "engine takes less. A dash stands for what failed or took too long.", "",
            *(f"- {line}" for line in conditions), ""]
    rows: list[tuple[str, str]] = []
    for name, section in SECTIONS.items():
        if name in figures:
            text += [f"## {section.TITLE}", ""]
            text += section.write(figures[name], folder / "performance")
            rows += section.summary(figures[name])
    folder.mkdir(parents=True, exist_ok=True)
    (folder / "performance.md").write_text("\n".join(text).rstrip() + "\n")
    if not bench.quick:
        into_readme(bench.top / "README.md", rows)
    print(folder / "performance.md")


def into_readme(readme: Path, rows: list[tuple[str, str]]) -> None:
    """Between its two marks, the rows that people ask for first."""
    before, _, after = readme.read_text().split(MARK)
    lines = ["| beside others, in the same run; below 1 is less | ratio |", "|---|---:|",
             *(f"| {what} | {value} |" for what, value in rows)]
    readme.write_text("\n".join([before + MARK, *lines, MARK + after]))


main()
