"""What is asked and answered on the two pipes, whoever moves the bytes: requests under way, questions of a batch."""

from __future__ import annotations

from collections import deque
from typing import Any, Callable, Deque, Generic, List, Optional, TypeVar, Union, cast

from ._mounts import read_mounts
from ._outcome import ConversionError, Converted, ServiceError, quoted
from ._process import DeadlineMissed, ProtocolError
from ._wire import Incomplete, Malformed, Reader
from .request import Plan, Planned, Request

T = TypeVar("T")

MOST_REQUESTS_UNDER_WAY = 256
MOST_BYTES_UNDER_WAY = 65536

UNANSWERED: Any = object()


class Waiting(Generic[T]):
    """A request that was submitted, and its answer once there is one."""

    def __init__(self, request: Request[T]) -> None:
        self.request = request
        self.answer: T | ServiceError = request.otherwise if request.payload is None else UNANSWERED

    def settle(self, answer: T | ServiceError) -> None:
        self.answer = answer


class Conversation:
    """The requests under way to one service after the other. No system call is made here."""

    def __init__(self) -> None:
        self.pending: Deque[Waiting[Any]] = deque()  # unanswered; their answers come in this order
        self.outgoing = bytearray()  # of these, what was not written yet
        self._silent = True  # nothing was written yet that could be answered
        self._received = b""
        self._offset = 0  # in _received, of the next answer

    def submit(self, waiting: Waiting[Any]) -> None:
        if waiting.request.payload is not None:
            self._silent = self._silent or not self.pending
            self.pending.append(waiting)
            self.outgoing += waiting.request.payload

    def wrote(self, count: int) -> None:
        del self.outgoing[:count]
        self._silent = self._silent and count == 0

    def receive(self, chunk: bytes) -> None:
        """Settles what chunk answers; ProtocolError for what is no answer."""
        self._received = self._received[self._offset :] + chunk
        self._offset = 0
        try:
            while self.pending and not self._silent:
                reader = Reader(self._received, self._offset)
                answer = self.pending[0].request.decode(reader)
                reader.trailer()
                self.pending.popleft().settle(answer)
                self._offset = reader.offset
        except Incomplete:
            return
        except Malformed as error:
            raise ProtocolError(f"The service answered what the protocol does not know: {error}.") from error
        if self._offset < len(self._received):
            raise ProtocolError("The service answered what it was not asked.")

    def fail(self, head: Waiting[Any], error: ServiceError) -> None:
        """Gives the error to the first request under way, or where there is none to head, the first before it failed."""
        (self.pending.popleft() if self.pending else head).settle(error)

    def restart(self) -> None:
        """Begins anew with another service: what has no answer yet is written to it."""
        self.pending = deque(waiting for waiting in self.pending if waiting.answer is UNANSWERED)
        self.outgoing = bytearray().join(waiting.request.payload or b"" for waiting in self.pending)
        self._silent = True
        self._received, self._offset = b"", 0


def missed(deadline: float, request: Request[Any]) -> DeadlineMissed:
    """The error of a request that was not answered in time. No mount is looked at for it."""
    asked = f"The service did not answer within {deadline:g} seconds when it was asked for {request.describe()}"
    served = [mount for mount in read_mounts() if mount.is_served] if request.searches else []
    names = ", ".join(f"{quoted(mount.point)} ({mount.kind.decode(errors='replace')})" for mount in served)
    return DeadlineMissed(asked + (f"; the search of the other volumes may wait for {names}." if served else "."))


Answer = Union[T, Converted[Any], ConversionError, ServiceError]


class Job:
    """A question of a batch: its requests of the moment, and its answer once there is one."""

    def __init__(self, question: Request[Any] | Planned[Any], ask: Callable[[Request[Any]], Waiting[Any]]) -> None:
        self.answer: Any = UNANSWERED
        self.size = 0
        self._ask = ask
        self._plan: Optional[Plan[Any]] = None
        self.waiting: List[Waiting[Any]] = []
        if isinstance(question, Request):
            self._begin([question])
        elif isinstance(question, Planned):
            self._plan = question.start()
            self._go_on(None)
        else:
            raise TypeError(f"a request or a conversion is asked, not {type(question).__name__}")

    @property
    def is_under_way(self) -> bool:
        return self.answer is UNANSWERED

    def first_unanswered(self) -> Waiting[Any] | None:
        return next((each for each in self.waiting if each.answer is UNANSWERED), None)

    def step(self) -> None:
        """Goes on with the answers of its requests. REQUIRES: all have one."""
        answers = [each.answer for each in self.waiting]
        error = next((each for each in answers if isinstance(each, ServiceError)), None)
        if self._plan is None:
            self.answer = answers[0]
        elif error is not None:
            self._plan.close()
            self.answer = error
        else:
            self._go_on(answers)

    def abandon(self) -> None:
        """Nobody wants the answer any more: it is not asked for again."""
        for each in self.waiting:
            if each.answer is UNANSWERED:
                each.settle(each.request.otherwise)

    def _go_on(self, answers: Any) -> None:
        assert self._plan is not None
        try:
            self._begin(self._plan.send(answers))
        except StopIteration as end:
            self.answer = end.value
        except ConversionError as error:
            self.answer = error

    def _begin(self, requests: Any) -> None:
        self.size = sum(len(each.payload or b"") for each in requests)
        self.waiting = []
        for each in requests:
            self.waiting.append(self._ask(each))


class Window:
    """The questions of a batch that are under way, and their answers in order."""

    def __init__(self, ask: Callable[[Request[Any]], Waiting[Any]]) -> None:
        self._ask = ask
        self._jobs: Deque[Job] = deque()  # in the order of the questions
        self._asked: Deque[Job] = deque()  # in the order of their requests
        self._size = 0

    def __len__(self) -> int:
        return len(self._jobs)

    def add(self, question: Request[Any] | Planned[Any]) -> None:
        job = Job(question, self._ask)
        self._jobs.append(job)
        self._size += job.size
        if job.is_under_way:
            self._asked.append(job)

    @property
    def is_full(self) -> bool:
        return len(self._jobs) >= MOST_REQUESTS_UNDER_WAY or self._size >= MOST_BYTES_UNDER_WAY

    def awaited(self) -> Waiting[Any] | None:
        """What has to be answered next for the first answer, None when that is there. REQUIRES: a question."""
        while self._jobs[0].is_under_way:
            waiting = self._asked[0].first_unanswered()
            if waiting is not None:
                return waiting
            self._step()
        return None

    def _step(self) -> None:
        job = self._asked.popleft()
        self._size -= job.size
        job.size = 0
        job.step()
        self._size += job.size
        if job.is_under_way:
            self._asked.append(job)

    def take(self) -> Any:
        """The first answer. REQUIRES: awaited() is None."""
        job = self._jobs.popleft()
        self._size -= job.size
        return job.answer

    def abandon(self) -> None:
        for job in self._asked:
            job.abandon()


def given(answer: Answer[T]) -> T:
    """The answer to one question, raised where it is an error."""
    if isinstance(answer, (ServiceError, ConversionError)):
        raise answer
    return cast(T, answer)
