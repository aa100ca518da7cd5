"""The state of morvane-watch, /var/lib/morvane: the private folder that Morvane runs in, the history of its logs, and
which of them is the baseline."""

import calendar
import contextlib
import fcntl
import json
import os
import re
import stat
import subprocess
import time

from .trouble import Trouble, printable, told

# A log in the history: the UTC time at which its run began, a number where a second had several, a mark where the log
# is not whole.
FILE = re.compile(r"([0-9]{8}T[0-9]{6}Z)(?:_([1-9][0-9]{0,5}))?(\.incomplete)?\.log\.zst")
DAY = re.compile(r"([0-9]{4})-([0-9]{2})-([0-9]{2})(?:[T ]([0-9]{2}):([0-9]{2})(?::([0-9]{2}))?)?Z?")
TIME = "%Y%m%dT%H%M%SZ"
LOG = os.path.join("MorvaneLogs", "Morvane.log")


class Archive:
    """A log in the history: name (as users give it), file (its name in the folder), path, time (seconds of the epoch),
    is_whole."""

    def __init__(self, folder, match):
        began, number, incomplete = match.groups()
        self.file = match.group(0)
        self.path = os.path.join(folder, self.file)
        self.name = began if number is None else "%s_%s" % (began, number)
        self.time = calendar.timegm(time.strptime(began, TIME))
        self.number = int(number or 0)
        self.is_whole = incomplete is None

    @property
    def order(self):
        """What archives are sorted by."""
        return (self.time, self.number)


class State:
    """The folder at place. Its methods raise OSError where the system refuses, unless they say otherwise."""

    def __init__(self, place):
        self.place = place
        self.run = os.path.join(place, "run")
        self.log = os.path.join(self.run, LOG)
        self.history = os.path.join(place, "history")
        self._baseline = os.path.join(place, "baseline")
        self._last = os.path.join(place, "last")

    def make(self):
        """Makes what is missing of its folders, for their owner alone."""
        for folder in (self.place, self.run, self.history):
            with contextlib.suppress(FileExistsError):
                os.mkdir(folder, 0o700)

    @contextlib.contextmanager
    def locked(self):
        """Keeps others from changing it; raises Trouble when another does already."""
        with open(os.path.join(self.place, "lock"), "ab") as lock:
            try:
                fcntl.flock(lock, fcntl.LOCK_EX | fcntl.LOCK_NB)
            except BlockingIOError:
                raise Trouble("%s: another run is under way" % self.place)
            yield

    def archives(self):
        """Every log in the history, the oldest first. What has another name or is no regular file is none of them."""
        found = []
        try:
            files = os.listdir(self.history)
        except FileNotFoundError:  # before the first run
            files = []
        for file in files:
            match = FILE.fullmatch(file)
            if match and stat.S_ISREG(os.lstat(os.path.join(self.history, file)).st_mode):
                with contextlib.suppress(ValueError):  # a time that does not exist
                    found.append(Archive(self.history, match))
        return sorted(found, key=lambda archive: archive.order)

    def find(self, when):
        """The archive that a user means: `last`, `baseline`, a name, or a day or time (UTC), of which the newest is
        taken. Raises Trouble when there is none."""
        if when == "baseline":
            return self.baseline()
        archives = self.archives()
        if when == "last":
            name = self.last().get("name")
            if name is None:
                raise Trouble("there is no run yet")
            found = [archive for archive in archives if archive.name == name]
        else:
            day = DAY.fullmatch(when)
            if day:
                beginning = "".join(day.groups()[:3]) + "T" + "".join(part or "" for part in day.groups()[3:])
                found = [archive for archive in archives if archive.name.startswith(beginning)]
            else:
                found = [archive for archive in archives if when in (archive.name, archive.file)]
        if not found:
            raise Trouble("%s: there is no such log in the history" % printable(when))
        return found[-1]

    def baseline(self):
        """The archive that is the baseline, None when none was accepted. Raises Trouble when it is gone."""
        try:
            target = os.readlink(self._baseline)
        except FileNotFoundError:
            return None
        for archive in self.archives():
            if target == os.path.join("history", archive.file):
                return archive
        raise Trouble("the baseline, %s, is not in the history any more; accept another" % printable(target))

    def accept(self, archive):
        """Makes the archive the baseline, instead of the one before, at once."""
        new = os.path.join(self.place, ".new.baseline")
        with contextlib.suppress(FileNotFoundError):
            os.unlink(new)
        os.symlink(os.path.join("history", archive.file), new)
        os.rename(new, self._baseline)
        sync(self.place)

    def last(self):
        """What the last run left: name of its log or None, began (its UTC time as in names), trouble (a text or None);
        empty when there was none."""
        try:
            with open(self._last, "rb") as file:
                record = json.loads(file.read(1 << 16).decode("utf-8"))
        except (FileNotFoundError, ValueError):
            return {}
        return record if isinstance(record, dict) else {}

    def remember(self, record):
        """Keeps what last() is to give."""
        new = os.path.join(self.place, ".new.last")
        with open(new, "wb") as file:
            file.write(json.dumps(record).encode("utf-8"))
            file.flush()
            os.fsync(file.fileno())
        os.rename(new, self._last)
        sync(self.place)

    def add(self, log, began, is_whole):
        """Compresses the log at the path into the history, and removes it once the archive is on the disk. began: the
        time of its run, in seconds of the epoch. Gives the archive; raises Trouble, the log untouched, if it cannot."""
        new = os.path.join(self.history, ".new.log.zst")
        try:
            with open(log, "rb") as source, open(new, "wb") as archive:
                compress(source, archive)
                os.fsync(archive.fileno())
            taken = {file.split(".")[0] for file in os.listdir(self.history)}
            second = time.strftime(TIME, time.gmtime(began))
            name = next(name for name in names_of(second) if name not in taken)
            file = name + ("" if is_whole else ".incomplete") + ".log.zst"
            os.rename(new, os.path.join(self.history, file))
            sync(self.history)
        except OSError as error:
            raise Trouble("%s: %s" % (self.history, error.strerror))
        finally:
            with contextlib.suppress(OSError):
                os.unlink(new)
        os.unlink(log)
        return Archive(self.history, FILE.fullmatch(file))

    def retire(self, keep, weeks, now, spared):
        """Removes logs from the history but for the newest `keep`, the first whole one of each of the last `weeks`
        weeks, this one included, and the archives in spared. Logs from after now do not count and stay. Gives the texts
        of what went wrong."""
        archives = [archive for archive in self.archives() if archive.time <= now]
        kept = {archive.name for archive in archives[-keep:] + spared}
        first = {}
        for archive in archives:
            if archive.is_whole and week_of(archive.time) > week_of(now) - weeks:
                first.setdefault(week_of(archive.time), archive.name)
        kept.update(first.values())
        troubles = []
        for archive in archives:
            if archive.name not in kept:
                try:
                    os.unlink(archive.path)
                except OSError as error:
                    troubles.append(told(error))
        return troubles


def compress(source, archive):
    """Writes the one open file, compressed, to the other. Raises Trouble, with zstd's own word, if that fails."""
    try:
        done = subprocess.run(["zstd", "--quiet", "--stdout"], stdin=source, stdout=archive, stderr=subprocess.PIPE,
                              check=False)
    except OSError as error:
        raise Trouble("zstd: %s" % error.strerror)
    if done.returncode != 0:
        lines = done.stderr.decode("utf-8", "surrogateescape").splitlines() or ["status %d" % done.returncode]
        raise Trouble(printable(lines[-1] if lines[-1].startswith("zstd: ") else "zstd: " + lines[-1]))


def names_of(second):
    """The names that runs of one second get, one after the other."""
    yield second
    number = 1
    while True:
        yield "%s_%d" % (second, number)
        number += 1


def week_of(seconds):
    """The number of the week in UTC, from Monday on; the epoch was a Thursday."""
    return int(seconds + 3 * 24 * 3600) // (7 * 24 * 3600)


def sync(folder):
    """Has the folder's names on the disk before anything that relies on them."""
    descriptor = os.open(folder, os.O_RDONLY | os.O_DIRECTORY)
    try:
        os.fsync(descriptor)
    finally:
        os.close(descriptor)
