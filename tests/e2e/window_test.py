"""The interactive mode from its start to its end, on a virtual screen, with mouse and keyboard: the real program with its
pages, its engine and a browser, and a server that receives what is sent. Pictures of every step are left in the build
folder, in screenshots/gui.
"""
import json
import os
import pathlib
import socket
import sys
import tempfile
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))
from browser_traces import processor_seconds  # noqa: E402
from fault_proxy import FaultProxy, Faults  # noqa: E402
from ingest import IngestServer  # noqa: E402
from interactive_stage import InteractiveStage  # noqa: E402
from open_package import open_package  # noqa: E402
from report_walk import ANSWERS, ReportWalk, choose_language  # noqa: E402
from support_tool import BIN, PRIVATE_KEY, read_archive, windows_path  # noqa: E402
from window_driver import Window, wait_for  # noqa: E402
from x_session import XSession  # noqa: E402

PICTURES = pathlib.Path(os.environ.get("ST_PICTURES", BIN.parent.parent / "screenshots/gui"))
ENGLISH, ROMANIAN = ANSWERS["en"], ANSWERS["ro"]


class WindowTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.painted = []  # seconds from each start to the picture
        cls.session = XSession(has_manager=True)
        cls.session.__enter__()
        cls.addClassCleanup(cls.session.__exit__)

    def setUp(self):
        self.stage = InteractiveStage(self.session)
        self.addCleanup(self.stage.close)
        scratch = tempfile.TemporaryDirectory(prefix="st_ingest_")
        self.addCleanup(scratch.cleanup)
        self.received = pathlib.Path(scratch.name)

    def open(self, *arguments):
        command = [windows_path(self.stage.path("support_tool.exe")), *arguments]
        window = self.enterContext(Window(self.session, command, self.stage.folder))
        self.painted.append(window.painted_after)
        return window

    def server(self):
        return self.enterContext(IngestServer(self.received))

    def assertEnded(self, window):
        self.assertEqual(window.wait_for_end(), 0)
        self.assertTrue(self.stage.is_as_before())

    def assertReceived(self, server, answers, recorded):
        """The one package that the server has holds the manifest and exactly these answers; returns the times."""
        self.assertEqual(len(server.receipts()), 1)
        self.assertEqual(len(server.stored()), 1)
        archive = self.received / "opened.zip"
        archive.write_bytes(open_package(server.content(server.stored()[0]), PRIVATE_KEY))
        entries = {name.rsplit("/", 1)[-1]: data for name, data in read_archive(archive).items()}
        manifest = json.loads(entries["collection_manifest.json"])
        self.assertEqual([(row["name"], row["outcome"]) for row in manifest["collectors"] if row["outcome"] == "data"],
                         [("system_summary", "data")])
        data = json.loads(entries["guiData.json"])
        times = {name: data["issue"].pop(name) for name in ("reproduce_start_time", "reproduce_stop_time") if recorded}
        self.assertEqual(data, answers.gui_data(recorded))
        return times

    def test_a_report_in_english_arrives_with_exactly_the_answers(self):
        server = self.server()
        line = self.enterContext(FaultProxy(server.port))
        self.stage.send_to(line.port)
        begin = time.time()
        window = self.open()
        line.upstream = Faults(stall_after=2000, stall_seconds=1)  # so that the progress can be seen
        walk = ReportWalk(window, ENGLISH, PICTURES / "en")
        walk.whole(while_recording=lambda: self.assertTrue(self.stage.is_raised()))
        self.assertTrue(self.stage.is_as_before())
        walk.picture("progress")
        walk.finish()
        window.click("#success button")
        self.assertEnded(window)
        times = self.assertReceived(server, ENGLISH, True)
        self.assertTrue(begin - 1 <= times["reproduce_start_time"] <= times["reproduce_stop_time"] <= time.time())
        self.assertEqual(self.stage.left(), ["gui", "language"])


    def test_a_report_in_romanian_arrives_although_the_server_was_down_at_first(self):
        with socket.create_server(("127.0.0.1", 0)) as taken:
            port = taken.getsockname()[1]
        self.stage.send_to(port)
        choose_language(self.stage.folder, "ro")
        window = self.open("noda")
        walk = ReportWalk(window, ROMANIAN, PICTURES / "ro")
        walk.whole()
        walk.finish("failure")
        self.assertIn("internet", window.text("#failure-help"))
        self.assertEqual(window.text("#failure-path"), windows_path(self.stage.path("collected.zip")))
        self.assertTrue(self.stage.path("collected.zip").exists())
        server = self.server()
        line = self.enterContext(FaultProxy(server.port, port))
        line.upstream = Faults(stall_after=2000, stall_seconds=1)
        window.click("#retry")
        window.wait_for_section("progress")
        walk.picture("progress")
        walk.finish()
        window.click("#close")
        self.assertEnded(window)
        self.assertReceived(server, ROMANIAN, True)

    def test_keyboard_alone_leads_to_the_end(self):
        server = self.server()
        self.stage.send_to(server.port)
        window = self.open()
        for field, text in (("name", ENGLISH.name), ("email", ENGLISH.email)):
            window.tab_to(field)
            window.fill_focused(text)
        window.tab_to("consent")
        window.key("space", "Return")
        window.wait_for_section("issue")
        window.key("Tab", "space")  # the first kind: "slow"
        window.tab_to("description")
        window.fill_focused(ENGLISH.description)
        window.key("Tab", "Tab", "Return")
        window.wait_for_section("reproduce")
        window.tab_to("reproduce-next")
        window.key("Return")
        window.wait_for_section("send")
        window.tab_to("send-button")
        window.key("Return")
        window.wait_for_section("success")
        window.key("Tab", "Return")
        self.assertEnded(window)
        self.assertReceived(server, ENGLISH, False)

    def test_closing_while_recording_restores_the_logging(self):
        window = self.open()
        walk = ReportWalk(window, ENGLISH)
        walk.to_the_recording()
        walk.start_recording()
        wait_for("the logging to be raised", self.stage.is_raised)
        window.key("alt+F4")
        self.assertEnded(window)

    def test_closing_while_sending_sends_to_the_end(self):
        server = self.server()
        line = self.enterContext(FaultProxy(server.port))
        self.stage.send_to(line.port)
        window = self.open()
        walk = ReportWalk(window, ENGLISH)
        walk.to_the_review()
        line.upstream = Faults(stall_after=2000, stall_seconds=3)
        walk.send()
        wait_for("the first bytes", lambda: line.forwarded("upstream") >= 2000)
        window.click("#close")
        wait_for("the window's end", lambda: not window.is_visible())
        self.assertIsNone(window.process.poll())
        self.assertEnded(window)
        self.assertReceived(server, ENGLISH, False)

    def test_the_caption_moves_the_window_and_its_buttons_minimise_and_close_it(self):
        window = self.open()
        x, y, width, height = window.place()
        self.assertEqual((x, y), (1280 // 2 - width // 2, 1024 // 2 - height // 2))
        self.assertEqual((width, height), (window.read("innerWidth"), window.read("innerHeight")))
        window.drag("#product", -150, 60)
        # It goes along from where the mouse is when the page has told of the press.
        wait_for("the move", lambda: window.place()[0] <= x - 75 and window.place()[1] >= y + 30)
        self.assertEqual(window.place()[2:], (width, height))
        corner = (window.place()[0] + 5, window.place()[1] + 5)
        colour = window.screen.colour(*corner)
        window.click("#minimize")
        wait_for("minimising", lambda: not window.is_visible() and window.screen.colour(*corner) != colour)
        window.read("document.getElementById('name').value = 'Seen by nobody'")
        time.sleep(0.5)  # its picture comes while the window has the size of a minimised one
        window.activate()
        wait_for("the window", lambda: window.is_visible() and window.screen.colour(*corner) == colour)
        window.fill("#name", "Ana")
        window.click("#close")
        self.assertEnded(window)

    def test_starting_input_and_waiting_take_little(self):
        # The best of several counts: the others say what else the machine had to do.
        window = self.open()
        print(f"painted {min(self.painted):.2f} s after the start", file=sys.stderr)
        self.assertLess(min(self.painted), 3)
        wait_for("the page to be at rest", lambda: self.share_of_a_core(window, 1) < 0.02)
        share = self.share_of_a_core(window, 5)
        print(f"idle costs {share * 100:.1f} % of a core", file=sys.stderr)
        self.assertLess(share, 0.02)
        window.point_at("#consent")
        wait_for("the highlight", lambda: window.read("document.getElementById('consent').matches(':hover')"))
        times = []
        for _ in range(5):
            area = window.area("#consent")
            wait_for("the picture to be at rest", lambda area=area: self.is_at_rest(window, area))
            before, begin = window.screen.pixels(area), time.monotonic()
            window.press()
            while window.screen.pixels(area) == before:
                self.assertLess(time.monotonic() - begin, 5)
            times.append(time.monotonic() - begin)
        print(f"a click is seen after {min(times) * 1000:.0f} ms", file=sys.stderr)
        self.assertLess(min(times), 0.1)
        window.point_elsewhere()
        wait_for("the highlight to go", lambda: not window.read("document.getElementById('consent').matches(':hover')"))

    @staticmethod
    def is_at_rest(window, area):
        before = window.screen.pixels(area)
        time.sleep(0.2)
        return window.screen.pixels(area) == before

    @staticmethod
    def share_of_a_core(window, seconds):
        """What the program and its browser use."""
        pids = [window.process.pid, *window.traces.processes()]
        before = processor_seconds(pids)
        time.sleep(seconds)
        return (processor_seconds(pids) - before) / seconds


if __name__ == "__main__":
    unittest.main(verbosity=2)
