"""What the tests of a whole run share: a simulated host, and Morvane in it, as any user. The test programs are called
TEST SIMHOST MORVANE [unittest arguments], as root."""

import atexit
import os
import re
import shutil
import signal
import subprocess
import sys
import tempfile
import time
import unittest
from functools import cache
from pathlib import Path

SIMHOST, BUILT = (Path(argument).resolve() for argument in sys.argv[1:3])
TESTS = Path(__file__).resolve().parents[1]
BUSY = TESTS / "faults" / "host.toml" # a little of everything: commands, adapters, iSCSI, disks

ROOT, NOBODY, OTHER = 0, 65534, 1
COMPLETED = b"Test completed.\n"
NO_DIRECTORY = b"Failed in creating the directory for keeping the log files\n"
NO_LOG = b"Failed in opening the logfile\n"


def installed():
    """A copy of Morvane, and of the library that stands beside a 32-bit one, where every user finds it."""
    folder = Path(tempfile.mkdtemp(prefix="morvane-evidence-"))
    atexit.register(shutil.rmtree, folder)
    folder.chmod(0o755)
    library = Path("packages/libhbaapi2/usr/lib")
    if (BUILT.parent / library).exists():
        shutil.copytree(BUILT.parent / library, folder / library, symlinks=True)
    return Path(shutil.copy(BUILT, folder))


MORVANE = installed()


def normalised(log):
    """A log without what differs from run to run: addresses and times."""
    log = re.sub(rb"(Vpd Page: |InqBuffer |Storing Target Mappings |Deleting )(0x)?[0-9a-f]+", rb"\1#", log)
    return re.sub(rb"(Time [a-zA-Z ]+: )[-0-9., ]+", rb"\1#", log)


def command_line(host, script, user, options=()):
    """The words that run Morvane on a host: `script` is a shell's, whose arguments are Morvane as `user`."""
    as_user = ["setpriv", f"--reuid={user}", f"--regid={user}", "--clear-groups"] if user != ROOT else []
    return [SIMHOST, host, *options, "--", "/bin/sh", "-c", script, "sh", *as_user, MORVANE]


class Run(unittest.TestCase):
    """A test with a working directory of its own, in which every user may write."""

    def setUp(self):
        folder = tempfile.TemporaryDirectory(prefix="morvane-evidence-")
        self.addCleanup(folder.cleanup)
        self.folder = Path(folder.name)
        self.folder.chmod(0o755)
        self.work = self.folder / "work"
        self.work.mkdir()
        self.work.chmod(0o777)
        self.logs = self.work / "MorvaneLogs"
        self.log = self.logs / "Morvane.log"

    def morvane(self, host=BUSY, script='exec "$@"', user=ROOT, environment=None, options=()):
        """Runs Morvane to its end."""
        return subprocess.run(command_line(host, script, user, options), cwd=self.work, stdin=subprocess.DEVNULL,
                              capture_output=True, check=False, timeout=60, env=environment)

    def planting(self, programs, script='exec "$@"'):
        """A script that puts programs (text by path) in the place of the simulated host's commands, which then stand
        in /etc/real, and goes on with `script`."""
        lines = ["mkdir /etc/real || exit 99"]
        for path, text in programs.items():
            planted = self.folder / Path(path).name
            planted.write_text(text)
            lines.append(f"mv {path} /etc/real && cp {planted} {path} && chmod 755 {path} || exit 99")
        return "\n".join([*lines, script])

    def host(self, text):
        """A description of a host."""
        path = self.folder / "host.toml"
        path.write_text(text)
        return path

    def make_logs(self, owner, mode=0o755):
        self.logs.mkdir()
        self.logs.chmod(mode)
        os.chown(self.logs, owner, owner)

    def assert_complete(self, done, host=BUSY, user=ROOT):
        """A run that ended well, and left its whole log in a file that only `user` may write to."""
        self.assertEqual((done.returncode, done.stdout, done.stderr), (0, COMPLETED, b""))
        self.assert_whole(host, user)
        status = self.log.lstat()
        self.assertEqual((oct(status.st_mode & ~0o044), status.st_uid, status.st_nlink), ("0o100600", user, 1))

    def assert_whole(self, host=BUSY, user=ROOT):
        self.assertEqual(normalised(self.log.read_bytes()), whole_run(host, user)[0])

    def assert_refused(self, done, line, reason):
        self.assertEqual((done.returncode, done.stdout, done.stderr.decode()), (1, line, f"morvane: {reason}\n"))


@cache
def whole_run(host, user=ROOT):
    """The log and simhost's record of a run that nothing disturbs."""
    with tempfile.TemporaryDirectory(prefix="morvane-evidence-") as folder:
        record = Path(folder, "record")
        os.chmod(folder, 0o777)
        subprocess.run(command_line(host, 'exec "$@"', user, ("--record", record)), cwd=folder, check=True,
                       stdin=subprocess.DEVNULL, capture_output=True, timeout=60)
        return normalised(Path(folder, "MorvaneLogs/Morvane.log").read_bytes()), record.read_text()


def wait_until(condition):
    """What `condition` returns once that is true."""
    for _ in range(4000):
        found = condition()
        if found:
            return found
        time.sleep(0.005)
    raise TimeoutError


def running_morvane():
    """The process number of the Morvane that runs, 0 when there is none."""
    program = MORVANE.stat()
    for process in filter(str.isdigit, os.listdir("/proc")):
        try:
            if os.path.samestat(os.stat(f"/proc/{process}/exe"), program):
                return int(process)
        except OSError:
            pass # it has ended, or is the kernel's own
    return 0


def kill_morvane(simhost):
    """Kills Morvane, and then the host that it runs on."""
    os.kill(wait_until(running_morvane), signal.SIGKILL)
    wait_until(lambda: not running_morvane())
    simhost.kill()
    simhost.wait()


def main():
    unittest.main(argv=sys.argv[:1] + sys.argv[3:])
