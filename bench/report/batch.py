"""One question to many files."""
from __future__ import annotations

import shutil
from pathlib import Path
from typing import Any

import page
from bench import Bench
from engines import Lxml, Ours
from running import in_turn, run

TITLE = "Many files"
FILES = 500
MEGABYTES = 0.2
QUESTION = "count(//item)"


def measure(bench: Bench) -> dict[str, Any]:
    folder = bench.folder / "data" / f"batch-{bench.megabytes(MEGABYTES):g}"
    if not folder.exists():
        original = bench.document("auction", MEGABYTES)
        folder.mkdir(parents=True)
        for i in range(FILES):
            shutil.copyfile(original, folder / f"{i:04}.xml")
    ours = Ours(bench.build).command
    commands: dict[str, list[str | Path]] = {
        "on all cores": [ours, "-e", QUESTION, folder],
        "on one": [ours, "--jobs", "1", "-e", QUESTION, folder],
    }
    if Lxml.installed():
        program = ("import sys, pathlib, lxml.etree as e; q = e.XPath(sys.argv[2])\n"
                   "for p in sorted(pathlib.Path(sys.argv[1]).iterdir()): print(q(e.parse(str(p))))")
        commands["lxml"] = [Lxml.python, "-c", program, folder, QUESTION]
    return in_turn({side: lambda side=side: run(commands[side]).seconds for side in commands},
                   bench.rounds)


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    text = [f"`{QUESTION}` asked of {FILES} files of {MEGABYTES} MB by one command: the time on the",
            "clock, over that of the same command on one core, and over lxml's in one process.", ""]
    rows = [["on all cores", page.ratio(figures["on all cores"], figures["on one"]),
             page.ratio(figures["on all cores"], figures.get("lxml"))],
            ["on one", 1.0, page.ratio(figures["on one"], figures.get("lxml"))]]
    return text + page.table(["", "/ on one core", "/ lxml"], rows)


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    return []
