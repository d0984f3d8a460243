"""What is shipped: its language, its version, its example."""

from __future__ import annotations

import ast
import os
import re
import unittest

import tallowmere

from .support import PACKAGE, PROJECT, SERVICE, FolderTest


class Package(unittest.TestCase):
    def test_it_is_written_in_python_3_9(self) -> None:
        sources = [*PACKAGE.glob("tallowmere/*.py"), *PACKAGE.glob("examples/*.py")]
        self.assertGreaterEqual(len(sources), 5)
        for source in sources:
            with self.subTest(source.name):
                ast.parse(source.read_text(), feature_version=(3, 9))

    def test_its_version_is_the_projects(self) -> None:
        [project] = re.findall(r"^project\(tallowmere VERSION (\S+)", (PROJECT / "CMakeLists.txt").read_text(), re.M)
        self.assertEqual(tallowmere.__version__, project)
        self.assertIn('version = { attr = "tallowmere.__version__" }\n', (PACKAGE / "pyproject.toml").read_text())

    def test_it_has_what_it_says(self) -> None:
        for name in tallowmere.__all__:
            self.assertTrue(hasattr(tallowmere, name), name)

    def test_every_request_is_a_method_of_the_same_name(self) -> None:
        requests = [name for name, value in vars(tallowmere.request).items() if re.match("(make|get|set|add)_", name)]
        self.assertEqual(len(requests), 10)
        for name in requests:
            self.assertTrue(callable(getattr(tallowmere.Client, name)), name)


class Example(FolderTest):
    def test_identify_prints_records_and_full_paths_in_ten_lines(self) -> None:
        example = PACKAGE / "examples/identify.py"
        self.assertLessEqual(len(example.read_text().splitlines()), 10)
        path = os.path.join(self.folder, "a:é")
        open(path, "w").close()
        said = self.run_python(
            [str(example), "a:é", "/nowhere/file", self.folder],
            environment={"PATH": os.path.dirname(SERVICE), "PYTHONIOENCODING": "utf-8"},
        )
        with tallowmere.Client(SERVICE) as client:
            folder = client.make_full_path(self.folder).decode("mac_roman")
            expected = [
                path, f"    {client.get_fsspec(path)}", f"    {folder}a/é", "/nowhere/file", "    None",
                "    no HFS path", self.folder, f"    {client.get_fsspec(self.folder)}", f"    {folder}",
            ]  # fmt: skip
        self.assertEqual(said.splitlines(), expected)
