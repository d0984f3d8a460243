"""The client for asyncio: the methods of tallowmere.Client, to be awaited. It takes no thread of its own.

Where a conversion looks whether an item exists, the event loop waits for the system: on a mount that may not answer,
use tallowmere.Client by asyncio.to_thread instead.
"""

from __future__ import annotations

import asyncio
import contextlib
import os
import weakref
from typing import Any, AsyncIterable, AsyncIterator, Iterable, TypeVar, Union, overload

from . import conversion, request
from ._client import checked_deadline
from ._conversation import UNANSWERED, Conversation, Waiting, Window, given, missed
from ._outcome import ConversionError, Converted, ServiceError
from ._process import CHUNK, GRACE, Process, ServiceEnded, write
from ._volumes import Volume, list_volumes
from ._wire import FSSpec
from .conversion import Conversion
from .request import MOST_FULL_PATH_BYTES, ExportSettings, HFSText, Path, Planned, Request

T = TypeVar("T")
Many = Union[Iterable[T], AsyncIterable[T]]

_LONGEST_WAIT = 1e6  # seconds
_FIRST_LOOK = 0.001  # seconds until it is seen whether a service has ended, doubled each time


class _Waiting(Waiting[T]):
    """Wakes who waits for the answer."""

    def __init__(self, request: Request[T]) -> None:
        super().__init__(request)
        self.is_answered = asyncio.Event()

    def settle(self, answer: T | ServiceError) -> None:
        super().settle(answer)
        self.is_answered.set()


class Client:
    """Asks the service, which it starts with the first request. See tallowmere.Client for what the methods do.

    Any number of tasks may ask at a time: the requests of all are under way together, and each gets its own answer.
    A task that is cancelled while it waits leaves the client usable. A client belongs to the event loop in which it has
    requests under way: RuntimeError for another one meanwhile.
    """

    def __init__(self, service: str | os.PathLike[str] | None = None, deadline: float = 10.0) -> None:
        self._deadline = checked_deadline(deadline)
        self._program = None if service is None else os.fspath(service)
        self._process: Process | None = None
        self._finalizer: Any = None
        self._conversation = Conversation()
        self._talk: asyncio.Task[None] | None = None  # exchanges bytes while requests are under way
        self._wake: asyncio.Event  # there is something to exchange, or the deadline has passed

    async def __aenter__(self) -> Client:
        return self

    async def __aexit__(self, *_: object) -> None:
        await self.close()

    async def close(self) -> None:
        """Ends the service. What is under way gets a ServiceError; a later request starts another one."""
        if self._talk is not None and not self._talk.done():
            self._talk.cancel()
            await asyncio.wait([self._talk])
        self._fail_all(ServiceEnded("The client was closed before the service had answered."))
        await self._stop(GRACE)

    @overload
    async def ask(self, question: Planned[T]) -> T: ...

    @overload
    async def ask(self, question: Request[T]) -> T: ...

    async def ask(self, question: Any) -> Any:
        """The answer to one request or conversion."""
        window = Window(self._submit)
        try:
            window.add(question)
            return given(await self._first(window))
        finally:
            window.abandon()

    @overload
    def batch(self, questions: Many[Conversion[T]]) -> AsyncIterator[Converted[T] | ConversionError | ServiceError]: ...

    @overload
    def batch(self, questions: Many[Request[T]]) -> AsyncIterator[T | ServiceError]: ...

    def batch(self, questions: Any) -> AsyncIterator[Any]:
        """The answers to requests or conversions in order, while up to 256 of them or 64 KiB are under way.

        questions, an iterable or an asynchronous one, may be without end: it is read that far ahead. What failed gives
        its error as a value, and what is behind it is asked of another service.
        """
        return self._batch(questions)

    async def _batch(self, questions: Many[Any]) -> AsyncIterator[Any]:
        window = Window(self._submit)
        try:
            async for each in _each(questions):
                window.add(each)
                while window.is_full:
                    yield await self._first(window)
            while window:
                yield await self._first(window)
        finally:
            window.abandon()

    async def _first(self, window: Window) -> Any:
        waiting = window.awaited()
        while waiting is not None:
            assert isinstance(waiting, _Waiting)
            await waiting.is_answered.wait()
            waiting = window.awaited()
        return window.take()

    def _submit(self, request: Request[Any]) -> _Waiting[Any]:
        loop = asyncio.get_running_loop()
        waiting: _Waiting[Any] = _Waiting(request)
        if self._talk is None or self._talk.done() or self._talk.get_loop().is_closed():
            self._wake = asyncio.Event()
            self._talk = None
        elif self._talk.get_loop() is not loop:
            raise RuntimeError("the client has requests under way in another event loop")
        self._conversation.submit(waiting)
        self._wake.set()
        if self._talk is None and self._conversation.pending:
            self._talk = loop.create_task(self._converse())
        return waiting

    async def _converse(self) -> None:
        """Exchanges bytes while requests are under way."""
        loop, conversation = asyncio.get_running_loop(), self._conversation
        limit = loop.time() + self._deadline
        try:
            while conversation.pending:
                head = conversation.pending[0]
                try:
                    await self._exchange(limit)
                except ServiceError as error:
                    await self._stop()
                    conversation.fail(head, error)
                if not conversation.pending or conversation.pending[0] is not head:
                    limit = loop.time() + self._deadline
        except BaseException:  # half a request may have been written
            await self._stop()
            self._fail_all(ServiceEnded("The conversation with the service was broken off before it had answered."))
            raise

    async def _exchange(self, limit: float) -> None:
        """Reads and writes once, as soon as there is something to read or write."""
        process, conversation = await self._running(), self._conversation
        await self._until_ready(process, limit)
        chunk: bytes | None = None
        with contextlib.suppress(BlockingIOError):
            chunk = os.read(process.output, CHUNK)
            if not chunk:
                raise ServiceEnded(f"The service {await self._stop(GRACE)} before it had answered.")
            conversation.receive(chunk)
        if conversation.outgoing:
            conversation.wrote(write(process.input, conversation.outgoing))
        if not chunk and asyncio.get_running_loop().time() >= limit:
            raise missed(self._deadline, conversation.pending[0].request)

    async def _until_ready(self, process: Process, limit: float) -> None:
        """Returns when the service has answered something, or takes what was not written, or more has been asked, or
        at the limit."""
        loop = asyncio.get_running_loop()
        self._wake.clear()
        loop.add_reader(process.output, self._wake.set)
        if self._conversation.outgoing:
            loop.add_writer(process.input, self._wake.set)
        alarm = loop.call_at(min(limit, loop.time() + _LONGEST_WAIT), self._wake.set)
        try:
            await self._wake.wait()
        finally:
            alarm.cancel()
            loop.remove_reader(process.output)
            loop.remove_writer(process.input)

    async def _running(self) -> Process:
        """The service of this process, started where there is none."""
        if self._process is not None and self._process.owner != os.getpid():
            await self._stop()
        if self._process is None:
            self._process = Process(self._program)
            self._finalizer = weakref.finalize(self, self._process.end, GRACE)
            self._conversation.restart()
        return self._process

    async def _stop(self, grace: float = 0) -> str | None:
        """Ends the service, if there is one, and tells how it ended."""
        if self._process is None:
            return None
        process, self._process = self._process, None
        self._finalizer.detach()
        process.close()
        delay = _FIRST_LOOK
        try:
            while grace > 0 and not process.has_ended():
                await asyncio.sleep(min(delay, grace))
                grace, delay = grace - delay, 2 * delay
        finally:
            ending = process.end()
        return ending

    def _fail_all(self, error: ServiceError) -> None:
        for waiting in self._conversation.pending:
            if waiting.answer is UNANSWERED:
                waiting.settle(error)
        self._conversation.restart()

    async def record_of(self, path: Path, *, resolve: bool = True) -> Converted[FSSpec]:
        return await self.ask(conversion.record_of(path, resolve=resolve))

    async def path_of(self, spec: FSSpec, *, search_other_volumes: bool = False) -> Converted[str]:
        return await self.ask(conversion.path_of(spec, search_other_volumes=search_other_volumes))

    async def hfs_path_of(self, path: Path, *, resolve: bool = True) -> Converted[bytes]:
        return await self.ask(conversion.hfs_path_of(path, resolve=resolve))

    async def path_of_hfs_path(self, hfs_path: HFSText) -> Converted[str]:
        return await self.ask(conversion.path_of_hfs_path(hfs_path))

    async def hfs_name_of(self, path: Path, *, resolve: bool = True) -> Converted[bytes]:
        return await self.ask(conversion.hfs_name_of(path, resolve=resolve))

    async def path_in_folder(self, folder: Path, name: HFSText, *, resolve: bool = True) -> Converted[str]:
        return await self.ask(conversion.path_in_folder(folder, name, resolve=resolve))

    async def volumes(self) -> list[Volume]:
        return await self.ask(list_volumes())

    async def make_full_path(self, path: Path, size: int = MOST_FULL_PATH_BYTES, keep_folders: bool = True) -> bytes:
        return await self.ask(request.full_path_in_any_size(path, size, keep_folders))

    async def make_file_ref_from_path(self, hfs_path: HFSText) -> str | None:
        return await self.ask(request.make_file_ref_from_path(hfs_path))

    async def get_vol_refnum_by_hfs_name(self, name: HFSText) -> int | None:
        return await self.ask(request.get_vol_refnum_by_hfs_name(name))

    async def get_hfs_volume_name(self, number: int) -> bytes | None:
        return await self.ask(request.get_hfs_volume_name(number))

    async def get_hfs_name(self, path: Path) -> bytes | None:
        return await self.ask(request.get_hfs_name(path))

    async def add_hfs_name(self, folder: Path, name: HFSText) -> str | None:
        return await self.ask(request.add_hfs_name(folder, name))

    async def get_fsspec(self, path: Path) -> FSSpec | None:
        return await self.ask(request.get_fsspec(path))

    async def set_file_ref_from_fsspec_data(self, spec: FSSpec) -> str | None:
        return await self.ask(request.set_file_ref_from_fsspec_data(spec))

    async def set_file_ref_from_fsspec(self, spec: FSSpec, search_other_volumes: bool = False) -> str | None:
        return await self.ask(request.set_file_ref_from_fsspec(spec, search_other_volumes))

    async def get_aiff_export_settings(
        self, rate: float, sample_size: int, channels: int, data_format: HFSText
    ) -> ExportSettings:
        return await self.ask(request.get_aiff_export_settings(rate, sample_size, channels, data_format))


async def _each(questions: Many[T]) -> AsyncIterator[T]:
    if isinstance(questions, AsyncIterable):
        async for question in questions:
            yield question
    else:
        for question in questions:
            yield question
