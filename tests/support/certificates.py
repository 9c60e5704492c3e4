#!/usr/bin/env python3
"""Makes the certificates that TLS tests need, with the openssl command line.

usage: certificates.py FOLDER

    ca.pem, ca.der      the test CA: what a client under test trusts
    localhost.pem       a good certificate for "localhost" and 127.0.0.1
    expired.pem         the same, over since yesterday
    other_host.pem      the same CA, but for "elsewhere.invalid"
    untrusted.pem       for "localhost", from a CA that nobody trusts

Each server certificate has its key beside it (NAME.key). Nothing here outlives a month or guards anything.
"""
import datetime
import pathlib
import subprocess
import sys

SERVERS = {  # name: (CA, name of the host, days until it is over)
    "localhost": ("ca", "localhost", 30),
    "expired": ("ca", "localhost", -1),
    "other_host": ("ca", "elsewhere.invalid", 30),
    "untrusted": ("other_ca", "localhost", 30),
}

# `openssl ca` because only it can date a certificate back.
CA_CONFIGURATION = """
[ca]
default_ca = test
[test]
database = index.txt
new_certs_dir = .
rand_serial = yes
default_md = sha256
unique_subject = no
policy = any
[any]
commonName = supplied
"""


def _openssl(folder, *arguments):
    done = subprocess.run(["openssl", *arguments], cwd=folder, stdin=subprocess.DEVNULL, capture_output=True, text=True,
                          check=False)
    if done.returncode != 0:
        raise RuntimeError(f"openssl {arguments[0]} failed: {done.stderr}")


def _make_ca(folder, name):
    _openssl(folder, "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-sha256", "-days", "30",
             "-subj", f"/CN=Support tool tests {name}", "-addext", "keyUsage=critical,keyCertSign,cRLSign",
             "-keyout", f"{name}.key", "-out", f"{name}.pem")


def _make_server(folder, name, ca, host, days):
    addresses = f"DNS:{host}" + (",IP:127.0.0.1" if host == "localhost" else "")
    (folder / f"{name}.ext").write_text(f"subjectAltName={addresses}\nbasicConstraints=CA:FALSE\n"
                                        "keyUsage=digitalSignature,keyEncipherment\nextendedKeyUsage=serverAuth\n",
                                        encoding="utf-8")
    _openssl(folder, "req", "-newkey", "rsa:2048", "-nodes", "-subj", f"/CN={host}",
             "-keyout", f"{name}.key", "-out", f"{name}.csr")
    now = datetime.datetime.now(datetime.timezone.utc)
    begin, end = (f"{now + datetime.timedelta(days=shift):%Y%m%d%H%M%SZ}" for shift in (-20, days))
    _openssl(folder, "ca", "-batch", "-notext", "-config", "ca.cnf", "-cert", f"{ca}.pem", "-keyfile", f"{ca}.key",
             "-extfile", f"{name}.ext", "-startdate", begin, "-enddate", end, "-in", f"{name}.csr",
             "-out", f"{name}.pem")


def make_certificates(folder):
    """Fills the folder (made if missing) and returns its path."""
    folder = pathlib.Path(folder)
    folder.mkdir(parents=True, exist_ok=True)
    (folder / "ca.cnf").write_text(CA_CONFIGURATION, encoding="utf-8")
    (folder / "index.txt").write_text("", encoding="utf-8")
    for ca in ("ca", "other_ca"):
        _make_ca(folder, ca)
    _openssl(folder, "x509", "-in", "ca.pem", "-outform", "DER", "-out", "ca.der")
    for name, (ca, host, days) in SERVERS.items():
        _make_server(folder, name, ca, host, days)
    return folder


if __name__ == "__main__":
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    make_certificates(sys.argv[1])
