"""The upload library in a folder of its own, with the program that uploads through it (tests/children/upload_child.cpp)."""
import json
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "e2e"))

from support_tool import BIN, ENVIRONMENT, LAUNCHER, LOGGER_XML, windows_path  # noqa: E402

TIMEOUT = 60  # seconds for one upload
SECRET = "k-8f3a51c0"  # the API key of every upload; it must never be in a log


class Upload:
    """What the program printed, and what this upload wrote to the log."""

    def __init__(self, output, log):
        self.output = output
        self.log = log
        match = re.search(r"^result=(-?\d+) sent=(\d+) total=(\d+)", output, re.MULTILINE)
        if not match:
            raise AssertionError(f"the program says no result: {output!r}\n{log}")
        self.result, self.sent, self.total = map(int, match.groups())


class UploadStage:
    def __init__(self):
        self._scratch = tempfile.TemporaryDirectory(prefix="st_upload_")
        self.folder = pathlib.Path(self._scratch.name)
        for name in ("upload_child.exe", "qxlink.dll", "log.dll"):
            shutil.copy(BIN / name, self.folder)
        (self.folder / "Logger.xml").write_text(LOGGER_XML.format(folder=windows_path(self.folder / "logs")),
                                                encoding="utf-8")
        self.file = self.folder / "collected.zip"
        self.outbox = self.folder / "outbox"

    def close(self):
        self._scratch.cleanup()

    def configure(self, endpoint, **members):
        """Members replace these defaults, which fail faster than the library's own."""
        document = {"endpoint": endpoint, "headers": {"X-Api-Key": SECRET}, "outbox": "outbox", "proxy": "none",
                    "retries": 3, "retry_delay": 0.02, "allow_plain_http": endpoint.startswith("http:"),
                    "timeouts": {"connect": 5, "send": 5, "receive": 5, "upload": 30}, **members}
        (self.folder / "qxlink.json").write_text(json.dumps(document), encoding="utf-8")

    def start(self, *options):
        return subprocess.Popen([*LAUNCHER, windows_path(self.folder / "upload_child.exe"), self.file.name, *options],
                                cwd=self.folder, env=ENVIRONMENT, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                stderr=subprocess.DEVNULL, text=True)

    def finish(self, process):
        try:
            output, _ = process.communicate(timeout=TIMEOUT)
        except subprocess.TimeoutExpired:
            process.kill()
            process.communicate()
            raise AssertionError(f"the upload does not end; log:\n{self._take_log()}") from None
        upload = Upload(output, self._take_log())
        if SECRET in upload.log:
            raise AssertionError(f"the key is in the log:\n{upload.log}")
        return upload

    def upload(self, data, *options):
        self.file.write_bytes(data)
        return self.finish(self.start(*options))

    def _take_log(self):
        texts = []
        for path in sorted((self.folder / "logs").glob("*.log")):
            texts.append(path.read_text(encoding="utf-8"))
            path.unlink()
        return "".join(texts)
