"""Asks by the shared library, through ctypes: c_interface.py LIBRARY SERVICE FOLDER, an empty folder."""

import ctypes
import os
import sys
import threading
from ctypes import POINTER, byref, c_char, c_char_p, c_int, c_int16, c_int32, c_size_t, c_uint8, c_uint32, c_void_p


class Record(ctypes.Structure):
    _fields_ = [
        ("volume", c_int16),
        ("name_length", c_uint8),
        ("reserved", c_uint8),
        ("parent", c_int32),
        ("name", c_char * 256),
    ]


def main() -> None:
    library_path, service, folder = sys.argv[1:]
    library = ctypes.CDLL(library_path)
    library.tallowmere_open.restype = c_void_p
    library.tallowmere_open.argtypes = [c_char_p, c_uint32]
    library.tallowmere_close.argtypes = [c_void_p]
    library.tallowmere_error.restype = c_char_p
    library.tallowmere_free.argtypes = [c_void_p]
    library.tallowmere_record_of.argtypes = [c_void_p, c_char_p, c_size_t, POINTER(Record)]
    library.tallowmere_path_of.argtypes = [c_void_p, POINTER(Record), c_int, POINTER(c_void_p), POINTER(c_size_t)]

    client = library.tallowmere_open(os.fsencode(service), 0)

    def record_of(path: bytes) -> "Record | None":
        record = Record()
        outcome = library.tallowmere_record_of(client, path, len(path), byref(record))
        return record if outcome in (0, 1) else None

    def path_of(record: Record) -> bytes:
        text, length = c_void_p(), c_size_t()
        assert library.tallowmere_path_of(client, byref(record), 0, byref(text), byref(length)) in (0, 1)
        path = ctypes.string_at(text, length.value)
        library.tallowmere_free(text)
        return path

    file = os.fsencode(os.path.join(folder, "a:b"))
    with open(file, "wb"):
        pass
    record = record_of(file)
    assert record is not None
    assert record.name == b"a/b"
    assert path_of(record) == file
    assert record_of(b"/missing/x") is None
    assert library.tallowmere_error() == b'there is no folder "/missing"', library.tallowmere_error()

    # ctypes lets go of the interpreter's lock: the threads are in the library at once.
    wrong = []

    def convert(number: int) -> None:
        for i in range(200):
            path = os.fsencode(os.path.join(folder, f"{number}.{i}"))
            record = record_of(path)
            if record is None or path_of(record) != path:
                wrong.append(path)

    threads = [threading.Thread(target=convert, args=(number,)) for number in range(4)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert not wrong, wrong
    library.tallowmere_close(client)


main()
