"""Defines the rows with their peers and goals, and measures them: times on a PC, counts of what the ARM build executes
under the emulator. script/bench builds the programs and describes the options."""
import datetime
import json
import os
import platform
import shutil
import statistics
import subprocess
import sys
import time
from pathlib import Path
from typing import NamedTuple


class Peer(NamedTuple):
    """What a row is compared with: another library, the library in another state, or, as 'bare', the least code that does
    the same work."""
    name: str
    title: str
    goal: float | None = None  # our time on a PC divided by the peer's, at most


class Row(NamedTuple):
    name: str
    area: str  # the program bench_AREA measures it
    title: str
    peers: tuple = ()
    device: tuple | None = None  # instructions and barriers on ARM, at most; a row without it is only timed
    turns: int = 4096  # a count is the average of this many operations
    wall: bool = False  # wall-clock time counts, because the operation waits for another thread or a timer


MESSAGE_LIST = 'mallocs, list, locks'
ROWS = [
    Row('trace_off/one', 'trace', 'trace that is off',
        (Peer('liblog', 'liblog, filtered', 0.6), Peer('bare', 'masked call', 1.6)), (26, 0)),
    Row('trace_off/two', 'trace', 'trace that is off, two threads',
        (Peer('liblog', 'liblog, filtered'), Peer('bare', 'masked call'))),
    Row('trace_on', 'trace', 'trace into nothing', (Peer('spdlog', 'spdlog, null sink', 1.0), Peer('bare', 'vsnprintf'))),
    Row('mutex/last', 'locks', 'mutex acquire + release by handle',
        (Peer('alone', 'the only mutex', 1.1), Peer('bare', 'pthread mutex', 1.6)), (140, 4)),
    Row('mutex/two', 'locks', 'the same, two threads, adjacent slots', (Peer('onethread', 'one thread', 1.5),)),
    Row('mutex/scoped', 'locks', 'mutex by std::lock_guard', (Peer('calls', 'the C calls'),), (138, 4)),
    Row('semaphore/last', 'locks', 'semaphore signal + wait',
        (Peer('alone', 'the only semaphore', 1.1), Peer('bare', 'sem_post, sem_wait', 3.0)), (170, 4)),
    Row('byname', 'locks', 'mutex by name, 31st of 40', (Peer('alone', 'the only mutex'),), (450, 4)),
    Row('message/same', 'messages', 'send + receive, same thread',
        (Peer('gasync', 'GAsyncQueue', 1.1), Peer('bare', MESSAGE_LIST, 2.0)), (900, 20)),
    Row('message/queued', 'messages', 'send + receive behind 1000000 messages', (Peer('empty', 'empty queue', 1.2),)),
    Row('message/typed', 'messages', 'send + receive of a type', (Peer('calls', 'the C calls'),), (685, 5)),
    Row('message/oneway', 'messages', 'message, one way',
        (Peer('gasync', 'GAsyncQueue', 0.9), Peer('bare', MESSAGE_LIST, 2.0)), wall=True),
    Row('message/pingpong1', 'messages', 'ping-pong on one core',
        (Peer('gasync', 'GAsyncQueue', 0.52), Peer('bare', MESSAGE_LIST, 2.0)), wall=True),
    Row('message/pingpong2', 'messages', 'ping-pong on two cores',
        (Peer('gasync', 'GAsyncQueue'), Peer('bare', MESSAGE_LIST, 2.0)), wall=True),
    Row('crc/12', 'crc', 'CRC-32, 12 bytes', (Peer('av_crc', 'av_crc', 1.1),), (100, 0)),
    Row('crc/184', 'crc', 'CRC-32, 184 bytes', (Peer('av_crc', 'av_crc', 0.55),), (930, 0)),
    Row('crc/4096', 'crc', 'CRC-32, 4096 bytes', (Peer('av_crc', 'av_crc', 0.55),), (19400, 0), turns=512),
    Row('ring/one', 'ring', 'ring, 188 bytes in and out', (Peer('bare', 'memcpy, mutex', 1.8),), (520, 8)),
    Row('ring/two', 'ring', 'ring, 188 bytes, two threads', (Peer('bare', 'memcpy, mutex'),), wall=True),
    Row('bits', 'bits', '1200 bit fields of PSI', (Peer('gstreamer', 'gst_bit_reader', 0.8),), (38000, 0), turns=512),
    Row('text/32', 'text', 'Latin-15 to UTF-8, 32 bytes', (Peer('iconv', 'iconv', 0.7),), (800, 0)),
    Row('text/4096', 'text', 'Latin-15 to UTF-8, 4096 bytes', (Peer('iconv', 'iconv', 0.5),), (33000, 8), turns=512),
    Row('calendar/to', 'time', 'seconds to calendar', (Peer('chrono', 'std::chrono', 1.3),), (200, 0)),
    Row('calendar/from', 'time', 'calendar to seconds', (Peer('chrono', 'std::chrono', 1.3),), (45, 0)),
    Row('timer', 'timer', 'timer start + cancel',
        (Peer('raw', 'timer_settime twice', 1.1), Peer('bare', 'asks first', 1.1))),
    *(Row(f'lateness/{state}_p{p}', 'lateness', f'lateness, {state}, p{p}',
          (Peer('raw', 'raw timer', 1.1), Peer('timerfd', 'timerfd')), wall=True)
      for state in ('idle', 'busy') for p in (50, 99)),
    Row('receiver', 'receiver', 'receiver, 512 MiB',
        (Peer('ffprobe', 'ffprobe, all packets', 1.0), Peer('programs', 'ffprobe, first programs', 1.0),
         Peer('bare', 'plain reading')), wall=True),
]

PC, ARM, CLANG = Path('build/release'), Path('build/arm'), Path('build/arm-clang')
RESULTS, TOP, PAGE = Path('build/bench'), Path('build/device'), Path('docs/performance.md')
PEERS, RECORD = Path('build/device/root').absolute(), Path('bench/device/counts.txt')
ARM_COMPILER = 'arm-linux-gnueabihf-g++'


def chosen(prefixes):
    rows = [row for row in ROWS if not prefixes or row.name.startswith(tuple(prefixes))]
    return rows or sys.exit(f'no such row: {" ".join(prefixes)}')


def output_of(*command):
    return subprocess.run(command, check=True, capture_output=True, text=True).stdout


# Tables ---------------------------------------------------------------------------------------------


def compared(peer, cost, ratio):
    """Returns the cells of a comparison. Bare code is a limit only where it is faster than the library."""
    kind = '' if peer.name != 'bare' or ratio is None else 'limit: ' if ratio >= 1 else 'baseline: '
    return kind + peer.title, cost, '' if ratio is None else f'{ratio:.2f}'


def blocks(table):
    """Yields the lines of a table of (leading cells, lines of a row); only the first line shows the leading cells."""
    for leading, lines in table:
        for number, line in enumerate(lines):
            yield (*(leading if number == 0 else [''] * len(leading)), *line)


def printed(table):
    widths = [max(map(len, column)) for column in zip(*table)]
    for line in table:
        print('  '.join(f'{cell:<{width}}' for cell, width in zip(line, widths)).rstrip())


def marked_down(head, *rest):
    for line in (head, ['---'] * len(head), *rest):
        yield '| ' + ' | '.join({'MISSED': '**missed**'}.get(cell, cell).replace('<= ', '≤ ') for cell in line) + ' |'


def into_page(name, lines):
    begin, end = f'<!-- {name}: script/bench --record -->', f'<!-- end of {name} -->'
    head, rest = PAGE.read_text().split(begin, 1)
    PAGE.write_text('\n'.join([head + begin, *lines, end + rest.split(end, 1)[1]]))


# Times ----------------------------------------------------------------------------------------------


class Figures:
    """Nanoseconds of each repetition, by row and contender."""

    def __init__(self):
        self.wall, self.cpu, self.errors = {}, {}, {}
        for path in sorted(RESULTS.glob('*.json')):
            for run in json.loads(path.read_text())['benchmarks']:
                if run['run_type'] == 'iteration':
                    self.add(run)

    def add(self, run):
        row, contender = run['name'].split(':', 1)
        key = row, contender.split('/')[0]
        if run.get('error_occurred'):
            self.errors[key] = run['error_message']
            return
        scale = {'ns': 1, 'us': 1e3, 'ms': 1e6, 's': 1e9}[run['time_unit']]
        wall = run['real_time'] * scale
        # For a batch, the time of one item. For concurrent threads, the time that each of them took.
        if 'items_per_second' in run:
            wall = 1e9 / run['items_per_second']
        self.wall.setdefault(key, []).append(wall * run.get('threads', 1))
        self.cpu.setdefault(key, []).append(run.get('cpu_time', wall) * scale)

    def of(self, row, contender):
        return (self.wall if row.wall else self.cpu).get((row.name, contender), [])


def shown(ns):
    unit, factor = next((pair for pair in (('ns', 1), ('µs', 1e3), ('ms', 1e6)) if ns < 1000 * pair[1]), ('s', 1e9))
    value = ns / factor
    return f'{value:.{2 if value < 10 else 1 if value < 100 else 0}f} {unit}'


def measure_receiver(megabytes, runs):
    sample = (PC / 'samples/sample.ts').read_bytes()
    directory = Path('/dev/shm') if os.access('/dev/shm', os.W_OK) else RESULTS
    stream = directory / f'varnek-bench-{os.getpid()}.ts'
    probe = ['ffprobe', '-v', 'quiet', '-show_programs']
    contenders = {
        'ours': [PC / 'bin/receiver', '--quiet', '--json', stream],
        'ffprobe': [*probe, '-count_packets', stream],
        'programs': [*probe, stream],
        'bare': ['dd', f'if={stream}', 'of=/dev/null', 'bs=64K', 'status=none'],
    }
    results = []
    try:
        with stream.open('wb') as file:
            for _ in range(-(-megabytes * 2**20 // len(sample))):
                file.write(sample)
        for _ in range(runs):
            for contender, command in contenders.items():
                if not shutil.which(command[0]):
                    continue
                start = time.monotonic()
                subprocess.run(command, check=True, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                               stderr=subprocess.DEVNULL)
                results.append({'run_type': 'iteration', 'name': f'receiver:{contender}', 'time_unit': 's',
                                'real_time': time.monotonic() - start})
    finally:
        stream.unlink(missing_ok=True)
    (RESULTS / 'receiver.json').write_text(json.dumps({'benchmarks': results}))


def run_programs(prefixes, brief):
    """Leaves the figures of the rows in build/bench/, in Google Benchmark's format."""
    for path in RESULTS.glob('*.json'):
        path.unlink()
    RESULTS.mkdir(parents=True, exist_ok=True)
    for area in dict.fromkeys(row.area for row in chosen(prefixes)):
        print(f'==> Measuring {area}', flush=True)
        out, program = RESULTS / f'{area}.json', PC / f'bin/bench_{area}'
        if area == 'receiver':
            measure_receiver(*((1, 1) if brief else (512, 7)))
        elif area == 'lateness':
            out.write_text(output_of(program, *(('1', '5') if brief else ('5', '200'))))
        else:
            names = '|'.join(row.name for row in chosen(prefixes) if row.area == area)
            subprocess.run([program, '--benchmark_filter=' + (f'^({names}):' if prefixes else '.'),
                            f'--benchmark_min_time={0.001 if brief else 0.06}',
                            f'--benchmark_repetitions={1 if brief else 9}',
                            '--benchmark_enable_random_interleaving=true',
                            f'--benchmark_out={out}', '--benchmark_out_format=json'],
                           check=True, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)


TIME_HEAD = ('operation', 'ours', 'range', 'peer', 'its cost', 'ratio', 'goal', '')


def time_table(figures, rows):
    for row in rows:
        ours = figures.of(row, 'ours')
        if not ours:
            sys.exit(f'no time of ours for {row.name}: {figures.errors.get((row.name, "ours"), "not measured")}')
        lines = []
        for peer in row.peers:
            theirs = figures.of(row, peer.name)
            ratio = statistics.median(ours) / statistics.median(theirs) if theirs else None
            cost = shown(statistics.median(theirs)) if theirs else figures.errors.get((row.name, peer.name), 'not installed')
            judged = peer.goal is not None and ratio is not None
            lines.append((*compared(peer, cost, ratio), f'<= {peer.goal}' if peer.goal else '',
                          ('met' if round(ratio, 2) <= peer.goal else 'MISSED') if judged else ''))
        yield ((row.title, shown(statistics.median(ours)), f'{shown(min(ours))} to {shown(max(ours))}'),
               lines or [[''] * 5])


def score(table):
    verdicts = [line[-1] for line in table]
    return f'{verdicts.count("met")} goals met, {verdicts.count("MISSED")} missed'


def print_times(prefixes, brief=False):
    run_programs(prefixes, brief)
    figures = Figures()
    table = list(blocks(time_table(figures, chosen(prefixes))))
    printed([TIME_HEAD, *table])
    print(score(table))


def record_times():
    run_programs([], brief=False)
    figures = Figures()
    table = list(blocks(time_table(figures, ROWS)))
    models = (line.split(':', 1)[1].strip() for line in Path('/proc/cpuinfo').read_text().splitlines()
              if line.startswith('model name'))
    into_page('times', [
        f'Measured on {datetime.date.today().isoformat()}: {next(models, platform.machine())}, {os.cpu_count()} cores, '
        f'Linux {platform.release().split("-")[0]}, {output_of("g++", "--version").splitlines()[0]}.',
        f'{score(table)}.', '', *marked_down(TIME_HEAD, *table)])


# Counts ---------------------------------------------------------------------------------------------


def build_plugin():
    TOP.mkdir(parents=True, exist_ok=True)
    subprocess.run(['gcc', '-O2', '-Wall', '-Wextra', '-Wpedantic', '-Werror', '-shared', '-fPIC', '-fvisibility=hidden',
                    '-o', TOP / 'count.so', 'bench/device/count.c'], check=True)


def count(row, contender, library=ARM):
    """Returns what an operation executes on average between the marks of a run, or why there is no count."""
    paths = [library.absolute() / 'lib', *(PEERS / top / 'lib/arm-linux-gnueabihf' for top in ('usr', '.'))]
    run = subprocess.run(
        ['setarch', '-R', 'qemu-arm', '-plugin', TOP / 'count.so', '-L', '/usr/arm-linux-gnueabihf',
         ARM / 'bin' / f'bench_{row.area}', f'{row.name}:{contender}', str(row.turns)],
        env={'PATH': os.environ['PATH'], 'LD_LIBRARY_PATH': ':'.join(map(str, paths))},
        stdin=subprocess.DEVNULL, capture_output=True, text=True, check=False)
    if run.returncode == 0:
        return tuple(round(int(executed) / row.turns) for executed in run.stdout.split())
    if contender == 'ours':
        sys.exit(f'{row.name} could not be counted: {run.stderr}')
    return run.stderr.strip()


def count_ours(rows, library=ARM):
    return {row.name: count(row, 'ours', library) for row in rows if row.device}


def check():
    version = output_of(ARM_COMPILER, '-dumpversion').split('.')[0].strip()
    recorded = {}
    for line in RECORD.read_text().splitlines():
        name, *numbers = line.split()
        if name == 'g++' and numbers != [version]:
            print(f'==> Nothing to compare: this is g++ {version}, and the record was made with g++ {numbers[0]}')
            return
        if name not in ('#', 'g++'):
            recorded[name] = tuple(map(int, numbers))
    counted = count_ours(ROWS)
    renew = 'script/bench --record updates the record'
    if recorded.keys() != counted.keys():
        sys.exit(f'{RECORD} has other rows: {" ".join(recorded.keys() ^ counted.keys())}; {renew}')
    worse = [f'{name}: {kind} {now}, recorded {then}'
             for name in counted
             for kind, now, then, leave in zip(('instructions', 'barriers', 'exclusive loads'), counted[name],
                                               recorded[name], (1.02, 1, 1))
             if now > then * leave]
    if worse:
        sys.exit('\n'.join([*worse, f'The device would execute more than before. If that is intended, {renew}.']))
    print(f'{len(counted)} rows, none above {RECORD}')


def spaced(number):
    return f'{number:,}'.replace(',', ' ')


def executed(numbers):
    return f'{spaced(numbers[0])} / {numbers[1]}'


COUNT_HEAD = ('operation', 'g++', 'clang', 'goal', '', 'peer', 'its cost', 'ratio')


def count_table(ours, clang, prefixes):
    for row in chosen(prefixes):
        if not row.device:
            continue
        now = ours[row.name]
        met = all(count <= most for count, most in zip(now, row.device))
        costs = {peer: count(row, peer.name) for peer in row.peers}
        yield ((row.title, executed(now), executed(clang[row.name]), f'<= {executed(row.device)}',
                'met' if met else 'MISSED'),
               [compared(peer, executed(cost), now[0] / cost[0])
                for peer, cost in costs.items() if isinstance(cost, tuple)] or [[''] * 3])
    if not prefixes:
        sizes = [tuple(map(int, output_of('script/check-library', '--size', path / 'lib/libvarnekutils_ltn.so').split()))
                 for path in (ARM, CLANG)]
        yield (('text and data', *(f'{spaced(size)} bytes' for size, _ in sizes), f'<= {spaced(sizes[0][1])}',
                'met' if all(size <= most for size, most in sizes) else 'MISSED'), [[''] * 3])


def print_counts(prefixes):
    ours, clang = (count_ours(chosen(prefixes), library) for library in (ARM, CLANG))
    printed([COUNT_HEAD, *blocks(count_table(ours, clang, prefixes))])


def record_counts():
    ours, clang = (count_ours(ROWS, library) for library in (ARM, CLANG))
    RECORD.write_text('\n'.join([
        '# What the ARM build executes for an operation: instructions, barriers, exclusive loads.',
        '# script/bench --record writes this file, script/bench --check compares.',
        f'g++ {output_of(ARM_COMPILER, "-dumpversion").split(".")[0].strip()}',
        *(f'{name:<16}{numbers[0]:>7}{numbers[1]:>4}{numbers[2]:>4}' for name, numbers in ours.items()), '']))
    versions = [output_of(tool, '--version').splitlines()[0] for tool in (ARM_COMPILER, 'clang++', 'qemu-arm')]
    into_page('counts', [f'Counted on {datetime.date.today().isoformat()}: {"; ".join(versions)}.', '',
                         *marked_down(COUNT_HEAD, *blocks(count_table(ours, clang, [])))])


def main(option, *prefixes):
    if option in ('--count', '--check', '--record'):
        build_plugin()
    match option:
        case '--list':
            printed([(row.name, row.title) for row in ROWS])
        case '--time':
            print_times(prefixes)
        case '--brief':
            print_times(prefixes, brief=True)
        case '--count':
            print_counts(prefixes)
        case '--check':
            check()
        case '--record':
            record_counts()
            record_times()


main(*sys.argv[1:])
