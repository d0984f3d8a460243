"""The client for threads: one service process, and the requests that are under way to it."""

from __future__ import annotations

import math
import os
import select
import threading
import time
import weakref
from typing import Any, Callable, Iterable, Iterator, TypeVar, overload

from . import conversion, request
from ._conversation import UNANSWERED, Conversation, Waiting, Window, given, missed
from ._outcome import ConversionError, Converted, ServiceError
from ._process import CHUNK, GRACE, Process, ServiceEnded, write
from ._volumes import Volume, list_volumes
from ._wire import FSSpec
from .conversion import Conversion
from .request import MOST_FULL_PATH_BYTES, ExportSettings, HFSText, Path, Planned, Request

T = TypeVar("T")
A = TypeVar("A")


def checked_deadline(deadline: float) -> float:
    if not isinstance(deadline, (int, float)):
        raise TypeError(f"a deadline is a number of seconds, not {type(deadline).__name__}")
    if not deadline > 0:
        raise ValueError("a deadline is a number of seconds above 0")
    return deadline


class Client:
    """Asks the service, which it starts with the first request.

    service:  the program; None looks for tallowmere beside the running script, beside the interpreter and on PATH.
    deadline: seconds that the service has for each answer.

    The conversions (record_of, path_of, hfs_path_of, path_of_hfs_path, hfs_name_of, path_in_folder) look whether the
    item exists and raise a ConversionError instead of an answer that would not lead back; module conversion has their
    contract. The requests, by the protocol's names, are the raw way: paths are absolute (what is answered to others is
    not to be relied on), and what does not exist is None.

    All raise a ServiceError when the service cannot be started, has ended, misses the deadline or answers what the
    protocol does not know; the next request starts another one. Paths are answered as str (os.fsdecode), HFS names and
    paths as bytes in Mac Roman (hfs_name_to_str). A str for one of these is sent in Mac Roman.

    Threads may share a client: a request waits until it is its turn, and each gets its own answers, also while batches
    of other threads are open. After a fork the child's copy starts a service of its own and leaves the parent's alone;
    a batch that is open goes on in both. A signal handler must not use the client that it interrupts: RuntimeError.
    """

    def __init__(self, service: str | os.PathLike[str] | None = None, deadline: float = 10.0) -> None:
        self._deadline = checked_deadline(deadline)
        self._program = None if service is None else os.fspath(service)
        self._process: Process | None = None
        self._finalizer: Any = None
        self._conversation = Conversation()
        self._lock = threading.Lock()
        self._user: int | None = None  # the thread that has the lock
        _clients.add(self)

    def __enter__(self) -> Client:
        return self

    def __exit__(self, *_: object) -> None:
        self.close()

    def close(self) -> None:
        """Ends the service, when the request of another thread has its answer. A later request starts another one."""
        self._in_turn(self._stop, GRACE)

    @overload
    def ask(self, question: Planned[T]) -> T: ...

    @overload
    def ask(self, question: Request[T]) -> T: ...

    def ask(self, question: Any) -> Any:
        """The answer to one request or conversion."""
        [answer] = self.batch([question])
        return given(answer)

    @overload
    def batch(self, questions: Iterable[Conversion[T]]) -> Iterator[Converted[T] | ConversionError | ServiceError]: ...

    @overload
    def batch(self, questions: Iterable[Request[T]]) -> Iterator[T | ServiceError]: ...

    def batch(self, questions: Any) -> Iterator[Any]:
        """The answers to requests or conversions in order, while up to 256 of them or 64 KiB are under way.

        questions may be without end: it is read that far ahead. What failed gives its error as a value, and what is
        behind it is asked of another service. Other requests may be asked meanwhile.
        """
        return self._batch(questions)

    def _batch(self, questions: Iterable[Any]) -> Iterator[Any]:
        window = Window(self._submit)
        try:
            for each in questions:
                window.add(each)
                while window.is_full:
                    yield self._first(window)
            while window:
                yield self._first(window)
        finally:
            window.abandon()

    def _first(self, window: Window) -> Any:
        waiting = window.awaited()
        while waiting is not None:
            self._in_turn(self._converse, waiting)
            waiting = window.awaited()
        return window.take()

    def _in_turn(self, act: Callable[[A], object], argument: A) -> None:
        """Calls act when no other thread does."""
        if self._user == threading.get_ident() and self._lock.locked():
            raise RuntimeError("the client is in the middle of a request of this very thread")
        # In one line, as an interrupt in front of the second line's end would leave the lock taken.
        with self._lock: self._alone(act, argument)  # fmt: skip

    def _alone(self, act: Callable[[A], object], argument: A) -> None:
        try:
            self._user = threading.get_ident()
            act(argument)
        except BaseException:  # half a request may have been written; the next service gets all anew
            self._stop()
            raise
        finally:
            self._user = None

    def _submit(self, request: Request[Any]) -> Waiting[Any]:
        waiting: Waiting[Any] = Waiting(request)
        self._in_turn(self._conversation.submit, waiting)
        return waiting

    def _converse(self, waiting: Waiting[Any]) -> None:
        """Exchanges bytes until waiting has its answer or its error."""
        conversation = self._conversation
        limit = time.monotonic() + self._deadline
        while waiting.answer is UNANSWERED:
            head = conversation.pending[0]
            try:
                self._exchange(limit)
            except ServiceError as error:
                self._stop()
                conversation.fail(head, error)
            if not conversation.pending or conversation.pending[0] is not head:
                limit = time.monotonic() + self._deadline

    def _exchange(self, limit: float) -> None:
        """Writes and reads once, as soon as there is something to write or read."""
        process, conversation = self._running(), self._conversation
        poller = select.poll()
        poller.register(process.output, select.POLLIN)
        if conversation.outgoing:
            poller.register(process.input, select.POLLOUT)
        ready = dict(poller.poll(math.ceil(1000 * min(max(limit - time.monotonic(), 0), 1e6))))
        if not ready:
            raise missed(self._deadline, conversation.pending[0].request)
        if process.output in ready:
            chunk = os.read(process.output, CHUNK)
            if not chunk:
                raise ServiceEnded(f"The service {self._stop(GRACE)} before it had answered.")
            conversation.receive(chunk)
        if process.input in ready:
            conversation.wrote(write(process.input, conversation.outgoing))

    def _running(self) -> Process:
        """The service of this process, started where there is none."""
        if self._process is not None and self._process.owner != os.getpid():
            self._stop()
        if self._process is None:
            self._process = Process(self._program)
            self._finalizer = weakref.finalize(self, self._process.end, GRACE)
            self._conversation.restart()
        return self._process

    def _stop(self, grace: float = 0) -> str | None:
        """Ends the service, if there is one, and tells how it ended."""
        if self._process is None:
            return None
        process, self._process = self._process, None
        self._finalizer.detach()
        return process.end(grace)

    def _begin_anew(self) -> None:
        """In a child after a fork: the service is the parent's, and another thread may have had the lock."""
        self._lock, self._user = threading.Lock(), None
        self._conversation.restart()  # what that thread was writing cannot be changed any more
        if self._process is not None:
            self._process = None
            self._finalizer.detach()

    def record_of(self, path: Path, *, resolve: bool = True) -> Converted[FSSpec]:
        """The record of an item, also of a new one in an existing folder."""
        return self.ask(conversion.record_of(path, resolve=resolve))

    def path_of(self, spec: FSSpec, *, search_other_volumes: bool = False) -> Converted[str]:
        """The path of a record's item, also of a new one in an existing folder; looked for on other volumes if so
        asked, where it can be another item of the same name in a folder with the same id."""
        return self.ask(conversion.path_of(spec, search_other_volumes=search_other_volumes))

    def hfs_path_of(self, path: Path, *, resolve: bool = True) -> Converted[bytes]:
        """The full HFS path of the item itself; that of a folder ends with a colon."""
        return self.ask(conversion.hfs_path_of(path, resolve=resolve))

    def path_of_hfs_path(self, hfs_path: HFSText) -> Converted[str]:
        """The path of the item with a full HFS path of at most 255 bytes, also of a new one in an existing folder."""
        return self.ask(conversion.path_of_hfs_path(hfs_path))

    def hfs_name_of(self, path: Path, *, resolve: bool = True) -> Converted[bytes]:
        """The HFS name of an item, also of a new one in an existing folder."""
        return self.ask(conversion.hfs_name_of(path, resolve=resolve))

    def path_in_folder(self, folder: Path, name: HFSText, *, resolve: bool = True) -> Converted[str]:
        """The path of the item with that HFS name in a folder, also of a new one."""
        return self.ask(conversion.path_in_folder(folder, name, resolve=resolve))

    def volumes(self) -> list[Volume]:
        """The volumes that both the service and this process can reach, the one of "/" first.

        Each mount point is asked about, and the server of one may keep the service waiting until the deadline: the
        error names it.
        """
        return self.ask(list_volumes())

    def make_full_path(self, path: Path, size: int = MOST_FULL_PATH_BYTES, keep_folders: bool = True) -> bytes:
        """The full HFS path of an item, with its folders shortened to size bytes, NUL included: 1 to 1024.

        keep_folders False gives the name of the volume alone. b":" is the path of what is on no volume.
        ValueError for a size in which the path does not fit however it is shortened.
        """
        return self.ask(request.full_path_in_any_size(path, size, keep_folders))

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


_clients: weakref.WeakSet[Client] = weakref.WeakSet()


def _after_fork() -> None:
    for client in list(_clients):
        client._begin_anew()


os.register_at_fork(after_in_child=_after_fork)
