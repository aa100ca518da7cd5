"""What a command says: for people on standard output, with fields for the journal."""

from . import journal

# What kind of entry it is, for `journalctl MESSAGE_ID=...`.
DIFFERENCE = "492a91bd84ba40f09ff6735d3d6d6173"  # one difference from the baseline
OUTCOME = "3a21d48e3dad428cae7b2edd69296260"  # what a run came to, or another baseline
TROUBLE = "f7b9494f818041f5893e0d0db8e1abaa"  # why a run, or a part of it, was not possible


def say(message, priority, message_id, **fields):
    """One line for people, and one entry with fields (their names without MORVANE_ and in small letters; None is left
    out) for the journal. Where standard output is the journal, the entry alone."""
    entry = {"MESSAGE": message, "PRIORITY": priority, "MESSAGE_ID": message_id, "SYSLOG_IDENTIFIER": "morvane-watch"}
    for name, value in fields.items():
        if value is not None:
            entry["MORVANE_" + name.upper()] = value
    is_sent = journal.send(entry)
    if not (is_sent and journal.is_output(1)):
        print(message, flush=True)
