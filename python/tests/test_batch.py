"""Many requests under way: their order, their bounds, and failures among them."""

from __future__ import annotations

import itertools
import os
import time
from typing import Iterator

from tallowmere import Client, ProtocolError, Request, ServiceEnded, ServiceError, request

from .support import SERVICE, FolderTest, children, kill_child

# Answers a volume's number with that number as its name.
ECHO = """
    import struct
    answered = 0
    while data := os.read(0, 4):
        while len(data) < 4: data += os.read(0, 4 - len(data))
        number = struct.unpack("=h", data[2:])[0]
        {act}
        name = str(number).encode() + b"\\0"
        os.write(1, b"\\1" + struct.pack("=H", len(name)) + name + b"MWLT")
        answered += 1
"""


class BatchTest(FolderTest):
    def client(self, act: str = "", deadline: float = 60) -> Client:
        client = Client(self.program(ECHO.format(act=act)) if act else SERVICE, deadline)
        self.addCleanup(client.close)
        return client


def numbers(count: int) -> list[Request[bytes | None]]:
    return [request.get_hfs_volume_name(number) for number in range(count)]


class Order(BatchTest):
    def test_answers_come_in_the_order_of_requests_of_every_kind(self) -> None:
        names = [f"{number:04}" + "n" * (number % 50) for number in range(2000)]
        asked = []
        for name in names:
            asked.append(request.add_hfs_name("/nowhere", name))
            asked.append(request.get_vol_refnum_by_hfs_name(name))
            asked.append(request.get_fsspec("a\0b"))
            asked.append(request.make_full_path("relative"))
        answers = list(self.client().batch(asked))
        self.assertEqual(answers[0::4], ["/nowhere/" + name for name in names])
        self.assertEqual(set(answers[1::4]) | set(answers[2::4]), {None})
        self.assertEqual(set(answers[3::4]), {b":"})

    def test_records_of_real_files_are_those_of_single_requests(self) -> None:
        paths = [os.path.join(self.folder, str(number)) for number in range(300)]
        for path in paths:
            open(path, "w").close()
        client = self.client()
        specs = list(client.batch(map(request.get_fsspec, paths)))
        self.assertEqual(specs, [client.get_fsspec(path) for path in paths])
        self.assertEqual(list(client.batch(map(request.set_file_ref_from_fsspec, specs))), paths)

    def test_nothing_asked_is_nothing_answered(self) -> None:
        self.assertEqual(list(self.client().batch([])), [])
        self.assertEqual(children(), [])


class Bounds(BatchTest):
    def taken_before_the_first_answer(self, path: str) -> int:
        taken = 0

        def endless() -> Iterator[Request[object]]:
            nonlocal taken
            for taken in itertools.count(1):
                yield request.get_fsspec(path)

        batch = self.client().batch(endless())
        next(batch)
        first = taken
        next(batch)
        self.assertEqual(taken, first + 1)
        batch.close()
        return first

    def test_256_requests_are_under_way(self) -> None:
        self.assertEqual(self.taken_before_the_first_answer("/"), 256)

    def test_64_kib_are_under_way(self) -> None:
        self.assertEqual(self.taken_before_the_first_answer("/" + "a" * (8192 - 6)), 8)
        self.assertEqual(self.taken_before_the_first_answer("/" + "a" * (8192 - 5 - 1)), 8)
        self.assertEqual(self.taken_before_the_first_answer("/" + "a" * (8192 - 7)), 9)

    def test_requests_that_are_not_sent_are_bounded_too(self) -> None:
        self.assertEqual(self.taken_before_the_first_answer("a\0b"), 256)

    def test_20000_requests_and_answers_of_60000_bytes(self) -> None:
        path, code = "/" + "a" * 59997, """
            left = 0
            answer = b"\\1\\x61\\xea" + b"a" * 60000 + b"\\0MWLT"
            while data := os.read(0, 65536):
                left += len(data)
                while left >= 60008:
                    left -= 60008
                    rest = memoryview(answer)
                    while rest: rest = rest[os.write(1, rest):]
            """  # fmt: skip
        client = Client(self.program(code), 60)
        self.addCleanup(client.close)
        asked = request.add_hfs_name(path, "b")
        self.assertEqual(len(asked.payload), 60008)
        lengths = [len(answer) for answer in client.batch(itertools.repeat(asked, 20000))]
        self.assertEqual(lengths, [60000] * 20000)

    def test_answers_that_fill_their_pipe_while_the_requests_fill_theirs(self) -> None:
        asked = [request.make_full_path("relative" * 12)] * 250 + [request.make_full_path("/" + "a" * 65000)]
        self.assertEqual(list(self.client().batch(asked))[:250], [b":"] * 250)

    def test_requests_and_answers_of_every_size(self) -> None:
        paths = ["/" + "a" * ((number * 7919) % 65530) for number in range(1000)]
        answers = self.client().batch(request.add_hfs_name(path, "b") for path in paths)
        for path, answer in zip(paths, answers):
            self.assertEqual(answer, path.rstrip("/") + "/b" if path != "/" else "//b")

    def test_the_deadline_does_not_count_the_consumers_time(self) -> None:
        batch = self.client(deadline=0.8).batch(numbers(600))
        next(batch)
        time.sleep(1.6)
        self.assertEqual(len([answer for answer in batch if not isinstance(answer, ServiceError)]), 599)

    def test_the_deadline_is_for_each_answer_not_for_those_before(self) -> None:
        client = self.client("time.sleep(0.1)", deadline=1.5)
        batch = client.batch(numbers(18))
        self.assertEqual(next(batch), b"0")
        self.assertEqual(client.get_hfs_volume_name(99), b"99")

    def test_the_deadline_is_for_each_answer_of_another_service_too(self) -> None:
        client = self.client("sys.exit(5) if number == 0 else time.sleep(0.1)", deadline=1.5)
        batch = client.batch(numbers(18))
        self.assertIsInstance(next(batch), ServiceEnded)
        self.assertEqual(client.get_hfs_volume_name(99), b"99")


class Failures(BatchTest):
    def test_only_the_request_in_hand_fails_when_the_service_dies(self) -> None:
        client = self.client("if answered == 10: sys.exit(5)")
        answers = list(client.batch(numbers(40)))
        for number, answer in enumerate(answers):
            if number in (10, 21, 32):
                self.assertIsInstance(answer, ServiceEnded)
                self.assertEqual(str(answer), "The service ended with status 5 before it had answered.")
            else:
                self.assertEqual(answer, str(number).encode())

    def test_only_the_request_with_nonsense_for_an_answer_fails(self) -> None:
        client = self.client("if number == 7: os.write(1, b'\\2')")
        answers = list(client.batch(numbers(20)))
        self.assertIsInstance(answers.pop(7), ProtocolError)
        self.assertEqual(answers, [str(number).encode() for number in range(20) if number != 7])

    def test_nonsense_in_one_write_with_good_answers_fails_alone(self) -> None:
        client = self.client("time.sleep(0.2) if number == 0 else None; number == 7 and os.write(1, b'\\2')")
        answers = list(client.batch(numbers(20)))
        self.assertEqual([isinstance(answer, ProtocolError) for answer in answers], [n == 7 for n in range(20)])

    def test_a_batch_survives_a_service_that_is_killed_again_and_again(self) -> None:
        paths = ["/" + "a" * (number % 3000) for number in range(4000)]
        failed = 0
        answers = self.client().batch(request.add_hfs_name(path, "b") for path in paths)
        for number, (path, answer) in enumerate(zip(paths, answers)):
            if number % 500 == 250:
                kill_child()
            if isinstance(answer, ServiceEnded):
                failed += 1
            else:
                self.assertEqual(answer, path + "/b")
        self.assertGreaterEqual(failed, 4)
        self.assertLessEqual(failed, 8)

    def test_every_request_fails_when_no_service_can_be_started(self) -> None:
        with Client(os.path.join(self.folder, "missing")) as client:
            answers = list(client.batch(numbers(300)))
        self.assertEqual({str(answer)[:36] for answer in answers}, {"The service could not be started: [E"})

    def test_an_error_of_the_iterable_reaches_the_consumer(self) -> None:
        def broken() -> Iterator[Request[object]]:
            yield request.get_fsspec("/etc")
            raise RuntimeError("broken")

        client = self.client()
        with self.assertRaisesRegex(RuntimeError, "broken"):
            list(client.batch(broken()))
        self.assertIsNone(client.get_vol_refnum_by_hfs_name("no such volume"))


class Company(BatchTest):
    def test_requests_between_answers(self) -> None:
        client = self.client()
        for number, answer in enumerate(client.batch(request.add_hfs_name("/nowhere", f"{n}") for n in range(600))):
            self.assertEqual(answer, f"/nowhere/{number}")
            self.assertEqual(client.add_hfs_name("/nowhere", f"x{number}"), f"/nowhere/x{number}")

    def test_a_batch_of_the_answers_of_a_batch(self) -> None:
        client = self.client()
        once = client.batch(request.add_hfs_name("/nowhere", f"{n}") for n in range(1000))
        twice = client.batch(request.add_hfs_name(path, "again") for path in once)
        self.assertEqual(list(twice), [f"/nowhere/{n}/again" for n in range(1000)])
        self.assertEqual(len(children()), 1)

    def test_an_abandoned_batch_does_not_disturb_the_next_request(self) -> None:
        client = self.client()
        for _ in client.batch(request.add_hfs_name("/nowhere", f"{n}") for n in range(1000)):
            break
        self.assertEqual(client.add_hfs_name("/", "é"), "//é")

    def test_what_was_abandoned_is_not_asked_again(self) -> None:
        log = os.path.join(self.folder, "log")
        client = self.client(f"open({log!r}, 'a').write('%d ' % number); number == 1 and sys.exit(0)")
        batch = client.batch(numbers(256))
        self.assertEqual(next(batch), b"0")
        batch.close()
        with self.assertRaises(ServiceEnded):
            client.get_hfs_volume_name(1)
        self.assertEqual(client.get_hfs_volume_name(300), b"300")
        with open(log) as file:
            self.assertEqual(file.read(), "0 1 1 300 ")
