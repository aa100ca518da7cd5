"""What keeps a command from doing its work."""

import os


class Trouble(Exception):
    """Ends what was begun; its text is for the user, one line."""


def printable(text):
    """The text, of str, without what could move a terminal's cursor: such bytes as \\xHH, a backslash doubled."""
    return "".join(
        character if character.isprintable() and character != "\\" else escaped(character) for character in text
    )


def escaped(character):
    """One character as printable() shows it; what came from undecodable bytes as these."""
    if character == "\\":
        return "\\\\"
    return "".join("\\x%02X" % byte for byte in character.encode("utf-8", "surrogateescape"))


def told(error):
    """An OSError as one line: what it is about, and the system's own word."""
    word = error.strerror or str(error)
    return word if error.filename is None else "%s: %s" % (printable(os.fsdecode(error.filename)), word)
