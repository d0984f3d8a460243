"""Prints the record of each item that a folder has, and of each that comes into it, until it is interrupted.

    python3 watch.py FOLDER [SECONDS-BETWEEN-LOOKS]
"""

import os
import sys
import time

from tallowmere import Client, Converted, Outcome, conversion


def watch(folder: str, seconds: float) -> None:
    known: set[str] = set()
    with Client() as client:
        while True:
            names = set(os.listdir(folder))
            fresh = sorted(names - known)
            answers = client.batch(conversion.record_of(os.path.join(folder, name)) for name in fresh)
            for name, answer in zip(fresh, answers):
                if not isinstance(answer, Converted):
                    print(name, answer, file=sys.stderr)
                elif answer.outcome is Outcome.FOUND:  # not gone again meanwhile
                    print(answer.text, flush=True)
            known = names
            time.sleep(seconds)


try:
    watch(sys.argv[1], float(sys.argv[2]) if len(sys.argv) > 2 else 1.0)
except KeyboardInterrupt:
    pass
