#!/usr/bin/env python3
"""Runs for long what a user runs once, in one process, and tells whether it keeps what it should give back.

    soak.py [--full] [--collections N] [--minutes M] [--pairs P] [--interval MS]

First N collections in a row of everything but process dumps, each packed, encrypted and put into an outbox; then M minutes
of monitoring with P pairs of a counter and a trigger. After each collection, and at equal steps of the monitoring, the
process rests while its handles, threads and private bytes are read. The first fifth is warm-up; what comes after must
not grow: the median of its last third is compared with the peak of the warm-up and the first third. Exit code 1 when it
does.
"""
import argparse
import json
import pathlib
import shutil
import statistics
import subprocess
import sys

SOURCE = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(SOURCE / "tests/e2e"))

from support_tool import BIN, ENVIRONMENT, LAUNCHER, ON_WINDOWS, Stage, windows_path  # noqa: E402

BOUNDED = {"collections": 20, "minutes": 2.0}
FULL = {"collections": 500, "minutes": 30.0}
SAMPLES = 30  # of the monitoring
COUNTERS = (r"\System\System Up Time", r"\Processor(_Total)\% Processor Time")

# What may come and go without being a leak: an idle thread of a pool with its handles, pages of the heap.
TOLERANCE = {"handles": 4, "descriptors": 4, "threads": 2, "private KiB": 512}


def unix_facts(pid):
    """What the system below Wine knows of the process; Wine itself knows no private bytes."""
    process = pathlib.Path(f"/proc/{pid}")
    memory = dict(line.split(":") for line in (process / "smaps_rollup").read_text().splitlines()[1:])
    private = sum(int(memory[name].split()[0]) for name in ("Private_Clean", "Private_Dirty"))
    return {"private KiB": private, "threads": len(list((process / "task").iterdir())),
            "descriptors": len(list((process / "fd").iterdir()))}


def run(stage, *arguments):
    """Yields what each sample shows."""
    with subprocess.Popen([*LAUNCHER, windows_path(stage.path("soak_child.exe")), *map(str, arguments)],
                          cwd=stage.folder, env=ENVIRONMENT, stdin=subprocess.PIPE, stdout=subprocess.PIPE,
                          stderr=subprocess.DEVNULL) as process:
        for line in process.stdout:
            words = line.decode().split()
            if words[:1] != ["sample"]:
                print(line.decode().rstrip())
                continue
            types = {name: int(count) for name, count in (word.split("=") for word in words[2:])}
            facts = {"handles": sum(types.values())}
            facts |= {"private KiB": int(words[1]) // 1024} if ON_WINDOWS else unix_facts(process.pid)
            facts |= {f" {name}": count for name, count in types.items()}
            yield facts
            process.stdin.write(b"\n")
            process.stdin.flush()
    if process.returncode != 0:
        raise SystemExit(f"{arguments} ended with {process.returncode}; log:\n{stage.log()[-4000:]}")


def judge(title, samples):
    """Prints the figures; True when nothing grew."""
    measured = samples[max(1, len(samples) // 5):]
    third = max(1, len(measured) // 3)
    print(f"\n{title}: {len(samples)} samples, of which {len(samples) - len(measured)} are warm-up")
    print(f"  {'':14}{'first':>10}{'begin':>10}{'end':>10}{'least':>10}{'most':>10}")
    is_flat = True
    for name in samples[-1]:
        values = [sample.get(name, 0) for sample in measured]
        begin, end = statistics.median(values[:third]), statistics.median(values[-third:])
        peak = max(sample.get(name, 0) for sample in samples[:len(samples) - len(measured) + third])
        grows = end - peak > TOLERANCE.get(name, TOLERANCE["handles"])
        if name not in TOLERANCE and not grows:
            continue
        is_flat &= not grows
        print(f"  {name:14}{samples[0].get(name, 0):10}{begin:10.0f}{end:10.0f}{min(values):10}{max(values):10}"
              + ("  GROWS" if grows else ""))
    return is_flat


def soak_collections(stage, count):
    settings = SOURCE / "app/settings"
    shutil.copy(settings / "stsettings.json", stage.path("stsettings.json"))
    shutil.copytree(settings, stage.path("settings"))
    samples = []
    for facts in run(stage, "collect", count):
        samples.append(facts)
        for package in stage.outbox.iterdir():
            package.unlink()
        if len(samples) % 50 == 0:
            print(f"  {len(samples)} collections: {facts['handles']} handles, {facts['private KiB']} KiB", flush=True)
    return judge(f"{count} collections in a row", samples)


def soak_monitoring(stage, minutes, pairs, interval):
    counters = [{"id": f"counter-{i}", "query": COUNTERS[i % len(COUNTERS)], "sampleInterval": interval,
                 "triggers": ["never"], "saveToFile": i % 10 == 0} for i in range(pairs)]
    trigger = {"id": "never", "triggerAfter": 1, "counterValue": -1.5, "condition": "<", "action": []}
    stage.path("monitoring.json").write_text(json.dumps(
        {"performanceCounters": counters, "triggers": [trigger], "actions": [],
         "limits": {"maxSampleFileBytes": 100_000}}), encoding="utf-8")
    step = max(1, round(minutes * 60 / SAMPLES))
    samples = list(run(stage, "monitor", round(minutes * 60 / step), step))
    return judge(f"{minutes:g} minutes of monitoring, {pairs} pairs every {interval} ms", samples)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--full", action="store_true", help="500 collections, 30 minutes")
    parser.add_argument("--collections", type=int, help="0: none")
    parser.add_argument("--minutes", type=float, help="of monitoring; 0: none")
    parser.add_argument("--pairs", type=int, default=50)
    parser.add_argument("--interval", type=int, default=100, help="milliseconds")
    options = parser.parse_args()
    defaults = FULL if options.full else BOUNDED
    collections = defaults["collections"] if options.collections is None else options.collections
    minutes = defaults["minutes"] if options.minutes is None else options.minutes

    stage = Stage("soak")
    try:
        shutil.copy(BIN / "soak_child.exe", stage.folder)
        logger = stage.path("Logger.xml")
        logger.write_text(logger.read_text(encoding="utf-8").replace("<maxSize>0<", "<maxSize>4 MB<"), encoding="utf-8")
        is_flat = collections == 0 or soak_collections(stage, collections)
        is_flat &= minutes == 0 or soak_monitoring(stage, minutes, options.pairs, options.interval)
    finally:
        stage.close()
    print("\nnothing grows" if is_flat else "\nSOMETHING GROWS")
    return 0 if is_flat else 1


if __name__ == "__main__":
    sys.exit(main())
