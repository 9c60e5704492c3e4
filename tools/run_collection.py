#!/usr/bin/env python3
"""Runs a real collection under Wine, opens the package again with the development key, checks it and prints a summary.

usage: tools/run_collection.py RELEASE_FOLDER RUN_FOLDER [--ingest] [OPTION of the program …]

The program runs as it ships: from a copy of the release folder, with its default settings. With --ingest it uploads to the
receiving server of tools/ingest, over HTTPS and a line that is cut in the middle; otherwise it puts the package into its
outbox. Exit status 0 only if the
package arrived, could be opened, and everything in it is sound. Needs the environment of
tools/wine_session.sh.
"""

import collections
import functools
import hashlib
import json
import os
import random
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
INSTALLER_LOG = 2 << 20  # bytes of a log as installers leave them, so that the package has a middle
CUT_AFTER = 1 << 20  # bytes


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
def variable(name):
    """A folder that an environment variable of the program names."""
    answer = subprocess.run(["wine", "cmd", "/c", f"echo %{name}%"], capture_output=True, text=True, check=True,
                            timeout=TIME_LIMIT, stdin=subprocess.DEVNULL)
    return windows_to_unix(answer.stdout.strip())


def default_folder(name):
    """A folder of the shipped configuration: all lie below the user's local application data."""
    return variable("LOCALAPPDATA") / "Quorvex" / "SupportTool" / name


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


class Outbox:
    """Where the package goes without an upload service."""

    def __init__(self):
        self.folder = default_folder("Outbox")
        self.before = set(self.folder.glob("*.zip")) if self.folder.exists() else set()

    def __enter__(self):
        return self

    def __exit__(self, *_):
        pass

    def package(self, _log):
        return new_package(self.folder, self.before)

    result = "delivered to the outbox"


class Ingest:
    """The receiving server behind a line that breaks once, in the middle of the package."""

    result = "delivered over HTTPS through a line that broke, and received with the right hash"

    def __init__(self, run_folder):
        sys.path.insert(0, str(PROJECT / "tests" / "support"))
        import certificates
        import fault_proxy
        import ingest

        folder = run_folder.with_name(run_folder.name + "-ingest")
        shutil.rmtree(folder, ignore_errors=True)
        made = certificates.make_certificates(folder / "certificates")
        self.server = ingest.IngestServer(folder, "--cert", str(made / "localhost.pem"), "--key", str(made / "localhost.key"))
        self.make_line = fault_proxy.FaultProxy
        self.faults = fault_proxy.Faults
        self.configuration = run_folder / "qxlink.json"
        self.log = variable("TMP") / "qxinst.run.log"
        self.authority = unix_to_windows(made / "ca.pem")

    def __enter__(self):
        self.server.__enter__()
        self.line = self.make_line(self.server.port).__enter__()
        self.line.upstream = self.faults(cut_after=CUT_AFTER)
        self.log.write_bytes(random.Random(1).randbytes(INSTALLER_LOG))
        self.configuration.write_text(json.dumps({"endpoint": f"https://localhost:{self.line.port}/files",
                                                  "ca_file": self.authority, "retry_delay": 0.2}), encoding="utf-8")
        return self

    def __exit__(self, *problem):
        self.log.unlink(missing_ok=True)
        self.line.__exit__(*problem)
        self.server.__exit__(*problem)

    def package(self, log):
        receipts = self.server.receipts()
        if len(receipts) != 1:
            raise RunFailed(f"expected one receipt, found {len(receipts)}")
        name, receipt = next(iter(receipts.items()))
        path = self.server.folder / "uploads" / name
        if hashlib.sha256(path.read_bytes()).hexdigest() != receipt["sha256"]:
            raise RunFailed("the receipt's SHA-256 is not that of the package")
        report = re.search(r"\d+ bytes are with the service after .*", log.text())
        if not report or " 1 attempts" in report.group():
            raise RunFailed("the upload was not resumed; see the log")
        print(f"   receipt   {self.server.folder}/receipts/{name}.json\n   sha256    {receipt['sha256']}\n   {report.group()}")
        # Under a name that the program can open; the server has its own copy.
        copy = self.configuration.with_name("received.zip")
        shutil.copyfile(path, copy)
        return copy


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


def write_report(folder, package, report):
    """The package as an HTML report; what the program says of it."""
    result = subprocess.run(["wine", "support_report.exe", unix_to_windows(package), "--key", unix_to_windows(DEVELOPMENT_KEY),
                             "-o", unix_to_windows(report)], cwd=folder, check=False, timeout=TIME_LIMIT,
                            stdin=subprocess.DEVNULL, capture_output=True)
    # The exit status 1 says that there are findings.
    if result.returncode not in (0, 1) or not report.exists():
        raise RunFailed(f"no report was written: {result.stderr.decode('utf-8', 'replace').strip()}")
    said = result.stdout.decode("utf-8", "replace")
    return said[said.rfind("Findings"):].strip()


def main(release, run_folder, *options):
    run_folder = Path(run_folder).resolve()
    shutil.rmtree(run_folder, ignore_errors=True)
    shutil.copytree(release, run_folder)
    options = list(options)
    with Ingest(run_folder) if "--ingest" in options else Outbox() as receiver:
        options = [option for option in options if option != "--ingest"]
        log = Log()
        begin = time.monotonic()
        start(run_folder, "nogui", "collect", *options)
        seconds = time.monotonic() - begin
        if log.return_code() != 0:
            raise RunFailed(f"the collection ended with code {log.return_code()}; see {log.path}")
        package = receiver.package(log)
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
    report = run_folder / "report.html"
    print(f"   report    {report}  ({write_report(run_folder, package, report)})")
    print(f"== the package is whole: collected, packed, encrypted, {receiver.result}, and opened again")


if __name__ == "__main__":
    if len(sys.argv) < 3:
        sys.exit(__doc__)
    try:
        main(*sys.argv[1:])
    except (RunFailed, OSError, ValueError, KeyError, zipfile.BadZipFile, subprocess.TimeoutExpired) as failure:
        sys.exit(f"run failed: {failure}")
