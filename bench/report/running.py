"""Running a command as users do, and what that took."""
from __future__ import annotations

import os
import re
import resource
import signal
import statistics
import subprocess
import tempfile
import time
from collections.abc import Callable, Sequence
from dataclasses import dataclass
from pathlib import Path


@dataclass(frozen=True)
class Run:
    """What one process took: seconds on the clock and of processors, the most memory it held."""

    seconds: float
    processor: float
    peak: int  # bytes
    output: str


class Failed(Exception):
    """A command that ended with another status than a good one, or not in time."""


def run(command: Sequence[str | Path], limit: float = 120, stdin: Path | None = None,
        good: Sequence[int] = (0,)) -> Run:
    """Runs to the end; the output is the standard one and that for errors together."""
    with tempfile.TemporaryFile() as said, open(stdin or os.devnull, "rb") as given:
        began = time.perf_counter()
        process = subprocess.Popen([str(word) for word in command], stdin=given, stdout=said,
                                   stderr=subprocess.STDOUT, start_new_session=True)
        status, usage, seen = wait(process, began + limit)
        seconds = time.perf_counter() - began
        said.seek(0)
        output = said.read().decode("utf-8", "replace")
    if status is None:
        raise Failed(f"over {limit:.0f} s")
    if status not in good:
        raise Failed(f"status {status}: {' '.join(output.split())[-200:]}")
    # What a process held before it became the command, which is our own memory, counts as its peak,
    # too: below ours only what was seen meanwhile tells.
    ours = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss
    peak = usage.ru_maxrss if usage.ru_maxrss > ours else seen
    return Run(seconds, usage.ru_utime + usage.ru_stime, peak * 1024, output)


def wait(process: subprocess.Popen[bytes], until: float):
    """The status, none where time ran out, what the process and its children used, and the most
    memory that it was seen to hold, in KiB."""
    seen = 0
    while True:
        pid, status, usage = os.wait4(process.pid, os.WNOHANG)
        if pid:
            process.returncode = os.waitstatus_to_exitcode(status)
            return process.returncode, usage, seen
        seen = max(seen, held(process.pid))
        if time.perf_counter() > until:
            os.killpg(process.pid, signal.SIGKILL)
            _, _, usage = os.wait4(process.pid, 0)
            process.returncode = -signal.SIGKILL
            return None, usage, seen
        time.sleep(0.0005)


def held(pid: int) -> int:
    """The most memory a running process has held so far, in KiB; nothing for one that has ended."""
    try:
        said = Path(f"/proc/{pid}/status").read_text()
    except OSError:
        return 0
    found = re.search(r"VmHWM:\s+(\d+)", said)
    return int(found.group(1)) if found else 0


def in_turn(sides: dict[str, Callable[[], float]], rounds: int) -> dict[str, float | None]:
    """The median of each side, one round of all after the other, so that what the machine does
    besides falls on everybody; none for a side that fails."""
    taken: dict[str, list[float]] = {side: [] for side in sides}
    failed: set[str] = set()
    for _ in range(rounds):
        for side, measure in sides.items():
            if side in failed:
                continue
            try:
                taken[side].append(measure())
            except Failed:
                failed.add(side)
    return {side: None if side in failed else statistics.median(taken[side]) for side in sides}
