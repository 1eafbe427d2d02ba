"""The package as a whole: its types, the examples of its documentation, and pip."""

from __future__ import annotations

import doctest
import importlib
import inspect
import os
import re
import shutil
import subprocess
import sys
from pathlib import Path
from typing import Callable, Dict, List

import pytest

import xquery

ROOT = Path(__file__).resolve().parents[2]
BUILD = Path(os.environ.get("XQUERY_BUILD", ROOT / "build" / "release"))
SOURCES = ROOT / "bindings" / "python"
MODULES = ["", "._documents", "._errors", "._lxml", "._queries", "._settings", "._values"]
MODULES += ["._xquery"]


@pytest.mark.parametrize("name", MODULES)
def test_examples_of_docstrings(name: str) -> None:
    if name == "._lxml":
        pytest.importorskip("lxml", reason="lxml is not installed (Debian's python3-lxml)")
    module = importlib.import_module("xquery" + name)
    failed, tried = doctest.testmod(module)
    assert failed == 0
    assert tried > 0


@pytest.mark.parametrize("page", ["docs/python.md", "README.md"])
def test_examples_of_pages(page: str) -> None:
    """The blocks of Python of a page are one program, in which >>> shows what is printed."""
    if "lxml" in (ROOT / page).read_text(encoding="utf-8"):
        pytest.importorskip("lxml", reason="lxml is not installed (Debian's python3-lxml)")
    text = (ROOT / page).read_text(encoding="utf-8")
    blocks = re.findall(r"^```pycon\n(.*?)^```", text, re.MULTILINE | re.DOTALL)
    assert blocks
    parser = doctest.DocTestParser()
    test = parser.get_doctest("\n".join(blocks), {}, page, page, 0)
    runner = doctest.DocTestRunner(optionflags=doctest.ELLIPSIS)
    report: List[str] = []
    runner.run(test, out=report.append)
    assert runner.failures == 0, "".join(report)


def test_everything_public_is_documented_and_listed() -> None:
    for name in xquery.__all__:
        value = getattr(xquery, name)
        if inspect.isclass(value) or inspect.isfunction(value):
            assert value.__doc__, name
    for name in dir(xquery.Node) + dir(xquery.Result):
        if not name.startswith("_"):
            owner = xquery.Node if hasattr(xquery.Node, name) else xquery.Result
            assert getattr(owner, name).__doc__.strip(), name
    assert xquery.__all__ == sorted(xquery.__all__)
    page = (ROOT / "docs" / "python.md").read_text(encoding="utf-8")
    assert [name for name in xquery.__all__ if not re.search(rf"\b{name}\b", page)] == []


def test_whatever_takes_settings_takes_all_of_them() -> None:
    def keywords(function: Callable[..., object]) -> Dict[str, object]:
        parameters = inspect.signature(function).parameters.values()
        return {each.name: each.default for each in parameters if each.kind is each.KEYWORD_ONLY}

    settings = inspect.signature(importlib.import_module("xquery._settings").Settings).parameters
    defaults = {name: each.default for name, each in settings.items()}
    assert len(defaults) > 5
    assert keywords(xquery.compile) == keywords(xquery.Context) == defaults


def mypy(*arguments: str, path: str = "") -> "subprocess.CompletedProcess[str]":
    if shutil.which("/usr/bin/mypy") is None:
        pytest.skip("mypy is not installed (Debian's mypy)")
    return subprocess.run(
        ["/usr/bin/mypy", "--strict", "--cache-dir", os.devnull, *arguments],
        capture_output=True,
        text=True,
        cwd=ROOT,
        env={**os.environ, "MYPYPATH": path},
    )


def test_types_of_the_package() -> None:
    done = mypy("bindings/python/xquery")
    assert done.returncode == 0, done.stdout


def test_types_of_the_tests() -> None:
    done = mypy("tests/python", "bench/python.py", path="bindings/python")
    assert done.returncode == 0, done.stdout


def test_stubs_are_what_the_module_has() -> None:
    stub = (SOURCES / "xquery" / "_xquery.pyi").read_text(encoding="utf-8")
    module = importlib.import_module("xquery._xquery")
    declared: Dict[str, List[str]] = {}
    current = ""
    for line in stub.splitlines():
        found = re.match(r"(?:class (\w+)|( *)def (\w+))", line)
        if found and found.group(1):
            current = found.group(1)
            declared[current] = []
        elif found and found.group(2):
            declared[current].append(found.group(3))
        elif found:
            assert callable(getattr(module, found.group(3)))
    for name, members in declared.items():
        existing = vars(getattr(module, name))
        for member in members:
            assert member in existing, f"{name}.{member}"
        for member in existing:
            assert member.startswith("_") or member in members, f"{name}.{member}"
    public = {name for name in vars(module) if not name.startswith("_")}
    functions = set(re.findall(r"^def (\w+)", stub, re.MULTILINE))
    assert public == set(declared) | {name for name in functions if not name.startswith("_")}


PROGRAM = """
import xquery, sys
assert xquery.__file__.startswith(sys.argv[1]), xquery.__file__
print(xquery.query("//book[price > 20]/title/string()", sys.argv[2]).one())
"""


def test_pip_builds_against_the_installed_library(tmp_path: Path) -> None:
    for name in ("cmake", "g++"):
        if shutil.which(name) is None:
            pytest.skip(f"{name} is not installed")
    prefix, target = tmp_path / "prefix", tmp_path / "target"
    # pip leaves what it builds beside the sources. The library's own are not there, nor needed.
    copy = tmp_path / "project"
    shutil.copytree(SOURCES, copy / "bindings" / "python")
    shutil.copytree(ROOT / "cmake", copy / "cmake")
    shutil.copy(ROOT / "CMakeLists.txt", copy)
    subprocess.run(
        ["cmake", "--install", str(BUILD), "--prefix", str(prefix)], check=True, capture_output=True
    )
    environment = {
        **os.environ,
        "CMAKE_PREFIX_PATH": str(prefix),
        # What is tested is that it builds, which takes a fraction of the time so.
        "XQUERY_CMAKE_ARGUMENTS": "-DCMAKE_BUILD_TYPE=Debug -DCMAKE_CXX_FLAGS_DEBUG=-O0",
    }
    environment.pop("PYTHONPATH")
    done = subprocess.run(
        [sys.executable, "-m", "pip", "install", "--no-build-isolation", "--no-deps", "--no-index"]
        + ["--disable-pip-version-check", "--root-user-action=ignore"]
        + ["--target", str(target), str(copy / "bindings" / "python")],
        capture_output=True,
        text=True,
        env=environment,
    )
    assert done.returncode == 0, done.stdout + done.stderr
    assert (target / "xquery" / "py.typed").exists()
    assert (target / "xquery" / "_xquery.pyi").exists()
    done = subprocess.run(
        [sys.executable, "-c", PROGRAM, str(target), str(ROOT / "examples" / "books.xml")],
        capture_output=True,
        text=True,
        cwd=tmp_path,
        env={**environment, "PYTHONPATH": str(target)},
    )
    assert (done.returncode, done.stdout) == (0, "A Field Guide to Lichens\n"), done.stderr
