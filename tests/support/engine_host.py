"""Runs the program engine_host.exe (tests/children) and talks with it line by line."""
import pathlib
import queue
import subprocess
import threading
import time

TIMEOUT = 30  # seconds that any single line may take


def windows_path(path):
    return "Z:" + str(path).replace("/", "\\")


class EngineHost:
    def __init__(self, session, bin_folder, page, *arguments):
        bin_folder = pathlib.Path(bin_folder)
        self.started = time.monotonic()
        self.process = subprocess.Popen(
            ["wine", str(bin_folder / "engine_host.exe"), windows_path(bin_folder / "sciter.dll"), page, *arguments],
            env=session.environment, stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL)
        self.lines = []  # all that were read
        self._queue = queue.Queue()
        threading.Thread(target=self._read, daemon=True).start()

    def _read(self):
        for line in self.process.stdout:
            self._queue.put(line.decode(errors="replace").strip())
        self._queue.put(None)

    def wait_for(self, start, timeout=TIMEOUT):
        """The rest of the next line that begins with `start`; lines before it are passed over."""
        deadline = time.monotonic() + timeout
        while True:
            try:
                line = self._queue.get(timeout=max(0, deadline - time.monotonic()))
            except queue.Empty:
                line = None
            if line is None:
                raise AssertionError(f"no line '{start}' came; there were: {self.lines[-20:]}")
            self.lines.append(line)
            if line.startswith(start):
                return line[len(start):].strip()

    def send(self, command):
        self.process.stdin.write(command.encode() + b"\n")
        self.process.stdin.flush()

    def ask(self, command, answer, timeout=TIMEOUT):
        self.send(command)
        return self.wait_for(answer, timeout)

    def wait(self, timeout=TIMEOUT):
        self.process.wait(timeout)
        try:
            while True:
                line = self._queue.get(timeout=2)
                if line is None:
                    break
                self.lines.append(line)
        except queue.Empty:
            pass
        return self.process.returncode

    def __enter__(self):
        return self

    def __exit__(self, *_):
        if self.process.poll() is None:
            try:
                self.send("close")
                self.wait(10)
            except (OSError, subprocess.TimeoutExpired):
                self.process.kill()
                self.process.wait()
        self.process.stdin.close()
        self.process.stdout.close()
