"""The parts of the kernel's mount table that a client needs: proc_pid_mountinfo(5)."""

from __future__ import annotations

import re
from typing import Iterator, NamedTuple

_TABLE = "/proc/self/mountinfo"
_ESCAPE = re.compile(rb"\\([0-7]{3})")  # of a space, tab, newline, backslash or '#'
# Kinds that are answered by a server, beside all those whose names begin with "fuse".
_SERVED = frozenset((
    b"9p", b"afs", b"beegfs", b"ceph", b"cifs", b"coda", b"gfs2", b"lustre", b"ncpfs", b"nfs", b"nfs4", b"ocfs2",
    b"orangefs", b"smb3", b"smbfs", b"vboxsf", b"virtiofs", b"vmhgfs",
))  # fmt: skip


class Mount(NamedTuple):
    point: bytes
    kind: bytes  # of file system, empty where the table does not tell

    @property
    def is_served(self) -> bool:
        return self.kind.startswith(b"fuse") or self.kind in _SERVED


def mounts_in(table: bytes) -> list[Mount]:
    """Every path at which something is mounted, once each: "/" first, then in the kernel's order.

    Of several mounts at one path the last one counts, as it covers the others. Malformed lines are skipped.
    """
    last = {mount.point: mount for mount in _lines(table)}
    root = last.pop(b"/", Mount(b"/", b""))
    order = {mount.point: number for number, mount in enumerate(_lines(table))}
    return [root, *sorted(last.values(), key=lambda mount: order[mount.point])]


def _lines(table: bytes) -> Iterator[Mount]:
    for line in table.split(b"\n"):
        left, _, right = line.partition(b" - ")
        fields = left.split(b" ")
        if len(fields) > 4 and fields[4].startswith(b"/"):
            yield Mount(_plain(fields[4]), _plain(right.split(b" ")[0]))


def _plain(field: bytes) -> bytes:
    return _ESCAPE.sub(lambda escape: bytes([int(escape[1], 8) & 0xFF]), field)


def read_mounts() -> list[Mount]:
    """The mounts of this process; "/" alone where there is no /proc."""
    try:
        with open(_TABLE, "rb") as table:
            return mounts_in(table.read())
    except OSError:
        return mounts_in(b"")
