"""Entries for systemd's journal, in its native protocol: one datagram an entry, each value behind its length, so that
it may hold any byte."""

import os
import socket
import struct

SOCKET = "/run/systemd/journal/socket"
MOST_VALUE_BYTES = 8192  # of one value; ten of them fit into every kernel's datagram

# Priorities, as syslog numbers them.
CRITICAL, ERROR, WARNING, NOTICE, INFO = 2, 3, 4, 5, 6


def encode(fields):
    """The datagram of an entry: fields maps names (capitals, digits, underscores) to texts or numbers. A value that is
    too long is cut."""
    datagram = b""
    for name, value in fields.items():
        value = str(value).encode("utf-8", "surrogateescape")[:MOST_VALUE_BYTES]
        datagram += name.encode("ascii") + b"\n" + struct.pack("<Q", len(value)) + value + b"\n"
    return datagram


def send(fields):
    """Sends one entry. Gives whether a journal took it: a host without systemd has none."""
    try:
        with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as journal:
            journal.settimeout(5)
            journal.sendto(encode(fields), SOCKET)
    except OSError:
        return False
    return True


def is_output(descriptor):
    """Whether what is written to the descriptor goes to the journal anyway, as systemd tells a unit's programs."""
    try:
        status = os.fstat(descriptor)
    except OSError:
        return False
    return os.environ.get("JOURNAL_STREAM") == "%d:%d" % (status.st_dev, status.st_ino)
