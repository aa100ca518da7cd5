#!/usr/bin/python3
"""What is to be seen of a run while it waits, and after it was killed there. usage: waiting_test.py SIMHOST MORVANE"""

import fcntl
import os
import pty
import re
import struct
import subprocess
import termios

from support import BUSY, COMPLETED, ROOT, Run, command_line, kill_morvane, main, normalised, wait_until, whole_run

CLEAR = b"\r\x1b[K"
FOREVER_MS = 600000


def starts(log, pattern):
    """The log up to and with each text of a pattern."""
    return [log[:found.end()] for found in re.finditer(pattern, log)]


class Waiting(Run):
    """A run that can be caught in the middle."""

    def setUp(self):
        super().setUp()
        self.record = self.folder / "record"

    def start(self, host, script='exec "$@"', **streams):
        """Starts Morvane in a directory as if nothing had run there."""
        self.log.unlink(missing_ok=True)
        return subprocess.Popen(command_line(host, script, ROOT, ("--record", self.record)), cwd=self.work,
                                **{"stdin": subprocess.DEVNULL, "stdout": subprocess.DEVNULL, **streams})

    def slow_host(self, commands):
        """The busy host, on which the last of these device commands never ends."""
        node, command = commands[-1]
        fault = f'{{ command = "{command}", nth = {commands.count(commands[-1])}, delay_ms = {FOREVER_MS} }}'
        return self.host(BUSY.read_text().replace(f'node = "{node}"', f'node = "{node}"\nfaults = [{fault}]'))

    def device_commands(self):
        """The whole log of the busy host, and the device commands behind it: node, page."""
        log, record = whole_run(BUSY)
        return log, [(node, f"0x{page}" if paged == "01" else "standard")
                     for node, paged, page in re.findall(r"^SG_IO (\S+) cdb=12(..)(..)", record, re.M)]

    def sent(self):
        return self.record.read_text().count("SG_IO ") if self.record.exists() else 0


class Killed(Waiting):
    def test_within_any_device_command_leaves_a_log_that_ends_with_it(self):
        log, commands = self.device_commands()
        expected = starts(log, rb"Entered Function doScsiIo Line \d+\n")
        self.assertEqual(len(commands), len(expected))
        self.assertGreater(len(commands), 10)
        for number, start in enumerate(expected, 1):
            with self.subTest(commands[number - 1], number=number):
                self.record.unlink(missing_ok=True)
                host = self.start(self.slow_host(commands[:number]))
                wait_until(lambda n=number: self.sent() == n)
                kill_morvane(host)
                self.assertEqual(normalised(self.log.read_bytes()), start)

    def test_within_any_shell_command_leaves_a_log_that_ends_with_it(self):
        log, record = whole_run(BUSY)
        # What iscsiadm prints is read behind the initiator's name.
        expected = starts(log, rb"Calling popen\n|Left Function readInitiatorIQN Line \d+\n")
        self.assertEqual(record.count("run "), len(expected))
        self.assertGreater(len(expected), 4)
        calls, hangs = self.folder / "calls", self.folder / "hangs"
        for number, start in enumerate(expected, 1):
            with self.subTest(start[-30:], number=number):
                calls.unlink(missing_ok=True)
                hangs.unlink(missing_ok=True)
                wrapper = (f"#!/bin/sh\necho >>{calls}\n"
                           f"[ $(wc -l <{calls}) -ne {number} ] || {{ touch {hangs}; exec sleep 600; }}\n"
                           'exec /etc/real/${0##*/} "$@"\n')
                names = ("/usr/bin/pgrep", "/sbin/powermt", "/sbin/iscsiadm")
                host = self.start(BUSY, self.planting(dict.fromkeys(names, wrapper)))
                wait_until(hangs.exists)
                kill_morvane(host)
                self.assertEqual(normalised(self.log.read_bytes()), start)


class Terminal(Waiting):
    """What standard error shows where it is a terminal."""

    def setUp(self):
        super().setUp()
        self.screen, self.terminal = pty.openpty()
        fcntl.ioctl(self.terminal, termios.TIOCSWINSZ, struct.pack("HHHH", 24, 80, 0, 0))
        self.addCleanup(os.close, self.screen)

    def run_at_terminal(self, script='exec "$@"'):
        """Standard output, and what the terminal got."""
        host = self.start(BUSY, script, stdout=subprocess.PIPE, stderr=self.terminal)
        os.close(self.terminal)
        output = host.communicate(timeout=60)[0]
        return output, self.shown()

    def shown(self):
        shown = b""
        while True:
            try:
                shown += os.read(self.screen, 65536)
            except OSError: # nobody has the terminal open any more
                return shown

    def test_shows_the_device_and_how_many_and_is_clear_at_the_end(self):
        output, shown = self.run_at_terminal()
        self.assertEqual(output, COMPLETED)
        self.assertEqual(shown.split(CLEAR), [b""] + [f"morvane: {text}".encode() for text in (
            "multipath: PowerPath",
            "FC: HBA library",
            "FC adapter: qlogic-qle2462-0 (1 of 2)",
            "FC vendors: /dev/sdb (1 of 2)",
            "FC vendors: /dev/sdc (2 of 2)",
            "FC: /dev/sdb (1 of 2)",
            "FC: /dev/sdc (2 of 2)",
            "FC adapter: qlogic-qle2462-1 (2 of 2)",
            "iSCSI: iscsiadm",
            "iSCSI: /dev/sdd",
            "DAS: /dev/sda",
            "DAS: /dev/sdb",
            "DAS: /dev/sdd",
            "DAS: /dev/cciss/c0d0")] + [b""])
        self.assert_whole()

    def test_gets_no_more_than_fits_its_width(self):
        fcntl.ioctl(self.terminal, termios.TIOCSWINSZ, struct.pack("HHHH", 24, 20, 0, 0))
        shown = self.run_at_terminal()[1]
        self.assertIn(b"morvane: FC: /dev/s", shown.split(CLEAR))
        self.assertEqual(max(map(len, shown.split(CLEAR))), 19)

    def test_is_clear_before_the_reason_of_a_failure(self):
        output, shown = self.run_at_terminal('exec "$@" >/dev/full')
        self.assertEqual(output, b"")
        self.assertEqual(shown.split(CLEAR)[-1], b"morvane: standard output: No space left on device\r\n")

    def test_names_the_device_that_does_not_answer(self):
        commands = self.device_commands()[1]
        first = commands.index(("/dev/sdc", "0x83")) + 1
        host = self.start(self.slow_host(commands[:first]), stderr=self.terminal)
        os.close(self.terminal)
        wait_until(lambda: self.sent() == first)
        kill_morvane(host)
        self.assertEqual(self.shown().split(CLEAR)[-1], b"morvane: FC: /dev/sdc (2 of 2)")


if __name__ == "__main__":
    main()
