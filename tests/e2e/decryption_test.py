"""The decrypt job on bad input: a clear line, no output file, and an older one stays."""
import subprocess
import unittest

from support_tool import ProgramTest, read_archive


class Decryption(ProgramTest):
    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.stage.collect("nocs", "noda")
        cls.package = cls.stage.path("collected.zip").read_bytes()

    def decrypt(self, *options, package=None):
        """The log of one run; the package is put under the default name first."""
        self.stage.path("collected.zip").write_bytes(self.package if package is None else package)
        return self.stage.run("nogui", "decrypt", *options)

    def test_named_files_are_used(self):
        out = "\u00f6ffnen \u6771.zip"
        self.stage.path("k.pem").write_bytes(self.stage.path("privateKey.pem").read_bytes())
        self.stage.path("p.bin").write_bytes(self.package)
        self.assertReturnCode(self.stage.run("nogui", "d", "i=p.bin", "pk=k.pem", f"o={out}"), 1)
        self.assertIn("collected/system_summary.json", read_archive(self.stage.path(out)))

    def test_what_cannot_be_opened_leaves_an_older_output_alone(self):
        wrong = self.stage.path("wrong.pem")
        subprocess.run(["openssl", "genrsa", "-traditional", "-out", wrong, "1024"], check=True, capture_output=True)
        (self.stage.path("big.pem")).write_bytes(b"x" * 100_000)
        (self.stage.path("no.pem")).write_bytes(b"no key")
        out = self.stage.path("collected_decrypted.zip")
        out.write_text("older")
        rows = (
            (("in=absent.zip",), None, "cannot read absent.zip, error 2"),
            (("pk=absent.pem",), None, "cannot read absent.pem, error 2"),
            (("pk=big.pem",), None, "cannot read big.pem, error 223"),
            (("pk=no.pem",), None, "Decryption failed with code"),
            (("pk=wrong.pem",), None, "Decryption failed with code"),
            ((), b"", "Decryption failed with code"),
            ((), self.package[:7], "Decryption failed with code"),
            ((), self.package[:100], "Decryption failed with code"),
            ((), b"\xff" * 8 + self.package[8:], "Decryption failed with code"),
            (("in=",), None, "cannot read "),
            (("out=absent\\x.zip",), None, "cannot write absent\\x.zip, error 3"),
            (("out=logs",), None, "cannot write logs, error 5"),
        )
        before = set(self.stage.left()) | {"collected.zip"}
        for options, package, text in rows:
            with self.subTest(options=options, text=text):
                log = self.decrypt(*options, package=package)
                self.assertInOrder(log, text, "Return code 0")
                self.assertEqual(out.read_text(), "older")
                self.assertEqual(set(self.stage.left()), before)


if __name__ == "__main__":
    unittest.main()
