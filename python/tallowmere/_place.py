"""Looks once where a path leads, and whether something is there."""

from __future__ import annotations

import contextlib
import errno
import os
import stat
from dataclasses import dataclass
from typing import Iterator, NoReturn, Optional, Tuple, Union

from ._outcome import ConversionError, Outcome, quoted
from ._wire import MOST_TEXT_BYTES

_REMOVED = b" (deleted)"  # which the kernel puts behind the path of a folder that is gone
_NOTHING_THERE = (errno.ENOENT, errno.ENOTDIR, errno.ELOOP)

Path = Union[str, bytes, "os.PathLike[str]", "os.PathLike[bytes]"]


@dataclass(frozen=True)
class Place:
    """A path without links in front of its last name, and what was there."""

    path: bytes
    is_new: bool = False  # its folder exists, it does not
    is_folder: bool = False
    is_mount: bool = False  # it is on another device than its folder

    @property
    def outcome(self) -> Outcome:
        return Outcome.NEW if self.is_new else Outcome.FOUND

    @property
    def folder(self) -> bytes:
        return os.path.dirname(self.path)

    @property
    def name(self) -> bytes:
        return os.path.basename(self.path)


def look_at(path: Path, resolve: bool = True) -> Place:
    """Where path leads: links in front of its last name are followed, and a relative one begins at the current folder.

    Without resolve the path has to be absolute and is taken as it is. ConversionError for what has no folder.
    """
    given = _encoded(path)
    folder, name = _split(given)
    if not resolve and (name is None or not given.startswith(b"/")) and given.strip(b"/"):
        fail(Outcome.INVALID, f"{quoted(given)} is not absolute, or ends with a dot, and is not to be resolved.")
    if name is None:
        real = real_folder(given, resolve)
        return Place(real, is_folder=True) if real == b"/" else look_at(real, resolve)
    with _opened(folder, given, resolve) as held:
        return _look_in(held, _path_of(held, folder, given) if resolve else folder, name)


def real_folder(path: Path, resolve: bool = True) -> bytes:
    """The path of a folder without links; ConversionError where there is none."""
    given = _encoded(path)
    if not resolve and not given.startswith(b"/"):
        fail(Outcome.INVALID, f"{quoted(given)} is not absolute, and is not to be resolved.")
    with _opened(given, given, resolve) as held:
        return _path_of(held, given, given) if resolve else given.rstrip(b"/") or b"/"


def exists(path: Path) -> bool:
    """Whether an item is at the path that the service answered, a link itself. ConversionError where it may not be
    looked at."""
    try:
        os.lstat(path)
    except OSError as error:
        if error.errno not in _NOTHING_THERE:
            _fail(error, os.fsencode(path))
        return False
    return True


def fail(outcome: Outcome, message: str) -> NoReturn:
    raise ConversionError(outcome, message)


def _encoded(path: Path) -> bytes:
    try:
        given = os.fsencode(path)
    except UnicodeEncodeError:
        fail(Outcome.INVALID, "A path has characters that no path can have.")
    if not given:
        fail(Outcome.INVALID, "A path is empty.")
    if b"\0" in given:
        fail(Outcome.INVALID, f"{quoted(given)} has a NUL, which no path can have.")
    if len(given) > MOST_TEXT_BYTES:
        fail(Outcome.INVALID, f"{quoted(given)} is too long for a path.")
    return given


def _split(given: bytes) -> Tuple[bytes, Optional[bytes]]:
    """The folder and the last name; None where that is none, and path a folder's."""
    folder, slash, name = given.rstrip(b"/").rpartition(b"/")
    if name in (b"", b".", b".."):
        return given, None
    return folder or (b"/" if slash else b"."), name


@contextlib.contextmanager
def _opened(folder: bytes, given: bytes, follow: bool) -> Iterator[int]:
    """The folder, held, so that its path and what is in it are those of one folder."""
    flags = os.O_PATH | os.O_DIRECTORY | os.O_CLOEXEC | (0 if follow else os.O_NOFOLLOW)
    try:
        held = os.open(folder, flags)
    except OSError as error:
        if error.errno not in _NOTHING_THERE:
            _fail(error, given)
        fail(Outcome.NOTHING, f"There is no folder {quoted(folder)}.")
    try:
        yield held
    finally:
        os.close(held)


def _path_of(held: int, folder: bytes, given: bytes) -> bytes:
    with contextlib.suppress(OSError):
        path = os.fsencode(os.readlink(f"/proc/self/fd/{held}"))
        if path.startswith(b"/") and not path.endswith(_REMOVED):
            return path
    try:
        path = os.path.realpath(folder)
        if os.path.samestat(os.stat(path), os.fstat(held)):
            return path
    except OSError:
        pass
    fail(Outcome.NOTHING, f"The folder of {quoted(given)} was removed.")


def _look_in(held: int, folder: bytes, name: bytes) -> Place:
    path = os.path.join(folder, name)
    try:
        item = os.stat(name, dir_fd=held, follow_symlinks=False)
    except OSError as error:
        if error.errno not in _NOTHING_THERE:
            _fail(error, path)
        return Place(path, is_new=True)
    return Place(path, is_folder=stat.S_ISDIR(item.st_mode), is_mount=item.st_dev != os.fstat(held).st_dev)


def _fail(error: OSError, path: bytes) -> NoReturn:
    outcome = Outcome.INVALID if error.errno == errno.ENAMETOOLONG else Outcome.REFUSED
    fail(outcome, f"{quoted(path)} cannot be looked at: {error.strerror}.")
