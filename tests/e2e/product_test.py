"""A machine with the product installed: every fact of it is collected, and all its folders are packed.

The settings that ship are tried here too.

The product is staged: a folder with programs, libraries, settings and a scan cache, data folders, and an entry in the
list of programs to uninstall. Writing that entry takes an administrator on Windows.
"""
import contextlib
import hashlib
import json
import os
import pathlib
import re
import shutil
import struct
import subprocess
import unittest
import uuid

import open_package
from support_tool import (BIN, ENVIRONMENT, LAUNCHER, ON_WINDOWS, PRIVATE_KEY, SOURCE, ProgramTest, read_archive,
                          temporary_folder)

UNINSTALL = "HKLM\\Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall"
STARTUP_KEY = f"HKEY_CURRENT_USER\\Software\\st_e2e_{uuid.uuid4().hex}"
# One record of the scan cache; the fields in their order, 72 bytes.
RECORD = struct.Struct("<QIIIHHIIQQHHIIIBBHI")
RECORDS_OFFSET, COUNT_OFFSET = 0x70000, 0x23894


def windows(*command):
    """Runs a command of the system; its output."""
    return subprocess.run([*LAUNCHER, *command], env=ENVIRONMENT, stdin=subprocess.DEVNULL, capture_output=True,
                          check=True).stdout.decode(errors="replace")


def common_data_folder():
    echo = windows("cmd", "/c", "echo %ProgramData%").strip()
    return pathlib.Path(echo if ON_WINDOWS else windows("winepath", "-u", echo).strip())


def volume_serial_number(path):
    if ON_WINDOWS:
        return os.stat(path).st_dev & 0xFFFFFFFF
    high, low = re.search(r"([0-9A-F]{4})-([0-9A-F]{4})", windows("cmd", "/c", "vol", "C:")).groups()
    return int(high + low, 16)


def scan_cache(count, records):
    header = bytearray(RECORDS_OFFSET)
    struct.pack_into("<I", header, COUNT_OFFSET, count)
    return bytes(header) + b"".join(RECORD.pack(*record) for record in records)


class Product:
    """The staged product, below the temporary folder, which lies on a volume that has a serial number."""

    def __init__(self):
        self.root = temporary_folder() / f"st_product_{uuid.uuid4().hex}"
        self.folder = self.root / "Pr\u00f6dukt \u6771"
        self.data = common_data_folder()
        self.name = self.root.name  # of everything that lies in folders of the machine
        self.key = f"{UNINSTALL}\\{{{uuid.uuid4()}}}"
        self.files = {"product_part.dll": (BIN / "product_part.dll").read_bytes(),
                      "modules/deep/product_ui.exe": (BIN / "log.dll").read_bytes(),
                      "plain.dll": b"not a library"}
        self.others = {"update_statistics.xml":
                       '<UpdateStatistics><Signatures><Check time="1700000001"/><Update time="1700000002"/></Signatures>'
                       '<Engine><Update time="1"/></Engine></UpdateStatistics>',
                       "qxch.xml": f"<settings><qxreinit><DumpPath>%ProgramData%\\{self.name}\\Crashes</DumpPath></qxreinit></settings>",
                       "settings/product.xml": "<settings/>", "README.EXE": "not listed"}
        self.logs = {f"Quorvex/Logs/{self.name}/engine.log": b"engine", f"Quorvex/QXLogging/{self.name}.log": b"trace",
                     f"{self.name}/Crashes/product.dmp": b"MDMP"}

    def stage(self):
        for name, content in {**self.files, **self.others}.items():
            self.write(self.folder / name, content)
        for name, content in self.logs.items():
            self.write(self.data / name, content)
        serial, reference = volume_serial_number(self.root), os.stat(self.folder / "plain.dll").st_ino
        fields = (2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 0b0101, 15, 0, 16)
        self.write(self.folder / "ThreatScanner/smartdb-ntfs.db",
                   scan_cache(3, [(reference, serial, *fields), (0xABCDEF, serial ^ 0x5A5A5A5A, *fields)])[:-1] + b"\0\1")
        for name, value in (("Publisher", "Quorvex"), ("InstallLocation", self.windows_path(self.folder)),
                            ("DisplayName", "Quorvex Security"), ("UninstallString", "uninstall.exe"),
                            ("DisplayVersion", "4.30")):
            windows("reg", "add", self.key, "/v", name, "/d", value, "/f")
        windows("reg", "add", STARTUP_KEY, "/v", "Tray", "/d", "tray.exe /start", "/f")

    @staticmethod
    def write(path, content):
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_bytes(content if isinstance(content, bytes) else content.encode())

    @staticmethod
    def windows_path(path):
        if ON_WINDOWS:
            return str(path)
        return windows("winepath", "-w", str(path)).strip()

    def remove(self):
        shutil.rmtree(self.root, ignore_errors=True)
        for name in self.logs:
            path = self.data / name
            path.unlink(missing_ok=True)
            with contextlib.suppress(OSError):  # the folders that are empty now, up to the machine's own
                for folder in path.relative_to(self.data).parents[:-1]:
                    (self.data / folder).rmdir()
        for key in (self.key, STARTUP_KEY):
            windows("reg", "delete", key, "/f")


class ProductCollection(ProgramTest):
    """One collection of the staged product, sent and opened again."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.product = Product()
        cls.addClassCleanup(cls.product.remove)
        cls.product.stage()
        cls.install_log = temporary_folder() / f"qxinst.{uuid.uuid4().hex}.log"
        cls.install_log.write_bytes(b"installed")
        cls.addClassCleanup(cls.install_log.unlink, missing_ok=True)
        # The settings that ship, with a list of startup places that this test knows.
        settings = cls.stage.path("settings")
        shutil.copytree(SOURCE / "app/settings", settings)
        (settings / "startup_registry_keys.txt").write_text(f"{STARTUP_KEY}\r\n\r\n", encoding="utf-8-sig")
        cls.write_startup_folder(settings / "startup_folders.txt")
        cls.log = cls.stage.collect("settings=settings\\quick.json", "noda")
        plain = cls.stage.path("opened.zip")
        plain.write_bytes(open_package.open_package(cls.stage.path("collected.zip").read_bytes(), PRIVATE_KEY))
        cls.entries = read_archive(plain)

    @classmethod
    def write_startup_folder(cls, list_file):
        folder = cls.product.root / "Startup"
        folder.mkdir()
        (folder / "tray.lnk").write_bytes(b"")
        list_file.write_text(cls.product.windows_path(folder) + "\n", encoding="utf-8")

    def document(self, name):
        return json.loads(self.entries[f"collected/{name}.json"])

    def test_the_run_succeeds_with_the_settings_that_ship(self):
        self.assertReturnCode(self.log, 0)
        self.assertNotIn("No config file", self.log)
        self.assertNotIn("No output folder set", self.log)

    def test_every_program_and_library_has_its_digest_and_version(self):
        information = self.document("product_information")
        location = self.product.windows_path(self.product.folder)
        self.assertEqual(information["install_location"], location)
        records = {record["path"]: record for record in information["file_information"]}
        self.assertEqual(set(records), {f"{location}\\" + name.replace("/", "\\") for name in self.product.files})
        for name, content in self.product.files.items():
            record = records[f"{location}\\" + name.replace("/", "\\")]
            self.assertEqual(record["md5"], hashlib.md5(content).hexdigest(), name)
        versions = {path.rsplit("\\")[-1]: record["version"] for path, record in records.items()}
        self.assertEqual(versions, {"product_part.dll": "4.30.65535.1", "product_ui.exe": "1.0.0.0", "plain.dll": ""})

    def test_last_update_has_the_complete_elements(self):
        self.assertEqual(self.document("product_information")["last_update"],
                         {"Signatures": {"check": {"time": "1700000001"}, "update": {"time": "1700000002"}}})
        self.assertIn("Invalid element", self.log)

    def test_scan_cache_records_come_with_their_paths_until_the_file_ends(self):
        first, second = self.document("product_information")["smart_db"]
        self.assertEqual(first["path"].lower(), (self.product.windows_path(self.product.folder) + "\\plain.dll").lower())
        self.assertEqual(second["path"], "")
        self.assertEqual(second["file_reference_number"], "ABCDEF")
        expected = {"references": 2, "key_and_scan": 3, "scan_phase": 4, "flag_from_dat": 5, "cloud_flags": 6,
                    "uInternalFlags": 7, "latime": 8, "lstime": 9, "uExtraFlags1": 10, "uExtraFlags2": 11,
                    "db_key_1": 12, "db_key_2": 13, "db_key_3": 14, "opt_scan_email": True, "opt_scan_packed": False,
                    "opt_scan_archives": True, "opt_deep_scan": False, "opt_max_archive_depth_level": 15,
                    "opt_max_archive_file_size": 16}
        self.assertEqual({name: first[name] for name in expected}, expected)
        self.assertEqual(set(first), set(expected) | {"file_reference_number", "path"})
        self.assertIn("Getdatabase information entries 3", self.log)
        self.assertIn("Less than sizeof( CacheInfoNTFS ) in file;", self.log)

    def test_every_folder_of_the_product_is_packed(self):
        folders = self.document("log_folders_considered")
        data, location = self.product.windows_path(self.product.data), self.product.windows_path(self.product.folder)
        name = self.product.name
        self.assertEqual(folders, [f"{data}\\Quorvex\\Logs", f"{data}\\Quorvex\\QXLogging", f"{location}\\settings",
                                   f"{data}\\{name}\\Crashes"])
        packed = {f"Logs/{name}/engine.log": b"engine", f"QXLogging/{name}.log": b"trace",
                  "settings/product.xml": b"<settings/>", "Crashes/product.dmp": b"MDMP",
                  f"install_logs/{self.install_log.name}": b"installed"}
        self.assertEqual({entry: self.entries.get(entry) for entry in packed}, packed)

    def test_the_product_is_among_the_installed_software(self):
        self.assertIn({"Name": "Quorvex Security", "Version": "4.30", "Publisher": "Quorvex", "InstallDate": None},
                      self.document("installed_software"))

    def test_startup_programs_come_from_both_lists(self):
        self.assertEqual(self.document("startup_programs"), [
            {"key": STARTUP_KEY, "name": "tray", "value": "tray.exe /start"},
            self.product.windows_path(self.product.root / "Startup") + "\\tray.lnk"])


class ShippedSettings(ProgramTest):
    """The settings files as they ship, in their folder beside the program."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        shutil.copytree(SOURCE / "app/settings", cls.stage.path("settings"))

    def collect(self, *options):
        log = self.stage.collect("nocs", "nodtf", "noe", *options)
        self.assertReturnCode(log, 0)
        self.assertNotIn("Expecting a string with file name", log)
        self.assertNotIn("names no collector", log)
        return log

    def test_the_full_collection_runs_from_its_folder_and_as_the_default(self):
        for folder in ("settings", "."):
            with self.subTest(folder=folder):
                shutil.copy(SOURCE / "app/settings/stsettings.json", self.stage.path(folder))
                log = self.collect(*([] if folder == "." else [f"settings={folder}\\stsettings.json"]))
                self.assertNotIn("cannot be read", log)
                self.assertNotIn("No config file", log)
                self.assertTrue(self.stage.path("collected/startup_programs.json").exists())
                self.assertTrue(self.stage.path("collected/installed_software.json").exists())

    def test_files_in_the_folder_do_not_change_what_a_plain_run_does(self):
        self.stage.path("stsettings.json").unlink()
        log = self.collect("pp")
        self.assertIn("No config file with name stsettings.json found", log)
        self.assertFalse(self.stage.path("collected/startup_programs.json").exists())


if __name__ == "__main__":
    unittest.main()
