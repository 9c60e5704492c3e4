"""Uses the interactive mode as a person does: looks at the screen, moves the mouse, types. All input goes through the X
server (xdotool); where things are on the page, and what it says, is read over the browser's own port.
"""
import contextlib
import subprocess
import time

from browser_traces import BrowserTraces
from page_probe import PageProbe, ProbeError
from screen import Screen

TIMEOUT = 20  # seconds that any single thing may take
CLASS = "support_tool.exe"  # of the window, for X clients

# What the page says of an element: its place, and what of it is within the parts that clip it.
BOX = """(() => {
  const element = document.querySelector(%r);
  if (!element || element.closest('[hidden]')) return null;
  const box = element.getBoundingClientRect();
  const main = element.closest('main');
  const clip = main ? main.getBoundingClientRect() : {top: 0, bottom: innerHeight};
  return {x: box.left, y: box.top, width: box.width, height: box.height,
          above: clip.top - box.top, below: box.bottom - clip.bottom};
})()"""
SECTION = "document.querySelector('main > section:not([hidden])').id"
FOCUSED = "document.activeElement.id"


def wait_for(what, condition, seconds=TIMEOUT):
    """The first true value of the condition; `what` is said when none comes."""
    deadline = time.monotonic() + seconds
    while True:
        value = condition()
        if value:
            return value
        if time.monotonic() > deadline:
            raise AssertionError(f"{what}: not within {seconds} seconds")
        time.sleep(0.02)


def start(session, command, folder):
    return subprocess.Popen(["wine", *command], cwd=folder, env=session.environment, stdin=subprocess.DEVNULL,
                            stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)


class Window:
    """The program's window from its start to the end of the process. `command` is the program with its arguments."""

    def __init__(self, session, command, folder):
        self._environment = session.environment
        self.screen = Screen(session.frame_buffer)
        self.handle = None
        self.page = None
        self.traces = BrowserTraces(session)
        self.started = time.monotonic()
        self.process = start(session, command, folder)

    def __enter__(self):
        try:
            self.handle = wait_for("the window", self._find)
            x, y, width, height = self.place()
            wait_for("the picture", lambda: any(self.screen.colour(x + width // 2, y + height // 2)))
            self.painted_after = time.monotonic() - self.started
            wait_for("the keyboard", self._has_keyboard)  # the window manager gives it when the window is shown already
            self.page = wait_for("the page", self._connect)
            wait_for("the first section", lambda: self.read("document.readyState") == "complete")
        except BaseException:
            self.__exit__()
            raise
        return self

    def __exit__(self, *_):
        if self.page:
            self.page.__exit__()
        if self.process.poll() is None:  # the test has failed, or has seen enough
            self.process.kill()
            self.process.wait()
            self.traces.kill()
        self.screen.close()

    # --- What there is

    def _xdotool(self, *arguments):
        result = subprocess.run(["xdotool", *map(str, arguments)], env=self._environment, capture_output=True, text=True,
                                stdin=subprocess.DEVNULL, check=False, timeout=TIMEOUT)
        if result.returncode != 0 and result.stderr:
            raise AssertionError(f"xdotool {arguments}: {result.stderr}")
        return result.stdout

    def _find(self):
        if self.process.poll() is not None:
            raise AssertionError(f"the program has ended with {self.process.returncode}")
        return next(iter(self._visible()), None)

    def _has_keyboard(self):
        return self._xdotool("getwindowfocus").strip() == self.handle

    def _visible(self):
        with contextlib.suppress(AssertionError):  # a window may go while it is asked for its name
            return self._xdotool("search", "--onlyvisible", "--class", CLASS).split()
        return []

    def _connect(self):
        profile = self.traces.profile()
        with contextlib.suppress(OSError, ProbeError, ValueError, IndexError):
            return profile and PageProbe(profile)
        return None

    def place(self):
        """Its rectangle on the screen: (x, y, width, height)."""
        answer = self._xdotool("getwindowgeometry", "--shell", self.handle)
        values = dict(line.split("=") for line in answer.split())
        return tuple(int(values[name]) for name in ("X", "Y", "WIDTH", "HEIGHT"))

    def area(self, element):
        """The rectangle of an element on the screen."""
        x, y, _, _ = self.place()
        box = self._box(element)
        return round(x + box["x"]), round(y + box["y"]), round(box["width"]), round(box["height"])

    def is_visible(self):
        return self.handle in self._visible()

    def read(self, expression):
        return self.page.read(expression)

    def text(self, element):
        return self.read(f"document.querySelector({element!r}).innerText")

    def section(self):
        return self.read(SECTION)

    def focused(self):
        return self.read(FOCUSED)

    def wait_for_section(self, name, seconds=TIMEOUT):
        wait_for(f"section {name}", lambda: self.section() == name, seconds)

    def wait_for_enabled(self, element):
        wait_for(f"{element}", lambda: self.read(f"!document.querySelector({element!r}).disabled"))

    def wait_for_text(self, element, text):
        wait_for(f"{text!r} in {element}", lambda: text in self.text(element))

    def shoot(self, path):
        """A picture of the window, when it has stopped changing."""
        self.point_elsewhere()
        place, before = self.place(), None
        deadline = time.monotonic() + 2  # a clock on the page never stops
        while (now := self.screen.pixels(place)) != before and time.monotonic() < deadline:
            before = now
            time.sleep(0.15)
        self.screen.save(place, path)

    # --- Input

    def _box(self, element):
        return wait_for(f"element {element}", lambda: self.read(BOX % element))

    def point_at(self, element):
        """Moves the mouse onto an element; rolls the wheel first when it lies outside of what the window shows."""
        for _ in range(30):
            box = self._box(element)
            if box["above"] <= 0 and box["below"] <= 0:
                break
            x, y, width, height = self.place()
            self._xdotool("mousemove", x + width // 2, y + height * 2 // 3, "click", 4 if box["above"] > 0 else 5)
            wait_for("scrolling", lambda box=box: self._box(element) != box)
            self._settle(element)
        x, y, width, height = self.area(element)
        self._xdotool("mousemove", x + width // 2, y + height // 2)

    def _settle(self, element):
        before = None
        while (now := self._box(element)) != before:
            before = now
            time.sleep(0.05)

    def point_elsewhere(self):
        self._xdotool("mousemove", 0, 0)

    def click(self, element):
        self.point_at(element)
        self.press()

    def press(self):
        """Clicks where the mouse is."""
        self._xdotool("click", "--delay", 0, 1)  # otherwise it waits for a tenth of a second afterwards

    def type(self, text, delay=15):
        # A key that needs AltGr must be read before AltGr is up again.
        self._xdotool("type", "--delay", delay if text.isascii() else 4 * delay, text)

    def fill(self, element, text):
        """Clicks into a field, replaces what is in it."""
        self.click(element)
        wait_for(f"the focus on {element}", lambda: "#" + self.focused() == element)
        self.fill_focused(text)

    def fill_focused(self, text):
        """As somebody who looks at what he types, and types it again when it came out wrong."""
        for delay in (15, 30, 60):
            self.key("ctrl+a")
            self.type(text, delay)
            with contextlib.suppress(AssertionError):
                return wait_for("the text", lambda: self.read("document.activeElement.value") == text, 3)
        raise AssertionError(f"{text!r} was typed, {self.read('document.activeElement.value')!r} is there")

    def key(self, *keys):
        self._xdotool("key", "--delay", 15, *keys)

    def tab_to(self, element_id):
        for _ in range(40):
            if self.focused() == element_id:
                return
            before = self.read("document.activeElement.outerHTML")
            self.key("Tab")
            wait_for("the focus", lambda before=before: self.read("document.activeElement.outerHTML") != before)
        raise AssertionError(f"{element_id} is not reached by the keyboard")

    def drag(self, element, dx, dy):
        """Drags the window by an element of the page, in steps as a hand does."""
        self.point_at(element)
        self._xdotool("mousedown", 1)
        for _ in range(10):
            self._xdotool("mousemove_relative", "--", dx // 10, dy // 10)
            time.sleep(0.03)
        self._xdotool("mouseup", 1)

    def activate(self):
        """As from the task bar."""
        self._xdotool("windowactivate", "--sync", self.handle)

    # --- The end

    def wait_for_end(self, seconds=TIMEOUT):
        """Waits for the process, its browser and the browser's profile to be gone."""
        try:
            code = self.process.wait(seconds)
        except subprocess.TimeoutExpired:
            raise AssertionError(f"the program does not end within {seconds} seconds") from None
        self.traces.seconds_until_gone(8)
        return code
