"""The client: one service process, and the requests that are under way to it."""

from __future__ import annotations

import contextlib
import fcntl
import math
import os
import select
import shutil
import signal
import subprocess
import sys
import time
import weakref
from collections import deque
from typing import IO, Any, Generic, Iterable, Iterator, TypeVar

from . import request
from ._wire import FSSpec, Incomplete, Malformed, Reader
from .request import ALWAYS_ENOUGH_BYTES, MOST_FULL_PATH_BYTES, ExportSettings, HFSText, Path, Request

T = TypeVar("T")

MOST_REQUESTS_UNDER_WAY = 256
MOST_BYTES_UNDER_WAY = 65536
_CHUNK = 65536
_GRACE = 1.0  # seconds that a service has to end by itself


class ServiceError(Exception):
    """No answer, for the reason in the message; also that no service could be started."""


class ServiceEnded(ServiceError):
    """The service ended, or closed its output, before it had answered."""


class DeadlineMissed(ServiceError):
    """The service did not answer in time, and was killed."""


class ProtocolError(ServiceError):
    """The service answered what the protocol does not know, and was killed."""


class _Process:
    """A running service, and this process's ends of its two pipes."""

    def __init__(self, program: str) -> None:
        self.owner = os.getpid()
        try:
            self._child = subprocess.Popen(
                [program, str(self.owner)], bufsize=0, stdin=subprocess.PIPE, stdout=subprocess.PIPE
            )
            assert self._child.stdin and self._child.stdout
            self.input, self.output = _own(self._child.stdin), _own(self._child.stdout)
        except OSError as error:
            raise ServiceError(f"The service could not be started: {error}.") from error

    def end(self, grace: float) -> str:
        """Closes the pipes, lets the service end within grace seconds, then kills it; tells how it ended."""
        os.close(self.input)
        os.close(self.output)
        try:
            status = self._child.wait(grace)
        except subprocess.TimeoutExpired:
            self._child.kill()
            with contextlib.suppress(subprocess.TimeoutExpired):
                self._child.wait(_GRACE)
            return "closed its output"
        return f"ended with status {status}" if status >= 0 else f"was ended by signal {-status}"


def _own(pipe: IO[bytes]) -> int:
    """Takes pipe over, without blocking and never as descriptor 0, 1 or 2, which the program may have closed
    and still write to."""
    with pipe:
        descriptor = fcntl.fcntl(pipe, fcntl.F_DUPFD_CLOEXEC, 3)
    os.set_blocking(descriptor, False)
    return descriptor


def _write(descriptor: int, data: bytearray) -> int:
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


_UNANSWERED: Any = object()


class _Waiting(Generic[T]):
    """A request that was submitted, and its answer once there is one."""

    def __init__(self, request: Request[T]) -> None:
        self.request = request
        self.answer: T | ServiceError = request.otherwise if request.payload is None else _UNANSWERED


class Client:
    """Asks the service, which it starts with the first request. For one thread at a time.

    service:  the program; None looks for tallowmere beside the running script, beside the interpreter and on PATH.
    deadline: seconds that the service has for each answer.

    A request raises ServiceError when the service cannot be started, has ended, misses the deadline or answers
    what the protocol does not know; the next request starts another one. Paths are absolute POSIX paths (what is
    answered to others is not to be relied on), and answered as str (os.fsdecode). A str for an HFS name or path is
    sent in Mac Roman, and answers are bytes in it (hfs_name_to_str). What does not exist is None.
    """

    def __init__(self, service: str | os.PathLike[str] | None = None, deadline: float = 10.0) -> None:
        if not deadline > 0:
            raise ValueError("a deadline is a number of seconds above 0")
        self._program = None if service is None else os.fspath(service)
        self._deadline = deadline
        self._process: _Process | None = None
        self._finalizer: Any = None
        self._pending: deque[_Waiting[Any]] = deque()  # unanswered; their answers come in this order
        self._outgoing = bytearray()  # of these, what was not written yet
        self._silent = True  # nothing was written yet that could be answered
        self._received = b""
        self._offset = 0  # in _received, of the next answer

    def __enter__(self) -> Client:
        return self

    def __exit__(self, *_: object) -> None:
        self.close()

    def close(self) -> None:
        """Ends the service. A later request starts another one."""
        self._stop(_GRACE)

    def ask(self, request: Request[T]) -> T:
        """The answer to one request."""
        [answer] = self.batch([request])
        if isinstance(answer, ServiceError):
            raise answer
        return answer

    def batch(self, requests: Iterable[Request[T]]) -> Iterator[T | ServiceError]:
        """The answers in order, while up to 256 requests or 64 KiB of them are under way.

        requests may be without end: it is read that far ahead. A request that failed gives its ServiceError as
        a value, and those behind it are asked of another service. Other requests may be asked meanwhile.
        """
        waiting: deque[_Waiting[T]] = deque()
        size = 0

        def first_answer() -> T | ServiceError:
            nonlocal size
            self._await(waiting[0])
            first = waiting.popleft()
            size -= len(first.request.payload or b"")
            return first.answer

        try:
            for each in requests:
                waiting.append(_Waiting(each))
                self._submit(waiting[-1])
                size += len(each.payload or b"")
                while len(waiting) >= MOST_REQUESTS_UNDER_WAY or size >= MOST_BYTES_UNDER_WAY:
                    yield first_answer()
            while waiting:
                yield first_answer()
        finally:
            for rest in waiting:  # nobody wants these answers any more
                rest.answer = rest.request.otherwise

    def _submit(self, waiting: _Waiting[Any]) -> None:
        if waiting.request.payload is None:
            return
        self._silent = self._silent or not self._pending
        try:
            self._pending.append(waiting)
            self._outgoing += waiting.request.payload
        except BaseException:  # what waits and what is written may differ; the next service gets both anew
            self._stop()
            raise

    def _await(self, waiting: _Waiting[Any]) -> None:
        """Exchanges bytes until waiting has its answer or its error."""
        limit = time.monotonic() + self._deadline
        while waiting.answer is _UNANSWERED:
            head = self._pending[0]
            try:
                self._exchange(limit)
            except ServiceError as error:
                self._stop()
                culprit = self._pending.popleft() if self._pending else head
                culprit.answer = error
            except BaseException:  # half a request may have been written
                self._stop()
                raise
            if not self._pending or self._pending[0] is not head:
                limit = time.monotonic() + self._deadline

    def _exchange(self, limit: float) -> None:
        """Writes and reads once, as soon as there is something to write or read."""
        process = self._running()
        poller = select.poll()
        poller.register(process.output, select.POLLIN)
        if self._outgoing:
            poller.register(process.input, select.POLLOUT)
        ready = dict(poller.poll(math.ceil(1000 * min(max(limit - time.monotonic(), 0), 1e6))))
        if not ready:
            raise DeadlineMissed(f"The service did not answer within {self._deadline:g} seconds.")
        if process.output in ready:
            self._receive(process)
        if process.input in ready:
            del self._outgoing[: _write(process.input, self._outgoing)]
            self._silent = False

    def _receive(self, process: _Process) -> None:
        chunk = os.read(process.output, _CHUNK)
        if not chunk:
            raise ServiceEnded(f"The service {self._stop(_GRACE)} before it had answered.")
        self._received = self._received[self._offset :] + chunk
        self._offset = 0
        try:
            while self._pending and not self._silent:
                reader = Reader(self._received, self._offset)
                answer = self._pending[0].request.decode(reader)
                reader.trailer()
                self._pending.popleft().answer = answer
                self._offset = reader.offset
        except Incomplete:
            return
        except Malformed as error:
            raise ProtocolError(f"The service answered what the protocol does not know: {error}.") from error
        if self._offset < len(self._received):
            raise ProtocolError("The service answered what it was not asked.")

    def _running(self) -> _Process:
        """The service of this process, started where there is none."""
        if self._process is not None and self._process.owner != os.getpid():
            self._stop()  # after a fork it is the parent's, and so are its pipes
        if self._process is None:
            self._process = _Process(self._program or _find_service())
            self._finalizer = weakref.finalize(self, self._process.end, _GRACE)
            self._pending = deque(waiting for waiting in self._pending if waiting.answer is _UNANSWERED)
            self._outgoing = bytearray().join(waiting.request.payload or b"" for waiting in self._pending)
            self._silent = True
            self._received, self._offset = b"", 0
        return self._process

    def _stop(self, grace: float = 0) -> str | None:
        """Ends the service, if there is one, and tells how it ended."""
        if self._process is None:
            return None
        process, self._process = self._process, None
        self._finalizer.detach()
        return process.end(grace)

    def make_full_path(self, path: Path, size: int = MOST_FULL_PATH_BYTES, keep_folders: bool = True) -> bytes:
        """The full HFS path of an item, with its folders shortened to size bytes, NUL included: 1 to 1024.

        keep_folders False gives the name of the volume alone. b":" is the path of what is on no volume.
        ValueError for a size in which the path does not fit however it is shortened.
        """
        if not 0 < size <= MOST_FULL_PATH_BYTES:
            raise ValueError("a full path is asked for in 1 to 1024 bytes")
        if size < ALWAYS_ENOUGH_BYTES:
            length, volume = self.ask(request.full_path_and_length(path, MOST_FULL_PATH_BYTES, False))
            if length >= size and len(volume) > size - 6:
                raise ValueError(f"the full path does not fit in {size} bytes, however it is shortened")
        return self.ask(request.full_path_and_length(path, size, keep_folders))[1]

    def make_file_ref_from_path(self, hfs_path: HFSText) -> str | None:
        """The path of a full HFS path of at most 255 bytes. Relative ones begin at the service's current folder."""
        return self.ask(request.make_file_ref_from_path(hfs_path))

    def get_vol_refnum_by_hfs_name(self, name: HFSText) -> int | None:
        """The number of the first volume with that name."""
        return self.ask(request.get_vol_refnum_by_hfs_name(name))

    def get_hfs_volume_name(self, number: int) -> bytes | None:
        """The name of the volume with that number; 0 is the volume of "/"."""
        return self.ask(request.get_hfs_volume_name(number))

    def get_hfs_name(self, path: Path) -> bytes | None:
        """The HFS name of an existing item."""
        return self.ask(request.get_hfs_name(path))

    def add_hfs_name(self, folder: Path, name: HFSText) -> str | None:
        """The path of the item with that HFS name, of at most 255 bytes, in an existing folder; also of a new item.

        Behind a path that is no folder the bytes are added as they are.
        """
        return self.ask(request.add_hfs_name(folder, name))

    def get_fsspec(self, path: Path) -> FSSpec | None:
        """The record of an item, also of a new one in an existing folder.

        The record of a new item leads nowhere when a file or a link, also one to a folder, is in front of its name.
        """
        return self.ask(request.get_fsspec(path))

    def set_file_ref_from_fsspec_data(self, spec: FSSpec) -> str | None:
        """The path of an item, also of a new one in an existing folder; looked for on the other volumes too."""
        return self.ask(request.set_file_ref_from_fsspec_data(spec))

    def set_file_ref_from_fsspec(self, spec: FSSpec, search_other_volumes: bool = False) -> str | None:
        """The path of a record, also of a new item in an existing folder."""
        return self.ask(request.set_file_ref_from_fsspec(spec, search_other_volumes))

    def get_aiff_export_settings(
        self, rate: float, sample_size: int, channels: int, data_format: HFSText
    ) -> ExportSettings:
        """The settings that export a sound to AIFF files: rate in hertz, sample_size in bits, and a data format of
        four characters."""
        return self.ask(request.get_aiff_export_settings(rate, sample_size, channels, data_format))
