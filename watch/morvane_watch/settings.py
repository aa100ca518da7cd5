"""The settings of /etc/morvane/watch.conf: one `name = value` a line, `#` begins a comment."""

import re

from .trouble import printable, told

MOST_BYTES = 4096

# Each whole number with its default, the least and the most it may be.
KNOWN = {
    "keep": (30, 1, 100000),  # the newest logs, so many
    "weeks": (52, 0, 5200),  # one log of each of so many weeks
    "timeout": (3600, 1, 7200),  # seconds that Morvane may take; the unit's TimeoutStartSec is above the most
}


class Settings:
    """keep, weeks and timeout as whole numbers; metrics, the path of a file or None; and troubles: what is wrong in the
    file, a text each. A setting that is wrong has its default."""

    def __init__(self):
        self.troubles = []
        self.keep, self.weeks, self.timeout = (default for default, _, _ in KNOWN.values())
        self.metrics = None

    def take(self, name, value):
        """Sets one setting from the file's texts; gives what is wrong with it, or None."""
        if name == "metrics":
            if not re.fullmatch(r"/.*[^/]\.prom", value):
                return "metrics is no path from / to a file NAME.prom: %s" % printable(value)
            self.metrics = value
            return None
        if name not in KNOWN:
            return "there is no setting %s" % (printable(name) or "without a name")
        _, least, most = KNOWN[name]
        if not re.fullmatch("[0-9]{1,9}", value) or not least <= int(value) <= most:
            return "%s is no whole number from %d to %d: %s" % (name, least, most, printable(value))
        setattr(self, name, int(value))
        return None


def read(path):
    """The Settings of the file at path; without the file, the defaults. Raises nothing: what is wrong is in troubles."""
    settings = Settings()
    try:
        with open(path, "rb") as file:
            content = file.read(MOST_BYTES + 1)
    except FileNotFoundError:
        return settings
    except OSError as error:
        settings.troubles.append(told(error))
        return settings
    if len(content) > MOST_BYTES:
        settings.troubles.append("%s: is longer than %d bytes" % (path, MOST_BYTES))
        return settings
    for number, line in enumerate(content.decode("utf-8", "surrogateescape").split("\n"), 1):
        line = line.split("#", 1)[0].strip()
        if not line:
            continue
        name, _, value = line.partition("=")
        wrong = settings.take(name.strip(), value.strip())
        if wrong:
            settings.troubles.append("%s, line %d: %s" % (path, number, wrong))
    return settings
