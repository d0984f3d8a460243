"""The client for asyncio: its answers, its tasks, and failures among them."""

from __future__ import annotations

import asyncio
import inspect
import itertools
import os
import signal
import threading
import time
import unittest
from typing import Any, AsyncIterator, Awaitable, Callable, Iterator

import tallowmere
from tallowmere import (
    ConversionError, DeadlineMissed, Outcome, ProtocolError, Request, ServiceEnded, ServiceError, aio, conversion,
    request,
)  # fmt: skip

from .support import SERVICE, FolderTest, children, descriptors, kill_child
from .test_batch import ECHO, numbers


class AsyncTest(FolderTest):
    def run_with(
        self, act: Callable[[aio.Client], Awaitable[None]], service: str = SERVICE, deadline: float = 30
    ) -> None:
        async def main() -> None:
            async with aio.Client(service, deadline) as client:
                await act(client)

        asyncio.run(main())
        self.assertEqual(children(), [])

    def echo(self, act: str) -> str:
        return self.program(ECHO.format(act=act))


async def collect(answers: Any) -> list[Any]:
    return [answer async for answer in answers]


class Package(unittest.TestCase):
    def test_it_has_the_methods_of_the_client_for_threads(self) -> None:
        def methods(client: type) -> dict[str, list[str]]:
            return {name: [str(each).replace(" ", "") for each in inspect.signature(method).parameters.values()]
                    for name, method in vars(client).items() if name[0] != "_" and name != "batch"}  # fmt: skip

        self.assertEqual(methods(aio.Client), methods(tallowmere.Client))
        self.assertGreater(len(methods(aio.Client)), 15)


class Answers(AsyncTest):
    def test_every_method_answers_as_that_for_threads(self) -> None:
        path = os.path.join(self.folder, "a:é")
        open(path, "w").close()
        with tallowmere.Client(SERVICE) as other:
            spec, hfs_path = other.record_of(path).value, other.hfs_path_of(path).value
            arguments: dict[str, tuple[Any, ...]] = {
                "record_of": (path,), "path_of": (spec,), "hfs_path_of": (path,), "path_of_hfs_path": (hfs_path,),
                "hfs_name_of": (path,), "path_in_folder": (self.folder, "a/é"), "volumes": (),
                "make_full_path": (path, 60), "make_file_ref_from_path": (hfs_path,),
                "get_vol_refnum_by_hfs_name": ("x",), "get_hfs_volume_name": (0,), "get_hfs_name": (path,),
                "add_hfs_name": (self.folder, "n"), "get_fsspec": (path,), "set_file_ref_from_fsspec_data": (spec,),
                "set_file_ref_from_fsspec": (spec, True), "get_aiff_export_settings": (44100, 16, 2, "twos"),
                "ask": (request.get_fsspec(path),),
            }  # fmt: skip
            expected = {name: getattr(other, name)(*values) for name, values in arguments.items()}

        async def act(client: aio.Client) -> None:
            methods = {name for name in vars(aio.Client) if name[0] != "_"}
            self.assertEqual(set(arguments) | {"close", "batch"}, methods)
            for name, values in arguments.items():
                self.assertEqual(await getattr(client, name)(*values), expected[name], name)

        self.run_with(act)

    def test_errors_are_raised(self) -> None:
        async def act(client: aio.Client) -> None:
            with self.assertRaises(ConversionError) as caught:
                await client.record_of("/nowhere/f")
            self.assertEqual(caught.exception.outcome, Outcome.NOTHING)
            with self.assertRaises(TypeError):
                await client.record_of(5)  # type: ignore[arg-type]
            with self.assertRaises(TypeError):
                await client.ask("/")  # type: ignore[call-overload]

        self.run_with(act)

    def test_many_tasks_get_each_its_own_answer_of_one_service(self) -> None:
        async def act(client: aio.Client) -> None:
            names = [f"{number}" * (number % 50 + 1) for number in range(2000)]
            paths = await asyncio.gather(*(client.add_hfs_name("/nowhere", name) for name in names))
            self.assertEqual(paths, ["/nowhere/" + name for name in names])
            self.assertEqual(len(children()), 1)

        self.run_with(act)

    def test_no_thread_is_started(self) -> None:
        async def act(client: aio.Client) -> None:
            await client.record_of("/")
            await collect(client.batch(numbers(300)))
            self.assertEqual(threading.active_count(), 1)

        self.run_with(act)

    def test_large_requests_and_answers_pass(self) -> None:
        async def act(client: aio.Client) -> None:
            path = "/" + "a" * 60000
            answers = await asyncio.gather(*(client.add_hfs_name(path, f"{number}") for number in range(100)))
            self.assertEqual(answers, [f"{path}/{number}" for number in range(100)])

        self.run_with(act)


class Batches(AsyncTest):
    def test_answers_come_in_order(self) -> None:
        async def act(client: aio.Client) -> None:
            answers = await collect(client.batch(request.add_hfs_name("/nowhere", f"{n}") for n in range(3000)))
            self.assertEqual(answers, [f"/nowhere/{n}" for n in range(3000)])

        self.run_with(act)

    def test_the_questions_may_come_asynchronously(self) -> None:
        async def questions() -> AsyncIterator[Request[Any]]:
            for number in range(600):
                await asyncio.sleep(0)
                yield request.add_hfs_name("/nowhere", f"{number}")

        async def act(client: aio.Client) -> None:
            self.assertEqual(await collect(client.batch(questions())), [f"/nowhere/{n}" for n in range(600)])

        self.run_with(act)

    def test_conversions_and_their_errors_are_values(self) -> None:
        paths = [os.path.join(self.folder, f"{number}é") for number in range(0, 300)]
        for path in paths[::2]:
            open(path, "w").close()

        async def act(client: aio.Client) -> None:
            asked = [each for path in paths for each in (path, path + "/below")]
            answers = await collect(client.batch(map(conversion.hfs_path_of, asked)))
            self.assertEqual([each.outcome.value for each in answers[:4]], ["found", "nothing", "new", "nothing"])
            back = await collect(client.batch(conversion.path_of_hfs_path(each.value) for each in answers[::2]))
            self.assertEqual([each.value for each in back], paths)

        self.run_with(act)

    def test_256_requests_are_under_way(self) -> None:
        taken = 0

        def endless() -> Iterator[Request[Any]]:
            nonlocal taken
            for taken in itertools.count(1):
                yield request.get_fsspec("/")

        async def act(client: aio.Client) -> None:
            batch = client.batch(endless())
            await batch.__anext__()
            self.assertEqual(taken, 256)
            await batch.aclose()  # type: ignore[attr-defined]
            self.assertEqual(await client.add_hfs_name("/", "é"), "//é")

        self.run_with(act)

    def test_what_was_left_is_not_asked_of_another_service(self) -> None:
        log = os.path.join(self.folder, "log")
        service = self.echo(f"open({log!r}, 'a').write('%d ' % number); number == 1 and sys.exit(0)")

        async def act(client: aio.Client) -> None:
            batch = client.batch(numbers(256))
            self.assertEqual(await batch.__anext__(), b"0")
            await batch.aclose()  # type: ignore[attr-defined]
            with self.assertRaises(ServiceEnded):
                await client.get_hfs_volume_name(1)
            self.assertEqual(await client.get_hfs_volume_name(300), b"300")

        self.run_with(act, service)
        with open(log) as file:
            self.assertEqual(file.read().split()[-1], "300")
            file.seek(0)
            self.assertLess(len(file.read().split()), 6)


class Cancellation(AsyncTest):
    def test_a_task_that_is_cancelled_leaves_the_others_their_answers(self) -> None:
        async def act(client: aio.Client) -> None:
            tasks = [asyncio.ensure_future(client.add_hfs_name("/nowhere", f"{n}")) for n in range(500)]
            await asyncio.sleep(0)
            for task in tasks[::3]:
                task.cancel()
            answers = await asyncio.gather(*tasks, return_exceptions=True)
            for number, answer in enumerate(answers):
                if number % 3:
                    self.assertEqual(answer, f"/nowhere/{number}")
                else:
                    self.assertIsInstance(answer, asyncio.CancelledError)

        self.run_with(act)

    def test_in_mid_request_it_leaves_the_client_usable(self) -> None:
        async def act(client: aio.Client) -> None:
            await client.get_hfs_volume_name(0)
            [child] = children()
            for size in (1, 60000):  # the greater one is written in part
                kill_child(signal.SIGSTOP)
                with self.assertRaises(asyncio.TimeoutError):
                    await asyncio.wait_for(client.add_hfs_name("/" + "a" * size, "x" * 200), 0.2)
                os.kill(child, signal.SIGCONT)
                self.assertEqual(await client.add_hfs_name("/nowhere", f"{size}"), f"/nowhere/{size}")
            self.assertEqual(children(), [child])

        self.run_with(act)

    def test_at_any_moment_it_shifts_no_answer(self) -> None:
        async def act(client: aio.Client) -> None:
            for turns in range(60):
                task = asyncio.ensure_future(collect(client.batch(numbers(20))))
                for _ in range(turns):
                    await asyncio.sleep(0)
                task.cancel()
                await asyncio.wait([task])
                self.assertEqual(await client.add_hfs_name("/nowhere", f"{turns}"), f"/nowhere/{turns}")

        self.run_with(act)

    def test_a_loop_that_ends_meanwhile_leaves_the_client_usable(self) -> None:
        client = aio.Client(SERVICE)
        before = descriptors()

        async def leave() -> None:
            asyncio.ensure_future(collect(client.batch(numbers(30000))))
            await asyncio.sleep(0.05)

        async def ask() -> None:
            self.assertEqual(await client.add_hfs_name("/nowhere", "x"), "/nowhere/x")

        for _ in range(5):
            asyncio.run(leave())
            asyncio.run(ask())
        asyncio.run(client.close())
        self.assertEqual(children(), [])
        self.assertEqual(descriptors(), before)


class Failures(AsyncTest):
    def test_a_service_that_is_killed_is_reported_and_replaced(self) -> None:
        async def act(client: aio.Client) -> None:
            await client.get_hfs_volume_name(0)
            kill_child()
            with self.assertRaisesRegex(ServiceEnded, "was ended by signal 9 before it had answered"):
                await client.get_hfs_volume_name(0)
            self.assertIsNotNone(await client.get_hfs_volume_name(0))

        self.run_with(act)

    def test_only_the_request_in_hand_fails(self) -> None:
        async def act(client: aio.Client) -> None:
            answers = await collect(client.batch(numbers(40)))
            for number, answer in enumerate(answers):
                if number in (10, 21, 32):
                    self.assertEqual(str(answer), "The service ended with status 5 before it had answered.")
                else:
                    self.assertEqual(answer, str(number).encode())

        self.run_with(act, self.echo("if answered == 10: sys.exit(5)"))

    def test_nonsense_fails_alone(self) -> None:
        async def act(client: aio.Client) -> None:
            answers = await collect(client.batch(numbers(20)))
            self.assertEqual([isinstance(each, ProtocolError) for each in answers], [n == 7 for n in range(20)])

        self.run_with(act, self.echo("if number == 7: os.write(1, b'\\2')"))

    def test_a_deadline_is_for_each_answer(self) -> None:
        async def act(client: aio.Client) -> None:
            begin = time.monotonic()
            answers = await asyncio.gather(*(client.get_hfs_volume_name(number) for number in range(12)))
            self.assertEqual(answers, [str(number).encode() for number in range(12)])
            self.assertGreater(time.monotonic() - begin, 1)

        self.run_with(act, self.echo("time.sleep(0.1)"), 1)

    def test_a_missed_deadline_fails_one_and_the_rest_are_asked_of_another_service(self) -> None:
        async def act(client: aio.Client) -> None:
            asked = [client.get_hfs_volume_name(number) for number in range(5)]
            first, *rest = await asyncio.gather(*asked, return_exceptions=True)
            self.assertIsInstance(first, DeadlineMissed)
            self.assertIn("within 0.5 seconds when it was asked for the name of the volume 0.", str(first))
            self.assertEqual(rest, [b"1", b"2", b"3", b"4"])

        self.run_with(act, self.echo("if number == 0: time.sleep(60)"), 0.5)

    def test_the_loop_goes_on_while_a_service_hangs(self) -> None:
        async def act(client: aio.Client) -> None:
            task = asyncio.ensure_future(client.get_hfs_volume_name(0))
            for _ in range(10):
                await asyncio.sleep(0.01)
            self.assertFalse(task.done())
            with self.assertRaises(DeadlineMissed):
                await task

        self.run_with(act, self.program("time.sleep(60)"), 0.5)

    def test_a_service_that_closes_its_output_does_not_stop_the_loop(self) -> None:
        async def act(client: aio.Client) -> None:
            ticks, task = 0, asyncio.ensure_future(client.get_hfs_volume_name(0))
            while not task.done():
                await asyncio.sleep(0.01)
                ticks += 1
            self.assertGreater(ticks, 20)
            self.assertRegex(str(task.exception()), "closed its output before it had answered")

        self.run_with(act, self.program("os.read(0, 9)\nos.close(1)\ntime.sleep(60)"))

    def test_no_service_is_an_error_for_each(self) -> None:
        async def act(client: aio.Client) -> None:
            answers = await collect(client.batch(numbers(300)))
            self.assertEqual({type(answer) for answer in answers}, {ServiceError})

        self.run_with(act, os.path.join(self.folder, "missing"))

    def test_what_waits_when_it_is_closed_gets_an_error(self) -> None:
        async def act(client: aio.Client) -> None:
            task = asyncio.ensure_future(client.get_hfs_volume_name(0))
            await asyncio.sleep(0.1)
            await client.close()
            with self.assertRaises(ServiceEnded):
                await task

        self.run_with(act, self.program("time.sleep(60)"))


class Loops(AsyncTest):
    def test_one_loop_after_the_other(self) -> None:
        client = aio.Client(SERVICE)

        async def ask() -> None:
            self.assertEqual(await client.add_hfs_name("/nowhere", "x"), "/nowhere/x")

        for _ in range(3):
            asyncio.run(ask())
        asyncio.run(client.close())
        self.assertEqual(children(), [])

    def test_another_loop_meanwhile_is_refused(self) -> None:
        async def act(client: aio.Client) -> None:
            task = asyncio.ensure_future(client.get_hfs_volume_name(0))
            await asyncio.sleep(0.05)
            with self.assertRaisesRegex(RuntimeError, "another event loop"):
                await asyncio.to_thread(asyncio.run, client.get_hfs_volume_name(0))
            with self.assertRaises(DeadlineMissed):
                await task

        self.run_with(act, self.program("time.sleep(60)"), 0.5)

    def test_it_may_be_made_outside_of_any_loop_in_any_thread(self) -> None:
        made: list[aio.Client] = []
        thread = threading.Thread(target=lambda: made.append(aio.Client(SERVICE)))
        thread.start()
        thread.join()

        async def main() -> None:
            async with made[0] as client:
                self.assertIsNotNone(await client.get_hfs_volume_name(0))

        asyncio.run(main())

    def test_after_a_fork_a_child_has_a_service_of_its_own(self) -> None:
        said = self.run_host(
            """
            import asyncio
            from tallowmere import aio
            client = aio.Client(SERVICE)
            async def ask(): return await client.add_hfs_name("/nowhere", str(os.getpid()))
            asyncio.run(ask())
            service = client._process.id
            child = os.fork()
            right = asyncio.run(ask()) == f"/nowhere/{os.getpid()}"
            if child == 0:
                asyncio.run(client.close())
                os._exit(0 if right and client._process is None else 1)
            print(right, os.waitpid(child, 0)[1], client._process.id == service)
            """
        )
        self.assertEqual(said, "True 0 True\n")
