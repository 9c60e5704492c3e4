#!/usr/bin/env python3
"""Makes the files that the benchmarks pack, the same bytes on every machine.

usage: make_corpus.py FOLDER      makes the folders below in FOLDER; what is complete already is kept.

mixed   400 files, 50 MiB together, as a support collection has them: collectors' JSON, logs, some that do not compress
small   10,000 files, 38 MiB together
big     one log of 50 MiB
pe      600 files of the sizes that executables and libraries have, 600 MiB together
"""
import itertools
import os
import random
import shutil
import sys

MIB = 1 << 20
FIRST_TIME = 1_700_000_000  # the newest file; each next one is a minute older

MODULES = [f"{stem}{kind}" for stem in ("kernel", "user", "crypt", "net", "shell", "engine", "scan", "update", "filter",
                                        "comm", "policy", "cache", "event", "proxy", "sync", "quarantine")
           for kind in ("32.dll", "core.dll", "api.dll", "svc.exe", "ui.exe", "drv.sys")]
LEVELS = ("INFO ", "INFO ", "INFO ", "TRACE", "TRACE", "WARN ", "ERROR")


class Language:
    """Words of made-up syllables and messages made of them, used as such things are: the n-th most common one n times
    less often than the first."""

    def __init__(self, rng):
        syllables = [c + v + e for c in "bcdfghklmnprstvz" for v in "aeiou" for e in ("", "n", "r", "s", "t", "l")]
        self.words = ["".join(rng.choices(syllables, k=rng.choice((1, 2, 2, 3, 3, 4)))) for _ in range(8000)]
        self.word_weights = self.falling_weights(len(self.words))
        self.messages = [self.sentence(rng, 3, 14) for _ in range(3000)]
        self.message_weights = self.falling_weights(len(self.messages))

    @staticmethod
    def falling_weights(count):
        return list(itertools.accumulate(1 / (rank + 2.7) for rank in range(count)))

    def sentence(self, rng, low, high):
        return " ".join(rng.choices(self.words, cum_weights=self.word_weights, k=rng.randrange(low, high)))

    def message(self, rng):
        return rng.choices(self.messages, cum_weights=self.message_weights)[0]


LANGUAGE = Language(random.Random(0))


def path(rng):
    return f"C:\\Program Files\\Vendor\\{LANGUAGE.sentence(rng, 1, 3)}\\{rng.choice(MODULES)}"


def log_text(rng, size):
    parts, length, clock = [], 0, rng.randrange(86_400_000)
    while length < size:
        clock += int(rng.expovariate(1 / 40))
        seconds, millis = divmod(clock, 1000)
        line = (f"2023-11-14 {seconds // 3600 % 24:02}:{seconds // 60 % 60:02}:{seconds % 60:02}.{millis:03} "
                f"[{rng.randrange(2000, 2400)}] {rng.choice(LEVELS)} {rng.choice(MODULES)}: "
                f"{LANGUAGE.message(rng)}\r\n")
        if rng.random() < 0.2:
            line = line[:-2] + f" [{path(rng)}] 0x{rng.getrandbits(32):08x}\r\n"
        parts.append(line)
        length += len(line)
    return "".join(parts).encode()[:size]


def json_text(rng, size):
    parts, length = ["{\n   \"items\" : [\n"], 0
    while length < size:
        name = rng.choice(MODULES)
        item = (f"      {{\n         \"company\" : \"Vendor Corporation\",\n"
                f"         \"description\" : \"{LANGUAGE.message(rng)}\",\n"
                f"         \"handles\" : {rng.randrange(2000)},\n"
                f"         \"md5\" : \"{rng.getrandbits(128):032x}\",\n         \"name\" : \"{name}\",\n"
                f"         \"path\" : \"C:\\\\Windows\\\\System32\\\\{name}\",\n"
                f"         \"pid\" : {rng.randrange(4, 30000, 4)},\n"
                f"         \"signed\" : {rng.choice(('true', 'false'))},\n         \"size\" : {rng.randrange(4_000_000)}\n"
                f"      }},\n")
        parts.append(item)
        length += len(item)
    return "".join(parts).encode()[:size]


def noise(rng, size):
    return rng.randbytes(size)


def sizes(rng, count, total, spread):
    """`count` sizes with a long tail that add up to exactly `total`."""
    weights = [rng.lognormvariate(0, spread) for _ in range(count)]
    scale = (total - count) / sum(weights)
    result = [1 + int(weight * scale) for weight in weights]
    result[0] += total - sum(result)
    return result


def write(path, content, index):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    with open(path, "wb") as file:
        file.write(content)
    os.utime(path, (FIRST_TIME - 60 * index,) * 2)


def make_mixed(folder):
    rng = random.Random(1)
    for index, size in enumerate(sizes(rng, 400, 50 * MIB, 1.2)):
        kind = index % 20  # of 20 files: 8 JSON, 11 logs, 1 that does not compress
        if kind < 8:
            write(f"{folder}/collector_{index}.json", json_text(rng, size), index)
        elif kind < 19:
            write(f"{folder}/logs/{MODULES[index % 16]}/product_{index}.log", log_text(rng, size), index)
        else:
            write(f"{folder}/dumps/memory_{index}.bin", noise(rng, size), index)


def make_small(folder):
    rng = random.Random(2)
    for index, size in enumerate(sizes(rng, 10_000, 38 * MIB, 0.8)):
        make = json_text if index % 3 == 0 else log_text
        write(f"{folder}/part_{index // 250:02}/file_{index}.txt", make(rng, size), index)


def make_big(folder):
    write(f"{folder}/product.log", log_text(random.Random(3), 50 * MIB), 0)


def make_pe(folder):
    rng = random.Random(4)
    for index, size in enumerate(sizes(rng, 600, 600 * MIB, 1.2)):
        write(f"{folder}/{index // 100}/module_{index}.{'exe' if index % 5 == 0 else 'dll'}", (b"MZ" + noise(rng, size))[:size], index)


CORPORA = {"mixed": make_mixed, "small": make_small, "big": make_big, "pe": make_pe}


def make_corpus(root, name):
    """Returns the folder of that corpus."""
    folder, stamp = f"{root}/{name}", f"{root}/{name}.complete"
    if not os.path.exists(stamp):
        shutil.rmtree(folder, ignore_errors=True)
        CORPORA[name](folder)
        open(stamp, "w").close()
    return folder


if __name__ == "__main__":
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    for corpus in CORPORA:
        make_corpus(sys.argv[1], corpus)
