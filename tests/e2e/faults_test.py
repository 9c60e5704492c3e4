"""The helper servers that other tests rely on do what they promise: break lines, play scripts, present certificates."""
import contextlib
import http.client
import json
import pathlib
import socket
import ssl
import subprocess
import sys
import tempfile
import time
import unittest

SUPPORT = pathlib.Path(__file__).resolve().parents[1] / "support"
sys.path.insert(0, str(SUPPORT))

from certificates import make_certificates  # noqa: E402
from fault_proxy import CUT, SEND, STALL, FaultProxy, Faults, steps  # noqa: E402
from ingest import SERVER, wait_until  # noqa: E402
from loopback_service import HOST, LoopbackService  # noqa: E402
from scripted_http_server import ScriptedServer, ScriptError, tls_context  # noqa: E402


class Echo(LoopbackService):
    async def handle(self, number, reader, writer):
        while data := await reader.read(4096):
            writer.write(data)
            await writer.drain()


def receive(line, length):
    """Up to so many bytes: fewer when the line ends before."""
    data = b""
    while len(data) < length and (more := line.recv(length - len(data))):
        data += more
    return data


class FaultSteps(unittest.TestCase):
    def test_faults_strike_at_their_byte(self):
        data = b"abcdef"
        cases = [
            ("no fault", Faults(), 0, [(SEND, data)]),
            ("cut inside", Faults(cut_after=2), 0, [(SEND, b"ab"), (CUT, None)]),
            ("cut at the end", Faults(cut_after=6), 0, [(SEND, data), (CUT, None)]),
            ("cut in a later chunk", Faults(cut_after=7), 0, [(SEND, data)]),
            ("cut counted from earlier chunks", Faults(cut_after=12), 10, [(SEND, b"ab"), (CUT, None)]),
            ("cut that has struck", Faults(cut_after=2), 2, [(SEND, data)]),
            ("stall goes on behind it", Faults(stall_after=2, stall_seconds=3), 0,
             [(SEND, b"ab"), (STALL, 3), (SEND, b"cdef")]),
            ("stall before a cut", Faults(cut_after=4, stall_after=2), 0,
             [(SEND, b"ab"), (STALL, None), (SEND, b"cd"), (CUT, None)]),
            ("garbled byte", Faults(garble_at=13), 10, [(SEND, b"ab\x9cdef")]),
            ("garbled byte behind a cut", Faults(garble_at=3, cut_after=2), 0, [(SEND, b"ab"), (CUT, None)]),
        ]
        for name, faults, position, expected in cases:
            with self.subTest(name):
                self.assertEqual(steps(faults, position, data), expected)


class FaultyLines(unittest.TestCase):
    def setUp(self):
        echo = self.enterContext(Echo())
        self.proxy = self.enterContext(FaultProxy(echo.port))

    def connect(self):
        return self.enterContext(socket.create_connection((HOST, self.proxy.port), timeout=5))

    def test_bytes_pass_both_ways_until_the_sender_ends(self):
        line = self.connect()
        line.sendall(b"hello")
        line.shutdown(socket.SHUT_WR)
        self.assertEqual(receive(line, 100), b"hello")

    def test_a_cut_lets_exactly_its_bytes_through_and_strikes_once(self):
        self.proxy.downstream = Faults(cut_after=3)
        line = self.connect()
        line.sendall(b"hello")
        self.assertEqual(receive(line, 100), b"hel")
        line = self.connect()
        line.sendall(b"hello")
        self.assertEqual(receive(line, 5), b"hello")

    def test_a_cut_per_connection_strikes_every_time(self):
        self.proxy.downstream = Faults(cut_after=3, per_connection=True)
        for _ in range(2):
            line = self.connect()
            line.sendall(b"hello")
            self.assertEqual(receive(line, 100), b"hel")

    def test_the_sender_sees_a_cut_as_a_reset(self):
        self.proxy.upstream = Faults(cut_after=3)
        line = self.connect()
        line.sendall(b"hello")
        with self.assertRaises(ConnectionResetError):
            receive(line, 100)

    def test_refused_connections_are_counted(self):
        self.proxy.refuse_next = 1
        with self.assertRaises(ConnectionError):
            line = self.connect()
            line.sendall(b"hello")
            if not receive(line, 5):
                raise ConnectionResetError
        line = self.connect()
        line.sendall(b"hello")
        self.assertEqual(receive(line, 5), b"hello")
        self.assertEqual(self.proxy.connections, 2)

    def test_slowness_takes_its_time(self):
        for name, faults in (("stall", Faults(stall_after=2, stall_seconds=0.3)), ("delay", Faults(delay=0.3)),
                             ("drip", Faults(bytes_per_second=15))):
            with self.subTest(name):
                self.proxy.upstream = faults
                line = self.connect()
                begin = time.monotonic()
                line.sendall(b"hello")
                self.assertEqual(receive(line, 5), b"hello")
                self.assertGreater(time.monotonic() - begin, 0.2)


class Scripts(unittest.TestCase):
    def test_requests_get_their_replies_in_order_and_are_recorded(self):
        script = [
            {"status": 301, "headers": {"Location": "$ORIGIN/again"}},
            {"status": 429, "headers": [["Retry-After", "1"], ["Retry-After", "2"]], "repeat": 2},
            {"raw": "HTTP/1.1 204 No Content\r\nUpload-Offset: -5\r\n\r\n"},
        ]
        with tempfile.TemporaryDirectory() as folder, \
                ScriptedServer(script, record=f"{folder}/record.json") as server:
            line = http.client.HTTPConnection("localhost", server.port, timeout=5)
            self.enterContext(contextlib.closing(line))
            seen = []
            for target in ("/first", "/again", "/again", "/last", "/more"):
                line.request("PATCH", target, b"\xffbody" if target == "/first" else None)
                response = line.getresponse()
                response.read()
                headers = response.headers
                seen.append((response.status, headers.get_all("Retry-After"), headers["Upload-Offset"]))
                if target == "/first":
                    self.assertEqual(headers["Location"], f"{server.origin}/again")
            self.assertEqual(seen, [(301, None, None), (429, ["1", "2"], None), (429, ["1", "2"], None),
                                    (204, None, "-5"), (500, None, None)])
            record = json.loads(pathlib.Path(folder, "record.json").read_text(encoding="utf-8"))
            self.assertEqual(record, server.requests)
        self.assertEqual([request["target"] for request in record], ["/first", "/again", "/again", "/last", "/more"])
        self.assertEqual((record[0]["body"], record[0]["body_bytes"], record[0]["whole"]), ("\xffbody", 5, True))

    def test_an_answer_can_come_before_the_body_is_read(self):
        with ScriptedServer([{"status": 413, "after_body_bytes": 10, "then": "close"}]) as server, \
                socket.create_connection((HOST, server.port), timeout=5) as line:
            line.sendall(b"PATCH / HTTP/1.1\r\nContent-Length: 1000\r\n\r\n" + b"x" * 10)
            self.assertTrue(receive(line, 1000).startswith(b"HTTP/1.1 413 "))
            self.assertEqual((server.requests[0]["body_bytes"], server.requests[0]["whole"]), (10, False))

    def test_a_server_can_stay_silent_or_slow_or_break_off(self):
        script = [{"never": True}, {"raw": "HTTP/1.1 200", "bytes_per_second": 40}, {"raw": "HTTP", "then": "reset"}]
        with ScriptedServer(script) as server:
            lines = [self.enterContext(socket.create_connection((HOST, server.port), timeout=0.4)) for _ in script]
            for number, line in enumerate(lines, 1):
                line.sendall(b"HEAD / HTTP/1.1\r\n\r\n")
                self.assertTrue(wait_until(lambda n=number: len(server.requests) == n))
            with self.assertRaises(TimeoutError):
                lines[0].recv(1)
            lines[1].settimeout(5)
            self.assertEqual(receive(lines[1], 12), b"HTTP/1.1 200")
            with self.assertRaises(ConnectionResetError):
                self.assertEqual(receive(lines[2], 4), b"HTTP")
                receive(lines[2], 1)

    def test_a_misspelt_member_is_an_error(self):
        with self.assertRaisesRegex(ScriptError, "reply 2: unknown member stats"):
            ScriptedServer([{}, {"stats": 500}])


class Certificates(unittest.TestCase):
    def test_a_careful_client_accepts_only_the_good_one(self):
        folder = make_certificates(self.enterContext(tempfile.TemporaryDirectory(prefix="st_certificates_")))
        careful = ssl.create_default_context(cafile=folder / "ca.pem")
        for name, complaint in (("localhost", None), ("expired", "expired"), ("other_host", "Hostname mismatch"),
                                ("untrusted", "unable to get local issuer")):
            context = tls_context(folder / f"{name}.pem", folder / f"{name}.key")
            with self.subTest(name), ScriptedServer([{}], context) as server:
                line = self.enterContext(contextlib.closing(
                    http.client.HTTPSConnection("localhost", server.port, timeout=5, context=careful)))
                if complaint:
                    with self.assertRaisesRegex(ssl.SSLCertVerificationError, complaint):
                        line.request("GET", "/")
                else:
                    line.request("GET", "/")
                    self.assertEqual(line.getresponse().status, 200)


class Orphans(unittest.TestCase):
    # Starts a program and ends as soon as that is ready, as a killed test would.
    PARENT = "import subprocess, sys; p = subprocess.Popen(sys.argv[1:], stdout=subprocess.PIPE); " \
             "print(p.pid, p.stdout.readline().decode().strip())"

    @staticmethod
    def runs(pid):
        with contextlib.suppress(OSError):
            return pathlib.Path(f"/proc/{pid}/stat").read_text(encoding="utf-8").rsplit(")", 1)[1].split()[0] != "Z"
        return False

    def test_servers_end_when_their_parent_ends(self):
        folder = self.enterContext(tempfile.TemporaryDirectory(prefix="st_orphans_"))
        script = pathlib.Path(folder, "script.json")
        script.write_text("[]", encoding="utf-8")
        for command in ([sys.executable, SUPPORT / "fault_proxy.py", "--to", "9"],
                        [sys.executable, SUPPORT / "scripted_http_server.py", script, f"{folder}/record.json"],
                        ["node", SERVER, "--folder", folder, "--port", "0", "--end-with-parent"]):
            with self.subTest(pathlib.Path(command[1]).name):
                done = subprocess.run([sys.executable, "-c", self.PARENT, *map(str, command)], check=True, text=True,
                                      timeout=20, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                      stderr=subprocess.DEVNULL)
                pid, *line = done.stdout.split()
                self.assertEqual(line[:2], ["listening", "on"])
                self.assertTrue(wait_until(lambda p=pid: not self.runs(p), 5))

    def test_servers_end_at_their_time_limit(self):
        process = subprocess.Popen([sys.executable, SUPPORT / "fault_proxy.py", "--to", "9", "--time-limit", "0.3"],
                                   stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL)
        try:
            self.assertEqual(process.wait(5), 0)
        finally:
            process.kill()
            process.wait()


if __name__ == "__main__":
    unittest.main()
