"""What the tests of morvane-watch share. The test programs are called TEST MORVANE-VIEW SIMHOST MORVANE."""

import contextlib
import io
import os
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path
from unittest import mock

ROOT = Path(__file__).resolve().parents[2]
WATCH = ROOT / "watch"
HOSTS = ROOT / "tests" / "hosts"
VIEW, SIMHOST, MORVANE = (Path(argument).resolve() for argument in sys.argv[1:4])
sys.path[:0] = [str(WATCH), str(ROOT / "tests" / "view")]
sys.dont_write_bytecode = True

from morvane_watch.main import main


class WatchTest(unittest.TestCase):
    """A state folder, a settings file, and a folder of programs that morvane-watch finds first: morvane-view, and a
    morvane that the test describes."""

    maxDiff = None

    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = Path(temporary.name)
        self.state = self.folder / "state"
        self.history = self.state / "history"
        self.log_in_run = self.state / "run" / "MorvaneLogs" / "Morvane.log"
        self.programs = self.folder / "programs"
        self.programs.mkdir()
        (self.programs / "morvane-view").symlink_to(VIEW)
        self.environment = dict(os.environ, PATH=f"{self.programs}:{os.environ['PATH']}", STATE_DIRECTORY=str(self.state),
                                CONFIGURATION_DIRECTORY=str(self.folder))

    def program(self, name, script):
        """Puts a shell script in a program's place."""
        path = self.programs / name
        path.unlink(missing_ok=True)
        path.write_text(f"#!/bin/sh\n{script}\n")
        path.chmod(0o755)

    def morvane(self, log, then="exit 0"):
        """Has morvane write these bytes as its log, and go on with a piece of shell."""
        (self.folder / "log").write_bytes(log)
        self.program("morvane", f"mkdir -p MorvaneLogs && cat '{self.folder}/log' >MorvaneLogs/Morvane.log\n{then}")

    def watch(self, *arguments, wrapper=()):
        """Runs morvane-watch; gives its status and what it wrote on standard output and error."""
        done = subprocess.run([*wrapper, WATCH / "morvane-watch", *arguments], env=self.environment, check=False,
                              stdout=subprocess.PIPE, stderr=subprocess.PIPE, timeout=60)
        return done.returncode, done.stdout.decode(), done.stderr.decode()

    def watch_at(self, when, *arguments):
        """Runs morvane-watch in this process at that time (seconds of the epoch); gives its status and output."""
        output = io.StringIO()
        with mock.patch.dict(os.environ, self.environment), mock.patch("time.time", return_value=float(when)), \
                mock.patch("signal.signal"), contextlib.redirect_stdout(output), contextlib.redirect_stderr(output):
            status = main(list(arguments))
        return status, output.getvalue()

    def names(self):
        """The files of the history."""
        return sorted(path.name for path in self.history.iterdir())
