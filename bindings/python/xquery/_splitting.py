"""Large documents, cut into pieces by the command."""

from __future__ import annotations

import json
import os
import pathlib
import re
import shutil
import subprocess
import tempfile
from typing import Dict, Iterator, List, Optional, Set, Union

import xquery

__all__ = ["Records"]


class Records:
    """A document that is cut into pieces of ``count`` records each.

    ``records`` is the path to the records, such as ``/site/people/person``, and what a query over
    the pieces gives is what it gives over the document as long as it looks at one record after the
    other. ``xquery --split`` cuts, on the machine of the client, in one pass and in the memory of
    one record; pieces are worked on as soon as they are whole.

    ``folder`` is where the pieces go: storage that all workers share. It is made where there is
    none, and must be empty. Without it the pieces go to a temporary folder, which is good where all
    workers are on this machine. A piece is removed when it has been evaluated, unless ``keep``; one
    that fails stays in the folder, to be looked at.

    ``namespaces`` makes prefixes known to the path. ``command`` is the command to run.
    """

    def __init__(
        self,
        path: Union[str, "os.PathLike[str]"],
        records: str,
        count: int,
        folder: Union[None, str, "os.PathLike[str]"] = None,
        *,
        namespaces: Optional[Dict[str, str]] = None,
        keep: bool = False,
        command: str = "xquery",
    ) -> None:
        if count < 1:
            raise ValueError("count must be 1 or more")
        if keep and folder is None:
            raise ValueError("keep requires a folder")
        self.path = os.fspath(path)
        self.records = records
        self.count = count
        # As workers know it, wherever they were started.
        self.folder = None if folder is None else os.path.abspath(folder)
        self.namespaces = dict(namespaces or {})
        self.keep = keep
        self.command = command
        self._temporary: Optional[str] = None
        self._pieces: Set[str] = set()
        self._process: Optional["subprocess.Popen[str]"] = None

    def __repr__(self) -> str:
        return f"Records({self.path!r}, {self.records!r}, {self.count})"

    def pieces(self) -> Iterator[str]:
        """The paths of the pieces, each once it is whole.

        Raises ``xquery.Error`` where the path is no path to records, ``xquery.DocumentError`` where
        the document is not well formed, behind the pieces before that, and ``OSError``.
        """
        folder = self._prepare()
        with tempfile.TemporaryFile("w+") as messages:
            self._process = subprocess.Popen(
                self._arguments(folder), stdout=subprocess.PIPE, stderr=messages, text=True
            )
            assert self._process.stdout is not None
            with self._process.stdout as names:
                for line in names:
                    name = line.rstrip("\n")
                    self._pieces.add(name)
                    yield name
            status = self._process.wait()
            if status != 0:
                messages.seek(0)
                raise _error(messages.read(), self.path, status)

    def done(self, path: str) -> None:
        """Removes a piece that has been evaluated. Of another path nothing is done."""
        if not self.keep and path in self._pieces:
            self._pieces.remove(path)
            pathlib.Path(path).unlink(missing_ok=True)

    def close(self) -> None:
        """Ends the cutting, and removes what is temporary."""
        if self._process is not None and self._process.poll() is None:
            self._process.terminate()
            self._process.wait()
        self._process = None
        if self._temporary is not None:
            shutil.rmtree(self._temporary, ignore_errors=True)
            self._temporary = None

    def _prepare(self) -> str:
        if self.folder is not None:
            return self.folder
        self._temporary = tempfile.mkdtemp(prefix="xquery-pieces-")
        # Workers may be somebody else's processes.
        os.chmod(self._temporary, 0o755)
        return self._temporary

    def _arguments(self, folder: str) -> List[str]:
        arguments = [self.command, "--as", "json", "--quiet"]
        for prefix, URI in self.namespaces.items():
            arguments += ["--namespace", f"{prefix}={URI}"]
        arguments += ["--split", self.records, "--records", str(self.count)]
        # What begins with a dash is no option.
        return [*arguments, "--", self.path, folder]


_PLACE = re.compile(r"(?s).*?:(\d+):(\d+): (.*)")


def _error(messages: str, path: str, status: int) -> Exception:
    """What the command's messages tell of."""
    for line in messages.splitlines():
        try:
            told = json.loads(line)
        except ValueError:
            continue
        message = told.get("message", "")
        if told.get("status") == 1:
            return xquery.Error(
                message, number=told.get("code", 0), category=told.get("category", "internal")
            )
        place = _PLACE.fullmatch(message)
        if place:
            return xquery.DocumentError(place[3], path, int(place[1]), int(place[2]))
        return OSError(message)
    return OSError(messages.strip() or f"the command ended with status {status}")
