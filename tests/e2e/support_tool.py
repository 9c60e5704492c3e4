"""Stages the built program in a fresh folder, runs it and reads what it left: log, outbox, files.

The build's folder with the programs comes in the environment variable ST_BIN. Elsewhere than on Windows the program runs
under Wine, in the session of tools/wine_session.sh.
"""
import contextlib
import json
import os
import pathlib
import random
import shutil
import subprocess
import sys
import tempfile
import time
import unittest
import uuid
import zipfile

SOURCE = pathlib.Path(__file__).resolve().parents[2]
BIN = pathlib.Path(os.environ.get("ST_BIN", SOURCE / "build/windows-cross/bin"))
PRIVATE_KEY = SOURCE / "stutil/keys/development_private_key.pem"
LIBRARIES = ("log.dll", "qxlink.dll", "framework.dll")
ON_WINDOWS = sys.platform == "win32"
TIMEOUT = 90  # seconds for one run; an ordinary one takes one or two

# The smallest run: one quick collector, nothing else.
ONE_COLLECTOR = {"system_summary": True}

LOGGER_XML = """<?xml version="1.0" encoding="utf-8"?>
<configuration path="{folder}"><maxSize>0</maxSize></configuration>
"""


def wine_environment():
    script = f'source "{SOURCE}/tools/wine_session.sh" && env -0'
    out = subprocess.run(["bash", "-c", script], capture_output=True, check=True).stdout
    return dict(entry.split("=", 1) for entry in out.decode().split("\0") if "=" in entry)


ENVIRONMENT = dict(os.environ) if ON_WINDOWS else wine_environment()
LAUNCHER = [] if ON_WINDOWS else ["wine"]


def windows_path(path):
    text = str(path)
    return text if ON_WINDOWS else "Z:" + text.replace("/", "\\")


def temporary_folder():
    """The temporary folder that the program sees."""
    if ON_WINDOWS:
        return pathlib.Path(tempfile.gettempdir())
    echo = subprocess.run(["wine", "cmd", "/c", "echo %TMP%"], env=ENVIRONMENT, stdin=subprocess.DEVNULL,
                          capture_output=True, check=True).stdout.decode().strip()
    unix = subprocess.run(["wine", "winepath", "-u", echo], env=ENVIRONMENT, stdin=subprocess.DEVNULL,
                          capture_output=True, check=True).stdout.decode().strip()
    return pathlib.Path(unix)


class Stage:
    """A folder with the program, its libraries and their settings; also the current directory of its runs."""

    def __init__(self, name="stage", libraries=LIBRARIES):
        self._scratch = tempfile.TemporaryDirectory(prefix="st_e2e_")
        self.folder = pathlib.Path(self._scratch.name) / name
        self.folder.mkdir()
        self._libraries = libraries
        self.logs = self.folder / "logs"
        self.outbox = self.folder / "outbox"
        for file in ("support_tool.exe", *libraries):
            shutil.copy(BIN / file, self.folder)
        (self.folder / "Logger.xml").write_text(
            LOGGER_XML.format(folder=windows_path(self.logs)), encoding="utf-8")
        (self.folder / "qxlink.json").write_text(json.dumps({"outbox": windows_path(self.outbox)}), encoding="utf-8")
        shutil.copy(PRIVATE_KEY, self.folder / "privateKey.pem")
        self.settings(ONE_COLLECTOR)

    def close(self):
        self._scratch.cleanup()

    def path(self, name):
        return self.folder / name

    def settings(self, document):
        """The settings file; text is written as it is."""
        text = document if isinstance(document, (str, bytes)) else json.dumps(document)
        data = text if isinstance(text, bytes) else text.encode()
        self.path("stsettings.json").write_bytes(data)

    def start(self, *arguments, environment=None):
        return subprocess.Popen([*LAUNCHER, windows_path(self.path("support_tool.exe")), *arguments], cwd=self.folder,
                                env=ENVIRONMENT | (environment or {}), stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                                stderr=subprocess.DEVNULL)

    def run(self, *arguments, environment=None, code=0):
        """Runs to the end and returns what this run added to the log. The exit code is 0 but for a missing engine."""
        before = self.mark()
        process = self.start(*arguments, environment=environment)
        try:
            ended = process.wait(TIMEOUT)
        except subprocess.TimeoutExpired:
            process.kill()
            process.wait()
            raise AssertionError(f"{arguments} does not end; log:\n{self.log()}") from None
        if ended & 0xFF != code & 0xFF:  # all that Wine hands on
            raise AssertionError(f"{arguments} ended with {ended}; log:\n{self.log()}")
        return self.log(before)

    def collect(self, *options):
        return self.run("nogui", "collect", *options)

    def mark(self):
        """How far the log files have got. Instances that run at one time write one file each."""
        return {path.name: path.stat().st_size for path in self.logs.glob("*.log")}

    def log(self, mark=None):
        """The text of the log files, one after another; what was added since the mark."""
        texts = []
        for path in sorted(self.logs.glob("*.log")):
            texts.append(path.read_bytes()[(mark or {}).get(path.name, 0):].decode("utf-8-sig", "replace"))
        return "".join(texts)

    def packages(self):
        """The packages in the outbox, oldest first. Each has a JSON file beside it that describes it."""
        return sorted(self.outbox.glob("*.zip"), key=lambda p: (p.stat().st_mtime_ns, p.name))

    def left(self):
        """The names of what runs left behind in the folder."""
        own = {"support_tool.exe", *self._libraries, "Logger.xml", "qxlink.json", "privateKey.pem", "stsettings.json", "logs",
               "outbox"}
        return sorted(p.name for p in self.folder.iterdir() if p.name not in own)

    def clear(self):
        """Removes what runs left behind."""
        for name in self.left():
            path = self.path(name)
            shutil.rmtree(path) if path.is_dir() else path.unlink()


class ProgramTest(unittest.TestCase):
    """One stage for all cases of a class: each start of the program costs about a second."""

    stage_name = "stage"
    libraries = LIBRARIES

    @classmethod
    def setUpClass(cls):
        cls.stage = Stage(cls.stage_name, cls.libraries)
        cls.addClassCleanup(cls.stage.close)

    def assertReturnCode(self, log, code):
        self.assertIn(f"Return code {code}", log)

    def assertInOrder(self, log, *texts):
        position = 0
        for text in texts:
            found = log.find(text, position)
            self.assertGreaterEqual(found, 0, f"{text!r} is not behind position {position} of:\n{log}")
            position = found + len(text)


def read_archive(path):
    """The entries of a zip as {name: bytes}; raises when a checksum or a JSON document in it is bad."""
    with zipfile.ZipFile(path) as archive:
        bad = archive.testzip()
        if bad:
            raise AssertionError(f"{path}: {bad} is damaged")
        entries = {name: archive.read(name) for name in archive.namelist()}
    for name, data in entries.items():
        if name.endswith(".json"):
            json.loads(data)
    return entries


def wait_until(condition, seconds=TIMEOUT):
    deadline = time.monotonic() + seconds
    while time.monotonic() < deadline:
        if condition():
            return True
        time.sleep(0.002)
    return False


@contextlib.contextmanager
def bulky_installer_log(megabytes):
    """While it lives, every run packs a file that takes a while: a moment in the middle of a run can be met."""
    path = temporary_folder() / f"qxinst.{uuid.uuid4().hex}.bulk"
    path.write_bytes(random.Random(7).randbytes(megabytes << 20))
    try:
        yield path
    finally:
        path.unlink(missing_ok=True)
