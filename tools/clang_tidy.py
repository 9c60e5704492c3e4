#!/usr/bin/env python3
"""clang-tidy over the sources that the cross build compiles, and over those that only the native build does:
clang_tidy.py BUILD_FOLDER NATIVE_BUILD_FOLDER [FILE…]

Most of clang-tidy's time goes into windows.h, the C++ library and GoogleTest, which it parses and searches anew for every
source. Sources are therefore checked in groups: one translation unit that includes several of them. Sources that
declare the same local name do not go into one group, and what keeps a group from compiling is checked by itself. A group
that has not changed since it passed is not checked again.
"""

import concurrent.futures
import hashlib
import json
import os
import pathlib
import re
import shlex
import subprocess
import sys

ROOT = pathlib.Path(__file__).resolve().parent.parent
FILES_IN_A_GROUP = 16
# What clang does not find or know by itself.
TOOLCHAIN = sorted(pathlib.Path('/usr/lib/gcc/x86_64-w64-mingw32').glob('*-posix/include/c++'))[-1]
CROSS_OPTIONS = ['--target=x86_64-w64-mingw32', '-nostdinc++', f'-isystem{TOOLCHAIN}', f'-isystem{TOOLCHAIN}/x86_64-w64-mingw32',
                 '-Wno-unknown-warning-option', '-Wno-unused-command-line-argument']
# The path-sensitive analyser takes most of the time and finds little in tests.
TEST_CHECKS = '--checks=-clang-analyzer-*'
# What every program, library or fuzz target defines for itself.
ENTRY_POINTS = ('wmain', 'main', 'DllMain', 'FuzzOne')


def is_test(path):
    return path.endswith('_test.cpp') or path.startswith('tests/')


def is_native(path):
    return path.startswith(('tests/fuzz/', 'tests/native/'))


def kind(path):
    """Only sources of one kind share a unit."""
    return is_native(path), is_test(path)


def tracked(*patterns):
    command = ['git', 'ls-files', '--cached', '--others', '--exclude-standard', '--', *patterns]
    listed = subprocess.run(command, cwd=ROOT, check=True, capture_output=True, text=True).stdout.split('\n')
    return sorted(path for path in listed if path and (ROOT / path).exists())


def compile_options(build, toolchain_options):
    """Source (relative) -> the options of its compile command. A source of several targets has those of the first."""
    options = {}
    for entry in json.loads((build / 'compile_commands.json').read_text()):
        path = os.path.relpath(entry['file'], ROOT)
        if not path.endswith('.cpp'):
            continue
        words = shlex.split(entry['command'])
        words = [word for word in words[:words.index('-o')] if word != '-c']
        first = next(index for index, word in enumerate(words) if word.startswith('-'))
        # One word each, so that the options of several sources can be put together.
        words = '\n'.join(words[first:]).replace('-isystem\n', '-isystem').split('\n')
        options.setdefault(path, words + toolchain_options)
    return options


def local_names(text):
    """The names that would meet those of another source in the same translation unit: what unnamed namespaces hold,
    macros, tests. clang-format keeps all of these at the start of a line."""
    names = set(re.findall(r'^#define (\w+)', text, re.M))
    names.update(re.findall(r'^TEST\w*\((\w+, \w+)\)', text, re.M))
    for body in re.findall(r'^namespace \{$(.*?)^\}  // namespace$', text, re.M | re.S):
        for line in re.findall(r'^(?!TEST|MATCHER|namespace|static_assert)[A-Za-z].*', body, re.M):
            if line.startswith('using ') and '=' not in line:
                continue
            name = re.match(r'(?:struct|class|enum class|enum|union|using)\s+(\w+)', line) or re.search(r'(\w+)\s*[({=;[]', line)
            if name:
                names.add(name.group(1))
    return names


def groups(files):
    """First fit: as few groups as the names allow."""
    found = []
    for path in files:
        names = local_names((ROOT / path).read_text(encoding='utf-8'))
        for group in found:
            if group['kind'] == kind(path) and len(group['files']) < FILES_IN_A_GROUP and not names & group['names']:
                break
        else:
            group = {'kind': kind(path), 'files': [], 'names': set()}
            found.append(group)
        group['files'].append(path)
        group['names'] |= names
    return [group['files'] for group in found]


def as_part(path, number):
    """A source as part of a unit."""
    lines = [f'#define {name} {name}{number}' for name in ENTRY_POINTS]
    lines.append(f'#include "{path}"  // NOLINT(bugprone-suspicious-include)')
    lines += [f'#undef {name}' for name in ENTRY_POINTS]
    return '\n'.join(lines) + '\n'


class Checker:
    def __init__(self, build, options):
        self.options = options
        self.folder = build / 'lint'
        self.folder.mkdir(parents=True, exist_ok=True)
        outside = [ROOT / '.clang-tidy', pathlib.Path(__file__), *(ROOT / path for path in tracked('*.h'))]
        self.headers = hashlib.sha256(b''.join(path.read_bytes() for path in outside)).digest()

    def check(self, files):
        """Whether the files, as one translation unit, have no findings."""
        text = b''.join((ROOT / path).read_bytes() for path in files)
        name = hashlib.sha256(self.headers + '\n'.join(files).encode() + text).hexdigest()[:40]
        stamp = self.folder / name
        if stamp.exists():
            return True
        # The options that differ between targets (folders of libraries, what is exported) do not disturb each other.
        options = dict.fromkeys(option for path in files for option in self.options[path])
        run = self.run(files, name, options, [TEST_CHECKS] if is_test(files[0]) else [])
        # Some of what only the company of others brings about is no error to the compiler, but a warning that counts as one.
        failed = re.findall(r'^(.*?):\d+:\d+: error: .*\[clang-diagnostic-', run.stdout, re.M)
        if len(files) > 1 and failed:
            alone = [path for path in files if str(ROOT / path) in failed]
            others = [path for path in files if path not in alone]
            parts = [[path] for path in alone or files] + ([others] if alone and others else [])
            return all([self.check(part) for part in parts])
        if run.returncode != 0:
            print(run.stdout, run.stderr, 'lint: ' + ' '.join(files), sep='\n', file=sys.stderr, flush=True)
            return False
        stamp.touch()
        return True

    def run(self, files, name, options, checks=()):
        source = ROOT / files[0]
        if len(files) > 1:
            # By this name the path-sensitive analyser knows that what the source includes is not a header.
            source = self.folder / f'UnifiedSource-{name}.cpp'
            source.write_text(''.join(as_part(path, number) for number, path in enumerate(files)))
        try:
            command = ['clang-tidy', '--quiet', *checks, str(source), '--', *options]
            return subprocess.run(command, cwd=ROOT, capture_output=True, text=True)
        finally:
            if len(files) > 1:
                source.unlink()

    def finds_planted_faults(self):
        """Whether checking in groups sees what checking alone does, with this clang-tidy too."""
        planted = {'first': ('int First(bool some) { int x = 0; int* p = nullptr; if (some) p = &x; return *p; }\n', 'NullDereference'),
                   'second': ('long long Second(int a, int b) { return a * b; }\n', 'implicit-widening')}
        files = [self.folder / f'planted_{name}.cpp' for name in planted]
        for path, (text, _) in zip(files, planted.values()):
            path.write_text(text)
        found = self.run(files, 'planted', CROSS_OPTIONS, ['--header-filter=.*']).stdout
        for path in files:
            path.unlink()
        return all(check in found for _, check in planted.values())


def main():
    build, native = (pathlib.Path(path).resolve() for path in sys.argv[1:3])
    options = compile_options(build, CROSS_OPTIONS)
    options |= {path: words for path, words in compile_options(native, []).items() if is_native(path)}
    files = [os.path.relpath(path, ROOT) for path in sys.argv[3:]] or tracked('*.cpp')
    units = groups([path for path in files if path in options])
    print(f'== clang-tidy over {len(files)} files, {len(units)} units', flush=True)
    checker = Checker(build, options)
    if not checker.finds_planted_faults():
        sys.exit('lint: this clang-tidy does not find faults in groups of sources')
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        passed = list(pool.map(checker.check, units))
    sys.exit(0 if all(passed) else 1)


if __name__ == '__main__':
    main()
