"""The engine (sciter.dll) with a real browser on a virtual screen: engine_host.exe is the window."""
import json
import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))
from browser_traces import BrowserTraces, processor_seconds  # noqa: E402
from engine_host import EngineHost, windows_path  # noqa: E402
from page_probe import PageProbe  # noqa: E402
from x_session import XSession  # noqa: E402

SOURCE = pathlib.Path(__file__).resolve().parents[2]
SUPPORT = SOURCE / "tests/support"
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


class UnixWatchTest(unittest.TestCase):
    """The shell that watches a Unix browser, with `sleep` as the browser."""

    def test_browser_and_profile_go_with_the_mark(self):
        with tempfile.TemporaryDirectory(prefix="st_watch_") as folder:
            (pathlib.Path(folder) / "st-engine-orphan").mkdir()
            watches = {}
            for name in ("kept", "deleted", "aged", "slept"):
                profile = pathlib.Path(folder) / f"st-engine-{name}"
                mark = pathlib.Path(f"{profile}.life")
                mark.touch()  # before the folder, which another watch would take for an orphan
                profile.mkdir()
                watches[name] = (profile, mark, subprocess.Popen(
                    ["sh", "-c", (SOURCE / "companions/engine/unix_watch.sh").read_text(), "watch", mark, profile, "sleep", "60"]))
            try:
                self.look_after(watches)
            finally:
                for profile, mark, watch in watches.values():
                    mark.unlink(missing_ok=True)
                    self.assertEqual(watch.wait(10), 0)
                    self.assertFalse(profile.exists())

    def look_after(self, watches):
        time.sleep(0.5)
        watches["deleted"][1].unlink()
        for name in ("aged", "slept"):
            os.utime(watches[name][1], (0, 0))
        time.sleep(2.5)
        self.assertFalse(watches["deleted"][0].exists())
        watches["slept"][1].touch()  # its owner is awake again
        deadline = time.monotonic() + 15
        while watches["aged"][0].exists() or watches["aged"][1].exists():
            self.assertLess(time.monotonic(), deadline)
            time.sleep(0.1)
        self.assertFalse((watches["kept"][0].parent / "st-engine-orphan").exists())
        self.assertTrue(watches["kept"][0].exists() and watches["slept"][0].exists())
        for name in ("kept", "slept"):
            self.assertIsNone(watches[name][2].poll())


class EngineTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.session = XSession()
        cls.session.__enter__()
        cls.addClassCleanup(cls.session.__exit__)
        cls.traces = BrowserTraces(cls.session)
        cls.addClassCleanup(cls.traces.kill)

    def setUp(self):
        self._folder = tempfile.TemporaryDirectory(prefix="st_engine_test_")
        self.addCleanup(self._folder.cleanup)
        self.folder = pathlib.Path(self._folder.name) / "pages 100%"
        self.folder.mkdir()
        (self.folder / "own.css").write_text("p { color: rgb(1, 2, 3) }")

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

    def test_input_is_seen_on_the_screen(self):
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
            function ask() { return String(confirm('sure?')); }
            function others() { return [String(alert('stop')), String(prompt('name?', 'x'))]; }""")
        host.wait_for("shown")
        for address in ("https://example.com/", "http://127.0.0.1:1/", "this://app/nothing.htm"):
            host.ask(f'call leave ["{address}"]', "called")
        self.assertEqual(host.ask("call pop []", "called"), '1 "null"')
        self.assertEqual(host.ask("call ask []", "called"), '1 "false"')
        self.assertEqual(host.ask("call others []", "called"), '1 ["undefined","null"]')
        time.sleep(0.5)
        self.assertEqual(host.ask("call ask []", "called"), '1 "false"')
        # Other ways to leave, by what no request is made for, and by pages that are not there.
        for way in ("location.href = 'about:blank'", "location.href = 'missing.htm'", "history.back()",
                    "location.href = URL.createObjectURL(new Blob(['x'], {type: 'text/html'}))"):
            host.send(f"call leave {json.dumps(['javascript:void(' + way + ')'])}")
            host.wait_for("called")
            deadline = time.monotonic() + 10
            while host.ask("call ask []", "called") != '1 "false"':
                self.assertLess(time.monotonic(), deadline, way)
                time.sleep(0.1)
        text = "\n".join(host.lines)
        for report in ("outside of the page: https://example.com/", "a page cannot open windows",
                       "a dialog was not shown: sure?", "a dialog was not shown: name?",
                       "the page went to 'about:blank'; it is loaded again", "missing.htm"):
            self.assertIn(report, text)

    def test_page_cannot_have_other_windows(self):
        host = self.open("""
            function byLink() { const a = document.createElement('a'); a.href = 'index.htm'; a.target = '_blank';
                                document.body.append(a); a.click(); }
            function byFrame() { const f = document.createElement('iframe'); document.body.append(f);
                                 return String(f.contentWindow.open('index.htm')); }
            function byForm() { const f = document.createElement('form'); f.target = 'other'; document.body.append(f);
                                f.submit(); }""")
        host.wait_for("shown")
        with PageProbe(self.traces.profile()) as probe:
            for way in ("byLink", "byFrame", "byForm"):
                host.ask(f"call {way} []", "called")
                time.sleep(0.3)
                self.assertEqual(len(probe.pages()), 1, way)

    def test_closing_ends_the_browser_and_deletes_its_profile(self):
        host = self.open("")
        host.wait_for("shown")
        self.assertTrue(self.traces.left())
        host.send("close")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)
        self.traces.seconds_until_gone(6)

    def test_page_may_close_its_window_in_a_call(self):
        host = self.open("setTimeout(() => { view.closeWindow(); view.echo(1); }, 300)")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)
        host = self.open("view.later(() => { view.closeWindow(); return view.echo(1); }, 1)")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)
        host = self.open("setTimeout(() => view.close(), 300)")
        host.wait_for("engine destroyed")
        self.assertEqual(host.wait(), 0)

    def test_killed_host_leaves_no_browser(self):
        host = self.open("")
        host.wait_for("shown")
        host.send("abort")
        self.assertEqual(host.wait(), 3)
        self.traces.seconds_until_gone(8)

    def test_killed_host_leaves_no_windows_browser(self):
        """Such a browser is in a job; engine_peer.exe stands in for one. The next window deletes the profile."""
        host, folder = self.open_with_peer()
        peers = self.traces.processes()
        self.assertEqual(len(peers), 1)
        left = list(folder.glob("st-engine-*"))
        self.assertEqual(len(left), 2)  # the profile, and the mark beside it
        host.send("abort")
        self.assertEqual(host.wait(), 3)
        deadline = time.monotonic() + 5
        while self.traces.processes():
            self.assertLess(time.monotonic(), deadline)
            time.sleep(0.05)
        self.assertEqual(len(list(folder.glob("st-engine-*"))), 1)
        (folder / "st-engine-0.life").write_text("left by a power failure")
        (folder / "st-engine-0").mkdir()
        host, folder = self.open_with_peer()
        self.assertEqual(len(list(folder.glob("st-engine-*"))), 2)
        self.assertFalse(set(left) & set(folder.glob("st-engine-*")))

    def open_with_peer(self):
        folder = pathlib.Path(self._folder.name) / "tmp"
        folder.mkdir(exist_ok=True)
        peer = folder / "engine_peer_good.exe"
        shutil.copy(BIN / "engine_peer.exe", peer)
        host = self.open("", "--browser", windows_path(peer), "--temporary", windows_path(folder))
        host.wait_for("shown")
        return host, folder

    def test_browser_that_dies_is_reported(self):
        host = self.open("function add(a) { return a; }")
        host.wait_for("shown")
        self.traces.kill()
        host.wait_for("debug 0 2 the")  # the page has crashed, or the browser is gone
        self.assertTrue(host.ask("call add [1]", "called").startswith("0 "))
        host.send("close")
        host.wait_for("ended")
        self.assertTrue(self.traces.left())  # the watch was killed too
        next_host = self.open("")
        next_host.wait_for("shown")
        next_host.send("close")
        next_host.wait_for("ended")
        self.traces.seconds_until_gone(6)

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
        self.traces.seconds_until_gone(8)

    def test_browser_that_speaks_nonsense_is_given_up(self):
        cases = (("garbage", "the browser speaks no DevTools protocol"),
                 ("endless", "the browser sends a message that is too large"),
                 ("closing", "the browser's connection has ended"),
                 ("html", "the browser's port refuses a web socket"),
                 ("mute", "does not answer, error"),
                 ("hanging", "it does not do what it is told"))
        hosts = []
        for manner, report in cases:
            browser = self.folder / f"bad_browser_{manner}"
            shutil.copy(SUPPORT / "bad_browser.py", browser)
            browser.chmod(0o755)
            hosts.append((manner, report, self.open("", "--browser", windows_path(browser))))
        for manner, report, host in hosts:
            with self.subTest(manner=manner):
                self.assertTrue(host.wait_for("loaded").startswith("0"))
                self.assertEqual(host.wait(), 1)
                self.assertIn(report, "\n".join(host.lines))
        self.traces.seconds_until_gone(8)

    def test_idle_page_costs_little(self):
        host = self.open("")
        host.wait_for("shown")
        time.sleep(3)
        pids = [host.process.pid, *self.traces.processes()]
        before = processor_seconds(pids)
        time.sleep(10)
        share = (processor_seconds(pids) - before) / 10
        print(f"idle costs {share * 100:.1f} % of a core", file=sys.stderr)
        self.assertLess(share, 0.02)


if __name__ == "__main__":
    unittest.main(verbosity=2)
