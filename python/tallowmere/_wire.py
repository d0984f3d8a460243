"""The protocol's fields: written, and read without trusting them. Integers are in the machine's byte order."""

from __future__ import annotations

import re
import struct
import sys
import unicodedata
from dataclasses import dataclass

TRAILER = b"MWLT"
MOST_NAME_BYTES = 63  # in a record
MOST_TEXT_BYTES = 65534  # in a path, without the NUL
MOST_SETTINGS_BYTES = 65536  # far more than any settings have

U8, U16, I16, U32 = (struct.Struct("=" + code) for code in "BHhI")
_RECORDS = {"little": struct.Struct("<hiB63s"), "big": struct.Struct(">hiB63s")}
RECORD_SIZE = 70
_TEXT_OF_RECORD = re.compile(r"(-?[0-9]+):(-?[0-9]+):(.*)", re.DOTALL)


class Incomplete(Exception):
    """The answer has not arrived whole."""


class Malformed(Exception):
    """The bytes are no answer; the message tells what is wrong with them."""


def hfs_name_to_str(name: bytes) -> str:
    """The text of a Mac Roman name. ':' and '/' stay as they are: a '/' in it is a ':' in the Linux name."""
    return name.decode("mac_roman")


def hfs_name_from_str(text: str) -> bytes:
    """The Mac Roman name of a text, its letters with accents composed or not; UnicodeEncodeError where it has none.

    Other characters stand for themselves alone: U+2126 (OHM SIGN), which NFC makes an omega, has no name.
    """
    return _DECOMPOSED.sub(lambda letter: unicodedata.normalize("NFC", letter[0]), text).encode("mac_roman")


def _decomposed_letters() -> list[str]:
    """The letters of Mac Roman that are a letter and a mark, as these two."""
    letters = filter(str.isalpha, hfs_name_to_str(bytes(range(0x80, 0x100))))
    return [pair for pair in (unicodedata.normalize("NFD", letter) for letter in letters) if len(pair) == 2]


_DECOMPOSED = re.compile("|".join(_decomposed_letters()))


@dataclass(frozen=True)
class FSSpec:
    """An item by its volume, the folder that holds it, and its name there.

    v_ref_num: volume reference number, 16 bits with a sign; 0 is the volume of "/".
    par_id:    node id of the folder, 32 bits with a sign; 2 is the volume's root folder.
    name:      HFS name in Mac Roman, at most 63 bytes.

    Other types are a TypeError, and values that no record can hold a ValueError.
    """

    v_ref_num: int
    par_id: int
    name: bytes

    def __post_init__(self) -> None:
        if not (_is_whole(self.v_ref_num) and _is_whole(self.par_id) and isinstance(self.name, bytes)):
            raise TypeError("a record holds two whole numbers and the bytes of a name")
        if not (-0x8000 <= self.v_ref_num < 0x8000 and -0x80000000 <= self.par_id < 0x80000000):
            raise ValueError("a record holds a number of 16 bits and an id of 32 bits, with a sign")
        if len(self.name) > MOST_NAME_BYTES:
            raise ValueError("a record holds a name of at most 63 bytes")

    @property
    def name_text(self) -> str:
        return hfs_name_to_str(self.name)

    @property
    def text(self) -> str:
        """volume:parent:name, as the command line writes it."""
        return f"{self.v_ref_num}:{self.par_id}:{self.name_text}"

    @classmethod
    def from_text(cls, text: str) -> FSSpec:
        """The record that is written volume:parent:name; an id may be written without a sign. ValueError for others."""
        if not isinstance(text, str):
            raise TypeError(f"a record is read from a str, not {type(text).__name__}")
        parts = _TEXT_OF_RECORD.fullmatch(text)
        if parts is None:
            raise ValueError("a record is written volume:parent:name")
        parent = int(parts[2])
        return cls(int(parts[1]), parent - (1 << 32) if 1 << 31 <= parent < 1 << 32 else parent,
                   hfs_name_from_str(parts[3]))  # fmt: skip

    def to_bytes(self, byte_order: str = sys.byteorder) -> bytes:
        """The record of 70 bytes, its numbers "little" or "big" endian; by default as this machine has them."""
        return _record_in(byte_order).pack(self.v_ref_num, self.par_id, len(self.name), self.name)

    @classmethod
    def from_bytes(cls, record: bytes | bytearray | memoryview, byte_order: str = sys.byteorder) -> FSSpec:
        """What to_bytes() wrote; bytes behind the name are ignored. ValueError for what is no record."""
        if not isinstance(record, (bytes, bytearray, memoryview)):
            raise TypeError(f"a record is read from bytes, not {type(record).__name__}")
        form = _record_in(byte_order)
        if len(record) != RECORD_SIZE:
            raise ValueError(f"a record has {RECORD_SIZE} bytes, not {len(record)}")
        v_ref_num, par_id, length, name = form.unpack(record)
        if length > MOST_NAME_BYTES:
            raise ValueError("a record holds a name of at most 63 bytes")
        return cls(v_ref_num, par_id, name[:length])


def _is_whole(value: object) -> bool:
    return isinstance(value, int) and not isinstance(value, bool)


def _record_in(byte_order: str) -> struct.Struct:
    if not isinstance(byte_order, str):
        raise TypeError(f'a byte order is "little" or "big", not {type(byte_order).__name__}')
    if byte_order not in _RECORDS:
        raise ValueError(f'a byte order is "little" or "big", not "{byte_order}"')
    return _RECORDS[byte_order]


def text(value: bytes) -> bytes:
    """A C string field. REQUIRES: no NUL, at most MOST_TEXT_BYTES."""
    return U16.pack(len(value) + 1) + value + b"\0"


class Reader:
    """Takes the fields of one answer from data, beginning at offset; offset is then behind them.

    Raises Incomplete where data ends too early, Malformed where a field is none.
    """

    def __init__(self, data: bytes, offset: int = 0) -> None:
        self._data = data
        self.offset = offset

    def take(self, count: int) -> bytes:
        end = self.offset + count
        if end > len(self._data):
            raise Incomplete
        taken = self._data[self.offset : end]
        self.offset = end
        return taken

    def number(self, form: struct.Struct) -> int:
        (value,) = form.unpack(self.take(form.size))
        return int(value)

    def flag(self) -> bool:
        value = self.number(U8)
        if value > 1:
            raise Malformed("a flag that is neither 0 nor 1")
        return value == 1

    def text(self) -> bytes | None:
        """A C string without its NUL, None for a missing one."""
        count = self.number(U16)
        return self.padded(count, 1) if count else None

    def padded(self, count: int, zeros: int | None = None) -> bytes:
        """The text in count bytes, behind which there are that many zeros, or at least one."""
        field = self.take(count)
        value = field.rstrip(b"\0")
        if b"\0" in value or len(field) - len(value) < 1 or zeros not in (None, len(field) - len(value)):
            raise Malformed("a text that does not end at its NUL")
        return value

    def record(self) -> FSSpec:
        record = self.take(RECORD_SIZE)
        try:
            spec = FSSpec.from_bytes(record)
        except ValueError as error:
            raise Malformed(str(error)) from error
        if spec.to_bytes() != record:
            raise Malformed("a record with bytes behind its name")
        return spec

    def settings(self) -> bytes:
        size = self.number(U32)
        if size > MOST_SETTINGS_BYTES:
            raise Malformed(f"settings of {size} bytes")
        return self.take(size)

    def trailer(self) -> None:
        if self.take(len(TRAILER)) != TRAILER:
            raise Malformed("no trailer where the answer ends")
