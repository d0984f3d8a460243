"""One client of several threads, of asyncio's threads, and on both sides of a fork: each gets its own answers."""

from __future__ import annotations

import asyncio
import os
import signal
import threading
import time
import traceback
from concurrent.futures import ThreadPoolExecutor

from tallowmere import Client, DeadlineMissed, ServiceEnded, conversion, request

from .support import SERVICE, FolderTest, children, has_ended, kill_child


class SharingTest(FolderTest):
    def setUp(self) -> None:
        super().setUp()
        self.client = Client(SERVICE, 60)
        self.addCleanup(self.client.close)

    def check(self, owner: int, count: int) -> None:
        """Asks for what only this owner asks for."""
        for number in range(count):
            name = f"{owner}-{number}"
            self.assertEqual(self.client.add_hfs_name("/nowhere", name), f"/nowhere/{name}")

    def check_batch(self, owner: int, count: int) -> None:
        names = [f"{owner}-{number}" for number in range(count)]
        answers = self.client.batch(request.add_hfs_name("/nowhere", name) for name in names)
        self.assertEqual(list(answers), [f"/nowhere/{name}" for name in names])

    def in_threads(self, *acts: object) -> None:
        with ThreadPoolExecutor(len(acts)) as pool:
            for result in [pool.submit(act, number) for number, act in enumerate(acts)]:
                result.result(120)


class Threads(SharingTest):
    def test_each_gets_its_own_answers(self) -> None:
        self.in_threads(*[lambda owner: self.check(owner, 500)] * 8)
        self.assertEqual(len(children()), 1)

    def test_batches_of_several_are_open_at_a_time(self) -> None:
        self.in_threads(*[lambda owner: self.check_batch(owner, 3000)] * 4, *[lambda owner: self.check(owner, 300)] * 2)

    def test_a_batch_that_stands_still_keeps_nobody_waiting(self) -> None:
        batch = self.client.batch(request.add_hfs_name("/nowhere", str(number)) for number in range(1000))
        self.assertEqual(next(batch), "/nowhere/0")
        self.in_threads(lambda owner: self.check(owner, 10))
        self.assertEqual(list(batch), [f"/nowhere/{number}" for number in range(1, 1000)])

    def test_a_service_that_is_killed_again_and_again_mixes_nothing_up(self) -> None:
        failed = []

        def ask(owner: int) -> None:
            for number in range(300):
                try:
                    self.check(owner * 1000 + number, 1)
                except ServiceEnded as error:
                    failed.append(error)

        def kill(_: int) -> None:
            for _ in range(20):
                time.sleep(0.02)
                for child in children():
                    os.kill(child, signal.SIGKILL)

        self.in_threads(ask, ask, ask, ask, kill)
        self.assertGreater(len(failed), 0)
        self.assertLess(len(failed), 100)

    def test_one_closes_it_while_others_ask(self) -> None:
        def close(_: int) -> None:
            for _ in range(20):
                self.client.close()

        self.in_threads(*[lambda owner: self.check(owner, 200)] * 4, close)

    def test_a_stopped_service_gives_each_its_error_and_the_next_answers(self) -> None:
        self.client = Client(SERVICE, 0.5)
        self.addCleanup(self.client.close)
        self.check(0, 1)
        kill_child(signal.SIGSTOP)
        errors = []

        def ask(owner: int) -> None:
            try:
                self.check(owner, 1)
            except DeadlineMissed as error:
                errors.append(error)

        self.in_threads(ask, ask, ask)
        self.assertEqual(len(errors), 1)  # the others were asked of the next service
        self.check(9, 10)

    def test_conversions_of_real_files(self) -> None:
        paths = [os.path.join(self.folder, f"{number}é") for number in range(100)]
        for path in paths:
            open(path, "w").close()

        def convert(_: int) -> None:
            for path in paths:
                self.assertEqual(self.client.path_of(self.client.record_of(path).value).value, path)
            answers = self.client.batch(map(conversion.hfs_path_of, paths))
            back = self.client.batch(conversion.path_of_hfs_path(answer.value) for answer in answers)
            self.assertEqual([answer.value for answer in back], paths)

        self.in_threads(*[convert] * 4)

    def test_a_signal_handler_must_not_use_the_client_that_it_interrupts(self) -> None:
        caught = []

        def use(*_: object) -> None:
            try:
                self.client.get_hfs_volume_name(0)
            except RuntimeError as error:
                caught.append(error)
                os.kill(child, signal.SIGCONT)

        self.check(0, 1)
        [child] = children()
        os.kill(child, signal.SIGSTOP)
        self.addCleanup(signal.signal, signal.SIGALRM, signal.signal(signal.SIGALRM, use))
        signal.setitimer(signal.ITIMER_REAL, 0.3)
        self.check(1, 1)
        self.assertIn("middle of a request", str(caught[0]))

    def test_a_forgotten_batch_of_another_thread_is_let_go(self) -> None:
        def leave(_: int) -> None:
            batch = self.client.batch(request.add_hfs_name("/nowhere", str(number)) for number in range(1000))
            next(batch)

        for _ in range(20):
            self.in_threads(leave, lambda owner: self.check(owner, 20))


class Asyncio(SharingTest):
    def test_to_thread_gives_each_its_own_answers(self) -> None:
        async def ask(number: int) -> None:
            name = str(number)
            path = await asyncio.to_thread(self.client.add_hfs_name, "/nowhere", name)
            self.assertEqual(path, f"/nowhere/{name}")

        async def main() -> None:
            await asyncio.gather(*map(ask, range(500)))

        asyncio.run(main())
        self.assertEqual(len(children()), 1)


class Forks(SharingTest):
    def in_child(self, act: object) -> None:
        """Calls act in a child, in which it has to return, and end in time."""
        child = os.fork()
        if child == 0:
            try:
                signal.alarm(60)
                act()
                os._exit(0)
            except BaseException:
                traceback.print_exc()
            finally:
                os._exit(1)
        self.assertEqual(os.waitpid(child, 0)[1], 0)

    def test_a_child_starts_a_service_of_its_own_and_leaves_the_parents_alone(self) -> None:
        self.check(0, 1)
        [service] = children()

        def act() -> None:
            self.check(1, 50)
            [own] = children()
            assert own != service
            self.client.close()
            assert not has_ended(service)

        self.in_child(act)
        self.assertEqual(children(), [service])
        self.check(2, 50)
        self.assertEqual(children(), [service])

    def test_a_child_that_ends_without_a_word_leaves_the_parents_service_alone(self) -> None:
        said = self.run_host(
            """
            client = Client(SERVICE)
            client.get_hfs_volume_name(0)
            service = client._process.id
            if os.fork() == 0:
                sys.exit(0)  # with all that is done at exit
            os.wait()
            print(os.path.exists(f"/proc/{service}"), client.get_hfs_volume_name(0) is not None)
            print(client._process.id == service)
            """
        )
        self.assertEqual(said, "True True\nTrue\n")

    def test_a_child_that_lives_does_not_keep_the_parents_service_alive(self) -> None:
        self.check(0, 1)
        [service] = children()
        child = os.fork()
        if child == 0:
            signal.pause()
            os._exit(0)
        self.addCleanup(os.waitpid, child, 0)
        self.addCleanup(os.kill, child, signal.SIGKILL)
        begin = time.monotonic()
        process = self.client._process
        process.close()  # the service sees the end of its input, as nobody else holds it
        while not process.has_ended() and time.monotonic() < begin + 10:
            time.sleep(0.001)
        self.assertTrue(has_ended(service))
        self.assertEqual(process.ending(), "ended with status 0")

    def test_a_batch_goes_on_in_both(self) -> None:
        batch = self.client.batch(request.add_hfs_name("/nowhere", str(number)) for number in range(1000))
        self.assertEqual(next(batch), "/nowhere/0")
        rest = [f"/nowhere/{number}" for number in range(1, 1000)]

        def act() -> None:
            assert list(batch) == rest

        self.in_child(act)
        self.assertEqual(list(batch), rest)

    def test_a_child_asks_while_other_threads_of_the_parent_do(self) -> None:
        stop = threading.Event()

        def ask(owner: int) -> None:
            while not stop.is_set():
                self.check(owner, 20)

        def fork(_: int) -> None:
            try:
                for number in range(20):
                    self.in_child(lambda: self.check(100 + number, 5))
            finally:
                stop.set()

        self.in_threads(ask, ask, ask, fork)

    def test_a_grandchild_has_its_own_too(self) -> None:
        self.check(0, 1)

        def act() -> None:
            self.check(1, 1)
            self.in_child(lambda: self.check(2, 5))
            self.check(3, 5)

        self.in_child(act)
        self.check(4, 5)
