#!/usr/bin/python3
"""Runs the plugin of supportconfig with programs that stand in for Morvane."""

import os
import signal
import subprocess
import tempfile
import time
import unittest
from pathlib import Path

PLUGIN = Path(__file__).resolve().parents[2] / "support" / "supportconfig"


class Plugin(unittest.TestCase):
    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = Path(temporary.name)
        self.programs = self.folder / "programs"
        self.programs.mkdir()
        self.temporary = self.folder / "tmp"
        self.temporary.mkdir()
        self.environment = {"PATH": f"{self.programs}:/usr/bin:/bin", "TMPDIR": str(self.temporary)}

    def morvane(self, script):
        (self.programs / "morvane").write_text(f"#!/bin/sh\n{script}\n")
        (self.programs / "morvane").chmod(0o755)

    def start(self):
        return subprocess.Popen([PLUGIN], cwd=self.folder, env=self.environment, stdout=subprocess.PIPE,
                                stderr=subprocess.PIPE)

    def run_to_its_end(self):
        plugin = self.start()
        output, error = plugin.communicate(timeout=60)
        self.assertEqual(os.listdir(self.temporary), [])
        self.assertEqual(sorted(os.listdir(self.folder)), ["programs", "tmp"])
        return plugin.returncode, output, error

    def written(self, said, log):
        return (b"#==[ Command ]======================================#\n# %s/morvane\n%s\n"
                b"#==[ Log File ]=====================================#\n# MorvaneLogs/Morvane.log\n%s"
                % (os.fsencode(self.programs), said, log))

    def test_writes_what_morvane_says_and_its_log_byte_for_byte(self):
        log = bytes(range(256)) * 4096
        (self.programs / "log").write_bytes(log)
        self.morvane(f"mkdir MorvaneLogs; cp {self.programs}/log MorvaneLogs/Morvane.log; echo 'Test completed.'; echo oh >&2")
        self.assertEqual(self.run_to_its_end(), (0, self.written(b"Test completed.\noh\n", log), b""))

    def test_ends_as_morvane_did_with_the_log_as_far_as_it_goes(self):
        self.morvane("mkdir MorvaneLogs; printf part >MorvaneLogs/Morvane.log; echo full >&2; exit 1")
        self.assertEqual(self.run_to_its_end(), (1, self.written(b"full\n", b"part"), b""))

    def test_says_so_when_there_is_no_log(self):
        self.morvane("echo why >&2; exit 1")
        self.assertEqual(self.run_to_its_end(), (1, self.written(b"why\n", b""), (
            b"cat: MorvaneLogs/Morvane.log: No such file or directory\n")))

    def test_without_morvane_there_is_nothing_to_do(self):
        self.assertEqual(self.run_to_its_end(), (111, b"", b""))

    def test_that_is_ended_ends_morvane_and_leaves_nothing(self):
        for number in (signal.SIGTERM, signal.SIGINT, signal.SIGHUP):
            self.morvane(f"mkdir MorvaneLogs; echo $$ >{self.programs}/process.new; "
                         f"mv {self.programs}/process.new {self.programs}/process; exec sleep 1000")
            plugin = self.start()
            process = self.programs / "process"
            wait_until(process.exists)
            plugin.send_signal(number)
            self.assertEqual((plugin.wait(20), os.listdir(self.temporary)), (1, []))
            wait_until(lambda: not Path(f"/proc/{process.read_text().strip()}").exists())
            plugin.communicate()
            process.unlink()


def wait_until(condition):
    end = time.monotonic() + 20
    while not condition():
        assert time.monotonic() < end
        time.sleep(0.05)


if __name__ == "__main__":
    unittest.main()
