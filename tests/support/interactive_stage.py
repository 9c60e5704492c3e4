"""The program staged with its window: pages, engine and plug-ins, in a folder that is the product's too."""
import contextlib
import json
import pathlib
import shutil
import sys
import time

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "e2e"))

from browser_traces import BrowserTraces  # noqa: E402
from page_probe import PageProbe, ProbeError  # noqa: E402
from support_tool import BIN, Stage, windows_path  # noqa: E402

LIBRARIES = ("log.dll", "qxlink.dll", "framework.dll", "sciter.dll", "ServConfig.dll", "ServConfig.json",
             "LanguageManager.dll")
# A product's: with a comment, odd white space and line ends that a rewriting would not keep.
LOGGER_XML = ('<?xml version="1.0" encoding="utf-8"?>\r\n<!-- of the product -->\r\n<configuration   path="{folder}">\n'
              "\t<level>FATAL|ERROR | INFO | TRACE</level><depth  >EXE</depth>\r\n  <maxSize>0</maxSize>\n</configuration>\n\n")


class InteractiveStage(Stage):
    def __init__(self, session):
        super().__init__("a stage 100% ș", LIBRARIES)
        for folder in ("gui", "language"):
            shutil.copytree(BIN / folder, self.path(folder))
        self.session = session
        self.traces = BrowserTraces(session)
        self.logger_xml = self.path("Logger.xml")
        self.marker = self.path("Logger.xml.raised")
        self.logger_xml.write_bytes(LOGGER_XML.format(folder=windows_path(self.logs)).encode())
        self.former = self.logger_xml.read_bytes()

    def send_to(self, port, **members):
        document = {"endpoint": f"http://localhost:{port}/files", "allow_plain_http": True, "proxy": "none", "retries": 1,
                    "retry_delay": 0.05, "outbox": windows_path(self.outbox), **members}
        self.path("qxlink.json").write_text(json.dumps(document), encoding="utf-8")

    def start(self, *arguments, environment=None):
        return super().start(*arguments, environment=self.session.environment | (environment or {}))

    def is_raised(self):
        return self.marker.exists() and b"<depth>MODULE</depth>" in self.logger_xml.read_bytes().replace(b"  >", b">")

    def is_as_before(self):
        return not self.marker.exists() and self.logger_xml.read_bytes() == self.former

    def page(self, process, seconds=30):
        """The page of the window of a process that was just started, when its first step is shown."""
        page = None
        shown = "document.readyState === 'complete' && !document.getElementById('details').hidden && !!stEngine"
        deadline = time.monotonic() + seconds
        while time.monotonic() < deadline and process.poll() is None:
            with contextlib.suppress(OSError, ValueError, IndexError, ProbeError):  # it begins
                page = page or self._connect()
                if page and page.read(shown):
                    return page
            time.sleep(0.02)
        raise AssertionError(f"no page within {seconds} s, the program's end: {process.poll()}; log:\n{self.log()}")

    def _connect(self):
        profile = self.traces.profile()
        return profile and PageProbe(profile)
