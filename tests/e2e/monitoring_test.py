"""The monitoring mode of the whole program: real counters, a busy child, dumps, samples, and every way to an end.

Where the system has no counters of processes, a stand-in for its pdh.dll measures them (tests/children/process_pdh.cpp).
"""
import copy
import json
import re
import shutil
import subprocess
import unittest

from json_schema import problems
from minidump import DUMP_TYPE, MiniDump
from support_tool import BIN, ENVIRONMENT, LAUNCHER, ON_WINDOWS, SOURCE, ProgramTest, wait_until, windows_path

SAMPLE = json.loads((SOURCE / "monitoring/monitoring.json").read_text())
SCHEMA = json.loads((SOURCE / "monitoring/monitoring.schema.json").read_text())
STOP_EVENT = "Local\\QuorvexSupportToolStopMonitoring"

NEVER = {
    "performanceCounters": [
        {"id": "uptime", "query": "\\System\\System Up Time", "sampleInterval": 20, "saveToFile": True,
         "triggers": ["never"]}],
    "triggers": [{"id": "never", "triggerAfter": 1, "counterValue": 0, "condition": "<", "action": []}],
    "actions": [],
}


def quick_sample():
    """The sample that ships, with more samples a second and a threshold that a busy machine reaches, too."""
    configuration = copy.deepcopy(SAMPLE)
    configuration["performanceCounters"][0]["sampleInterval"] = 100
    configuration["triggers"][0]["counterValue"] = 20
    del configuration["limits"]["minFreeDiskBytes"]  # whatever machine this is
    return configuration


class MonitoringTest(ProgramTest):
    def setUp(self):
        self.addCleanup(self.stage.clear)

    def configure(self, configuration):
        text = configuration if isinstance(configuration, str) else json.dumps(configuration)
        self.stage.path("monitoring.json").write_text(text)

    def monitor(self, environment=None):
        return self.stage.run("monitoring", environment=environment)

    def start_child(self, name="example.exe"):
        shutil.copy(BIN / "cpu_child.exe", self.stage.path(name))
        child = subprocess.Popen([*LAUNCHER, windows_path(self.stage.path(name)), "120"], env=ENVIRONMENT,
                                 stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)

        def end():
            child.kill()
            child.wait()

        self.addCleanup(end)
        return child

    def dumps(self):
        return sorted(self.stage.folder.glob("*.dmp"))

    def start(self, configuration):
        """Starts a run and waits until it samples."""
        self.configure(configuration)
        process = self.stage.start("monitoring")
        self.addCleanup(process.wait)
        self.addCleanup(process.kill)
        sampled = wait_until(lambda: self.stage.path("uptime.csv").exists(), 30)
        self.assertTrue(sampled, self.stage.log())
        return process


class Monitoring(MonitoringTest):
    """With the system's own counters."""

    def test_two_pairs_that_fire_end_the_run(self):
        configuration = copy.deepcopy(NEVER)
        configuration["triggers"][0]["condition"] = ">"
        configuration["performanceCounters"][0]["triggers"] = ["never", "later"]
        configuration["triggers"].append(dict(configuration["triggers"][0], id="later", triggerAfter=5))
        self.configure(configuration)
        log = self.monitor()
        self.assertInOrder(log, "[uptime,never] TRIGGER", "[uptime,later] UPDATE; cnt = 5", "[uptime,later] TRIGGER",
                           "stop signaled")
        self.assertEqual(log.count("stop signaled"), 1)
        self.assertEqual(log.count("TRIGGER"), 2)
        lines = self.stage.path("uptime.csv").read_text().splitlines()
        self.assertEqual(lines[0], "time,value")
        values = []
        for line in lines[1:]:
            match = re.fullmatch(r"\d{4}-\d\d-\d\dT\d\d:\d\d:\d\d\.\d{3}Z,(.+)", line)
            self.assertTrue(match, line)
            values.append(float(match[1]))
        self.assertGreaterEqual(len(values), 6)
        self.assertEqual(values, sorted(values))

    def test_the_stop_event_ends_what_never_fires(self):
        process = self.start(NEVER)
        mark = self.stage.mark()
        subprocess.run([*LAUNCHER, str(BIN / "set_event.exe"), STOP_EVENT], env=ENVIRONMENT, check=True, timeout=30,
                       stdin=subprocess.DEVNULL)
        self.assertEqual(process.wait(30), 0)
        self.assertInOrder(self.stage.log(mark), "the stop event is signaled", "stop signaled", "<- Testing()")

    def test_a_configuration_that_cannot_be_used_ends_the_run_with_a_reason(self):
        missing = copy.deepcopy(NEVER)
        missing["performanceCounters"][0]["triggers"].append("absent")
        rows = (
            (None, "Invalid path for configuration file monitoring.json"),
            (missing, "trigger with name absent was not found"),
            (dict(NEVER, limits={"maxDump": 3}), "there is no limit maxDump"),
        )
        for configuration, text in rows:
            with self.subTest(text=text):
                if configuration is not None:
                    self.configure(configuration)
                self.assertInOrder(self.monitor(), text, "<- Testing()")

    def test_without_an_event_queue_the_run_ends_with_a_reason(self):
        self.configure(NEVER)
        rows = (
            (None, "error loading", "Failed to init EQ : "),
            ("log_partial.dll", "does not export QxCreateObject", "Failed to init EQ : 127"),
            ("fake_framework.dll", "QxCreateObject GlobalEventQueue returned 7", "Failed to init EQ : 7"),
        )
        framework = self.stage.path("framework.dll")
        self.addCleanup(lambda: shutil.copy(BIN / "framework.dll", framework))
        for replacement, *texts in rows:
            with self.subTest(replacement=replacement):
                framework.unlink(missing_ok=True)
                if replacement:
                    shutil.copy(BIN / replacement, framework)
                self.assertInOrder(self.monitor({"ST_FAKE_FRAMEWORK": "7"}), *texts, "<- Testing()")


class ProcessMonitoring(MonitoringTest):
    """With counters of processes."""

    # What is not the system's own must be asked for.
    ENVIRONMENT = {"WINEDLLOVERRIDES": ENVIRONMENT.get("WINEDLLOVERRIDES", "") + ";pdh=n"}

    def setUp(self):
        super().setUp()
        if not ON_WINDOWS:
            shutil.copy(BIN / "process_pdh/pdh.dll", self.stage.folder)

    def test_a_busy_process_is_dumped_and_the_run_ends_by_itself(self):
        self.start_child()
        self.configure(quick_sample())
        log = self.monitor(self.ENVIRONMENT)
        self.assertInOrder(log, "[example-processor-time,example-is-busy] UPDATE; cnt = 5",
                           "[example-processor-time,example-is-busy] TRIGGER", "Running action with id='dump-example'",
                           "action finished", "stop signaled")
        dumps = self.dumps()
        self.assertEqual(len(dumps), 1, log)
        self.assertRegex(dumps[0].name, r"^example\.exe_\d+\.dmp$")
        dump = MiniDump(dumps[0].read_bytes())
        self.assertEqual(dump.flags, DUMP_TYPE)
        self.assertEqual(dump.process_id, int(dumps[0].stem.rsplit("_", 1)[1]))
        self.assertTrue(dump.modules[0].endswith("\\example.exe"), dump.modules)
        self.assertGreaterEqual(dump.threads, 1)
        samples = self.stage.path("example-processor-time.csv").read_text().splitlines()
        self.assertGreaterEqual(len(samples), 5)
        self.assertGreater(max(float(line.split(",")[1]) for line in samples[1:]), 20)

    def test_an_idle_machine_does_not_fire_and_limits_refuse_dumps(self):
        configuration = quick_sample()
        configuration["limits"] = {"maxDumps": 1}
        configuration["triggers"][0]["action"] = ["dump-example", "dump-example"]
        self.configure(configuration)
        process = self.stage.start("monitoring", environment=self.ENVIRONMENT)
        self.addCleanup(process.wait)
        self.addCleanup(process.kill)
        with self.assertRaises(subprocess.TimeoutExpired, msg="nothing is busy yet"):
            process.wait(2)
        self.start_child()
        self.assertEqual(process.wait(60), 0)
        self.assertEqual(len(self.dumps()), 1)
        self.assertIn(": maxDumps is 1", self.stage.log())

    @unittest.skipIf(ON_WINDOWS, "a disk is made full by a limit of the process")
    def test_a_full_disk_leaves_no_dump(self):
        self.start_child()
        self.configure(quick_sample())
        script = "trap '' XFSZ; ulimit -f 200; exec wine support_tool.exe monitoring"  # of 512 bytes
        mark = self.stage.mark()
        subprocess.run(["sh", "-c", script], cwd=self.stage.folder, env=ENVIRONMENT | self.ENVIRONMENT, timeout=90,
                       check=True, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        log = self.stage.log(mark)
        self.assertRegex(log, r"MiniDumpWriteDump fails with code|is cut off after|cannot be given its name")
        self.assertIn("stop signaled", log)
        self.assertEqual([p.name for p in self.stage.folder.glob("*.dmp*")], [])


class Schema(unittest.TestCase):
    def test_the_sample_fits_and_what_the_program_refuses_does_not(self):
        self.assertEqual(problems(SAMPLE, SCHEMA), [])
        self.assertEqual(problems(NEVER, SCHEMA), [])
        rows = (
            ("performanceCounters", "sampleInterval", 1000.5),
            ("performanceCounters", "sampleInterval", 0),
            ("performanceCounters", "triggers", [1]),
            ("performanceCounters", "trigers", []),
            ("triggers", "condition", "="),
            ("triggers", "counterValue", "50"),
            ("triggers", "triggerAfter", 1 << 31),
            ("actions", "type", "restart"),
            ("actions", "parameters", {}),
            ("actions", "parameters", {"pid": "7"}),
            ("limits", "maxDumps", -1),
            ("limits", "maxDump", 1),
        )
        for section, member, value in rows:
            with self.subTest(section=section, member=member, value=value):
                document = copy.deepcopy(SAMPLE)
                (document[section] if section == "limits" else document[section][0])[member] = value
                self.assertEqual(len(problems(document, SCHEMA)), 1)
        for section in ("performanceCounters", "triggers", "actions"):
            for member in SAMPLE[section][0].keys() - {"$comment", "saveToFile"}:
                document = copy.deepcopy(SAMPLE)
                del document[section][0][member]
                self.assertEqual(len(problems(document, SCHEMA)), 1, (section, member))


if __name__ == "__main__":
    unittest.main()
