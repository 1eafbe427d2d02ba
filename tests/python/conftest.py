"""What the tests of the Python module share."""

from __future__ import annotations

import os
import subprocess
import sys
from pathlib import Path
from typing import Callable

import pytest

import xquery

ROOT = Path(__file__).resolve().parents[2]


@pytest.fixture(autouse=True)
def in_the_project(monkeypatch: pytest.MonkeyPatch) -> None:
    """Relative paths of the examples are those of the project."""
    monkeypatch.chdir(ROOT)


@pytest.fixture
def books() -> xquery.Node:
    return xquery.parse(ROOT / "examples" / "books.xml")


@pytest.fixture
def run_python() -> Callable[[str], subprocess.CompletedProcess[str]]:
    """A program in a process of its own, with the same module."""

    def run(program: str) -> subprocess.CompletedProcess[str]:
        return subprocess.run(
            [sys.executable, "-X", "faulthandler", "-c", program],
            capture_output=True,
            text=True,
            timeout=120,
            cwd=ROOT,
            env={**os.environ, "PYTHONDEVMODE": "1"},
        )

    return run
