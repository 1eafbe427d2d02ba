"""Tables and plots of the page."""
from __future__ import annotations

import math
from collections.abc import Iterable, Sequence
from pathlib import Path

import matplotlib

matplotlib.use("svg")
import matplotlib.pyplot as plt  # noqa: E402 - the way of drawing is chosen before it is loaded

# The same figures give the same file.
matplotlib.rcParams["svg.hashsalt"] = "xquery"
matplotlib.rcParams["svg.fonttype"] = "none"

COLOURS = {"xquery": "#1b6ac9", "Saxon-HE": "#c2571a", "BaseX": "#3c8d40", "libxml2": "#7a4fa3",
           "pugixml": "#b03060", "lxml": "#6b6b6b"}


def number(value: float | None) -> str:
    """Three figures; a dash for what could not be measured."""
    if value is None:
        return "-"
    return f"{value:.0f}" if value >= 100 else f"{value:.3g}"


def ratio(part: float | None, whole: float | None) -> float | None:
    return part / whole if part is not None and whole else None


def mean(ratios: Iterable[float | None]) -> float | None:
    """The geometric mean of those that there are."""
    logarithms = [math.log(each) for each in ratios if each]
    return math.exp(sum(logarithms) / len(logarithms)) if logarithms else None


def table(head: Sequence[str], rows: Iterable[Sequence[str | float | None]]) -> list[str]:
    def line(cells: Iterable[str]) -> str:
        return "| " + " | ".join(cells) + " |"

    written = [line(head), line(["---"] + ["---:"] * (len(head) - 1))]
    for row in rows:
        written.append(line(cell if isinstance(cell, str) else number(cell) for cell in row))
    return written + [""]


def bars(path: Path, title: str, groups: Sequence[str], sides: dict[str, list[float | None]],
         label: str) -> None:
    """A group of bars for each row, one bar for each side; a line where both sides are equal."""
    figure, axes = plt.subplots(figsize=(9, 0.9 + 0.24 * len(groups) * max(1, len(sides) * 0.7)))
    height = 0.8 / len(sides)
    for i, (side, values) in enumerate(sides.items()):
        places = [row + i * height for row in range(len(groups))]
        axes.barh(places, [value or 0 for value in values], height, label=side,
                  color=COLOURS.get(side))
    axes.set_yticks([row + 0.4 - height / 2 for row in range(len(groups))], groups)
    axes.invert_yaxis()
    axes.axvline(1, color="black", linewidth=0.8)
    finish(figure, axes, path, title, label)


def lines(path: Path, title: str, across: Sequence[float],
          sides: dict[str, Sequence[float | None]], labels: tuple[str, str]) -> None:
    """A line for each side, both axes logarithmic."""
    figure, axes = plt.subplots(figsize=(8, 4.5))
    for side, values in sides.items():
        points = [(x, y) for x, y in zip(across, values) if y]
        axes.plot([x for x, _ in points], [y for _, y in points], marker="o", label=side,
                  color=COLOURS.get(side.split(",")[0]),
                  linestyle="-" if "," not in side else "--")
    axes.set_xscale("log")
    axes.set_yscale("log")
    axes.set_ylabel(labels[1])
    finish(figure, axes, path, title, labels[0])


def finish(figure: plt.Figure, axes: plt.Axes, path: Path, title: str, label: str) -> None:
    axes.set_title(title)
    axes.set_xlabel(label)
    axes.legend()
    axes.grid(axis="x", linewidth=0.3)
    figure.tight_layout()
    path.parent.mkdir(parents=True, exist_ok=True)
    figure.savefig(path, metadata={"Date": None})
    plt.close(figure)


def image(path: Path, text: str) -> list[str]:
    return [f"![{text}](performance/{path.name})", ""]
