#!/usr/bin/env python3
"""Opens an encrypted package without any of the program's code: the Python standard library and the openssl command.

usage: open_package.py PACKAGE PRIVATE_KEY OUT

A package is the length of the wrapped session key (8 bytes, little-endian), the wrapped session key (a CryptoAPI
SIMPLEBLOB), and the archive encrypted with RC4. Prints one line and exits with 1 when it cannot be opened.
"""
import pathlib
import struct
import subprocess
import sys

SIMPLEBLOB, BLOB_VERSION, CALG_RC4, CALG_RSA_KEYX = 1, 2, 0x6801, 0xA400
BLOB_HEADER_SIZE = 12
SESSION_KEY_SIZE = 5  # 40 bits
SALT = bytes(11)


class PackageError(Exception):
    """The file is not a package for this key; the text says why."""


def openssl(*arguments, data):
    result = subprocess.run(["openssl", *map(str, arguments)], input=data, capture_output=True, check=False)
    if result.returncode != 0:
        raise PackageError(f"openssl {arguments[0]}: {result.stderr.decode(errors='replace').strip()}")
    return result.stdout


def split_package(package):
    """The key blob and the cipher text."""
    if len(package) < 8:
        raise PackageError(f"{len(package)} bytes are no package")
    (length,) = struct.unpack_from("<Q", package)
    if length > len(package) - 8:
        raise PackageError(f"the wrapped key claims {length} bytes, the package has {len(package) - 8} left")
    return package[8 : 8 + length], package[8 + length :]


def session_key(key_blob, private_key):
    """Unwraps the session key with the private key file (PEM)."""
    if len(key_blob) < BLOB_HEADER_SIZE:
        raise PackageError(f"a wrapped key of {len(key_blob)} bytes")
    header = struct.unpack_from("<BBHII", key_blob)
    if header != (SIMPLEBLOB, BLOB_VERSION, 0, CALG_RC4, CALG_RSA_KEYX):
        raise PackageError(f"the wrapped key begins with {header}")
    wrapped = key_blob[BLOB_HEADER_SIZE:][::-1]  # CryptoAPI has the number's lowest byte first
    key = openssl("pkeyutl", "-decrypt", "-inkey", private_key, "-pkeyopt", "rsa_padding_mode:oaep", data=wrapped)
    if len(key) != SESSION_KEY_SIZE:
        raise PackageError(f"a session key of {len(key)} bytes")
    return key


def open_package(package, private_key):
    """The archive in the package (bytes) for the private key file (path)."""
    key_blob, cipher_text = split_package(package)
    key = session_key(key_blob, private_key) + SALT
    if not cipher_text:
        return b""
    return openssl("enc", "-d", "-rc4", "-K", key.hex(), "-provider", "legacy", "-provider", "default",
                   data=cipher_text)


def main(arguments):
    if len(arguments) != 3:
        print(__doc__.split("\n\n")[1], file=sys.stderr)
        return 2
    package, private_key, out = map(pathlib.Path, arguments)
    try:
        plain = open_package(package.read_bytes(), private_key)
        out.write_bytes(plain)
    except (PackageError, OSError) as error:
        print(f"open_package.py: {error}", file=sys.stderr)
        return 1
    print(f"{len(plain)} bytes")
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
