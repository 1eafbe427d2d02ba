"""Where things are, and the documents that are measured."""
from __future__ import annotations

import subprocess
from dataclasses import dataclass
from pathlib import Path

MEGABYTES_OF_FACTOR_1 = 110


@dataclass(frozen=True)
class Bench:
    top: Path
    quick: bool

    @property
    def build(self) -> Path:
        return self.top / "build" / "release"

    @property
    def folder(self) -> Path:
        return self.top / "build" / "report"

    @property
    def rounds(self) -> int:
        return 1 if self.quick else 5

    def megabytes(self, wanted: float) -> float:
        return wanted / 100 if self.quick else wanted

    def document(self, kind: str, megabytes: float) -> Path:
        """Generated data of a kind, made once."""
        path = self.folder / "data" / f"{kind}-{self.megabytes(megabytes):g}.xml"
        if not path.exists():
            path.parent.mkdir(parents=True, exist_ok=True)
            unfinished = path.with_suffix(".part")
            factor = self.megabytes(megabytes) / MEGABYTES_OF_FACTOR_1
            with open(unfinished, "wb") as out:
                subprocess.run([self.build / f"xquery_{kind}", f"{factor:.6f}"], stdout=out,
                               check=True)
            unfinished.rename(path)
        return path

    def published(self) -> list[Path]:
        """The twenty queries usually asked of the auction data, in the form they are usually printed
        in; where that is the plain one, there is no other."""
        folder = self.top / "bench" / "queries" / "auction"
        plain = (each for each in sorted(folder.glob("*.plain.xq")) if each.name[0].isdigit())
        forms = ((each.with_name(each.name.replace(".plain.", ".published.")), each)
                 for each in plain)
        return [published if published.exists() else plain for published, plain in forms]
