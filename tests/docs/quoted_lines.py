#!/usr/bin/env python3
"""Checks every excerpt of the documents against a run of the program on the simulated host that it names.

usage: quoted_lines.py SIMHOST MORVANE MORVANE-VIEW DOCUMENT...

An excerpt is a fenced block (Markdown) or a .Bd display (manual page) behind one of these marks, which stands on the
fence or in a comment on the line before the display:

    log HOST            lines of the log on tests/hosts/HOST, in this order; others may stand between them
    log HOST prefix     likewise, but the lines may go on
    log HOST nobody     likewise, of a run as an unprivileged user
    output HOST         the whole standard output
    view HOST           like log, of what morvane-view says of the log
    verify HOST MEMORY  likewise of morvane-view verify, with a memory of the host

Blanks at the ends of lines do not count.
"""

import re
import shutil
import subprocess
import sys
import tempfile
from functools import cache
from pathlib import Path
from typing import Iterator, NamedTuple

HOSTS = Path(__file__).resolve().parents[1] / "hosts"
AS_NOBODY = ["setpriv", "--reuid=65534", "--regid=65534", "--clear-groups"]


class Excerpt(NamedTuple):
    place: str
    kind: str
    host: str
    options: tuple[str, ...]
    lines: list[str]


def markdown_excerpts(path: Path) -> Iterator[Excerpt]:
    text = path.read_text()
    for match in re.finditer(r"^```(log|output|view|verify) (\S+)(.*)\n((?:.*\n)*?)```$", text, re.MULTILINE):
        line = text.count("\n", 0, match.start()) + 1
        yield Excerpt(f"{path.name}:{line}", match[1], match[2], tuple(match[3].split()), match[4].splitlines())


def unescaped(line: str) -> str:
    for escape, character in ((r"\-", "-"), (r"\(aq", "'"), (r"\&", ""), (r"\e", "\\")):
        line = line.replace(escape, character)
    return line


def manual_excerpts(path: Path) -> Iterator[Excerpt]:
    text = path.read_text()
    for match in re.finditer(r'^\.\\" (log|output|view|verify) (\S+)(.*)\n\.Bd .*\n((?:.*\n)*?)\.Ed$', text, re.MULTILINE):
        line = text.count("\n", 0, match.start()) + 1
        lines = [unescaped(quoted) for quoted in match[4].splitlines()]
        yield Excerpt(f"{path.name}:{line}", match[1], match[2], tuple(match[3].split()), lines)


@cache
def run(simhost: Path, morvane: Path, view: Path, host: str, as_nobody: bool) -> dict[str, list[str]]:
    """The lines of the log, of standard output and of morvane-view's report of one run, by kind of excerpt."""
    with tempfile.TemporaryDirectory() as name:
        work = Path(name)
        work.chmod(0o777)
        program = Path(shutil.copy(morvane, work)) # where an unprivileged user finds it too
        command = [simhost, HOSTS / host / "host.toml", "--", *(AS_NOBODY if as_nobody else []), program]
        output = subprocess.run(command, cwd=work, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, check=False).stdout
        log = work / "MorvaneLogs" / "Morvane.log"
        report = subprocess.run([view, log], stdout=subprocess.PIPE, check=True).stdout
        texts = {"log": log.read_bytes(), "output": output, "view": report}
        subprocess.run([simhost, HOSTS / host / "host.toml", "--memory", work / "memories"], check=True)
        for root in (work / "memories").iterdir():
            answer = subprocess.run([view, "verify", "--root", root, log], stdout=subprocess.PIPE, check=False)
            texts[f"verify {root.name}"] = answer.stdout
    return {kind: text.decode(errors="replace").split("\n") for kind, text in texts.items()}


def complaint(excerpt: Excerpt, simhost: Path, morvane: Path, view: Path) -> str:
    """What is wrong with an excerpt; empty when nothing is."""
    if not (HOSTS / excerpt.host / "host.toml").exists():
        return f"no simulated host {excerpt.host}"
    kind = f"verify {excerpt.options[0]}" if excerpt.kind == "verify" else excerpt.kind
    text = run(simhost, morvane, view, excerpt.host, "nobody" in excerpt.options)[kind]
    quoted = [line.rstrip() for line in excerpt.lines]
    if excerpt.kind == "output":
        actual = [line.rstrip() for line in text if line]
        return "" if quoted == actual else f"standard output is {actual}"
    rest = (line.rstrip() for line in text)
    for line in quoted:
        if not any(actual == line or "prefix" in excerpt.options and actual.startswith(line) for actual in rest):
            return f"not in the {excerpt.kind} of {excerpt.host}, or not in this order: {line!r}"
    return ""


def main(simhost: str, morvane: str, view: str, *documents: str) -> int:
    failures = 0
    for document in map(Path, documents):
        excerpts = list(manual_excerpts(document) if document.suffix[1:].isdigit() else markdown_excerpts(document))
        if not excerpts:
            print(f"{document.name}: no excerpts")
            failures += 1
        for excerpt in excerpts:
            wrong = complaint(excerpt, Path(simhost), Path(morvane), Path(view))
            if wrong:
                print(f"{excerpt.place}: {wrong}")
                failures += 1
        print(f"{document.name}: {len(excerpts)} excerpts checked")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
