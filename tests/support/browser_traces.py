"""What windows of a session have of their browsers: processes, profile folders and the marks beside them. Browsers that
programs of other sessions have started do not count.
"""
import os
import pathlib
import signal
import time

PREFIX = b"st-engine-"


class BrowserTraces:
    def __init__(self, session):
        self._owner = os.fsencode("WINEPREFIX=" + session.environment["WINEPREFIX"])
        self._profiles = set()  # all that were ever seen

    def processes(self):
        """{process: profile folder}, watches included."""
        found = {}
        for process in pathlib.Path("/proc").glob("[0-9]*"):
            try:
                command = (process / "cmdline").read_bytes().split(b"\0")
                profiles = [part for part in command if PREFIX in part and b"st-engine-watch" != part and b"\n" not in part]
                if not profiles or self._owner not in (process / "environ").read_bytes().split(b"\0"):
                    continue
            except OSError:
                continue
            profile = os.fsdecode(profiles[-1]).removeprefix("--user-data-dir=")
            found[int(process.name)] = pathlib.Path(profile.removeprefix("Z:").replace("\\", "/"))
        self._profiles |= {profile for profile in found.values() if profile.name.startswith("st-engine-")}
        return found

    def profile(self):
        """The profile of the only browser that runs, when it takes connections; else None."""
        ready = {path for path in self.processes().values() if (path / "DevToolsActivePort").exists()}
        return ready.pop() if len(ready) == 1 else None

    def left(self):
        """What there is still, as text; empty when nothing is."""
        files = [path.with_name(path.name + suffix) for path in self._profiles for suffix in ("", ".life")]
        return [f"process {pid}" for pid in self.processes()] + [str(path) for path in files if path.exists()]

    def seconds_until_gone(self, limit):
        """Waits until nothing is left; fails after so many seconds."""
        start = time.monotonic()
        while left := self.left():
            if time.monotonic() - start > limit:
                raise AssertionError(f"left {limit} s after the end: {left}")
            time.sleep(0.05)
        return time.monotonic() - start

    def kill(self):
        """All of it: no program has a say."""
        for pid in self.processes():
            try:
                os.kill(pid, signal.SIGKILL)
            except ProcessLookupError:
                pass
