"""Every method, asked of the real service about real files."""

from __future__ import annotations

import os
import sys
import unicodedata
from pathlib import Path

from tallowmere import Client, FSSpec, request

from .support import SERVICE, FolderTest, children

ODD_NAMES = [
    b"plain.txt", b"a:b", b"\xff\xfe.aif", "Café".encode(), unicodedata.normalize("NFD", "Ångström").encode(),
    "日本.wav".encode(), b"a" * 63, b"b" * 64, b"c" * 255, b" #1", b"~", b"new\nline",
]  # fmt: skip


class ServiceTest(FolderTest):
    def setUp(self) -> None:
        super().setUp()
        self.client = Client(SERVICE)
        self.addCleanup(self.client.close)

    def make(self, name: str) -> str:
        path = os.path.join(self.folder, name)
        Path(path).touch()
        return path


class Records(ServiceTest):
    def test_every_file_comes_back_whatever_its_name(self) -> None:
        for name in ODD_NAMES:
            with self.subTest(name):
                path = os.path.join(os.fsencode(self.folder), name)
                os.close(os.open(path, os.O_CREAT | os.O_WRONLY))
                spec = self.client.get_fsspec(path)
                self.assertIsNotNone(spec)
                self.assertEqual(self.client.set_file_ref_from_fsspec(spec), os.fsdecode(path))
                self.assertEqual(self.client.set_file_ref_from_fsspec_data(spec), os.fsdecode(path))
                self.assertEqual(self.client.get_hfs_name(path), spec.name)
                self.assertEqual(self.client.add_hfs_name(self.folder, spec.name), os.fsdecode(path))

    def test_a_record_tells_volume_folder_and_name(self) -> None:
        spec = self.client.get_fsspec(self.make("a:é"))
        self.assertEqual(spec.name, b"a/\x8e")
        self.assertEqual(spec.name_text, "a/é")
        self.assertEqual(spec.par_id & 0xFFFFFFFF, os.stat(self.folder).st_ino)
        self.assertIsNotNone(self.client.get_hfs_volume_name(spec.v_ref_num))

    def test_paths_are_text_bytes_or_path_objects(self) -> None:
        path = self.make("f")
        specs = [self.client.get_fsspec(each) for each in (path, os.fsencode(path), Path(path))]
        self.assertEqual(specs, [specs[0]] * 3)
        self.assertEqual(specs[0].name, b"f")

    def test_a_new_item_has_a_record_and_one_without_a_folder_has_none(self) -> None:
        path = os.path.join(self.folder, "new")
        self.assertEqual(self.client.set_file_ref_from_fsspec(self.client.get_fsspec(path)), path)
        self.assertIsNone(self.client.get_fsspec(os.path.join(path, "inside")))
        self.assertIsNone(self.client.get_fsspec("relative"))

    def test_a_record_that_leads_nowhere_has_no_path(self) -> None:
        spec = FSSpec(32767, -1, b"lost")
        self.assertIsNone(self.client.set_file_ref_from_fsspec(spec))
        self.assertIsNone(self.client.set_file_ref_from_fsspec_data(spec))

    def test_the_other_volumes_are_searched_when_asked(self) -> None:
        found = self.client.get_fsspec(self.make("here"))
        elsewhere = FSSpec(32767, found.par_id, found.name)
        self.assertIsNone(self.client.set_file_ref_from_fsspec(elsewhere))
        self.assertEqual(
            self.client.set_file_ref_from_fsspec(elsewhere, search_other_volumes=True),
            os.path.join(self.folder, "here"),
        )


class FullPaths(ServiceTest):
    def test_a_folder_comes_back_from_its_full_path(self) -> None:
        self.assertEqual(self.client.make_file_ref_from_path(self.client.make_full_path(self.folder)), self.folder)

    def test_a_file_comes_back_from_the_path_of_its_folder_and_its_name(self) -> None:
        path = self.make("one: two")
        self.assertEqual(self.client.make_file_ref_from_path(self.client.make_full_path(path) + b"one/ two"), path)

    def test_a_folder_comes_back_without_the_last_colon(self) -> None:
        full = self.client.make_full_path(self.folder)
        self.assertEqual(self.client.make_file_ref_from_path(full[:-1]), self.folder)

    def test_a_path_may_be_text(self) -> None:
        path = self.make("été")
        full = self.client.make_full_path(path).decode("mac_roman") + "été"
        self.assertEqual(self.client.make_file_ref_from_path(full), path)

    def test_a_path_without_a_volume_begins_at_the_current_folder(self) -> None:
        self.addCleanup(os.chdir, os.getcwd())
        path, outer = self.make("f"), self.make("outer")
        os.mkdir(os.path.join(self.folder, "inner"))
        os.chdir(self.folder)
        self.assertEqual(self.client.make_file_ref_from_path("f"), path)
        self.assertEqual(self.client.make_file_ref_from_path(":f"), path)
        os.chdir("inner")
        self.client.close()
        self.assertEqual(self.client.make_file_ref_from_path("::outer"), outer)

    def test_what_is_missing_has_no_path(self) -> None:
        full = self.client.make_full_path(self.folder)
        for missing in (b"no such volume:f", full + b"missing", full + b"missing:f"):
            self.assertIsNone(self.client.make_file_ref_from_path(missing))

    def test_the_volume_alone(self) -> None:
        volume = self.client.get_hfs_volume_name(self.client.get_fsspec(self.folder).v_ref_num)
        self.assertEqual(self.client.make_full_path(self.folder, keep_folders=False), volume)

    def test_outer_folders_are_left_out_where_the_path_does_not_fit(self) -> None:
        deep = os.path.join(self.folder, "outermost" * 3, "inner")
        os.makedirs(deep)
        whole = self.client.make_full_path(deep)
        self.assertEqual(self.client.make_full_path(deep, len(whole) + 1), whole)
        shortened = self.client.make_full_path(deep, len(whole))
        self.assertLess(len(shortened), len(whole))
        self.assertIn(b"...", shortened)
        self.assertTrue(shortened.endswith(b":inner:"))

    def test_every_size_is_answered_or_refused(self) -> None:
        volume = self.client.make_full_path(self.folder, keep_folders=False)
        whole = self.client.make_full_path(self.folder)
        for keep in (False, True):
            for size in range(1, len(whole) + 3):
                if size <= len(whole) and len(volume) > size - 6:
                    with self.assertRaisesRegex(ValueError, f"does not fit in {size} bytes"):
                        self.client.make_full_path(self.folder, size, keep)
                else:
                    self.assertLess(len(self.client.make_full_path(self.folder, size, keep)), size)

    def test_what_is_on_no_volume_has_a_colon_that_needs_two_bytes(self) -> None:
        self.assertEqual(self.client.make_full_path("relative", 2), b":")
        with self.assertRaises(ValueError):
            self.client.make_full_path("relative", 1)

    def test_sizes_beyond_the_protocol_are_refused(self) -> None:
        for size in (0, -1, 1025):
            with self.subTest(size), self.assertRaises(ValueError):
                self.client.make_full_path("/", size)

    def test_a_request_takes_only_sizes_that_are_always_enough(self) -> None:
        for size in (767, 1025):
            with self.subTest(size), self.assertRaises(ValueError):
                request.make_full_path("/", size)
        for size in (768, 1024):
            self.assertEqual(self.client.ask(request.make_full_path("relative", size)), b":")
        volume = self.client.ask(request.make_full_path(self.folder, keep_folders=False))
        self.assertEqual(volume, self.client.make_full_path(self.folder, keep_folders=False))


class Volumes(ServiceTest):
    def test_a_volume_by_name_and_number(self) -> None:
        name = self.client.get_hfs_volume_name(0)
        number = self.client.get_vol_refnum_by_hfs_name(name)
        self.assertLess(number, 0)
        self.assertEqual(self.client.get_hfs_volume_name(number), name)
        self.assertEqual(self.client.get_vol_refnum_by_hfs_name(name.decode("mac_roman")), number)

    def test_what_is_no_volume(self) -> None:
        self.assertIsNone(self.client.get_hfs_volume_name(1))
        self.assertIsNone(self.client.get_vol_refnum_by_hfs_name("no such volume"))

    def test_a_number_that_has_more_than_16_bits_is_refused(self) -> None:
        for number in (-0x8000, 0x7FFF):
            self.assertIsNone(self.client.get_hfs_volume_name(number))
        for number in (-0x8001, 0x8000):
            with self.assertRaises(ValueError):
                self.client.get_hfs_volume_name(number)


class Names(ServiceTest):
    def test_a_missing_item_has_no_name(self) -> None:
        self.assertIsNone(self.client.get_hfs_name(os.path.join(self.folder, "missing")))

    def test_a_new_item_is_called_as_its_hfs_name_says(self) -> None:
        for name in (b"caf\x8e / \xdb", "café / €"):
            self.assertEqual(self.client.add_hfs_name(self.folder, name), os.path.join(self.folder, "café : €"))


class Limits(ServiceTest):
    """What can just be asked is sent, and what is one byte longer is not."""

    def assert_limit(self, make: object, most: int, otherwise: object = None) -> None:
        asked = make(b"a" * most)
        self.assertIsNotNone(asked.payload)
        self.client.ask(asked)
        for beyond in (b"a" * (most + 1), b"a\0b"):
            asked = make(beyond)
            self.assertIsNone(asked.payload)
            self.assertEqual(self.client.ask(asked), otherwise)

    def test_paths_have_65534_bytes(self) -> None:
        for make in (request.get_hfs_name, request.get_fsspec, lambda path: request.add_hfs_name(path, "a")):
            self.assert_limit(make, 65534)
        self.assert_limit(request.make_full_path, 65534, b":")

    def test_names_have_255_bytes(self) -> None:
        self.assert_limit(request.get_vol_refnum_by_hfs_name, 255)
        self.assert_limit(lambda name: request.add_hfs_name("/", name), 255)

    def test_full_paths_have_255_bytes_and_relative_ones_get_a_colon(self) -> None:
        self.assert_limit(lambda name: request.make_file_ref_from_path(b":" + name), 254)
        self.assert_limit(request.make_file_ref_from_path, 254)

    def test_a_record_with_a_nul_in_its_name_is_not_asked(self) -> None:
        spec = FSSpec(0, 2, b"a\0b")
        self.assertIsNone(request.set_file_ref_from_fsspec(spec).payload)
        self.assertIsNone(request.set_file_ref_from_fsspec_data(spec).payload)
        self.assertIsNone(self.client.set_file_ref_from_fsspec(spec))

    def test_a_text_that_cannot_be_encoded_is_not_asked(self) -> None:
        self.assertIsNone(self.client.get_fsspec("/\ud800"))
        self.assertIsNone(self.client.add_hfs_name("/", "日本"))


class ExportSettings(ServiceTest):
    def test_settings_tell_the_sound(self) -> None:
        result, data = self.client.get_aiff_export_settings(22050.5, 24, 6, b"in24")
        self.assertEqual(result, 0)
        for value in (b"in24", (22050 * 65536 + 32768).to_bytes(4, "big"), b"\x00\x18", b"\x00\x06"):
            self.assertIn(value, data)

    def test_a_rate_is_rounded(self) -> None:
        payload = request.get_aiff_export_settings(0.1, 16, 2, "twos").payload
        self.assertEqual(payload[2:6], round(6553.6).to_bytes(4, sys.byteorder))

    def test_a_refusal_tells_its_reason(self) -> None:
        self.assertEqual(self.client.get_aiff_export_settings(44100, 16, 2, "mp3 "), (-206, b""))
        self.assertEqual(self.client.get_aiff_export_settings(44100, 16, 0, "twos"), (-50, b""))

    def test_the_greatest_values_are_asked(self) -> None:
        result, data = self.client.get_aiff_export_settings(65535 + 65535 / 65536, 65535, 255, "NONE")
        self.assertEqual(result, 0)
        self.assertIn(b"\xff\xff\xff\xff", data)

    def test_values_that_do_not_fit_are_refused(self) -> None:
        for values in (
            (65536, 16, 2, "twos"), (-1, 16, 2, "twos"), (float("nan"), 16, 2, "twos"), (44100, 65536, 2, "twos"),
            (44100, -1, 2, "twos"), (44100, 16, 256, "twos"), (44100, 16, -1, "twos"), (44100, 16, 2, "two"),
            (44100, 16, 2, b"twoss"),
        ):  # fmt: skip
            with self.subTest(values), self.assertRaises(ValueError):
                self.client.get_aiff_export_settings(*values)


class Types(ServiceTest):
    """What is of a wrong type is a TypeError at once, also in a batch, and nothing is sent."""

    def test_of_requests_and_conversions(self) -> None:
        client, spec = self.client, FSSpec(0, 2, b"a")
        for ask, *arguments in (
            (client.make_full_path, 5), (client.make_full_path, "/", 1000.0), (client.make_full_path, "/", 1000, 1),
            (client.make_file_ref_from_path, None), (client.get_vol_refnum_by_hfs_name, bytearray(b"a")),
            (client.get_hfs_volume_name, -1.0), (client.get_hfs_volume_name, "1"), (client.get_hfs_name, None),
            (client.add_hfs_name, "/", 5), (client.add_hfs_name, 5, "a"), (client.get_fsspec, ["/"]),
            (client.set_file_ref_from_fsspec, "0:2:a"), (client.set_file_ref_from_fsspec, (0, 2, b"a")),
            (client.set_file_ref_from_fsspec, spec, 1), (client.set_file_ref_from_fsspec_data, None),
            (client.get_aiff_export_settings, "44100", 16, 2, "twos"),
            (client.get_aiff_export_settings, 44100, 16.5, 2, "twos"),
            (client.get_aiff_export_settings, 44100, 16, 2.0, "twos"),
            (client.get_aiff_export_settings, 44100, 16, 2, 5), (client.record_of, 5), (client.record_of, None),
            (client.path_of, "0:2:a"), (client.hfs_path_of, 5), (client.hfs_name_of, 5),
            (client.path_of_hfs_path, 5), (client.path_in_folder, 5, "a"), (client.path_in_folder, "/", 5),
            (client.ask, "/"), (client.ask, None), (Client, 5), (Client, SERVICE, "10"),
        ):  # fmt: skip
            with self.subTest(ask, arguments=arguments), self.assertRaises(TypeError):
                ask(*arguments)
        self.assertEqual(children(), [])

    def test_of_what_is_in_a_batch(self) -> None:
        batch = self.client.batch([request.get_hfs_volume_name(0), "/"])
        with self.assertRaises(TypeError):
            list(batch)
