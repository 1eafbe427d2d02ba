"""Trees from text, of six kinds."""
from __future__ import annotations

import re
from pathlib import Path
from typing import Any

import page
from bench import Bench, MEGABYTES_OF_FACTOR_1
from running import run

TITLE = "Reading"
SIZES = (10, 100)
COLUMNS = ("sax", "engine/sax", "engine/pugixml", "libxml2/sax", "pugixml/sax", "bytes", "ns",
           "count/plain")


def measure(bench: Bench) -> dict[str, Any]:
    figures: dict[str, Any] = {}
    for size in SIZES:
        factor = bench.megabytes(size) / MEGABYTES_OF_FACTOR_1
        said = run([bench.build / "xquery_bench", "--reading", f"--factor={factor:.5f}"], 900).output
        for line in said.splitlines():
            row = re.fullmatch(r"(\D+?)\s+[\d.]+" + r"\s+([\d.]+)" * len(COLUMNS), line)
            if row:
                values = dict(zip(COLUMNS, map(float, row.groups()[1:])))
                figures.setdefault(row.group(1), {})[str(size)] = values
    return figures


def over(values: dict[str, float], peer: str) -> float | None:
    """Our time over that of a peer, both of which are known over that of the empty SAX handlers."""
    if peer == "SAX":
        return values["engine/sax"]
    if peer == "pugixml":
        return values["engine/pugixml"]
    return page.ratio(values["engine/sax"], values["libxml2/sax"])


def write(figures: dict[str, Any], plots: Path) -> list[str]:
    sides = ("SAX", "libxml2", "pugixml")
    text = [
        "Time to make a tree of a text in memory, over that which libxml2's SAX parser takes with",
        "handlers that do nothing, libxml2 for its tree, and pugixml for its tree, which checks less;",
        "and the memory of our tree, in bytes for each byte of text. The last column is the time of",
        "`count(//node())`, which is answered from what has been counted while reading, over that of",
        "a walk through as many nodes of 56 bytes, linked by pointers.",
        "",
    ]
    head = ["text"] + [f"/ {side}, {size} MB" for size in SIZES for side in sides]
    rows = []
    for kind, sizes in figures.items():
        rows.append([kind, *(over(sizes[str(size)], side) for size in SIZES for side in sides),
                     sizes[str(SIZES[-1])]["bytes"], sizes[str(SIZES[-1])].get("count/plain")])
    plot = plots / "reading.svg"
    page.bars(plot, f"Time to make a tree of {SIZES[-1]} MB, over that of", list(figures),
              {side: [over(sizes[str(SIZES[-1])], side) for sizes in figures.values()]
               for side in sides}, "ratio")
    return text + page.table([*head, "bytes a byte", "count"], rows) + page.image(plot, "times of reading")


def summary(figures: dict[str, Any]) -> list[tuple[str, str]]:
    of_libxml2 = page.mean(over(sizes["100"], "libxml2") for sizes in figures.values())
    return [("a tree of 100 MB of text, mean over six kinds, beside libxml2's tree",
             page.number(of_libxml2))]
