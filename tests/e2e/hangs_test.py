"""A peer that never answers costs its collector and nothing else: the run goes on, is delivered, and the process ends."""
import json
import os
import time
import unittest
import uuid

import open_package
from support_tool import ON_WINDOWS, PRIVATE_KEY, ProgramTest, read_archive, temporary_folder
from product_test import UNINSTALL, Product, windows

TIMEOUT = 2  # seconds for a collector
GRACE = 5  # that it has then to end by itself


@unittest.skipIf(ON_WINDOWS, "a file that never answers is a Unix pipe here; on Windows take a share that is gone")
class SilentFile(ProgramTest):
    """A product one of whose files opens and is never read to its end."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        product = temporary_folder() / f"st_silent_{uuid.uuid4().hex}"
        product.mkdir()
        os.mkfifo(product / "silent.dll")
        cls.writer = os.open(product / "silent.dll", os.O_RDWR)
        cls.addClassCleanup((product / "silent.dll").unlink)
        cls.addClassCleanup(os.close, cls.writer)
        key = f"{UNINSTALL}\\{{{uuid.uuid4()}}}"
        cls.addClassCleanup(windows, "reg", "delete", key, "/f")
        for name, value in (("Publisher", "Quorvex"), ("InstallLocation", Product.windows_path(product)),
                            ("DisplayName", "Silent"), ("UninstallString", "uninstall.exe")):
            windows("reg", "add", key, "/v", name, "/d", value, "/f")
        cls.stage.settings({"system_summary": True, "product_information": True, "registry": ["HKEY_CURRENT_USER\\Environment"],
                            "collector_timeout": TIMEOUT})
        begin = time.monotonic()
        cls.log = cls.stage.collect("noda")
        cls.seconds = time.monotonic() - begin

    def test_the_process_ends_with_its_run_delivered(self):
        self.assertReturnCode(self.log, 0)
        self.assertInOrder(self.log, "<- NoGui()", "<- wWinMain()")
        self.assertEqual(len(self.stage.packages()), 1)
        self.assertGreater(self.seconds, TIMEOUT + GRACE)
        self.assertLess(self.seconds, TIMEOUT + GRACE + 60)

    def test_the_manifest_tells_what_happened(self):
        plain = self.stage.path("opened.zip")
        plain.write_bytes(open_package.open_package(self.stage.path("collected.zip").read_bytes(), PRIVATE_KEY))
        entries = read_archive(plain)
        collectors = json.loads(entries["collected/collection_manifest.json"])["collectors"]
        self.assertEqual({entry["name"]: entry["outcome"] for entry in collectors},
                         {"system_summary": "data", "product_information": "timed out", "registry": "data"})
        self.assertNotIn("collected/product_information.json", entries)
        silent = collectors[1]
        self.assertEqual(silent["reason"], "it took longer than 2 seconds, does not answer and was left behind")
        self.assertGreaterEqual(silent["milliseconds"], TIMEOUT * 1000)
        self.assertIn("The collector of product_information timed out", self.log)


if __name__ == "__main__":
    unittest.main()
