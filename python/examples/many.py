"""Prints the record of each path on standard input, one a line, and an empty line for what has none.

    find /srv/music -print0 | python3 many.py
"""

import os
import sys
from collections import Counter
from typing import Iterator

from tallowmere import Client, Converted, conversion


def paths_in(descriptor: int) -> Iterator[bytes]:
    rest = b""
    while chunk := os.read(descriptor, 65536):
        *paths, rest = (rest + chunk).split(b"\0")
        yield from paths
    if rest:
        yield rest


counts: Counter[str] = Counter()
with Client() as client:
    for answer in client.batch(map(conversion.record_of, paths_in(sys.stdin.fileno()))):
        counts[answer.outcome.value] += 1
        if isinstance(answer, Converted):
            print(answer.text)
        else:
            print()
            print(answer, file=sys.stderr)
print(", ".join(f"{count} {outcome}" for outcome, count in sorted(counts.items())), file=sys.stderr)
