"""The collectors of tables: each writes its file, or the manifest says why not.

What a machine has differs, and elsewhere than on Windows WMI knows few classes and properties. So most cases compare the
files with the manifest; the exceptions are what every machine has, and updates that the test itself registers.
"""
import json
import subprocess
import unittest

from support_tool import ENVIRONMENT, LAUNCHER, ProgramTest

MEMBERS = {
    "processor": {"Architecture", "Caption", "DataWidth", "Description", "Family", "Manufacturer", "MaxClockSpeed", "Name",
                  "ProcessorId", "ProcessorType", "Revision"},
    "network": {"LocalName", "RemoteName", "RemotePath", "ResourceType", "Status", "UserName"},
    "printers": {"Name", "PortName", "ServerName"},
    "system_drivers": {"Name", "Description", "PathName", "ServiceType", "Started", "StartMode", "State", "AcceptPause",
                       "AcceptStop"},
    "services": {"DisplayName", "Name", "State", "StartMode", "ServiceType", "PathName", "StartName"},
}
DISKS = {"Model", "Partitions", "BytesPerSector"}
PARTITIONS = {"Drive Letter", "Description", "Compressed", "File System", "Size", "Free Space", "VolumeName",
              "VolumeSerialNumber"}
IN_RUN_ORDER = [("processor", "CpuCollector"), ("storage", "DiskCollector"), ("network", "NetworkCollector"),
                ("printers", "PrintersCollector"), ("system_drivers", "SystemDriversCollector"),
                ("network", "NetworkConnectionsCollector"), ("services", "ServiceCollector"),
                ("installed_updates", "InstalledUpdatesCollector")]

UNINSTALL = ("HKLM\\Software\\Wow6432Node\\Microsoft\\Windows\\CurrentVersion\\Uninstall\\st_e2e_update",
             "HKLM\\Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall\\st_e2e_update")


def registry(*arguments):
    """True when it succeeded; on Windows the machine's keys take an administrator."""
    return subprocess.run([*LAUNCHER, "reg", *arguments, "/f"], env=ENVIRONMENT, stdin=subprocess.DEVNULL,
                          stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, check=False).returncode == 0


class TableCollectors(ProgramTest):
    """One collection with all of them."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.has_updates = True
        for key in UNINSTALL:
            cls.addClassCleanup(registry, "delete", key)
            for name, kind, data in (("DisplayName", "REG_SZ", "S\u00fcd \u6771"), ("UninstallString", "REG_SZ", "u"),
                                     ("ParentDisplayName", "REG_SZ", "Suite"), ("SystemComponent", "REG_DWORD", "1")):
                cls.has_updates &= registry("add", key, "/v", name, "/t", kind, "/d", data)
        cls.stage.settings({key: True for key, _ in IN_RUN_ORDER} | {"pretty_print": True})
        cls.log = cls.stage.collect("nodtf", "nocs")
        cls.manifest = json.loads(cls.stage.path("collected/collection_manifest.json").read_text("utf-8"))["collectors"]

    def data(self, name):
        """What the collector's file holds; None when there is no file."""
        path = self.stage.path(f"collected/{name}.json")
        return json.loads(path.read_text("utf-8")) if path.exists() else None

    def test_all_run_in_their_order_and_the_run_succeeds(self):
        self.assertReturnCode(self.log, 0)
        self.assertEqual([(entry["name"], entry["class"]) for entry in self.manifest], IN_RUN_ORDER)
        self.assertInOrder(self.log, *(f"Collecting data for {name} ..." for name, _ in IN_RUN_ORDER))

    def test_each_file_is_written_or_the_manifest_says_why_not(self):
        for entry in {entry["name"]: entry for entry in self.manifest}.values():  # of two of a name the later
            with self.subTest(collector=entry["name"]):
                path = self.stage.path(f"collected/{entry['name']}.json")
                if entry["outcome"] == "data":
                    self.assertEqual(path.stat().st_size, entry["bytes"])
                    data = self.data(entry["name"])
                    records = sum(map(len, data.values())) if isinstance(data, dict) else len(data)
                    self.assertEqual(records, entry["records"])
                else:
                    self.assertEqual(entry["outcome"], "no data")
                    self.assertFalse(path.exists())
                    self.assertTrue(entry["reason"])
                    self.assertIn(f"No data collected for {entry['name']}", self.log)

    def test_rows_have_all_members_and_no_others(self):
        tables = {name: (self.data(name) or [], members) for name, members in MEMBERS.items()}
        storage = self.data("storage")
        tables |= {"disks": (storage["Disks"], DISKS), "partitions": (storage["Partitions"], PARTITIONS)}
        for name, (rows, members) in tables.items():
            for row in rows:
                self.assertEqual(set(row), members, name)

    def test_machine_has_a_processor_a_disk_and_a_drive(self):
        self.assertEqual({row["DataWidth"] for row in self.data("processor")}, {64})
        storage = self.data("storage")
        self.assertTrue(storage["Disks"])
        self.assertIn("C:", [row["Drive Letter"] for row in storage["Partitions"]])

    def test_adapters_are_counted_though_connections_replace_their_file(self):
        adapters, connections = (entry for entry in self.manifest if entry["name"] == "network")
        self.assertEqual(adapters["outcome"], "data")
        self.assertEqual(len(self.data("network")), connections["records"])

    def test_updates_of_both_views_are_listed(self):
        if not self.has_updates:
            self.skipTest("the machine's registry cannot be written")
        update = {"Name": "S\u00fcd \u6771", "Program": "Suite"}
        self.assertEqual(self.data("installed_updates").count(update), 2)


if __name__ == "__main__":
    unittest.main()
