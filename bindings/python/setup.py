"""Builds the package with pip:

    pip install --no-build-isolation ./bindings/python

Needed are CMake, a C++20 compiler, pybind11 and the headers of Python (Debian's cmake, g++,
pybind11-dev and python3-dev), and the installed library. Where that is not in the usual places,
CMAKE_PREFIX_PATH says where it is; where it is nowhere, it is built from the project that this
folder is in, and goes into the package. XQUERY_CMAKE_ARGUMENTS has further arguments for CMake.
"""

import os
import re
import shlex
import subprocess
import sys
from pathlib import Path

from setuptools import Extension, setup
from setuptools.command.build_ext import build_ext

HERE = Path(__file__).resolve().parent


def version() -> str:
    """The library's; what is here is of the same version."""
    project = HERE.parent.parent / "CMakeLists.txt"
    found = re.search(r"project\(xquery VERSION ([0-9.]+)", project.read_text())
    if not found:
        raise RuntimeError(f"{project} has no version")
    return found.group(1)


class BuiltByCMake(build_ext):
    """The module is one target of CMake, which installs it with its files into the package."""

    def build_extension(self, extension: Extension) -> None:
        folder = Path(self.get_ext_fullpath(extension.name)).resolve().parent
        build = Path(self.build_temp).resolve() / "cmake"
        build.mkdir(parents=True, exist_ok=True)
        configure = [
            "cmake",
            "-S",
            str(HERE),
            "-B",
            str(build),
            f"-DXQUERY_PYTHON={sys.executable}",
            f"-DXQUERY_PYTHON_FOLDER={folder.parent}",
            f"-DXQUERY_PYTHON_VERSION={version()}",
            *shlex.split(os.environ.get("XQUERY_CMAKE_ARGUMENTS", "")),
        ]
        jobs = str(len(os.sched_getaffinity(0)))
        subprocess.run(configure, check=True)
        subprocess.run(["cmake", "--build", str(build), "-j", jobs], check=True)
        subprocess.run(["cmake", "--install", str(build), "--component", "python"], check=True)


setup(
    name="xquery",
    version=version(),
    description="An XQuery engine for Python",
    license="Apache-2.0",
    packages=["xquery"],
    package_data={"xquery": ["py.typed", "*.pyi"]},
    python_requires=">=3.11",
    ext_modules=[Extension("xquery._xquery", sources=[])],
    cmdclass={"build_ext": BuiltByCMake},
    zip_safe=False,
)
