#!/usr/bin/env python3
"""Opens the window of the interactive mode, with the program as it ships.

usage: tools/run_gui.py RELEASE_FOLDER RUN_FOLDER PICTURES_FOLDER

On a display ($DISPLAY) the window is there until it is closed. Without one it opens on a virtual screen (Xvfb), is led
through a whole report in each language by mouse and keyboard, and leaves a picture of every step; the packages go to the
receiving server of tools/ingest when it is installed, otherwise into the outbox, and are opened and compared.
"""
import contextlib
import json
import os
import shutil
import sys
import tempfile
from pathlib import Path

PROJECT = Path(__file__).resolve().parent.parent
sys.path[:0] = [str(PROJECT / "tests" / folder) for folder in ("support", "e2e")]

from ingest import IngestServer  # noqa: E402
from open_package import open_package  # noqa: E402
from report_walk import ANSWERS, ReportWalk, choose_language  # noqa: E402
from support_tool import PRIVATE_KEY, read_archive, windows_path  # noqa: E402
from window_driver import Window, start  # noqa: E402
from x_session import XSession  # noqa: E402


def show(run_folder):
    outbox = run_folder / "outbox"
    configure(run_folder, outbox=windows_path(outbox))
    with XSession(os.environ["DISPLAY"]) as session:
        print(f"== the window is open; reports go to {outbox}")
        start(session, [windows_path(run_folder / "support_tool.exe")], run_folder).wait()


def configure(run_folder, **members):
    (run_folder / "qxlink.json").write_text(json.dumps({"proxy": "none", "retries": 1, **members}), encoding="utf-8")


def check(package, answers):
    """The package holds the manifest and exactly what was typed."""
    with tempfile.TemporaryDirectory() as scratch:
        archive = Path(scratch) / "opened.zip"
        archive.write_bytes(open_package(package, PRIVATE_KEY))
        entries = {name.rsplit("/", 1)[-1]: data for name, data in read_archive(archive).items()}
    collectors = json.loads(entries["collection_manifest.json"])["collectors"]
    answered = json.loads(entries["guiData.json"])
    times = [answered["issue"].pop(f"reproduce_{which}_time") for which in ("start", "stop")]
    if answered != answers.gui_data(recorded=True) or times[0] > times[1]:
        sys.exit(f"guiData.json is not what was typed: {answered}")
    print(f"   the package: {len(package):,} bytes, {len(collectors)} collectors, guiData.json as typed")


def walk(session, run_folder, language, pictures, server):
    outbox = run_folder / f"outbox_{language}"
    to_server = {"endpoint": server.url, "allow_plain_http": True} if server else {}
    configure(run_folder, outbox=windows_path(outbox), **to_server)
    choose_language(run_folder, language)
    before = set(server.stored()) if server else set()
    with Window(session, [windows_path(run_folder / "support_tool.exe")], run_folder) as window:
        report = ReportWalk(window, ANSWERS[language], pictures / language)
        report.whole()
        report.picture("progress")
        report.finish()
        window.click("#success button")
        window.wait_for_end()
    print(f"   {language}: from the first page to the last; pictures in {pictures / language}")
    if server:
        package = server.content((set(server.stored()) - before).pop())
    else:
        package = next(outbox.glob("*.zip")).read_bytes()
    check(package, ANSWERS[language])


def main(release, run_folder, pictures):
    run_folder, pictures = Path(run_folder).resolve(), Path(pictures).resolve()
    shutil.rmtree(run_folder, ignore_errors=True)
    shutil.copytree(release, run_folder)
    if os.environ.get("DISPLAY"):
        show(run_folder)
        return
    has_server = shutil.which("node") and (PROJECT / "tools/ingest/node_modules").exists()
    print(f"== no display: on a virtual screen, reports go to {'a server on loopback' if has_server else 'an outbox'}")
    with contextlib.ExitStack() as stack:
        server = stack.enter_context(IngestServer(run_folder / "received")) if has_server else None
        session = stack.enter_context(XSession(has_manager=True))
        for language in ANSWERS:
            walk(session, run_folder, language, pictures, server)


if __name__ == "__main__":
    if len(sys.argv) != 4:
        sys.exit(__doc__)
    try:
        main(*sys.argv[1:])
    except (AssertionError, OSError, KeyError, ValueError) as failure:
        sys.exit(f"the walk failed: {failure}")
