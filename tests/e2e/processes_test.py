"""The collector of the running processes, by the whole program: what it says of a program that tells the same of itself."""
import json
import subprocess
import unittest

from support_tool import BIN, ENVIRONMENT, LAUNCHER, ProgramTest, windows_path


class Child:
    """The program tests/children/process_child.cpp at work."""

    def __init__(self):
        self.path = windows_path(BIN / "process_child.exe")
        self._process = subprocess.Popen([*LAUNCHER, self.path], env=ENVIRONMENT, stdin=subprocess.DEVNULL,
                                         stdout=subprocess.PIPE, text=True, encoding="utf-8")
        self.modules, self.handles = [], []
        for line in self._process.stdout:
            fact, _, value = line.rstrip().partition(" ")
            if fact == "pid":
                self.pid = int(value)
            elif fact == "module":
                self.modules.append(value)
            elif fact == "handle":
                number, _, kind = value.partition(" ")
                self.handles.append({"name": "", "type": kind, "value": f"[{int(number):#x}]"})
            elif fact == "ready":
                return
        raise AssertionError("the child program ended early")

    def close(self):
        self._process.kill()
        self._process.wait()
        self._process.stdout.close()


class RunningTasks(ProgramTest):
    stage_name = "processes"

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.child = Child()
        cls.addClassCleanup(cls.child.close)
        cls.stage.settings({"running_tasks": True})
        cls.log = cls.stage.run("silent", "collect", "nodtf", "nocs")
        document = json.loads(cls.stage.path("collected/running_tasks.json").read_text(encoding="utf-8"))
        cls.processes = document["processes"]

    def process(self):
        found = [process for process in self.processes if process["ProcessId"] == self.child.pid]
        self.assertEqual(len(found), 1)
        return found[0]

    def test_the_child_is_listed_with_what_it_says_of_itself(self):
        process = self.process()
        self.assertReturnCode(self.log, 0)
        self.assertEqual(process["Name"], "process_child.exe")
        self.assertEqual(process["Description"], "process_child.exe")
        self.assertEqual(process["imageType"], "x32")
        self.assertRegex(process["User"], r".+\\.+")
        self.assertEqual([module["name"] for module in process["modules"]], self.child.modules)
        for handle in self.child.handles:
            self.assertEqual(process["handles"].count(handle), 1, handle)

    def test_every_process_has_every_property_of_wmi(self):
        names = {"ProcessId", "Name", "ExecutablePath", "CommandLine", "ParentProcessId", "Priority", "Description"}
        for process in self.processes:
            self.assertLessEqual(names, process.keys())

    def test_the_program_lists_itself(self):
        own = [process for process in self.processes if process["Name"] == "support_tool.exe"]
        self.assertEqual(len(own), 1)
        self.assertTrue(own[0]["modules"][0]["name"].endswith("support_tool.exe"))
        self.assertIn("File", {handle["type"] for handle in own[0]["handles"]})


if __name__ == "__main__":
    unittest.main()
