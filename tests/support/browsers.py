"""The browsers that engines have started, as the Unix machine sees them, and what processes cost."""
import contextlib
import os
import pathlib
import re


def _commands():
    for process in pathlib.Path("/proc").glob("[0-9]*"):
        with contextlib.suppress(OSError):
            command = (process / "cmdline").read_bytes()
            if b"st-engine-" in command:
                yield process, command


def profiles_in_use(session):
    """The profile folders of the browsers of a session's programs."""
    mark = b"WINEPREFIX=" + os.fsencode(session.environment["WINEPREFIX"])
    found = set()
    for process, command in _commands():
        with contextlib.suppress(OSError):
            if mark in (process / "environ").read_bytes().split(b"\0"):
                found.add(pathlib.Path("/tmp") / re.search(rb"st-engine-[0-9A-Za-z]+", command).group().decode())
    return found


def processes_of(profiles):
    """The processes of these browsers, the watching shells included. Most write their own text over their environment."""
    names = [os.fsencode(profile.name) for profile in profiles]
    return [int(process.name) for process, command in _commands() if any(name in command for name in names)]


def browser_processes(session):
    return processes_of(profiles_in_use(session))


def processor_seconds(pids):
    total = 0
    for pid in pids:
        with contextlib.suppress(OSError):
            fields = pathlib.Path(f"/proc/{pid}/stat").read_text().rsplit(")", 1)[1].split()
            total += int(fields[11]) + int(fields[12])
    return total / os.sysconf("SC_CLK_TCK")
