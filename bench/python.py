#!/usr/bin/env python3
"""What Python adds to the time of the library, each pair measured in the same run.

    PYTHONPATH=build/release/python /usr/bin/python3 bench/python.py [build/release/xquery]

- one item: an evaluation over a parsed document, against the same in C++, as the command's
  ``--repeat`` measures it
- strings: 100,000 of them, against lxml's XPath over the same document

Times are minima of several rounds, in turns, so that both sides have had the machine alike.
"""

from __future__ import annotations

import re
import subprocess
import sys
import time
from pathlib import Path
from typing import Any, Callable, List, Optional, Tuple

import xquery

ROUNDS = 7
STRINGS = 100_000
ONE_ITEM = "count(/a/b)"


def shortest(*sides: Callable[[], Any], rounds: int = ROUNDS) -> List[float]:
    """The shortest time of each side, in seconds."""
    best = [float("inf")] * len(sides)
    for _ in range(rounds):
        for index, side in enumerate(sides):
            start = time.perf_counter()
            side()
            best[index] = min(best[index], time.perf_counter() - start)
    return best


def evaluate_one_item(times: int = 2000) -> float:
    """Seconds for each evaluation from Python."""
    document = xquery.parse("<a><b/></a>")
    query = xquery.compile(ONE_ITEM)

    def run() -> None:
        for _ in range(times):
            query.evaluate(document)[0]

    return shortest(run)[0] / times


def evaluate_one_item_in_cpp(command: Path, folder: Path) -> Optional[float]:
    """Seconds for each evaluation in C++: the command's own measure, the minimum of many."""
    file = folder / "one.xml"
    file.write_text("<a><b/></a>")
    done = subprocess.run(
        [command, "--time", "--repeat", "2000", "-e", ONE_ITEM, file],
        capture_output=True,
        text=True,
        check=True,
    )
    found = re.search(r"evaluate.*?([0-9.]+) ?ms.*?([0-9.]+) ?ms", done.stderr)
    return min(float(number) for number in found.groups()) / 1000 if found else None


def documents_of_strings() -> Tuple[xquery.Node, Any]:
    from lxml import etree  # type: ignore[import]

    text = "<a>" + "".join(f"<b>text {number}</b>" for number in range(STRINGS)) + "</a>"
    return xquery.parse(text), etree.fromstring(text)


def strings() -> Tuple[float, float]:
    """Seconds for all the strings, from this module and from lxml."""
    document, tree = documents_of_strings()
    query = xquery.compile("for $b in /a/b return string($b)")
    from lxml import etree

    path = etree.XPath("/a/b/text()")
    assert list(query.evaluate(document)) == path(tree)
    ours, theirs = shortest(lambda: list(query.evaluate(document)), lambda: path(tree))
    return ours, theirs


def main() -> None:
    one = evaluate_one_item()
    print(f"one item, Python:      {one * 1e6:8.2f} us")
    if len(sys.argv) > 1:
        import tempfile

        with tempfile.TemporaryDirectory() as folder:
            cpp = evaluate_one_item_in_cpp(Path(sys.argv[1]).resolve(), Path(folder))
        if cpp is not None:
            print(f"one item, C++:         {cpp * 1e6:8.2f} us")
            print(f"added by Python:       {(one - cpp) * 1e6:8.2f} us")
    ours, theirs = strings()
    print(f"{STRINGS} strings:        {ours * 1e3:8.2f} ms")
    print(f"the same, lxml:        {theirs * 1e3:8.2f} ms")
    print(f"ratio:                 {ours / theirs:8.2f}")


if __name__ == "__main__":
    main()
