"""The running service: started, written to, and ended."""

from __future__ import annotations

import contextlib
import fcntl
import os
import shutil
import signal
import subprocess
import sys
import weakref
from typing import IO

from ._outcome import ServiceError

GRACE = 1.0  # seconds that a service has to end by itself
CHUNK = 65536


class ServiceEnded(ServiceError):
    """The service ended, or closed its output, before it had answered."""


class DeadlineMissed(ServiceError):
    """The service did not answer in time, and was killed."""


class ProtocolError(ServiceError):
    """The service answered what the protocol does not know, and was killed."""


class Process:
    """A running service, and this process's ends of its two pipes.

    After a fork it is the parent's: the child's copies of the pipes are closed at once, so that the service sees the
    end of its input when the parent closes its own.
    """

    def __init__(self, program: str | os.PathLike[str] | None) -> None:
        self.owner = os.getpid()
        try:
            self._child = subprocess.Popen(
                [program or _find_service(), str(self.owner)],
                bufsize=0, stdin=subprocess.PIPE, stdout=subprocess.PIPE,
            )  # fmt: skip
            assert self._child.stdin and self._child.stdout
            self.input, self.output = _own(self._child.stdin), _own(self._child.stdout)
        except OSError as error:
            raise ServiceError(f"The service could not be started: {error}.") from error
        self._open = True
        _running.add(self)

    @property
    def id(self) -> int:
        return self._child.pid

    def close(self) -> None:
        """Closes the pipes, which lets the service end by itself."""
        if self._open:
            self._open = False
            os.close(self.input)
            os.close(self.output)

    def has_ended(self) -> bool:
        """Whether it has; it is waited for then."""
        return self._child.poll() is not None

    def end(self, grace: float = 0) -> str:
        """Closes the pipes, lets the service end within grace seconds, then kills it; tells how it ended."""
        self.close()
        if self.owner != os.getpid():
            return "belongs to another process"
        try:
            self._child.wait(grace)
        except subprocess.TimeoutExpired:
            self._child.kill()
            with contextlib.suppress(subprocess.TimeoutExpired):
                self._child.wait(GRACE)
            return "closed its output"
        return self.ending()

    def ending(self) -> str:
        """How it ended. REQUIRES: it has."""
        status = self._child.returncode
        return f"ended with status {status}" if status >= 0 else f"was ended by signal {-status}"

    def leave_to_parent(self) -> None:
        """In a child after a fork: lets go of the service without a word to it."""
        self.close()
        self._child.returncode = 0  # nobody here waits for it


_running: weakref.WeakSet[Process] = weakref.WeakSet()


def _after_fork() -> None:
    for process in list(_running):
        process.leave_to_parent()
    _running.clear()


os.register_at_fork(after_in_child=_after_fork)


def _own(pipe: IO[bytes]) -> int:
    """Takes pipe over, without blocking and never as descriptor 0, 1 or 2, which the program may have closed
    and still write to."""
    with pipe:
        descriptor = fcntl.fcntl(pipe, fcntl.F_DUPFD_CLOEXEC, 3)
    os.set_blocking(descriptor, False)
    return descriptor


def write(descriptor: int, data: bytearray) -> int:
    """Writes what there is room for. A SIGPIPE of it does not reach a program that has none pending."""
    before = signal.pthread_sigmask(signal.SIG_BLOCK, ())
    try:
        signal.pthread_sigmask(signal.SIG_BLOCK, {signal.SIGPIPE})
        was_pending = signal.SIGPIPE in signal.sigpending()
        return os.write(descriptor, data)
    except BlockingIOError:
        return 0
    except BrokenPipeError:
        if not was_pending:
            signal.sigtimedwait({signal.SIGPIPE}, 0)
        return len(data)  # nobody reads it; the end of the service's output is what counts
    finally:
        signal.pthread_sigmask(signal.SIG_SETMASK, before)


def _find_service() -> str:
    """The service beside the running script, beside the interpreter, or on PATH."""
    script = getattr(sys.modules.get("__main__"), "__file__", None)
    folders = [os.path.dirname(os.path.realpath(script))] if script else []
    folders += [os.path.dirname(sys.executable)] if sys.executable else []
    found = shutil.which("tallowmere", path=os.pathsep.join(folders)) or shutil.which("tallowmere")
    if found is None:
        raise ServiceError("There is no service tallowmere beside the program, nor on PATH.")
    return found
