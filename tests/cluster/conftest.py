"""A cluster of processes on this machine: a scheduler and as many workers as are asked for."""

import os
import pathlib
import shutil
import signal
import subprocess
import sys
import tempfile
import time

import distributed
import pytest

HERE = pathlib.Path(__file__).parent
NOBODY = 65534


class Cluster:
    """Everything that it starts it also ends. Whoever is root has it run by nobody, who may not read
    all files."""

    def __init__(self, folder):
        self.folder = folder
        self.processes = {}
        self.environment = dict(
            os.environ,
            HOME=str(folder),
            PYTHONPATH=os.pathsep.join([*sys.path, str(HERE)]),
            # So that losing a worker once is enough to suspect what it had.
            DASK_DISTRIBUTED__SCHEDULER__ALLOWED_FAILURES="0",
            DASK_DISTRIBUTED__ADMIN__LOG_FORMAT="%(levelname)s %(message)s",
        )
        self.user = {}
        if os.geteuid() == 0:
            self.user = {"user": NOBODY, "group": NOBODY, "extra_groups": []}
            os.chown(folder, NOBODY, NOBODY)
            if not self.is_able_to_import():
                self.user = {}
        self.file = folder / "scheduler.json"
        self.start("scheduler", "dask_scheduler", "--host", "127.0.0.1", "--port", "0",
                   "--scheduler-file", str(self.file), "--no-dashboard")
        self.wait_for(self.file.exists)
        self.client = distributed.Client(scheduler_file=str(self.file), timeout=60)

    def is_able_to_import(self):
        command = [sys.executable, "-c", "import xquery.cluster"]
        return subprocess.run(command, env=self.environment, stderr=subprocess.DEVNULL,
                              **self.user).returncode == 0

    def is_restricted(self):
        return bool(self.user) or os.geteuid() != 0

    def start(self, name, module, *arguments):
        with open(self.folder / f"{name}.log", "w") as log:
            self.processes[name] = subprocess.Popen(
                [sys.executable, "-m", f"distributed.cli.{module}", *arguments],
                cwd=self.folder, env=self.environment, stdout=log, stderr=log, **self.user)

    def start_workers(self, *names):
        for name in names:
            self.start(name, "dask_worker", "--scheduler-file", str(self.file), "--nthreads", "1",
                       "--name", name, "--no-nanny", "--no-dashboard", "--host", "127.0.0.1",
                       "--local-directory", str(self.folder / "work"))
        self.wait_for(lambda: set(names) <= set(self.workers()))

    def workers(self):
        known = self.client.scheduler_info()["workers"].values()
        return [worker["name"] for worker in known]

    def kill(self, name):
        process = self.processes.pop(name)
        process.send_signal(signal.SIGKILL)
        process.wait()

    def wait_for(self, condition, seconds=60):
        end = time.monotonic() + seconds
        while not condition():
            lost = [name for name, each in self.processes.items() if each.poll() is not None]
            assert not lost, (self.folder / f"{lost[0]}.log").read_text()
            assert time.monotonic() < end, "the cluster does not start"
            time.sleep(0.05)

    def close(self):
        self.client.close()
        for process in self.processes.values():
            process.terminate()
        for process in self.processes.values():
            try:
                process.wait(10)
            except subprocess.TimeoutExpired:
                process.kill()
                process.wait()


@pytest.fixture(scope="session")
def shared_folder():
    """What all processes of a cluster can read, as storage that machines share."""
    folder = pathlib.Path(tempfile.mkdtemp(prefix="xquery-cluster-"))
    folder.chmod(0o755)
    yield folder
    shutil.rmtree(folder)


@pytest.fixture(scope="session")
def cluster(shared_folder):
    folder = shared_folder / "cluster"
    folder.mkdir()
    cluster = Cluster(folder)
    yield cluster
    cluster.close()


@pytest.fixture
def two_workers(cluster):
    """A cluster of two workers with one thread each, whatever became of others before."""
    missing = [name for name in ("one", "two") if name not in cluster.workers()]
    if missing:
        cluster.start_workers(*missing)
    return cluster


@pytest.fixture
def folder(shared_folder, request):
    folder = shared_folder / request.node.name
    folder.mkdir()
    return folder
