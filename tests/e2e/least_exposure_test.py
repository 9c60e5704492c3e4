"""What others on the machine may do with a run: not read what it writes, not make it write elsewhere, not be loaded."""
import os
import shutil
import subprocess
import threading
import unittest

from support_tool import (BIN, ENVIRONMENT, LAUNCHER, ON_WINDOWS, TIMEOUT, ProgramTest, wait_until, windows_path)

# Every library that the program loads by its bare name, its own and the system's, and some that those load in turn.
NAMES = ("log", "qxch", "qxlink", "framework", "ServConfig", "LanguageManager", "sciter", "psapi", "wintrust", "crypt32",
         "pdh", "dbghelp", "version", "winhttp", "bcrypt", "cryptbase", "wbemprox", "iphlpapi")


class PlantedLibraries(ProgramTest):
    def setUp(self):
        self.place = self.stage.path("downloads")
        self.place.mkdir()
        self.addCleanup(shutil.rmtree, self.place)
        self.plant(self.place)

    @staticmethod
    def plant(folder):
        for name in NAMES:
            shutil.copy(BIN / "planted_library.dll", folder / f"{name}.dll")

    def loaded(self):
        return sorted(path.name for path in self.place.rglob("*.loaded"))

    def test_they_are_never_loaded_from_the_current_or_the_output_folder(self):
        output = self.place / "out"
        planter = threading.Thread(target=lambda: wait_until(output.exists) and self.plant(output))
        planter.start()
        before = self.stage.mark()
        environment = ENVIRONMENT | {"WINEPATH" if LAUNCHER else "PATH": windows_path(self.place)}
        subprocess.run([*LAUNCHER, windows_path(self.stage.path("support_tool.exe")), "nogui", "collect", "o=out",
                        f"s={windows_path(self.stage.path('stsettings.json'))}", "nodtf", "noda"],
                       cwd=self.place, env=environment, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                       stderr=subprocess.DEVNULL, timeout=TIMEOUT, check=True)
        planter.join()
        log = self.stage.log(before)
        self.assertReturnCode(log, 0)
        self.assertIn("error loading qxch dll", log, "the run was not tempted")
        self.assertTrue((output / "qxch.dll").exists())
        self.assertEqual(self.loaded(), [])

    def test_a_program_without_the_rule_does_load_them(self):
        subprocess.run([*LAUNCHER, "rundll32.exe", "qxch.dll,EnableCrashHandler"], cwd=self.place, env=ENVIRONMENT,
                       stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, timeout=TIMEOUT)
        self.assertEqual(self.loaded(), ["qxch.dll.loaded"])


class OutputOfARun(ProgramTest):
    def test_only_the_user_and_the_administrators_may_look_into_it(self):
        self.stage.collect("nodtf", "noda", "noe")
        for name in ("collected", "collected.zip"):
            path = self.stage.path(name)
            if ON_WINDOWS:
                rights = subprocess.run(["icacls", path], capture_output=True, text=True, check=True).stdout
                self.assertNotRegex(rights, r"Everyone|\\Users:|Authenticated Users", name)
            else:
                self.assertEqual(path.stat().st_mode & 0o007, 0, name)
        self.assertEqual(self.stage.outbox.stat().st_mode & 0o007, 0)

    def test_a_planted_name_of_another_file_is_replaced_and_that_file_untouched(self):
        for name in ("collected.zip", "collected.zip.partial"):
            with self.subTest(name):
                self.stage.clear()
                victim = self.stage.path("victim")
                victim.write_bytes(b"precious")
                os.link(victim, self.stage.path(name))
                self.assertReturnCode(self.stage.collect("noda"), 0)
                self.assertEqual(victim.read_bytes(), b"precious")
                self.assertNotEqual(self.stage.path("collected.zip").read_bytes(), b"precious")


if __name__ == "__main__":
    unittest.main()
