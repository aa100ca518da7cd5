#!/usr/bin/python3
"""What bash, zsh and fish complete of morvane-view's arguments, each asked as a user does, by keys on a terminal; fish
can be asked for its list. usage: completion_test.py MORVANE-VIEW [unittest arguments]"""

import os
import pty
import select
import shutil
import subprocess
import sys
import tempfile
import time
import unittest
from pathlib import Path

from support import run

PROMPT = b"ready> "
SETTING_UP = {  # before the program's own script: an environment of nothing but what the test gives
    "bash": "PS1='ready> '",
    "zsh": "PROMPT='ready> '; unset zle_bracketed_paste; autoload -Uz compinit; compinit -D -u",
}
SHELLS = {"bash": ["bash", "--norc", "--noprofile", "-i"], "zsh": ["zsh", "-f", "-i"]}


class Completion(unittest.TestCase):
    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.folder = Path(scratch.name)
        self.here = self.folder / "here"  # where the user is
        self.here.mkdir()
        (self.here / "before maintenance.log").touch()
        for shell in ("bash", "zsh", "fish"):
            done = run("completion", shell)
            self.assertEqual((done.returncode, done.stderr), (0, b""), shell)
            (self.folder / shell).write_bytes(done.stdout)
        self.environment = {"PATH": os.environ["PATH"], "HOME": str(self.folder), "TERM": "dumb", "LC_ALL": "C.UTF-8"}

    def read_until_prompt(self, terminal):
        shown, end = b"", time.monotonic() + 20
        while PROMPT not in shown:
            ready, _, _ = select.select([terminal], [], [], max(0, end - time.monotonic()))
            self.assertTrue(ready, shown)
            shown += os.read(terminal, 4096)

    def typed(self, shell, keys):
        """The arguments that the program gets when a user of `shell` types its name, then `keys` and the enter key."""
        if shutil.which(shell) is None:
            self.skipTest(f"no {shell}")
        script, arguments = self.folder / "script", self.folder / "arguments"
        script.write_text(f"{SETTING_UP[shell]}\n. {self.folder / shell}\n"
                          f"morvane-view() {{ printf '%s\\n' \"$@\" >{arguments}; }}\n")
        process, terminal = pty.fork()
        if process == 0:
            os.chdir(self.here)
            os.execvpe(shell, SHELLS[shell], self.environment)
        try:
            os.write(terminal, f". {script}\n".encode())
            self.read_until_prompt(terminal)
            os.write(terminal, f"morvane-view {keys}\n".encode())
            self.read_until_prompt(terminal)
        finally:
            os.close(terminal)  # hangs up
            os.waitpid(process, 0)
        return arguments.read_text().splitlines()

    def listed(self, line):
        """What fish lists behind the words of a line."""
        if shutil.which("fish") is None:
            self.skipTest("no fish")
        done = subprocess.run(["fish", "--no-config", "-c", 'source $argv[1]; complete -C "$argv[2]"', self.folder / "fish",
                               line], cwd=self.here, env=self.environment, capture_output=True, check=True, timeout=60)
        self.assertEqual(done.stderr, b"")
        return done.stdout.decode().splitlines()

    def test_a_command(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                self.assertEqual(self.typed(shell, "di\t"), ["diff"])
        self.assertEqual(self.listed("morvane-view di"), ["diff\tcompare two logs of a host"])

    def test_an_option_and_the_names_of_files(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                page = {"bash": ["--html", "before maintenance.log"], "zsh": ["--html=before maintenance.log"]}[shell]
                self.assertEqual(self.typed(shell, "san --ht\tbe\t be\t"), ["san", *page, "before maintenance.log"])
        self.assertEqual(self.listed("morvane-view san --ht"), ["--html\twrite a page for the browser to FILE"])
        self.assertEqual(self.listed("morvane-view san --html be"), ["before maintenance.log"])

    def test_an_option_of_another_command_is_none(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                self.assertEqual(self.typed(shell, "diff --for\t"), ["diff", "--for"])
        self.assertEqual(self.listed("morvane-view diff --for"), [])

    def test_the_name_of_a_file_behind_a_sign(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                self.assertEqual(self.typed(shell, "--html=be\t"), ["--html=before maintenance.log"])
        self.assertEqual(self.listed("morvane-view --html=be"), ["--html=before maintenance.log"])

    def test_the_log_of_the_program_without_a_command(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                self.assertEqual(self.typed(shell, "be\t"), ["before maintenance.log"])
        self.assertEqual(self.listed("morvane-view be"), ["before maintenance.log"])

    def test_a_word_of_a_few(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                self.assertEqual(self.typed(shell, "completion z\t"), ["completion", "zsh"])
        self.assertEqual(self.listed("morvane-view completion "), ["bash", "fish", "zsh"])

    def test_columns_one_behind_the_other(self):
        for shell in SHELLS:
            with self.subTest(shell=shell):
                self.assertEqual(self.typed(shell, "paths -o dev\t,lui\t be\t"),
                                 ["paths", "-o", "device,luid", "before maintenance.log"])
                self.assertEqual(self.typed(shell, "paths --columns=dev\t"), ["paths", "--columns=device"])
        self.assertEqual(self.listed("morvane-view paths --columns dev"), ["device\tthe columns, with commas between"])
        self.assertEqual(self.listed("morvane-view paths -o device,ad"),
                         ["device,adapter\tthe columns, with commas between",
                          "device,address\tthe columns, with commas between"])


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1] + sys.argv[2:])
