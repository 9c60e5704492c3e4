"""The real receiving server (tools/ingest) for tests, and a tus client made of plain requests."""
import base64
import contextlib
import hashlib
import http.client
import json
import os
import pathlib
import re
import selectors
import subprocess
import time

SERVER = pathlib.Path(__file__).resolve().parents[2] / "tools/ingest/server.js"
START_LIMIT = 20  # seconds
TAGS = json.dumps({"tags": ["Quorvex Guard Basic", "support_tool"]}, separators=(",", ":"))


class IngestServer:
    """Runs the server for a `with` block on its own port. `options` are its command-line options."""

    def __init__(self, folder, *options, api_key=""):
        self.folder = pathlib.Path(folder)
        self.folder.mkdir(parents=True, exist_ok=True)
        self.log = self.folder / "ingest.log"
        self._command = ["node", str(SERVER), "--folder", str(folder), "--port", "0", "--end-with-parent", *options]
        self._environment = {**os.environ, "INGEST_API_KEY": api_key}

    def __enter__(self):
        with open(self.log, "ab") as log:
            self.process = subprocess.Popen(self._command, env=self._environment, stdin=subprocess.DEVNULL,
                                            stdout=subprocess.PIPE, stderr=log)
        try:
            self.url = self._wait_until_ready()
        except BaseException:
            self.__exit__()
            raise
        self.port = int(re.search(r":(\d+)/files$", self.url).group(1))
        return self

    def __exit__(self, *_):
        self.process.terminate()
        try:
            self.process.wait(START_LIMIT)
        except subprocess.TimeoutExpired:
            self.process.kill()
            self.process.wait()
        self.process.stdout.close()

    def _wait_until_ready(self):
        with selectors.DefaultSelector() as selector:
            selector.register(self.process.stdout, selectors.EVENT_READ)
            line = self.process.stdout.readline().decode() if selector.select(START_LIMIT) else ""
        match = re.fullmatch(r"listening on (\S+)\n", line)
        if not match:
            raise RuntimeError(f"the ingest server did not start: {self.log.read_text(encoding='utf-8')}")
        return match.group(1)

    def stored(self):
        """Names of the uploads that lie there, finished or not."""
        return sorted(path.name for path in (self.folder / "uploads").iterdir() if not path.suffix)

    def content(self, upload_id):
        return (self.folder / "uploads" / upload_id).read_bytes()

    def receipts(self):
        """{upload id: receipt}; every name in the folder must be a final one."""
        return {path.name.removesuffix(".json"): json.loads(path.read_text(encoding="utf-8"))
                for path in (self.folder / "receipts").iterdir()}


def metadata_for(data, **changes):
    """The metadata of a sound upload of `data`; a change to None leaves that entry out."""
    entries = {"filename": "collected.zip", "category": "kvsetuplogs", "tags": TAGS,
               "sha256": hashlib.sha256(data).hexdigest(), **changes}
    return ",".join(f"{name} {base64.b64encode(value.encode()).decode()}"
                    for name, value in entries.items() if value is not None)


class TusClient:
    """Each request goes over a connection of its own. With a TLS context it speaks HTTPS to "localhost"."""

    def __init__(self, port, tls=None, headers=None, timeout=10):
        self.port = port
        self._tls = tls
        self._headers = {"Tus-Resumable": "1.0.0", **(headers or {})}
        self._timeout = timeout

    def connect(self):
        if self._tls:
            connection = http.client.HTTPSConnection("localhost", self.port, timeout=self._timeout, context=self._tls)
        else:
            connection = http.client.HTTPConnection("localhost", self.port, timeout=self._timeout)
        connection.connect()
        return connection

    def request(self, method, target, headers=None, body=None, connection=None):
        """Returns (status, headers, text)."""
        with contextlib.closing(connection or self.connect()) as line:
            line.request(method, target, body, {**self._headers, **(headers or {})})
            response = line.getresponse()
            return response.status, response.headers, response.read().decode()

    def create(self, data, metadata=None, **headers):
        """Returns (status, location, text)."""
        fields = {"Upload-Length": str(len(data)), "Upload-Metadata": metadata or metadata_for(data), **headers}
        status, answer, text = self.request("POST", "/files", fields)
        return status, answer["Location"], text

    def patch(self, location, data, offset=0, connection=None):
        headers = {"Upload-Offset": str(offset), "Content-Type": "application/offset+octet-stream"}
        return self.request("PATCH", location, headers, data, connection)

    def offset(self, location):
        """How many bytes the server has, or its status when it does not say."""
        status, headers, _ = self.request("HEAD", location)
        return int(headers["Upload-Offset"]) if status == 200 else f"status {status}"


def wait_until(condition, seconds=10):
    deadline = time.monotonic() + seconds
    while time.monotonic() < deadline:
        if condition():
            return True
        time.sleep(0.02)
    return False
