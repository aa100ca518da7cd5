"""One run: Morvane's log into the history, and what differs from the baseline into the journal."""

import contextlib
import os
import signal
import subprocess
import tempfile
import time

from . import differences, journal, report
from .history import TIME
from .trouble import Trouble, printable, told

MOST_REPORTED = 1000  # differences told one by one
MOST_SAID_BYTES = 4096  # of Morvane's standard error
MOST_REMEMBERED = 20  # troubles

# Exit statuses.
SAME, DIFFERENT, IN_TROUBLE, NO_BASELINE = 0, 1, 2, 3


class Run:
    """One run with the given State and Settings; made anew for each."""

    def __init__(self, state, settings):
        self.state = state
        self.settings = settings
        self.began = time.time()
        self.archive = None  # of this run's log
        self.status = SAME
        self.troubles = []

    def go(self):
        """Runs, says what came of it, and gives the exit status. Raises nothing that a run may meet."""
        for text in self.settings.troubles:
            self._trouble(text + "; the default is used, and no log is retired")
        with self._told():
            self.state.make()
            with self.state.locked():
                with self._told():
                    self._steps()
                self.state.remember({
                    "name": self.archive and self.archive.name,
                    "began": time.strftime(TIME, time.gmtime(self.began)),
                    "trouble": "; ".join(self.troubles[:MOST_REMEMBERED]) or None,
                })
        return IN_TROUBLE if self.troubles else self.status

    def _trouble(self, text):
        self.troubles.append(text)
        report.say(text, journal.ERROR, report.TROUBLE, kind="trouble", log=self._name())

    def _name(self):
        return self.archive and self.archive.name

    @contextlib.contextmanager
    def _told(self):
        """What goes wrong inside is said, and ends only what is inside."""
        try:
            yield
        except Trouble as trouble:
            self._trouble(str(trouble))
        except OSError as error:
            self._trouble(told(error))

    def _steps(self):
        self._keep_leftover()
        failure = self._run_morvane()
        if not self._has_log():
            raise Trouble(failure or "morvane left no log")
        failure = failure or self._failure_of_log()
        log = self.state.log
        try:
            self.archive = self.state.add(log, self.began, failure is None)
            log = self.archive.path
        except Trouble as trouble:
            self._trouble("%s; the log stays in %s" % (trouble, log))
        if self.settings.metrics is not None:
            with self._told():
                differences.write_metrics(self.settings.metrics, log)
        if failure:
            self._trouble("the log is not whole: " + failure)
        else:
            with self._told():
                self._compare(log)
        self._retire()

    def _has_log(self):
        """Whether Morvane's log is in the private folder and holds anything."""
        try:
            return os.stat(self.state.log).st_size > 0
        except FileNotFoundError:
            return False

    def _keep_leftover(self):
        """Puts the log of a run that could not into the history. Raises Trouble when this cannot either: no run may write
        over it."""
        if not self._has_log():
            return
        began = os.stat(self.state.log).st_mtime
        try:
            archive = self.state.add(self.state.log, began, self._failure_of_log() is None)
        except Trouble as trouble:
            raise Trouble("%s; an earlier run's log stays in %s, and Morvane is not run" % (trouble, self.state.log))
        report.say("an earlier run's log was still to be kept; it is in the history now: " + archive.name,
                   journal.NOTICE, report.OUTCOME, kind="kept", log=archive.name)

    def _failure_of_log(self):
        """Why the log in the private folder is not whole, None if it is."""
        try:
            return None if differences.is_whole(self.state.log) else "it is cut off"
        except Trouble as trouble:
            return str(trouble)

    def _run_morvane(self):
        """Runs Morvane in the private folder. Gives why it failed, None if it did not."""
        with tempfile.TemporaryFile() as said:
            try:
                process = subprocess.Popen(["morvane"], cwd=self.state.run, stdin=subprocess.DEVNULL,
                                           stdout=subprocess.DEVNULL, stderr=said, start_new_session=True)
            except OSError as error:
                return "morvane: %s" % error.strerror
            try:
                status = process.wait(self.settings.timeout)
            except subprocess.TimeoutExpired:
                return "morvane did not end within %d seconds" % self.settings.timeout
            finally:
                end(process)
            if status == 0:
                return None
            said.seek(max(0, said.seek(0, os.SEEK_END) - MOST_SAID_BYTES))
            lines = said.read().decode("utf-8", "surrogateescape").splitlines()
        ending = "status %d" % status if status > 0 else "signal %d" % -status
        return "morvane ended with %s%s" % (ending, "".join("; " + printable(line) for line in lines))

    def _compare(self, log):
        """Says what differs between the baseline and the log at the path, and sets the status."""
        baseline = self.state.baseline()
        if baseline is None:
            self.status = NO_BASELINE
            report.say("no baseline: accept one with `morvane-watch accept`", journal.WARNING, report.OUTCOME,
                       kind="no-baseline", log=self._name())
            return
        about = {"log": self._name(), "baseline": baseline.name}
        found, warnings = differences.compare(baseline.path, log)
        for text in warnings:
            report.say("warning: " + text, journal.WARNING, report.OUTCOME, kind="warning", **about)
        for difference in found[:MOST_REPORTED]:
            report.say(difference.message, difference.priority, report.DIFFERENCE, kind=difference.kind, **about,
                       **difference.fields)
        if found:
            self.status = DIFFERENT
        report.say(differences.outcome(found, baseline.name), journal.ERROR if found else journal.INFO, report.OUTCOME,
                   kind="different" if found else "same", **about)

    def _retire(self):
        """Removes the logs that the settings do not keep; none while one of them is wrong. A clock that was wrong gets no
        log removed."""
        now = time.time()
        late = [archive.name for archive in self.state.archives() if archive.time > now]
        if late:
            report.say("the clock was turned back: %s in the history from after now, the newest %s; not counted"
                       % (differences.counted(len(late), "log"), late[-1]), journal.WARNING, report.OUTCOME, kind="clock")
        if self.settings.troubles:
            return
        spared = [] if self.archive is None else [self.archive]
        with contextlib.suppress(Trouble):
            spared += [archive for archive in [self.state.baseline()] if archive is not None]
        for text in self.state.retire(self.settings.keep, self.settings.weeks, now, spared):
            self._trouble(text)


def end(process):
    """Ends the process and those that it started, if it runs still. One that the kernel holds is left to it."""
    for number in (signal.SIGTERM, signal.SIGKILL):
        if process.poll() is not None:
            return
        with contextlib.suppress(ProcessLookupError):
            os.killpg(process.pid, number)
        with contextlib.suppress(subprocess.TimeoutExpired):
            process.wait(5)
