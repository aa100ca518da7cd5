"""morvane-watch: runs Morvane every night, keeps its logs, and tells what differs from the accepted state.

Python 3.6 and its standard library are enough, as enterprise distributions have them.
"""
