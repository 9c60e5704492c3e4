#!/usr/bin/env python3
"""Starts the receiving server on loopback with a certificate made for the occasion, and says how to upload to it.

usage: tools/ingest/start_local.py FOLDER [--port N]

The folder holds the certificates and what is received; it stays. The server ends with Ctrl-C.
"""
import argparse
import pathlib
import subprocess
import sys

PROJECT = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(PROJECT / "tests/support"))

from certificates import make_certificates  # noqa: E402


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("folder", type=pathlib.Path)
    parser.add_argument("--port", type=int, default=8443)
    options = parser.parse_args()
    folder = options.folder.resolve()
    certificates = folder / "certificates"
    if not (certificates / "localhost.pem").exists():
        make_certificates(certificates)
    ca = "Z:" + str(certificates / "ca.pem").replace("/", "\\\\")
    print(f"""   in qxlink.json beside the program:
      "endpoint": "https://localhost:{options.port}/files",
      "ca_file": "{ca}"
   receipts appear in {folder}/receipts; Ctrl-C ends the server
""", flush=True)
    command = ["node", str(PROJECT / "tools/ingest/server.js"), "--folder", str(folder), "--port", str(options.port),
               "--cert", str(certificates / "localhost.pem"), "--key", str(certificates / "localhost.key")]
    try:
        return subprocess.run(command, check=False).returncode
    except KeyboardInterrupt:
        return 0


if __name__ == "__main__":
    sys.exit(main())
