"""The program killed at any moment: every file under a final name is whole, and the next run is an ordinary one."""
import json
import time
import unittest

import open_package
from support_tool import PRIVATE_KEY, TIMEOUT, ProgramTest, bulky_installer_log, read_archive, wait_until

# (stage, what the log says when it has begun)
STAGES = (("COLLECT", "--> COLLECT"), ("COMPRESS", "Creating zip archive"), ("ENCRYPT", "-> Encrypt"),
          ("SUBMIT", "<- Encrypt"))
SWEEP_RUNS = 10


class Kill(ProgramTest):
    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.stage.settings({"all_collectors": True})
        # A kill can fall into the middle of packing, encrypting and submitting.
        cls.enterClassContext(bulky_installer_log(12))

    def run_and_kill(self, moment):
        """Starts a run, kills it when `moment(log of this run)` is true; false when it ended before."""
        before = self.stage.mark()
        process = self.stage.start("nogui", "c", "noda", "nodtf")
        try:
            wait_until(lambda: process.poll() is not None or moment(self.stage.log(before)))
            killed = process.poll() is None
        finally:
            process.kill()
            process.wait(TIMEOUT)
        return killed

    def check_everything_under_a_final_name(self):
        for document in self.stage.path("collected").glob("*.json"):
            json.loads(document.read_bytes())
        archive = self.stage.path("collected.zip")
        if archive.exists():
            self.check_package_or_archive(archive)
        for package in self.stage.packages():
            self.check_package(package)
        for description in self.stage.outbox.glob("*.json"):
            json.loads(description.read_bytes())

    def check_package_or_archive(self, path):
        if path.read_bytes()[:4] == b"PK\3\4":
            read_archive(path)
        else:
            self.check_package(path)

    def check_package(self, path):
        plain = self.stage.path("opened.zip")
        plain.write_bytes(open_package.open_package(path.read_bytes(), PRIVATE_KEY))
        read_archive(plain)
        plain.unlink()

    def test_in_every_stage_nothing_half_written_stands_under_a_final_name(self):
        for stage, text in STAGES:
            for delay in (0, 0.02):
                with self.subTest(stage=stage, delay=delay):
                    # On a busy machine a quick stage may be over before its line is seen.
                    for _ in range(1 if delay else 5):
                        killed = self.run_and_kill(lambda log, text=text, delay=delay: text in log and not time.sleep(delay))
                        self.check_everything_under_a_final_name()
                        if killed:
                            break
                    self.assertTrue(killed or delay, f"the run ended before it could be killed in {stage}")

    def test_at_any_time_nothing_half_written_stands_under_a_final_name(self):
        start = time.monotonic()
        self.assertReturnCode(self.stage.collect("noda", "nodtf"), 0)
        whole = time.monotonic() - start
        for run in range(SWEEP_RUNS):
            deadline = time.monotonic() + whole * (run + 1) / (SWEEP_RUNS + 1)
            with self.subTest(run=run):
                self.run_and_kill(lambda _, deadline=deadline: time.monotonic() >= deadline)
                self.check_everything_under_a_final_name()
        self.assertReturnCode(self.stage.collect(), 0)
        self.assertEqual([name for name in self.stage.left() if not name.endswith(".partial")], [])


if __name__ == "__main__":
    unittest.main()
