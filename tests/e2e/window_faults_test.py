"""The interactive mode with a page, a browser and settings that misbehave: an answer or a message for the user, never a hang
or a crash."""
import json
import os
import pathlib
import signal
import subprocess
import sys
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))

from interactive_stage import InteractiveStage  # noqa: E402
from support_tool import wait_until, windows_path  # noqa: E402
from x_session import XSession  # noqa: E402

APP_PATH = "HKLM\\Software\\Microsoft\\Windows\\CurrentVersion\\App Paths\\msedge.exe"

NAMES = ("validate_user_details", "select_issue", "translate", "get_state", "cancel", "notif", "call_function",
         "no_such_function", "", "__proto__", "\\u0000", "x" * 100_000)
# What the page sends, under one name; how often what kind of answer or error comes back.
SHAPES = """
    const loop = {}; loop.self = loop;
    const nested = (depth) => { let value = 1; while (depth-- > 0) value = depth % 2 ? [value] : {a: value}; return value; };
    const wide = Object.fromEntries(Array.from({length: 5000}, (_, i) => ['k' + i, i]));
    const shapes = [[], [undefined], [null], [0], [-1e308], [NaN], [12345678901234567890n], ['\\ud800'], [true], [[]], [{}],
      [loop], [nested(150)], [nested(199)], [nested(5000)],
      [Symbol.iterator], [() => 1], [new Error('e')], [new Date(NaN)], [new Uint8Array(1e4)], [document], [Promise.resolve(1)],
      [{user_name: 1, user_email: [], agreed_licence: 'yes'}], [{user_name: 'a', user_email: 'a@b.cc'}],
      [{issue: {}, description: null}], [{functionName: 7, data: 1}], [{functionName: 'no such', args: []}],
      [{__proto__: null, constructor: 1, issue_reproduced: 'no'}], [1, 2], [1, 2, 3], [1, () => { throw new Error('mine'); }]];
    if (name === 'select_issue') shapes.push([wide], ['x'.repeat(5e6)], [Array(300000).fill(1)]);
    const kinds = {};
    for (const shape of shapes) {
      let kind;
      try { kind = typeof Window.this.xcall(name, ...shape); } catch (error) { kind = error.constructor.name; }
      kinds[kind] = (kinds[kind] || 0) + 1;
    }
    return JSON.stringify(kinds);"""


class WindowFaults(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.session = cls.enterClassContext(XSession())
        cls.stage = InteractiveStage(cls.session)
        cls.addClassCleanup(cls.stage.close)
        cls.traces = cls.stage.traces

    def setUp(self):
        self.addCleanup(self.traces.kill)
        self.mark = self.stage.mark()

    def open(self):
        process = self.stage.start()
        self.addCleanup(self.end, process)
        return process

    def open_page(self):
        process = self.open()
        page = self.stage.page(process)
        self.addCleanup(page.__exit__)
        return process, page

    def end(self, process):
        if process.poll() is None:
            process.kill()
            process.wait()

    def close(self, process, page):
        page.read("void setTimeout(() => native.call('close'))")  # after the answer
        self.assertEqual(process.wait(20), 0)

    def wine(self, *command):
        return subprocess.run(["wine", *command], env=self.session.environment, stdin=subprocess.DEVNULL, capture_output=True,
                              check=False)

    def log(self):
        return self.stage.log(self.mark)

    def read_the_message(self, process):
        """Waits for the box, closes it and lets the program end."""
        search = ["xdotool", "search", "--onlyvisible", "--name", "^Support Tool$"]
        self.assertTrue(wait_until(lambda: subprocess.run(search, env=self.session.environment, capture_output=True,
                                                          check=False).stdout, 40), self.log())
        self.assertIsNone(process.poll())
        self.wine("taskkill", "/im", "support_tool.exe")
        self.assertEqual(process.wait(20), 0)

    def test_messages_of_any_shape_are_answered(self):
        process, page = self.open_page()
        for name in NAMES:
            kinds = json.loads(page.read(f'(() => {{ const name = "{name}"; {SHAPES} }})()'))
            self.assertLessEqual(set(kinds), {"object", "Error", "TypeError"}, name)
            self.assertGreater(kinds["object"], 20, name)
        self.assertEqual(page.read("view.get_state().success"), True)
        self.assertEqual(page.read("view.translate('close').translation"), "Close")
        self.close(process, page)
        self.assertNotIn("unexpected failure", self.log())
        self.traces.seconds_until_gone(8)

    def test_calls_in_the_moment_of_closing_do_no_harm(self):
        process, page = self.open_page()
        page.read("""(() => {
            setInterval(() => { for (let i = 0; i < 10; ++i) { try { view.get_state(); view.select_issue({}, () => 1); }
                                catch (error) { } } }, 1);
            setTimeout(() => view.xcall('close'), 300); })()""")
        self.assertEqual(process.wait(20), 0)
        self.traces.seconds_until_gone(8)

    def test_browser_that_dies_is_said_and_logging_is_put_back(self):
        process, page = self.open_page()
        page.read("view.start_issue_reproduction()")
        self.assertTrue(self.stage.is_raised())
        self.traces.kill()
        self.read_the_message(process)
        self.assertTrue(self.stage.is_as_before())
        self.assertIn("the page is lost; the window is closed", self.log())

    def test_browser_that_hangs_does_not_keep_the_window(self):
        process, page = self.open_page()
        page.read("view.start_issue_reproduction()")
        for pid in self.traces.processes():
            entry = pathlib.Path("/proc") / str(pid)
            # The browser itself; those that it has started ("--type=") notice when it goes.
            if (entry / "comm").read_text().startswith("chrom") and b"--type=" not in (entry / "cmdline").read_bytes():
                os.kill(pid, signal.SIGSTOP)
        self.assertTrue(self.stage.is_raised())
        self.wine("taskkill", "/im", "support_tool.exe")  # as Windows' own list of tasks does
        self.assertEqual(process.wait(20), 0)
        self.assertTrue(self.stage.is_as_before())
        self.traces.seconds_until_gone(8)

    def test_browser_that_cannot_be_used_is_said(self):
        broken = self.stage.path("broken")
        broken.write_text("#!/bin/sh\necho 'no will' >&2\nexit 1\n")
        os.chmod(broken, 0o755)
        self.wine("reg", "add", APP_PATH, "/ve", "/d", windows_path(broken), "/f")
        self.addCleanup(self.wine, "reg", "delete", APP_PATH, "/f")
        process = self.open()
        self.read_the_message(process)
        for text in ("the browser ended at once: no will", "Failed to create window from file"):
            self.assertIn(text, self.log())
        # Without a window nobody is asked to read anything.
        self.stage.run("nogui", "c", "nocs", "noe")

    def test_page_that_is_not_there_is_said(self):
        page = self.stage.path("gui/new/support_tool_en.html")
        away = page.rename(page.with_suffix(".away"))
        self.addCleanup(away.rename, page)
        self.read_the_message(self.open())
        self.assertIn("Failed to create window from file", self.log())

    def test_settings_of_the_installer_that_are_none_mean_english(self):
        settings = self.stage.path("kitinstaller/settings")
        settings.mkdir(parents=True)
        bomb = "a: &a [x,x,x,x,x,x,x,x,x]\n" + "".join(
            f"{name}: &{name} [{','.join(['*' + before] * 9)}]\n" for before, name in zip("abcdefgh", "bcdefghi"))
        with open(settings / "install_info.yaml", "wb") as file:
            file.write(bomb.encode())
        process, page = self.open_page()
        self.assertEqual(page.read("document.documentElement.lang"), "en")
        self.assertIn("install_info.yaml is not usable: too many values", self.log())
        self.close(process, page)


if __name__ == "__main__":
    unittest.main(verbosity=2)
