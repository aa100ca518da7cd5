"""What the tests of morvane-view share: the program, the logs, the schema. The test programs are called
TEST MORVANE-VIEW [unittest arguments]."""

import json
import lzma
import re
import subprocess
import sys
from pathlib import Path

import jsonschema

HERE = Path(__file__).resolve().parent
ROOT = HERE.parents[1]
HOSTS = ROOT / "tests" / "hosts"
LAB = HERE / "lab"
SCHEMA = json.loads((ROOT / "view" / "morvane-log.schema.json").read_text())
PROGRAM = Path(sys.argv[1]).resolve()

# Values where the expected log of a simulated host leaves them open (tests/hosts/log_comparison.hpp).
OPEN_VALUES = ((re.compile(rb" Line #$", re.M), b" Line 1"), (re.compile(b"<times>"), b"1.00, 2.00, 3.00, 4.00"),
               (re.compile(b"<time>"), b"1.50"), (re.compile(b"(0x)?<address>"), b"0x55d0"))


def hosts():
    return sorted(path.parent.name for path in HOSTS.glob("*/expected.log"))


def host_log(host):
    """The log of a simulated host."""
    log = (HOSTS / host / "expected.log").read_bytes()
    for mark, value in OPEN_VALUES:
        log = mark.sub(value, log)
    return log


def memories(simhost, host, folder):
    """What the kernel of a simulated host may remember, laid out in the folder: the roots by their names."""
    done = subprocess.run([simhost, HOSTS / host / "host.toml", "--memory", folder], capture_output=True, check=False)
    assert (done.returncode, done.stderr) == (0, b""), (host, done)
    return {root.name: root for root in sorted(Path(folder).iterdir())}


def lab_stages():
    return sorted(path.name.removesuffix(".log.xz") for path in LAB.glob("*.log.xz"))


def lab_log(stage):
    """The log of a run in the laboratory."""
    return lzma.decompress((LAB / f"{stage}.log.xz").read_bytes())


def is_whole(log):
    """Whether the run came to its end; a failed assertion ends the program before."""
    return b"\t\t\t   END \n" in log


def run(*arguments, log=b"", folder=None):
    """Runs morvane-view with `log` on its standard input."""
    return subprocess.run([PROGRAM, *map(str, arguments)], input=log, cwd=folder, capture_output=True, check=False,
                          timeout=60)


def valid(output):
    """A JSON document of morvane-view, checked against its schema."""
    document = json.loads(output)
    jsonschema.validate(document, SCHEMA)
    return document


def report(log):
    """What morvane-view --json says of a log."""
    return valid(run("--json", "-", log=log).stdout)
