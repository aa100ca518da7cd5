#!/usr/bin/python3
"""What a run takes from its caller, and gives to the commands it runs. usage: room_test.py SIMHOST MORVANE"""

import json
import os
from itertools import product
from pathlib import Path

from support import COMPLETED, Run, main

COMMANDS = ("/usr/bin/pgrep", "/sbin/powermt", "/sbin/iscsiadm")
PROBE = """#!/usr/bin/python3 -I
import json, os, sys
descriptors = {}
for number in sorted(map(int, os.listdir("/proc/self/fd"))):
    try:
        descriptors[number] = os.readlink(f"/proc/self/fd/{number}")
    except FileNotFoundError:
        pass # that of the listing itself
with open("%s/" + os.path.basename(sys.argv[0]), "w") as file:
    json.dump({"environment": dict(os.environ), "descriptors": descriptors}, file)
print("2101 emcpd")
print("2102 emcpd")
"""
# What a caller may have set, and a shell, grep or sed would heed.
CALLERS_OWN = {"ENV": "/tmp/planted", "BASH_ENV": "/tmp/planted", "LC_ALL": "C.UTF-8", "LANG": "de_DE.UTF-8", "IFS": "e",
               "POSIXLY_CORRECT": "1", "BASH_FUNC_grep%%": "() { false; }", "GREP_COLORS": "mt=01"}


class Commands(Run):
    def test_have_a_fixed_environment_and_nothing_of_the_runs_open(self):
        self.morvane(script=self.planting(dict.fromkeys(COMMANDS, PROBE % self.work)),
                     environment={**os.environ, **CALLERS_OWN})
        for command in COMMANDS:
            with self.subTest(command):
                seen = json.loads((self.work / Path(command).name).read_text())
                seen["environment"].pop("PWD") # the shell's own
                self.assertEqual(seen["environment"], {"PATH": "/usr/sbin:/usr/bin:/sbin:/bin", "LC_ALL": "C"})
                self.assertEqual(list(seen["descriptors"]), ["0", "1", "2"])
                self.assertEqual(seen["descriptors"]["0"], "/dev/null")
                self.assertTrue(seen["descriptors"]["1"].startswith("pipe:"))

    def test_are_the_systems_whatever_stands_earlier_in_the_path(self):
        evil = self.folder / "evil"
        evil.mkdir()
        for name in ("sh", "grep", "sed", "pgrep", "powermt", "iscsiadm"):
            (evil / name).write_text(f"#!/bin/sh\necho {name} >>{self.work}/planted\n")
            (evil / name).chmod(0o755)
        done = self.morvane(script=f'PATH={evil}:$PATH exec "$@"')
        self.assert_complete(done)
        self.assertFalse((self.work / "planted").exists())

    def test_work_in_the_c_locale_whatever_the_callers(self):
        listing = b"".join(b"Pseudo name=emcpower%c\nLogical device ID=%s [LUN 0]\n" % pair
                           for pair in ((b"a", b"AA"), (b"b", b"B\xff"), (b"c", b"CC")))
        host = self.host(f"""
            [fc]
            [commands]
            "/usr/bin/pgrep" = "1 emcpd\\n2 emcpd\\n"
            "/sbin/powermt" = {{ output = {{ hex = "{listing.hex()}" }} }}
            """)
        done = self.morvane(host, environment={**os.environ, "LC_ALL": "C.UTF-8"})
        self.assert_complete(done, host)
        table = b"".join(b"               %s emcpower%c" % pair for pair in ((b"AA", b"a"), (b"B\xff", b"b"), (b"CC", b"c")))
        self.assertIn(b"PowerPath Data : Ulid  Pseudo Name\n" + table, self.log.read_bytes())

    def test_leave_the_callers_input_to_the_caller(self):
        reading = dict.fromkeys(COMMANDS, "#!/bin/sh\nexec cat >/dev/null\n")
        done = self.morvane(script=self.planting(
            reading, 'printf "oak\\nelm\\nash\\n" | while read host; do "$@" >/dev/null; echo "$host"; done'))
        self.assertEqual((done.returncode, done.stdout, done.stderr), (0, b"oak\nelm\nash\n", b""))


class StandardDescriptors(Run):
    def test_may_be_closed_and_the_log_is_the_same(self):
        for closed in product((False, True), repeat=3):
            with self.subTest(closed=closed):
                redirections = " ".join(f"{number}>&-" for number in range(3) if closed[number])
                done = self.morvane(script=f'exec "$@" {redirections}')
                self.assertEqual((done.returncode, done.stdout, done.stderr), (0, b"" if closed[1] else COMPLETED, b""))
                self.assert_whole()

    def test_closed_keep_the_reason_of_a_refusal_out_of_the_log(self):
        self.make_logs(65534)
        self.log.mkdir()
        done = self.morvane(script='exec "$@" 1>&- 2>&-')
        self.assertEqual((done.returncode, done.stdout, done.stderr, os.listdir(self.log)), (1, b"", b"", []))

    def test_output_that_takes_nothing_is_a_failed_run_with_a_whole_log(self):
        done = self.morvane(script='exec "$@" >/dev/full')
        self.assert_refused(done, b"", "standard output: No space left on device")
        self.assert_whole()

    def test_output_and_error_that_take_nothing_are_a_failed_run_with_a_whole_log(self):
        done = self.morvane(script='exec "$@" >/dev/full 2>/dev/full')
        self.assertEqual((done.returncode, done.stdout, done.stderr), (1, b"", b""))
        self.assert_whole()


if __name__ == "__main__":
    main()
