"""A virtual screen and a Wine session that has it, for tests with windows. The sessions of the other tests have no screen,
and one that was started without never gets any: this one has a prefix of its own, kept in the build folder.
"""
import os
import pathlib
import shutil
import subprocess
import tempfile

SOURCE = pathlib.Path(__file__).resolve().parents[2]
WINE_ROOT = pathlib.Path(os.environ.get("ST_WINE_SCREEN_ROOT", SOURCE / "build/wine-screen"))


class XSession:
    """`environment` is what programs of the session are started with; `frame_buffer` is a file for screen.Screen, or
    None on a display that is there already and was handed in. Without a window manager nothing can be minimised."""

    def __init__(self, display=None, has_manager=False):
        self.display = display
        self._has_manager = has_manager
        self._manager = None
        self.frame_buffer = None
        self._server = None

    def __enter__(self):
        if self.display is None:
            self._start_server()
        self.environment = self._bash("true")
        if self._has_manager:
            self._manager = subprocess.Popen(["openbox"], env=self.environment, stdin=subprocess.DEVNULL,
                                             stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        self._bash("st_wine_down; st_wine_up")
        return self

    def _start_server(self):
        self._folder = tempfile.TemporaryDirectory(prefix="st_screen_")
        self.frame_buffer = pathlib.Path(self._folder.name) / "Xvfb_screen0"
        reader, writer = os.pipe()
        self._server = subprocess.Popen(
            ["Xvfb", "-displayfd", str(writer), "-screen", "0", "1280x1024x24", "-nolisten", "tcp", "-noreset", "-fbdir",
             self._folder.name],
            pass_fds=[writer], stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        os.close(writer)
        with os.fdopen(reader) as answer:
            self.display = ":" + answer.readline().strip()
        if self.display == ":":
            raise RuntimeError("Xvfb did not start")
        subprocess.run(["setxkbmap", "-display", self.display, "ro"], check=True)  # letters outside ASCII can be typed

    def __exit__(self, *_):
        self._bash("st_wine_down")
        for process in (self._manager, self._server):
            if process is not None:
                process.terminate()
                process.wait()
        if self._server is not None:
            self._folder.cleanup()

    def _bash(self, command):
        script = (f'source "{SOURCE}/tools/wine_session.sh"; export DISPLAY={self.display}; {command} >/dev/null 2>&1; '
                  "env -0")
        out = subprocess.run(["bash", "-c", script], env={**os.environ, "ST_WINE_ROOT": str(WINE_ROOT)},
                             stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, check=True).stdout
        return dict(entry.split("=", 1) for entry in out.decode().split("\0") if "=" in entry)


def is_possible():
    return all(shutil.which(program) for program in ("Xvfb", "wine", "bash"))
