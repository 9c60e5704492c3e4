#!/usr/bin/env python3
"""Checks with Python's own reader that a zip archive is sound and holds exactly the files of a folder.

usage: verify_archive.py ARCHIVE FOLDER      exit status 0 when it does; else says what is wrong
"""
import os
import sys
import time
import zipfile


def expected_entries(folder):
    parent = os.path.dirname(os.path.abspath(folder))
    for root, _, names in os.walk(folder):
        for name in names:
            path = os.path.join(root, name)
            stat = os.stat(path)
            yield os.path.relpath(path, parent), (stat.st_size, time.localtime(stat.st_mtime)[:5])


def verify(archive, folder):
    with zipfile.ZipFile(archive) as opened:
        if (damaged := opened.testzip()) is not None:
            return f"{damaged} is damaged"
        entries = {info.filename: (info.file_size, info.date_time[:5]) for info in opened.infolist()}
    expected = dict(expected_entries(folder))
    for name in sorted(entries.keys() ^ expected.keys()):
        return f"{name} is {'not a file' if name in entries else 'missing'}"
    for name in sorted(name for name in entries if entries[name] != expected[name]):
        return f"{name} has size and time {entries[name]}, not {expected[name]}"
    return None


if __name__ == "__main__":
    if len(sys.argv) != 3:
        sys.exit(__doc__)
    if (problem := verify(*sys.argv[1:])) is not None:
        sys.exit(f"{sys.argv[1]}: {problem}")
