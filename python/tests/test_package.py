"""What is shipped: its language, its types, its version."""

from __future__ import annotations

import ast
import os
import re
import shutil
import subprocess
import unittest

import tallowmere

from .support import PACKAGE, PROJECT


class Package(unittest.TestCase):
    def test_it_is_written_in_python_3_9(self) -> None:
        sources = [*PACKAGE.glob("tallowmere/*.py"), *PACKAGE.glob("examples/*.py")]
        self.assertGreaterEqual(len(sources), 5)
        for source in sources:
            with self.subTest(source.name):
                ast.parse(source.read_text(), feature_version=(3, 9))

    def test_its_types_are_right_by_mypy(self) -> None:
        mypy = shutil.which("mypy")
        if mypy is None:
            self.skipTest("there is no mypy")
        sources = ["tallowmere", "tests/typed.py", *map(str, PACKAGE.glob("examples/*.py"))]
        checked = subprocess.run(
            [mypy, "--strict", "--cache-dir", os.devnull, *sources], cwd=PACKAGE, capture_output=True, text=True
        )
        self.assertEqual((checked.returncode, checked.stderr), (0, ""), checked.stdout)

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
