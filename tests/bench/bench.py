#!/usr/bin/env python3
"""Measures the program against native peers: same files, same run, rounds in turn, medians.

usage: bench.py [--list] [--rounds N] [--programs FOLDER] [ROW...]

Ours runs under Wine, the peer natively. The peer's time is that of its whole process. Ours is the time of the job, as the
program itself measures it: in the product it is a call in a running process, and what starting one under Wine costs is
the row `start`. The ratio is the median of the rounds' own ratios; below 1 ours is faster (or smaller). Speed is reported, never asserted: the exit status is 1 only when
something failed to run or made a wrong result.

A row is a function that takes a Bench and yields Lines, and one line in ROWS.
"""
import argparse
import difflib
import json
import os
import random
import re
import shutil
import statistics
import subprocess
import sys
import time
from typing import NamedTuple

import make_corpus
import make_package

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path.insert(0, f"{ROOT}/tests/support")

import ingest  # noqa: E402  (of the tests: the receiving server)

FOLDER = f"{ROOT}/build/bench"
SESSION = f"{ROOT}/tools/wine_session.sh"
MIB = 1 << 20
KEY_PART = 8 + 140  # what a package has before the encrypted archive, for a key of 1024 bits


class Line(NamedTuple):
    name: str
    ours: str
    peer: str
    ratio: float | None  # None where the goal is about `value`
    goal: float
    value: float | None = None  # what the goal bounds, when that is not the ratio

    def print(self):
        value = self.ratio if self.value is None else self.value
        ratio = "-" if self.ratio is None else f"{self.ratio:.2f}" if self.ratio >= 0.1 else f"{self.ratio:.4f}"
        verdict = "reached" if value <= self.goal else "MISSED"
        print(f"{self.name:24} {self.ours:>11} {self.peer:>11} {ratio:>6} {self.goal:>6.3g}  {verdict}", flush=True)


class Bench:
    def __init__(self, programs, rounds):
        self.programs = programs
        self.rounds = rounds
        self.wine = wine_environment()

    def corpus(self, name):
        return make_corpus.make_corpus(FOLDER, name)

    def ours(self, program, *arguments):
        """The command line of a program of the build; to be run with `wine=True`."""
        path = f"{self.programs}/{program}.exe"
        if not os.path.exists(path):
            raise RuntimeError(f"{path} is not built")
        return ["wine", path, *arguments]

    def run(self, command, wine=False):
        """Seconds of one run: what the program says of its job, else the whole process on the wall clock."""
        begin = time.perf_counter()
        output = subprocess.run(command, cwd=FOLDER, env=self.wine if wine else None, stdin=subprocess.DEVNULL,
                                stdout=subprocess.PIPE, text=True, check=True).stdout
        seconds = time.perf_counter() - begin
        job = re.search(r"seconds=([0-9.]+)", output)
        return float(job.group(1)) if job else seconds

    def output(self, command):
        """What one of our programs prints."""
        return subprocess.run(command, cwd=FOLDER, env=self.wine, stdin=subprocess.DEVNULL, check=True, text=True,
                              stdout=subprocess.PIPE).stdout

    def compare(self, name, goal, ours, peer, before=lambda: None, after=lambda: None, peer_in_wine=False):
        """A line about the time of two commands. `before` and `after` are called around each run, outside the clock."""
        def timed(side):
            before()
            seconds = self.run(*side)
            after()
            return seconds

        sides = ((ours, True), (peer, peer_in_wine))
        for side in sides:
            timed(side)  # warm up: files into the cache, services of the session
        pairs = []
        for index in range(self.rounds):
            if index % 2:
                peer_seconds = timed(sides[1])
                pairs.append((timed(sides[0]), peer_seconds))
            else:
                pairs.append((timed(sides[0]), timed(sides[1])))
        ours_time, peer_time = (statistics.median(side) for side in zip(*pairs))
        ratio = statistics.median(one / other for one, other in pairs)
        return Line(name, f"{ours_time:.3f} s", f"{peer_time:.3f} s", ratio, goal)

    def peak_over_idle(self, name, goal_mib, command, idle, before=lambda: None):
        """A line about the memory of one of our commands over that of another one; both print their own peak."""
        def peak(side):
            before()
            return int(re.search(r"peak_memory=(\d+)", self.output(side)).group(1))

        rounds = [(peak(command), peak(idle)) for _ in range(3)]
        over = max(one for one, _ in rounds) - min(other for _, other in rounds)
        return Line(name, f"{over / MIB:.1f} MiB", "-", None, goal_mib, over / MIB)


def wine_environment():
    up = subprocess.run(["bash", "-c", f"source {SESSION} && st_wine_up && env -0"], check=True, text=True,
                        stdin=subprocess.DEVNULL, stdout=subprocess.PIPE)
    return dict(item.split("=", 1) for item in up.stdout.split("\0") if "=" in item)


def remove(path):
    if os.path.exists(path):
        os.remove(path)


# --- rows

def pack(corpus, time_goal, size_goal):
    def row(bench):
        folder, ours, peer = bench.corpus(corpus), f"{FOLDER}/ours.zip", f"{FOLDER}/peer.zip"

        def clear():
            remove(ours), remove(peer)

        def check():
            if os.path.exists(ours):
                subprocess.run([sys.executable, f"{ROOT}/tests/bench/verify_archive.py", ours, folder], check=True)
                sizes["ours"] = os.path.getsize(ours)
            else:
                sizes["peer"] = os.path.getsize(peer)

        sizes = {}
        yield bench.compare(f"pack-{corpus}", time_goal, bench.ours("pack_bench", ours, corpus),
                            ["zip", "-6", "-r", "-q", peer, corpus], clear, check)
        clear()
        yield Line("  archive size", f"{sizes['ours']} B", f"{sizes['peer']} B", sizes["ours"] / sizes["peer"], size_goal)
    return row


def pack_memory(bench):
    archive = f"{FOLDER}/ours.zip"
    idle = bench.ours("pack_bench", archive)
    for corpus, goal in (("mixed", 24), ("small", 24), ("big", 40)):
        bench.corpus(corpus)
        yield bench.peak_over_idle(f"pack-memory {corpus}", goal, bench.ours("pack_bench", archive, corpus), idle)
    remove(archive)


def encrypt(bench):
    archive, ours, peer = f"{bench.corpus('big')}/{os.listdir(bench.corpus('big'))[0]}", f"{FOLDER}/ours.bin", f"{FOLDER}/peer.bin"
    size = os.path.getsize(archive)

    def before():
        remove(peer)
        shutil.copyfile(archive, ours)

    def after():
        package = os.path.getsize(ours)
        if package not in (size, size + KEY_PART):
            raise RuntimeError(f"a package of {package} bytes for an archive of {size}")

    # The peer's key is as long as the one that the provider uses, and as arbitrary.
    openssl = ["openssl", "enc", "-rc4", "-provider", "legacy", "-provider", "default", "-K", "0123456789" + 22 * "0",
               "-in", archive, "-out", peer]
    yield bench.compare("encrypt", 1.15, bench.ours("encrypt_bench", ours), openssl, before, after)
    yield bench.peak_over_idle("  peak memory", 2.2 * size / MIB, bench.ours("encrypt_bench", ours),
                               bench.ours("pack_bench", f"{FOLDER}/ours.zip"), before)
    for path in (ours, peer, f"{FOLDER}/ours.zip"):
        remove(path)


def md5(bench):
    folder = bench.corpus("pe")
    files = sorted(os.path.join(at, name) for at, _, names in os.walk(folder) for name in names)
    ours, peer = bench.ours("md5_bench", folder), ["openssl", "md5", "-r", *files]
    expected = subprocess.run(peer, check=True, text=True, stdout=subprocess.PIPE).stdout
    digests = sorted(line.split()[0] for line in expected.splitlines())
    if digests != sorted(re.findall(r"^([0-9a-f]{32}) ", bench.output(ours), re.MULTILINE)):
        raise RuntimeError("the digests differ from the peer's")
    yield bench.compare("md5", 0.60, ours, peer)


def handles(bench):
    output = bench.output(bench.ours("handles_bench", "500000", "400"))
    rows = re.findall(r"^(.*): grouped ms=([0-9.]+) scanned ms=([0-9.]+) ratio=([0-9.]+)", output, re.MULTILINE)
    if len(rows) != 2:
        raise RuntimeError(f"unexpected output: {output}")
    for table, ours, peer, ratio in rows:
        yield Line(f"handles {table}", f"{ours} ms", f"{peer} ms", float(ratio), round(1 / 30, 3))


def walk(bench):
    command = bench.ours("walk_bench", bench.corpus("small"))
    figures = dict(re.findall(r"(walk_dir ms|bare ms|ratio)=([0-9.]+)", bench.output(command)))
    yield Line("walk", f"{figures['walk_dir ms']} ms", f"{figures['bare ms']} ms", float(figures["ratio"]), 1.5)


def product_files(bench):
    folder = f"{FOLDER}/product"
    with open(f"{bench.programs}/product_part.dll", "rb") as part:
        paths = make_corpus.make_product(folder, part.read())
    ours = bench.ours("product_files_bench", "product")
    if f"records={len(paths)}" not in bench.output(ours):
        raise RuntimeError("not every file was described")
    yield bench.compare("product-files", 0.60, ours, ["openssl", "md5", *paths])


def events(bench):
    def side(job, writer):
        return bench.ours("events_bench", job, writer, f"{writer}.json")

    yield bench.compare("events", 0.60, side("document", "ours"), side("document", "library"), peer_in_wine=True)
    with open(f"{FOLDER}/ours.json", "rb") as ours, open(f"{FOLDER}/library.json", "rb") as library:
        if ours.read() != library.read():
            raise RuntimeError("the writers do not agree")
    yield bench.compare("  from the log on", 1, side("records", "ours"), side("records", "library"), peer_in_wine=True)
    yield bench.peak_over_idle("  memory to write it", 1, side("document", "ours"), side("document", "none"))
    for writer in ("ours", "library"):
        remove(f"{FOLDER}/{writer}.json")


def start(bench):
    # Without a job the program comes up, writes its first lines and ends: a little more than what the goal is about.
    yield bench.compare("start", 4, bench.ours("support_tool", "nogui"), bench.ours("empty_program"), peer_in_wine=True)


def event_queue(bench):
    # The peer keeps the machine busy beyond its own time, so the rounds are few.
    command = bench.ours("event_queue_bench", "1000", "10", "5")
    figures = {}
    for _ in range(min(3, bench.rounds)):
        for who, rest in re.findall(r"^(queue|threads) (.*)$", bench.output(command), re.MULTILINE):
            for name, value in re.findall(r"(\w+)=([0-9.]+)", rest):
                figures.setdefault((who, name), []).append(float(value))
    middle = {key: statistics.median(values) for key, values in figures.items()}

    def line(title, name, unit, goal):
        ours, peer = middle["queue", name], middle["threads", name]
        return Line(title, f"{ours:.2f}{unit}", f"{peer:.2f}{unit}", ours / peer, goal, ours)

    yield line("event-queue", "median_error_ms", " ms", 2)
    yield line("  processors", "processors", "", 1)
    if middle["queue", "runs"] < 0.95:
        raise RuntimeError(f"of all runs only {middle['queue', 'runs']:.2f} came")


def upload(bench):
    size = 50 * MIB
    stage = f"{FOLDER}/upload"
    shutil.rmtree(stage, ignore_errors=True)
    os.makedirs(stage)
    for name in ("upload_child.exe", "qxlink.dll", "log.dll"):
        shutil.copy(f"{bench.programs}/{name}", stage)
    with open(f"{stage}/package.zip", "wb") as file:
        file.write(random.Random(50).randbytes(size))
    subprocess.run([f"{ROOT}/tools/ingest/install.sh"], check=True, stdout=subprocess.DEVNULL)

    def ours(*options):
        output = bench.output(["wine", f"{stage}/upload_child.exe", f"{stage}/package.zip", *options])
        if "result=0 " not in output:
            raise RuntimeError(f"the upload failed: {output}")
        return output

    def our_speed():
        return size / float(re.search(r"seconds=([0-9.]+)", ours()).group(1))

    with ingest.IngestServer(f"{stage}/server") as server:
        address = f"http://localhost:{server.port}/files"
        with open(f"{stage}/qxlink.json", "w", encoding="utf-8") as file:
            json.dump({"endpoint": address, "allow_plain_http": True, "proxy": "none"}, file)
        with open(f"{stage}/package.zip", "rb") as file:
            data = file.read()
        client = ingest.TusClient(server.port)
        metadata = ingest.metadata_for(data)

        def peer_speed():
            _, location, _ = client.create(data, metadata)
            output = subprocess.run(
                ["curl", "--silent", "--fail", "--noproxy", "*", "--output", os.devnull, "--write-out", "%{speed_upload}",
                 "--request", "PATCH", "--header", "Tus-Resumable: 1.0.0", "--header", "Upload-Offset: 0", "--header",
                 "Content-Type: application/offset+octet-stream", "--upload-file", f"{stage}/package.zip",
                 f"http://localhost:{server.port}{location}"], check=True, text=True, stdout=subprocess.PIPE).stdout
            return float(output)

        our_speed(), peer_speed()
        pairs = [(our_speed(), peer_speed()) if index % 2 else (peer_speed(), our_speed())[::-1]
                 for index in range(bench.rounds)]
        own, other = (statistics.median(side) / MIB for side in zip(*pairs))
        # Of speeds, the larger is the better: the line shows the peer's time as it shows it for all jobs.
        yield Line("upload", f"{own:.0f} MiB/s", f"{other:.0f} MiB/s",
                   statistics.median(peer / mine for mine, peer in pairs), 1 / 0.9)

        def peak(*options):
            return int(re.search(r"peak_memory=(\d+)", ours(*options)).group(1))

        over = max(peak() for _ in range(3)) - min(peak("idle") for _ in range(3))
        yield Line("  peak memory", f"{over / MIB:.1f} MiB", "-", None, 16, over / MIB)
    shutil.rmtree(stage)


def report_page(bench):
    report = f"{FOLDER}/report.html"
    subprocess.run([f"{ROOT}/tests/pages/install.sh"], check=True, stdout=subprocess.DEVNULL)
    subprocess.run(["node", f"{ROOT}/tests/pages/report_sample.mjs", f"{os.path.dirname(bench.programs)}/report_page.html", report,
                    "50000"], check=True)
    browser = next(filter(None, map(shutil.which, ("chromium", "chromium-browser", "google-chrome"))), None)
    if not browser:
        raise RuntimeError("no Chromium is installed")
    output = subprocess.run(["node", f"{ROOT}/tests/bench/report_page_bench.mjs", report, browser, str(bench.rounds)], check=True,
                            text=True, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE).stdout
    figures = {name: float(value) for name, value in re.findall(r"(\w+)=([0-9.]+)", output)}
    yield Line("report-page open", f"{figures['open_ms']:.0f} ms", "-", None, 2000, figures["open_ms"])
    yield Line("  keystroke", f"{figures['keystroke_ms']:.0f} ms", "-", None, 100, figures["keystroke_ms"])
    yield Line("  slowest keystroke", f"{figures['slowest_keystroke_ms']:.0f} ms", "-", None, 100, figures["slowest_keystroke_ms"])
    remove(report)
def report(bench):
    package, page = make_package.make_package(f"{FOLDER}/package.zip"), f"{FOLDER}/report.html"
    ours = bench.ours("support_report", package.rsplit("/", 1)[1], "-o", "report.html")
    # The peer unpacks and parses the same documents, and writes them again as one; findings are exit code 1.
    peer = ("import json, sys, zipfile; archive = zipfile.ZipFile(sys.argv[1]); "
            "documents = {n: json.loads(archive.read(n)) for n in archive.namelist() if n.endswith('.json')}; "
            "json.dump(documents, open(sys.argv[2], 'w'))")
    line = bench.compare("report", 1.5, ["sh", "-c", '"$@" > report.log; [ $? -le 1 ]', "sh", *ours],
                         [sys.executable, "-c", peer, package, f"{FOLDER}/peer.json"], lambda: remove(page))
    yield line
    yield Line("  seconds", line.ours, "-", None, 3, float(line.ours.split()[0]))
    bench.run(["sh", "-c", '"$@" > report.log; [ $? -le 1 ]', "sh", *ours], wine=True)
    with open(page, encoding="utf-8") as file:
        data = json.loads(re.search(r'<script type="application/json" id="report-data">(.*?)</script>', file.read(), re.S)[1])
    rows = {table["id"]: len(table["rows"]) for table in data["tables"]}
    if (rows["events"], rows["processes"]) != (50_000, 400):
        raise RuntimeError(f"the report holds {rows}")
    for path in (page, f"{FOLDER}/peer.json", f"{FOLDER}/report.log"):
        remove(path)


ROWS = {
    "pack-mixed": ("50 MiB in 400 mixed files, against zip -6", pack("mixed", 0.60, 1.02)),
    "pack-small": ("38 MiB in 10,000 files, against zip -6", pack("small", 0.90, 1.02)),
    "pack-big": ("one file of 50 MiB, against zip -6", pack("big", 0.75, 1.01)),
    "pack-memory": ("peak memory of packing over an idle run", pack_memory),
    "encrypt": ("RC4 of 50 MiB, file to file, against openssl enc -rc4; its peak memory", encrypt),
    "md5": ("MD5 of 600 executables and libraries, 600 MiB, against openssl md5", md5),
    "handles": ("500,000 handles of 400 processes by process, against a scan for each; 1/30 is the goal", handles),
    "walk": ("10,000 files, against a bare FindFirstFile loop", walk),
    "product-files": ("version and MD5 of 500 libraries, 400 MB, against openssl md5", product_files),
    "events": ("20,000 event records to a JSON file, against Json::StyledWriter; memory over the document", events),
    "event-queue": ("1,000 items of 10 ms: median error of the period, and processors taken; against a thread for each", event_queue),
    "upload": ("50 MiB to a tus server on loopback, against one PATCH by curl; its peak memory over idle", upload),
    "report-page": ("a report of 50,000 events in Chromium: until its table is drawn, and from a keystroke to the rows it leaves", report_page),
    "report": ("a package of 50,000 events and 400 processes to an HTML report, against Python parsing and writing it", report),
    "start": ("start, first log lines, end; against an empty GUI program", start),
}


def run_rows(bench, names):
    print(f"{'row':24} {'ours':>11} {'peer':>11} {'ratio':>6} {'goal':>6}  verdict")
    failed = False
    for name in names:
        try:
            for line in ROWS[name][1](bench):
                line.print()
        except (OSError, RuntimeError, subprocess.SubprocessError) as error:
            print(f"{name:24} FAILED: {error}", flush=True)
            failed = True
    return failed


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("rows", nargs="*", metavar="ROW")
    parser.add_argument("--list", action="store_true", help="name the rows")
    parser.add_argument("--rounds", type=int, default=7)
    parser.add_argument("--programs", default=f"{ROOT}/build/windows-cross/bin", help="where the programs of the build are")
    options = parser.parse_args()
    if options.list:
        for name, (meaning, _) in ROWS.items():
            print(f"{name:14} {meaning}")
        return 0
    for name in options.rows:
        if name not in ROWS:
            nearest = difflib.get_close_matches(name, ROWS, 1, 0)[0]
            parser.error(f"there is no row {name}; is {nearest} meant?")
    os.makedirs(FOLDER, exist_ok=True)
    was_up = subprocess.run(["bash", "-c", f"source {SESSION} && wineserver -k0"], stderr=subprocess.DEVNULL).returncode == 0
    try:
        return int(run_rows(Bench(os.path.abspath(options.programs), max(1, options.rounds)), options.rows or ROWS))
    finally:
        if not was_up:
            subprocess.run([SESSION, "down"], check=False)


if __name__ == "__main__":
    sys.exit(main())
