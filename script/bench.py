#!/usr/bin/env python3
"""Defines the rows of script/bench with their peers and goals, and creates its table and charts.

  bench.py list                       lists the names of the rows
  bench.py areas [ROW...]             prints the programs that measure these rows, each with a filter
  bench.py receiver TOP MIB RUNS OUT  measures the receiver of the build tree TOP, and ffprobe
  bench.py table DIR [ROW...]         prints the results in DIR; fails when a row has no figure of ours
  bench.py growth DIR                 prints how the cost grows
  bench.py record DIR DOCS            writes the results to DOCS/performance.md and draws the charts next to it
"""
import datetime
import json
import os
import platform
import resource
import statistics
import subprocess
import sys
import time
from pathlib import Path


class Row:
    """A row. Goals are (contender, label, highest ratio or None). `wall` measures wall-clock time."""

    def __init__(self, name, area, title, *goals, wall=False):
        self.name, self.area, self.title, self.goals, self.wall = name, area, title, goals, wall


ROWS = [
    Row('crc/12', 'crc', 'CRC-32, 12 bytes', ('av_crc', 'av_crc', 1.1), ('dvbpsi', 'libdvbpsi', None),
        ('boost', 'boost::crc', None), ('limit', 'limit: 16 tables inlined', 1.1)),
    *[Row(f'crc/{n}', 'crc', f'CRC-32, {n} bytes', ('av_crc', 'av_crc', 0.55), ('dvbpsi', 'libdvbpsi', 0.2),
          ('boost', 'boost::crc', 0.2), ('limit', 'limit: 16 tables inlined', 1.1)) for n in (184, 1024, 4096)],
    Row('bits', 'bits', '1200 bit fields of PSI', ('gstreamer', 'gst_bit_reader', 0.8),
        ('limit', 'limit: checked reader', 1.5)),
    Row('ring/one', 'ring', 'ring, 188 bytes in and out', ('boost', 'circular_buffer', 0.5),
        ('jack', 'JACK, no lock', None), ('limit', 'limit: memcpy, mutex', 1.8)),
    Row('ring/two', 'ring', 'ring, 188 bytes, two threads', ('boost', 'circular_buffer', 0.85),
        ('jack', 'JACK, no lock', None), ('limit', 'limit: memcpy, mutex', None), wall=True),
    Row('message/same', 'messages', 'message, same thread', ('gasync', 'GAsyncQueue', 1.3),
        ('mq', 'POSIX mq', 0.06), ('limit', 'limit: mallocs, list, locks', 2.0)),
    Row('message/oneway', 'messages', 'message, one way', ('gasync', 'GAsyncQueue', 1.0),
        ('mq', 'POSIX mq', None), ('limit', 'limit: mallocs, list, locks', 2.0), wall=True),
    Row('message/pingpong1', 'messages', 'ping-pong on one core', ('gasync', 'GAsyncQueue', None),
        ('mq', 'POSIX mq', 0.7), ('limit', 'limit: mallocs, list, locks', 2.0), wall=True),
    Row('message/pingpong2', 'messages', 'ping-pong on two cores', ('gasync', 'GAsyncQueue', None),
        ('mq', 'POSIX mq', 1.05), ('limit', 'limit: mallocs, list, locks', 2.0), wall=True),
    *[Row(f'mutex/{slot}', 'locks', f'acquire + release, {slot} slot', ('bare', 'pthread mutex', 1.6),
          ('limit', 'limit: library call', 1.3)) for slot in ('first', 'last')],
    *[Row(f'mutex2/{where}', 'locks', f'two threads, {text}', ('onethread', 'one thread', 1.5))
      for where, text in (('neighbours', 'adjacent slots'), ('apart', 'slots apart'))],
    *[Row(f'semaphore/{slot}', 'locks', f'signal + wait, {slot} slot', ('bare', 'bare semaphore', 3.0))
      for slot in ('first', 'last')],
    Row('trace_off/one', 'trace', 'trace that is off', ('liblog', 'liblog, filtered', 0.6),
        ('spdlog', 'spdlog, below level', None), ('limit', 'limit: masked call', 1.6)),
    Row('trace_off/two', 'trace', 'trace that is off, two threads', ('liblog', 'liblog, filtered', None),
        ('spdlog', 'spdlog, below level', None), ('limit', 'limit: masked call', None)),
    Row('trace_on', 'trace', 'trace into nothing', ('spdlog', 'spdlog, null sink', 1.0),
        ('spdlog_line', 'spdlog, whole line', None),
        ('limit', 'limit: vsnprintf', None)),
    Row('text/32', 'text', 'Latin-15 to UTF-8, 32 bytes', ('iconv', 'iconv', 0.7), ('icu', 'ICU', 0.7)),
    Row('text/4096', 'text', 'Latin-15 to UTF-8, 4 KiB', ('iconv', 'iconv', 0.5), ('icu', 'ICU', 0.5)),
    Row('calendar/to', 'time', 'seconds to calendar', ('libc', 'gmtime_r', 0.5), ('limit', 'limit: chrono', 1.3)),
    Row('calendar/from', 'time', 'calendar to seconds', ('libc', 'timegm', 0.2), ('limit', 'limit: chrono', 1.3)),
    Row('timer', 'timer', 'timer start + cancel', ('raw', 'timer_settime twice', 1.1),
        ('limit', 'limit: asks first', 1.1)),
    Row('file/188', 'files', 'stream read, 188 bytes', ('libc', 'fread', 1.05)),
    Row('file/64k', 'files', 'large-file read, 64 KiB', ('libc', 'read', 1.05)),
    *[Row(f'lateness/{state}_p{p}', 'lateness', f'lateness, {state}, p{p}', ('raw', 'raw timer', 1.1),
          ('timerfd', 'timerfd', None), wall=True) for state in ('idle', 'busy') for p in (50, 99)],
    *[Row(f'string/{what}', 'strings', f'string {what}', ('std', 'std::string', None))
      for what in ('append', 'copy', 'compare')],
    Row('receiver', 'receiver', 'receiver, 512 MiB', ('ffprobe', 'ffprobe, all packets', 1.0),
        ('programs', 'ffprobe, first programs', 1.0), ('read', 'plain reading', None), wall=True),
]

# The charts of growth. Each curve is (name, contender, label). `per` divides the time by the value on the x axis.
GROWTH = [
    ('fill', 'locks', 'Objects in the table', 'ns an operation', False,
     (('grow_mutex', 'ours', 'mutex acquire + release'), ('grow_semaphore', 'ours', 'semaphore signal + wait'),
      ('grow_byname', 'ours', 'mutex by name, the last one'))),
    ('queue', 'messages', 'Messages in the queue', 'ns a message', False,
     (('grow_queue', 'ours', 'send + receive'), ('grow_queue', 'limit', 'limit: mallocs, list, locks'))),
    ('length', 'text crc bits', 'Bytes', 'ns a byte', True,
     (('grow_text', 'ours', 'Latin-15 to UTF-8'), ('grow_text', 'iconv', 'the same, by iconv'),
      ('grow_crc', 'ours', 'CRC-32'), ('grow_bits', 'ours', 'bit fields'))),
]
# An operation in one thread, and in each of two threads at the same time.
THREADS = [
    ('mutexes in adjacent slots', ('mutex2/neighbours', 'onethread'), ('mutex2/neighbours', 'ours')),
    ('mutexes in slots far apart', ('mutex2/apart', 'onethread'), ('mutex2/apart', 'ours')),
    *[(f'trace that is off, {label}', ('trace_off/one', who), ('trace_off/two', who)) for who, label in
      (('ours', 'ours'), ('limit', 'masked call'), ('liblog', 'liblog'), ('spdlog', 'spdlog'))],
]
AREAS = list(dict.fromkeys(row.area for row in ROWS))


def chosen(prefixes):
    rows = [row for row in ROWS if not prefixes or any(row.name.startswith(prefix) for prefix in prefixes)]
    return rows or sys.exit(f'no such row: {" ".join(prefixes)}')


# What was measured ----------------------------------------------------------------------------------


class Figures:
    """Nanoseconds of each repetition, by row and contender."""

    def __init__(self, directory):
        self.wall, self.cpu, self.errors = {}, {}, {}
        for path in sorted(Path(directory).glob('*.json')):
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

    def of(self, row, contender, wall):
        return (self.wall if wall else self.cpu).get((row, contender), [])


def shown(ns):
    for unit, factor in (('ns', 1), ('µs', 1e3), ('ms', 1e6), ('s', 1e9)):
        if abs(ns) < 1000 * factor or unit == 's':
            value = ns / factor
            return f'{value:.{2 if value < 10 else 1 if value < 100 else 0}f} {unit}'
    return ''


def spread(samples):
    return f'{shown(min(samples))} to {shown(max(samples))}'


def lines(figures):
    """Yields (row, ours, spread, peer, time, ratio, goal, verdict) for each pair that was measured."""
    for row in ROWS:
        ours = figures.of(row.name, 'ours', row.wall)
        if not ours:
            continue
        for contender, label, goal in row.goals:
            theirs = figures.of(row.name, contender, row.wall)
            head = row.title, shown(statistics.median(ours)), spread(ours), label
            wanted = f'<= {goal}' if goal else ''
            if not theirs:
                yield *head, figures.errors.get((row.name, contender), 'not measured'), '', wanted, ''
                continue
            ratio = statistics.median(ours) / statistics.median(theirs)
            verdict = '' if not goal else 'met' if round(ratio, 2) <= goal else 'MISSED'
            yield *head, shown(statistics.median(theirs)), f'{ratio:.2f}', wanted, verdict


HEAD = ('row', 'ours', 'range', 'peer', 'its cost', 'ratio', 'goal', '')


def named_once(table):
    """Yields the lines of a table, with the title and our time only in the first line of each row."""
    last = None
    for line in table:
        yield ['', '', '', *line[3:]] if line[0] == last else list(line)
        last = line[0]


def score(table):
    verdicts = [line[-1] for line in table]
    return f'{verdicts.count("met")} goals met, {verdicts.count("MISSED")} missed'


def print_table(figures, prefixes):
    table = [HEAD, *lines(figures)]
    widths = [max(len(line[i]) for line in table) for i in range(len(HEAD))]
    for fields in named_once(table):
        print('  '.join(f'{field:<{width}}' for field, width in zip(fields, widths)).rstrip())
    print(score(table))
    absent = [row.name for row in chosen(prefixes) if not figures.of(row.name, 'ours', row.wall)]
    if absent:
        sys.exit(f'rows without a figure of ours: {", ".join(absent)}')


def curves(figures, chart):
    _, _, _, _, per, names = chart
    for name, contender, label in names:
        points = {}
        for (row, who), samples in figures.cpu.items():
            if who == contender and row.startswith(name + '/'):
                x = int(row.split('/')[1])
                points[x] = statistics.median(samples) / (x if per else 1)
        if points:
            yield label, sorted(points.items())


def print_growth(figures):
    for chart in GROWTH:
        for label, points in curves(figures, chart):
            print(f'{label}, {chart[3]}: ' + ', '.join(f'{y:.3g} at {x}' for x, y in points))


# The receiver ---------------------------------------------------------------------------------------


def measure_receiver(top, megabytes, runs, out):
    sample = Path(top, 'samples/sample.ts').read_bytes()
    directory = '/dev/shm' if os.access('/dev/shm', os.W_OK) else str(Path(out).parent)
    stream = Path(directory, f'varnek-bench-{os.getpid()}.ts')
    probe = ['ffprobe', '-v', 'quiet', '-show_programs']
    contenders = {
        'ours': [f'{top}/bin/receiver', '--quiet', '--json', str(stream)],
        'ffprobe': [*probe, '-count_packets', str(stream)],
        'programs': [*probe, str(stream)],
        'read': ['dd', f'if={stream}', 'of=/dev/null', 'bs=64K', 'status=none'],
    }
    results = []
    try:
        with stream.open('wb') as file:
            for _ in range(-(-megabytes * 2**20 // len(sample))):
                file.write(sample)
        for _ in range(runs):
            for contender, command in contenders.items():
                result = {'run_type': 'iteration', 'name': f'receiver:{contender}', 'time_unit': 's'}
                before = resource.getrusage(resource.RUSAGE_CHILDREN)
                start = time.monotonic()
                try:
                    subprocess.run(command, check=True, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                                   stderr=subprocess.DEVNULL)
                except FileNotFoundError:
                    result |= {'error_occurred': True, 'error_message': 'not installed'}
                else:
                    result['real_time'] = time.monotonic() - start
                    after = resource.getrusage(resource.RUSAGE_CHILDREN)
                    result['cpu_time'] = (after.ru_utime + after.ru_stime - before.ru_utime - before.ru_stime)
                results.append(result)
        size = stream.stat().st_size
    finally:
        stream.unlink(missing_ok=True)
    Path(out).write_text(json.dumps({'benchmarks': results, 'bytes': size}, indent=1))


# Charts ---------------------------------------------------------------------------------------------


def growth_chart(figures, chart, path):
    name, _, xlabel, ylabel, per, _ = chart
    drawn = list(curves(figures, chart))
    if not drawn:
        return
    import matplotlib  # only a recording needs it
    matplotlib.use('svg')
    from matplotlib import pyplot, ticker
    # Makes the file the same for the same figures.
    pyplot.rcParams.update({'svg.fonttype': 'none', 'svg.hashsalt': name, 'font.family': 'sans-serif'})
    figure, axes = pyplot.subplots(figsize=(7.2, 3.6), layout='constrained')
    for label, points in drawn:
        axes.plot(*zip(*points), marker='o', markersize=4, label=label)
    axes.set_xscale('log')
    axes.set_xticks([x for x, _ in drawn[0][1]])
    axes.xaxis.set_major_formatter('{x:.0f}')
    if per:  # the prices for a byte differ a lot
        axes.set_yscale('log')
        axes.yaxis.set_major_locator(ticker.LogLocator(subs=(1, 2, 5)))
        axes.yaxis.set_major_formatter('{x:g}')
    else:
        axes.set_ylim(bottom=0)
    axes.minorticks_off()
    axes.set_xlabel(f'{xlabel} (logarithmic)')
    axes.set_ylabel(ylabel + (' (logarithmic)' if per else ''))
    axes.grid(alpha=0.4)
    axes.legend()
    figure.savefig(path, metadata={'Date': None, 'Title': f'{ylabel} against {xlabel.lower()}'})


# The document ---------------------------------------------------------------------------------------


def processor():
    for line in Path('/proc/cpuinfo').read_text().splitlines():
        if line.startswith('model name'):
            return line.split(':', 1)[1].strip()
    return platform.machine()


def section(directory, figures):
    table = list(lines(figures))
    compiler = subprocess.run(['g++', '--version'], capture_output=True, text=True, check=True).stdout.splitlines()[0]
    yield (f'Measured on {datetime.date.today().isoformat()}: {processor()}, {os.cpu_count()} cores, '
           f'Linux {platform.release().split("-")[0]}, {compiler}.')
    yield f'{score(table)}.'
    yield ''
    yield '| ' + ' | '.join(HEAD) + ' |'
    yield '|---|---|---|---|---|---|---|---|'
    for fields in named_once(table):
        fields[-1] = {'MISSED': '**missed**'}.get(fields[-1], fields[-1])
        yield '| ' + ' | '.join(field.replace('<= ', '≤ ') for field in fields) + ' |'
    yield ''
    yield '| operation | time in one thread alone | time in each of two threads at once |'
    yield '|---|---|---|'
    for label, *names in THREADS:
        pair = [figures.of(*name, False) for name in names]
        if all(pair):
            yield '| ' + ' | '.join([label, *(shown(statistics.median(samples)) for samples in pair)]) + ' |'
    path = Path(directory, 'receiver.json')
    if path.exists():
        size = json.loads(path.read_text())['bytes']
        labels = {'ours': 'the receiver', 'ffprobe': 'ffprobe (all packets)', 'read': 'plain reading'}
        speed = {who: size / statistics.median(figures.wall['receiver', who]) * 1e3
                 for who in labels if ('receiver', who) in figures.wall}
        yield ''
        yield ('Speeds of reading the stream: ' +
               ', '.join(f'{labels[who]} {value:.0f} MB/s' for who, value in speed.items()) +
               f'. The receiver reaches {100 * speed["ours"] / speed["read"]:.1f} % of plain reading.')


def record(directory, docs):
    figures = Figures(directory)
    for chart in GROWTH:
        growth_chart(figures, chart, Path(docs, f'performance-{chart[0]}.svg'))
    page = Path(docs, 'performance.md')
    begin, end = '<!-- results: script/bench --record -->', '<!-- end of results -->'
    text = page.read_text()
    head, rest = text.split(begin, 1)
    page.write_text(head + begin + '\n' + '\n'.join(section(directory, figures)) + '\n' + end + rest.split(end, 1)[1])


def print_areas(prefixes):
    for area in AREAS:
        names = [row.name for row in chosen(prefixes) if row.area == area]
        if names:
            # Google Benchmark expects an extended regular expression.
            print(area, '.' if not prefixes else '^(' + '|'.join(names) + '):')


def main(arguments):
    match arguments:
        case ['list']:
            for row in ROWS:
                print(f'{row.name:<20}{row.title}')
        case ['areas', *prefixes]:
            print_areas(prefixes)
        case ['receiver', top, megabytes, runs, out]:
            measure_receiver(top, int(megabytes), int(runs), out)
        case ['table', directory, *prefixes]:
            print_table(Figures(directory), prefixes)
        case ['growth', directory]:
            print_growth(Figures(directory))
        case ['record', directory, docs]:
            record(directory, docs)
        case _:
            sys.exit(__doc__)


main(sys.argv[1:])
