# SPDX-License-Identifier: MIT
"""A Spark cluster on this machine: a master and workers, each a process of its own, on the loopback address."""

import ctypes
import os
import signal
import socket
import subprocess
import sys
import time
import urllib.request
from pathlib import Path
from types import TracebackType

import pyspark

HOST = "127.0.0.1"


def _free_port() -> int:
    with socket.socket() as probe:
        probe.bind((HOST, 0))
        return int(probe.getsockname()[1])


def _end_with_parent() -> None:
    """The kernel ends this process when the one that started it is killed."""
    set_parent_death_signal = 1
    ctypes.CDLL(None).prctl(set_parent_death_signal, signal.SIGTERM)


class LocalCluster:
    """Started by `with`, ended after it. Logs and work files are in `folder`."""

    def __init__(self, folder: Path, workers: int = 2, cores: int = 1, memory: str = "1g") -> None:
        self._folder = folder
        self._port = _free_port()
        self._page = _free_port()
        self._wanted = workers
        self._worker_options = ["--cores", str(cores), "--memory", memory, "--work-dir", str(folder / "work")]
        self._processes: list[subprocess.Popen[bytes]] = []
        self.url = f"spark://{HOST}:{self._port}"
        self.dashboard = f"http://{HOST}:{self._page}"

    def __enter__(self) -> "LocalCluster":
        # What Spark calls Python in this process and in the workers.
        os.environ["PYSPARK_PYTHON"] = sys.executable
        try:
            self._start("master.Master", "--port", str(self._port), "--webui-port", str(self._page))
            self._wait_for(0)
            for _ in range(self._wanted):
                self._start("worker.Worker", *self._worker_options, "--webui-port", "0", self.url)
            self._wait_for(self._wanted)
        except BaseException:
            self._stop()
            raise
        return self

    def __exit__(
        self, kind: type[BaseException] | None, error: BaseException | None, trace: TracebackType | None
    ) -> None:
        self._stop()

    def kill_worker(self) -> None:
        """Ends the last worker and what it runs at once, as a machine that loses its power."""
        process = self._processes.pop()
        os.killpg(process.pid, signal.SIGKILL)
        process.wait()

    def _start(self, name: str, *arguments: str) -> None:
        home = Path(pyspark.__file__).parent
        environment = {
            **os.environ,
            "SPARK_HOME": str(home),
            "SPARK_LOCAL_IP": HOST,
            "SPARK_DAEMON_MEMORY": "256m",
        }
        command = [str(home / "bin" / "spark-class"), f"org.apache.spark.deploy.{name}", "--host", HOST, *arguments]
        with open(self._folder / f"{name}.{len(self._processes)}.log", "wb") as log:
            # A session of its own: a worker and its executors are ended together.
            process = subprocess.Popen(
                command, env=environment, stdout=log, stderr=log, start_new_session=True, preexec_fn=_end_with_parent
            )
        self._processes.append(process)

    def _wait_for(self, workers: int, seconds: float = 180) -> None:
        end = time.monotonic() + seconds
        while time.monotonic() < end:
            if any(process.poll() is not None for process in self._processes):
                raise RuntimeError(f"A process of the cluster has ended; see the logs in {self._folder}.")
            try:
                with urllib.request.urlopen(f"{self.dashboard}/json/", timeout=30) as answer:
                    if answer.read().count(b'"ALIVE"') >= workers:
                        return
            except OSError:
                pass
            time.sleep(0.2)
        raise RuntimeError(f"The cluster has not started within {seconds} s; see the logs in {self._folder}.")

    def _stop(self) -> None:
        for process in reversed(self._processes):
            try:
                os.killpg(process.pid, signal.SIGTERM)
                process.wait(20)
            except ProcessLookupError:
                process.wait()
            except subprocess.TimeoutExpired:
                os.killpg(process.pid, signal.SIGKILL)
                process.wait()
        self._processes.clear()
