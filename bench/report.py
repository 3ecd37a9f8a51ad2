"""bench/report.py BUILD-DIRECTORY: measures the tool and two programs for comparison. The floor
(bench_floor) does the tool's job without the verification. The peer (bench_peer) does the
tool's job with OpenSSL. Prints tables of the results, and writes the tables to
docs/performance.md. Writes the plot docs/performance-entries.svg. Also writes the plot
docs/performance-time.svg, but only if perf works. scripts/bench calls this script."""

import collections
import datetime
import json
import math
import os
import re
import statistics
import subprocess
import sys

import plots

BUILD = sys.argv[1]
TOOL, FLOOR, PEER = (f'{BUILD}/bin/{name}' for name in ('apktoolkit', 'bench_floor', 'bench_peer'))
MICRO = [f'{BUILD}/bench/bench_micro', f'{BUILD}/bench/bench_micro_openssl']
DOCUMENT = 'docs/performance.md'

# rounds: how often each program runs. floor, peer: the target for the ratio of the tool's time to
# that program's time. memory: the target for the ratio of the tool's memory to the floor's. None: no
# target. margin: a ratio misses its target only if it is greater than target * (1 + margin).
Package = collections.namedtuple('Package', 'name rounds floor peer memory margin')
PACKAGES = [
    Package('small', 101, 1.07, 0.90, 1.03, 0.05),
    Package('small-rsa4096', 101, 1.20, 1.00, 1.03, 0.03),
    Package('medium', 21, 1.03, 0.98, 1.03, 0.03),
    Package('large', 9, 1.03, 0.98, 1.05, 0.03),
    Package('entries-1k', 101, 1.13, 0.88, 1.03, 0.03),
    Package('entries-10k', 41, 1.18, 0.88, 1.12, 0.03),
    Package('entries-60k', 15, 1.22, 0.90, 1.25, 0.05),
    Package('entries-10k-unordered', 41, 1.20, None, None, 0.03),
    Package('entries-60k-unordered', 15, 1.28, None, None, 0.05),
]
MODULUS_BITS = (1024, 1536, 2048, 3072, 4096)
RSA_TARGETS = {2048: 10.5, 4096: 12.5}
ENTRIES = {'entries-1k': 1000, 'entries-10k': 10000, 'entries-60k': 60000}
WALL, CPU, MEMORY = range(3)


def main():
    outside = [measure_outside(package) for package in PACKAGES]
    runs = {package.name: measure(package) for package in PACKAGES}
    start_up = median(run_in_turns(41, [TOOL], '/dev/null')[TOOL], CPU)
    counts = {name: count_instructions(package_path(name)) for name in ('small', *ENTRIES)}
    micro = measure_micro()
    parts = {package.name: measure_parts(package) for package in PACKAGES}

    text = '\n'.join([
        machine(), '', *package_table(runs), '', *resource_table(runs), '',
        *growth(runs, start_up), '', *instruction_table(counts), '', *outside_table(outside), '',
        *rsa_table(micro), '', *micro_table(micro), '', *text_table()])
    print(text)
    replace_numbers(text)
    plots.write_growth('docs/performance-entries.svg', {
        os.path.basename(program).replace('bench_', ''):
        [(count, median(runs[name][program], CPU) / 1000) for name, count in ENTRIES.items()]
        for program in (TOOL, FLOOR, PEER)})
    if all(parts.values()):
        plots.write_parts('docs/performance-time.svg', parts)


def package_path(name):
    return f'{BUILD}/packages/{name}/base.apk'


# ---- Whole processes.

def run_in_turns(rounds, programs, file):
    """Maps each program to a list with the (wall, cpu, memory) of each run. wall and cpu are in
    microseconds, memory is in kilobytes."""
    output = subprocess.run([f'{BUILD}/bench/bench_run', str(rounds), *programs, '--', file],
                            check=True, capture_output=True, text=True).stdout
    runs = collections.defaultdict(list)
    for line in output.splitlines():
        program, *numbers = line.split('\t')
        runs[program].append(tuple(int(number) for number in numbers))
    return runs


def measure(package):
    expect_same_log(package)
    return run_in_turns(package.rounds, [TOOL, FLOOR, PEER], package_path(package.name))


def expect_same_log(package):
    """Exits if the logs of the three programs differ in more than times and process numbers. The
    signing step must fail, because the kernel of a workstation has no integrity feature. The log
    reports this failure as the result 65536. Also exits if the log does not have this result."""
    logs = {re.sub(r'\d\d-\d\d \d\d:\d\d:\d\d +\d+ +\d+', '', subprocess.run(
        [program, package_path(package.name)], check=True, capture_output=True, text=True).stderr)
        for program in (TOOL, FLOOR, PEER)}
    if len(logs) != 1 or 'finished: 65536' not in logs.pop():
        sys.exit(f'bench: {package.name}: the programs did not do the same job')


def median(runs, column):
    return statistics.median(run[column] for run in runs)


def ratio(runs, other, column):
    """The median of the ratios of all rounds: the tool's value divided by the value of `other`."""
    return statistics.median(a[column] / b[column] for a, b in zip(runs[TOOL], runs[other]))


def package_table(runs):
    def cell(value, target, margin):
        if target is None:
            return f'{value:.3f}'
        missed = '' if value <= target * (1 + margin) else ', **missed**'
        return f'{value:.3f} ({target:.2f}{missed})'

    yield '| package | wall / floor | cpu / floor | wall / peer | cpu / peer | memory / floor |'
    yield '|---|---|---|---|---|---|'
    for p in PACKAGES:
        r = runs[p.name]
        yield f'| {p.name} | ' + ' | '.join([
            cell(ratio(r, FLOOR, WALL), p.floor, p.margin),
            cell(ratio(r, FLOOR, CPU), p.floor, p.margin),
            cell(ratio(r, PEER, WALL), p.peer, p.margin),
            cell(ratio(r, PEER, CPU), p.peer, p.margin),
            cell(ratio(r, FLOOR, MEMORY), p.memory, p.margin)]) + ' |'


def resource_table(runs):
    yield '| package, medians of tool / floor / peer | wall, ms | cpu, ms | peak memory, MB |'
    yield '|---|---|---|---|'
    for name, r in runs.items():
        cells = [' / '.join(f'{median(r[program], column) / 1000:.1f}'
                            for program in (TOOL, FLOOR, PEER)) for column in (WALL, CPU, MEMORY)]
        yield f'| {name} | ' + ' | '.join(cells) + ' |'


def growth(runs, start_up):
    cost = {name: median(runs[name][TOOL], CPU) - start_up for name in ENTRIES}
    names = list(ENTRIES)
    for few, many in zip(names, names[1:]):
        exponent = math.log(cost[many] / cost[few]) / math.log(ENTRIES[many] / ENTRIES[few])
        yield (f'From {ENTRIES[few]:,} to {ENTRIES[many]:,} entries the processor time without '
               f'start-up grows with the exponent {exponent:.2f} (at most 1.10).')


def measure_outside(package):
    """The wall-clock seconds of apksigner and jarsigner. Each runs twice, and the shorter run
    counts. Unlike the tool, these programs check every entry."""
    commands = (['apksigner', 'verify', '--min-sdk-version', '18', '--max-sdk-version', '23'],
                ['jarsigner', '-verify'])
    times = []
    for command in commands:
        samples = []
        for _ in range(2):
            start = datetime.datetime.now()
            subprocess.run([*command, package_path(package.name)], check=True, capture_output=True)
            samples.append((datetime.datetime.now() - start).total_seconds())
        times.append(min(samples))
    return package.name, times


def outside_table(outside):
    yield '| package | apksigner verify, s | jarsigner -verify, s |'
    yield '|---|---|---|'
    for name, times in outside:
        yield f'| {name} | ' + ' | '.join(f'{time:.2f}' for time in times) + ' |'


# ---- Instructions.

def callgrind(command, options=()):
    """The number of executed instructions, and the text of the profile."""
    profile = f'{BUILD}/callgrind.out'
    subprocess.run(['valgrind', '--quiet', '--tool=callgrind', f'--callgrind-out-file={profile}',
                    *options, *command], check=True, capture_output=True)
    with open(profile, encoding='utf-8') as file:
        text = file.read()
    return int(re.search(r'^(?:summary|totals): (\d+)', text, re.M).group(1)), text


def count_instructions(path):
    return [callgrind([program, path])[0] for program in (TOOL, FLOOR)]


def instruction_table(counts):
    yield '| package | million instructions, tool | floor | ratio |'
    yield '|---|---|---|---|'
    for name, (tool, floor) in counts.items():
        yield f'| {name} | {tool / 1e6:.1f} | {floor / 1e6:.1f} | {tool / floor:.3f} |'


def instructions_per_limb(limbs=128):
    count, profile = callgrind([MICRO[0], f'--benchmark_filter=^mpi_mul_hlp/{limbs}$',
                                '--benchmark_min_time=0.01'],
                               ['--toggle-collect=mpi_mul_hlp*', '--separate-callers=0'])
    name = re.search(r'\((\d+)\) mpi_mul_hlp', profile).group(1)
    calls = sum(int(n) for n in re.findall(rf'^cfn=\({name}\).*\ncalls=(\d+)', profile, re.M))
    return count / calls / limbs


# ---- Parts.

def measure_micro():
    """Maps each benchmark's name to its processor time in nanoseconds (median of three runs)."""
    samples = collections.defaultdict(list)
    for _ in range(3):
        for program in MICRO:
            command = [program, '--benchmark_format=json', '--benchmark_min_time=0.2']
            output = subprocess.run(command, check=True, capture_output=True, text=True).stdout
            for result in json.loads(output)['benchmarks']:
                samples[result['name']].append(result['cpu_time'])
    return {name: statistics.median(values) for name, values in samples.items()}


def rsa_table(micro):
    yield '| modulus, bits | tool, µs | OpenSSL | BoringSSL | GMP | tool / OpenSSL |'
    yield '|---|---|---|---|---|---|'
    for bits in MODULUS_BITS:
        tool, *others = (micro[f'public/{name}/{bits}'] / 1000
                         for name in ('tool', 'openssl', 'boringssl', 'gmp'))
        target = f' (at most {RSA_TARGETS[bits]})' if bits in RSA_TARGETS else ''
        yield (f'| {bits} | {tool:.0f} | ' + ' | '.join(f'{other:.1f}' for other in others) +
               f' | {tool / others[0]:.1f}{target} |')


def micro_table(micro):
    yield '| part | cost |'
    yield '|---|---|'
    for limbs in (32, 64, 128):
        cost = micro[f'mpi_mul_hlp/{limbs}'] / limbs
        yield f'| `mpi_mul_hlp`, {limbs} limbs | {cost:.2f} ns a limb |'
    yield f'| `mpi_mul_hlp`, 128 limbs | {instructions_per_limb():.1f} instructions a limb |'
    for name in ('mpi_montmul', 'mpi_mod_mpi'):
        for bits in (1024, 2048, 4096):
            yield f'| `{name}`, {bits} bits | {micro[f"{name}/{bits}"] / 1000:.1f} µs |'
    for sections in (10, 1000, 60000):
        cost = micro[f'ManifestMf::load/{sections}']
        yield (f'| `ManifestMf::load`, {sections:,} sections | {cost / 1000:.1f} µs, '
               f'{cost / sections:.0f} ns a section |')
    yield f'| `base64decode` of a SHA-256 digest | {micro["base64decode"]:.0f} ns |'


def text_table():
    output = subprocess.run([f'{BUILD}/bench/bench_texts'], check=True, capture_output=True,
                            text=True).stdout
    reader = None
    for line in output.splitlines():
        table, *cells = line.split('\t')
        if table != reader:
            if reader:
                yield ''
            yield f'| {table} | peak memory, bytes per byte of text | ns per byte |'
            yield '|---|---|---|'
            reader = table
        yield '| ' + ' | '.join(cells) + ' |'


# The parts of a run, each with a pattern. perf takes samples of the running code. Each sample counts
# for the first part whose pattern matches the file of the sampled code.
PARTS = (('start-up', r'/ld-linux'), ('kernel', r'kernel'), ('inflate', r'/libz\.'),
         ('digests', r'/libcrypto\.'), ("the tool's own code", r'/apktoolkit$'), ('libraries', r''))


def measure_parts(package):
    """Each part's share of the processor time; None if perf is missing or fails."""
    data = f'{BUILD}/perf.data'
    run = [f'{BUILD}/bench/bench_run', str(package.rounds // 3), TOOL, '/bin/true', '--',
           package_path(package.name)]
    try:
        subprocess.run(['perf', 'record', '-q', '-F', '10000', '-e', 'cpu-clock', '-o', data, '--',
                        *run], check=True, capture_output=True)
        samples = subprocess.run(['perf', 'script', '-i', data, '-F', 'comm,ip,dso'], check=True,
                                 capture_output=True, text=True).stdout
    except (OSError, subprocess.CalledProcessError):
        return None
    shares = collections.Counter({part: 0 for part, _ in PARTS})
    for line in samples.splitlines():
        fields = line.split()
        if fields and fields[0] == 'apktoolkit':
            shares[next(part for part, pattern in PARTS
                        if re.search(pattern, fields[-1].strip('()')))] += 1
    total = sum(shares.values())
    return {part: count / total for part, count in shares.items()}


# ---- The document.

def machine():
    with open('/proc/cpuinfo', encoding='utf-8') as file:
        model = re.search(r'model name\s*: (.*)', file.read()).group(1)
    compiler = first_line(['g++', '--version'])
    openssl = ' '.join(first_line(['openssl', 'version']).split()[:2])
    versions = first_line(['dpkg-query', '-W', '-f', '${Package} ${Version}, ', 'zlib1g',
                           'android-libziparchive', 'android-libboringssl', 'libgmp10'])
    return (f'{datetime.date.today().isoformat()}; {model}, {os.cpu_count()} processors; '
            f'{compiler}, -O2; {openssl}, {versions.rstrip(", ")}.')


def first_line(command):
    return subprocess.run(command, check=True, capture_output=True, text=True).stdout.split('\n')[0]


def replace_numbers(text):
    begin, end = '<!-- numbers: scripts/bench -->', '<!-- end of numbers -->'
    with open(DOCUMENT, encoding='utf-8') as file:
        document = file.read()
    before, rest = document.split(begin)
    after = rest.split(end)[1]
    with open(DOCUMENT, 'w', encoding='utf-8') as file:
        file.write(f'{before}{begin}\n{text}\n{end}{after}')


main()
