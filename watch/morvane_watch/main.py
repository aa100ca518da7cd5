"""The command line."""

import argparse
import contextlib
import os
import signal
import subprocess
import sys
import time
from collections import Counter

from . import differences, journal, report, settings
from .history import State
from .run import DIFFERENT, IN_TROUBLE, NO_BASELINE, SAME, Run
from .trouble import Trouble, printable, told

WHEN = "a name of `history`, a day or time of UTC (2026-11-21, 2026-11-21T02:00), last, or baseline"


def run(state, _):
    """Runs Morvane, keeps its log, and says what differs from the baseline."""
    signal.signal(signal.SIGTERM, lambda *_: sys.exit(IN_TROUBLE))  # what is begun is ended, Morvane too
    folder = os.environ.get("CONFIGURATION_DIRECTORY", "/etc/morvane")
    return Run(state, settings.read(os.path.join(folder, "watch.conf"))).go()


def status(state, _):
    """Says what the last run saw, against the baseline."""
    last = state.last()
    if not last:
        raise Trouble("there is no run yet")
    print("Last run: %s" % printable(str(last.get("name") or last.get("began"))))
    if last.get("trouble"):
        print("Trouble: %s" % last["trouble"])
    baseline = state.baseline()
    if baseline is None:
        print("No baseline: accept one with `morvane-watch accept`")
        return IN_TROUBLE if last.get("trouble") else NO_BASELINE
    print("Baseline: %s" % baseline.name)
    found = []
    if last.get("name") is not None:
        archive = state.find("last")
        if archive.is_whole:
            found, warnings = differences.compare(baseline.path, archive.path)
            for line in ["warning: " + text for text in warnings] + [difference.message for difference in found]:
                print(line)
            print(differences.outcome(found, baseline.name))
    return IN_TROUBLE if last.get("trouble") else DIFFERENT if found else SAME


def accept(state, options):
    """Makes a log the baseline; a log that is not whole never becomes it."""
    with state.locked():
        archive = state.find(options.when)
        if archive is None:
            raise Trouble("there is no baseline to accept again")
        if not (archive.is_whole and differences.is_whole(archive.path)):
            raise Trouble("%s is not whole: it cannot be the baseline" % archive.name)
        state.accept(archive)
    report.say("%s is the baseline now" % archive.name, journal.NOTICE, report.OUTCOME, kind="accepted",
               baseline=archive.name)
    return SAME


def history(state, _):
    """Lists the runs, and what changed from each to the next."""
    baseline = None
    with contextlib.suppress(Trouble):
        baseline = state.baseline()
    now = time.time()
    before = None
    result = SAME
    for archive in state.archives():
        try:
            said = changes(before, archive) if archive.is_whole else "not whole"
        except Trouble as trouble:
            said = "left out: %s" % trouble
            result = IN_TROUBLE
        else:
            before = archive if archive.is_whole else before
        marks = [said]
        if archive.time > now:
            marks.append("from after now")
        if baseline is not None and archive.name == baseline.name:
            marks.append("the baseline")
        print("%-19s %s" % (archive.name, "; ".join(marks)), flush=True)
    return result


def changes(before, archive):
    """What changed from the one whole log, which may be None, to the other, in a few words."""
    if before is None:
        differences.is_whole(archive.path)
        return "the first"
    found, _ = differences.compare(before.path, archive.path)
    counts = Counter(difference.kind for difference in found)
    return ", ".join("%s: %d" % kind for kind in counts.items()) or "same"


def show(state, options):
    """Shows one log."""
    return viewed(path_of(state, options.when))


def diff(state, options):
    """Compares two logs."""
    return viewed("diff", path_of(state, options.old), path_of(state, options.new))


def path_of(state, when):
    """The path of the log that the user means. Raises Trouble when there is none."""
    archive = state.find(when)
    if archive is None:
        raise Trouble("no baseline: accept one with `morvane-watch accept`")
    return archive.path


def viewed(*arguments):
    """Has morvane-view show it; gives its status."""
    sys.stdout.flush()
    try:
        return subprocess.call(("morvane-view",) + arguments)
    except OSError as error:
        raise Trouble("morvane-view: %s" % error.strerror)


def parser():
    """The command line's grammar; the function of a command is in `do`."""
    top = argparse.ArgumentParser(
        prog="morvane-watch",
        description="Runs Morvane every night, keeps its logs, and tells what differs from the accepted state.",
        epilog="WHEN is %s. Exit status: 0 same, 1 different, 2 trouble, 3 no baseline." % WHEN,
    )
    commands = top.add_subparsers(dest="command", metavar="COMMAND")

    def add(function, *arguments):
        words = function.__doc__.rstrip(".")
        command = commands.add_parser(function.__name__, description=function.__doc__, help=words[0].lower() + words[1:])
        command.set_defaults(do=function)
        for name, default in arguments:
            command.add_argument(name, metavar="WHEN", nargs="?", default=default,
                                 help="%s (default: %s)" % (WHEN, default))

    add(run)
    add(status)
    add(accept, ("when", "last"))
    add(history)
    add(show, ("when", "last"))
    add(diff, ("old", "baseline"), ("new", "last"))
    return top


def main(arguments):
    """Does what the arguments, without the program's name, ask for; gives the exit status."""
    options = parser().parse_args(arguments)
    if options.command is None:
        parser().print_usage(sys.stderr)
        return IN_TROUBLE
    try:
        return options.do(State(os.environ.get("STATE_DIRECTORY", "/var/lib/morvane")), options)
    except Trouble as trouble:
        print("morvane-watch: %s" % trouble, file=sys.stderr)
    except BrokenPipeError:  # whoever read has seen enough
        os.dup2(os.open(os.devnull, os.O_WRONLY), 1)
    except OSError as error:
        print("morvane-watch: %s" % told(error), file=sys.stderr)
    except KeyboardInterrupt:
        pass
    return IN_TROUBLE
