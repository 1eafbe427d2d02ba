"""The engine and the peers beside it: how each evaluates a query, and says how long that took."""
from __future__ import annotations

import re
import shutil
from pathlib import Path

from running import Failed, run

SAXON = Path("/usr/share/java/Saxon-HE.jar")


class Ours:
    """This engine, by its command."""

    name = "xquery"

    def __init__(self, build: Path) -> None:
        self.command = build / "xquery"

    def version(self) -> str:
        return run([self.command, "--version"]).output.split("\n")[0]

    def hot(self, document: Path, query: Path, repeat: int, limit: float) -> float:
        """Milliseconds to evaluate and to print over a document that is parsed already."""
        said = run([self.command, "--time", "--repeat", str(repeat), "-o", "/dev/null", query,
                    document], limit).output
        return sum(float(found(rf"{phase}\s+(?:median\s+)?([\d.]+)", said))
                   for phase in ("evaluate", "print"))

    def once(self, document: Path, query: str) -> list[str | Path]:
        return [self.command, "-e", query, document]

    def alone(self) -> list[str | Path]:
        return [self.command, "-e", "1"]


class Saxon:
    name = "Saxon-HE"

    def __init__(self) -> None:
        self.java: list[str | Path] = ["java", "-Xmx6g", "-cp", SAXON, "net.sf.saxon.Query"]

    @staticmethod
    def installed() -> bool:
        return SAXON.exists() and shutil.which("java") is not None

    def version(self) -> str:
        return found(r"Saxon-HE ([\d.]+J?)", run([*self.java, "-t", "-qs:1"]).output)

    def hot(self, document: Path, query: Path, repeat: int, limit: float) -> float:
        said = run([*self.java, f"-s:{document}", f"-q:{query}", "-t", f"-repeat:{repeat}",
                    "-o:/dev/null"], limit).output
        value, unit = re.findall(r"xecution time[^\d\n]*([\d.]+)(ms|s)", said)[-1]
        return float(value) * (1000 if unit == "s" else 1)

    def once(self, document: Path, query: str) -> list[str | Path]:
        return [*self.java, f"-s:{document}", f"-qs:{query}"]

    def alone(self) -> list[str | Path]:
        return [*self.java, "-qs:1"]


class BaseX:
    name = "BaseX"

    @staticmethod
    def installed() -> bool:
        return shutil.which("basex") is not None

    def version(self) -> str:
        return found(r"BaseX ([\d.]+)", run(["basex", "-h"], good=(0, 1)).output)

    def hot(self, document: Path, query: Path, repeat: int, limit: float) -> float:
        # -w keeps white space, so that all query the same document.
        said = run(["basex", "-w", "-s", "indent=no", "-i", document, "-V", "-r", str(repeat), "-o",
                    "/dev/null", query], limit).output
        phases = re.findall(r"^(?:Evaluating|Printing): ([\d.]+) ms", said, re.M)
        if not phases:
            raise Failed("no times")
        return sum(map(float, phases))

    def once(self, document: Path, query: str) -> list[str | Path]:
        return ["basex", "-w", "-i", document, query]

    def alone(self) -> list[str | Path]:
        return ["basex", "1"]


class Lxml:
    """libxml2's paths, from Python: for what a path can ask."""

    name = "lxml"
    python = "/usr/bin/python3"

    @staticmethod
    def installed() -> bool:
        try:
            run([Lxml.python, "-c", "import lxml.etree"])
        except Failed:
            return False
        return True

    def version(self) -> str:
        return run([self.python, "-c",
                    "import lxml.etree as e; print('.'.join(map(str, e.LXML_VERSION)))"]
                   ).output.strip()

    def once(self, document: Path, query: str) -> list[str | Path]:
        program = ("import sys, lxml.etree as e; "
                   "print(e.parse(sys.argv[1], e.XMLParser(huge_tree=True)).xpath(sys.argv[2]))")
        return [self.python, "-c", program, document, query]

    def alone(self) -> list[str | Path]:
        return [self.python, "-c", "import lxml.etree as e; print(e.XPath('1')(e.Element('a')))"]


def found(pattern: str, text: str) -> str:
    match = re.search(pattern, text)
    if not match:
        raise Failed(f"no {pattern} in {text[-200:]}")
    return match.group(1)


def peers() -> list[Saxon | BaseX]:
    """Those that evaluate whole queries."""
    return [kind() for kind in (Saxon, BaseX) if kind.installed()]


def all_peers() -> list[Saxon | BaseX | Lxml]:
    return [*peers(), *([Lxml()] if Lxml.installed() else [])]
