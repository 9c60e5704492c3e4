"""A whole collection: what goes out, what is left, and every result that the command line can reach.

Result 2, a cancelled run, needs another thread to set the flag; nothing on the command line does.
"""
import json
import re
import subprocess
import unittest
import uuid

import open_package
from support_tool import (ON_WINDOWS, ONE_COLLECTOR, PRIVATE_KEY, ProgramTest, Stage, read_archive, temporary_folder,
                          windows_path)

KEEP_ALL = ("nodtf", "noda")
# As the log prints it, with the option pp.
DEFAULT_DOCUMENT = ('"output_folder" : "collected"', '"pretty_print" : true', '"processor" : true',
                    '"windows_events" : true')


class Delivery(ProgramTest):
    """One collection with every collector, kept and submitted, then looked at from all sides."""

    stage_name = "S\u00fcd \u6771 stage"

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.install_log = temporary_folder() / f"qxinst.{uuid.uuid4().hex}.log"
        cls.install_log.write_bytes(b"installed")
        cls.addClassCleanup(cls.install_log.unlink, missing_ok=True)
        cls.stage.settings({"all_collectors": True, "pretty_print": True, "registry": ["HKEY_CURRENT_USER\\Environment"]})
        cls.log = cls.stage.collect(*KEEP_ALL)

    def archive(self):
        plain = self.stage.path("opened.zip")
        plain.write_bytes(open_package.open_package(self.stage.path("collected.zip").read_bytes(), PRIVATE_KEY))
        return plain

    def test_the_run_goes_through_its_stages_in_order(self):
        self.assertReturnCode(self.log, 0)
        self.assertInOrder(self.log, "-> wWinMain()", "-> InitQxch()", "-> CheckSingleInstance()", "-> NoGui()",
                           "settingsFile='stsettings.json'", "-> st::CollectData()", "--> COLLECT",
                           "progress scaled percent", "<-- COLLECT", "Step 50/100", "Not deleting archive",
                           "--> COMPRESS", "install_logs folder", "Creating zip archive collected.zip", "<-- COMPRESS",
                           "-> Encrypt", "<- Encrypt", "lie in the outbox", "Step 100/100", "<- st::CollectData()",
                           "Return code 0", "<- NoGui()")

    def test_progress_is_half_of_the_collectors_then_50_then_100(self):
        steps = [int(step) for step in re.findall(r"Step (\d+)/100", self.log)]
        collectors = re.findall(r"progress scaled percent [\d.]+ \[(\d+)/(\d+)\]", self.log)
        self.assertEqual(steps, [int(int(step) / int(all) * 0.5 * 100) for step, all in collectors] + [50, 100])
        self.assertEqual(collectors[-1][0], collectors[-1][1])

    def test_the_outbox_holds_the_very_package(self):
        packages = [p for p in self.stage.packages() if p.read_bytes() == self.stage.path("collected.zip").read_bytes()]
        self.assertEqual(len(packages), 1)

    def test_the_opened_archive_is_whole_and_holds_the_folder(self):
        plain = self.archive()
        subprocess.run(["unzip", "-tq", plain], check=True, capture_output=True)
        entries = read_archive(plain)
        folder = self.stage.path("collected")
        files = {f"collected/{p.relative_to(folder).as_posix()}": p.read_bytes() for p in folder.rglob("*") if p.is_file()}
        self.assertEqual({name: data for name, data in entries.items() if name.startswith("collected/")}, files)
        self.assertIn("collected/system_summary.json", entries)
        self.assertIn("collected/collection_manifest.json", entries)

    def test_installer_logs_are_in_the_archive_under_both_roots(self):
        entries = read_archive(self.archive())
        self.assertEqual(entries[f"install_logs/{self.install_log.name}"], b"installed")
        self.assertEqual(entries[f"collected/install_logs/{self.install_log.name}"], b"installed")

    def test_decrypt_mode_writes_the_same_bytes_as_openssl(self):
        log = self.stage.run("silent", "/d")
        self.assertReturnCode(log, 1)
        self.assertEqual(self.stage.path("collected_decrypted.zip").read_bytes(), self.archive().read_bytes())


class WindowsEvents(ProgramTest):
    """The event logs of this machine, whatever is in them. A Wine session's are empty."""

    RECORD = {"TimeGenerated", "EventType", "SourceName", "Computername", "InsertionStrings"}

    def test_settings_file_gets_both_logs_written(self):
        for pretty in (True, False):
            with self.subTest(pretty=pretty):
                self.stage.settings({"windows_events": True, "pretty_print": pretty})
                log = self.stage.run("silent", "collect", "nocs", *KEEP_ALL)
                self.assertReturnCode(log, 0)
                self.assertInOrder(log, "Collecting data for : ['windows_events']", "Free loaded libraries")
                self.assertNotIn("OpenEventLog failed", log)
                folder = self.stage.path("collected")
                text = (folder / "windows_events.json").read_text("ascii")
                events = json.loads(text)
                self.assertEqual(list(events), ["Application", "System"])
                for record in events["Application"] + events["System"]:
                    self.assertEqual(set(record) - {"message"}, self.RECORD)
                    self.assertRegex(record["TimeGenerated"], r"^\d{1,2}/\d{1,2}/\d{4} \d\d:\d\d:\d\d$")
                if not ON_WINDOWS:
                    self.assertEqual(text, '{\n   "Application" : [],\n   "System" : []\n}\n' if pretty
                                     else '{"Application":[],"System":[]}\n')
                manifest = json.loads((folder / "collection_manifest.json").read_text("utf-8"))
                (entry,) = manifest["collectors"]
                self.assertEqual((entry["name"], entry["class"], entry["outcome"], entry["errors"]),
                                 ("windows_events", "EventLogCollector", "data", []))
                self.assertEqual(entry["records"], len(events["Application"]) + len(events["System"]))
                self.assertEqual(entry["bytes"], len(text))
                self.stage.clear()


class AllCollectors(ProgramTest):
    """Everything that the program can collect of this machine."""

    def test_each_collector_writes_its_file_or_the_manifest_says_why_not(self):
        self.stage.settings({"all_collectors": True})
        log = self.stage.collect("nocs", "nodtf", "noe")
        self.assertReturnCode(log, 0)
        manifest = json.loads(self.stage.path("collected/collection_manifest.json").read_bytes())
        self.assertEqual(len(manifest["collectors"]), 16)
        for entry in manifest["collectors"]:
            with self.subTest(collector=entry["class"]):
                written = self.stage.path(f"collected/{entry['name']}.json").exists()
                self.assertEqual(written, entry["outcome"] == "data", entry)
                self.assertEqual("reason" in entry, not written, entry)


class CleanUp(ProgramTest):
    """What is left of a run, for the four ways to delete, when it succeeds and when the submission fails."""

    WAYS = {("dtf", "da"): [], ("nodtf", "da"): ["collected"], ("dtf", "noda"): ["collected.zip"],
            KEEP_ALL: ["collected", "collected.zip"]}

    def check(self, code, *options):
        for way, left in self.WAYS.items():
            with self.subTest(way=way, code=code):
                log = self.stage.collect(*way, *options)
                self.assertReturnCode(log, code)
                self.assertEqual(self.stage.left(), left)
                self.stage.clear()

    def test_success_leaves_what_was_to_be_kept(self):
        self.check(0, "nocs")

    def test_failed_submission_leaves_the_same(self):
        library = self.stage.path("qxlink.dll")
        elsewhere = library.rename(self.stage.folder.parent / library.name)
        try:
            self.check(4)
        finally:
            elsewhere.rename(library)


class Results(ProgramTest):
    """Every other result, by a real cause."""

    def tearDown(self):
        self.stage.clear()

    def test_0_without_submission_keeps_a_plain_archive_on_demand(self):
        log = self.stage.collect("nocloudSubmit", "noencrypt", "noda", "nocompress")
        self.assertReturnCode(log, 0)
        self.assertIn("cloudSubmission is disabled from command line", log)
        self.assertIn("compressData='false'", log)
        self.assertIn("collected/system_summary.json", read_archive(self.stage.path("collected.zip")))
        self.assertEqual(self.stage.packages(), [])

    def test_1_for_an_output_folder_that_must_not_be_deleted(self):
        self.stage.path("precious").write_text("kept")
        for folder in (".", "..", "", "C:\\", "C:\\windows", windows_path(self.stage.folder)):
            with self.subTest(folder=folder):
                log = self.stage.collect(f"o={folder}", "nocs")
                self.assertIn(f"output folder '{folder}' is refused: ", log)
                self.assertReturnCode(log, 1)
        self.assertEqual(self.stage.left(), ["precious"])

    def test_1_for_an_output_folder_whose_parent_is_absent(self):
        log = self.stage.collect("o=absent\\collected", "nocs")
        self.assertIn("failed to create output folder", log)
        self.assertReturnCode(log, 1)

    def test_1_for_a_file_in_the_output_folders_place(self):
        self.stage.path("collected").write_text("kept")
        log = self.stage.collect("nocs")
        self.assertIn("already exists. doing nothing", log)
        self.assertReturnCode(log, 1)
        self.assertEqual(self.stage.path("collected").read_text(), "kept")

    def test_3_for_an_archive_that_cannot_be_created(self):
        self.stage.path("collected.zip").mkdir()
        log = self.stage.collect("nocs")
        self.assertInOrder(log, "Failed to compress folders", "Deleted folder with collected data",
                           "Failed to delete generated zip file.", "Return code 3")
        self.assertEqual(self.stage.left(), ["collected.zip"])

    def test_an_older_output_folder_is_replaced(self):
        old = self.stage.path("collected")
        (old / "deep").mkdir(parents=True)
        (old / "deep" / "old.txt").write_text("old")
        log = self.stage.collect("nocs", "nodtf", "noda", "noe")
        self.assertReturnCode(log, 0)
        self.assertFalse((old / "deep").exists())
        self.assertNotIn("collected/deep/old.txt", read_archive(self.stage.path("collected.zip")))

    def test_collect_then_decrypt_in_one_run(self):
        log = self.stage.run("nogui", "d", "c", "nocs", "noda")
        self.assertInOrder(log, "Return code 0", "privateKeyFile='privateKey.pem'", "Return code 1")
        self.assertIn("collected/system_summary.json", read_archive(self.stage.path("collected_decrypted.zip")))


class SettingsFile(ProgramTest):
    """The settings file beside the defaults and the command line, whole and broken."""

    def tearDown(self):
        self.stage.settings(ONE_COLLECTOR)
        self.stage.clear()

    def test_without_a_folder_of_its_own_the_default_is_used_with_a_warning(self):
        log = self.stage.collect("nocs", "nodtf")
        self.assertIn("No output folder set in settings file. Setting the default one", log)
        self.assertEqual(self.stage.left(), ["collected"])

    def test_its_folder_counts_unless_the_command_line_names_one(self):
        self.stage.settings(ONE_COLLECTOR | {"output_folder": "von \u6771"})
        for options, folder in (((), "von \u6771"), (("o=gew\u00e4hlt/",), "gew\u00e4hlt")):
            with self.subTest(options=options):
                log = self.stage.collect("nocs", "nodtf", "noda", "noe", *options)
                self.assertReturnCode(log, 0)
                self.assertEqual(self.stage.left(), [folder, f"{folder}.zip"])
                self.assertIn(f"{folder}/system_summary.json", read_archive(self.stage.path(f"{folder}.zip")))
                self.stage.clear()

    def test_broken_files_fall_back_to_the_default_document(self):
        for document in ("", "{", "[1, 2]", "\"text\"", "null", b"\xff\xfe{\0}\0", "[" * 5000):
            with self.subTest(document=document[:20]):
                self.stage.settings(document)
                log = self.stage.collect("nocs", "pp")
                self.assertInOrder(log, *DEFAULT_DOCUMENT, "Return code 0")

    def test_absent_file_falls_back_to_the_default_document(self):
        log = self.stage.collect("nocs", "pp", "s=absent.json")
        self.assertInOrder(log, "No config file with name absent.json found", *DEFAULT_DOCUMENT, "Return code 0")

    def test_an_output_folder_that_is_no_usable_text_is_result_1(self):
        for value in (5, None, ["collected"], {}, True, "", "C:\\Windows\0x", "a\0b", "a?b", "con\\x|"):
            with self.subTest(value=value):
                self.stage.settings(ONE_COLLECTOR | {"output_folder": value})
                self.assertReturnCode(self.stage.collect("nocs"), 1)
        self.assertEqual(self.stage.left(), [])


if __name__ == "__main__":
    unittest.main()
