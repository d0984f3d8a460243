"""What a missed deadline says."""

from __future__ import annotations

import os
import time

from tallowmere import Client, DeadlineMissed, FSSpec
from tallowmere._mounts import Mount, mounts_in

from .support import FolderTest, in_own_mounts


class Messages(FolderTest):
    def test_it_tells_what_was_asked(self) -> None:
        spec = FSSpec(-27, 19, b"caf\x8e")
        stand_in = self.program("time.sleep(60)")
        with Client(stand_in, 0.05) as client:
            for ask, arguments, what in (
                (client.make_full_path, ("/x",), 'the full HFS path of "/x"'),
                (client.make_file_ref_from_path, (b"a:\x8e",), 'the item with the HFS path "a:é"'),
                (client.get_vol_refnum_by_hfs_name, ("é",), 'the number of the volume "é"'),
                (client.get_hfs_volume_name, (-27,), "the name of the volume -27"),
                (client.get_hfs_name, (b"/\xff\n",), 'the HFS name of "/\\udcff\\n"'),
                (client.add_hfs_name, ("/x", "y"), 'the item "y" in "/x"'),
                (client.get_fsspec, ("/x",), 'the record of "/x"'),
                (client.set_file_ref_from_fsspec, (spec,), 'the item with the record "-27:19:café"'),
                (client.get_aiff_export_settings, (1, 1, 1, "twos"), 'export settings for "twos"'),
                (client.record_of, ("/etc/hostname",), 'the record of "/etc/hostname"'),
                (client.volumes, (), 'the record of "/"'),
            ):  # fmt: skip
                with self.subTest(what), self.assertRaises(DeadlineMissed) as caught:
                    ask(*arguments)
                missed = "The service did not answer within 0.05 seconds when it was asked for "
                self.assertEqual(str(caught.exception), f"{missed}{what}.")

    def test_a_giant_path_is_quoted_in_part(self) -> None:
        with Client(self.program("time.sleep(60)"), 0.05) as client, self.assertRaises(DeadlineMissed) as caught:
            client.get_fsspec("/" + "a" * 60000)
        self.assertLess(len(str(caught.exception)), 400)
        self.assertIn("aaa…", str(caught.exception))

    def test_a_search_names_the_mounts_that_may_have_kept_it_waiting_and_looks_at_none(self) -> None:
        stand_in = self.program("time.sleep(60)")
        said = in_own_mounts(
            self,
            f"""
            import ctypes
            os.mkdir("dead")
            device = os.open("/dev/fuse", os.O_RDWR)  # nobody answers on it
            options = f"fd={{device}},rootmode=40000,user_id=0,group_id=0".encode()
            if ctypes.CDLL(None).mount(b"none", b"dead", b"fuse.test", 0, options) != 0: sys.exit("no FUSE")
            waiting = Client({stand_in!r}, 0.2)
            spec = FSSpec(-99, 2, b"x")
            def says(ask, *arguments, **options):
                try: ask(*arguments, **options)
                except ServiceError as error: print(str(error).partition("asked for ")[2])
            says(waiting.path_of, spec)
            says(waiting.path_of, spec, search_other_volumes=True)
            says(waiting.set_file_ref_from_fsspec_data, spec)
            os._exit(0)
            """,
            needs="/dev/fuse",
        )
        dead = f"the search of the other volumes may wait for \"{os.path.join(self.folder, 'dead')}\" (fuse.test)."
        plain, *searches = said.splitlines()
        self.assertEqual(plain, 'the item with the record "-99:2:x".')
        for search in searches:
            self.assertTrue(search.startswith('the item with the record "-99:2:x"; the search'), search)
            self.assertIn(dead[4:-1], search)
        self.assertEqual(len(searches), 2)


class Mounts(FolderTest):
    TABLE = (
        b"22 27 0:21 / /proc rw - proc proc rw\n27 1 254:0 / / rw,relatime - ext4 /dev/vda rw\n"
        b"40 27 0:40 / /a\\040b\\134c rw shared:1 master:2 - fuse.sshfs host:/x rw\n"
        b"malformed\n1 2 3:4 / relative rw - x\n"
        b"41 27 0:41 / /proc rw - nfs4 host:/y rw\n42 27 8:1 / /disk rw - fuseblk /dev/sda rw\n"
    )

    def test_each_mount_point_is_there_once_the_root_first(self) -> None:
        self.assertEqual(
            mounts_in(self.TABLE),
            [
                Mount(b"/", b"ext4"), Mount(b"/a b\\c", b"fuse.sshfs"), Mount(b"/proc", b"nfs4"),
                Mount(b"/disk", b"fuseblk"),
            ],  # fmt: skip
        )
        self.assertEqual([mount.is_served for mount in mounts_in(self.TABLE)], [False, True, True, True])

    def test_without_a_table_there_is_the_root(self) -> None:
        self.assertEqual(mounts_in(b""), [Mount(b"/", b"")])

    def test_a_table_of_20000_mounts_is_read_at_once(self) -> None:
        table = b"".join(b"1 1 0:1 / /m%d rw - tmpfs none rw\n" % (number % 15000) for number in range(20000))
        begin = time.monotonic()
        self.assertEqual(len(mounts_in(table)), 15001)
        self.assertLess(time.monotonic() - begin, 5)
