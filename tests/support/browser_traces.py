"""What windows of a session have of their browsers: processes, profile folders and the marks beside them. Browsers that
programs of other sessions have started do not count.
"""
import contextlib
import os
import pathlib
import signal
import time

PREFIX = "st-engine-"


def _commands():
    """(folder in /proc, command line) of every process that names a profile."""
    for process in pathlib.Path("/proc").glob("[0-9]*"):
        with contextlib.suppress(OSError):
            command = (process / "cmdline").read_bytes()
            if os.fsencode(PREFIX) in command:
                yield process, command


def _profile_of(command):
    """The profile folder that a command line names last, if it names one."""
    for part in reversed(os.fsdecode(command).split("\0")):
        path = pathlib.Path(part.removeprefix("--user-data-dir=").removeprefix("Z:").replace("\\", "/"))
        if path.is_absolute() and path.name.startswith(PREFIX):
            return path
    return None


def processor_seconds(pids):
    """The processor time that processes have used so far."""
    total = 0
    for pid in pids:
        with contextlib.suppress(OSError):
            fields = pathlib.Path(f"/proc/{pid}/stat").read_text().rsplit(")", 1)[1].split()
            total += int(fields[11]) + int(fields[12])
    return total / os.sysconf("SC_CLK_TCK")


class BrowserTraces:
    def __init__(self, session):
        self._owner = os.fsencode("WINEPREFIX=" + session.environment["WINEPREFIX"])
        self._profiles = set()  # all that were ever seen

    def profiles(self):
        """The profile folders of the browsers that run."""
        found = set()
        for process, command in _commands():
            with contextlib.suppress(OSError):
                profile = _profile_of(command)
                if profile and self._owner in (process / "environ").read_bytes().split(b"\0"):
                    found.add(profile)
        self._profiles |= found
        return found

    def processes(self):
        """The processes of these browsers, watches included: by the profile's name, as most of them write over their own
        environment."""
        self.profiles()
        names = [os.fsencode(profile.name) for profile in self._profiles]
        return [int(process.name) for process, command in _commands() if any(name in command for name in names)]

    def profile(self):
        """The profile of the only browser that runs, when it takes connections; else None."""
        ready = [path for path in self.profiles() if (path / "DevToolsActivePort").exists()]
        return ready[0] if len(ready) == 1 else None

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
            with contextlib.suppress(ProcessLookupError):
                os.kill(pid, signal.SIGKILL)
