#!/usr/bin/env python3
"""How the laboratory's judge reads a log."""

import sys
import unittest
from pathlib import Path

sys.path.insert(0, str(Path(__file__).resolve().parents[2] / "lab"))
import morvane_log

# Some report texts have no line end of their own, so that a trace line may stand behind one.
LOG = """\
Entered Function main Line 31

================================================
============== DAS DEVICE DETAILS ==============
================================================
Entered Function operator const uint8* Line 74
Left Function operator const uint8* Line 76
Added to DevMap 1 --> /dev/sda --> 2

--------> Device Name: |/dev/sda| LunId: |5000C5001A2B3C4D|

Entered Function ~ZebBuffer Line 50
Could not open /dev/sdb for read!Left Function operator uint8* Line 69

--------> Device Name: |/dev/sdb| is not supported

"""


class TraceLines(unittest.TestCase):
    def test_are_left_out_whatever_the_function_is_called(self):
        das = """\
Added to DevMap 1 --> /dev/sda --> 2

--------> Device Name: |/dev/sda| LunId: |5000C5001A2B3C4D|

Could not open /dev/sdb for read!
--------> Device Name: |/dev/sdb| is not supported

"""
        self.assertEqual(
            morvane_log.read(LOG),
            morvane_log.Report(
                sections={"DAS": das},
                das=[("/dev/sda", "5000C5001A2B3C4D")],
                not_supported=["/dev/sdb"],
                claimed=[("/dev/sda", 2)],
            ),
        )


if __name__ == "__main__":
    unittest.main()
