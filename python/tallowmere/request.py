"""The requests as values, for Client.ask and Client.batch. Each is what the Client's method of that name asks.

This is the raw way: the service is sent what is given and its answer is handed over, also where that leads elsewhere;
conversion has the careful one. A text that cannot be sent (a NUL within, too long, a str without an encoding) makes a
request that is not sent: its answer is None, as for a thing that does not exist. A number that is out of its range is
a ValueError, and a value of another type a TypeError.
"""

from __future__ import annotations

import os
import struct
from dataclasses import dataclass
from typing import Any, Callable, Generator, Generic, List, NamedTuple, Optional, Sequence, Tuple, TypeVar, Union

from ._outcome import quoted
from ._wire import I16, MOST_TEXT_BYTES, U8, U16, U32, FSSpec, Reader, hfs_name_from_str, hfs_name_to_str, text

T = TypeVar("T")
T_co = TypeVar("T_co", covariant=True)
Number = TypeVar("Number", int, float)
Path = Union[str, bytes, "os.PathLike[str]", "os.PathLike[bytes]"]
HFSText = Union[str, bytes]

NO_VOLUME = 32767
MOST_FULL_PATH_BYTES = 1024  # with the NUL
ALWAYS_ENOUGH_BYTES = 768  # for every full path, with the NUL
MOST_HFS_BYTES = 255  # beyond which the service cuts a name and miscounts a path
IMPOSSIBLE_NAME = -37  # a result code
_NAME_ROOM = 64  # for every name, with the NUL
_FIXED_ONE = 65536


class ExportSettings(NamedTuple):
    """result is 0 or the negative error code of docs/protocol.md, and data then empty."""

    result: int
    data: bytes


@dataclass(frozen=True)
class Request(Generic[T_co]):
    """payload is None for what cannot be asked: the answer is then otherwise."""

    payload: Optional[bytes]
    decode: Callable[[Reader], T_co]
    otherwise: T_co
    describe: Callable[[], str] = lambda: "an answer"  # what is asked for
    searches: bool = False  # all volumes are looked at where the first has no such item


Plan = Generator[Sequence[Request[Any]], List[Any], T]  # asks some requests at a time, is sent their answers


@dataclass(frozen=True)
class Planned(Generic[T_co]):
    """What takes several requests. Each plan that start() makes is used once."""

    start: Callable[[], Plan[T_co]]


def _path(path: Path) -> bytes | None:
    try:
        return _askable(os.fsencode(path), MOST_TEXT_BYTES)
    except UnicodeEncodeError:
        return None


def _hfs(name: HFSText) -> bytes | None:
    if not isinstance(name, (str, bytes)):
        raise TypeError(f"an HFS name or path is bytes or str, not {type(name).__name__}")
    try:
        return _askable(hfs_name_from_str(name) if isinstance(name, str) else name, MOST_HFS_BYTES)
    except UnicodeEncodeError:
        return None


def _askable(value: bytes, most: int) -> bytes | None:
    return value if len(value) <= most and b"\0" not in value else None


def _checked(value: Number, least: int, most: int, what: str) -> Number:
    if not least <= value <= most:
        raise ValueError(f"{what} is out of its range: {value}")
    return value


def _whole(value: int, least: int, most: int, what: str) -> int:
    if not isinstance(value, int):
        raise TypeError(f"{what} is a whole number, not {type(value).__name__}")
    return _checked(value, least, most, what)


def _flag(value: bool) -> bytes:
    if not isinstance(value, bool):
        raise TypeError(f"a flag is a bool, not {type(value).__name__}")
    return U8.pack(value)


def _spec(value: FSSpec) -> FSSpec:
    if not isinstance(value, FSSpec):
        raise TypeError(f"a record is an FSSpec, not {type(value).__name__}")
    return value


def _optional(
    code: int,
    describe: Callable[[], str],
    decode: Callable[[Reader], T | None],
    *fields: bytes | None,
    searches: bool = False,
) -> Request[T | None]:
    """A request that is asked when none of its fields is None."""
    askable = [field for field in fields if field is not None]
    payload = U16.pack(code) + b"".join(askable) if len(askable) == len(fields) else None
    return Request(payload, decode, None, describe, searches)


def _text(value: bytes | None) -> bytes | None:
    return None if value is None else text(value)


def _quoted_hfs(name: HFSText) -> str:
    return quoted(name if isinstance(name, str) else hfs_name_to_str(name))


def _flagged_name(reader: Reader) -> bytes | None:
    flag, name = reader.flag(), reader.text()
    return name if flag else None


def _flagged_path(reader: Reader) -> str | None:
    path = _flagged_name(reader)
    return os.fsdecode(path) if path is not None else None


def full_path_and_length(path: Path, size: int, keep_folders: bool) -> Request[Tuple[int, bytes]]:
    """The full path in size bytes, and its length before it was shortened. A size below 768 can keep the
    service busy for ever."""

    def decode(reader: Reader) -> tuple[int, bytes]:
        return reader.number(U16), reader.padded(size)

    _whole(size, 1, MOST_FULL_PATH_BYTES, "a size in bytes")
    encoded = _path(path)
    flag = _flag(keep_folders)
    payload = None if encoded is None else U16.pack(1) + text(encoded) + U16.pack(size) + flag
    return Request(payload, decode, (1, b":"), lambda: f"the full HFS path of {quoted(path)}")


def make_full_path(path: Path, size: int = MOST_FULL_PATH_BYTES, keep_folders: bool = True) -> Request[bytes]:
    """A size below 768 is a ValueError here: the client's method, which asks twice, takes smaller ones."""
    if not ALWAYS_ENOUGH_BYTES <= _whole(size, 1, MOST_FULL_PATH_BYTES, "a size in bytes"):
        raise ValueError("a full path is requested in 768 to 1024 bytes")
    both = full_path_and_length(path, size, keep_folders)
    return Request(both.payload, lambda reader: both.decode(reader)[1], both.otherwise[1], both.describe)


def full_path_in_any_size(path: Path, size: int = MOST_FULL_PATH_BYTES, keep_folders: bool = True) -> Planned[bytes]:
    """The same in any size from 1. A size in which the path does not fit is a ValueError when it is asked."""

    def plan() -> Plan[bytes]:
        if size < ALWAYS_ENOUGH_BYTES:
            [(length, volume)] = yield [full_path_and_length(path, MOST_FULL_PATH_BYTES, False)]
            if length >= size and len(volume) > size - 6:
                raise ValueError(f"the full path does not fit in {size} bytes, however it is shortened")
        [(_, full)] = yield [asked]
        return bytes(full)

    asked = full_path_and_length(path, size, keep_folders)
    return Planned(plan)


def result_and_path(hfs_path: HFSText) -> Request[Tuple[int, Optional[str]]]:
    """The result code, 0 or one of docs/protocol.md, and with 0 the path. -37 for what cannot be asked."""

    def decode(reader: Reader) -> tuple[int, str | None]:
        result, path = reader.number(I16), reader.text()
        return result, os.fsdecode(path) if result == 0 and path is not None else None

    def describe() -> str:
        return f"the item with the HFS path {_quoted_hfs(hfs_path)}"

    path = _hfs(hfs_path)
    if path is not None and b":" not in path:
        path = _askable(b":" + path, MOST_HFS_BYTES)  # the service adds this colon
    if path is None:
        return Request(None, decode, (IMPOSSIBLE_NAME, None), describe)
    folder, colon, name = path.rpartition(b":")
    payload = U16.pack(2) + text(folder + colon) + (text(name) if name else U16.pack(0)) + U8.pack(False)
    return Request(payload, decode, (IMPOSSIBLE_NAME, None), describe)


def make_file_ref_from_path(hfs_path: HFSText) -> Request[Optional[str]]:
    both = result_and_path(hfs_path)
    return Request(both.payload, lambda reader: both.decode(reader)[1], None, both.describe)


def get_vol_refnum_by_hfs_name(name: HFSText) -> Request[Optional[int]]:
    def decode(reader: Reader) -> int | None:
        number = reader.number(I16)
        return None if number == NO_VOLUME else number

    return _optional(3, lambda: f"the number of the volume {_quoted_hfs(name)}", decode, _text(_hfs(name)))


def get_hfs_volume_name(number: int) -> Request[Optional[bytes]]:
    packed = I16.pack(_whole(number, -0x8000, 0x7FFF, "a volume reference number"))
    return _optional(4, lambda: f"the name of the volume {number}", _flagged_name, packed)


def get_hfs_name(path: Path) -> Request[Optional[bytes]]:
    return _optional(
        5, lambda: f"the HFS name of {quoted(path)}", _flagged_name, _text(_path(path)), U16.pack(_NAME_ROOM)
    )


def add_hfs_name(folder: Path, name: HFSText) -> Request[Optional[str]]:
    return _optional(
        6, lambda: f"the item {_quoted_hfs(name)} in {quoted(folder)}", _flagged_path,
        _text(_path(folder)), _text(_hfs(name)), U8.pack(False),
    )  # fmt: skip


def get_fsspec(path: Path) -> Request[Optional[FSSpec]]:
    def decode(reader: Reader) -> FSSpec | None:
        flag, spec = reader.flag(), reader.record()
        return spec if flag else None

    return _optional(7, lambda: f"the record of {quoted(path)}", decode, _text(_path(path)))


def set_file_ref_from_fsspec_data(spec: FSSpec) -> Request[Optional[str]]:
    place = struct.pack("=hi", _spec(spec).v_ref_num, spec.par_id)
    return _optional(
        8, lambda: f"the item with the record {quoted(spec.text)}", _flagged_path,
        place, _text(_hfs(spec.name)), U8.pack(False), searches=True,
    )  # fmt: skip


def set_file_ref_from_fsspec(spec: FSSpec, search_other_volumes: bool = False) -> Request[Optional[str]]:
    record = spec.to_bytes() if _hfs(_spec(spec).name) is not None else None
    return _optional(
        9, lambda: f"the item with the record {quoted(spec.text)}", _flagged_path,
        record, _flag(search_other_volumes), U8.pack(False), searches=search_other_volumes,
    )  # fmt: skip


def get_aiff_export_settings(
    rate: float, sample_size: int, channels: int, data_format: HFSText
) -> Request[ExportSettings]:
    def decode(reader: Reader) -> ExportSettings:
        return ExportSettings(reader.number(I16), reader.settings())

    if not isinstance(rate, (int, float)):
        raise TypeError(f"a rate in hertz is a number, not {type(rate).__name__}")
    if not isinstance(data_format, (str, bytes)):
        raise TypeError(f"a data format is bytes or str, not {type(data_format).__name__}")
    code = hfs_name_from_str(data_format) if isinstance(data_format, str) else data_format
    if len(code) != 4:
        raise ValueError("a data format has four characters")
    payload = (
        U16.pack(10)
        + U32.pack(round(_checked(rate * _FIXED_ONE, 0, 0xFFFFFFFF, "a rate in hertz × 65536")))
        + U32.pack(_whole(sample_size, 0, 0xFFFF, "a sample size in bits"))
        + U8.pack(_whole(channels, 0, 0xFF, "a number of channels"))
        + U32.pack(int.from_bytes(code, "big"))
    )
    return Request(payload, decode, ExportSettings(0, b""), lambda: f"export settings for {_quoted_hfs(data_format)}")
