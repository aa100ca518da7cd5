#!/usr/bin/env python3
"""Checks the tables of rooms in the architecture page against the include lines of the sources.

usage: includes.py ARCHITECTURE_PAGE

A room is a folder, without the folders below it that the page lists as rooms of their own. A table lists rooms from the
lowest to the highest: a room includes from rooms of its table above it and from no others.
"""

import re
import sys
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]
ROOM = r"`([\w/]+)/`"


def tables(page: Path) -> list[dict[str, set[str]]]:
    """Every table of rooms: the rooms in the table's order, each with those that it includes from."""
    rows = r"(?:^\| " + ROOM + r" \| .* \|.*\|$\n?)+"
    return [{row[1]: set(re.findall(ROOM, row[2]))
             for row in re.finditer(r"^\| " + ROOM + r" \| .* \|(.*)\|$", table[0], re.MULTILINE)}
            for table in re.finditer(rows, page.read_text(), re.MULTILINE)]


def room_of(path: str, rooms: set[str]) -> str:
    """The room that a file is in; its folder where the page lists none."""
    folders = [str(folder) for folder in Path(path).parents]
    return next((folder for folder in folders if folder in rooms), folders[0])


def actual(room: str, rooms: set[str]) -> set[str]:
    """The other rooms whose headers a room's sources include."""
    sources = [source for source in (ROOT / room).rglob("*.[ch]pp")
               if room_of(str(source.relative_to(ROOT)), rooms) == room]
    lines = (line for source in sources for line in source.read_text().splitlines())
    return {room_of(match[1], rooms) for line in lines if (match := re.match(r'#include "([^"]+/[^"]+)"', line))} - {room}


def main(page: str) -> int:
    found = tables(Path(page))
    rooms = {room for table in found for room in table}
    wrong = 0 if found and all(len(table) > 1 for table in found) else 1
    for table in found:
        lower: set[str] = set()
        for room, documented in table.items():
            included = actual(room, rooms)
            if included != documented:
                print(f"{room}/ includes from {sorted(included)}; the page says {sorted(documented)}")
                wrong += 1
            if included - lower:
                print(f"{room}/ includes from {sorted(included - lower)}, which the page does not list below it")
                wrong += 1
            lower.add(room)
    print(f"{len(rooms)} rooms")
    return 1 if wrong else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
