"""What the figures were taken on."""
from __future__ import annotations

import os
import platform
import re
from pathlib import Path


def describe(versions: dict[str, str]) -> list[str]:
    memory = int(re.search(r"MemTotal:\s+(\d+)", Path("/proc/meminfo").read_text()).group(1))
    model = re.search(r"model name\s*:\s*(.+)", Path("/proc/cpuinfo").read_text())
    system = re.search(r'PRETTY_NAME="(.+)"', Path("/etc/os-release").read_text())
    lines = [
        f"Processor: {model.group(1).strip() if model else platform.machine()}, "
        f"{len(os.sched_getaffinity(0))} cores",
        f"Memory: {memory / 2**20:.0f} GiB",
        f"System: {system.group(1) if system else platform.system()}, Linux {platform.release()}",
    ]
    return lines + [f"{name}: {version}" for name, version in versions.items()]
