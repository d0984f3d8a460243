from __future__ import annotations

import sys
import unicodedata
import unittest

from tallowmere import FSSpec, hfs_name_from_str, hfs_name_to_str
from tallowmere._wire import Incomplete, Malformed, Reader, text


class Names(unittest.TestCase):
    def test_every_byte_is_a_character_and_comes_back(self) -> None:
        name = bytes(range(256))
        self.assertEqual(hfs_name_from_str(hfs_name_to_str(name)), name)

    def test_0xdb_is_the_euro_sign(self) -> None:
        self.assertEqual(hfs_name_to_str(b"\xdb"), "€")

    def test_both_normal_forms_give_the_same_name(self) -> None:
        for form in ("NFC", "NFD"):
            self.assertEqual(hfs_name_from_str(unicodedata.normalize(form, "Café Å")), b"Caf\x8e \x81")

    def test_every_letter_may_be_decomposed(self) -> None:
        letters = "".join(filter(str.isalpha, hfs_name_to_str(bytes(range(256)))))
        self.assertEqual(hfs_name_from_str(unicodedata.normalize("NFD", letters)), letters.encode("mac_roman"))

    def test_what_mac_roman_lacks_is_an_error(self) -> None:
        for text in ("日本", "a\ud800", "e\u0301\u0301", "\u0301"):
            with self.subTest(text), self.assertRaises(UnicodeEncodeError):
                hfs_name_from_str(text)

    def test_what_a_normal_form_makes_another_character_is_an_error(self) -> None:
        for text in (
            "\u2126", "\u212a", "\u212b", "\u037e", "\u0387", "\u1fef", "\u1ffd", "a\u0340", "a\u0341", "=\u0338",
        ):  # fmt: skip
            with self.subTest(text), self.assertRaises(UnicodeEncodeError):
                self.assertEqual(len(unicodedata.normalize("NFC", text).encode("mac_roman")), 1)
                hfs_name_from_str(text)


class Records(unittest.TestCase):
    def test_a_record_has_70_bytes_with_zeros_behind_the_name(self) -> None:
        record = FSSpec(-2, 0x01020304, b"ab").to_bytes()
        self.assertEqual(len(record), 70)
        self.assertEqual(int.from_bytes(record[6:7], "big"), 2)
        self.assertEqual(record[7:], b"ab" + bytes(61))

    def test_a_record_comes_back(self) -> None:
        for spec in (FSSpec(-0x8000, -0x80000000, b""), FSSpec(0x7FFF, 0x7FFFFFFF, b"\xff" * 63)):
            self.assertEqual(FSSpec.from_bytes(spec.to_bytes()), spec)

    def test_bytes_behind_the_name_are_ignored(self) -> None:
        self.assertEqual(FSSpec.from_bytes(FSSpec(1, 2, b"a").to_bytes()[:8] + b"x" * 62), FSSpec(1, 2, b"a"))

    def test_what_is_no_record_is_an_error(self) -> None:
        good = FSSpec(1, 2, b"a").to_bytes()
        for bad in (good[:-1], good + b"\0", good[:6] + b"\x40" + good[7:]):
            with self.assertRaises(ValueError):
                FSSpec.from_bytes(bad)

    def test_numbers_and_names_that_do_not_fit_are_errors(self) -> None:
        for fields in (
            (0x8000, 2, b""), (-0x8001, 2, b""), (0, 0x80000000, b""), (0, -0x80000001, b""), (0, 2, b"a" * 64),
        ):  # fmt: skip
            with self.subTest(fields), self.assertRaises(ValueError):
                FSSpec(*fields)

    def test_other_types_are_type_errors(self) -> None:
        for fields in (
            (0.0, 2, b"a"), (0, 1.5, b"a"), ("0", 2, b"a"), (0, None, b"a"), (0, 2, "a"), (0, 2, [97]),
            (False, 2, b"a"), (0, True, b"a"),
        ):  # fmt: skip
            with self.subTest(fields), self.assertRaises(TypeError):
                FSSpec(*fields)
        for what in ("a" * 70, 70, None):
            with self.subTest(what), self.assertRaises(TypeError):
                FSSpec.from_bytes(what)
        for what in (b"0:2:a", FSSpec(0, 2, b"a"), None):
            with self.subTest(what), self.assertRaises(TypeError):
                FSSpec.from_text(what)
        with self.assertRaises(TypeError):
            FSSpec(0, 2, b"a").to_bytes(1)

    def test_a_record_of_another_machine_has_its_byte_order(self) -> None:
        spec = FSSpec(-2, 0x01020304, b"ab")
        tail = b"\2ab" + bytes(61)
        for order, numbers in (("big", b"\xff\xfe\1\2\3\4"), ("little", b"\xfe\xff\4\3\2\1")):
            self.assertEqual(spec.to_bytes(order), numbers + tail)
            for record in (numbers + tail, bytearray(numbers + tail), memoryview(numbers + tail)):
                self.assertEqual(FSSpec.from_bytes(record, byte_order=order), spec)
        self.assertEqual(spec.to_bytes(), spec.to_bytes(sys.byteorder))
        with self.assertRaises(ValueError):
            FSSpec.from_bytes(bytes(70), byte_order="middle")

    def test_a_record_as_text_comes_back(self) -> None:
        for spec, text in (
            (FSSpec(-27, 19, b"hostname"), "-27:19:hostname"), (FSSpec(0, -4, b""), "0:-4:"),
            (FSSpec(-1, 2, b"\x8e/:\n"), "-1:2:é/:\n"),
        ):  # fmt: skip
            self.assertEqual(spec.text, text)
            self.assertEqual(FSSpec.from_text(text), spec)

    def test_a_text_may_have_an_id_without_a_sign_and_decomposed_accents(self) -> None:
        self.assertEqual(FSSpec.from_text("-1:4294967292:e\u0301"), FSSpec(-1, -4, b"\x8e"))
        self.assertEqual(FSSpec.from_text("-1:2147483648:a"), FSSpec(-1, -2147483648, b"a"))
        self.assertEqual(FSSpec.from_text("-1:2147483647:a"), FSSpec(-1, 2147483647, b"a"))

    def test_what_is_no_text_of_a_record_is_an_error(self) -> None:
        for text in (
            "", "1", "1:2", "a:2:b", "1:b:c", " 1:2:a", "+1:2:a", "1_0:2:a", "١:2:a", "40000:2:a", "1:4294967296:a",
            "1:-2147483649:a", "1:2:日本", "1:2:" + "a" * 64,
        ):  # fmt: skip
            with self.subTest(text), self.assertRaises(ValueError):
                FSSpec.from_text(text)

    def test_the_name_as_text(self) -> None:
        self.assertEqual(FSSpec(1, 2, b"\x8e/").name_text, "é/")


class Fields(unittest.TestCase):
    def test_a_text_is_counted_with_its_nul(self) -> None:
        self.assertEqual(Reader(text(b"abc")).text(), b"abc")
        self.assertEqual(len(text(b"abc")), 6)

    def test_an_empty_text_is_not_a_missing_one(self) -> None:
        self.assertEqual(Reader(text(b"")).text(), b"")
        self.assertIsNone(Reader(bytes(2)).text())

    def test_a_text_ends_at_its_nul(self) -> None:
        for inside in (b"ab", b"a\0b\0", b"a\0\0"):
            with self.subTest(inside), self.assertRaises(Malformed):
                Reader(len(inside).to_bytes(2, sys.byteorder) + inside).text()

    def test_there_are_only_zeros_behind_a_padded_text(self) -> None:
        self.assertEqual(Reader(b"ab\0\0").padded(4), b"ab")
        for field in (b"abcd", b"a\0b\0"):
            with self.subTest(field), self.assertRaises(Malformed):
                Reader(field).padded(4)

    def test_a_flag_is_0_or_1(self) -> None:
        self.assertEqual([Reader(b"\0").flag(), Reader(b"\1").flag()], [False, True])
        with self.assertRaises(Malformed):
            Reader(b"\2").flag()

    def test_an_answered_record_has_a_short_name_and_zeros(self) -> None:
        good = FSSpec(1, 2, b"a").to_bytes()
        self.assertEqual(Reader(good).record(), FSSpec(1, 2, b"a"))
        for bad in (good[:6] + b"\x40" + good[7:], good[:-1] + b"x"):
            with self.subTest(bad), self.assertRaises(Malformed):
                Reader(bad).record()

    def test_settings_have_a_sane_size(self) -> None:
        for size, error in ((65536, Incomplete), (65537, Malformed)):
            with self.subTest(size), self.assertRaises(error):
                Reader(size.to_bytes(4, sys.byteorder)).settings()

    def test_a_trailer_ends_an_answer(self) -> None:
        Reader(b"MWLT").trailer()
        with self.assertRaises(Malformed):
            Reader(b"MWLt").trailer()
        with self.assertRaises(Incomplete):
            Reader(b"MWL").trailer()


if __name__ == "__main__":
    unittest.main()
