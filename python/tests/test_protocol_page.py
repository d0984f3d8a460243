"""The examples of docs/protocol.md: each request as the package writes it, each answer as it reads it."""

from __future__ import annotations

import sys
import unittest

from tallowmere import ExportSettings, FSSpec, request
from tallowmere._wire import Incomplete, Malformed, Reader

from .support import PROJECT


def read_examples() -> dict[int, tuple[bytes, bytes]]:
    examples: list[dict[str, bytes]] = []
    label = ""
    for line in (PROJECT / "docs/protocol.md").read_text().splitlines():
        if not line.startswith("    "):
            label = ""
            continue
        if line[4:].startswith("request"):
            examples.append({})
        label = line[4:14].strip() or label
        if label in ("request", "response"):
            examples[-1][label] = examples[-1].get(label, b"") + bytes.fromhex(line[14:])
    return {each["request"][0]: (each["request"], each.get("response", b"")) for each in examples}


EXPECTED = {
    1: (request.full_path_and_length("x", 8, True), (1, b":")),
    2: (request.make_file_ref_from_path("no such volume:f"), None),
    3: (request.get_vol_refnum_by_hfs_name("no such volume"), None),
    4: (request.get_hfs_volume_name(32767), None),
    5: (request.get_hfs_name("/missing"), None),
    6: (request.add_hfs_name("/", "a/b"), "//a:b"),
    7: (request.get_fsspec("/missing/file"), None),
    8: (request.set_file_ref_from_fsspec_data(FSSpec(0, 2, b"new?")), "//new?"),
    9: (request.set_file_ref_from_fsspec(FSSpec(0, 2, b"new?")), "//new?"),
    10: (request.get_aiff_export_settings(44100, 16, 2, "twos"), ExportSettings(0, bytes(10))),
}


@unittest.skipUnless(sys.byteorder == "little", "the page shows little-endian machines")
class Examples(unittest.TestCase):
    examples = read_examples()

    def test_there_is_one_of_every_code(self) -> None:
        self.assertEqual(list(self.examples), list(range(11)))
        self.assertEqual(set(self.examples), {0, *EXPECTED})

    def test_requests_are_written_as_shown(self) -> None:
        for code, (asked, _) in EXPECTED.items():
            with self.subTest(code=code):
                self.assertEqual(asked.payload, self.examples[code][0])

    def test_answers_are_read_as_shown(self) -> None:
        for code, (asked, expected) in EXPECTED.items():
            with self.subTest(code=code):
                reader = Reader(b"before" + self.examples[code][1], 6)
                answer = asked.decode(reader)
                reader.trailer()
                self.assertEqual(reader.offset, 6 + len(self.examples[code][1]))
                if code == 10:
                    self.assertEqual((answer.result, answer.data[:16]), (0, bytes(15) + b"\x84"))
                    self.assertEqual(len(answer.data), 144)
                else:
                    self.assertEqual(answer, expected)

    def test_an_answer_that_is_cut_anywhere_is_not_whole(self) -> None:
        for code, (asked, _) in EXPECTED.items():
            for length in range(len(self.examples[code][1])):
                with self.subTest(code=code, length=length), self.assertRaises(Incomplete):
                    reader = Reader(self.examples[code][1][:length])
                    asked.decode(reader)
                    reader.trailer()

    def test_an_answer_without_its_trailer_is_malformed(self) -> None:
        for code, (asked, _) in EXPECTED.items():
            with self.subTest(code=code), self.assertRaises(Malformed):
                reader = Reader(self.examples[code][1][:-1] + b"\0")
                asked.decode(reader)
                reader.trailer()


if __name__ == "__main__":
    unittest.main()
