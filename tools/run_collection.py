#!/usr/bin/env python3
"""Runs a real collection under Wine, opens the package again with the development key, checks it and prints a summary.

usage: tools/run_collection.py RELEASE_FOLDER RUN_FOLDER [OPTION of the program …]

The program runs as it ships: from a copy of the release folder, with its default settings. Exit status 0 only if the
package arrived in the outbox, could be opened, and everything in it is sound. Needs the environment of
tools/wine_session.sh.
"""

import collections
import functools
import json
import os
import re
import shutil
import subprocess
import sys
import time
import zipfile
from pathlib import Path

PROJECT = Path(__file__).resolve().parent.parent
DEVELOPMENT_KEY = PROJECT / "stutil" / "keys" / "development_private_key.pem"
TIME_LIMIT = 600  # seconds for one start of the program


class RunFailed(Exception):
    pass


def windows_to_unix(path):
    drive, rest = path[0].lower(), path[2:].replace("\\", "/")
    root = Path(os.environ["WINEPREFIX"]) / "dosdevices" / f"{drive}:"
    return Path(str(root.resolve()) + rest)


def unix_to_windows(path):
    return "Z:" + str(path).replace("/", "\\")


def start(folder, *arguments):
    subprocess.run(["wine", "support_tool.exe", *arguments], cwd=folder, check=False, timeout=TIME_LIMIT,
                   stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)


@functools.cache
def default_folder(name):
    """A folder of the shipped configuration: all lie below the user's local application data."""
    answer = subprocess.run(["wine", "cmd", "/c", "echo %LOCALAPPDATA%"], capture_output=True, text=True, check=True,
                            timeout=TIME_LIMIT, stdin=subprocess.DEVNULL)
    return windows_to_unix(answer.stdout.strip() + "\\Quorvex\\SupportTool\\" + name)


class Log:
    """The lines that the program adds to its log from now on."""

    def __init__(self):
        self.path = default_folder("Logs") / "support_tool.log"
        self.offset = self.path.stat().st_size if self.path.exists() else 0

    def text(self):
        if not self.path.exists():
            raise RunFailed(f"the program wrote no log ({self.path})")
        data = self.path.read_bytes()
        return data[self.offset if len(data) >= self.offset else 0:].decode("utf-8", "replace")

    def return_code(self):
        codes = re.findall(r"Return code (-?\d+)", self.text())
        if not codes:
            raise RunFailed(f"the log holds no result ({self.path})")
        return int(codes[-1])


def new_package(outbox, before):
    found = sorted(path for path in outbox.glob("*.zip") if path not in before) if outbox.exists() else []
    if len(found) != 1:
        raise RunFailed(f"expected one new package in {outbox}, found {len(found)}")
    return found[0]


def check_archive(path):
    """Returns the manifest; every entry is read (and so its CRC checked), every JSON file parsed."""
    with zipfile.ZipFile(path) as archive:
        damaged = archive.testzip()
        if damaged:
            raise RunFailed(f"entry {damaged} of the archive is damaged")
        documents = {name: json.loads(archive.read(name).decode("utf-8"))
                     for name in archive.namelist() if name.endswith(".json")}
    manifests = [document for name, document in documents.items() if name.endswith("/collection_manifest.json")]
    if len(manifests) != 1:
        raise RunFailed(f"expected one collection manifest in the archive, found {len(manifests)}")
    names = {Path(name).name for name in documents}
    for collector in manifests[0]["collectors"]:
        if collector["outcome"] == "data" and collector["name"] + ".json" not in names:
            raise RunFailed(f"the archive lacks {collector['name']}.json")
        if collector["outcome"] == "failed":
            raise RunFailed(f"collector {collector['name']} failed: {collector}")
    if not any(collector["outcome"] == "data" for collector in manifests[0]["collectors"]):
        raise RunFailed("no collector has data")
    return manifests[0]


def summary(manifest, package, plain, log, seconds):
    print(f"\n   {'collector':<24}{'outcome':<10}{'records':>9}{'bytes':>12}{'ms':>8}")
    for row in manifest["collectors"]:
        print(f"   {row['name']:<24}{row['outcome']:<10}{row['records']:>9}{row['bytes']:>12,}{row['milliseconds']:>8}")
        for line, count in collections.Counter(row["errors"]).items():
            print(f"      {line}" + (f"  ({count} times)" if count > 1 else ""))
    print(f"\n   archive   {plain.stat().st_size:,} bytes, checked")
    print(f"   package   {package}  ({package.stat().st_size:,} bytes)")
    print(f"   log       {log.path}")
    print(f"   time      {seconds:.1f} s\n")


def main(release, run_folder, *options):
    run_folder = Path(run_folder).resolve()
    shutil.rmtree(run_folder, ignore_errors=True)
    shutil.copytree(release, run_folder)
    outbox = default_folder("Outbox")
    before = set(outbox.glob("*.zip")) if outbox.exists() else set()

    log = Log()
    begin = time.monotonic()
    start(run_folder, "nogui", "collect", *options)
    seconds = time.monotonic() - begin
    if log.return_code() != 0:
        raise RunFailed(f"the collection ended with code {log.return_code()}; see {log.path}")
    package = new_package(outbox, before)
    for left in ("collected", "collected.zip"):
        if (run_folder / left).exists():
            raise RunFailed(f"{left} was left behind in {run_folder}")

    plain = run_folder / "collected_decrypted.zip"
    log = Log()
    start(run_folder, "nogui", "decrypt", f"--in={unix_to_windows(package)}",
          f"--privateKey={unix_to_windows(DEVELOPMENT_KEY)}")
    if log.return_code() != 1 or not plain.exists():
        raise RunFailed(f"the package could not be decrypted; see {log.path}")
    summary(check_archive(plain), package, plain, log, seconds)
    print("== the package is whole: collected, packed, encrypted, delivered to the outbox, and opened again")


if __name__ == "__main__":
    if len(sys.argv) < 3:
        sys.exit(__doc__)
    try:
        main(*sys.argv[1:])
    except (RunFailed, OSError, ValueError, KeyError, zipfile.BadZipFile, subprocess.TimeoutExpired) as failure:
        sys.exit(f"run failed: {failure}")
