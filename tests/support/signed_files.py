#!/usr/bin/env python3
"""Makes executables with and without good signatures, with the openssl and osslsigncode command lines.

usage: signed_files.py PROGRAM FOLDER

    trusted_ca.der      the authority that a test may trust
    trusted.exe         PROGRAM, signed by that authority
    tampered.exe        the same with one byte changed afterwards
    untrusted.exe       PROGRAM, signed by an authority that nobody trusts
    unsigned.exe        PROGRAM as it is

The certificates are issued with SHA-1: Wine 8 takes a chain of SHA-256 certificates for good without looking for its
root. The digests of the files are SHA-256.
"""
import pathlib
import shutil
import subprocess
import sys
import tempfile

DAYS = "3650"  # as long as a build folder may live


def run(*command):
    done = subprocess.run(command, stdin=subprocess.DEVNULL, capture_output=True, text=True, check=False)
    if done.returncode != 0:
        raise RuntimeError(f"{command[0]} {command[1]} failed: {done.stdout}{done.stderr}")


def make_signer(scratch, name):
    """An authority and a certificate of it to sign code with."""
    ca, signer = scratch / f"{name}_ca", scratch / name
    run("openssl", "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-sha1", "-days", DAYS,
        "-subj", f"/CN=Support tool tests {name}", "-addext", "keyUsage=critical,keyCertSign,cRLSign",
        "-keyout", f"{ca}.key", "-out", f"{ca}.pem")
    run("openssl", "req", "-newkey", "rsa:2048", "-nodes", "-subj", f"/CN=Support tool tests {name} signer",
        "-keyout", f"{signer}.key", "-out", f"{signer}.csr")
    extensions = scratch / f"{name}.ext"
    extensions.write_text("basicConstraints=CA:FALSE\nkeyUsage=digitalSignature\nextendedKeyUsage=codeSigning\n",
                          encoding="utf-8")
    run("openssl", "x509", "-req", "-sha1", "-days", DAYS, "-in", f"{signer}.csr", "-CA", f"{ca}.pem",
        "-CAkey", f"{ca}.key", "-CAcreateserial", "-extfile", str(extensions), "-out", f"{signer}.pem")
    return ca, signer


def sign(program, signer, ca, signed):
    signed.unlink(missing_ok=True)  # it is not replaced
    run("osslsigncode", "sign", "-h", "sha256", "-certs", f"{signer}.pem", "-key", f"{signer}.key", "-ac", f"{ca}.pem",
        "-in", str(program), "-out", str(signed))


def make_signed_files(program, folder):
    folder.mkdir(parents=True, exist_ok=True)
    with tempfile.TemporaryDirectory() as scratch_name:
        scratch = pathlib.Path(scratch_name)
        for name in ("trusted", "untrusted"):
            ca, signer = make_signer(scratch, name)
            sign(program, signer, ca, folder / f"{name}.exe")
        run("openssl", "x509", "-in", str(scratch / "trusted_ca.pem"), "-outform", "DER",
            "-out", str(folder / "trusted_ca.der"))
    shutil.copyfile(program, folder / "unsigned.exe")
    tampered = bytearray((folder / "trusted.exe").read_bytes())
    tampered[0x1000] ^= 1  # in the code
    (folder / "tampered.exe").write_bytes(tampered)


if __name__ == "__main__":
    if len(sys.argv) != 3:
        sys.exit(__doc__)
    make_signed_files(pathlib.Path(sys.argv[1]), pathlib.Path(sys.argv[2]))
