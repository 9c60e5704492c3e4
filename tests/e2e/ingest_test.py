"""Uploads by hand-written requests to the real receiving server, over HTTPS and over lines that break."""
import hashlib
import pathlib
import random
import ssl
import subprocess
import sys
import tempfile
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1] / "support"))

from certificates import make_certificates  # noqa: E402
from fault_proxy import FaultProxy, Faults  # noqa: E402
from ingest import SERVER, IngestServer, TusClient, metadata_for, wait_until  # noqa: E402

MAX_BYTES = 4 << 20
API_KEY = "a key for tests"
DATA = random.Random(1).randbytes(3 << 20)
BROKEN_LINE = (ConnectionError, TimeoutError, ssl.SSLError)


def upload_id(location):
    return location.rsplit("/", 1)[-1]


class IngestTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.scratch = pathlib.Path(cls.enterClassContext(tempfile.TemporaryDirectory(prefix="st_ingest_")))
        cls.certificates = make_certificates(cls.scratch / "certificates")
        cls.tls = ssl.create_default_context(cafile=cls.certificates / "ca.pem")
        cls.server = cls.enterClassContext(IngestServer(
            cls.scratch / "store", "--max-bytes", str(MAX_BYTES), "--cert", str(cls.certificates / "localhost.pem"),
            "--key", str(cls.certificates / "localhost.key"), api_key=API_KEY))
        cls.client = cls.client_at(cls.server.port)

    @classmethod
    def client_at(cls, port, key=API_KEY, timeout=10, tls=None):
        return TusClient(port, tls or cls.tls, {"X-Api-Key": key} if key else {}, timeout)

    def create(self, data, client=None, **metadata):
        status, location, text = (client or self.client).create(data, metadata_for(data, **metadata))
        self.assertEqual(status, 201, text)
        return location

    def assert_received(self, location, data, server=None):
        server, name = server or self.server, upload_id(location)
        receipt = server.receipts()[name]
        self.assertEqual(server.content(name), data)
        self.assertEqual((receipt["bytes"], receipt["sha256"], receipt["verified"]),
                         (len(data), hashlib.sha256(data).hexdigest(), True))
        self.assertEqual(receipt["metadata"]["filename"], "collected.zip")


class Uploads(IngestTest):
    def test_an_upload_in_chunks_is_kept_with_a_receipt(self):
        location = self.create(DATA)
        self.assertRegex(location, r"^/files/[0-9a-f]{32}$")
        for begin in range(0, len(DATA), 1 << 20):
            self.assertEqual(self.client.offset(location), begin)
            self.assertNotIn(upload_id(location), self.server.receipts())
            status, headers, text = self.client.patch(location, DATA[begin:begin + (1 << 20)], begin)
            self.assertEqual((status, headers["Upload-Offset"]), (204, str(begin + (1 << 20))), text)
        self.assert_received(location, DATA)
        self.assertEqual(self.client.offset(location), len(DATA))

    def test_an_empty_file_is_received_when_it_is_created(self):
        self.assert_received(self.create(b""), b"")

    def test_a_chunk_at_the_wrong_offset_changes_nothing(self):
        location = self.create(DATA)
        self.client.patch(location, DATA[:1000])
        self.assertEqual(self.client.patch(location, DATA)[0], 409)
        self.assertEqual(self.client.offset(location), 1000)

    def test_bytes_with_another_hash_are_removed_and_get_no_receipt(self):
        location = self.create(DATA, sha256="0" * 64)
        status, _, text = self.client.patch(location, DATA)
        self.assertEqual(status, 422)
        self.assertIn("another SHA-256", text)
        self.assertEqual(self.client.offset(location), "status 404")
        self.assertNotIn(upload_id(location), self.server.stored())
        self.assertNotIn(upload_id(location), self.server.receipts())

    def test_what_was_received_is_neither_handed_out_nor_deleted(self):
        location = self.create(b"data")
        self.client.patch(location, b"data")
        self.assertEqual(self.client.request("GET", location)[0], 405)
        self.assertEqual(self.client.request("DELETE", location)[0], 400)
        self.assert_received(location, b"data")

    def test_creations_that_are_refused(self):
        cases = [
            ("another category", {"metadata": metadata_for(DATA, category="photos")}, 403, 'category "kvsetuplogs"'),
            ("no category", {"metadata": metadata_for(DATA, category=None)}, 400, 'lack "category"'),
            ("no sha256", {"metadata": metadata_for(DATA, sha256=None)}, 400, 'lack "sha256"'),
            ("no filename", {"metadata": metadata_for(DATA, filename=None)}, 400, 'lack "filename"'),
            ("no tags", {"metadata": metadata_for(DATA, tags=None)}, 400, 'lack "tags"'),
            ("upper-case sha256", {"metadata": metadata_for(DATA, sha256="A" * 64)}, 400, "lower-case"),
            ("tags that are no JSON", {"metadata": metadata_for(DATA, tags="{")}, 400, "tags"),
            ("metadata that are no base64", {"metadata": "category !"}, 400, "metadata"),
            ("no length", {"Upload-Defer-Length": "1", "Upload-Length": ""}, 400, "upload-length"),
            ("too large", {"Upload-Length": str(MAX_BYTES + 1)}, 413, f"{MAX_BYTES} bytes"),
        ]
        before = self.server.stored()
        for name, arguments, expected, sentence in cases:
            with self.subTest(name):
                status, location, text = self.client.create(DATA, **arguments)
                self.assertEqual((status, location), (expected, None), text)
                self.assertIn(sentence, text)
        with self.subTest("no metadata at all"):
            status, _, text = self.client.request("POST", "/files", {"Upload-Length": "5"})
            self.assertEqual((status, 'lack "category"' in text), (400, True), text)
        self.assertEqual(self.server.stored(), before)

    def test_the_largest_accepted_size_is_accepted(self):
        status, _, text = self.client.create(DATA, **{"Upload-Length": str(MAX_BYTES)})
        self.assertEqual(status, 201, text)

    def test_more_bytes_than_announced_are_refused(self):
        location = self.create(DATA[:1000], sha256="0" * 64)
        self.assertEqual(self.client.patch(location, DATA[:1001])[0], 413)
        self.assertNotIn(upload_id(location), self.server.receipts())

    def test_requests_without_the_key_are_refused(self):
        location = self.create(DATA)
        for key in (None, "another key"):
            stranger = self.client_at(self.server.port, key)
            with self.subTest(key=key):
                self.assertEqual(stranger.create(DATA)[0], 401)
                self.assertEqual(stranger.offset(location), "status 401")
                self.assertEqual(stranger.patch(location, DATA)[0], 401)
        self.assertEqual(self.client.offset(location), 0)

    def test_other_addresses_lead_nowhere(self):
        self.create(DATA)
        state = f"{self.server.stored()[0]}.json"
        for target in ("/", "/elsewhere", f"/files/{'0' * 32}", f"/files/{state}", "/files/..%2Fingest.log"):
            with self.subTest(target):
                self.assertEqual(self.client.request("HEAD", target)[0], 404)


class BrokenLines(IngestTest):
    def setUp(self):
        self.proxy = self.enterContext(FaultProxy(self.server.port))
        self.through_proxy = self.client_at(self.proxy.port, timeout=1)
        self.location = self.create(DATA, self.through_proxy)

    def assert_resumes(self, client):
        """From what arrived, which is some but not all."""
        offset = client.offset(self.location)
        self.assertIsInstance(offset, int)
        self.assertTrue(0 < offset < len(DATA), offset)
        self.assertEqual(client.patch(self.location, DATA[offset:], offset)[0], 204)
        self.assert_received(self.location, DATA)

    def test_an_upload_resumes_after_a_cut(self):
        self.proxy.upstream = Faults(cut_after=len(DATA) // 2)
        with self.assertRaises(BROKEN_LINE):
            self.through_proxy.patch(self.location, DATA)
        self.assert_resumes(self.through_proxy)

    def test_an_upload_resumes_while_its_first_connection_hangs(self):
        self.proxy.upstream = Faults(stall_after=len(DATA) // 2)
        with self.assertRaises(BROKEN_LINE):
            self.through_proxy.patch(self.location, DATA)
        self.assert_resumes(self.client)

    def test_an_upload_resumes_after_bytes_were_garbled(self):
        self.proxy.upstream = Faults(garble_at=len(DATA) // 2)
        with self.assertRaises(BROKEN_LINE):
            self.through_proxy.patch(self.location, DATA)
        self.assert_resumes(self.through_proxy)

    def test_an_upload_whose_last_answer_is_lost_is_received(self):
        before_tls_13 = ssl.create_default_context(cafile=self.certificates / "ca.pem")
        before_tls_13.maximum_version = ssl.TLSVersion.TLSv1_2  # 1.3 answers something right after the handshake
        sender = self.client_at(self.proxy.port, tls=before_tls_13)
        connection = sender.connect()
        self.proxy.downstream = Faults(cut_after=1)
        with self.assertRaises(BROKEN_LINE):
            sender.patch(self.location, DATA, connection=connection)
        self.assertEqual(self.client.offset(self.location), len(DATA))
        self.assert_received(self.location, DATA)


class Restarts(unittest.TestCase):
    def setUp(self):
        self.store = pathlib.Path(self.enterContext(tempfile.TemporaryDirectory(prefix="st_ingest_")))

    def upload(self, server, data, length=None):
        client = TusClient(server.port)
        _, location, _ = client.create(DATA)
        client.patch(location, data)
        return location

    def test_what_an_earlier_process_left_is_settled(self):
        with IngestServer(self.store) as server:
            whole, damaged, begun = (self.upload(server, data) for data in (DATA, DATA, DATA[:1000]))
            server.process.kill()
        for location in (whole, damaged):
            (self.store / "receipts" / f"{upload_id(location)}.json").unlink()
        with open(self.store / "uploads" / upload_id(damaged), "r+b") as file:
            file.write(b"not the first bytes that were sent")

        with IngestServer(self.store) as server:
            self.assertEqual(list(server.receipts()), [upload_id(whole)])
            client = TusClient(server.port)
            self.assertEqual(client.offset(damaged), "status 404")
            self.assertEqual(client.offset(begun), 1000)
            self.assertEqual(client.patch(begun, DATA[1000:], 1000)[0], 204)
            self.assertEqual(len(server.receipts()), 2)

    def test_only_unfinished_uploads_expire(self):
        with IngestServer(self.store, "--unfinished-hours", str(1 / 3600)) as server:
            whole, begun = (self.upload(server, data) for data in (DATA, DATA[:1000]))
            self.assertTrue(wait_until(lambda: upload_id(begun) not in server.stored()))
            self.assertIn(upload_id(whole), server.stored())

    def test_unsound_options_are_refused(self):
        folder = ["--folder", str(self.store)]
        for options in ([], [*folder, "--cert", "x"], [*folder, "--port", "1e9"], [*folder, "--max-bytes", "many"],
                        [*folder, "--unknown"]):
            with self.subTest(options):
                done = subprocess.run(["node", str(SERVER), *options], stdin=subprocess.DEVNULL, capture_output=True,
                                      text=True, timeout=20, check=False)
                self.assertEqual(done.returncode, 2)
                self.assertRegex(done.stderr, r"^ingest: .+\n$")


if __name__ == "__main__":
    unittest.main()
