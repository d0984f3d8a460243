"""The conversions: every outcome, by real files, through the real service."""

from __future__ import annotations

import errno
import os
import pickle
import pwd
import unicodedata
from pathlib import Path

from tallowmere import (
    Client, ConversionError, Converted, FSSpec, Outcome, ServiceError, Volume, conversion, request,
)  # fmt: skip

from .support import SERVICE, FolderTest, in_own_mounts

ODD_NAMES = [
    "plain.txt", "a:b", "\udcff\udcfe.aif", "Café", unicodedata.normalize("NFD", "Ångström"), "日本.wav", "a" * 63,
    "b" * 64, "c" * 255, " #1", "~", "~root", "new\nline", "-", "...",
]  # fmt: skip


class ConversionTest(FolderTest):
    def setUp(self) -> None:
        super().setUp()
        self.client = Client(SERVICE)
        self.addCleanup(self.client.close)

    def path(self, *names: str) -> str:
        return os.path.join(self.folder, *names)

    def make(self, *names: str) -> str:
        Path(self.path(*names)).touch()
        return self.path(*names)

    def make_folder(self, *names: str) -> str:
        os.makedirs(self.path(*names))
        return self.path(*names)

    def make_link(self, to: str, name: str) -> str:
        os.symlink(to, self.path(name))
        return self.path(name)

    def enter(self, folder: str) -> None:
        self.addCleanup(os.chdir, os.getcwd())
        os.chdir(folder)

    def assert_error(self, outcome: Outcome, at_fault: str, ask: object, *arguments: object, **options: object) -> None:
        with self.assertRaises(ConversionError) as caught:
            ask(*arguments, **options)
        self.assertEqual(caught.exception.outcome, outcome, str(caught.exception))
        self.assertIn(at_fault, str(caught.exception))
        self.assertRegex(str(caught.exception), r"\A[A-Z\"][^\n]*\.\Z")


class ThereAndBack(ConversionTest):
    def test_every_item_comes_back_by_its_record_whatever_its_name(self) -> None:
        for name in ODD_NAMES:
            with self.subTest(name):
                path = self.make(name)
                record = self.client.record_of(path)
                self.assertEqual(record.outcome, Outcome.FOUND)
                self.assertEqual(self.client.path_of(record.value), Converted(path, Outcome.FOUND))

    def test_every_item_comes_back_by_its_hfs_path(self) -> None:
        for name in ODD_NAMES:
            with self.subTest(name):
                path = self.make(name)
                hfs_path = self.client.hfs_path_of(path).value
                self.assertEqual(self.client.path_of_hfs_path(hfs_path), Converted(path, Outcome.FOUND))

    def test_every_item_comes_back_by_its_name_in_its_folder(self) -> None:
        for name in ODD_NAMES:
            with self.subTest(name):
                path = self.make(name)
                hfs_name = self.client.hfs_name_of(path).value
                self.assertEqual(hfs_name, self.client.record_of(path).value.name)
                self.assertEqual(self.client.path_in_folder(self.folder, hfs_name), Converted(path, Outcome.FOUND))

    def test_a_folder_comes_back(self) -> None:
        path = self.make_folder("outer", "inner")
        hfs_path = self.client.hfs_path_of(path).value
        self.assertTrue(hfs_path.endswith(b":outer:inner:"))
        self.assertEqual(self.client.path_of_hfs_path(hfs_path).value, path)
        self.assertEqual(self.client.path_of(self.client.record_of(path).value).value, path)

    def test_the_root_folder_comes_back(self) -> None:
        for spelling in ("/", "//", "/.", "/..", "/./"):
            record = self.client.record_of(spelling)
            self.assertEqual(record.value.par_id, 1)
            self.assertEqual(self.client.path_of(record.value), Converted("/", Outcome.FOUND))
            self.assertEqual(self.client.hfs_path_of(spelling).value, record.value.name + b":")

    def test_a_new_item_comes_back(self) -> None:
        for name in ("new", "a:b", "Café", "~", "~root", "é" * 63, "x#1", "new\nline"):
            with self.subTest(name):
                path = self.path(name)
                record, hfs_path = self.client.record_of(path), self.client.hfs_path_of(path)
                self.assertEqual((record.outcome, hfs_path.outcome), (Outcome.NEW, Outcome.NEW))
                self.assertEqual(self.client.path_of(record.value), Converted(path, Outcome.NEW))
                self.assertEqual(self.client.path_of_hfs_path(hfs_path.value), Converted(path, Outcome.NEW))
                name_of = self.client.hfs_name_of(path)
                self.assertEqual(name_of, Converted(record.value.name, Outcome.NEW))
                self.assertEqual(self.client.path_in_folder(self.folder, name_of.value), Converted(path, Outcome.NEW))

    def test_a_long_name_finds_what_exists_in_a_folder(self) -> None:
        path = self.make("c" * 200)
        self.assertEqual(self.client.path_in_folder(self.folder, "c" * 200), Converted(path, Outcome.FOUND))

    def test_a_new_item_in_the_root_folder_has_one_slash(self) -> None:
        record = self.client.record_of("/new item?")
        self.assertEqual(self.client.path_of(record.value), Converted("/new item?", Outcome.NEW))
        self.assertEqual(self.client.path_in_folder("/", "new item?"), Converted("/new item?", Outcome.NEW))

    def test_a_link_is_an_item_itself_also_one_that_leads_nowhere(self) -> None:
        link = self.make_link("nowhere", "link")
        record = self.client.record_of(link)
        self.assertEqual(record.outcome, Outcome.FOUND)
        self.assertEqual(self.client.path_of(record.value), Converted(link, Outcome.FOUND))
        self.assertEqual(self.client.hfs_name_of(link).value, b"link")
        self.assertTrue(self.client.hfs_path_of(link).value.endswith(b":link"))
        self.assertEqual(self.client.record_of(link + "/"), record)

    def test_what_is_found_on_another_volume_when_asked(self) -> None:
        spec = self.client.record_of(self.make("here")).value
        elsewhere = FSSpec(32767, spec.par_id, spec.name)
        self.assert_error(Outcome.NOT_A_VOLUME, "32767", self.client.path_of, elsewhere)
        self.assertEqual(self.client.path_of(elsewhere, search_other_volumes=True).value, self.path("here"))

    def test_texts_are_those_of_the_command_line(self) -> None:
        path = self.make("a:é")
        record = self.client.record_of(path)
        self.assertEqual(record.text, record.value.text)
        self.assertTrue(record.text.endswith(":a/é"))
        self.assertTrue(self.client.hfs_path_of(path).text.endswith(":a/é"))
        self.assertEqual(self.client.path_of(record.value).text, path)


class Ways(ConversionTest):
    def test_a_relative_path_begins_at_the_current_folder(self) -> None:
        path = self.make("f")
        record = self.client.record_of(path)
        self.make_folder("inner")
        self.enter(self.folder)
        self.assertEqual(self.client.record_of("f"), record)
        self.assertEqual(self.client.record_of("./inner/../f"), record)
        self.enter(self.path("inner"))
        self.assertEqual(self.client.record_of("../f"), record)
        self.assertEqual(self.client.record_of("."), self.client.record_of(self.path("inner")))
        self.assertEqual(self.client.record_of(".."), self.client.record_of(self.folder))
        self.assertEqual(self.client.path_in_folder("..", "f").value, path)

    def test_links_in_front_of_the_last_name_are_followed(self) -> None:
        self.make_folder("real")
        self.make_link("real", "link")
        path = self.make("real", "f")
        self.assertEqual(self.client.record_of(self.path("link", "f")), self.client.record_of(path))
        self.assertEqual(self.client.hfs_path_of(self.path("link", "f")), self.client.hfs_path_of(path))
        self.assertEqual(self.client.path_in_folder(self.path("link"), "f").value, path)

    def test_a_new_item_behind_a_link_leads_back(self) -> None:
        self.make_folder("real")
        self.make_link("real", "link")
        record = self.client.record_of(self.path("link", "new"))
        self.assertEqual(record.outcome, Outcome.NEW)
        self.assertEqual(self.client.path_of(record.value).value, self.path("real", "new"))

    def test_dots_behind_a_link_are_those_of_its_folder(self) -> None:
        self.make_folder("one", "two")
        self.make_link("one/two", "link")
        path = self.make("one", "f")
        self.assertEqual(self.client.record_of(self.path("link", "..", "f")), self.client.record_of(path))
        self.assertEqual(self.client.record_of(self.path("link", "..")), self.client.record_of(self.path("one")))

    def test_a_tilde_is_a_plain_name(self) -> None:
        self.enter(self.folder)
        record = self.client.record_of("~")
        self.assertEqual(self.client.path_of(record.value), Converted(self.path("~"), Outcome.NEW))

    def test_what_is_not_to_be_resolved_is_taken_as_it_is(self) -> None:
        self.make_folder("real")
        self.make_link("real", "link")
        path = self.make("real", "f")
        self.assertEqual(self.client.record_of(path, resolve=False), self.client.record_of(path))
        self.assertEqual(self.client.record_of("/", resolve=False), self.client.record_of("/"))
        for name in ("f", "new"):
            behind_link = self.path("link", name)
            self.assert_error(Outcome.NOTHING, self.path("link"), self.client.record_of, behind_link, resolve=False)
            self.assert_error(Outcome.NOTHING, self.path("link"), self.client.hfs_path_of, behind_link, resolve=False)
        for relative in ("f", "real/f", ".", self.path("real", "..")):
            self.assert_error(Outcome.INVALID, relative, self.client.record_of, relative, resolve=False)
        self.assert_error(Outcome.INVALID, "real", self.client.path_in_folder, "real", "f", resolve=False)
        self.assert_error(
            Outcome.NOTHING, self.path("link"), self.client.path_in_folder, self.path("link"), "f", resolve=False
        )

    def test_a_removed_current_folder_has_nothing(self) -> None:
        self.enter(self.make_folder("gone"))
        os.rmdir(self.path("gone"))
        for path in ("f", "."):
            self.assert_error(Outcome.NOTHING, '"', self.client.record_of, path)

    def test_a_folder_whose_name_says_that_it_is_deleted(self) -> None:
        self.make_folder("x (deleted)")
        path = self.make("x (deleted)", "f")
        self.assertEqual(self.client.path_of(self.client.record_of(path).value).value, path)


class Nothing(ConversionTest):
    def test_below_what_is_no_folder(self) -> None:
        self.make("file")
        self.make_link("nowhere", "dangling")
        self.make_link("ring", "ring")
        for folder in ("missing", "file", "dangling", "ring"):
            for ask in (self.client.record_of, self.client.hfs_path_of, self.client.hfs_name_of):
                self.assert_error(Outcome.NOTHING, self.path(folder), ask, self.path(folder, "f"))
            self.assert_error(
                Outcome.NOTHING, self.path(folder), self.client.path_in_folder, self.path(folder), "f"
            )  # fmt: skip

    def test_records_that_lead_nowhere(self) -> None:
        spec = self.client.record_of(self.make("f")).value
        gone = self.client.record_of(self.make_folder("gone")).value
        inside = self.client.record_of(self.make("gone", "f")).value
        # Held open, so that no other folder gets its id.
        self.addCleanup(os.close, os.open(self.path("gone"), os.O_PATH))
        os.remove(self.path("gone", "f"))
        os.rmdir(self.path("gone"))
        self.assertEqual(self.client.path_of(gone).outcome, Outcome.NEW)
        self.assert_error(Outcome.NOTHING, inside.text, self.client.path_of, inside)
        self.assert_error(Outcome.NOTHING, ":3:f", self.client.path_of, FSSpec(spec.v_ref_num, 3, b"f"))

    def test_hfs_paths_that_lead_nowhere(self) -> None:
        folder = self.client.hfs_path_of(self.folder).value
        self.make("file")
        for rest in (b"missing:", b"missing:f", b"missing:inner:", b"file:f", b"file:", b"missing:inner:f"):
            self.assert_error(Outcome.NOTHING, rest.decode(), self.client.path_of_hfs_path, folder + rest)

    def test_hfs_paths_that_climb_above_the_root_folder(self) -> None:
        root, folder = (self.client.hfs_path_of(path).value for path in ("/", self.folder))
        above = folder + b":" * folder.count(b":")
        for path in (root + b":", root + b"::", above, above + b":", root + b":etc", root + b":new"):
            self.assert_error(Outcome.NOTHING, path.decode(), self.client.path_of_hfs_path, path)
        self.assertEqual(self.client.path_of_hfs_path(above[:-1]).value, "/")
        self.assertEqual(self.client.path_of_hfs_path(folder + b":").value, os.path.dirname(self.folder))

    def test_a_name_with_a_tilde_is_no_home_folder(self) -> None:
        spec = self.client.record_of(self.make("f")).value
        user = pwd.getpwuid(os.getuid()).pw_name.encode()
        for name in (b"~", b"~" + user):
            lost = FSSpec(spec.v_ref_num, 0x7FFFFFF1, name)
            self.assertIsNotNone(self.client.set_file_ref_from_fsspec(lost))  # the raw way leads home
            self.assert_error(Outcome.NOTHING, lost.text, self.client.path_of, lost)


class Invalid(ConversionTest):
    def test_what_is_no_path(self) -> None:
        for path, at_fault in (
            ("", "empty"), ("/a\0b", "/a"), (b"/a\0b", "/a"), ("/\ud800", "characters"),
            ("/" + "a" * 70000, "too long"),
            (self.path("a" * 256), "too long"), ("/" + "a/" * 3000 + "f", "too long"),
        ):  # fmt: skip
            for ask in (self.client.record_of, self.client.hfs_path_of, self.client.hfs_name_of):
                self.assert_error(Outcome.INVALID, at_fault, ask, path)

    def test_names_that_no_item_has(self) -> None:
        spec = self.client.record_of(self.folder).value
        for name in (b"", b".", b"..", b"a:b", b":", b"a\0b", b"a" * 64, b"a" * 256):
            at_fault = name.split(b"\0")[0].decode()[:200]
            self.assert_error(Outcome.INVALID, at_fault, self.client.path_in_folder, self.folder, name)
            if len(name) < 64:
                record = FSSpec(spec.v_ref_num, spec.par_id, name)
                self.assert_error(Outcome.INVALID, at_fault, self.client.path_of, record)
        for name in ("日本", "a\ud800"):
            self.assert_error(Outcome.INVALID, name[0], self.client.path_in_folder, self.folder, name)
            self.assert_error(Outcome.INVALID, name[0], self.client.path_of_hfs_path, "Root:" + name)

    def test_names_with_characters_that_only_a_normal_form_makes_those_of_an_item(self) -> None:
        folder = self.client.hfs_path_of(self.folder).text
        for name in ("\u2126", "\u212a", "\u212b", "=\u0338"):
            path = self.make(unicodedata.normalize("NFC", name))
            self.assertEqual(self.client.path_in_folder(self.folder, os.path.basename(path)).value, path)
            self.assert_error(Outcome.INVALID, "character", self.client.path_in_folder, self.folder, name)
            self.assert_error(Outcome.INVALID, "character", self.client.path_of_hfs_path, folder + name)

    def test_a_name_is_looked_at_before_its_folder(self) -> None:
        for name in (b"", b"..", b"a:b", b"a\0b", b"a" * 256, "日本"):
            self.assert_error(Outcome.INVALID, "", self.client.path_in_folder, self.path("missing"), name)

    def test_what_is_no_bool_is_a_type_error(self) -> None:
        for ask in (conversion.record_of, conversion.hfs_path_of, conversion.hfs_name_of):
            for value in ("no", 0, None):
                with self.subTest(ask.__name__, value=value), self.assertRaises(TypeError):
                    ask("/etc", resolve=value)
        with self.assertRaises(TypeError):
            conversion.path_in_folder("/", "etc", resolve="no")

    def test_what_is_no_full_hfs_path(self) -> None:
        for path in (b"", b"name", b":name", b":", b"::up"):
            self.assert_error(Outcome.INVALID, path.decode(), self.client.path_of_hfs_path, path)
        self.assert_error(Outcome.INVALID, "255 bytes", self.client.path_of_hfs_path, b"Root:" + b"a" * 251)

    def test_new_names_that_would_not_come_back(self) -> None:
        for name in ("日本.aif", "\udcff.aif", "n" * 64, unicodedata.normalize("NFD", "é"), "é" * 64):
            with self.subTest(name):
                for ask in (self.client.record_of, self.client.hfs_path_of, self.client.hfs_name_of):
                    self.assert_error(Outcome.INVALID, self.folder, ask, self.path(name))

    def test_new_hfs_paths_that_would_not_come_back(self) -> None:
        folder = self.client.hfs_path_of(self.folder).value
        for name in (b"..", b".", b"n" * 64):
            self.assert_error(Outcome.INVALID, name.decode(), self.client.path_of_hfs_path, folder + name)


class Ambiguous(ConversionTest):
    def test_new_names_that_are_those_of_other_items(self) -> None:
        for new, other in (
            ("日.aif", "?.aif"), ("n" * 64, "n" * 63), (unicodedata.normalize("NFD", "é"), "é"),
            ("ö", unicodedata.normalize("NFD", "ö")),
        ):  # fmt: skip
            with self.subTest(new):
                self.make(other)
                for ask in (self.client.record_of, self.client.hfs_path_of, self.client.hfs_name_of):
                    self.assert_error(Outcome.AMBIGUOUS, other, ask, self.path(new))

    def test_a_new_name_that_is_the_short_form_of_another(self) -> None:
        short = self.client.record_of(self.make("日本.wav")).value.name.decode()
        self.assertIn("#", short)
        self.assert_error(Outcome.AMBIGUOUS, "日本.wav", self.client.record_of, self.path(short))


class NotAVolume(ConversionTest):
    def test_what_is_in_a_kernel_interface(self) -> None:
        for path in ("/proc/self/status", "/proc/new", "/proc/version", "/proc/sys"):
            for ask in (self.client.record_of, self.client.hfs_path_of, self.client.hfs_name_of):
                self.assert_error(Outcome.NOT_A_VOLUME, "/proc", ask, path)
        for name in (b"version", b"new", b"a/b", b"\x8e"):
            self.assert_error(Outcome.NOT_A_VOLUME, "/proc", self.client.path_in_folder, "/proc", name)

    def test_the_folder_of_a_kernel_interface_has_its_own_path(self) -> None:
        hfs_path = self.client.hfs_path_of("/proc").value
        self.assertTrue(hfs_path.endswith(b":proc:"))
        self.assertEqual(self.client.path_of_hfs_path(hfs_path).value, "/proc")
        self.assertEqual(self.client.path_in_folder("/", "proc").value, "/proc")
        self.assertEqual(self.client.path_of(self.client.record_of("/proc").value).value, "/proc")

    def test_an_hfs_path_into_a_kernel_interface_is_on_no_volume(self) -> None:
        hfs_path = self.client.hfs_path_of("/proc").value
        for rest in (b"version", b"new", b"sys:"):
            self.assert_error(
                Outcome.NOT_A_VOLUME, "is on no volume", self.client.path_of_hfs_path, hfs_path + rest
            )  # fmt: skip

    def test_what_begins_with_no_volume(self) -> None:
        self.assert_error(Outcome.NOT_A_VOLUME, "no such volume", self.client.path_of_hfs_path, "no such volume:f")
        self.assert_error(Outcome.NOT_A_VOLUME, "-99", self.client.path_of, FSSpec(-99, 2, b"f"))


class Long(ConversionTest):
    def test_an_hfs_path_has_511_bytes_at_most(self) -> None:
        folder = self.folder
        while len(self.client.hfs_path_of(folder).value) <= 449:
            folder = os.path.join(folder, "d" * 40)
            os.mkdir(folder)
        room = 511 - len(self.client.hfs_path_of(folder).value)
        for make in (lambda path: None, lambda path: Path(path).touch()):
            fits, beyond = (os.path.join(folder, "f" * length) for length in (room, room + 1))
            make(fits), make(beyond)
            self.assertEqual(len(self.client.hfs_path_of(fits).value), 511)
            self.assert_error(Outcome.INVALID, "511 bytes", self.client.hfs_path_of, beyond)

    def test_a_path_whose_outer_folders_were_left_out_is_no_path_of_the_item(self) -> None:
        folder = self.folder
        for depth in range(16):
            folder = os.path.join(folder, "d" * 60)
            os.mkdir(folder)
            raw = self.client.make_full_path(folder)
            try:
                self.assertEqual(self.client.hfs_path_of(folder).value.count(b":" + b"d" * 60), depth + 1)
            except ConversionError as error:
                self.assertEqual(error.outcome, Outcome.INVALID)
                self.assertLess(raw.count(b":" + b"d" * 60), depth + 1 + (len(raw) > 511))
        self.assertLess(len(raw), 511)  # so it is not by its length that it is told

    def test_a_path_that_is_long_and_whole_is_answered(self) -> None:
        folder, whole = self.folder, self.client.hfs_path_of(self.folder).value
        while len(whole) + 21 <= 511:
            folder, whole = os.path.join(folder, "e" * 20), whole + b"e" * 20 + b":"
            os.mkdir(folder)
        self.assertGreater(len(whole), 490)
        self.assertEqual(self.client.hfs_path_of(folder).value, whole)


class Batches(ConversionTest):
    def test_answers_and_errors_are_values_in_order(self) -> None:
        paths = [self.make(f"{number}") for number in range(300)]
        asked = [path for each in paths for path in (each, each + "/below", each + ".new")]
        answers = list(self.client.batch(map(conversion.record_of, asked)))
        self.assertEqual([each.outcome.value for each in answers], ["found", "nothing", "new"] * 300)
        records = [each.value for each in answers[::3]]
        back = self.client.batch(map(conversion.path_of, records))
        self.assertEqual([each.value for each in back], paths)

    def test_what_takes_several_steps_stays_in_order(self) -> None:
        paths = [self.make(f"{number}é") for number in range(300)]
        asked = [each for path in paths for each in (conversion.hfs_path_of(path), request.get_fsspec(path),
                 conversion.record_of(path + "#1"), conversion.path_of(FSSpec(-99, 2, b"x")))]  # fmt: skip
        answers = list(self.client.batch(asked))
        self.assertEqual(answers[0::4], [self.client.hfs_path_of(path) for path in paths])
        self.assertEqual(answers[1::4], [self.client.get_fsspec(path) for path in paths])
        self.assertEqual({each.outcome for each in answers[2::4]}, {Outcome.NEW})
        self.assertEqual({each.outcome for each in answers[3::4]}, {Outcome.NOT_A_VOLUME})

    def test_a_service_that_fails_is_an_outcome(self) -> None:
        with Client(self.path("missing")) as client:
            [answer] = client.batch([conversion.record_of("/")])
            self.assertIsInstance(answer, ServiceError)
            self.assertEqual(answer.outcome, Outcome.SERVICE_FAILED)

    def test_an_item_is_looked_at_when_its_turn_comes(self) -> None:
        asked = conversion.record_of(self.path("late"))
        self.make("late")
        self.assertEqual(self.client.ask(asked).outcome, Outcome.FOUND)
        os.remove(self.path("late"))
        self.assertEqual(self.client.ask(asked).outcome, Outcome.NEW)


class Outcomes(ConversionTest):
    def test_they_have_the_names_of_the_other_clients(self) -> None:
        self.assertEqual(
            [each.value for each in Outcome],
            ["found", "new", "nothing", "ambiguous", "refused", "not-a-volume", "invalid", "service-failed"],
        )

    def test_errors_can_be_sent_to_another_process(self) -> None:
        error = pickle.loads(pickle.dumps(ConversionError(Outcome.NOTHING, "There is nothing.")))
        self.assertEqual((error.outcome, str(error)), (Outcome.NOTHING, "There is nothing."))

    def test_what_may_not_be_looked_at_is_refused(self) -> None:
        said = self.run_host(
            """
            os.mkdir("closed"); open("closed/f", "w").close(); os.chmod("closed", 0)
            if os.getuid() == 0:
                os.chmod(".", 0o755); os.setgroups([]); os.setresuid(65534, 65534, 65534)
            with Client(SERVICE) as client:
                for path in ("closed/f", "closed/new", "closed/inner/f"):
                    try: client.record_of(path)
                    except ConversionError as error: print(error.outcome.value, "closed" in str(error))
            """
        )
        self.assertEqual(said, "refused True\n" * 3)

    def test_without_descriptors_nothing_is_answered(self) -> None:
        said = self.run_host(
            """
            import resource
            client = Client(SERVICE)
            client.record_of("/")
            resource.setrlimit(resource.RLIMIT_NOFILE, (len(os.listdir("/proc/self/fd")) - 1, 100))
            try: client.record_of("/etc/hostname")
            except ConversionError as error: print(error.outcome.value, error)
            """
        )
        self.assertEqual(said, f'refused "/etc/hostname" cannot be looked at: {os.strerror(errno.EMFILE)}.\n')


class Volumes(ConversionTest):
    def test_the_first_is_that_of_the_root_folder(self) -> None:
        volumes = self.client.volumes()
        name = self.client.get_hfs_volume_name(0)
        number = self.client.get_vol_refnum_by_hfs_name(name)
        self.assertEqual(volumes[0], Volume(number, name, "/"))
        self.assertEqual(volumes[0].name_text, name.decode("mac_roman"))

    def test_each_is_one_and_no_kernel_interface_is_any(self) -> None:
        volumes = self.client.volumes()
        self.assertEqual(len({volume.number for volume in volumes}), len(volumes))
        self.assertNotIn("/proc", [volume.mount_point for volume in volumes])
        for volume in volumes:
            self.assertEqual(self.client.get_hfs_volume_name(volume.number), volume.name)
            self.assertEqual(self.client.path_of(self.client.record_of(volume.mount_point).value).value,
                             volume.mount_point)  # fmt: skip

    def test_what_is_mounted_is_listed_once_by_its_name(self) -> None:
        said = in_own_mounts(
            self,
            """
            os.makedirs("a b/é"); os.mkdir("again")
            mount("-t", "tmpfs", "none", "a b/é"); mount("--bind", "a b/é", "again")
            print([(v.name_text, v.mount_point) for v in client.volumes() if os.getcwd() in v.mount_point])
            """,
        )
        self.assertEqual(said, f"[('é', '{self.path('a b', 'é')}')]\n")

    def test_a_path_on_the_second_volume_of_a_name_would_lead_to_the_first(self) -> None:
        said = in_own_mounts(
            self,
            """
            for place in ("one/disk", "two/disk"):
                os.makedirs(place)
                mount("-t", "tmpfs", "none", place)
                open(place + "/f", "w").close()
            print(client.hfs_path_of("one/disk/f").text)
            try: print(client.hfs_path_of("two/disk/f").text)
            except ConversionError as error: print(error.outcome.value)
            print(client.path_of(client.record_of("two/disk/f").value).value)
            """,
        )
        self.assertEqual(said, f"disk:f\nambiguous\n{self.path('two', 'disk', 'f')}\n")

    def test_an_interface_in_a_folder_of_its_name_is_not_taken_for_that_folder(self) -> None:
        said = in_own_mounts(
            self,
            """
            os.makedirs("proc/proc"); mount("--bind", "/proc", "proc/proc")
            outer = client.hfs_path_of("proc").text
            own = client.hfs_path_of("proc/proc").text
            print(own == outer + "proc:", client.path_of_hfs_path(own).value == os.path.abspath("proc/proc"))
            """,
        )
        self.assertEqual(said, "True True\n")

    def test_a_kernel_interface_that_is_mounted_twice_has_a_path_at_each_place(self) -> None:
        said = in_own_mounts(
            self,
            """
            os.makedirs("first"); os.makedirs("folder/second")
            outer = client.hfs_path_of(".").text
            for place in ("first", "folder/second"): mount("--bind", "/proc", place)
            for place in ("first", "folder/second"):
                own = client.hfs_path_of(place)
                print(own.text[len(outer):], os.path.relpath(client.path_of_hfs_path(own.value).value))
            """,
        )
        self.assertEqual(said, "first: first\nfolder:second: folder/second\n")

    def test_what_is_mounted_beside_two_volumes_of_one_name_leads_back_or_is_ambiguous(self) -> None:
        said = in_own_mounts(
            self,
            """
            def show(source, place): os.makedirs(place); mount("--bind", source, place)
            for place in ("a/vol", "b/vol"):
                os.makedirs(place); mount("-t", "tmpfs", "none", place)
            os.mkdir("a/vol/in a"); os.mkdir("b/vol/in b")
            open("a/vol/file", "w").close(); open("b/vol/other", "w").close()
            show("b/vol/in b", "shown"); show("b/vol/in b", "a/vol/shown")
            show("a/vol/in a", "b/vol/first"); show("b/vol/in b", "b/vol/shown"); show("/proc", "b/vol/proc")
            mount("--bind", "a/vol/file", "b/vol/other")
            outer = client.hfs_path_of(".").text
            for path in ("shown", "a/vol/shown", "b/vol/first",
                         "shown/new", "b/vol/shown", "b/vol/proc", "b/vol/other"):
                try: print(client.hfs_path_of(path).text.replace(outer, "HERE:"))
                except ConversionError as error: print(error.outcome.value)
            """,
        )
        self.assertEqual(said, "HERE:shown:\nvol:shown:\nvol:in a:\n" + "ambiguous\n" * 4)

    def test_a_folder_of_another_mount_comes_back(self) -> None:
        said = in_own_mounts(
            self,
            """
            os.makedirs("disk"); os.mkdir("shown")
            mount("-t", "tmpfs", "none", "disk"); os.makedirs("disk/outer/inner")
            mount("--bind", "disk/outer/inner", "shown"); open("shown/f", "w").close()
            for path in ("shown", "shown/f"):
                record, hfs = client.record_of(path), client.hfs_path_of(path)
                ways = client.path_of(record.value).value, client.path_of_hfs_path(hfs.value).value
                print(hfs.text, all(os.path.samefile(path, way) for way in ways))
            """,
        )
        self.assertEqual(said, "disk:outer:inner: True\ndisk:outer:inner:f True\n")

    def test_a_file_that_is_mounted_by_itself_comes_back_or_has_no_record(self) -> None:
        said = in_own_mounts(
            self,
            """
            os.mkdir("disk"); open("alone", "w").close(); open("other", "w").close()
            mount("-t", "tmpfs", "none", "disk"); open("disk/f", "w").close(); open("disk/g", "w").close()
            mount("--bind", "disk/f", "alone"); mount("--bind", "disk/g", "other")
            import subprocess
            subprocess.run(["umount", "-l", "disk"], check=True)
            for ask, back in ((client.record_of, client.path_of), (client.hfs_path_of, client.path_of_hfs_path)):
                try: print(os.path.samefile(back(ask("alone").value).value, "alone"))
                except ConversionError as error: print(error.outcome.value)
            """,
        )
        self.assertRegex(said, r"\A(True|not-a-volume)\n(True|not-a-volume)\n\Z")
