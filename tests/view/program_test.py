#!/usr/bin/python3
"""Runs morvane-view on logs and checks what it says. usage: program_test.py MORVANE-VIEW SIMHOST MORVANE"""

import base64
import bz2
import gzip
import hashlib
import json
import lzma
import os
import pty
import re
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

import make_log
from support import HERE, HOSTS, PROGRAM, ROOT, host_log, hosts, report, run, valid

PAGES = ROOT.parent / "shared" / "pages"  # of devices that others captured; not part of the project
SIMHOST, MORVANE = (Path(argument).resolve() for argument in sys.argv[2:4])


class Hosts(unittest.TestCase):
    def test_a_log_that_was_just_written_reads_as_the_one_expected_of_the_host(self):
        with tempfile.TemporaryDirectory() as folder:
            subprocess.run([SIMHOST, HOSTS / "demo" / "host.toml", "--", MORVANE], cwd=folder, check=True,
                           capture_output=True, timeout=60)
            done = run(folder=folder)
        self.assertEqual((done.returncode, done.stderr), (0, b""))
        expected = (HERE / "golden" / "hosts" / "demo.txt").read_text()
        self.assertEqual(done.stdout.decode(), expected.replace("demo.log", "./MorvaneLogs/Morvane.log"))

    def test_a_report_line_is_a_path_or_a_device_and_nothing_is_lost(self):
        for host in hosts():
            with self.subTest(host):
                log = host_log(host)
                document = report(log)
                listed = [m for m in re.findall(rb"^\|  \|  \|  \|_ lun name (\S*) luid ", log, re.M) if m]
                self.assertLessEqual(len(document["fc"]["paths"]), len(listed))
                self.assertEqual(len(document["iscsi"]["paths"]), len(re.findall(rb"\|_ Device_Name: ", log)))
                self.assertEqual(len(document["direct"]["devices"]),
                                 len(re.findall(rb"^--------> Device Name: \|.*\| LunId: \|.*\|$", log, re.M)))
                self.assertEqual(len(document["logical"]["devices"]),
                                 len(re.findall(rb"^--------> Device Name: \|.*\| LunId: \|.*\| $", log, re.M)))


class CapturedPages(unittest.TestCase):
    @unittest.skipUnless(PAGES.is_dir(), f"no {PAGES}")
    def test_are_read_as_their_own_check_says(self):
        done = subprocess.run([PAGES / "check", MORVANE, SIMHOST, PROGRAM], capture_output=True, check=False, timeout=280)
        self.assertRegex(done.stdout.decode().splitlines()[-1], r"^\d+ agreed, 0 differ$", done.stdout.decode())


# Each way to pack a log.
PACKERS = {"gz": gzip.compress, "bz2": bz2.compress, "xz": lzma.compress,
           "zst": lambda log: subprocess.run(["zstd", "-qc"], input=log, capture_output=True, check=True).stdout}


class PackedLogs(unittest.TestCase):
    def test_every_command_reads_them_as_the_logs_they_hold_whatever_their_names_are(self):
        logs = [host_log(host) for host in ("demo", "fc-names")]
        with tempfile.TemporaryDirectory() as folder:
            def all_commands():
                commands = [["a"], ["--json", "a"], ["--html", "page", "a"], ["diff", "a", "b"], ["san", "--json", "a", "b"]]
                done = [run(*command, folder=folder) for command in commands]
                return [(d.returncode, d.stdout, d.stderr) for d in done], (Path(folder) / "page").read_bytes()

            def write(pack):
                for name, log in zip("ab", logs):
                    (Path(folder) / name).write_bytes(pack(log))

            write(bytes)
            expected = all_commands()
            for kind, pack in PACKERS.items():
                with self.subTest(kind):
                    write(pack)
                    self.assertEqual(all_commands(), expected)
                    self.assertEqual(run("--json", "-", log=pack(logs[0])).stdout, run("--json", "-", log=logs[0]).stdout)

    def test_of_several_members_are_read_as_one(self):
        log = host_log("demo")
        for kind, pack in PACKERS.items():
            with self.subTest(kind):
                self.assertEqual(report(pack(log[:5000]) + pack(log[5000:])), report(log))

    def test_that_are_cut_or_damaged_are_shown_as_far_as_they_unpack_and_are_not_whole(self):
        log = make_log.big(1000).bytes()
        for kind, pack in PACKERS.items():
            packed = pack(log)
            for size in (len(packed) // 2, len(packed) - 1):
                with self.subTest(f"{size} bytes of {kind}"):
                    document = report(packed[:size])
                    self.assertFalse(document["log"]["complete"])
                    self.assertEqual(document["problems"][0]["kind"], "log-cut")
                    self.assertRegex(document["problems"][0]["cause"], r"^the compressed file is cut off or damaged "
                                     r"\(.+\): the report holds what could be unpacked$")
                    self.assertGreater(document["log"]["bytes"], len(log) / 4)
                    self.assertLessEqual(document["log"]["bytes"], len(log))
            with self.subTest(f"the beginning of {kind}"):
                done = run("-", log=packed[:20])
                self.assertEqual((done.returncode, done.stdout), (2, b""))
                self.assertRegex(done.stderr.decode(), r"^morvane-view: -: the compressed file is cut off or damaged "
                                                       r"\(.+\): nothing of it could be unpacked\n$")

    def test_that_unpack_to_much_more_than_a_log_does_are_given_up(self):
        log = host_log("demo")
        with tempfile.NamedTemporaryFile() as bomb:
            with subprocess.Popen(["zstd", "-q"], stdin=subprocess.PIPE, stdout=bomb) as zstd:
                for _ in range(2**30 // len(log)):
                    zstd.stdin.write(log)
            done = run(bomb.name)
        self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (
            2, b"", f"morvane-view: {bomb.name}: unpacks to thousands of times its size, which no log does; it is not "
                    "read further\n"))

    def test_of_something_else_are_no_logs(self):
        for kind, pack in PACKERS.items():
            with self.subTest(kind):
                done = run("-", log=pack(b"something else\n" * 100))
                self.assertEqual((done.returncode, done.stderr), (2, b"morvane-view: -: is not a Morvane log\n"))
                done = run("-", log=pack(b""))
                self.assertEqual((done.returncode, done.stderr), (2, b"morvane-view: -: the log is empty\n"))

    def test_are_not_replaced_by_a_page(self):
        for kind, pack in PACKERS.items():
            with self.subTest(kind), tempfile.TemporaryDirectory() as folder:
                path = Path(folder) / "page.html"
                path.write_bytes(pack(host_log("demo")))
                done = run("--html", path, "-", log=host_log("demo"))
                self.assertEqual((done.returncode, done.stderr.decode()), (
                    2, f"morvane-view: {path}: is a Morvane log; name another file to write to\n"))


class Report(unittest.TestCase):
    def test_a_healthy_host_has_no_problem_and_counts_paths_by_lun(self):
        document = report(make_log.healthy().bytes())
        self.assertEqual([p for p in document["problems"] if p["severity"] == "problem"], [])
        self.assertEqual([(lun["pathCount"], lun["unique"]) for lun in document["luns"]], [(4, True)] * 3 + [(1, True)])
        self.assertEqual(document["host"], "hosta")

    def test_each_trouble_is_named_with_its_cause(self):
        document = report(make_log.troubled().bytes())
        self.assertEqual([(p["kind"], p["subject"]) for p in document["problems"] if p["severity"] == "problem"], [
            ("lun-unnamed", "LUN 1"),
            ("lun-dropped", "/dev/sdc"),
            ("lun-dropped", "/dev/sde (LUN 4 of target 52:00:00:00:00:00:00:01)"),
            ("lun-left-out", "/dev/sdd"),
            ("lun-left-out", "/dev/sdf"),
            ("adapter-failed", "acme-a8-1"),
            ("adapter-failed", "acme-a8-4"),
            ("device-ignored", "/dev/sdk"),
            ("inquiry-failed", "/dev/sdj (LUN 0 of iqn.2003-01.org.example:disk1)"),
            ("device-unsupported", "/dev/sdz"),
            ("tree-ended", "LOGICAL"),
            ("identifier-not-unique", "ACME:BOX:1.0:x"),
            ("identifier-not-unique", "0" * 32),
        ])
        causes = {p["subject"]: p["cause"] for p in document["problems"]}
        self.assertEqual(causes["/dev/sdc"], "dropped: reading page 0x83 timed out")
        self.assertEqual(causes["/dev/sr0"],
                         "not reported: its device type is neither disk nor storage array controller")

    def test_bytes_that_are_no_text_are_escaped(self):
        text = run("-", log=make_log.troubled().bytes()).stdout
        self.assertNotIn(b"\x1b", text)
        self.assertIn(rb"naa\x1B[31m\xE9\\5000C500", text)

    def test_a_cut_log_is_read_up_to_the_cut_wherever_it_is(self):
        log = make_log.troubled().bytes()
        for end in range(100, log.index(b"\t\t\t   END "), 97):
            with self.subTest(end=end):
                document = report(log[:end])
                self.assertEqual(document["log"]["complete"], False)
                self.assertIn("log-cut", [p["kind"] for p in document["problems"]])

    def test_unknown_lines_are_counted_and_named(self):
        log = make_log.healthy().bytes().replace(b"Number of adapters: 2\n", b"Number of adapters: 2\nwhat is this\n")
        done = run("--json", "-", log=log)
        self.assertEqual(json.loads(done.stdout)["log"]["unknown"]["count"], 1)
        self.assertIn(b"1 piece is none of Morvane's texts:", done.stderr)
        self.assertIn(b": what is this\n", done.stderr)

    def test_of_two_runs_the_last_is_reported_and_leftovers_are_not(self):
        old, new = make_log.troubled("old").bytes(), make_log.healthy("new").bytes()
        document = report(old + new)
        self.assertEqual((document["host"], document["log"]["runs"], len(document["luns"])), ("new", 2, 4))
        document = report(new + old[len(old) // 2:])
        self.assertEqual((document["host"], document["log"]["runs"], len(document["luns"])), ("new", 1, 4))
        self.assertGreater(document["log"]["leftoverTexts"], 0)


class Diff(unittest.TestCase):
    def compare(self, before, after):
        with tempfile.TemporaryDirectory() as folder:
            old, new = Path(folder, "old"), Path(folder, "new")
            old.write_bytes(before)
            new.write_bytes(after)
            done = run("diff", "--json", old, new)
        document = valid(done.stdout)
        return done.returncode, document

    def test_a_renamed_device_is_no_difference(self):
        status, document = self.compare(make_log.healthy().bytes(), make_log.healthy(first_disk=30).bytes())
        self.assertEqual((status, document["same"]), (0, True))

    def test_another_lun_behind_the_same_place_is_dangerous(self):
        before = make_log.healthy().bytes()
        other = b"600A0B80000000000000000000000999"
        after = before.replace(b"600A0B80000000000000000000000001", other)
        status, document = self.compare(before, after)
        self.assertEqual(status, 1)
        self.assertEqual({(c["before"], c["after"], c["dangerous"]) for c in document["identityChanges"]},
                         {("600A0B80000000000000000000000001", other.decode(), True)})
        self.assertEqual((len(document["identityChanges"]), document["lostPaths"]), (4, []))

    def test_luns_of_one_fcp_lun_are_told_apart_by_the_numbers_of_the_host(self):
        before = re.sub(rb"fcplun 0\w+", b"fcplun 00", make_log.healthy().bytes())
        first = rb"\|  \|  \|  \|_ lun name \S+ luid 600A0B80000000000000000000000000 .*\n"
        last = rb"(\|  \|  \|  \|_ lun name \S+) luid 600A0B80000000000000000000000002 "
        after = re.sub(first, b"", re.sub(last, rb"\1 luid 600A0B80000000000000000000000009 ", before))
        status, document = self.compare(before, after)
        self.assertEqual((status, len(document["lostPaths"])), (1, 4))
        self.assertEqual({(c["before"][-1], c["after"][-1]) for c in document["identityChanges"]}, {("2", "9")})

    def test_a_lost_adapter_shows_as_lost_paths_and_smaller_counts(self):
        before = make_log.healthy().bytes()
        start = before.index(b"Going to open Adapter #1")
        end = before.index(b"Time values", start)
        status, document = self.compare(before, before[:start] + before[end:])
        self.assertEqual((status, len(document["lostPaths"]), document["newPaths"]), (1, 6, []))
        self.assertEqual([(c["before"], c["after"]) for c in document["pathCounts"]], [(4, 2)] * 3)


    def test_a_tree_that_an_error_ended_is_said(self):
        before = make_log.healthy().bytes()
        start = before.index(b"Entered Function printDeviceTree")
        end = before.index(b"Left Function BuildIscsiTree_Linux")
        failure = b"Caught exception while building ISCSI tree: Write failed\n\n"
        status, document = self.compare(before, before[:start] + failure + before[end:])
        self.assertEqual((status, len(document["lostPaths"])), (1, 1))
        self.assertEqual(document["warnings"], [
            "the new log's ISCSI tree was ended early: what it does not list counts as lost"])

    def test_a_log_without_its_beginning_or_its_end_is_said(self):
        log = make_log.healthy().bytes()
        warning = " is not whole: what it does not reach counts as lost"
        for cut in (log[200:], log[:-200]):
            self.assertIn("the old log" + warning, self.compare(cut, log)[1]["warnings"])
            self.assertIn("the new log" + warning, self.compare(log, cut)[1]["warnings"])

    def test_two_hosts_are_told_apart_by_name_or_by_initiators(self):
        one, other = make_log.healthy("one").bytes(), make_log.healthy("other").bytes()
        self.assertEqual(self.compare(one, other)[1]["warnings"], ["the logs are of two hosts: one and other"])
        self.assertEqual(self.compare(one, one)[1]["warnings"], [])
        nameless = re.sub(rb"^--------> .*\n", b"", one, flags=re.M)
        self.assertEqual(self.compare(one, nameless)[1]["warnings"], [])
        foreign = nameless.replace(b"wwpn 10:00", b"wwpn 10:ff").replace(b"iqn.1993", b"iqn.2093")
        self.assertEqual(self.compare(one, foreign)[1]["warnings"],
                         ["the logs have no initiator in common: they may be of two hosts"])


class San(unittest.TestCase):
    def test_luns_are_joined_over_hosts(self):
        with tempfile.TemporaryDirectory() as folder:
            logs = []
            for host in ("alpha", "beta"):
                logs.append(Path(folder, host))
                logs[-1].write_bytes(make_log.healthy(host).bytes())
            logs.append(Path(folder, "gamma"))
            logs[-1].write_bytes(make_log.troubled("gamma").bytes())
            done = run("san", "--json", *logs)
        document = valid(done.stdout)
        seen = {lun["identifier"]: lun for lun in document["luns"]}
        self.assertEqual(seen["600A0B80000000000000000000000001"]["hosts"],
                         [{"host": "alpha", "pathCount": 4}, {"host": "beta", "pathCount": 4}])
        self.assertEqual(seen["600601604B2A1E00AAAAAAAAAAAAAA01"]["hosts"], [{"host": "gamma", "pathCount": 1}])
        self.assertEqual([i for i, lun in seen.items() if lun["notUnique"]], ["0" * 32, "ACME:BOX:1.0:x"])


class Colour(unittest.TestCase):
    def shown_on_terminal(self, **environment):
        """What the program writes on a terminal."""
        ours, theirs = pty.openpty()
        with tempfile.TemporaryDirectory() as folder, open(ours, "rb", buffering=0) as terminal:
            log = Path(folder, "log")
            log.write_bytes(host_log("das-naa"))
            subprocess.run([PROGRAM, log], stdout=theirs, check=True, timeout=60,
                           env={key: value for key, value in os.environ.items() if key != "NO_COLOR"} | environment)
            os.close(theirs)
            shown = b""
            while True:
                try:
                    shown += terminal.read(4096)
                except OSError:  # nothing more: the other end is closed
                    return shown

    def test_is_for_terminals_only_and_not_where_the_user_wants_none(self):
        self.assertIn(b"\x1b[32mNo problems.\x1b[0m", self.shown_on_terminal())
        self.assertIn(b"\x1b[", self.shown_on_terminal(NO_COLOR=""))
        self.assertNotIn(b"\x1b", self.shown_on_terminal(NO_COLOR="1"))
        self.assertNotIn(b"\x1b", run("-", log=host_log("das-naa")).stdout)


class Evidence(unittest.TestCase):
    """What is read is never written over, and one bad log costs no other."""

    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = Path(temporary.name)
        self.log = make_log.healthy().bytes()
        (self.folder / "MorvaneLogs").mkdir()
        self.place = self.folder / "MorvaneLogs" / "Morvane.log"
        self.place.write_bytes(self.log)

    def refused(self, message, *arguments):
        before = sorted(path.name for path in self.folder.rglob("*"))
        done = run(*arguments, folder=self.folder)
        self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (2, b"", f"morvane-view: {message}\n"))
        self.assertEqual(self.place.read_bytes(), self.log)
        self.assertEqual(sorted(path.name for path in self.folder.rglob("*")), before)

    def test_a_page_does_not_replace_the_log_whose_page_it_is(self):
        self.refused("MorvaneLogs/Morvane.log: is a log that is to be read; name another file to write to",
                     "--html", "MorvaneLogs/Morvane.log")
        (self.folder / "link").symlink_to(self.place)
        self.refused("link: is a log that is to be read; name another file to write to", "--html", "link")

    def test_a_page_does_not_replace_another_log(self):
        other = self.folder / "other.log"
        other.write_bytes(self.log)
        self.refused("other.log: is a Morvane log; name another file to write to", "san", "--html", "other.log",
                     "MorvaneLogs/Morvane.log")
        self.assertEqual(other.read_bytes(), self.log)

    def test_nothing_is_written_where_a_link_of_another_user_leads(self):
        target = self.folder / "another file"
        target.write_text("its text")
        (self.folder / "link").symlink_to(target)
        self.assertEqual(run("--html", "link", folder=self.folder).returncode, 0)  # one's own is a way like any other
        self.assertTrue((self.folder / "link").is_symlink())
        self.assertTrue(target.read_text().endswith("</html>\n"))
        if os.geteuid() != 0:
            self.skipTest("only root can give a link away")
        os.chown(self.folder / "link", 65534, 65534, follow_symlinks=False)
        target.write_text("its text")
        for option in ("--html", "--prometheus"):
            self.refused("link: is a link of another user; name the file that it leads to", option, "link")
            self.assertEqual(target.read_text(), "its text")

    def test_a_page_replaces_an_older_one_whole_or_not_at_all(self):
        page = self.folder / "page.html"
        page.write_text("an older page")
        page.chmod(0o640)
        self.assertEqual(run("--html", page, folder=self.folder).returncode, 0)
        self.assertTrue(page.read_text().endswith("</html>\n"))
        self.assertEqual(page.stat().st_mode & 0o777, 0o640)
        self.assertEqual([path.name for path in self.folder.iterdir() if path.name.startswith("page")], ["page.html"])

    def test_a_page_that_cannot_be_written_leaves_what_was_there(self):
        self.refused("nowhere/page.html: No such file or directory", "--html", "nowhere/page.html")
        full = run("--html", "/dev/full", folder=self.folder)
        self.assertEqual((full.returncode, full.stderr), (2, b"morvane-view: /dev/full: No space left on device\n"))

    def test_many_logs_are_shown_without_the_bad_ones(self):
        (self.folder / "empty.log").write_bytes(b"")
        (self.folder / "text.log").write_bytes(b"nothing that Morvane writes\n" * 3)
        good = run("san", "MorvaneLogs/Morvane.log", folder=self.folder)
        done = run("san", "empty.log", "MorvaneLogs/Morvane.log", "missing.log", "text.log", folder=self.folder)
        self.assertEqual((done.returncode, done.stdout), (2, good.stdout))
        self.assertEqual(done.stderr.decode(), "morvane-view: left out: empty.log: the log is empty\n"
                                               "morvane-view: left out: missing.log: No such file or directory\n"
                                               "morvane-view: left out: text.log: is not a Morvane log\n")
        none = run("san", "empty.log", folder=self.folder)
        self.assertEqual((none.returncode, none.stdout, none.stderr.decode()),
                         (2, b"", "morvane-view: left out: empty.log: the log is empty\n"
                                  "morvane-view: there is no log to show\n"))

    def test_names_of_files_are_escaped_in_messages(self):
        done = run("a\x1b[31mb\nc", folder=self.folder)
        self.assertEqual((done.returncode, done.stderr.decode()),
                         (2, "morvane-view: a\\x1B[31mb\\x0Ac: No such file or directory\n"))

    def test_input_without_an_end_is_given_up(self):
        done = run("/dev/zero")
        self.assertEqual((done.returncode, done.stderr), (2, b"morvane-view: /dev/zero: is not a Morvane log\n"))
        with open("/dev/urandom", "rb") as endless:
            done = subprocess.run([PROGRAM, "-"], stdin=endless, capture_output=True, check=False, timeout=60)
        self.assertEqual((done.returncode, done.stderr), (2, b"morvane-view: -: is not a Morvane log\n"))

    def test_a_log_is_read_across_a_hole_of_nuls(self):
        half = len(self.log) // 2
        (self.folder / "hole.log").write_bytes(self.log[:half] + bytes(3 << 20) + self.log[half:])
        self.assertEqual(run("hole.log", folder=self.folder).returncode, 0)

    def test_a_page_runs_its_own_script_alone(self):
        page = run("--html", "-", "MorvaneLogs/Morvane.log", folder=self.folder).stdout.decode()
        policy = re.search('http-equiv="Content-Security-Policy"\\s+content="([^"]*)"', page)[1]
        for element in ("script", "style"):
            text = re.search(f"<{element}>(.*?)</{element}>", page, re.S)[1].encode()
            digest = base64.b64encode(hashlib.sha256(text).digest()).decode()
            self.assertIn(f"{element}-src 'sha256-{digest}'", policy)
        self.assertTrue(policy.startswith("default-src 'none'; "))


class Errors(unittest.TestCase):
    def test_each_is_one_clear_line_and_status_2(self):
        for log, words in ((b"", b"the log is empty"), (b"hello\nworld\n", b"is not a Morvane log")):
            done = run("-", log=log)
            self.assertEqual((done.returncode, done.stderr, done.stdout), (2, b"morvane-view: -: " + words + b"\n", b""))
        done = run("/nonexistent/log")
        self.assertEqual((done.returncode, done.stderr),
                         (2, b"morvane-view: /nonexistent/log: No such file or directory\n"))
        self.assertEqual(run("diff", "/nonexistent/a", "/nonexistent/b").returncode, 2)
        self.assertEqual(run("--nonsense").returncode, 2)

    def test_what_a_command_would_not_heed_is_refused(self):
        with tempfile.TemporaryDirectory() as folder:
            log = Path(folder, "log")
            log.write_bytes(make_log.healthy().bytes())
            for arguments in (["--html", "x.html", "diff", log, log], ["nosuch.log", "diff", log, log],
                              ["nosuch.log", "san", log, log]):
                done = run(*arguments, folder=folder)
                self.assertEqual((done.returncode, done.stdout), (2, b""), arguments)
                self.assertIn(b" excludes ", done.stderr)
            self.assertEqual(run("--html", "x.html", "san", log, log, folder=folder).returncode, 0)
            self.assertTrue(Path(folder, "x.html").exists())


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1])
