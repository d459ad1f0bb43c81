#!/usr/bin/env python3
"""Counts what the ARM build executes for an operation, under the emulator.

  count.py table [ROW...]    counts ours and the available peers, and prints a table
  count.py page              counts the same, and writes the table to docs/performance.md
  count.py record            counts ours, and writes the record bench/device/counts.txt
  count.py check             counts ours, and fails if a count exceeds the record

Counts instructions, barriers and exclusive loads of the programs in build/arm. Used by script/count and script/check.
"""
import datetime
import os
import subprocess
import sys
from pathlib import Path

ARM, CLANG, TOP = Path('build/arm'), Path('build/arm-clang'), Path('build/device')
SYSROOT = '/usr/arm-linux-gnueabihf'
PEERS = Path('build/device/root').absolute()
RECORD = Path('bench/device/counts.txt')
RENEW = 'script/count --record updates the record'
KINDS = ('instructions', 'barriers', 'exclusive loads')


class Row:
    """A row. The goal is the maximum of instructions and barriers; peers are (contender, label)."""

    def __init__(self, name, program, title, goal, *peers, turns=4096):
        self.name, self.program, self.title, self.goal = name, program, title, goal
        self.peers, self.turns = peers, turns


CRC_PEERS = (('av_crc', 'av_crc'), ('boost', 'boost::crc'), ('dvbpsi', 'libdvbpsi'),
             ('limit', 'limit: 16 tables inlined'))
ROWS = [
    Row('trace_off/one', 'trace', 'trace that is off', (26, 0), ('limit', 'limit: masked call')),
    Row('mutex/last', 'locks', 'mutex acquire + release by handle', (140, 4), ('bare', 'pthread mutex')),
    Row('semaphore/last', 'locks', 'semaphore signal + wait', (170, 4), ('bare', 'bare semaphore')),
    Row('message/same', 'messages', 'send + receive, same thread', (900, 20), ('gasync', 'GAsyncQueue'),
        ('limit', 'limit: mallocs, list, locks')),
    Row('byname', 'locks', 'mutex by name, 31st of 40', (350, 4)),
    Row('crc/12', 'crc', 'CRC-32, 12 bytes', (100, 0), *CRC_PEERS),
    Row('crc/184', 'crc', 'CRC-32, 184 bytes', (930, 0), *CRC_PEERS),
    Row('crc/4096', 'crc', 'CRC-32, 4096 bytes', (19400, 0), *CRC_PEERS, turns=512),
    Row('ring/one', 'ring', 'ring, 188 bytes in and out', (520, 8), ('limit', 'limit: memcpy, mutex')),
    Row('bits', 'bits', '1200 bit fields of PSI', (38000, 0), ('gstreamer', 'gst_bit_reader'),
        ('limit', 'limit: checked reader'), turns=512),
    Row('text/32', 'text', 'Latin-15 to UTF-8, 32 bytes', (800, None)),
    Row('text/4096', 'text', 'Latin-15 to UTF-8, 4096 bytes', (33000, None), turns=512),
    Row('calendar/to', 'time', 'seconds to calendar', (200, 0), ('libc', 'gmtime_r'), ('limit', 'limit: chrono')),
    Row('calendar/from', 'time', 'calendar to seconds', (45, 0), ('libc', 'timegm'), ('limit', 'limit: chrono')),
]


def chosen(prefixes):
    rows = [row for row in ROWS if not prefixes or any(row.name.startswith(prefix) for prefix in prefixes)]
    return rows or sys.exit(f'no such row: {" ".join(prefixes)}')


# Counting -------------------------------------------------------------------------------------------


def build_plugin():
    subprocess.run(['gcc', '-O2', '-Wall', '-Wextra', '-Wpedantic', '-Werror', '-shared', '-fPIC', '-fvisibility=hidden',
                    '-o', TOP / 'count.so', 'bench/device/count.c'], check=True)


def count(row, contender, library=ARM):
    """Returns the average counts of an operation between the marks of a run; None when the run fails."""
    out = TOP / 'count.txt'
    out.unlink(missing_ok=True)
    paths = [library.absolute() / 'lib', *(PEERS / top / 'lib/arm-linux-gnueabihf' for top in ('usr', '.'))]
    run = subprocess.run(
        ['setarch', '-R', 'qemu-arm', '-plugin', f'{TOP}/count.so,out={out}', '-L', SYSROOT,
         ARM / 'bin' / f'bench_{row.program}', f'{row.name}:{contender}', str(row.turns)],
        env={'PATH': os.environ['PATH'], 'LD_LIBRARY_PATH': ':'.join(map(str, paths))},
        stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.PIPE, text=True, check=False)
    if run.returncode == 0 and out.exists():
        return tuple(round(int(executed) / row.turns) for executed in out.read_text().split())
    print(f'{row.name}:{contender} failed: {run.stderr}', file=sys.stderr)
    return None


def count_all(wanted):
    """Counts each (row, contender, library), one after the other because the programs share a directory."""
    return {key: count(*key) for key in wanted}


def of_ours():
    counts = count_all([(row, 'ours', ARM) for row in ROWS])
    if None in counts.values():
        sys.exit('some rows could not be counted')
    return {row.name: numbers for (row, _, _), numbers in counts.items()}


# The record -----------------------------------------------------------------------------------------


def check():
    recorded = {}
    for line in RECORD.read_text().splitlines():
        if not line.startswith('#'):
            name, *numbers = line.split()
            recorded[name] = tuple(map(int, numbers))
    counted = of_ours()
    if recorded.keys() != counted.keys():
        sys.exit(f'{RECORD} has other rows: {" ".join(recorded.keys() ^ counted.keys())}; {RENEW}')
    worse = [f'{name}: {kind} {now}, recorded {then}'
             for name in counted
             for kind, now, then, leave in zip(KINDS, counted[name], recorded[name], (1.02, 1, 1))
             if now > then * leave]
    if worse:
        sys.exit('\n'.join([*worse, f'The device would execute more than before. If that is intended, {RENEW}.']))
    print(f'{len(counted)} rows, none above {RECORD}')


def record(counted):
    RECORD.write_text('\n'.join([
        '# Counts of what the ARM build executes for an operation: instructions, barriers, exclusive loads.',
        '# script/count --record writes this file, script/check device compares.',
        *(f'{name:<16}{numbers[0]:>7}{numbers[1]:>4}{numbers[2]:>4}' for name, numbers in counted.items()), '']))


# The table ------------------------------------------------------------------------------------------


def shown(numbers):
    return 'not built' if numbers is None else f'{numbers[0]:,} / {numbers[1]}'.replace(',', ' ')


def size_of(library):
    """Returns the size of text and data, stripped."""
    stripped = TOP / f'{library.name}.so'
    subprocess.run(['arm-linux-gnueabihf-strip', '-o', stripped, library / 'lib/libvarnekutils_ltn.so'], check=True)
    sizes = subprocess.run(['arm-linux-gnueabihf-size', stripped], check=True, capture_output=True, text=True)
    text, data = sizes.stdout.splitlines()[1].split()[:2]
    return int(text) + int(data)


HEAD = ('operation', 'g++', 'clang', 'peer', 'its cost', 'ratio', 'goal', '')


def lines(prefixes):
    rows = chosen(prefixes)
    libraries = [library for library in (ARM, CLANG) if (library / 'lib/libvarnekutils_ltn.so').exists()]
    counts = count_all([(row, 'ours', library) for row in rows for library in libraries] +
                       [(row, contender, ARM) for row in rows for contender, _ in row.peers])
    for row in rows:
        ours = counts[row, 'ours', ARM]
        goal = row.goal[0], row.goal[1] if row.goal[1] is not None else ours[1]
        met = all(now <= most for now, most in zip(ours, goal))
        ends = [shown(ours), shown(counts.get((row, 'ours', CLANG))),
                '<= ' + (shown(goal) if row.goal[1] is not None else shown(goal).split(' /')[0]),
                'met' if met else '**missed**']
        for contender, label in row.peers or ((None, ''),):
            theirs = counts.get((row, contender, ARM))
            ratio = f'{ours[0] / theirs[0]:.2f}' if theirs else ''
            yield row.title, *ends[:2], label, shown(theirs) if label else '', ratio, *ends[2:]
    if not prefixes:
        sizes = [size_of(library) for library in libraries]
        yield ('text and data, stripped', *(f'{size:,} bytes'.replace(',', ' ') for size in sizes),
               *[''] * (5 - len(sizes)), '<= 98 304', 'met' if max(sizes) <= 96 * 1024 else '**missed**')


def named_once(table):
    last = None
    for line in table:
        yield ['', '', '', *line[3:6], '', ''] if line[0] == last else list(line)
        last = line[0]


def print_table(prefixes):
    table = list(named_once([HEAD, *lines(prefixes)]))
    widths = [max(len(line[i]) for line in table) for i in range(len(HEAD))]
    for fields in table:
        print('  '.join(f'{field:<{width}}' for field, width in zip(fields, widths)).rstrip())


def version_of(*command):
    return subprocess.run([*command, '--version'], capture_output=True, text=True, check=True).stdout.splitlines()[0]


def write_page():
    page = Path('docs/performance.md')
    begin, end = '<!-- counts: script/count --record -->', '<!-- end of counts -->'
    head, rest = page.read_text().split(begin, 1)
    section = [
        f'Counted on {datetime.date.today().isoformat()}: {version_of("arm-linux-gnueabihf-g++")}; '
        f'{version_of("clang++")}; {version_of("qemu-arm")}.', '',
        '| ' + ' | '.join(HEAD) + ' |', '|---' * len(HEAD) + '|',
        *('| ' + ' | '.join(field.replace('<= ', '≤ ') for field in fields) + ' |'
          for fields in named_once(lines([])))]
    page.write_text(head + begin + '\n' + '\n'.join(section) + '\n' + end + rest.split(end, 1)[1])


def main(arguments):
    TOP.mkdir(parents=True, exist_ok=True)
    build_plugin()
    match arguments:
        case ['table', *prefixes]:
            print_table(prefixes)
        case ['page']:
            write_page()
        case ['record']:
            record(of_ours())
        case ['check']:
            check()
        case _:
            sys.exit(__doc__)


main(sys.argv[1:])
