"""support_report on a package that a real run made: it is opened, judged and unpacked; what cannot be opened is told apart."""
import json
import shutil
import subprocess
import unittest
import zipfile

from support_tool import BIN, ENVIRONMENT, LAUNCHER, SOURCE, TIMEOUT, ProgramTest, windows_path

OTHER_KEY = SOURCE / "stutil/keys/other_private_key.pem"
NOTHING_FOUND, FINDINGS, BAD_INPUT, WRONG_KEY = range(4)


class Report(ProgramTest):
    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        shutil.copy(BIN / "support_report.exe", cls.stage.folder)
        shutil.copy(OTHER_KEY, cls.stage.path("other.pem"))
        # The product is not installed, which is a finding of every run here.
        cls.stage.settings({"system_summary": True, "storage": True, "services": True, "running_tasks": True,
                            "installed_software": True, "windows_events": True, "product_information": True})
        cls.stage.collect("nocs", "noda", "nodtf")
        cls.package = cls.stage.path("collected.zip")

    def report(self, *arguments):
        """The exit code and both texts."""
        result = subprocess.run([*LAUNCHER, windows_path(self.stage.path("support_report.exe")), *arguments],
                                cwd=self.stage.folder, env=ENVIRONMENT, stdin=subprocess.DEVNULL, capture_output=True,
                                timeout=TIMEOUT, check=False)
        return result.returncode, result.stdout.decode(), result.stderr.decode(errors="replace")

    def findings(self, *arguments):
        code, text, _ = self.report("--json", *arguments)
        self.assertEqual(code, FINDINGS)
        return json.loads(text)["findings"]

    def test_a_package_is_opened_and_judged(self):
        code, text, _ = self.report("collected.zip", "--key", "privateKey.pem")
        self.assertEqual(code, FINDINGS)
        self.assertIn("The product is not installed [product-not-installed]", text)
        findings = {finding["id"]: finding for finding in self.findings("collected.zip", "--key", "privateKey.pem")}
        self.assertEqual(findings["product-not-installed"]["severity"], "warning")
        self.assertEqual(findings["product-not-installed"]["evidence"][0]["file"], "collection_manifest.json")
        # A package of our own is sound, and its collectors' files are what the rules expect.
        for rule in ("manifest-missing", "document-missing", "document-unreadable", "entry-left-out", "clock-jump"):
            self.assertNotIn(rule, findings)

    def test_what_is_unpacked_is_the_collection_and_judged_alike(self):
        code, _, messages = self.report("collected.zip", "--key", "privateKey.pem", "--extract", "unpacked \u00f6")
        self.assertEqual(code, FINDINGS, messages)
        unpacked = self.stage.path("unpacked \u00f6")
        expected = {path.name: path.read_bytes() for path in self.stage.path("collected").glob("*.json")}
        self.assertEqual({path.name: path.read_bytes() for path in (unpacked / "collected").glob("*.json")}, expected)
        of_package = self.findings("collected.zip", "--key", "privateKey.pem")
        self.assertEqual(self.findings("unpacked \u00f6"), of_package)
        self.assertEqual(self.findings("unpacked \u00f6\\collected"), of_package)
        with zipfile.ZipFile(self.stage.path("plain.zip"), "w", zipfile.ZIP_DEFLATED) as archive:
            for name, content in expected.items():
                archive.writestr(f"collected/{name}", content)
            archive.writestr("../evil.txt", "x")
        in_zip = self.findings("plain.zip")
        self.assertEqual([f for f in in_zip if f["id"] != "entry-left-out"], of_package)
        self.assertIn("../evil.txt", [f["evidence"][0]["file"] for f in in_zip])
        # A folder that holds something is not touched.
        code, _, messages = self.report("plain.zip", "--extract", "collected")
        self.assertEqual(code, BAD_INPUT)
        self.assertIn("is not empty", messages)

    def test_what_cannot_be_opened_says_why(self):
        self.stage.path("garbage").write_bytes(bytes(range(256)) * 40)
        self.stage.path("cut").write_bytes(self.package.read_bytes()[:100])
        rows = (
            (("collected.zip", "--key", "other.pem"), WRONG_KEY, "does not open the package"),
            (("collected.zip",), BAD_INPUT, "--key FILE"),
            (("garbage", "--key", "privateKey.pem"), BAD_INPUT, "neither a package nor a zip archive"),
            (("cut", "--key", "privateKey.pem"), BAD_INPUT, "neither a package nor a zip archive"),
            (("absent",), BAD_INPUT, "absent cannot be read, error 2"),
            ((), BAD_INPUT, "Name a package"),
        )
        for arguments, expected, message in rows:
            with self.subTest(arguments=arguments):
                code, text, messages = self.report(*arguments)
                self.assertEqual((code, text), (expected, ""))
                self.assertIn(message, messages)

    def test_help_and_version_are_no_errors(self):
        for option, text in (("--help", "Exit codes: 0 nothing found"), ("--version", "support_report 1.")):
            code, out, _ = self.report(option)
            self.assertEqual(code, NOTHING_FOUND)
            self.assertIn(text, out)


if __name__ == "__main__":
    unittest.main()
