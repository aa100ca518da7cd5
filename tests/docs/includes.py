#!/usr/bin/env python3
"""Checks the table of folders in the architecture page against the include lines of the sources.

usage: includes.py ARCHITECTURE_PAGE
"""

import re
import sys
from pathlib import Path

ROOT = Path(__file__).resolve().parents[2]


def documented(page: Path) -> dict[str, set[str]]:
    """The folders of the table, each with those that it includes from."""
    rows = re.findall(r"^\| `(\w+)/` \| .* \|(.*)\|$", page.read_text(), re.MULTILINE)
    return {folder: set(re.findall(r"`(\w+)/`", included)) for folder, included in rows}


def actual(folder: str) -> set[str]:
    """The other folders whose headers a folder's sources include."""
    sources = [*(ROOT / folder).rglob("*.cpp"), *(ROOT / folder).rglob("*.hpp")]
    lines = (line for source in sources for line in source.read_text().splitlines())
    return {match[1] for line in lines if (match := re.match(r'#include "(\w+)/', line))} - {folder}


def main(page: str) -> int:
    folders = documented(Path(page))
    if not folders:
        print("no table of folders")
        return 1
    wrong = {folder: actual(folder) for folder, included in folders.items() if actual(folder) != included}
    for folder, included in wrong.items():
        print(f"{folder}/ includes from {sorted(included)}; the page says {sorted(folders[folder])}")
    return 1 if wrong else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
