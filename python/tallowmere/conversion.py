"""The conversions as values, for Client.ask and Client.batch. Each is what the Client's method of that name does.

A conversion resolves the way to an item, looks once whether the item is there, and is a ConversionError instead of an
answer that would not lead back. It is looked at when its turn comes, not when the value is made.

Paths may be relative, and links in front of the last name are followed; the last name is the item itself, a link or
not. With resolve=False a path has to be absolute, is taken as it is, and has nothing where a link is in the place of
the item's folder. '~' is a plain character. A value of a wrong type is a TypeError.
"""

from __future__ import annotations

import contextlib
import os
from typing import Any, List, NoReturn, Optional, Tuple, TypeVar

from . import request
from ._outcome import Converted, Outcome, quoted
from ._place import Place, exists, fail, look_at, real_folder
from ._wire import MOST_NAME_BYTES, FSSpec, hfs_name_from_str, hfs_name_to_str
from .request import MOST_HFS_BYTES, HFSText, Path, Plan, Planned, Request

T_co = TypeVar("T_co", covariant=True)

PARENT_OF_ROOTS = 1  # the parent id of every volume's root folder
NOWHERE = 3  # the node id of what is on no volume
_MOST_FULL_PATH = 511  # bytes of an HFS path
_CERTAINLY_WHOLE = _MOST_FULL_PATH - MOST_NAME_BYTES - 1  # bytes of folders, to which one more could have been added
_NO_ITEM, _NO_FOLDER, _NO_VOLUME, _NOT_PERMITTED = -43, -120, -35, -5000  # result codes


class Conversion(Planned[Converted[T_co]]):
    """A conversion to be asked."""


def record_of(path: Path, *, resolve: bool = True) -> Conversion[FSSpec]:
    """The record of an item, also of a new one in an existing folder."""
    _check_path(path, resolve)

    def plan() -> Plan[Converted[FSSpec]]:
        place = look_at(path, resolve)
        spec, _ = yield from _record(place)
        return Converted(spec, place.outcome)

    return Conversion(plan)


def path_of(spec: FSSpec, *, search_other_volumes: bool = False) -> Conversion[str]:
    """The path of a record's item, also of a new one in an existing folder.

    With search_other_volumes, what is not on the record's volume is looked for on all others, in the folder with the
    same id: that can be another item that happens to be called the same.
    """
    asked = request.set_file_ref_from_fsspec(spec, search_other_volumes)

    def plan() -> Plan[Converted[str]]:
        _check_name(spec.name)
        [answer] = yield [asked]
        if answer is None:
            yield from _fail_without_path(spec)
        path = _single_slash(answer)
        if spec.name.startswith(b"~"):
            yield from _check_tilde(spec, path, search_other_volumes)
        return Converted(path, _outcome_of(path))

    return Conversion(plan)


def hfs_path_of(path: Path, *, resolve: bool = True) -> Conversion[bytes]:
    """The full HFS path of the item itself, in Mac Roman: that of a folder ends with a colon."""
    _check_path(path, resolve)

    def plan() -> Plan[Converted[bytes]]:
        place = look_at(path, resolve)
        spec, [full] = yield from _record(place, request.make_full_path(place.path))
        if place.is_mount and spec.par_id != PARENT_OF_ROOTS:
            return Converted((yield from _mounted_path(place, spec, full)), place.outcome)
        yield from _check_whole(place, full)
        full = full if place.is_folder else full + spec.name
        if len(full) > _MOST_FULL_PATH:
            _fail_too_long(place)
        yield from _check_volume(place, spec, full)
        return Converted(full, place.outcome)

    return Conversion(plan)


def path_of_hfs_path(hfs_path: HFSText) -> Conversion[str]:
    """The path of the item with a full HFS path, of at most 255 bytes; also of a new one in an existing folder.

    Of several volumes with one name, the first is meant.
    """
    _check_hfs(hfs_path)

    def plan() -> Plan[Converted[str]]:
        full = _encoded(hfs_path)
        if len(full) > MOST_HFS_BYTES:
            fail(Outcome.INVALID, f"The HFS path {_quoted(full)} has more than {MOST_HFS_BYTES} bytes.")
        if full.find(b":") < 1:
            fail(Outcome.INVALID, f"The HFS path {_quoted(full)} does not begin with a volume and a colon.")
        result, path = yield from _result_and_path(full)
        if path is not None:
            return Converted(path, _outcome_of(path))
        folder, colon, name = full.rpartition(b":")
        if result == _NO_ITEM and name:
            _, path = yield from _result_and_path(folder + colon)
            if path is not None:
                _check_name(name, MOST_HFS_BYTES)
                return (yield from _in_folder(os.fsencode(path), name))
        return (yield from _fail_by_result(result, full))

    return Conversion(plan)


def hfs_name_of(path: Path, *, resolve: bool = True) -> Conversion[bytes]:
    """The HFS name of an item, in Mac Roman, as its record has it; also of a new one in an existing folder."""
    _check_path(path, resolve)

    def plan() -> Plan[Converted[bytes]]:
        place = look_at(path, resolve)
        spec, _ = yield from _record(place)
        return Converted(spec.name, place.outcome)

    return Conversion(plan)


def path_in_folder(folder: Path, name: HFSText, *, resolve: bool = True) -> Conversion[str]:
    """The path of the item with that HFS name in a folder, to which a link may lead; also of a new one."""
    _check_path(folder, resolve)
    _check_hfs(name)

    def plan() -> Plan[Converted[str]]:
        encoded = _encoded(name)
        _check_name(encoded, MOST_HFS_BYTES)
        return (yield from _in_folder(real_folder(folder, resolve), encoded))

    return Conversion(plan)


def _check_path(path: Path, resolve: bool) -> None:
    if not isinstance(path, (str, bytes)):
        os.fspath(path)  # TypeError for what is no path
    if not isinstance(resolve, bool):
        raise TypeError(f"resolve is a bool, not {type(resolve).__name__}")


def _check_hfs(name: HFSText) -> None:
    if not isinstance(name, (str, bytes)):
        raise TypeError(f"an HFS name or path is bytes or str, not {type(name).__name__}")


def _encoded(name: HFSText) -> bytes:
    try:
        return hfs_name_from_str(name) if isinstance(name, str) else name
    except UnicodeEncodeError:
        fail(Outcome.INVALID, f"{quoted(_printable(str(name)))} has a character that HFS names cannot have.")


def _printable(text: str) -> str:
    return text.encode("utf-8", "backslashreplace").decode()


def _quoted(name: bytes) -> str:
    return quoted(hfs_name_to_str(name))


def _single_slash(path: str) -> str:
    """The path of a new item in "/", which the service writes with two slashes."""
    return path[1:] if path.startswith("//") else path


def _outcome_of(path: str) -> Outcome:
    return Outcome.FOUND if exists(path) else Outcome.NEW


def _check_name(name: bytes, most: int = MOST_NAME_BYTES) -> None:
    """A name that an item of a folder can have, and that leads to no other one."""
    if not name or name in (b".", b".."):
        fail(Outcome.INVALID, f"An item cannot be called {_quoted(name)}.")
    if b":" in name or b"\0" in name:
        fail(Outcome.INVALID, f"The HFS name {_quoted(name)} has a character that HFS names cannot have.")
    if len(name) > most:
        fail(Outcome.INVALID, f"The HFS name {_quoted(name)} has more than {most} bytes.")


def _record(place: Place, *others: Request[Any]) -> Plan[Tuple[FSSpec, List[Any]]]:
    """The record of what is there, or of what can be there and leads back; and the answers to other requests."""
    spec, *rest = yield [request.get_fsspec(place.path), *others]
    if spec is None or spec.par_id == NOWHERE:
        _fail_on_no_volume(place)
    if place.is_new and not _is_plain(place.name):
        [back] = yield [request.set_file_ref_from_fsspec(spec)]
        if back is None or os.fsencode(os.path.basename(back)) != place.name:
            _fail_elsewhere(place, back)
    return spec, rest


def _is_plain(name: bytes) -> bool:
    """Whether a name stays as it is on the way to HFS and back, and is nothing else's: with accents it could be that
    of an item in another normal form, and with '#' the short form of one."""
    return name.isascii() and b"#" not in name and len(name) <= MOST_NAME_BYTES


def _fail_on_no_volume(place: Place) -> NoReturn:
    fail(Outcome.NOT_A_VOLUME, f"{quoted(place.path)} is on no volume.")


def _fail_elsewhere(place: Place, back: str | None) -> NoReturn:
    if back is not None and exists(back):
        fail(Outcome.AMBIGUOUS, f"{quoted(place.path)} does not exist, and its HFS name is that of {quoted(back)}.")
    fail(Outcome.INVALID, f"{quoted(place.path)} does not exist, and no HFS name would lead back to it.")


def _fail_without_path(spec: FSSpec) -> Plan[NoReturn]:
    [volume] = yield [request.get_hfs_volume_name(spec.v_ref_num)]
    if volume is None:
        fail(Outcome.NOT_A_VOLUME, f"No volume has the number {spec.v_ref_num}, of the record {quoted(spec.text)}.")
    fail(Outcome.NOTHING, f"There is no item with the record {quoted(spec.text)}, nor a folder for it.")


def _check_tilde(spec: FSSpec, path: str, search_other_volumes: bool) -> Plan[None]:
    """A name with '~' in front is answered as a home folder where the record's folder is not found."""
    [back] = yield [request.get_fsspec(path)]
    is_it = back is not None and (back.par_id, back.name) == (spec.par_id, spec.name)
    if not is_it or not (search_other_volumes or spec.v_ref_num in (0, back.v_ref_num)):
        yield from _fail_without_path(spec)


def _check_whole(place: Place, full: bytes) -> Plan[None]:
    """Folders that did not fit are left out of a full path, which then leads elsewhere: it is compared with one that
    certainly has all its folders, further up."""
    path, tail = place.path if place.is_folder else place.folder, b""
    upper = full
    while len(upper.partition(b":")[2]) > _CERTAINLY_WHOLE:
        spec, upper = yield [request.get_fsspec(path), request.make_full_path(os.path.dirname(path))]
        if spec is None:
            _fail_on_no_volume(place)
        path, tail = os.path.dirname(path), spec.name + b":" + tail
    if upper + tail != full:
        _fail_too_long(place)


def _fail_too_long(place: Place) -> NoReturn:
    fail(Outcome.INVALID, f"The HFS path of {quoted(place.path)} would have more than {_MOST_FULL_PATH} bytes.")


def _mounted_path(place: Place, spec: FSSpec, full: bytes) -> Plan[bytes]:
    """The path of an item on another device than its folder: a subvolume, a folder of another volume, a file mounted
    by itself, or a kernel interface.

    The full path is the one where that is mounted first, or of an interface that of the folder that holds it. Where it
    leads elsewhere, the item has its path in the folder that it is mounted in.
    """
    [outer] = yield [request.make_full_path(place.folder)]
    own: bytes = outer + spec.name + (b":" if place.is_folder else b"")
    if place.is_folder and full not in (outer, own) and len(full) <= MOST_HFS_BYTES:
        _, back = yield from _result_and_path(full)
        if back is not None and _is_same(back, place):
            return full
    if len(own) <= MOST_HFS_BYTES:
        yield from _check_leads_back(place, spec, own)
    else:
        yield from _check_whole(place, own if place.is_folder else outer)
    if len(own) > _MOST_FULL_PATH:
        _fail_too_long(place)
    return own


def _check_leads_back(place: Place, spec: FSSpec, full: bytes) -> Plan[None]:
    result, back = yield from _result_and_path(full)
    if back is not None and _is_same(back, place):
        return
    if back is not None:
        fail(Outcome.AMBIGUOUS, f"The HFS path of {quoted(place.path)} leads to {quoted(back)}.")
    if result != _NOT_PERMITTED:
        yield from _check_volume(place, spec, full)
    fail(Outcome.REFUSED, f"The folders above {quoted(place.path)} cannot all be looked at.")


def _result_and_path(full: bytes) -> Plan[Tuple[int, Optional[str]]]:
    """The path of a full HFS path. That of a kernel interface's folder is found without the colon at its end, which
    is not to be left out where it climbs to an outer folder."""
    [(result, path)] = yield [request.result_and_path(full)]
    if result != 0 and full.endswith(b":") and not full.endswith(b"::") and b":" in full[:-1]:
        [(_, folder)] = yield [request.result_and_path(full[:-1])]
        if folder is not None and os.path.isdir(folder) and not os.path.islink(folder):
            return 0, _single_slash(folder)
    return result, None if path is None else _single_slash(path)


def _is_same(path: str, place: Place) -> bool:
    try:
        return os.path.samestat(os.lstat(path), os.lstat(place.path))
    except OSError:
        return False


def _check_volume(place: Place, spec: FSSpec, full: bytes) -> Plan[None]:
    name = full.partition(b":")[0]
    [first] = yield [request.get_vol_refnum_by_hfs_name(name)]
    if first != spec.v_ref_num:
        fail(Outcome.AMBIGUOUS, f"{quoted(place.path)} is on another volume than the first that is called "
             f"{_quoted(name)}.")  # fmt: skip


def _in_folder(folder: bytes, name: bytes) -> Plan[Converted[str]]:
    """The item with an HFS name in a folder, whose path has no links. REQUIRES: an item can have the name."""
    plain = hfs_name_to_str(name).translate({ord("/"): ":", ord(":"): "/"}).encode()
    answer, spec = yield [request.add_hfs_name(folder, name), request.get_fsspec(os.path.join(folder, plain))]
    path = None if answer is None else _single_slash(answer)
    if spec is None or spec.par_id == NOWHERE:
        fail(Outcome.NOT_A_VOLUME, f"{quoted(folder)} is on no volume.")
    if path is None or not _is_in(path, folder):
        fail(Outcome.NOTHING, f"There is no item called {_quoted(name)} in {quoted(folder)}, and there cannot be one.")
    outcome = _outcome_of(path)
    if outcome is Outcome.NEW:
        _check_name(name)
    return Converted(path, outcome)


def _is_in(path: str, folder: bytes) -> bool:
    """Whether path is one in that folder, which may be mounted at another place as well."""
    holder = os.path.dirname(os.fsencode(path))
    with contextlib.suppress(OSError):
        return holder == folder or os.path.samefile(holder, folder)
    return False


def _fail_by_result(result: int, full: bytes) -> Plan[NoReturn]:
    if result == _NO_VOLUME:  # which is told of what is in a kernel interface, too
        volume = full.partition(b":")[0]
        [number] = yield [request.get_vol_refnum_by_hfs_name(volume)]
        if number is None:
            fail(Outcome.NOT_A_VOLUME, f"No volume is called {_quoted(volume)}.")
        fail(Outcome.NOT_A_VOLUME, f"The item with the HFS path {_quoted(full)} is on no volume.")
    if result == _NOT_PERMITTED:
        fail(Outcome.REFUSED, f"The item with the HFS path {_quoted(full)} may not be looked at.")
    if result in (_NO_ITEM, _NO_FOLDER):
        fail(Outcome.NOTHING, f"There is no item with the HFS path {_quoted(full)}, nor a folder for it.")
    if result == request.IMPOSSIBLE_NAME:
        fail(Outcome.INVALID, f"No item can have the HFS path {_quoted(full)}.")
    fail(Outcome.REFUSED, f"The item with the HFS path {_quoted(full)} cannot be looked at: error {result}.")
