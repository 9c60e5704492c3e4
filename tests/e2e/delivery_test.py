#!/usr/bin/env python3
"""Uploads through qxlink.dll: to the real tus server over a line that breaks in every way, and to a server that answers
what no real one does."""
import base64
import hashlib
import json
import pathlib
import random
import socket
import sys
import tempfile
import threading
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))

from certificates import make_certificates  # noqa: E402
from fault_proxy import FaultProxy, Faults  # noqa: E402
from ingest import IngestServer  # noqa: E402
from scripted_http_server import ScriptedServer, tls_context  # noqa: E402
from support_tool import ProgramTest, windows_path  # noqa: E402
from upload_stage import SECRET, UploadStage  # noqa: E402

OK, FILE_UNREADABLE, OPTION_REFUSED, CANCELLED = 0, 7, 6, 9
CONFIGURATION_INVALID = 4
NO_CONNECTION, NO_SECURE_CHANNEL, TIMED_OUT, REFUSED, FAILED = 1001, 1002, 1003, 1004, 1005


def random_bytes(count):
    return random.Random(count).randbytes(count)


class UploadTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.stage = UploadStage()
        cls.addClassCleanup(cls.stage.close)
        cls.certificates = make_certificates(cls.stage.folder / "certificates")

    def tls(self, name="localhost"):
        return tls_context(self.certificates / f"{name}.pem", self.certificates / f"{name}.key")


# --- a server that says what it is told to

CAPABLE = {"status": 204, "headers": {"Tus-Resumable": "1.0.0", "Tus-Version": "1.0.0", "Tus-Extension": "creation"}}
CREATED = {"status": 201, "headers": {"Location": "/files/one"}}
DATA = random_bytes(100_000)
SIZE = len(DATA)


def took(offset):
    return {"status": 204, "headers": {"Upload-Offset": str(offset)}}


def has(offset):
    return {"status": 200, "headers": {"Upload-Offset": str(offset), "Upload-Length": str(SIZE)}}


def capable(**headers):
    return {"status": 204, "headers": {**CAPABLE["headers"], **{k.replace("_", "-"): v for k, v in headers.items()}}}


def created_at(location):
    return {"status": 201, "headers": {"Location": location}}


CAPABLE_TOO_SMALL = capable(Tus_Max_Size="99999")

# (what the server does, script, result, methods of the requests, what the log says)
REPLIES = [
    ("all is well", [CAPABLE, CREATED, took(SIZE)], OK, "OPTIONS POST PATCH", "100000 bytes are with the service"),
    ("it does not know OPTIONS", [{"status": 405}, CREATED, took(SIZE)], OK, "OPTIONS POST PATCH", "1 attempts"),
    ("it wants the key for OPTIONS", [{"status": 401}, CAPABLE_TOO_SMALL], REFUSED, "OPTIONS OPTIONS", "at most 99999"),
    ("it redirects for ever", [{"status": 301, "headers": {"Location": "$ORIGIN/files"}, "repeat": 9}], FAILED,
     "OPTIONS POST", "redirections are not followed"),
    ("400 with a reason", [CAPABLE, {"status": 400, "body": "no such tag\r\nX"}], REFUSED, "OPTIONS POST", "no such tag..X"),
    ("400 without one", [CAPABLE, {"status": 400}], REFUSED, "OPTIONS POST", 'check "endpoint"'),
    ("401, and repeats the key", [CAPABLE, {"status": 401, "body": f"bad key {SECRET}"}], REFUSED, "OPTIONS POST",
     "(not shown)"),
    ("404 for the endpoint", [CAPABLE, {"status": 404}], REFUSED, "OPTIONS POST", 'check "endpoint"'),
    ("413", [CAPABLE, {"status": 413, "body": "at most 5 MB"}], REFUSED, "OPTIONS POST", "at most 5 MB"),
    ("it says its limit before", [CAPABLE_TOO_SMALL], REFUSED, "OPTIONS", "the service takes at most 99999"),
    ("the upload is gone once", [CAPABLE, CREATED, {"status": 404}, CREATED, took(SIZE)], OK,
     "OPTIONS POST PATCH POST PATCH", "begins anew"),
    ("the upload is gone twice", [CAPABLE, CREATED, {"status": 410}, CREATED, {"status": 404}], REFUSED,
     "OPTIONS POST PATCH POST PATCH", "no longer knows the upload"),
    ("gone when asked", [CAPABLE, CREATED, {"status": 500}, {"status": 410}, CREATED, took(SIZE)], OK,
     "OPTIONS POST PATCH HEAD POST PATCH", "begins anew"),
    ("another hash arrived", [CAPABLE, CREATED, {"status": 422}, CREATED, took(SIZE)], OK,
     "OPTIONS POST PATCH POST PATCH", "not what was promised"),
    ("another offset", [CAPABLE, CREATED, {"status": 409}, has(60_000), took(SIZE)], OK,
     "OPTIONS POST PATCH HEAD PATCH", "goes on at 60000 of 100000"),
    ("too many requests", [CAPABLE, {"status": 429, "headers": {"Retry-After": "1"}}, CREATED, took(SIZE)], OK,
     "OPTIONS POST POST PATCH", "asked too often"),
    ("locked for a while", [CAPABLE, CREATED, {"status": 423}, has(0), took(SIZE)], OK, "OPTIONS POST PATCH HEAD PATCH",
     "2 attempts"),
    ("out of order for ever", [CAPABLE, {"status": 503, "repeat": 9}], FAILED, "OPTIONS POST POST POST POST",
     "given up after 4 attempts"),
    ("it takes the bytes piecemeal", [CAPABLE, CREATED, took(1), took(99_999), took(SIZE)], OK,
     "OPTIONS POST PATCH PATCH PATCH", "1 attempts"),
    ("it takes nothing", [CAPABLE, CREATED, took(0), has(0), took(0), has(0), took(0), has(0), took(0)], FAILED, None,
     "takes no bytes"),
    ("offset beyond the file", [CAPABLE, CREATED, took(SIZE + 1)], FAILED, "OPTIONS POST PATCH", "what cannot be"),
    ("negative offset", [CAPABLE, CREATED, {"status": 500}, has(-5)], FAILED, "OPTIONS POST PATCH HEAD", "what cannot be"),
    ("offset that is no number", [CAPABLE, CREATED, took("all")], FAILED, "OPTIONS POST PATCH", "what cannot be"),
    ("two offsets", [CAPABLE, CREATED, {"status": 204, "headers": [["Upload-Offset", "100000"], ["Upload-Offset", "5"]]}],
     FAILED, "OPTIONS POST PATCH", "what cannot be"),
    ("no offset", [CAPABLE, CREATED, {"status": 204}], FAILED, "OPTIONS POST PATCH", "does not say how much"),
    ("it is no tus server", [{"status": 200}, {"status": 200, "body": "<html>"}], FAILED, "OPTIONS POST",
     "no tus 1.0 service"),
    ("no Location", [CAPABLE, {"status": 201}], FAILED, "OPTIONS POST", "names no place"),
    ("Location elsewhere", [CAPABLE, created_at("http://elsewhere.invalid/files/one")], FAILED, "OPTIONS POST",
     "another host; nothing was sent"),
    ("Location with another scheme", [CAPABLE, created_at("ftp://localhost/one")], FAILED, "OPTIONS POST", "another host"),
    ("full Location", [CAPABLE, created_at("$ORIGIN/there?x=1"), took(SIZE)], OK, "OPTIONS POST PATCH", "1 attempts"),
    ("relative Location", [CAPABLE, created_at("one"), took(SIZE)], OK, "OPTIONS POST PATCH", "1 attempts"),
    ("the answer is no HTTP", [CAPABLE, {"raw": "220 smtp ready\r\n\r\n", "then": "close", "repeat": 9}], NO_CONNECTION,
     None, "given up after 4 attempts"),
    ("the answer breaks off once", [CAPABLE, CREATED, {"raw": "HTTP/1.1 2", "then": "reset"}, has(SIZE)], OK,
     "OPTIONS POST PATCH HEAD", "2 attempts"),
    ("it answers early and hangs up", [CAPABLE, CREATED, {"status": 500, "after_body_bytes": 10, "then": "reset"}, has(0),
                                       took(SIZE), took(SIZE)], OK, None, "0 bytes resumed"),
]


class Replies(UploadTest):
    def run_script(self, script, *options, data=DATA, tls=None, **members):
        with ScriptedServer(script, tls) as server:
            self.stage.configure(f"{server.origin}/files", **members)
            begin = time.monotonic()
            upload = self.stage.upload(data, *options)
            return upload, server.requests, time.monotonic() - begin

    def test_every_answer_has_its_consequence(self):
        for what, script, result, methods, line in REPLIES:
            with self.subTest(what):
                upload, requests, _ = self.run_script(script)
                self.assertEqual(upload.result, result, upload.log)
                self.assertIn(line, upload.log)
                if methods is not None:
                    self.assertEqual(" ".join(request["method"] for request in requests), methods)
                self.assertEqual(upload.sent == SIZE, result == OK)
                if result != OK:
                    self.assertIn(" ERROR ", upload.log)

    def test_requests_are_as_the_protocol_wants_them(self):
        _, requests, _ = self.run_script([CAPABLE, CREATED, took(60_000), took(SIZE)], chunk_size=60_000)
        headers = [{name.lower(): value for name, value in request["headers"]} for request in requests]
        self.assertEqual([fields["tus-resumable"] for fields in headers], ["1.0.0"] * 4)
        self.assertEqual([fields.get("x-api-key") for fields in headers], [None, SECRET, SECRET, SECRET])
        self.assertEqual(headers[1]["upload-length"], str(SIZE))
        entries = dict(entry.split(" ") for entry in headers[1]["upload-metadata"].split(","))
        self.assertEqual({name: base64.b64decode(value).decode() for name, value in entries.items()},
                         {"filename": "collected.zip", "category": "kvsetuplogs",
                          "tags": '{"tags":["Quorvex Guard Basic","support_tool"]}',
                          "sha256": hashlib.sha256(DATA).hexdigest()})
        self.assertEqual([(fields["upload-offset"], fields["content-type"]) for fields in headers[2:]],
                         [("0", "application/offset+octet-stream"), ("60000", "application/offset+octet-stream")])
        self.assertEqual([request["body_sha256"] for request in requests[2:]],
                         [hashlib.sha256(DATA[:60_000]).hexdigest(), hashlib.sha256(DATA[60_000:]).hexdigest()])
        self.assertEqual([request["target"] for request in requests], ["/files", "/files", "/files/one", "/files/one"])

    def test_chunks_carry_checksums_when_the_server_offers_them(self):
        for offered, name in (("md5,sha1", "sha1"), ("sha1,sha256", "sha256"), ("md5", None)):
            script = [capable(Tus_Extension="creation,checksum", Tus_Checksum_Algorithm=offered), CREATED, took(50_000),
                      {"status": 460}, has(50_000), took(SIZE)]
            with self.subTest(offered):
                upload, requests, _ = self.run_script(script, chunk_size=50_000)
                self.assertEqual(upload.result, OK, upload.log)
                for request, part in ((requests[2], DATA[:50_000]), (requests[5], DATA[50_000:])):
                    fields = {key.lower(): value for key, value in request["headers"]}
                    expected = name and f"{name} {base64.b64encode(hashlib.new(name, part).digest()).decode()}"
                    self.assertEqual(fields.get("upload-checksum"), expected)

    def test_waits_have_limits(self):
        limits = {"connect": 1, "send": 1, "receive": 0.5, "upload": 20}
        short = {"connect": 1, "send": 1, "receive": 20, "upload": 1.5}
        rows = [
            ("silent", [CAPABLE, {"never": True, "repeat": 9}], {"timeouts": limits, "retries": 1}, 3),
            ("a byte a second", [CAPABLE, {**CREATED, "bytes_per_second": 1, "repeat": 9}],
             {"timeouts": limits, "retries": 1}, 4),
            ("silent, all time is over", [CAPABLE, {"never": True, "repeat": 9}], {"timeouts": short}, 3),
            ("busy, all time is over", [CAPABLE, {"status": 503, "repeat": 999}], {"timeouts": short, "retries": 999}, 3),
            ("asks for more time than there is", [CAPABLE, {"status": 503, "headers": {"Retry-After": "86400"}}],
             {"timeouts": short}, 2),
        ]
        for what, script, members, seconds in rows:
            with self.subTest(what):
                upload, _, lasted = self.run_script(script, **members)
                self.assertIn(upload.result, (TIMED_OUT, FAILED))
                self.assertIn("given up", upload.log)
                self.assertLess(lasted, seconds + 1)

    def test_a_pause_that_the_server_asks_for_is_kept(self):
        for retry_after, least in (("1", 1), ("$IN3", 1.5)):
            script = [CAPABLE, {"status": 503, "headers": {"Retry-After": retry_after}}, CREATED, took(SIZE)]
            with self.subTest(retry_after):
                upload, requests, _ = self.run_script(script)
                self.assertEqual(upload.result, OK)
                self.assertGreaterEqual(requests[2]["seconds"] - requests[1]["seconds"], least)

    def test_certificates_are_verified_before_anything_is_said(self):
        rows = [("localhost", "ca.pem", OK), ("localhost", "ca.der", OK), ("localhost", "other_ca.pem", NO_SECURE_CHANNEL),
                ("expired", "ca.pem", NO_SECURE_CHANNEL), ("other_host", "ca.pem", NO_SECURE_CHANNEL),
                ("untrusted", "ca.pem", NO_SECURE_CHANNEL), ("localhost", "", NO_SECURE_CHANNEL),
                ("localhost", "ca.key", CONFIGURATION_INVALID), ("localhost", "missing.pem", CONFIGURATION_INVALID)]
        for certificate, authority, result in rows:
            with self.subTest(certificate=certificate, authority=authority):
                ca_file = f"certificates\\{authority}" if authority else ""
                upload, requests, _ = self.run_script([CAPABLE, CREATED, took(SIZE)], tls=self.tls(certificate),
                                                      ca_file=ca_file)
                self.assertEqual(upload.result, result, upload.log)
                said = [request for request in requests if request["method"] != "OPTIONS" or SECRET in str(request)]
                self.assertEqual(len(said), 2 if result == OK else 0)
                if result != OK:
                    self.assertIn(" ERROR ", upload.log)

    def test_plain_http_only_with_permission(self):
        with ScriptedServer([CAPABLE, CREATED, took(SIZE)]) as server:
            for allowed, option, result, requests in ((False, OPTION_REFUSED, NO_SECURE_CHANNEL, 0), (True, OK, OK, 3)):
                with self.subTest(allowed=allowed):
                    self.stage.configure(f"https://localhost:{server.port}/files", allow_plain_http=allowed,
                                         timeouts={"connect": 1})
                    upload = self.stage.upload(DATA, "fallback")
                    self.assertIn(f"option={option}\n", upload.output)
                    self.assertEqual((upload.result, len(server.requests)), (result, requests), upload.log)

    def test_a_server_that_is_not_there(self):
        with socket.create_server(("127.0.0.1", 0)) as taken:
            port = taken.getsockname()[1]
        for endpoint in (f"https://localhost:{port}/files", "https://nothing-here.invalid/files"):
            with self.subTest(endpoint):
                self.stage.configure(endpoint, retries=1)
                upload = self.stage.upload(DATA)
                self.assertEqual(upload.result, NO_CONNECTION)
                self.assertIn("check the network", upload.log)

    def test_a_named_proxy_is_used(self):
        with ScriptedServer([CAPABLE, CREATED, took(SIZE)]) as proxy:
            self.stage.configure("http://service.invalid/files", proxy=f"localhost:{proxy.port}")
            upload = self.stage.upload(DATA)
            self.assertEqual(upload.result, OK, upload.log)
            self.assertEqual(proxy.requests[2]["target"].replace(":80/", "/"), "http://service.invalid/files/one")

    def test_every_form_of_the_call(self):
        rows = [((), OK, None), (("memory",), OK, None), (("async",), OK, "done=0 status=204 location=http://localhost:"),
                (("memory", "async"), OK, "done=0 status=204"), (("cancel=50000",), CANCELLED, None),
                (("async", "cancel=1"), CANCELLED, "done=9")]
        for options, result, line in rows:
            with self.subTest(options):
                # The progress function is called ten times a second.
                script = [CAPABLE, CREATED, {**took(40_000), "delay": 0.12}, {**took(60_000), "delay": 0.12}, took(SIZE)]
                upload, requests, _ = self.run_script(script, *options, chunk_size=40_000)
                self.assertEqual(upload.result, result, upload.log)
                self.assertIn(line or "", upload.output)
                if result == OK:
                    self.assertEqual(requests[4]["body_sha256"], hashlib.sha256(DATA[60_000:]).hexdigest())

    def test_the_end_of_a_context_cancels_what_waits(self):
        for reply in ({"never": True}, {"status": 503, "headers": {"Retry-After": "20"}}):
            with self.subTest(reply):
                upload, _, lasted = self.run_script([CAPABLE, reply], "async", "end=300")
                self.assertEqual((upload.result, upload.output.count("done=9")), (CANCELLED, 1))
                self.assertLess(lasted, 4)

    def test_messages_are_asked_and_answered(self):
        for reply, result, answer in (({"body": '{"a":2}'}, OK, 'answer=200 {"a":2}\n'), ({"status": 404}, REFUSED, ""),
                                      ({"status": 500}, FAILED, "")):
            with self.subTest(reply), ScriptedServer([reply]) as server:
                self.stage.configure("", messages=f"{server.origin}/tell", allow_plain_http=True)
                upload = self.stage.upload(b"", "ask")
                self.assertEqual(upload.result, result, upload.log)
                self.assertIn(answer, upload.output)
                fields = dict(server.requests[0]["headers"])
                self.assertEqual((server.requests[0]["method"], fields["X-Topic"], fields["Content-Type"],
                                  server.requests[0]["body"]), ("POST", "status", "application/json", '{"q":1}'))

    def test_an_empty_file_is_an_upload_too(self):
        script = [CAPABLE, CREATED, {"status": 200, "headers": {"Upload-Offset": "0", "Upload-Length": "0"}}]
        upload, requests, _ = self.run_script(script, data=b"")
        self.assertEqual((upload.result, len(requests)), (OK, 3), upload.log)


# --- the real server behind a line that breaks

class Line(UploadTest):
    DATA = random_bytes(3_000_000)

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.server = cls.enterClassContext(IngestServer(cls.stage.folder / "plain", api_key=SECRET))
        cls.proxy = cls.enterClassContext(FaultProxy(cls.server.port))
        certificates = cls.certificates
        cls.tls_server = cls.enterClassContext(IngestServer(
            cls.stage.folder / "tls", "--cert", str(certificates / "localhost.pem"), "--key",
            str(certificates / "localhost.key"), api_key=SECRET))
        cls.tls_proxy = cls.enterClassContext(FaultProxy(cls.tls_server.port))

    def setUp(self):
        for proxy in (self.proxy, self.tls_proxy):
            proxy.upstream = proxy.downstream = Faults()

    def send(self, upstream=Faults(), downstream=Faults(), tls=False, data=None, **members):
        """Returns the upload and the receipts that it made."""
        proxy, server = (self.tls_proxy, self.tls_server) if tls else (self.proxy, self.server)
        scheme = "https" if tls else "http"
        self.stage.configure(f"{scheme}://localhost:{proxy.port}/files", ca_file="certificates\\ca.pem",
                             **{"chunk_size": 1_000_000, "retries": 8, **members})
        before = server.receipts().keys()
        proxy.upstream, proxy.downstream = upstream, downstream
        upload = self.stage.upload(self.DATA if data is None else data)
        receipts = [receipt for name, receipt in server.receipts().items() if name not in before]
        return upload, receipts

    def assertArrived(self, upload, receipts, data=None):
        self.assertEqual(upload.result, OK, upload.log)
        self.assertEqual([receipt["sha256"] for receipt in receipts],
                         [hashlib.sha256(self.DATA if data is None else data).hexdigest()])

    def test_every_place_where_the_line_can_break(self):
        upload, receipts = self.send()
        self.assertArrived(upload, receipts)
        whole = self.proxy.forwarded("upstream")
        answers = self.proxy.forwarded("downstream")
        for position in (1, 100, 600, 700_000, 1_500_000, 2_900_000, whole):
            with self.subTest(upstream=position):
                upload, receipts = self.send(Faults(cut_after=position))
                self.assertArrived(upload, receipts)
                self.assertIn("2 attempts", upload.log)
        for position in (1, answers // 2, answers - 1):
            with self.subTest(downstream=position):
                self.assertArrived(*self.send(downstream=Faults(cut_after=position)))

    def test_tls_lines_that_break(self):
        for faults in (Faults(cut_after=20), Faults(cut_after=1_500_000), Faults(garble_at=1_600_000)):
            with self.subTest(faults):
                upload, receipts = self.send(faults, tls=True)
                self.assertArrived(upload, receipts)
        self.assertIn("bytes resumed", upload.log)
        self.assertRegex(upload.log, r"[1-9]\d+ bytes resumed")

    def test_a_line_that_breaks_again_and_again_brings_all_in_the_end(self):
        upload, receipts = self.send(Faults(cut_after=400_000, per_connection=True), retries=2)
        self.assertArrived(upload, receipts)

    def test_a_line_that_goes_silent(self):
        upload, receipts = self.send(Faults(stall_after=1_500_000), timeouts={"connect": 5, "send": 1, "receive": 3, "upload": 30})
        self.assertArrived(upload, receipts)

    def test_bytes_that_change_on_the_way_are_sent_again(self):
        upload, receipts = self.send(Faults(garble_at=2_000_000))
        self.assertArrived(upload, receipts)
        self.assertIn("begins anew", upload.log)

    def test_a_file_that_shrinks_is_no_success(self):
        timer = threading.Timer(1.5, lambda: self.stage.file.write_bytes(b"short"))
        timer.start()
        upload, receipts = self.send(Faults(bytes_per_second=6_000_000), data=random_bytes(30_000_000), chunk_size=1 << 30)
        timer.join()
        self.assertEqual((upload.result, receipts), (FILE_UNREADABLE, []), upload.log)
        self.assertIn("it changed or vanished", upload.log)

    def test_a_file_that_changes_is_sent_as_it_is_in_the_end(self):
        changed = bytes(reversed(self.DATA))

        def change():
            with open(self.stage.file, "r+b") as file:
                file.write(changed)

        timer = threading.Timer(1.5, change)
        timer.start()
        upload, receipts = self.send(Faults(bytes_per_second=1_000_000))
        timer.join()
        self.assertArrived(upload, receipts, changed)
        self.assertIn("begins anew", upload.log)

    def test_a_wrong_key_is_refused_at_once(self):
        upload, receipts = self.send(headers={"X-Api-Key": "wrong"})
        self.assertEqual((upload.result, receipts), (REFUSED, []))
        self.assertIn('check the key in "headers"', upload.log)

    def test_progress_is_logged_every_few_seconds(self):
        upload, receipts = self.send(Faults(bytes_per_second=450_000), chunk_size=250_000)
        self.assertArrived(upload, receipts)
        self.assertRegex(upload.log, r"\d+ of 3000000 bytes are sent \(\d+ %\)")
        self.assertRegex(upload.log, r"3000000 bytes are with the service after \d+ ms: \d+ KiB/s, 1 attempts, 0 bytes")


# --- the whole program

class Program(ProgramTest):
    def configure(self, endpoint, **members):
        document = {"endpoint": endpoint, "outbox": windows_path(self.stage.outbox), "proxy": "none", "retries": 0,
                    "allow_plain_http": True, "timeouts": {"connect": 1}, "retry_delay": 0.02, **members}
        self.stage.path("qxlink.json").write_text(json.dumps(document), encoding="utf-8")

    def test_what_could_not_be_sent_is_kept_and_sent_first_by_the_next_run(self):
        folder = self.enterContext(tempfile.TemporaryDirectory(prefix="st_delivery_"))
        with socket.create_server(("127.0.0.1", 0)) as taken:
            port = taken.getsockname()[1]
        self.configure(f"https://localhost:{port}/files", keep_in_outbox_on_failure=True)
        log = self.stage.collect()
        self.assertReturnCode(log, 4)
        self.assertIn("it waits in the outbox for the next run", log)
        kept = self.stage.packages()
        self.assertEqual(len(kept), 1)
        first = hashlib.sha256(kept[0].read_bytes()).hexdigest()

        with IngestServer(folder) as server:
            self.configure(server.url.replace("127.0.0.1", "localhost"), keep_in_outbox_on_failure=True)
            log = self.stage.collect()
            self.assertReturnCode(log, 0)
            self.assertInOrder(log, "sending what waits in the outbox", "are with the service", "are with the service")
            receipts = sorted(server.receipts().values(), key=lambda receipt: receipt["received"])
        self.assertEqual(len(receipts), 2)
        self.assertEqual(receipts[0]["sha256"], first)
        self.assertEqual({receipt["metadata"]["filename"] for receipt in receipts}, {"collected.zip"})
        self.assertEqual(list(self.stage.outbox.iterdir()), [])

    def test_without_that_option_nothing_is_kept(self):
        with socket.create_server(("127.0.0.1", 0)) as taken:
            port = taken.getsockname()[1]
        self.configure(f"https://localhost:{port}/files")
        before = self.stage.packages()
        log = self.stage.collect()
        self.assertReturnCode(log, 4)
        self.assertInOrder(log, "qxskylane error uploading file", "submission to tessaro failed")
        self.assertEqual(self.stage.packages(), before)

    def test_the_fallback_to_plain_http_keeps_and_sends_one_package(self):
        with ScriptedServer([{"status": 503, "repeat": 99}]) as server:
            self.configure(f"https://localhost:{server.port}/files", keep_in_outbox_on_failure=True)
            before = self.stage.packages()
            log = self.stage.collect()
            self.assertReturnCode(log, 4)
            self.assertIn("Error [1002], falling back to plain http, setopt ret [0]", log)
            kept = [path for path in self.stage.packages() if path not in before]
        self.assertEqual(len(kept), 1)
        for path in (*kept, *(pathlib.Path(f"{p}.json") for p in kept)):
            path.unlink()


if __name__ == "__main__":
    unittest.main()
