#!/usr/bin/env python3
"""Runs the monitoring mode with the sample configuration that ships, under Wine, until its trigger fires; checks and shows
what it left.

usage: tools/run_monitoring.py RELEASE_FOLDER BUILD_BIN_FOLDER RUN_FOLDER

A child that keeps a processor busy plays the program of the sample, example.exe. Wine has no counters of processes, so a
stand-in for its pdh.dll measures them. Exit status 0 only if the run ended by itself and left a readable dump of the child
and its samples. Needs the environment of tools/wine_session.sh.
"""

import os
import shutil
import subprocess
import sys
import time
from pathlib import Path

from run_collection import Log, RunFailed

sys.path.insert(0, str(Path(__file__).resolve().parent.parent / "tests" / "e2e"))
from minidump import BadDump, MiniDump  # noqa: E402: the path comes first

CHILD_SECONDS = 300
TIME_LIMIT = 240


def start(folder, *command, **more):
    return subprocess.Popen(["wine", *command], cwd=folder, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                            stderr=subprocess.DEVNULL, **more)


def monitor(folder):
    environment = os.environ | {"WINEDLLOVERRIDES": os.environ.get("WINEDLLOVERRIDES", "") + ";pdh=n"}
    child = start(folder, "example.exe", str(CHILD_SECONDS))
    program = start(folder, "support_tool.exe", "monitoring", env=environment)
    try:
        program.wait(TIME_LIMIT)
    finally:
        for process in (program, child):
            process.kill()
            process.wait()


def check(folder, log):
    for text in ("[example-processor-time,example-is-busy] TRIGGER", "stop signaled"):
        if text not in log.text():
            raise RunFailed(f"the log does not say {text!r}; see {log.path}")
    dumps = sorted(folder.glob("example.exe_*.dmp"))
    if len(dumps) != 1:
        raise RunFailed(f"expected one dump in {folder}, found {len(dumps)}; see {log.path}")
    dump = MiniDump(dumps[0].read_bytes())
    if not dump.modules[0].endswith("\\example.exe"):
        raise RunFailed(f"{dumps[0]} is of {dump.modules[0]}")
    samples = (folder / "example-processor-time.csv").read_text().splitlines()[1:]
    if not samples:
        raise RunFailed("there are no samples")
    return dumps[0], dump, samples


def main(release, binaries, run_folder):
    folder = Path(run_folder).resolve()
    shutil.rmtree(folder, ignore_errors=True)
    shutil.copytree(release, folder)
    shutil.copy(Path(binaries) / "cpu_child.exe", folder / "example.exe")
    shutil.copy(Path(binaries) / "process_pdh" / "pdh.dll", folder)

    log = Log()
    begin = time.monotonic()
    monitor(folder)
    seconds = time.monotonic() - begin
    path, dump, samples = check(folder, log)
    values = [float(line.split(",")[1]) for line in samples]
    print(f"\n   configuration  {folder / 'monitoring.json'}")
    print(f"   dump           {path}  ({path.stat().st_size:,} bytes, process {dump.process_id}, "
          f"{dump.threads} threads, {len(dump.modules)} modules)")
    print(f"   samples        {folder / 'example-processor-time.csv'}  ({len(samples)}, highest {max(values):.0f} %)")
    print(f"   log            {log.path}")
    print(f"   time           {seconds:.1f} s\n")
    print("== the trigger fired, the busy process was dumped, and the run ended by itself")


if __name__ == "__main__":
    if len(sys.argv) != 4:
        sys.exit(__doc__)
    try:
        main(*sys.argv[1:])
    except (RunFailed, BadDump, OSError, ValueError, subprocess.TimeoutExpired) as failure:
        sys.exit(f"run failed: {failure}")
