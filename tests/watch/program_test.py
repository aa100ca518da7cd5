#!/usr/bin/python3
"""Runs morvane-watch and checks what it says and keeps. usage: program_test.py MORVANE-VIEW SIMHOST MORVANE"""

import ast
import calendar
import os
import re
import signal
import socket
import struct
import subprocess
import sys
import time
import unittest
from pathlib import Path
from unittest import mock

from support import HOSTS, MORVANE, SIMHOST, WATCH, WatchTest

import make_log
from morvane_watch import journal, settings
from morvane_watch.history import State

SAME, DIFFERENT, TROUBLE, NO_BASELINE = 0, 1, 2, 3
HEALTHY = make_log.healthy("oak").bytes()
NIGHT = calendar.timegm((2015, 11, 21, 2, 0, 0))
DAY = 24 * 3600
LUN = "600A0B80000000000000000000000001"


def without_a_path(log):
    """The log without one path of LUN, which its trace shows still."""
    return re.sub(rb"\|  \|  \|  \|_ lun name \S+ luid %s .*\n" % LUN.encode(), b"", log, count=1)


def without_an_adapter(log):
    """The log as far as the second adapter, and from its end on."""
    start = log.index(b"Going to open Adapter #1")
    return log[:start] + log[log.index(b"Time values", start):]


class Hosts(WatchTest):
    """Morvane itself on simulated hosts."""

    def watch_on(self, description, *arguments):
        host = self.folder / "host.toml"
        host.write_text(description)
        return self.watch(*arguments, wrapper=[SIMHOST, host, "--"])

    def test_a_lost_path_is_told_until_it_is_back_or_accepted(self):
        (self.programs / "morvane").symlink_to(MORVANE)
        demo = (HOSTS / "demo" / "host.toml").read_text()
        lost = demo.replace(', "/dev/sdp"]\n\n', "]\n\n", 1).replace('"sdp", ', "")
        lost = "".join(line for line in lost.splitlines(keepends=True) if "/block/sdp" not in line)
        self.assertEqual(self.watch_on(demo, "run"),
                         (NO_BASELINE, "no baseline: accept one with `morvane-watch accept`\n", ""))
        first = State(self.state).last()["name"]
        self.assertEqual(self.watch("accept"), (SAME, f"{first} is the baseline now\n", ""))
        self.assertEqual(self.watch_on(demo, "run"), (SAME, f"same as the baseline {first}\n", ""))
        told = "".join(["LUN with fewer paths: 60060160B4C02E00DE3A917012E2DD11: was 4, is 3\n"] + [
            f"path lost: 21:0{port}:00:1b:32:0a:9d:12 -> 50:06:01:69:3b:20:1f:a2 LUN 2, /dev/sdp, "
            "60060160B4C02E00DE3A917012E2DD11\n" for port in (0, 1)])
        self.assertEqual(self.watch_on(lost, "run"), (DIFFERENT, f"{told}3 differences from the baseline {first}\n", ""))
        last = State(self.state).last()["name"]
        self.assertEqual(self.watch("status"), (DIFFERENT, f"Last run: {last}\nBaseline: {first}\n{told}"
                                                           f"3 differences from the baseline {first}\n", ""))
        self.assertEqual(self.watch_on(demo, "run"), (SAME, f"same as the baseline {first}\n", ""))
        self.assertEqual(self.watch_on(lost, "run")[0], DIFFERENT)
        last = State(self.state).last()["name"]
        self.assertEqual(self.watch("accept"), (SAME, f"{last} is the baseline now\n", ""))
        self.assertEqual(self.watch_on(lost, "run"), (SAME, f"same as the baseline {last}\n", ""))


class Commands(WatchTest):
    def nights(self, *logs):
        """A run a night from NIGHT on, each with one of the logs; the first log is accepted."""
        for night, log in enumerate(logs):
            self.morvane(log)
            self.watch_at(NIGHT + night * DAY, "run")
            if night == 0:
                self.watch_at(NIGHT, "accept")

    def test_before_the_first_run_each_says_so(self):
        no_baseline = (TROUBLE, "", "morvane-watch: no baseline: accept one with `morvane-watch accept`\n")
        no_run = (TROUBLE, "", "morvane-watch: there is no run yet\n")
        self.assertEqual(self.watch("status"), no_run)
        self.assertEqual(self.watch("show"), no_run)
        self.assertEqual(self.watch("diff"), no_baseline)
        self.assertEqual(self.watch("history"), (SAME, "", ""))
        self.state.mkdir()
        self.assertEqual(self.watch("accept"), no_run)

    def test_history_tells_what_changed_from_each_run_to_the_next(self):
        self.nights(HEALTHY, HEALTHY, without_a_path(HEALTHY), HEALTHY[:5000], HEALTHY)
        self.assertEqual(self.watch("history"), (SAME, (
            "20151121T020000Z    the first; the baseline\n"
            "20151122T020000Z    same\n"
            "20151123T020000Z    path-lost: 1\n"
            "20151124T020000Z    not whole\n"
            "20151125T020000Z    path-new: 1\n"), ""))

    def test_show_and_diff_are_those_of_morvane_view_on_the_logs_that_are_meant(self):
        self.nights(HEALTHY, without_a_path(HEALTHY), HEALTHY)
        first, second, third = (self.history / name for name in self.names())

        def view(*arguments):
            done = subprocess.run([self.programs / "morvane-view", *arguments], capture_output=True, check=False)
            return done.returncode, done.stdout.decode(), done.stderr.decode()

        self.assertEqual(self.watch("show"), view(third))
        self.assertEqual(self.watch("show", "baseline"), view(first))
        self.assertEqual(self.watch("show", "2015-11-22"), view(second))
        self.assertEqual(self.watch("diff"), (SAME, "No difference.\n", ""))
        self.assertEqual(self.watch("diff", "2015-11-22"), view("diff", second, third))
        self.assertEqual(self.watch("diff", "20151122T020000Z", "baseline"), view("diff", second, first))

    def test_a_log_is_meant_by_its_name_its_file_its_day_or_its_time(self):
        self.history.mkdir(parents=True)
        for name in ("20151121T020000Z", "20151121T020000Z_1", "20151121T140500Z", "20151122T020000Z"):
            (self.history / f"{name}.log.zst").touch()
        state = State(self.state)
        for when, name in {
                "20151121T020000Z": "20151121T020000Z",
                "20151121T020000Z_1": "20151121T020000Z_1",
                "20151121T020000Z_1.log.zst": "20151121T020000Z_1",
                "2015-11-21": "20151121T140500Z",
                "2015-11-21T02:00": "20151121T020000Z_1",
                "2015-11-21 02:00:00Z": "20151121T020000Z_1",
                "2015-11-22": "20151122T020000Z"}.items():
            self.assertEqual(state.find(when).name, name)
        for when in ("2015-11-23", "2015-11-21T02", "20151121", "../history", "", "x\x1b[31m"):
            shown = when.replace("\x1b", "\\x1B")
            self.assertEqual(self.watch("show", when),
                             (TROUBLE, "", f"morvane-watch: {shown}: there is no such log in the history\n"))

    def test_an_older_log_can_be_accepted(self):
        self.nights(HEALTHY, without_a_path(HEALTHY))
        self.assertEqual(self.watch("accept", "20151122T020000Z"), (SAME, "20151122T020000Z is the baseline now\n", ""))
        self.assertEqual(self.watch("accept", "2015-11-21"), (SAME, "20151121T020000Z is the baseline now\n", ""))
        self.assertEqual(os.readlink(self.state / "baseline"), "history/20151121T020000Z.log.zst")

    def test_a_command_line_that_makes_no_sense_is_trouble(self):
        self.assertEqual(self.watch(), (TROUBLE, "", "usage: morvane-watch [-h] COMMAND ...\n"))
        self.assertEqual(self.watch("nonsense")[0], TROUBLE)

    def test_output_that_nobody_reads_ends_it(self):
        self.nights(HEALTHY)
        reader, writer = os.pipe()
        os.close(reader)
        done = subprocess.run([WATCH / "morvane-watch", "history"], env=self.environment, stdout=writer,
                              stderr=subprocess.PIPE, check=False, timeout=60)
        os.close(writer)
        self.assertEqual((done.returncode, done.stderr), (TROUBLE, b""))


class Runs(WatchTest):
    """Runs that do not go as they should."""

    def test_a_run_that_fails_keeps_its_log_which_never_becomes_the_baseline(self):
        self.morvane(HEALTHY, "printf 'morvane: no\\033[1m space\\n' >&2; exit 1")
        said = "the log is not whole: morvane ended with status 1; morvane: no\\x1B[1m space"
        self.assertEqual(self.watch_at(NIGHT, "run"), (TROUBLE, f"{said}\n"))
        self.assertEqual(self.names(), ["20151121T020000Z.incomplete.log.zst"])
        self.assertEqual(self.watch("accept"),
                         (TROUBLE, "", "morvane-watch: 20151121T020000Z is not whole: it cannot be the baseline\n"))
        self.assertEqual(self.watch("status"),
                         (TROUBLE, f"Last run: 20151121T020000Z\nTrouble: {said}\n"
                                   "No baseline: accept one with `morvane-watch accept`\n", ""))

    def test_a_log_that_is_cut_off_is_not_whole_whatever_morvane_says(self):
        self.morvane(HEALTHY[:5000])
        self.assertEqual(self.watch_at(NIGHT, "run"), (TROUBLE, "the log is not whole: it is cut off\n"))
        self.assertEqual(self.names(), ["20151121T020000Z.incomplete.log.zst"])

    def test_a_log_that_is_none_is_kept_and_told(self):
        self.morvane(b"nothing that Morvane writes\n" * 9)
        self.assertEqual(self.watch_at(NIGHT, "run"), (TROUBLE, (
            f"the log is not whole: morvane-view: {self.log_in_run}: is not a Morvane log\n")))
        self.assertEqual(self.names(), ["20151121T020000Z.incomplete.log.zst"])

    def test_a_run_without_a_log_says_why(self):
        self.morvane(HEALTHY)
        self.watch_at(NIGHT, "run")
        for script, said in {
                "echo 'morvane: ./MorvaneLogs: Permission denied' >&2; exit 1":
                    "morvane ended with status 1; morvane: ./MorvaneLogs: Permission denied",
                "kill -SEGV $$": "morvane ended with signal 11",
                "exit 0": "morvane left no log",
                "mkdir -p MorvaneLogs; : >MorvaneLogs/Morvane.log": "morvane left no log"}.items():
            self.program("morvane", script)
            self.assertEqual(self.watch_at(NIGHT + DAY, "run"), (TROUBLE, f"{said}\n"))
            self.assertEqual(self.watch("status")[1].splitlines()[:2], ["Last run: 20151122T020000Z", f"Trouble: {said}"])
        self.assertEqual(self.names(), ["20151121T020000Z.log.zst"])

    def test_without_morvane_morvane_view_or_zstd_it_says_which_is_missing(self):
        self.environment["PATH"] = str(self.programs)
        self.assertEqual(self.watch("run"), (TROUBLE, "morvane: No such file or directory\n", ""))
        self.program("morvane", "/bin/mkdir -p MorvaneLogs; echo x >MorvaneLogs/Morvane.log")
        (self.programs / "morvane-view").unlink()
        self.assertEqual(self.watch("run"), (TROUBLE, (
            f"zstd: No such file or directory; the log stays in {self.log_in_run}\n"
            "the log is not whole: morvane-view: No such file or directory\n"), ""))

    def test_a_run_that_takes_too_long_is_ended_with_all_that_it_started(self):
        (self.folder / "watch.conf").write_text("timeout = 1\n")
        self.morvane(HEALTHY[:5000], "sleep 1000 & echo $! >child; trap '' TERM; sleep 1000 & wait; wait")
        began = time.monotonic()
        self.assertEqual(self.watch_at(NIGHT, "run"),
                         (TROUBLE, "the log is not whole: morvane did not end within 1 seconds\n"))
        self.assertLess(time.monotonic() - began, 20)
        self.assertEqual(self.names(), ["20151121T020000Z.incomplete.log.zst"])
        child = int((self.state / "run" / "child").read_text())
        self.assertFalse(is_running(child))

    def test_a_run_that_is_ended_ends_morvane(self):
        self.morvane(HEALTHY[:5000], "sleep 1000 & echo $! >child.new; mv child.new child; wait")
        run = subprocess.Popen([WATCH / "morvane-watch", "run"], env=self.environment, stdout=subprocess.DEVNULL)
        child = self.state / "run" / "child"
        wait_until(child.exists)
        self.assertEqual(self.watch("run"), (TROUBLE, f"{self.state}: another run is under way\n", ""))
        self.assertEqual(self.watch("accept"), (TROUBLE, "", f"morvane-watch: {self.state}: another run is under way\n"))
        run.send_signal(signal.SIGTERM)
        self.assertEqual(run.wait(20), TROUBLE)
        wait_until(lambda: not is_running(int(child.read_text())))
        self.morvane(HEALTHY)
        status, said, _ = self.watch("run")
        incomplete, whole = self.names()
        self.assertRegex(incomplete, r"^\w+\.incomplete\.log\.zst$")
        self.assertRegex(whole, r"^\w+\.log\.zst$")
        self.assertEqual((status, said), (NO_BASELINE, (
            f"an earlier run's log was still to be kept; it is in the history now: {incomplete.split('.')[0]}\n"
            "no baseline: accept one with `morvane-watch accept`\n")))

    def test_runs_of_one_second_have_names_of_their_own(self):
        self.morvane(HEALTHY)
        for _ in range(3):
            self.watch_at(NIGHT, "run")
        self.assertEqual([archive.name for archive in State(self.state).archives()],
                         ["20151121T020000Z", "20151121T020000Z_1", "20151121T020000Z_2"])
        self.assertEqual(State(self.state).last()["name"], "20151121T020000Z_2")

    def test_a_name_that_is_taken_is_left_to_its_owner(self):
        self.morvane(HEALTHY)
        self.history.mkdir(parents=True)
        (self.history / "20151121T020000Z.log.zst").symlink_to("elsewhere")
        (self.history / "20151121T020000Z_1.log.zst").mkdir()
        (self.history / "20151121T020000Z_2.incomplete.log.zst").touch()
        self.watch_at(NIGHT, "run")
        self.assertEqual(self.names(), ["20151121T020000Z.log.zst", "20151121T020000Z_1.log.zst",
                                        "20151121T020000Z_2.incomplete.log.zst", "20151121T020000Z_3.log.zst"])
        self.assertEqual(State(self.state).last()["name"], "20151121T020000Z_3")

    def test_a_log_that_does_not_fit_into_the_history_is_kept_where_it_is_and_no_run_writes_over_it(self):
        self.morvane(HEALTHY)
        self.watch("run")
        self.watch("accept")
        baseline, = self.history.iterdir()
        pages = baseline.stat().st_size // 4096 + 1
        (self.folder / "kept").mkdir()
        os.link(baseline, self.folder / "kept" / baseline.name)
        full = ["unshare", "--mount", "sh", "-c", f"""mount -t tmpfs -o size={pages * 4096} none '{self.history}' &&
            cp '{self.folder}'/kept/* '{self.history}' && exec "$@" """, "sh"]
        self.morvane(without_a_path(HEALTHY))
        status, said, _ = self.watch("run", wrapper=full)
        lines = said.splitlines()
        self.assertRegex(lines.pop(0), f"^zstd: .*No space left on device.*; the log stays in {self.log_in_run}$")
        self.assertEqual((status, lines), (TROUBLE, [
            f"path lost: 10:00:00:00:00:00:00:00 -> 52:00:00:00:00:00:00:00 LUN 1, /dev/sdc, {LUN}",
            f"1 difference from the baseline {baseline.name.split('.')[0]}"]))
        self.assertEqual(self.log_in_run.read_bytes(), without_a_path(HEALTHY))
        self.morvane(HEALTHY)
        status, said, _ = self.watch("run", wrapper=full)
        self.assertEqual(status, TROUBLE)
        self.assertRegex(said, "^zstd: .*No space left on device.*; an earlier run's log stays in "
                               f"{self.log_in_run}, and Morvane is not run\n$")
        self.assertEqual(self.log_in_run.read_bytes(), without_a_path(HEALTHY))
        self.assertEqual(self.watch("run")[0], SAME)
        self.assertEqual([archive.is_whole for archive in State(self.state).archives()], [True] * 3)

    def test_a_history_that_cannot_be_written_is_told(self):
        self.state.mkdir()
        self.history.touch()
        self.morvane(HEALTHY)
        self.assertEqual(self.watch("run"),
                         (TROUBLE, f"{self.history}: Not a directory; the log stays in {self.log_in_run}\n"
                                   "no baseline: accept one with `morvane-watch accept`\n"
                                   f"{self.history}: Not a directory\n", ""))
        self.assertEqual(self.log_in_run.read_bytes(), HEALTHY)

    def test_a_host_that_was_renamed_is_told_and_compared(self):
        self.morvane(HEALTHY)
        self.watch_at(NIGHT, "run")
        self.watch_at(NIGHT, "accept")
        self.morvane(make_log.healthy("ash").bytes())
        self.assertEqual(self.watch_at(NIGHT + DAY, "run"),
                         (SAME, "warning: the logs are of two hosts: oak and ash\nsame as the baseline 20151121T020000Z\n"))

    def test_wrong_settings_are_told_and_no_log_is_removed(self):
        self.morvane(HEALTHY)
        for day in range(40):
            (self.history).mkdir(parents=True, exist_ok=True)
            (self.history / f"200001{day % 28 + 1:02}T0200{day:02}Z.log.zst").touch()
        (self.folder / "watch.conf").write_text("keep = 1O\n")
        self.assertEqual(self.watch_at(NIGHT, "run"), (TROUBLE, (
            f"{self.folder}/watch.conf, line 1: keep is no whole number from 1 to 100000: 1O; "
            "the default is used, and no log is retired\n"
            "no baseline: accept one with `morvane-watch accept`\n")))
        self.assertEqual(len(self.names()), 41)


class Metrics(WatchTest):
    def setUp(self):
        super().setUp()
        self.file = self.folder / "morvane.prom"
        (self.folder / "watch.conf").write_text(f"metrics = {self.file}\n")

    def value(self, name):
        return re.search(f"^{name} (.*)$", self.file.read_text(), re.M)[1]

    def test_are_those_of_the_log_and_for_all_to_read(self):
        self.morvane(HEALTHY)
        mask = os.umask(0o077)  # the service's
        self.addCleanup(os.umask, mask)
        self.assertEqual(self.watch("run")[0], NO_BASELINE)
        self.assertEqual(self.file.stat().st_mode & 0o777, 0o644)
        self.assertEqual((self.value("morvane_luns"), self.value("morvane_run_complete")), ("4", "1"))
        archive = self.history / self.names()[0]
        self.assertEqual(archive.stat().st_mode & 0o777, 0o600)
        done = subprocess.run([self.programs / "morvane-view", "--prometheus", "-", archive], capture_output=True, check=True)
        self.assertEqual(self.file.read_bytes(), done.stdout)

    def test_of_a_log_that_is_not_whole_say_so(self):
        self.morvane(HEALTHY[:-200])
        self.assertEqual(self.watch("run"), (TROUBLE, "the log is not whole: it is cut off\n", ""))
        self.assertEqual(self.value("morvane_run_complete"), "0")

    def test_that_cannot_be_written_cost_no_log(self):
        (self.folder / "watch.conf").write_text("metrics = /nonexistent/morvane.prom\n")
        self.morvane(HEALTHY)
        self.assertEqual(self.watch_at(NIGHT, "run"), (
            TROUBLE, "morvane-view: /nonexistent/morvane.prom: No such file or directory\n"
                     "no baseline: accept one with `morvane-watch accept`\n"))
        self.assertEqual(self.names(), ["20151121T020000Z.log.zst"])


class BadState(WatchTest):
    """A history in which something is wrong."""

    def setUp(self):
        super().setUp()
        self.morvane(HEALTHY)
        for night in range(3):
            self.watch_at(NIGHT + night * DAY, "run")
        self.watch_at(NIGHT, "accept", "20151121T020000Z")
        self.first, self.second, _ = (self.history / name for name in self.names())

    def test_a_damaged_log_is_named_and_left_out(self):
        self.second.write_bytes(self.second.read_bytes()[:200])
        status, said, _ = self.watch("history")
        lines = said.splitlines()
        self.assertEqual((status, lines[0], lines[2]),
                         (TROUBLE, "20151121T020000Z    the first; the baseline", "20151123T020000Z    same"))
        self.assertRegex(lines[1], f"^20151122T020000Z    left out: morvane-view: {self.second}: ")
        status, _, error = self.watch("accept", "2015-11-22")
        self.assertEqual(status, TROUBLE)
        self.assertRegex(error, f"^morvane-watch: morvane-view: {self.second}: ")

    def test_a_damaged_baseline_is_trouble_and_the_run_is_kept(self):
        self.first.write_bytes(b"\x28\xb5\x2f\xfd" + b"x" * 200)
        status, said = self.watch_at(NIGHT + 3 * DAY, "run")
        self.assertEqual(status, TROUBLE)
        self.assertRegex(said, f"^morvane-view: {self.first}: .*\n$")
        self.assertEqual(len(self.names()), 4)

    def test_a_baseline_that_is_gone_is_told(self):
        self.first.unlink()
        said = "the baseline, history/20151121T020000Z.log.zst, is not in the history any more; accept another"
        self.assertEqual(self.watch_at(NIGHT + 3 * DAY, "run"), (TROUBLE, f"{said}\n"))
        self.assertEqual(self.watch("diff"), (TROUBLE, "", f"morvane-watch: {said}\n"))

    def test_a_baseline_out_of_the_history_is_none(self):
        (self.state / "baseline").unlink()
        (self.state / "baseline").symlink_to("/etc/shadow")
        self.assertEqual(self.watch("show", "baseline"), (TROUBLE, "", (
            "morvane-watch: the baseline, /etc/shadow, is not in the history any more; accept another\n")))

    def test_what_is_not_its_own_is_neither_listed_nor_removed(self):
        (self.folder / "watch.conf").write_text("keep = 1\nweeks = 0\n")
        others = ["notes.txt", "20100101T000000Z.log.zst.orig", "20109999T000000Z.log.zst", "20100101T000000Z_0.log.zst",
                  "x20100101T000000Z.log.zst", "20100101T000000Z.log"]
        for name in others:
            (self.history / name).write_text("mine")
        (self.history / "20100102T000000Z.log.zst").symlink_to("notes.txt")
        (self.history / "20100103T000000Z.log.zst").mkdir()
        os.mkfifo(self.history / "20100104T000000Z.log.zst")
        self.watch_at(NIGHT + 3 * DAY, "run")
        self.assertEqual(self.names(), sorted([
            *others, "20100102T000000Z.log.zst", "20100103T000000Z.log.zst", "20100104T000000Z.log.zst",
            "20151121T020000Z.log.zst", "20151124T020000Z.log.zst"]))
        self.assertEqual(self.watch("history"),
                         (SAME, "20151121T020000Z    the first; the baseline\n20151124T020000Z    same\n", ""))

    def test_a_record_of_the_last_run_that_makes_no_sense_is_none(self):
        for record in ("", "{", "[]", '"x"', "\xff", '{"name": 7}'):
            (self.state / "last").write_bytes(record.encode("latin-1"))
            self.assertEqual(self.watch("show")[0], TROUBLE)
        self.assertEqual(self.watch("status")[0], TROUBLE)

    def test_what_morvane_view_writes_is_not_trusted(self):
        for script, said in {
                "echo '{}'": "what it wrote is not understood; is it as new as morvane-watch?",
                "echo '[['": "what it wrote is not understood; is it as new as morvane-watch?",
                "printf '\\377'": "what it wrote is not understood; is it as new as morvane-watch?",
                "exit 7": "status 7",
                "kill -KILL $$": "status -9"}.items():
            self.program("morvane-view", script)
            self.assertEqual(self.watch("status")[2], f"morvane-watch: morvane-view: {said}\n")

    def test_a_clock_that_was_ahead_makes_logs_that_do_not_count_and_stay(self):
        (self.folder / "watch.conf").write_text("keep = 2\nweeks = 0\n")
        ahead = calendar.timegm((2099, 1, 1, 0, 0, 0))
        self.assertEqual(self.watch_at(ahead, "run"), (SAME, "same as the baseline 20151121T020000Z\n"))
        self.assertEqual(self.names(), ["20151121T020000Z.log.zst", "20151123T020000Z.log.zst", "20990101T000000Z.log.zst"])
        said = ("same as the baseline 20151121T020000Z\n"
                "the clock was turned back: 1 log in the history from after now, the newest 20990101T000000Z; not counted\n")
        for night in (3, 4):
            self.assertEqual(self.watch_at(NIGHT + night * DAY, "run"), (SAME, said))
        self.assertEqual(self.names(), ["20151121T020000Z.log.zst", "20151124T020000Z.log.zst", "20151125T020000Z.log.zst",
                                        "20990101T000000Z.log.zst"])
        self.assertEqual(State(self.state).find("last").name, "20151125T020000Z")
        self.assertEqual(self.watch_at(NIGHT + 5 * DAY, "history")[1].splitlines()[-1],
                         "20990101T000000Z    same; from after now")

    def test_a_clock_that_was_behind_costs_no_log(self):
        (self.folder / "watch.conf").write_text("keep = 3\nweeks = 0\n")
        self.watch_at(0, "run")
        self.assertEqual(self.names(), ["19700101T000000Z.log.zst", "20151121T020000Z.log.zst", "20151122T020000Z.log.zst",
                                        "20151123T020000Z.log.zst"])
        self.assertEqual(State(self.state).find("last").name, "19700101T000000Z")


class Retention(WatchTest):
    def kept_of(self, names, keep, weeks, now, spared=()):
        """What retirement leaves of the names."""
        self.history.mkdir(parents=True)
        for name in names:
            (self.history / f"{name}.log.zst").touch()
        state = State(self.state)
        archives = {archive.name: archive for archive in state.archives()}
        self.assertEqual(state.retire(keep, weeks, now, [archives[name] for name in spared]), [])
        return [archive.name for archive in state.archives()]

    def test_the_newest_and_one_a_week_stay(self):
        nights = [time.strftime("%Y%m%dT%H%M%SZ", time.gmtime(NIGHT - night * DAY)) for night in range(500)]
        kept = self.kept_of(nights, 5, 52, NIGHT)
        mondays = [name for name in sorted(nights) if time.strptime(name[:8], "%Y%m%d").tm_wday == 0]
        self.assertEqual(kept, sorted({*mondays[-52:], *nights[:5]}))

    def test_it_is_the_same_night_after_night(self):
        """Logs that a week keeps are not lost to one of its later nights."""
        self.history.mkdir(parents=True)
        state = State(self.state)
        for night in range(60):
            now = NIGHT + night * DAY
            (self.history / time.strftime("%Y%m%dT%H%M%SZ.log.zst", time.gmtime(now))).touch()
            state.retire(2, 4, now, [])
        self.assertEqual([archive.name for archive in state.archives()], [
            "20151228T020000Z", "20160104T020000Z", "20160111T020000Z", "20160118T020000Z", "20160119T020000Z"])

    def test_logs_that_are_not_whole_stay_among_the_newest_only(self):
        kept = self.kept_of(["20151102T020000Z.incomplete", "20151103T020000Z", "20151120T020000Z.incomplete",
                             "20151121T020000Z"], 2, 52, NIGHT)
        self.assertEqual(kept, ["20151103T020000Z", "20151120T020000Z", "20151121T020000Z"])

    def test_the_spared_stay(self):
        kept = self.kept_of(["20141102T020000Z", "20141103T020000Z", "20151121T020000Z"], 1, 0, NIGHT, ["20141102T020000Z"])
        self.assertEqual(kept, ["20141102T020000Z", "20151121T020000Z"])


class Settings(WatchTest):
    def read(self, text):
        (self.folder / "watch.conf").write_bytes(text)
        read = settings.read(str(self.folder / "watch.conf"))
        return (read.keep, read.weeks, read.timeout, read.metrics), [trouble.replace(f"{self.folder}/", "") for trouble in read.troubles]

    def test_need_no_file_and_the_one_that_is_installed_changes_none(self):
        missing = settings.read(str(self.folder / "none"))
        self.assertEqual(((missing.keep, missing.weeks, missing.timeout, missing.metrics), missing.troubles),
                         ((30, 52, 3600, None), []))
        text = (WATCH / "watch.conf").read_bytes()
        self.assertEqual(self.read(text), ((30, 52, 3600, None), []))
        self.assertEqual(self.read(re.sub(rb"^#(\w+ = )", rb"\1", text, flags=re.M)),
                         ((30, 52, 3600, "/var/lib/prometheus/node-exporter/morvane.prom"), []))
        self.assertEqual(re.findall(rb"^#(\w+) = ", text, re.M), [b"keep", b"weeks", b"timeout", b"metrics"])

    def test_are_taken_from_the_file(self):
        self.assertEqual(self.read(b"keep=1 # few\n\n  weeks = 0\n# timeout = 2\ntimeout = 7200\nmetrics = /x y/z.prom"),
                         ((1, 0, 7200, "/x y/z.prom"), []))

    def test_that_are_wrong_are_named_and_have_their_defaults(self):
        self.assertEqual(self.read(b"keep = 0\nweeks = -1\ntimeout = 7201\nkepp = 3\nkeep\n = 4\n\xff = \x1b\nkeep = 10000000000\n"
                                   b"weeks = \xd9\xa3\nmetrics = x.prom\nmetrics = /x/.prom\nmetrics = /x/y.txt\nmetrics =\n"),
                         ((30, 52, 3600, None), [
            "watch.conf, line 1: keep is no whole number from 1 to 100000: 0",
            "watch.conf, line 2: weeks is no whole number from 0 to 5200: -1",
            "watch.conf, line 3: timeout is no whole number from 1 to 7200: 7201",
            "watch.conf, line 4: there is no setting kepp",
            "watch.conf, line 5: keep is no whole number from 1 to 100000: ",
            "watch.conf, line 6: there is no setting without a name",
            "watch.conf, line 7: there is no setting \\xFF",
            "watch.conf, line 8: keep is no whole number from 1 to 100000: 10000000000",
            "watch.conf, line 9: weeks is no whole number from 0 to 5200: ٣",
            "watch.conf, line 10: metrics is no path from / to a file NAME.prom: x.prom",
            "watch.conf, line 11: metrics is no path from / to a file NAME.prom: /x/.prom",
            "watch.conf, line 12: metrics is no path from / to a file NAME.prom: /x/y.txt",
            "watch.conf, line 13: metrics is no path from / to a file NAME.prom: ",
        ]))

    def test_that_cannot_be_read_are_told(self):
        self.assertEqual(settings.read(str(self.folder)).troubles, [f"{self.folder}: Is a directory"])
        self.assertEqual(settings.read("/dev/zero").troubles, ["/dev/zero: is longer than 4096 bytes"])


class Journal(WatchTest):
    def received(self, when, *arguments):
        """The entries that a journal gets while morvane-watch runs, as the bytes of each field."""
        place = self.folder / "journal"
        with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as receiver:
            receiver.bind(str(place))
            receiver.setblocking(False)
            with mock.patch("morvane_watch.journal.SOCKET", str(place)):
                self.watch_at(when, *arguments)
            entries = []
            while True:
                try:
                    entries.append(decoded(receiver.recv(1 << 20)))
                except BlockingIOError:
                    place.unlink()
                    return entries

    def test_gets_an_entry_for_each_difference_and_one_for_the_outcome(self):
        self.morvane(HEALTHY)
        outcome = {b"MESSAGE_ID": b"3a21d48e3dad428cae7b2edd69296260", b"SYSLOG_IDENTIFIER": b"morvane-watch"}
        difference = {**outcome, b"MESSAGE_ID": b"492a91bd84ba40f09ff6735d3d6d6173"}
        self.assertEqual(self.received(NIGHT, "run"), [
            {**outcome, b"MESSAGE": b"no baseline: accept one with `morvane-watch accept`", b"PRIORITY": b"4",
             b"MORVANE_KIND": b"no-baseline", b"MORVANE_LOG": b"20151121T020000Z"}])
        self.assertEqual(self.received(NIGHT, "accept"), [
            {**outcome, b"MESSAGE": b"20151121T020000Z is the baseline now", b"PRIORITY": b"5",
             b"MORVANE_KIND": b"accepted", b"MORVANE_BASELINE": b"20151121T020000Z"}])
        self.morvane(without_an_adapter(HEALTHY))
        logs = {b"MORVANE_LOG": b"20151122T020000Z", b"MORVANE_BASELINE": b"20151121T020000Z"}
        lun = b"600A0B80000000000000000000000000"
        initiator, target = b"10:00:00:00:00:00:00:01", b"52:00:00:00:00:00:00:10"
        path = initiator + b" -> " + target + b" LUN 0"
        entries = self.received(NIGHT + DAY, "run")
        self.assertEqual([entry[b"MORVANE_KIND"] for entry in entries],
                         [b"lun-fewer-paths"] * 3 + [b"path-lost"] * 6 + [b"different"])
        self.assertEqual([entries[0], entries[3], entries[-1]], [
            {**difference, **logs, b"MESSAGE": b"LUN with fewer paths: " + lun + b": was 4, is 2", b"PRIORITY": b"3",
             b"MORVANE_KIND": b"lun-fewer-paths", b"MORVANE_LUN": lun, b"MORVANE_BEFORE": b"4", b"MORVANE_AFTER": b"2"},
            {**difference, **logs, b"MESSAGE": b"path lost: " + path + b", /dev/sdh, " + lun, b"PRIORITY": b"3",
             b"MORVANE_KIND": b"path-lost", b"MORVANE_LUN": lun, b"MORVANE_PATH": path, b"MORVANE_DEVICE": b"/dev/sdh",
             b"MORVANE_TREE": b"fc", b"MORVANE_INITIATOR": initiator, b"MORVANE_TARGET": target},
            {**outcome, **logs, b"MESSAGE": b"9 differences from the baseline 20151121T020000Z", b"PRIORITY": b"3",
             b"MORVANE_KIND": b"different"}])
        self.morvane(HEALTHY, "exit 1")
        self.assertEqual(self.received(NIGHT + 2 * DAY, "run"), [
            {**outcome, b"MESSAGE_ID": b"f7b9494f818041f5893e0d0db8e1abaa", b"PRIORITY": b"3", b"MORVANE_KIND": b"trouble",
             b"MESSAGE": b"the log is not whole: morvane ended with status 1", b"MORVANE_LOG": b"20151123T020000Z"}])

    def test_another_lun_behind_a_path_is_the_worst(self):
        self.morvane(HEALTHY)
        self.watch_at(NIGHT, "run")
        self.watch_at(NIGHT, "accept")
        other = LUN[:-2] + "99"
        self.morvane(HEALTHY.replace(b"luid " + LUN.encode(), b"luid " + other.encode()))
        entries = self.received(NIGHT + DAY, "run")
        changed = [entry for entry in entries if entry[b"MORVANE_KIND"] == b"identity-changed"]
        self.assertEqual([(entry[b"PRIORITY"], entry[b"MORVANE_LUN"], entry[b"MORVANE_BEFORE"], entry[b"MORVANE_AFTER"],
                           entry[b"MESSAGE"]) for entry in changed],
                         [(b"2", other.encode(), LUN.encode(), other.encode(),
                           b"another LUN behind the same path: " + entry[b"MORVANE_PATH"] + b", " + entry[b"MORVANE_DEVICE"] +
                           f": was {LUN}, is {other}".encode()) for entry in changed])
        self.assertEqual(len(changed), 4)

    def test_of_very_many_differences_the_first_thousand_are_told(self):
        self.morvane(HEALTHY)
        self.watch_at(NIGHT, "run")
        self.watch_at(NIGHT, "accept")
        self.program("morvane-view", """case $1 in
            diff) python3 -c 'import json; print(json.dumps({"warnings": [], "powerPath": None, "lostDirect": [
                {"device": "/dev/sd%d" % i, "identifier": None} for i in range(5000)], **{name: [] for name in (
                "identityChanges", "pathCounts", "lostPaths", "newPaths", "newDirect", "lostLogical", "newLogical")}}))' ;;
            *) echo '{"log": {"complete": true, "beginsInside": false}}' ;;
            esac""")
        status, said = self.watch_at(NIGHT + DAY, "run")
        lines = said.splitlines()
        self.assertEqual((status, len(lines), lines[0], lines[999], lines[1000]), (
            DIFFERENT, 1001, "direct disk lost: /dev/sd0", "direct disk lost: /dev/sd999",
            "5000 differences from the baseline 20151121T020000Z"))

    def test_values_hold_any_byte_and_are_bounded(self):
        self.assertEqual(journal.encode({"MESSAGE": "a\nB=c\0\udcff", "PRIORITY": 3}),
                         b"MESSAGE\n" + struct.pack("<Q", 7) + b"a\nB=c\0\xff\nPRIORITY\n" + struct.pack("<Q", 1) + b"3\n")
        self.assertEqual(len(decoded(journal.encode({"MESSAGE": "x" * 1000000}))[b"MESSAGE"]), 8192)

    def test_that_is_the_output_gets_each_line_once(self):
        status = os.fstat(1)
        for stream, is_output in ((f"{status.st_dev}:{status.st_ino}", True), ("1:1", False), ("", False)):
            with mock.patch.dict(os.environ, JOURNAL_STREAM=stream):
                self.assertEqual(journal.is_output(1), is_output)


class Sources(unittest.TestCase):
    def test_are_python_3_6(self):
        for source in [WATCH / "morvane-watch", *WATCH.glob("morvane_watch/*.py")]:
            ast.parse(source.read_text(), feature_version=(3, 6))


def decoded(datagram):
    """The fields of an entry."""
    fields = {}
    while datagram:
        name, _, rest = datagram.partition(b"\n")
        length, = struct.unpack("<Q", rest[:8])
        assert name not in fields and rest[8 + length:9 + length] == b"\n", datagram
        fields[name] = rest[8:8 + length]
        datagram = rest[9 + length:]
    return fields


def is_running(process):
    try:
        return Path(f"/proc/{process}/stat").read_text().split()[2] != "Z"
    except FileNotFoundError:
        return False


def wait_until(condition):
    end = time.monotonic() + 20
    while not condition():
        assert time.monotonic() < end
        time.sleep(0.05)


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[4:]])
