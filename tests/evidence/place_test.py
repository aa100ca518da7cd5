#!/usr/bin/python3
"""Where the log stands, and what may stand in its place. usage: place_test.py SIMHOST MORVANE"""

import os
import socket
import stat

from support import (BUSY, COMPLETED, MORVANE, NO_DIRECTORY, NO_LOG, NOBODY, OTHER, ROOT, Run, main, normalised,
                     whole_run)

PRECIOUS = "root's own\n"


class InTheLogsPlace(Run):
    """Root runs it where nobody may write, and nobody was there before."""

    def setUp(self):
        super().setUp()
        self.precious = self.folder / "precious"
        self.precious.write_text(PRECIOUS)
        self.make_logs(NOBODY)

    def assert_made_anew(self):
        self.assert_complete(self.morvane())
        self.assertEqual(self.precious.read_text(), PRECIOUS)

    def test_a_link_to_a_file_of_roots_is_replaced(self):
        self.log.symlink_to(self.precious)
        self.assert_made_anew()

    def test_a_link_of_roots_own_is_replaced(self):
        self.log.symlink_to(self.precious)
        os.chown(self.log, ROOT, ROOT, follow_symlinks=False)
        self.assert_made_anew()

    def test_a_link_to_nothing_is_replaced_and_makes_nothing(self):
        self.log.symlink_to(self.folder / "new")
        self.assert_made_anew()
        self.assertFalse((self.folder / "new").exists())

    def test_a_hard_link_to_a_file_of_roots_is_replaced(self):
        os.link(self.precious, self.log)
        self.assert_made_anew()

    def test_a_pipe_is_replaced_and_not_waited_for(self):
        os.mkfifo(self.log)
        self.assert_made_anew()

    def test_a_socket_is_replaced(self):
        with socket.socket(socket.AF_UNIX) as end:
            end.bind(str(self.log))
            self.assert_made_anew()

    def test_a_device_is_replaced(self):
        os.mknod(self.log, stat.S_IFCHR | 0o666, os.makedev(1, 3))
        self.assert_made_anew()

    def test_another_users_file_is_replaced_and_shows_nothing_of_the_log(self):
        self.log.write_text("nobody's\n")
        os.chown(self.log, NOBODY, NOBODY)
        with self.log.open() as held:
            self.assert_made_anew()
            self.assertEqual(held.read(), "nobody's\n")

    def test_a_directory_stays_and_there_is_no_log(self):
        self.log.mkdir()
        self.assert_refused(self.morvane(), NO_LOG, "./MorvaneLogs/Morvane.log: not a log of root's, and cannot be "
                            "replaced: Is a directory (the directory belongs to user 65534)")


class TheDirectory(Run):
    def test_is_made_where_there_is_none(self):
        self.assert_complete(self.morvane())

    def test_may_be_a_link_of_the_users_own(self):
        for user in (ROOT, NOBODY):
            with self.subTest(user=user):
                self.link_logs(user, owner=user)
                self.assert_complete(self.morvane(user=user), user=user)
                self.assertEqual(os.listdir(self.target), ["Morvane.log"])

    def test_may_be_a_link_of_roots(self):
        self.link_logs(NOBODY, owner=ROOT)
        self.assert_complete(self.morvane(user=NOBODY), user=NOBODY)

    def test_is_no_link_of_anybody_else(self):
        for user, owner in ((ROOT, NOBODY), (NOBODY, OTHER)):
            with self.subTest(user=user):
                self.link_logs(user, owner)
                (self.target / "Morvane.log").write_text(PRECIOUS)
                self.assert_refused(self.morvane(user=user), NO_LOG, f"./MorvaneLogs: a link that user {owner} made")
                self.assertEqual((self.target / "Morvane.log").read_text(), PRECIOUS)

    def test_is_no_link_that_leads_through_one_of_somebody_elses(self):
        # Root's link in nobody's directory, and nobody has exchanged a directory on its way.
        self.link_logs(ROOT, ROOT)
        os.chown(self.work, NOBODY, NOBODY)
        (self.target / "logs").mkdir()
        (self.target / "logs" / "Morvane.log").write_text(PRECIOUS)
        self.logs.unlink()
        self.logs.symlink_to("data/logs")
        (self.work / "data").symlink_to(self.target)
        os.chown(self.work / "data", NOBODY, NOBODY, follow_symlinks=False)
        self.assert_refused(self.morvane(), NO_LOG, f"./MorvaneLogs: a link that user {NOBODY} made")
        self.assertEqual((self.target / "logs" / "Morvane.log").read_text(), PRECIOUS)

    def test_may_be_a_link_to_a_link_of_the_users_own(self):
        self.link_logs(ROOT, ROOT)
        (self.work / "second").symlink_to(self.target)
        self.logs.unlink()
        self.logs.symlink_to("second")
        self.assert_complete(self.morvane())
        self.assertEqual(os.listdir(self.target), ["Morvane.log"])

    def test_is_no_link_that_leads_to_itself(self):
        self.logs.unlink(missing_ok=True)
        self.logs.symlink_to("MorvaneLogs")
        self.assert_refused(self.morvane(), NO_LOG, "./MorvaneLogs: Too many levels of symbolic links")

    def test_is_no_file(self):
        self.logs.write_text(PRECIOUS)
        self.assert_refused(self.morvane(), NO_LOG, "./MorvaneLogs: Not a directory")
        self.assertEqual(self.logs.read_text(), PRECIOUS)

    def test_that_cannot_be_made_is_the_reason(self):
        self.work.chmod(0o755)
        self.assert_refused(self.morvane(user=NOBODY), NO_DIRECTORY, "./MorvaneLogs: Permission denied")

    def test_that_may_not_be_written_is_the_reason_and_whose_it_is(self):
        self.make_logs(ROOT)
        self.assert_refused(self.morvane(user=NOBODY), NO_LOG,
                            "./MorvaneLogs/Morvane.log: Permission denied (the directory belongs to root)")

    def test_with_roots_log_that_may_not_be_replaced_is_the_reason(self):
        self.make_logs(ROOT, 0o1777)
        self.log.write_text(PRECIOUS)
        self.assert_refused(self.morvane(user=NOBODY), NO_LOG,
                            "./MorvaneLogs/Morvane.log: not a log of user 65534's, and cannot be replaced: "
                            "Operation not permitted (the directory belongs to root)")
        self.assertEqual(self.log.read_text(), PRECIOUS)

    def link_logs(self, user, owner):
        """Makes MorvaneLogs a link that `owner` made, to a directory of `user`'s."""
        self.target = self.folder / f"logs-of-{user}-by-{owner}"
        self.target.mkdir()
        os.chown(self.target, user, user)
        self.logs.unlink(missing_ok=True)
        self.logs.symlink_to(self.target)
        os.chown(self.logs, owner, owner, follow_symlinks=False)
        self.work.chmod(0o755)
        os.chown(self.work, user, user)


class OneRunAfterAnother(Run):
    def test_leaves_nothing_of_the_earlier_log(self):
        self.make_logs(ROOT)
        self.log.write_text("x" * 100000)
        self.assert_complete(self.morvane())

    def test_may_be_roots_after_the_users_and_the_users_again(self):
        for user in (NOBODY, ROOT, NOBODY):
            with self.subTest(user=user):
                self.assert_complete(self.morvane(user=user), user=user)
        self.assertEqual(self.logs.stat().st_uid, NOBODY)

    def test_leaves_a_log_that_only_its_owner_writes_to_whatever_the_umask(self):
        for umask, mode in (("000", "0o100644"), ("022", "0o100644"), ("077", "0o100600")):
            with self.subTest(umask=umask):
                self.assert_complete(self.morvane(script=f'umask {umask}; exec "$@"'))
                self.assertEqual(oct(self.log.stat().st_mode), mode)
                self.log.unlink()

    def test_leaves_an_earlier_log_to_others_who_could_write_to_it(self):
        self.make_logs(ROOT)
        self.log.touch()
        self.log.chmod(0o666)
        with open(self.log, "r+b") as held:  # as somebody else may hold it
            self.assert_complete(self.morvane())
            held.write(b"forged")
        self.assertEqual(oct(self.log.stat().st_mode), "0o100644")
        self.assertNotIn(b"forged", self.log.read_bytes())


class DuringARun(Run):
    """What happens while the run waits for iscsiadm."""

    def while_waiting(self, script):
        return self.planting({"/sbin/iscsiadm": f'#!/bin/sh\n{script}\nexec /etc/real/iscsiadm "$@"\n'}, 'echo $$ >first; exec "$@"')

    def test_a_second_one_is_told_and_harms_nothing(self):
        done = self.morvane(script=self.while_waiting(f"cp MorvaneLogs/Morvane.log before; {MORVANE} >output 2>error; "
                                                      "echo $? >status; cmp MorvaneLogs/Morvane.log before >difference"))
        self.assert_complete(done)
        first = (self.work / "first").read_text().strip()
        told = [(self.work / name).read_text() for name in ("status", "output", "error", "difference")]
        self.assertEqual(told, ["1\n", NO_LOG.decode(), f"morvane: ./MorvaneLogs: locked by process {first}, "
                                "as by a run that is writing its log there\n", ""])

    def test_a_log_that_is_replaced_is_not_called_complete(self):
        done = self.morvane(script=self.while_waiting("mv MorvaneLogs/Morvane.log mine; touch MorvaneLogs/Morvane.log"))
        self.assert_refused(done, b"", "./MorvaneLogs/Morvane.log: changed during the run by somebody else")

    def test_a_log_that_is_cut_is_not_called_complete(self):
        done = self.morvane(script=self.while_waiting(": >MorvaneLogs/Morvane.log"))
        self.assert_refused(done, b"", "./MorvaneLogs/Morvane.log: changed during the run by somebody else")

    def test_a_log_whose_directory_is_replaced_is_not_called_complete(self):
        done = self.morvane(script=self.while_waiting("mv MorvaneLogs mine; mkdir MorvaneLogs; "
                                                      "touch MorvaneLogs/Morvane.log"))
        self.assert_refused(done, b"", "./MorvaneLogs/Morvane.log: changed during the run by somebody else")

    def test_a_log_that_is_removed_is_not_called_complete(self):
        done = self.morvane(script=self.while_waiting("rm MorvaneLogs/Morvane.log"))
        self.assert_refused(done, b"", "./MorvaneLogs/Morvane.log: No such file or directory")


class FullDisk(Run):
    """The log on a file system of its own, or under a limit, that takes so much and no more."""

    def setUp(self):
        super().setUp()
        self.record = self.folder / "record"
        self.log = self.work / "copy"

    def run_on(self, set_up):
        """How a run ended, once the shell has set it up; its log is copied."""
        script = f'mkdir -p MorvaneLogs; {set_up}; "$@"; status=$?; ulimit -S -f unlimited; ' \
                 "cp MorvaneLogs/Morvane.log copy; exit $status"
        return self.morvane(script=script, options=("--record", self.record))

    def assert_cut(self, done, reason):
        """A run that said so, and sent no more commands than its log shows."""
        self.assert_refused(done, b"", f"./MorvaneLogs/Morvane.log: {reason}")
        log = self.log.read_bytes()
        lines = log[:log.rfind(b"\n") + 1]
        self.assertTrue(whole_run(BUSY)[0].startswith(normalised(lines)))
        self.assertLessEqual(self.record.read_text().count("SG_IO "), log.count(b"Entered Function doScsiIo "))

    def test_of_any_size_is_told_or_holds_the_whole_log(self):
        sizes = range(4, len(whole_run(BUSY)[0]) // 1024 + 12, 4)
        fits = []
        for size in sizes:
            with self.subTest(size=f"{size} KiB"):
                done = self.run_on(f"mount -t tmpfs -o size={size}k none MorvaneLogs")
                fits.append(done.returncode == 0)
                if done.returncode == 0:
                    self.assertEqual((done.stdout, done.stderr), (COMPLETED, b""))
                    self.assert_whole()
                else:
                    self.assert_cut(done, "No space left on device")
        self.assertEqual((fits, fits[0], fits[-1]), (sorted(fits), False, True))

    def test_that_takes_nothing_at_all_is_told(self):
        done = self.run_on('trap "" XFSZ; ulimit -S -f 0')
        self.assert_cut(done, "File too large")
        self.assertEqual(self.log.read_bytes(), b"")

    def test_under_an_earlier_log_is_told_too(self):
        done = self.run_on("mount -t tmpfs -o size=8k none MorvaneLogs; head -c 8192 /dev/zero >MorvaneLogs/Morvane.log")
        self.assert_cut(done, "No space left on device")


if __name__ == "__main__":
    main()
