"""The service under test, programs that take its place, and what this process has open."""

from __future__ import annotations

import os
import signal
import subprocess
import sys
import tempfile
import textwrap
import time
import unittest
from pathlib import Path

PROJECT = Path(__file__).resolve().parents[2]
PACKAGE = PROJECT / "python"
SERVICE = os.environ.get("TALLOWMERE_SERVICE", str(PROJECT / "build/dev/bin/tallowmere"))


class FolderTest(unittest.TestCase):
    """A test with a temporary folder of its own, in which it can write programs."""

    def setUp(self) -> None:
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = os.path.realpath(folder.name)

    def program(self, code: str) -> str:
        """A program with that Python code, to be started in the service's place."""
        path = os.path.join(self.folder, "stand-in")
        with open(path, "w") as file:
            file.write(f"#!{sys.executable} -IS\nimport os, sys, time\n{textwrap.dedent(code)}")
        os.chmod(path, 0o700)
        return path

    def run_host(self, code: str, *arguments: str) -> str:
        """What a program of its own with that code says on standard output; it has to succeed."""
        prologue = f"import os, signal, sys\nfrom tallowmere import *\nSERVICE = {SERVICE!r}\n"
        return self.run_python(["-c", prologue + textwrap.dedent(code), *arguments])

    def run_python(
        self, arguments: list[str], environment: dict[str, str] = {}, interpreter: str = sys.executable
    ) -> str:
        host = subprocess.run(
            [interpreter, *arguments],
            env={**os.environ, "PYTHONPATH": str(PACKAGE), **environment},
            cwd=self.folder, capture_output=True, text=True, timeout=60,
        )  # fmt: skip
        self.assertEqual((host.returncode, host.stderr), (0, ""))
        return host.stdout


def children() -> list[int]:
    """The children of this process, also those that ended and were not waited for."""
    found = []
    for process in filter(str.isdecimal, os.listdir("/proc")):
        try:
            with open(f"/proc/{process}/stat", "rb") as file:
                fields = file.read().rpartition(b")")[2].split()
        except OSError:
            continue  # it ended meanwhile
        if int(fields[1]) == os.getpid():
            found.append(int(process))
    return found


def has_ended(process: int) -> bool:
    """Whether a process is no more, or has only not been waited for."""
    try:
        return ") Z " in Path(f"/proc/{process}/stat").read_text()
    except OSError:
        return True


def descriptors() -> set[str]:
    return set(os.listdir("/proc/self/fd"))


def kill_child(number: int = signal.SIGKILL) -> None:
    """Sends a signal to the one child, and with SIGKILL sees it end; it is not waited for here."""
    [child] = children()
    os.kill(child, number)
    while number == signal.SIGKILL and not has_ended(child):
        time.sleep(0.001)


def in_own_mounts(test: FolderTest, code: str, needs: str = "/") -> str:
    """What a program says that has a client and may mount, in a mount namespace of its own. Skipped where that is not
    permitted, or what it needs is not there."""
    if not os.path.exists(needs):
        test.skipTest(f"there is no {needs}")
    prologue = f"""
        import os, subprocess, sys
        from tallowmere import *
        def mount(*arguments): subprocess.run(["mount", *arguments], check=True)
        client = Client({SERVICE!r})
        """
    enter = ["unshare", "--mount", *([] if os.getuid() == 0 else ["--map-root-user"])]
    try:
        permitted = subprocess.run([*enter, "mount", "-t", "tmpfs", "none", test.folder], capture_output=True)
    except FileNotFoundError:
        test.skipTest("there is no unshare")
    if permitted.returncode != 0:
        test.skipTest(f"it may not mount here: {permitted.stderr.decode().strip()}")
    program = textwrap.dedent(prologue) + textwrap.dedent(code)
    host = subprocess.run(
        [*enter, sys.executable, "-W", "error", "-c", program],
        env={**os.environ, "PYTHONPATH": str(PACKAGE), "PYTHONIOENCODING": "utf-8"},
        cwd=test.folder, capture_output=True, text=True, timeout=60,
    )  # fmt: skip
    test.assertEqual(host.stderr, "")
    return host.stdout
