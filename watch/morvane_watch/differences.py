"""What morvane-view says of logs: whether one is whole, how two differ, what it comes to as metrics."""

import json
import os
import subprocess

from . import journal
from .trouble import Trouble

# The differences of `morvane-view diff --json`: the list that holds them, the kind that the journal gets, what people
# read, and how bad it is. Of a list with two kinds the difference itself decides.
LISTS = [
    ("identityChanges", "identity-changed", "another LUN behind the same path", journal.CRITICAL),
    ("identityChanges", "identity-unreadable", "identifier can no longer be read", journal.ERROR),
    ("identityChanges", "identity-readable", "identifier can be read now", journal.NOTICE),
    ("pathCounts", "lun-lost", "LUN lost", journal.CRITICAL),
    ("pathCounts", "lun-fewer-paths", "LUN with fewer paths", journal.ERROR),
    ("pathCounts", "lun-more-paths", "LUN with more paths", journal.NOTICE),
    ("pathCounts", "lun-new", "new LUN", journal.NOTICE),
    ("lostPaths", "path-lost", "path lost", journal.ERROR),
    ("newPaths", "path-new", "new path", journal.NOTICE),
    ("lostDirect", "disk-lost", "direct disk lost", journal.ERROR),
    ("newDirect", "disk-new", "new direct disk", journal.NOTICE),
    ("lostLogical", "device-lost", "logical device lost", journal.WARNING),
    ("newLogical", "device-new", "new logical device", journal.NOTICE),
]


class Difference:
    """One difference: kind, message (a line for people), priority, fields (for the journal)."""

    def __init__(self, kind, words, priority, fields):
        self.kind = kind
        self.priority = priority
        self.fields = fields
        change = "was {before}, is {after}".format(**fields) if "before" in fields else ""
        shown = [fields.get("path"), fields.get("device"), fields.get("lun")]
        subject = ", ".join(text for text in shown if text and text not in change)
        self.message = ": ".join(part for part in (words, subject, change) if part)


def is_of_kind(kind, entry):
    """Whether the entry of a list with two kinds or more is of this one."""
    if kind.startswith("identity-"):
        return kind == (
            "identity-changed" if entry["dangerous"]
            else "identity-unreadable" if entry["after"] is None
            else "identity-readable"
        )
    if kind.startswith("lun-"):
        return kind == (
            "lun-lost" if entry["after"] == 0
            else "lun-new" if entry["before"] == 0
            else "lun-fewer-paths" if entry["after"] < entry["before"]
            else "lun-more-paths"
        )
    return True


def counted(number, word):
    """The number, and the word for so many."""
    return "%d %s%s" % (number, word, "" if number == 1 else "s")


def fields_of(entry):
    """The journal's fields of an entry of one of the lists."""
    fields = {"lun": entry.get("identifier"), "device": entry.get("device")}
    if "initiator" in entry:
        fields["path"] = "%s -> %s LUN %s" % (entry["initiator"], entry["target"], entry["lun"])
        fields.update(tree=entry["tree"], initiator=entry["initiator"], target=entry["target"])
    if "before" in entry:
        fields.update(before=entry["before"], after=entry["after"])
    if "dangerous" in entry:
        fields["lun"] = entry["after"] or entry["before"]
    return fields


def differences_of(document):
    """The Differences that a document of `morvane-view diff --json` holds, the worst first."""
    found = [
        Difference(kind, words, priority, fields_of(entry))
        for name, kind, words, priority in LISTS
        for entry in document[name]
        if is_of_kind(kind, entry)
    ]
    power_path = document["powerPath"]
    if power_path is not None:
        found.append(Difference("powerpath-changed", "PowerPath", journal.WARNING, dict(power_path)))
    return sorted(found, key=lambda difference: difference.priority)


def outcome(found, baseline):
    """What the Differences from the baseline of that name come to, in one line."""
    if not found:
        return "same as the baseline " + baseline
    return "%s from the baseline %s" % (counted(len(found), "difference"), baseline)


def asked(arguments, good):
    """What morvane-view writes as JSON for the arguments, and its status. Raises Trouble if the status is none of the
    good ones, with its own word."""
    try:
        done = subprocess.run(["morvane-view"] + arguments, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                              stderr=subprocess.PIPE, check=False)
    except OSError as error:
        raise Trouble("morvane-view: %s" % error.strerror)
    if done.returncode not in good:
        lines = done.stderr.decode("utf-8", "surrogateescape").splitlines() or ["status %d" % done.returncode]
        raise Trouble(lines[-1] if lines[-1].startswith("morvane-view: ") else "morvane-view: " + lines[-1])
    return done.stdout


def understood(reader, arguments, good):
    """reader() of the document that morvane-view writes; raises Trouble, too, if it is none that reader() knows."""
    output = asked(arguments, good)
    try:
        return reader(json.loads(output.decode("utf-8")))
    except (ValueError, KeyError, TypeError, AttributeError):
        raise Trouble("morvane-view: what it wrote is not understood; is it as new as morvane-watch?")


def is_whole(log):
    """Whether the log at the path reaches from a run's beginning to its end. Raises Trouble if it cannot be read."""
    return understood(lambda report: report["log"]["complete"] and not report["log"]["beginsInside"],
                      ["--json", log], (0,))


def write_metrics(path, log):
    """Has the metrics of the log written to the file at path, which all may read unless it is there already. Raises Trouble
    if they cannot be."""
    mask = os.umask(0o022)
    try:
        asked(["--prometheus", path, log], (0,))
    finally:
        os.umask(mask)


def compare(old, new):
    """The Differences between two logs by their paths, and the texts of warnings. Raises Trouble if one cannot be read."""
    return understood(lambda document: (differences_of(document), [str(text) for text in document["warnings"]]),
                      ["diff", "--json", old, new], (0, 1))
