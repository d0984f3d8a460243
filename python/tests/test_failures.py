"""Services that die, hang or answer nonsense, and hosts that make it hard: each gives one clear error, and the next
request is answered."""

from __future__ import annotations

import gc
import os
import signal
import subprocess
import sys
import threading
import time
import types
from typing import Any

import tallowmere
from tallowmere import Client, DeadlineMissed, ProtocolError, ServiceEnded, ServiceError, request

from .support import PACKAGE, SERVICE, FolderTest, children, descriptors, has_ended, kill_child

# A stand-in says what its test writes here when the first request arrives.
ANSWER = "os.read(0, 65536)\nos.write(1, {!r})\n"
LINGER = "time.sleep(60)\n"
NAMED = b"\1\2\0A\0MWLT"


class FailureTest(FolderTest):
    def setUp(self) -> None:
        super().setUp()
        self.assertEqual(children(), [])
        self.addCleanup(lambda: self.assertEqual(children(), []))

    def client(self, service: str = SERVICE, deadline: float = 30) -> Client:
        client = Client(service, deadline)
        self.addCleanup(client.close)
        return client

    def assert_fails(self, client: Client, error: type[ServiceError], message: str) -> None:
        with self.assertRaisesRegex(error, message) as caught:
            client.get_hfs_volume_name(0)
        self.assertIs(type(caught.exception), error)
        self.assertRegex(str(caught.exception), r"\A[A-Z][^\n]*\.\Z")

    def assert_answers(self, client: Client) -> None:
        self.assertIsNotNone(client.get_hfs_volume_name(0))


class Deaths(FailureTest):
    def test_a_service_killed_between_requests_is_reported_and_replaced(self) -> None:
        client = self.client()
        self.assert_answers(client)
        kill_child()
        self.assert_fails(client, ServiceEnded, "was ended by signal 9 before it had answered")
        self.assert_answers(client)

    def test_a_service_killed_during_a_request_is_reported_and_replaced(self) -> None:
        client = self.client()
        self.assert_answers(client)
        kill_child(signal.SIGSTOP)
        killer = threading.Timer(0.2, kill_child)
        killer.start()
        self.assert_fails(client, ServiceEnded, "was ended by signal 9 before it had answered")
        killer.join()
        self.assert_answers(client)

    def test_a_program_that_exits_at_once(self) -> None:
        client = self.client(self.program("sys.exit(3)"))
        for _ in range(2):
            self.assert_fails(client, ServiceEnded, "ended with status 3 before it had answered")

    def test_an_answer_that_is_cut(self) -> None:
        for length in range(len(NAMED)):
            client = self.client(self.program(ANSWER.format(NAMED[:length])))
            self.assert_fails(client, ServiceEnded, "ended with status 0 before it had answered")

    def test_an_output_that_is_closed(self) -> None:
        client = self.client(self.program("os.read(0, 9)\nos.close(1)\n" + LINGER))
        self.assert_fails(client, ServiceEnded, "closed its output before it had answered")

    def test_a_missing_program(self) -> None:
        missing = os.path.join(self.folder, "missing")
        self.assert_fails(self.client(missing), ServiceError, f"could not be started: .*No such file .*{missing}")

    def test_a_program_that_may_not_be_run(self) -> None:
        self.assert_fails(self.client(self.folder), ServiceError, "could not be started: .*Permission denied")

    def test_300_restarts_leave_nothing_behind(self) -> None:
        client = self.client()
        self.assert_answers(client)
        before = descriptors()
        for _ in range(300):
            kill_child()
            self.assert_fails(client, ServiceEnded, "signal 9")
            self.assert_answers(client)
        self.assertEqual(descriptors(), before)
        self.assertEqual(len(children()), 1)

    def test_failed_starts_leave_nothing_behind(self) -> None:
        client = self.client(os.path.join(self.folder, "missing"))
        before = descriptors()
        for _ in range(20):
            self.assert_fails(client, ServiceError, "No such file")
        self.assertEqual(descriptors(), before)


class Deadlines(FailureTest):
    def test_a_service_that_never_answers_is_killed(self) -> None:
        client = self.client(self.program("import signal\nsignal.signal(15, signal.SIG_IGN)\n" + LINGER), 0.3)
        begin = time.monotonic()
        self.assert_fails(client, DeadlineMissed, "did not answer within 0.3 seconds")
        self.assertGreaterEqual(time.monotonic() - begin, 0.3)
        self.assertEqual(children(), [])

    def test_a_stopped_service_is_killed_and_replaced(self) -> None:
        client = self.client(deadline=2)
        self.assert_answers(client)
        kill_child(signal.SIGSTOP)
        self.assert_fails(client, DeadlineMissed, "within 2 seconds")
        self.assert_answers(client)

    def test_a_service_that_trickles_misses_its_deadline(self) -> None:
        trickle = """
            os.read(0, 9)
            for byte in b"\\1\\377\\377" + b"a" * 600:
                os.write(1, bytes([byte]))
                time.sleep(0.1)
            """
        client = self.client(self.program(trickle), 0.5)
        begin = time.monotonic()
        self.assert_fails(client, DeadlineMissed, "within 0.5 seconds")
        self.assertLess(time.monotonic() - begin, 20)

    def test_a_deadline_is_for_each_answer(self) -> None:
        code = f"while os.read(0, 4):\n  time.sleep(0.2)\n  os.write(1, {NAMED!r})\n"
        client = self.client(self.program(code), 3)
        begin = time.monotonic()
        for _ in range(16):
            client.get_hfs_volume_name(0)
        self.assertGreater(time.monotonic() - begin, 3)

    def test_what_is_no_deadline_is_refused(self) -> None:
        for deadline in (0, -1, float("nan")):
            with self.assertRaises(ValueError):
                Client(SERVICE, deadline)
        self.assert_answers(self.client(deadline=float("inf")))

    def test_closing_does_not_wait_for_a_stuck_service(self) -> None:
        client = self.client()
        self.assert_answers(client)
        kill_child(signal.SIGSTOP)
        begin = time.monotonic()
        client.close()
        self.assertLess(time.monotonic() - begin, 20)
        self.assertEqual(children(), [])


class Nonsense(FailureTest):
    def test_answers_that_the_protocol_does_not_know(self) -> None:
        for answer, message in (
            (b"\1\2\0A\0MWLX", "does not know: no trailer where the answer ends"),
            (b"\2\2\0A\0MWLT", "does not know: a flag that is neither 0 nor 1"),
            (b"\1\2\0AAMWLT", "does not know: a text that does not end at its NUL"),
            (NAMED + b"\1", "answered what it was not asked"),
            (NAMED * 2, "answered what it was not asked"),
        ):
            with self.subTest(answer):
                client = self.client(self.program(ANSWER.format(answer) + LINGER))
                self.assert_fails(client, ProtocolError, message)
                self.assertEqual(children(), [])

    def test_an_answer_before_the_request_is_not_its_answer(self) -> None:
        marker = os.path.join(self.folder, "said")
        code = ANSWER.format(NAMED) + f"time.sleep(0.1)\nos.write(1, {NAMED!r})\nopen({marker!r}, 'w')\n"
        client = self.client(self.program(code + LINGER))
        self.assertEqual(client.get_hfs_volume_name(0), b"A")
        while not os.path.exists(marker):
            time.sleep(0.01)
        self.assert_fails(client, ProtocolError, "answered what it was not asked")


class Refusals(FailureTest):
    def test_a_result_that_is_an_error_has_no_path(self) -> None:
        result = (-43).to_bytes(2, sys.byteorder, signed=True)
        for answered, path in ((bytes(2), "/x"), (result, None)):
            answer = answered + (3).to_bytes(2, sys.byteorder) + b"/x\0MWLT"
            client = self.client(self.program(ANSWER.format(answer)))
            self.assertEqual(client.make_file_ref_from_path("volume:x"), path)

    def test_a_size_that_is_always_enough_takes_one_request(self) -> None:
        answer = (7).to_bytes(2, sys.byteorder) + b"volume:".ljust(768, b"\0") + b"MWLT"
        client = self.client(self.program(ANSWER.format(answer)))
        self.assertEqual(client.make_full_path("/", 768), b"volume:")


SOURCES = os.path.dirname(tallowmere.__file__)


class Stop(BaseException):
    """What an interrupt at some line of the client raises."""


def stopped_at_line(number: int, act: Any) -> bool:
    """Calls act and raises Stop in front of the line of the client that is executed as that one; False where it
    has fewer."""
    executed = 0

    def trace(frame: types.FrameType, event: str, _: Any) -> Any:
        nonlocal executed
        if not frame.f_code.co_filename.startswith(SOURCES):
            return None
        executed += event == "line"
        if event == "line" and executed == number:
            sys.settrace(None)
            raise Stop
        return trace

    before = sys.gettrace()
    sys.settrace(trace)
    try:
        act()
    except Stop:
        return True
    finally:
        sys.settrace(before)
    return False


class Lives(FailureTest):
    def test_the_service_starts_with_the_first_request_and_ends_with_the_block(self) -> None:
        with Client(SERVICE) as client:
            self.assertEqual(children(), [])
            self.assert_answers(client)
            self.assertEqual(len(children()), 1)
        self.assertEqual(children(), [])
        self.assert_answers(client)
        client.close()
        client.close()

    def test_a_forgotten_client_leaves_nothing_behind(self) -> None:
        before = descriptors()
        client = Client(SERVICE)
        self.assert_answers(client)
        del client
        gc.collect()
        self.assertEqual(children(), [])
        self.assertEqual(descriptors(), before)

    def test_the_service_has_the_three_descriptors_and_its_parents_id(self) -> None:
        inheritable = os.open("/dev/null", os.O_RDONLY)
        self.addCleanup(os.close, inheritable)
        os.set_inheritable(inheritable, True)
        client = self.client(self.program(ANSWER.format(NAMED) + "os.read(0, 1)\n"))
        self.assertEqual(client.get_hfs_volume_name(0), b"A")
        [child] = children()
        self.assertEqual(sorted(os.listdir(f"/proc/{child}/fd")), ["0", "1", "2"])
        with open(f"/proc/{child}/cmdline") as arguments:
            self.assertEqual(arguments.read().split("\0")[-2], str(os.getpid()))

    def test_an_interrupted_request_does_not_disturb_the_next(self) -> None:
        def interrupt(*_: object) -> None:
            raise KeyboardInterrupt

        client = self.client()
        self.assert_answers(client)
        kill_child(signal.SIGSTOP)
        self.addCleanup(signal.signal, signal.SIGALRM, signal.signal(signal.SIGALRM, interrupt))
        signal.setitimer(signal.ITIMER_REAL, 0.2)
        with self.assertRaises(KeyboardInterrupt):
            client.get_hfs_name("/" + "a" * 60000)
        self.assertEqual(children(), [])
        self.assertIsNone(client.get_vol_refnum_by_hfs_name("no such volume"))

    def test_an_interrupt_at_any_line_does_not_shift_the_answers(self) -> None:
        client = self.client(deadline=10)
        mask = signal.pthread_sigmask(signal.SIG_BLOCK, ())  # may stay as it is set for a write
        self.addCleanup(signal.pthread_sigmask, signal.SIG_SETMASK, mask)

        def ask(first: int) -> list[Any]:
            names = [f"{number}" for number in range(first, first + 3)]
            return list(client.batch(request.add_hfs_name("/nowhere", name) for name in names))

        for line in range(1, 10000):
            self.assert_answers(client)
            if not stopped_at_line(line, lambda: ask(0)):
                break
            self.assertEqual(ask(3), ["/nowhere/3", "/nowhere/4", "/nowhere/5"], line)
        self.assertGreater(line, 100)


class Hosts(FolderTest):
    def test_a_default_sigpipe_does_not_end_the_host(self) -> None:
        stand_in = self.program("os.close(0)\ntime.sleep(0.5)\nsys.exit(3)")
        said = self.run_host(
            """
            signal.signal(signal.SIGPIPE, signal.SIG_DFL)
            with Client(sys.argv[1]) as client:
                [first, *_] = client.batch([request.get_hfs_name("/" + "a" * 60000)] * 2)  # more than a pipe takes
            print(first, signal.pthread_sigmask(signal.SIG_BLOCK, ()), signal.sigpending())
            """,
            stand_in,
        )
        self.assertEqual(said, "The service ended with status 3 before it had answered. set() set()\n")

    def test_a_host_that_blocks_sigpipe_keeps_its_own_and_gets_no_other(self) -> None:
        stand_in = self.program("os.close(0)\ntime.sleep(0.5)\nsys.exit(3)")
        said = self.run_host(
            """
            signal.signal(signal.SIGPIPE, signal.SIG_DFL)
            signal.pthread_sigmask(signal.SIG_BLOCK, {signal.SIGPIPE})
            for own in (False, True):
                if own: signal.raise_signal(signal.SIGPIPE)
                with Client(sys.argv[1]) as client:
                    list(client.batch([request.get_hfs_name("/" + "a" * 60000)] * 2))  # more than a pipe takes
                print(own, signal.SIGPIPE in signal.sigpending(), flush=True)
                if own: signal.sigtimedwait({signal.SIGPIPE}, 0)
            signal.pthread_sigmask(signal.SIG_UNBLOCK, {signal.SIGPIPE})
            """,
            stand_in,
        )
        self.assertEqual(said, "False False\nTrue True\n")

    def test_a_host_without_standard_descriptors(self) -> None:
        for closed in ("0", "1", "01", "12", "012"):
            with self.subTest(closed):
                said = os.path.join(self.folder, "said")
                self.run_host(
                    """
                    for each in sys.argv[1]: os.close(int(each))
                    client = Client(SERVICE)
                    names = [client.get_hfs_volume_name(0) for _ in range(2)]
                    try: os.write(1, b"junk")
                    except OSError: pass
                    names += [client.get_hfs_volume_name(0)]
                    client.close()
                    with open(sys.argv[2], "w") as file: print(len(set(names)), None in names, file=file)
                    os._exit(0)
                    """,
                    closed, said,
                )  # fmt: skip
                with open(said) as file:
                    self.assertEqual(file.read(), "1 False\n")

    def test_a_forked_host_has_a_service_of_its_own(self) -> None:
        said = self.run_host(
            """
            client = Client(SERVICE)
            name = client.get_hfs_volume_name(0)
            child = os.fork()
            same = [client.get_hfs_volume_name(0) == name for _ in range(50)]
            if child == 0:
                client.close()
                os._exit(0 if all(same) else 1)
            print(all(same), os.waitpid(child, 0)[1], client.get_hfs_volume_name(0) == name)
            """
        )
        self.assertEqual(said, "True 0 True\n")

    def test_a_host_that_ends_without_closing_ends_its_service(self) -> None:
        said = self.run_host(
            """
            client = Client(SERVICE)
            client.get_hfs_volume_name(0)
            print(client._process.id)
            """
        )
        self.assertFalse(os.path.exists(f"/proc/{int(said)}"))

    def test_a_host_that_is_killed_takes_its_services_with_it(self) -> None:
        code = f"""if True:
            import subprocess, time
            from tallowmere import Client
            clients = [Client({SERVICE!r}) for _ in range(2)]
            for client in clients: client.get_hfs_volume_name(0)
            # A child that outlives the host and has all that a child inherits.
            child = subprocess.Popen(["sleep", "60"], stdout=subprocess.DEVNULL, close_fds=False)
            print(child.pid, *[client._process.id for client in clients], flush=True)
            time.sleep(60)
            """
        environment = {**os.environ, "PYTHONPATH": str(PACKAGE)}
        with subprocess.Popen([sys.executable, "-c", code], env=environment, stdout=subprocess.PIPE, text=True) as host:
            assert host.stdout
            child, *services = [int(word) for word in host.stdout.readline().split()]
            self.addCleanup(os.kill, child, signal.SIGKILL)
            host.kill()
        self.assertEqual(len(services), 2)
        for service in services:
            deadline = time.monotonic() + 10
            while not has_ended(service) and time.monotonic() < deadline:
                time.sleep(0.001)
            self.assertTrue(has_ended(service))

    def test_the_service_is_found_beside_the_script_then_on_path(self) -> None:
        script = os.path.join(self.folder, "script.py")
        with open(script, "w") as file:
            file.write("import tallowmere\ntry: print(tallowmere.Client().get_hfs_volume_name(0))\n"
                       "except tallowmere.ServiceError as error: print(error)\n")  # fmt: skip
        places = [os.path.join(self.folder, name) for name in ("tallowmere", "bin/tallowmere")]
        os.mkdir(os.path.join(self.folder, "bin"))
        path = {"PATH": os.path.join(self.folder, "bin")}
        said = self.run_python([script], environment=path)
        self.assertEqual(said, "There is no service tallowmere beside the program, nor on PATH.\n")
        for letter, place in (("P", places[1]), ("B", places[0])):
            os.rename(self.program(ANSWER.format(NAMED.replace(b"A", letter.encode()))), place)
            self.assertEqual(self.run_python([script], environment=path), f"b'{letter}'\n")
        link = os.path.join(self.folder, "bin", "link.py")
        os.symlink(script, link)
        self.assertEqual(self.run_python([link], environment=path), "b'B'\n")

    def test_the_service_is_found_beside_the_interpreter(self) -> None:
        os.mkdir(os.path.join(self.folder, "bin"))
        interpreter = os.path.join(self.folder, "bin", "python3")
        os.symlink(sys.executable, interpreter)
        os.rename(self.program(ANSWER.format(NAMED)), os.path.join(self.folder, "bin", "tallowmere"))
        code = "import tallowmere; print(tallowmere.Client().get_hfs_volume_name(0))"
        self.assertEqual(self.run_python(["-c", code], {"PATH": ""}, interpreter), "b'A'\n")
