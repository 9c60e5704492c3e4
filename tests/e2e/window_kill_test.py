"""The interactive mode killed in each of its states: the next start puts the product's logging back, and neither a browser
nor its profile is left."""
import pathlib
import sys
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))

from interactive_stage import InteractiveStage  # noqa: E402
from scripted_http_server import ScriptedServer  # noqa: E402
from support_tool import wait_until  # noqa: E402
from x_session import XSession  # noqa: E402

BROWSER_END = 8  # seconds until nothing of a killed program's browser is left; docs/engine.md
SECTION = "document.querySelector('main > section:not([hidden])').id"
# What a user does, by the page's own elements.
TO_THE_RECORDING = """
    const field = (id) => document.getElementById(id);
    field('name').value = 'Ana';
    field('email').value = 'ana@example.com';
    field('consent').checked = true;
    field('details-form').requestSubmit();
    document.querySelector('input[name=issue]').checked = true;
    field('description').value = 'It stops.';
    field('issue-form').requestSubmit();"""
CLICK = "document.getElementById('%s').click()"


class WindowKill(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.session = cls.enterClassContext(XSession())
        cls.stage = InteractiveStage(cls.session)
        cls.addClassCleanup(cls.stage.close)
        cls.stage.settings({"all_collectors": True})  # collecting takes its time
        cls.server = cls.enterClassContext(ScriptedServer([{"never": True, "repeat": 100}]))
        cls.stage.send_to(cls.server.port)

    def setUp(self):
        self.addCleanup(self.stage.traces.kill)
        self.mark = self.stage.mark()
        self.process = self.stage.start("noda")
        self.addCleanup(self.end)
        self.page = self.stage.page(self.process)
        self.addCleanup(self.page.__exit__)

    def end(self):
        if self.process.poll() is None:
            self.process.kill()
            self.process.wait()

    def until(self, what, condition):
        self.assertTrue(wait_until(lambda: self.process.poll() is not None or condition(), 30), what)
        self.assertIsNone(self.process.poll(), f"{what}: the program has ended")

    def record(self):
        self.page.read(f"(() => {{ {TO_THE_RECORDING} }})()")
        self.assertEqual(self.page.read(SECTION), "reproduce")
        self.page.read(CLICK % "reproduce-toggle")
        self.until("raised", self.stage.is_raised)

    def stop_and_send(self):
        enabled = "!document.getElementById('reproduce-toggle').disabled"
        self.until("recording", lambda: self.page.read(enabled))
        self.page.read(CLICK % "reproduce-toggle")
        self.until("recorded", lambda: self.page.read("!document.getElementById('reproduce-next').disabled"))
        self.page.read(CLICK % "reproduce-next")
        self.page.read(CLICK % "send-button")

    def until_logged(self, text):
        self.until(text, lambda: text in self.stage.log(self.mark))

    def kill_and_look(self, state, is_raised=False):
        self.process.kill()
        self.process.wait()
        self.assertEqual(self.stage.is_raised(), is_raised)
        seconds = self.stage.traces.seconds_until_gone(BROWSER_END)
        print(f"killed while {state}: nothing of the browser is left after {seconds:.1f} s", file=sys.stderr)
        self.stage.run("nogui")
        self.assertTrue(self.stage.is_as_before(), self.stage.logger_xml.read_bytes())

    def test_while_the_page_is_shown(self):
        self.kill_and_look("the page is shown")

    def test_while_recording(self):
        self.record()
        self.kill_and_look("recording", is_raised=True)
        self.assertIn("was left raised and is put back", self.stage.log(self.mark))

    def test_while_collecting(self):
        self.record()
        self.stop_and_send()
        self.until_logged("--> COLLECT")
        self.kill_and_look("collecting")
        self.assertNotIn("<-- COLLECT", self.stage.log(self.mark))

    def test_while_sending(self):
        self.stage.settings({"system_summary": True})
        requests = len(self.server.requests)
        self.record()
        self.stop_and_send()
        self.until("sending", lambda: len(self.server.requests) > requests)
        self.assertEqual(self.page.read(SECTION), "progress")
        self.kill_and_look("sending")

    def test_while_sending_what_is_still_recorded(self):
        """A page that leaves out the stop: sending switches it off."""
        requests = len(self.server.requests)
        self.stage.settings({"system_summary": True})
        self.record()
        self.page.read("view.submit({issue_reproduced: true}).success")
        self.until("sending", lambda: len(self.server.requests) > requests)
        self.assertTrue(self.stage.is_as_before())
        self.kill_and_look("sending what is still recorded")


if __name__ == "__main__":
    unittest.main(verbosity=2)
