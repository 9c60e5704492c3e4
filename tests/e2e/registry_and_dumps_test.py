"""What the collectors of registry keys and of process dumps leave in the output folder and in the package."""
import json
import re
import shutil
import subprocess
import unittest
import uuid

from support_tool import BIN, ENVIRONMENT, LAUNCHER, ProgramTest, read_archive, windows_path

REG = "reg" if LAUNCHER == [] else "C:\\windows\\system32\\reg.exe"
# As reg.exe takes them, and what the file must show.
VALUES = (
    ("Text", "REG_SZ", "S\u00fcd \u6771", "S\u00fcd \u6771"),
    ("Path", "REG_EXPAND_SZ", "%WinDir%\\Sub", "c:\\windows\\Sub"),
    ("Number", "REG_DWORD", "0xffffffff", "4294967295"),
    ("Bytes", "REG_BINARY", "0aff", "aff"),
    ("List", "REG_MULTI_SZ", "one\\0two", "one two   "),
)


def reg(*arguments):
    subprocess.run([*LAUNCHER, REG, *arguments, "/f"], env=ENVIRONMENT, check=True, stdin=subprocess.DEVNULL,
                   stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)


class RegistryAndDumps(ProgramTest):
    """One run of both, kept and packed."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.key = f"Software\\st_e2e_{uuid.uuid4().hex}"
        cls.addClassCleanup(reg, "delete", f"HKCU\\{cls.key}")
        for name, kind, data, _ in VALUES:
            reg("add", f"HKCU\\{cls.key}\\Sub", "/v", name, "/t", kind, "/d", data)
        cls.children = {name: cls.start_child(name) for name in ("svc_one.exe", "svc_two.exe", "by_id.exe")}
        cls.stage.settings({
            "pretty_print": True,
            "registry": [f"HKCU\\{cls.key}", f"HKEY_CURRENT_USER\\{cls.key}\\Sub", "hkcu\\Software", 5],
            "process_dumps": [{"name": "programs\\svc_"}, {"pid": cls.children["by_id.exe"]}, {"pid": "1"},
                              {"pid": 4294967280}],
        })
        cls.log = cls.stage.collect("nodtf", "noda", "noe", "nocs")

    @classmethod
    def start_child(cls, name):
        """A program that waits; its process id."""
        folder = cls.stage.folder.parent / "programs"
        folder.mkdir(exist_ok=True)
        program = shutil.copy(BIN / "process_child.exe", folder / name)
        child = subprocess.Popen([*LAUNCHER, windows_path(program)], env=ENVIRONMENT, stdin=subprocess.DEVNULL,
                                 stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, text=True)
        cls.addClassCleanup(child.stdout.close)
        cls.addClassCleanup(child.wait)
        cls.addClassCleanup(child.kill)
        lines = [line.strip() for line in iter(child.stdout.readline, "ready\n")]
        return int(next(line for line in lines if line.startswith("pid ")).removeprefix("pid "))

    def test_the_run_succeeds_and_logs_what_could_not_be_had(self):
        self.assertReturnCode(self.log, 0)
        self.assertInOrder(self.log, "need numeric value", "Could not find valid process data for pid -16",
                           "hkcu\\Software is not a valid registry key", "registry key is not a string. skipping")
        self.assertEqual(self.stage.left(), ["collected", "collected.zip"])

    def test_the_registry_file_holds_the_values_of_every_type(self):
        dumps = json.loads(self.stage.path("collected/registry.json").read_text(encoding="utf-8"))
        values = {name.lower(): text for name, _, _, text in VALUES}
        self.assertEqual(dumps, {f"HKCU\\{self.key}": {"subkeys": {"Sub": {"values": values}}},
                                 f"HKEY_CURRENT_USER\\{self.key}\\Sub": {"values": values}})

    def test_one_whole_dump_of_each_process_is_in_the_folder_and_in_the_archive(self):
        expected = {f"programs_svc_-*_{self.children['svc_one.exe']}.dmp",
                    f"programs_svc_-*_{self.children['svc_two.exe']}.dmp", f"by_id.exe_{self.children['by_id.exe']}.dmp"}
        dumps = {path.name: path.read_bytes() for path in self.stage.path("collected").glob("*.dmp*")}
        self.assertEqual({re.sub("-[0-9a-f]{8}_", "-*_", name) for name in dumps}, expected)
        entries = read_archive(self.stage.path("collected.zip"))
        for name, data in dumps.items():
            self.assertEqual(data[:4], b"MDMP")
            self.assertEqual(entries[f"collected/{name}"], data)
        self.assertNotIn("collected/process_dumps.json", entries)


if __name__ == "__main__":
    unittest.main()
