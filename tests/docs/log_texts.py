"""Holds docs/log-format.md against the program's sources and the reader of logs: log_texts.py ROOT

Every text that the page quotes is a string literal of the program, and every literal that the program hands to a
log function is quoted on the page. Every text on the page is one that morvane-view knows, and the other way round.
"""

import pathlib
import re
import sys

FOLDERS = ["main", "foundation", "fc", "host", "scsi", "multipath"]
LITERAL = r'"(?:[^"\\\n]|\\.)*"'
# Texts that only carry other texts.
CARRIERS = {'"%s"', '"\\n%s\\n%s\\n%s\\n"', '"%s\\n"', '" %s\\n"'}
# Texts from which the program puts a line together; the reader knows the line.
PIECES = {'"\\n"', '" %s\\n"', '"|_ Adapter wwnn "', '"|  |_ Initiator wwpn "', '"|  |  |_ Target wwnn "', '" wwpn "',
          '" bus %u target# %u\\n"', '"|_ Initiator IQN "', '"|  |_ Target IQN"'}
LINES = {'"|_ Adapter wwnn %s\\n"', '"|  |_ Initiator wwpn %s\\n"',
         '"|  |  |_ Target wwnn %s wwpn %s bus %u target# %u\\n"', '"|_ Initiator IQN  %s\\n"',
         '"|  |_ Target IQN %s\\n"'}
# Texts that stand within the fields of others.
VALUES = {'"::"', '" :: "', '":-( SCSI_Inquiry_Failed"', '"Invalid Hbaapi Status Code"'}
# Of the two texts that close a quote on the next line, the reader knows the quote as a text of its own.
QUOTE = '"\'"'


def literals_of(path):
    """A source's text, in which a literal that is split over lines is one literal."""
    return re.sub(r'(?<!\\)"\s*\n\s*"', "", path.read_text())


def sources(root):
    for folder in FOLDERS:
        for path in sorted((root / folder).rglob("*.[ch]pp")):
            yield literals_of(path)


def banner_lines(source):
    """The lines that a banner is written in, each with the line ends that it has there."""
    for rule in re.findall(r'"(=+)"', source):
        yield rf'"{rule}\n"'
        yield rf'"\n{rule}\n"'
    for title in re.findall(rf"reportBanner\(({LITERAL})\)", source):
        yield title[:-1] + r'\n"'


def chained_texts(source):
    """The texts that are put together piece by piece, as printf would have them."""
    piece = rf"\s*\.(text|string|decimal|hex)\(({LITERAL}|[^()]*(?:\([^()]*\))?)\)"
    for chain in re.findall(rf"\b(?:text|line)((?:{piece})+)", source):
        pieces = re.findall(piece, chain[0])
        yield '"' + "".join({"text": value[1:-1], "string": "%s", "decimal": "%u", "hex": "%x"}[kind]
                            for kind, value in pieces) + '"'


def form(text):
    """What the reader and the page have in common of a text: the line ends before it and the empty lines behind it
    are not part of it, a text field reads an address as well, and a sign, a width or a precision is no matter."""
    text = re.sub(r"^(?:\\n)+", "", text[1:-1])
    text = re.sub(r"(?:\\n)+'?$", r"\\n", text)
    if re.fullmatch("=+ [A-Z ]+ =+", text):
        text += r"\n"  # the rule behind a tree's name begins with the line end
    text = re.sub(r"%[-0-9.]*l?([a-z])", r"%\1", text)
    return text.replace("%d", "%u").replace("%p", "%s")


def compare_with_reader(root, quoted):
    """Prints what only the page or only the reader has; whether there is any."""
    known = set(re.findall(rf"\{{Text::\w+,\s*({LITERAL})[,}}]", literals_of(root / "view/read/known_texts.cpp")))
    on_page = {form(text): text for text in quoted - PIECES - VALUES}
    in_reader = {form(text): text for text in known - LINES - {QUOTE}}
    unknown = sorted(on_page[text] for text in on_page.keys() - in_reader.keys())
    unwritten = sorted(in_reader[text] for text in in_reader.keys() - on_page.keys())
    for text in unknown:
        print("quoted, but not known to morvane-view:", text)
    for text in unwritten:
        print("known to morvane-view, but not quoted:", text)
    print(f"{len(known)} texts known to morvane-view")
    return bool(unknown or unwritten or len(known) < 150)


def main():
    root = pathlib.Path(sys.argv[1])
    page = (root / "docs/log-format.md").read_text()
    quoted = {text.replace("\\|", "|") for text in re.findall(rf"`({LITERAL})`", page)}
    literals = set()
    logged = set()
    for text in sources(root):
        literals.update(re.findall(LITERAL, text))
        literals.update(banner_lines(text))
        calls = (rf"\b(?:(?:log|report)Printf(?:NoThrow)?\(|Clib_fprintf\(stream,|trace\.log\(|logAndFail<\w+>\("
                 rf"|failAfterExit<\w+>\(trace, \w+,)\s*({LITERAL})")
        logged.update(re.findall(calls, text))
        chained = set(chained_texts(text)) - CARRIERS - PIECES
        literals.update(chained)
        logged.update(chained)
    missing = sorted(quoted - literals)
    unquoted = sorted(logged - quoted - CARRIERS)
    for text in missing:
        print("quoted, but no text of the program:", text)
    for text in unquoted:
        print("written to the log, but not quoted:", text)
    print(f"{len(quoted)} texts quoted, {len(logged)} handed to a log function")
    differs = compare_with_reader(root, quoted)
    return 1 if missing or unquoted or len(quoted) < 150 or differs else 0


if __name__ == "__main__":
    sys.exit(main())
