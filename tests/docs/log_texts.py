"""Holds docs/log-format.md against the program's sources: log_texts.py ROOT

Every text that the page quotes is a string literal of the program, and every literal that the program hands to a
log function is quoted on the page.
"""

import pathlib
import re
import sys

FOLDERS = ["main", "foundation", "fc", "host", "scsi", "multipath"]
LITERAL = r'"(?:[^"\\\n]|\\.)*"'
# Texts that only carry other texts.
CARRIERS = {'"%s"', '"%s\\n"', '" %s\\n"'}


def sources(root):
    for folder in FOLDERS:
        for path in sorted((root / folder).glob("*.[ch]pp")):
            text = path.read_text()
            # A literal that is split over lines is one literal.
            yield re.sub(r'(?<!\\)"\s*\n\s*"', "", text)


def main():
    root = pathlib.Path(sys.argv[1])
    page = (root / "docs/log-format.md").read_text()
    quoted = {text.replace("\\|", "|") for text in re.findall(rf"`({LITERAL})`", page)}
    literals = set()
    logged = set()
    for text in sources(root):
        literals.update(re.findall(LITERAL, text))
        calls = rf"\b(?:logPrintf|logPrintfNoThrow|Clib_fprintf\((?:gLogStream|stream),)\(?\s*({LITERAL})"
        logged.update(re.findall(calls, text))
    missing = sorted(quoted - literals)
    unquoted = sorted(logged - quoted - CARRIERS)
    for text in missing:
        print("quoted, but no text of the program:", text)
    for text in unquoted:
        print("written to the log, but not quoted:", text)
    print(f"{len(quoted)} texts quoted, {len(logged)} handed to a log function")
    return 1 if missing or unquoted or len(quoted) < 150 else 0


if __name__ == "__main__":
    sys.exit(main())
