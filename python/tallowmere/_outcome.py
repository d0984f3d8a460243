"""What comes of a conversion: the same outcomes, by the same names, in every client and on the command line."""

from __future__ import annotations

import enum
import os
from dataclasses import dataclass
from typing import Generic, TypeVar, Union

from ._wire import FSSpec, hfs_name_to_str

T_co = TypeVar("T_co", covariant=True)

_MOST_QUOTED = 200  # characters of a text in a message


class Outcome(enum.Enum):
    FOUND = "found"  # the item exists
    NEW = "new"  # its folder exists, it does not
    NOTHING = "nothing"  # nothing is there, nor a folder for it
    AMBIGUOUS = "ambiguous"  # more than one item could be meant, or the answer would name another one
    REFUSED = "refused"  # permission, or another error of the system
    NOT_A_VOLUME = "not-a-volume"  # it is on no volume, or there is no such volume
    INVALID = "invalid"  # it cannot be asked about, or its answer would not lead back
    SERVICE_FAILED = "service-failed"  # no answer from the service


class ConversionError(Exception):
    """There is no answer that leads back, for the reason in the message, one sentence."""

    def __init__(self, outcome: Outcome, message: str) -> None:
        super().__init__(message)
        self.outcome = outcome

    def __reduce__(self) -> tuple[type[ConversionError], tuple[Outcome, str]]:
        return type(self), (self.outcome, str(self))


class ServiceError(Exception):
    """No answer, for the reason in the message; also that no service could be started."""

    outcome = Outcome.SERVICE_FAILED


@dataclass(frozen=True)
class Converted(Generic[T_co]):
    """A conversion that succeeded; outcome is FOUND or NEW."""

    value: T_co
    outcome: Outcome

    @property
    def text(self) -> str:
        """The value as the command line prints it: a record as volume:parent:name, an HFS name or path decoded."""
        value: Union[FSSpec, bytes, str, object] = self.value
        if isinstance(value, FSSpec):
            return value.text
        return hfs_name_to_str(value) if isinstance(value, bytes) else str(value)


def quoted(value: str | bytes | os.PathLike[str] | os.PathLike[bytes]) -> str:
    """The value for a message of one line, a giant one in part."""
    name = os.fsdecode(value)
    shown = name if len(name) <= _MOST_QUOTED else name[:_MOST_QUOTED] + "…"
    return '"' + "".join(c if c.isprintable() else repr(c)[1:-1] for c in shown) + '"'
