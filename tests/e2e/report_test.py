"""support_report on a package that a real run made: it is opened, judged and unpacked; what cannot be opened is told apart."""
import html.parser
import json
import shutil
import subprocess
import unittest
import zipfile

from support_tool import BIN, ENVIRONMENT, LAUNCHER, SOURCE, TIMEOUT, ProgramTest, windows_path

OTHER_KEY = SOURCE / "stutil/keys/other_private_key.pem"
NOTHING_FOUND, FINDINGS, BAD_INPUT, WRONG_KEY = range(4)


class EmbeddedData(html.parser.HTMLParser):
    """The text of the element that holds the report's data."""

    def __init__(self, page):
        super().__init__()
        self.is_inside = False
        self.text = ""
        self.feed(page)

    def handle_starttag(self, tag, attributes):
        self.is_inside = dict(attributes) == {"type": "application/json", "id": "report-data"} and tag == "script"

    def handle_data(self, data):
        self.text += data if self.is_inside else ""

    def handle_endtag(self, tag):
        self.is_inside = False


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

    def data(self, name, *arguments):
        """The data in a report that is written under the name, and what the program said of it."""
        code, text, messages = self.report(*arguments, "-o", name)
        self.assertEqual((code, messages), (FINDINGS, ""))
        path = self.stage.path(name)
        self.assertFalse(path.with_name(path.name + ".partial").exists())
        return json.loads(EmbeddedData(path.read_text(encoding="utf-8")).text), text

    def test_the_report_holds_the_collection(self):
        data, text = self.data("r\u00f6port.html", "collected.zip", "--key", "privateKey.pem")
        self.assertIn("r\u00f6port.html is written. Findings: ", text)
        documents = {path.stem: json.loads(path.read_text(encoding="utf-8"))
                     for path in self.stage.path("collected").glob("*.json")}
        self.assertEqual(data["source"], {"name": "collected.zip", "bytes": self.package.stat().st_size,
                                          "collectedAt": documents["collection_manifest"]["start"]})
        self.assertIn(documents["system_summary"]["System Name"], data["machine"])
        self.assertEqual(data["product"], "The product is not installed.")
        self.assertIn("product_information.json", [part["what"] for part in data["missing"]])
        tables = {table["id"]: table for table in data["tables"]}
        for table in data["tables"]:
            self.assertTrue(all(len(row) == len(table["columns"]) for row in table["rows"]), table["id"])
        processes = tables["processes"]
        ids = [column["id"] for column in processes["columns"]]
        rows = [dict(zip(ids, row)) for row in processes["rows"]]
        self.assertEqual([row["pid"] for row in rows], [p["ProcessId"] for p in documents["running_tasks"]["processes"]])
        self.assertTrue(any(rows[row["parentRow"]]["pid"] == row["parentPid"] for row in rows if row["parentRow"] is not None))
        gauge = next(gauge for gauge in data["gauges"] if gauge["name"] == "C:")
        self.assertLess(0, gauge["used"])
        self.assertLess(gauge["used"], gauge["total"])
        self.assertEqual([row[0] for row in tables["package"]["rows"] if row[0].endswith("/services.json")],
                         ["collected/services.json"] if "services" in documents else [])
        # The evidence of each finding stands in the row that it names.
        finding = next(f for f in data["findings"] if f["id"] == "product-not-installed")
        evidence = finding["evidence"][0]
        self.assertIn("product_information", tables[evidence["table"]]["rows"][evidence["row"]])

    def test_two_collections_are_compared(self):
        later = self.stage.path("later")
        shutil.copytree(self.stage.path("collected"), later)
        manifest = json.loads((later / "collection_manifest.json").read_text(encoding="utf-8"))
        manifest["start"] = "2099-01-01T00:00:00Z"
        (later / "collection_manifest.json").write_text(json.dumps(manifest), encoding="utf-8")
        (later / "installed_software.json").write_text('[{"Name": "Editor", "Version": "2"}]', encoding="utf-8")
        expected = ("added", "Installed software", "Editor")
        code, text, _ = self.report("later", "--compare", "collected.zip", "--key", "privateKey.pem")
        self.assertEqual(code, FINDINGS)
        self.assertIn("  - added: Installed software: Editor, 2\n", text)
        code, text, _ = self.report("--json", "collected.zip", "--compare", "later", "--key", "privateKey.pem")
        comparison = json.loads(text)["comparison"]
        self.assertEqual((comparison["otherIsOlder"], comparison["warnings"]), (False, []))
        self.assertIn(expected, [(c["kind"], c["table"], c["item"]) for c in comparison["changes"]])
        data, _ = self.data("changes.html", "later", "--compare", "collected")
        self.assertEqual(data["tables"][0]["id"], "changes")
        self.assertIn(expected, [tuple(row[:3]) for row in data["tables"][0]["rows"]])
        self.assertEqual(data["comparison"]["changes"], len(data["tables"][0]["rows"]))
        self.assertEqual(data["comparison"]["with"]["name"], "collected")

    def test_what_cannot_be_opened_says_why(self):
        self.stage.path("garbage").write_bytes(bytes(range(256)) * 40)
        with zipfile.ZipFile(self.stage.path("plain2.zip"), "w") as archive:
            archive.writestr("collection_manifest.json", "{}")
        self.stage.path("cut").write_bytes(self.package.read_bytes()[:100])
        rows = (
            (("collected.zip", "--key", "other.pem"), WRONG_KEY, "does not open the package"),
            (("collected.zip",), BAD_INPUT, "--key FILE"),
            (("garbage", "--key", "privateKey.pem"), BAD_INPUT, "neither a package nor a zip archive"),
            (("cut", "--key", "privateKey.pem"), BAD_INPUT, "neither a package nor a zip archive"),
            (("collected", "-o", "no/such/folder/r.html"), BAD_INPUT, "cannot be written, error 3"),
            (("collected", "-o", "logs"), BAD_INPUT, "is a folder"),
            (("plain2.zip", "-o", "PLAIN2.zip"), BAD_INPUT, "which is read"),
            (("collected", "--compare", "logs"), BAD_INPUT, "logs holds no collection"),
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
