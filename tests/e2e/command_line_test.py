"""Start-up: modes, instances, odd command lines and missing libraries."""
import shutil
import unittest

from support_tool import BIN, LIBRARIES, TIMEOUT, ProgramTest, bulky_installer_log, read_archive, wait_until


class StartUp(ProgramTest):
    def test_both_names_of_the_monitoring_mode_start_it(self):
        for arguments in (("/m",), ("--monitoring",)):
            with self.subTest(arguments=arguments):
                log = self.stage.run(*arguments)
                self.assertInOrder(log, "-> Testing()", "Invalid path for configuration file monitoring.json",
                                   "<- Testing()")
        self.assertEqual(self.stage.left(), [])

    def test_without_an_html_engine_the_window_mode_ends_with_minus_one(self):
        before = self.stage.left()
        for arguments in ((), ("NoGui", "c")):
            with self.subTest(arguments=arguments):
                log = self.stage.run(*arguments, code=-1)
                self.assertInOrder(log, "-> WithGui()", "the HTML engine sciter.dll cannot be loaded, error 126")
        self.assertEqual(self.stage.left(), before)

    def test_logging_that_a_killed_run_left_raised_is_put_back_at_the_start(self):
        settings = self.stage.path("Logger.xml")
        marker = self.stage.path("Logger.xml.raised")
        before = settings.read_bytes()
        settings.write_bytes(before.replace(b"</maxSize>", b"</maxSize><depth>MODULE</depth>"))
        marker.write_bytes(b'{"components":[],"logger_xml_bytes":%d}\n%b' % (len(before), before))
        self.stage.run("nogui")
        self.assertNotIn(b"MODULE", settings.read_bytes())
        self.assertFalse(marker.exists())
        settings.write_bytes(before)

    def test_nogui_without_a_job_does_nothing(self):
        log = self.stage.run("nogui")
        self.assertInOrder(log, "-> NoGui()", "<- NoGui()")
        self.assertNotIn("Return code", log)

    def test_whatever_becomes_of_the_crash_handler_the_program_goes_on(self):
        library = self.stage.path("qxch.dll")
        self.assertInOrder(self.stage.run("nogui"), "error loading qxch dll 126", "-> NoGui()")
        shutil.copy(BIN / "log.dll", library)  # has other exports
        self.assertInOrder(self.stage.run("nogui"), "cannot get enable crash handler func", "-> NoGui()")
        shutil.copy(BIN / "fake_qxch.dll", library)
        self.assertInOrder(self.stage.run("nogui", environment={"ST_FAKE_QXCH_RESULT": "7"}),
                           "error initializing qxch 7", "-> NoGui()")
        self.assertNotIn(" ERROR ", self.stage.run("nogui"))
        library.unlink()

    def test_unknown_options_are_ignored_with_the_nearest_name(self):
        log = self.stage.run("nogui", "--encript", "x" * 20_000, "line=a\nb")
        self.assertInOrder(log, "unknown option 'encript' is ignored; the nearest known option is 'encrypt'",
                           "unknown option 'xxx", "its value has a line break", "-> NoGui()", "<- NoGui()")

    def test_empty_command_line_and_known_options_make_no_warning(self):
        for arguments in ((), ("nogui", "-nocs", "/o=x", "--pk=k")):
            log = self.stage.run(*arguments, code=0 if arguments else -1)
            self.assertNotIn("unknown option", log)
            self.assertNotIn("is ignored", log)

    def test_second_instance_ends_at_once_and_leaves_the_first_alone(self):
        self.enterContext(bulky_installer_log(40))
        before = self.stage.mark()
        first = self.stage.start("nogui", "c", "nocs", "noe", "noda")
        try:
            self.assertTrue(wait_until(lambda: "<- CheckSingleInstance()" in self.stage.log(before)))
            self.assertEqual(self.stage.start("nogui", "c", "nocs").wait(TIMEOUT), 0)
            self.assertIsNone(first.poll(), "the first instance ended too early for this test")
            self.assertEqual(first.wait(TIMEOUT), 0)
        finally:
            first.kill()
            first.wait()
        log = self.stage.log(before)
        self.assertInOrder(log, "An instance already exists", "Not a single instance")
        self.assertEqual(log.count("-> NoGui()"), 1)
        self.assertIn("collected/system_summary.json", read_archive(self.stage.path("collected.zip")))


class WithoutLogging(ProgramTest):
    libraries = tuple(name for name in LIBRARIES if name != "log.dll")

    def test_the_program_does_the_same_without_output(self):
        self.assertEqual(self.stage.collect("noe", "noda"), "")
        self.assertEqual(self.stage.left(), ["collected.zip"])
        archive = self.stage.path("collected.zip")
        self.assertIn("collected/system_summary.json", read_archive(archive))
        self.assertEqual([p.read_bytes() for p in self.stage.packages()][-1:], [archive.read_bytes()])


if __name__ == "__main__":
    unittest.main()
