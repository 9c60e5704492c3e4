"""The engine (sciter.dll) with a real browser on a virtual screen: engine_host.exe is the window."""
import os
import pathlib
import shutil
import signal
import sys
import tempfile
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))
from browsers import browser_processes, processor_seconds, profiles_in_use  # noqa: E402
from engine_host import EngineHost, windows_path  # noqa: E402
from x_session import XSession  # noqa: E402

SOURCE = pathlib.Path(__file__).resolve().parents[2]
BIN = pathlib.Path(os.environ.get("ST_BIN", SOURCE / "build/windows-cross/bin"))

WM_LBUTTONDOWN, WM_LBUTTONUP, WM_MOUSEWHEEL, WM_CHAR = 0x201, 0x202, 0x20A, 0x102
WM_KEYDOWN, WM_KEYUP = 0x100, 0x101
VK_BACK, VK_TAB = 8, 9

PAGE = """<!-- a comment --><!DOCTYPE html>
<html style="width: 420px; height: 320px; background: #102030"><head>
<link rel="stylesheet" href="res:style.css"><link rel="stylesheet" href="this://app/style.css">
<link rel="stylesheet" href="own.css"><script src="res:discarded.js"></script></head>
<body style="margin: 0">
<p id="p">Text</p>
<input id="field" style="position: absolute; left: 10px; top: 100px; width: 200px; height: 30px">
<div id="box" style="position: absolute; left: 10px; top: 200px; width: 100px; height: 50px; overflow: auto">
<div style="height: 1000px"></div></div>
<script>SCRIPT</script></body></html>"""


def at(x, y):
    return y << 16 | x


class EngineTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.session = XSession()
        cls.session.__enter__()
        cls.addClassCleanup(cls.session.__exit__)

    def setUp(self):
        self.seen = set()
        self._folder = tempfile.TemporaryDirectory(prefix="st_engine_test_")
        self.addCleanup(self._folder.cleanup)
        self.folder = pathlib.Path(self._folder.name) / "pages 100%"
        self.folder.mkdir()
        (self.folder / "own.css").write_text("p { color: rgb(1, 2, 3) }")

    def browsers(self):
        return browser_processes(self.session)

    def profiles(self):
        """The profile folders that there are, of the browsers that were seen in this case."""
        self.seen |= profiles_in_use(self.session)
        return [path for path in self.seen if path.exists()]

    def gone_within(self, seconds):
        deadline = time.monotonic() + seconds
        while time.monotonic() < deadline and (self.browsers() or self.profiles()):
            time.sleep(0.2)
        return not self.browsers() and not self.profiles()

    def open(self, script, *arguments, page=PAGE):
        (self.folder / "index.htm").write_text(page.replace("SCRIPT", script), encoding="utf-8")
        host = EngineHost(self.session, BIN, "file://" + windows_path(self.folder / "index.htm"), *arguments)
        self.addCleanup(host.__exit__)
        return host

    def test_page_is_painted_in_the_window_within_three_seconds(self):
        host = self.open("")
        self.assertEqual(host.wait_for("shown").split()[:2], ["420", "320"])
        while host.ask("pixel 400 300", "pixel") != "16 32 48":
            self.assertLess(time.monotonic() - host.started, 3)
            time.sleep(0.02)
        print(f"painted {time.monotonic() - host.started:.2f} s after the start", file=sys.stderr)
        self.assertEqual(host.ask("measure", "measure").split()[:4], ["0", "0", "420", "320"])

    def test_plain_window_is_painted_too(self):
        host = self.open("", "--plain")
        host.wait_for("shown")
        deadline = time.monotonic() + 5
        while host.ask("pixel 200 290", "pixel") != "16 32 48":
            self.assertLess(time.monotonic(), deadline)
            time.sleep(0.05)

    def test_page_follows_the_size_of_the_window(self):
        host = self.open("addEventListener('resize', () => view.print(innerWidth + 'x' + innerHeight))")
        host.wait_for("shown")
        host.send("size 500 400")
        deadline = time.monotonic() + 5
        while not host.wait_for("print").startswith("500x400"):
            self.assertLess(time.monotonic(), deadline)

    def test_resources_come_from_the_host_or_from_the_pages_folder(self):
        host = self.open("""
            const style = getComputedStyle(document.getElementById('p'));
            view.print([style.padding, style.marginLeft, style.color, document.compatMode].join('|'));
            for (const address of ['../index.htm', 'missing.css', '/C:/windows/win.ini', 'https://example.com/',
                                   'http://127.0.0.1:1/']) {
              const request = new XMLHttpRequest();
              request.open('GET', address, false);
              try { request.send(); view.print('reached ' + address); } catch (error) { view.print('no ' + address); }
            }""")
        self.assertTrue(host.wait_for("print").startswith("3px|7px|rgb(1, 2, 3)|CSS1Compat"))
        self.assertEqual([host.wait_for("print").split()[0] for _ in range(5)], ["no"] * 5)
        host.wait_for("loaded 1")
        self.assertIn("load res:discarded.js", host.lines)

    def test_calls_go_both_ways_and_nest(self):
        host = self.open("""
            const twice = (x) => x * 2;                    // no member of the global object
            function add(a, b) { return a + b; }
            function viaNative(value) { return view.echo(value); }
            function deep(n) { return n === 0 ? 'bottom' : view.pageCall('deep', n - 1); }
            function fails() { throw new Error('on purpose'); }
            const all = [1, -0.5, 'text \\u00e4 \\u{1F600}', true, null, [], {a: {b: [1]}}, {'__proto__x': 1}];
            view.print(String(JSON.stringify(view.echo(all)) === JSON.stringify(all)));
            view.print([undefined, NaN, new Date(5), new Uint8Array([1, 255])]
              .map((value) => String(view.echo(value))).join('|'));
            view.print([1, 1.5, 'x', true, null, undefined, [], {}, () => 1].map((value) => view.kind(value)).join());
            view.print(String(view.invoke((x) => x + 1, 41)));
            view.print(String(view.pageCall('twice', 21)));
            view.print(deep(20));
            view.print(Window.this.xcall('echo', 'xcall'));
            view.print('\\ud800 lone');
            view.later((x) => { view.print('later ' + x); return x + 1; }, 1);
            for (const wrong of [() => view.nothing(), () => { const a = []; a.push(a); view.echo(a); },
                                 () => view.invoke(() => { throw new Error('inner'); }, 1)])
              try { view.print('not refused ' + wrong()); } catch (error) { view.print(error.message); }""")
        expected = ["true", "undefined|NaN|" , "30,40,50,20,10,0,90,100,134", "42", "42", "bottom", "xcall",
                    "\ufffd lone", "there is no native function 'nothing'", "a value that is nested too deeply",
                    "Error: inner"]
        for text in expected:
            self.assertTrue(host.wait_for("print").startswith(text), (text, host.lines[-1]))
        self.assertEqual(host.wait_for("print").split()[:2], ["later", "1"])
        self.assertEqual(host.wait_for("later"), "2")
        for command, answer in (("add [1,2]", "1 3"), ("viaNative [{\"a\":[1]}]", '1 {"a":[1]}'), ("twice [4]", "1 8"),
                                ("deep [3]", '1 "bottom"'), ("fails []", '0 "Error: on purpose"'),
                                ("nothing []", '0 "the page has no function \\"nothing\\""'),
                                ("alert(1) []", '0 "the page has no function \\"alert(1)\\""')):
            self.assertEqual(host.ask("call " + command, "called"), answer, command)

    def test_ten_thousand_calls_in_a_row(self):
        host = self.open("""
            function many(n) { let sum = 0; for (let i = 0; i < n; ++i) sum += view.echo(1); return sum; }
            function functions(n) { for (let i = 0; i < n; ++i) view.invoke((x) => x, i); return n; }""")
        host.wait_for("shown")
        start = time.monotonic()
        for _ in range(10):
            self.assertEqual(host.ask("call many [1000]", "called"), "1 1000")
        print(f"a call of the page takes {(time.monotonic() - start) / 10:.2f} ms", file=sys.stderr)
        self.assertEqual(host.ask("call functions [500]", "called"), "1 500")
        start = time.monotonic()
        for _ in range(200):
            host.send("call many [0]")
        for _ in range(200):
            self.assertEqual(host.wait_for("called"), "1 0")
        print(f"a call into the page takes {(time.monotonic() - start) * 5:.2f} ms", file=sys.stderr)

    def test_input_reaches_the_page_within_a_tenth_of_a_second(self):
        host = self.open("""
            const field = document.getElementById('field');
            field.addEventListener('input', () => view.print('value ' + field.value));
            field.addEventListener('mousedown', (event) => view.print('down ' + event.offsetX + ' ' + event.detail));
            document.getElementById('box').addEventListener('scroll', () => view.print('scrolled'));
            field.addEventListener('blur', () => view.print('blur'));""")
        host.wait_for("shown")
        time.sleep(0.5)
        for count in (1, 2):
            host.send(f"post {WM_LBUTTONDOWN} 1 {at(30, 110)}")
            self.assertTrue(host.wait_for("print").startswith("down 1"))
            host.send(f"post {WM_LBUTTONUP} 0 {at(30, 110)}")
            self.assertEqual(host.lines[-1].split()[3], str(count))
        times = []
        for end in range(1, 6):
            start = time.monotonic()
            host.send(f"post {WM_CHAR} {ord('x')} 0")
            self.assertEqual(host.wait_for("print").split()[1], "x" * end)
            times.append(time.monotonic() - start)
        self.assertLess(sorted(times)[2], 0.1)
        print(f"a character reaches the page in {sorted(times)[2] * 1000:.0f} ms", file=sys.stderr)
        host.send(f"post {WM_KEYDOWN} {VK_BACK} 0")
        host.send(f"post {WM_KEYUP} {VK_BACK} 0")
        self.assertEqual(host.wait_for("print").split()[1], "xxxx")
        host.send(f"post {WM_MOUSEWHEEL} {(-120 & 0xFFFF) << 16} {at(20 + 30, 20 + 220)}")
        self.assertTrue(host.wait_for("print").startswith("scrolled"))
        host.send(f"post {WM_KEYDOWN} {VK_TAB} 0")
        self.assertTrue(host.wait_for("print").startswith("blur") or host.wait_for("print").startswith("blur"))

    def test_input_is_seen_on_the_screen_within_a_tenth_of_a_second(self):
        host = self.open("addEventListener('mousedown', () => document.documentElement.style.background = '#ff0000')")
        host.wait_for("shown")
        while host.ask("pixel 400 300", "pixel") != "16 32 48":
            time.sleep(0.02)
        start = time.monotonic()
        host.send(f"post {WM_LBUTTONDOWN} 1 {at(300, 20)}")
        while host.ask("pixel 400 300", "pixel") != "255 0 0":
            self.assertLess(time.monotonic() - start, 2)
        print(f"a click is seen after {(time.monotonic() - start) * 1000:.0f} ms", file=sys.stderr)

    def test_page_stays_where_it_is(self):
        host = self.open("""
            function leave(address) { location.href = address; }
            function pop() { return String(open('https://example.com/')); }
            function ask() { return String(confirm('sure?')); }""")
        host.wait_for("shown")
        for address in ("https://example.com/", "http://127.0.0.1:1/", "this://app/nothing.htm"):
            host.ask(f'call leave ["{address}"]', "called")
        self.assertEqual(host.ask("call pop []", "called"), '1 "null"')
        self.assertEqual(host.ask("call ask []", "called"), '1 "false"')
        time.sleep(0.5)
        self.assertEqual(host.ask("call ask []", "called"), '1 "false"')
        text = "\n".join(host.lines)
        for report in ("outside of the page: https://example.com/", "a page cannot open windows", "a dialog was not shown"):
            self.assertIn(report, text)

    def test_closing_ends_the_browser_and_deletes_its_profile(self):
        host = self.open("")
        host.wait_for("shown")
        self.assertTrue(self.browsers() and self.profiles())
        host.send("close")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)
        self.assertTrue(self.gone_within(6), (self.browsers(), self.profiles()))

    def test_page_may_close_its_window_in_a_call(self):
        host = self.open("setTimeout(() => { view.closeWindow(); view.echo(1); }, 300)")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)
        host = self.open("setTimeout(() => view.close(), 300)")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)

    def test_killed_host_leaves_no_browser(self):
        host = self.open("")
        host.wait_for("shown")
        self.assertTrue(self.profiles())
        host.send("abort")
        self.assertEqual(host.wait(), 3)
        self.assertTrue(self.gone_within(40), (self.browsers(), self.profiles()))

    def test_browser_that_dies_is_reported(self):
        host = self.open("function add(a) { return a; }")
        host.wait_for("shown")
        left = self.profiles()
        for pid in self.browsers():
            try:
                os.kill(pid, signal.SIGKILL)
            except ProcessLookupError:
                pass
        host.wait_for("debug 0 2 the")  # the page has crashed, or the browser is gone
        self.assertTrue(host.ask("call add [1]", "called").startswith("0 "))
        host.send("close")
        host.wait_for("ended")
        for path in left:  # its watch was killed too
            shutil.rmtree(path, ignore_errors=True)
            path.with_name(path.name + ".life").unlink(missing_ok=True)

    def test_browser_that_is_none_is_reported(self):
        broken = self.folder / "broken"
        broken.write_text("#!/bin/sh\necho 'no display and no will' >&2\nexit 1\n")
        silent = self.folder / "silent"
        silent.write_text("#!/bin/sh\nfor a; do case $a in --user-data-dir=*) d=${a#*=};; esac; done\n"
                          "printf '9\\n/devtools/browser/x\\n' > \"$d/DevToolsActivePort\"; exec sleep 60\n")
        for browser, report in ((broken, "the browser ended at once: no display and no will"),
                                (silent, "the browser's port 9 does not answer"),
                                (self.folder / "missing.exe", "the browser cannot be started, error")):
            if browser.exists():
                browser.chmod(0o755)
            host = self.open("", "--browser", windows_path(browser))
            self.assertTrue(host.wait_for("loaded").startswith("0"))
            self.assertEqual(host.wait(), 1)
            self.assertIn(report, "\n".join(host.lines))
        self.assertTrue(self.gone_within(40))

    def test_idle_page_costs_little(self):
        host = self.open("")
        host.wait_for("shown")
        time.sleep(3)
        pids = [host.process.pid, *self.browsers()]
        before = processor_seconds(pids)
        time.sleep(10)
        share = (processor_seconds(pids) - before) / 10
        print(f"idle costs {share * 100:.1f} % of a core", file=sys.stderr)
        self.assertLess(share, 0.02)


if __name__ == "__main__":
    unittest.main(verbosity=2)
