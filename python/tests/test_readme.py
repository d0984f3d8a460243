"""What README.md shows is what comes out, and its programs do what it says."""

from __future__ import annotations

import doctest
import os
import re
import signal
import subprocess
import sys
import time

import tallowmere

from .support import PACKAGE, SERVICE, FolderTest

ENVIRONMENT = {
    "PATH": f"{os.path.dirname(SERVICE)}:{os.environ['PATH']}", "PYTHONPATH": str(PACKAGE), "PYTHONIOENCODING": "utf-8",
}  # fmt: skip


class ExampleTest(FolderTest):
    def setUp(self) -> None:
        super().setUp()
        with tallowmere.Client(SERVICE) as client:
            self.hfs_folder = client.hfs_path_of(self.folder).text
            self.volume = client.hfs_path_of("/").text

    def make(self, name: str) -> str:
        path = os.path.join(self.folder, name)
        open(path, "w").close()
        return path

    def start(self, example: str, *arguments: str, **options: object) -> subprocess.Popen[str]:
        process = subprocess.Popen(
            [sys.executable, "-W", "error", str(PACKAGE / "examples" / example), *arguments],
            env={**os.environ, **ENVIRONMENT}, cwd=self.folder, text=True, encoding="utf-8",
            stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=subprocess.PIPE,
        )  # fmt: skip
        self.addCleanup(process.communicate)
        self.addCleanup(process.kill)
        return process

    def say(self, example: str, *arguments: str, given: str = "") -> tuple[str, str]:
        process = self.start(example, *arguments)
        said = process.communicate(given, timeout=60)
        self.assertEqual(process.returncode, 0, said)
        return said


class Readme(ExampleTest):
    def as_here(self, text: str) -> str:
        """The page's text with this machine's folder and volume for the ones shown."""
        text = text.replace("Root:home:ann:", self.hfs_folder).replace("/home/ann", self.folder)
        text = text.replace("Root:", self.volume).replace("-27 Root /", f"-27 {self.volume[:-1]} /")
        return text

    def test_its_sessions_are_real(self) -> None:
        self.make("Mix 1: final.aif")
        page = (PACKAGE / "README.md").read_text()
        examples = doctest.DocTestParser().get_examples(self.as_here(page))
        self.assertGreater(len(examples), 25)
        program = (
            "import doctest, sys\n"
            "class Checker(doctest.OutputChecker):\n"
            "    def check_output(self, want, got, flags):\n"
            "        import re\n"
            "        plain = lambda text: re.sub(r'-?\\b[0-9]{2,}\\b', 'N', text)\n"
            "        return super().check_output(plain(want), plain(got), flags)\n"
            "test = doctest.DocTestParser().get_doctest(sys.stdin.read(), {}, 'README.md', None, 0)\n"
            "runner = doctest.DocTestRunner(Checker())\n"
            "runner.run(test)\n"
            "sys.exit(runner.failures)\n"
        )
        host = subprocess.run(
            [sys.executable, "-W", "error", "-c", program], input=self.as_here(page), cwd=self.folder,
            env={**os.environ, **ENVIRONMENT}, text=True, encoding="utf-8", capture_output=True, timeout=120,
        )  # fmt: skip
        self.assertEqual((host.returncode, host.stdout, host.stderr), (0, "", ""))

    def test_it_shows_the_protocols_outcomes(self) -> None:
        page = (PACKAGE / "README.md").read_text()
        for outcome in tallowmere.Outcome:
            self.assertIn(f"`{outcome.value}`", page)

    def test_it_names_every_example(self) -> None:
        shown = re.findall(r"\(examples/(\w+\.py)\)", (PACKAGE / "README.md").read_text())
        self.assertEqual(sorted(shown), sorted(path.name for path in PACKAGE.glob("examples/*.py")))


class Examples(ExampleTest):
    def test_identify_prints_records_and_full_paths_in_ten_lines(self) -> None:
        self.assertLessEqual(len((PACKAGE / "examples/identify.py").read_text().splitlines()), 10)
        path = self.make("a:é")
        said, _ = self.say("identify.py", "a:é", "new", "/nowhere/file", self.folder)
        with tallowmere.Client(SERVICE) as client:
            record, new, folder = (client.record_of(each).text for each in (path, self.folder + "/new", self.folder))
        expected = [
            "a:é", "    found", f"    {record}", f"    {self.hfs_folder}a/é", "new", "    new", f"    {new}",
            f"    {self.hfs_folder}new", "/nowhere/file", "    nothing", '    There is no folder "/nowhere".',
            self.folder, "    found", f"    {folder}", f"    {self.hfs_folder}",
        ]  # fmt: skip
        self.assertEqual(said.splitlines(), expected)

    def test_many_prints_a_line_for_each_path_and_counts_them(self) -> None:
        paths = [self.make(f"{number}é") for number in range(2000)]
        asked = [each for path in paths for each in (path, path + "/below", path + ".new", "日本", "/proc/x")]
        said, told = self.say("many.py", given="\0".join(asked))
        lines = said.split("\n")
        self.assertEqual(len(lines), len(asked) + 1)
        with tallowmere.Client(SERVICE) as client:
            self.assertEqual(lines[0:20:5], [client.record_of(path).text for path in paths[:4]])
        self.assertEqual({*lines[1::5], *lines[3::5], *lines[4::5]}, {""})
        self.assertEqual(
            told.splitlines()[-1], "2000 found, 2000 invalid, 2000 new, 2000 not-a-volume, 2000 nothing"
        )  # fmt: skip

    def test_many_answers_what_is_there_before_the_input_ends(self) -> None:
        process = self.start("many.py")
        assert process.stdin and process.stdout
        for _ in range(300):
            process.stdin.write("/etc/passwd\0")
        process.stdin.flush()
        self.assertTrue(process.stdout.readline().endswith(":passwd\n"))

    def test_asynchronous_prints_paths_and_counts_a_folder(self) -> None:
        for name in ("a", "b", "n" * 100):
            self.make(name)
        said, _ = self.say("asynchronous.py", ".", "a", "/nowhere/x")
        self.assertEqual(
            said.splitlines(),
            [self.hfs_folder, self.hfs_folder + "a", 'There is no folder "/nowhere".', "3 items in ."],
        )

    def test_watch_prints_what_is_there_and_what_comes(self) -> None:
        first = self.make("first")
        process = self.start("watch.py", ".", "0.05")
        assert process.stdout
        with tallowmere.Client(SERVICE) as client:
            self.assertEqual(process.stdout.readline(), client.record_of(first).text + "\n")
            for number in range(3):
                path = self.make(f"{number}é")
                self.assertEqual(process.stdout.readline(), client.record_of(path).text + "\n")
            os.remove(first)
            time.sleep(0.5)
            self.make("first")
            self.assertEqual(process.stdout.readline(), client.record_of(first).text + "\n")
        process.send_signal(signal.SIGINT)
        self.assertEqual((process.wait(10), process.stdout.read()), (0, ""))
