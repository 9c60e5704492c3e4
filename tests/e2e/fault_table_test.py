#!/usr/bin/env python3
"""Every Windows call that the program depends on, failed in turn, in every scenario (tests/faults/fault_walk.cpp).

  fault_table_test.py [--long] [SCENARIO[:NAME[:CALL[:ERROR]]] ...]

Without --long a few calls of each function fail, each with one error; with it all of them, each with every error.
"""
import argparse
import contextlib
import json
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))

from certificates import make_certificates  # noqa: E402
from ingest import IngestServer  # noqa: E402
from support_tool import BIN, ENVIRONMENT, LAUNCHER, LOGGER_XML, PRIVATE_KEY, windows_path  # noqa: E402

WALK = BIN / "faults"
HANGS, ENDS_BADLY = 3, 1
OUTBOX = {"outbox": "outbox"}


class Result:
    """What the runs of one scenario gave."""

    def __init__(self):
        self.runs = self.struck = self.made = 0
        self.reached = set()
        self.bad = []


class Stage:
    """A folder with the fault build and what its scenarios work on."""

    def __init__(self, folder, upload):
        self.folder = folder
        (folder / "temp").mkdir(parents=True)
        for file in (*WALK.glob("*.exe"), *WALK.glob("*.dll"), BIN / "log.dll"):
            shutil.copy(file, folder)
        shutil.copy(PRIVATE_KEY, folder / "privateKey.pem")
        (folder / "Logger.xml").write_text(LOGGER_XML.format(folder=windows_path(folder / "logs")), encoding="utf-8")
        (folder / "qxlink.json").write_text(json.dumps(upload), encoding="utf-8")
        (folder / "temp" / "qxinst.log").write_text("an installer's log\n", encoding="utf-8")
        (folder / "upload.bin").write_bytes(bytes(range(256)) * 1000)

    def walk(self, limit, *arguments):
        """Returns (exit code, lines). A walk that does not end has no code, and its last line is what Linux says of it."""
        with open(self.folder / "out.txt", "wb") as out:
            process = subprocess.Popen([*LAUNCHER, windows_path(self.folder / "fault_walk.exe"), *arguments],
                                       cwd=self.folder, env=ENVIRONMENT, stdin=subprocess.DEVNULL, stdout=out,
                                       stderr=subprocess.DEVNULL)
            try:
                code = process.wait(limit)
            except subprocess.TimeoutExpired:
                code, state = None, process_state(process.pid)
            finally:
                process.kill()
                process.wait()
        lines = (self.folder / "out.txt").read_text(encoding="utf-8", errors="replace").splitlines()
        return code, lines if code is not None else [*lines, state]


def process_state(pid):
    """Tells a walk that waits from one that is stopped: Wine stops a process while another one reads its memory."""
    with contextlib.suppress(OSError):
        status = pathlib.Path(f"/proc/{pid}/status").read_text(encoding="utf-8")
        return ", ".join(re.findall(r"^(?:State|Threads|TracerPid):.*", status, re.M)).replace("\t", " ")
    return "gone"


def walk_scenario(stage, scenario, arguments, limit):
    """The whole plan: goes on behind a run that ended the process."""
    result = Result()
    begin, names = 0, {}
    while True:
        code, lines = stage.walk(limit, scenario, f"from={begin}", *arguments)
        last = None
        for line in lines:
            if match := re.fullmatch(r"plan (\d+) functions=\d+ calls=(\d+)", line):
                result.made = int(match[2])
            elif match := re.fullmatch(r"run (\d+) (\S+)", line):
                last = int(match[1])
                names[last] = match[2]
                result.reached.add(match[2].split(":")[0])
                result.runs += 1
            elif match := re.fullmatch(r"bad (\d+) (.*)", line):
                result.bad.append(f"{scenario}:{names.get(int(match[1]), '-')} {match[2]}")
            elif match := re.fullmatch(r"walked \d+ struck=(\d+)", line):
                result.struck += int(match[1])
        if code in (0, ENDS_BADLY) and lines and lines[-1].startswith("walked"):
            return result
        what = {HANGS: "does not end", None: "does not end in time"}.get(code, f"crashes, exit code {code}")
        result.bad.append(f"{scenario}:{names.get(last, 'no fault')} {what}; said last: {lines[-2:]}")
        if last is None or code is None:
            return result
        begin = last + 1


def parse(arguments):
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--long", action="store_true", help="fail every call, with every error")
    parser.add_argument("--limit", type=int, default=0, help="seconds for one scenario")
    parser.add_argument("scenarios", nargs="*")
    return parser.parse_args(arguments)


def plan(options, known):
    """[(scenario, arguments for it)]."""
    depth = ["most=40", "errors=all"] if options.long else ["most=3"]
    brief = {} if options.long else {"running_tasks": ["most=2"]}  # a second for each run
    if not options.scenarios:
        return [(name, brief.get(name, depth)) for name in known]
    chosen = []
    for text in options.scenarios:
        scenario, _, only = text.partition(":")
        chosen.append((scenario, [*depth, f"only={only}"] if only else depth))
    return chosen


def main(arguments):
    options = parse(arguments)
    limit = options.limit or (3600 if options.long else 150)
    begin = time.monotonic()
    with tempfile.TemporaryDirectory(prefix="st_faults_") as scratch:
        scratch = pathlib.Path(scratch)
        certificates = make_certificates(scratch / "certificates")
        with IngestServer(scratch / "store", "--cert", str(certificates / "localhost.pem"), "--key",
                          str(certificates / "localhost.key")) as server:
            https = {**OUTBOX, "endpoint": f"https://localhost:{server.port}/files", "proxy": "none", "retries": 1,
                     "retry_delay": 0.02, "ca_file": windows_path(certificates / "ca.pem"),
                     "timeouts": {"connect": 5, "send": 5, "receive": 5, "upload": 15}}
            code, known = Stage(scratch / "list", OUTBOX).walk(60, "list")
            if code != 0:
                sys.exit(f"the scenarios cannot be listed, exit code {code}")

            def one(job):
                scenario, depth = job
                stage = Stage(scratch / scenario, https if scenario == "upload_https" else OUTBOX)
                return scenario, walk_scenario(stage, scenario, depth, limit)

            # One at a time: two walks in one Wine session have frozen each other, and are no faster.
            results = dict(one(job) for job in plan(options, known))
    return report(results, time.monotonic() - begin)


def report(results, seconds):
    for scenario, result in results.items():
        print(f"{scenario:22} {len(result.reached):3} functions, {result.made:5} calls, {result.runs:5} runs, "
              f"{result.struck:5} struck, {len(result.bad)} bad")
    bad = [line for result in results.values() for line in result.bad]
    reached = set().union(*(result.reached for result in results.values()))
    runs = sum(result.runs for result in results.values())
    print(*bad, sep="\n")
    print(f"{len(reached)} calls x {len(results)} scenarios, {runs} runs in {seconds:.0f} s, {len(bad)} bad")
    return 1 if bad or not runs else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
