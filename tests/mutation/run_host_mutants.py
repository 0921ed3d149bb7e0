#!/usr/bin/python3
# SPDX-License-Identifier: MIT
"""Runs the mutants of the host and the command, each until a command line or a test notices it.

    run_host_mutants.py TREE CAPTURES EXPLAINED EVERY LEAST REPORT

TREE is the rewritten project, built in TREE/build. Of expressions each EVERY-th is changed, of the words of tables as
well. A mutant is given only to what reaches it: first to the command lines below, of which it must change the output or
the exit code, then to the tests. REPORT gets a line for each mutant as it ends: what notices it, the place, the change
and the text; those that nobody notices are printed, too. The exit code is 1 where fewer than LEAST of a hundred are
noticed or explained.
"""
import collections
import concurrent.futures
import os
import pathlib
import random
import re
import struct
import subprocess
import sys
import tempfile
import time

SHOWN = ("--all --utc", "--color always", "detail --bits", "detail --color always", "verify --all --jobs 1", "verify --bad --jobs 2",
         "keys --jobs 1", "keys --per chunk --raw", "json --fields --jobs 1", "json --count 3", "html --limit 40",
         "plan --shards 3", "--filter 'ip and tcp'", "--packet 3-7,9 --jobs 2",
         "--where 'sctp.chunk_type == 6 or ip.source in 10.0.0.0/8 and not tcp.port in {80, 8000-8080}'")
OTHERS = ("json --schema", "fields", "fields --json", "fields tcp", "fields 478", "--help", "no-such-file", "--no-such-option",
          "--where 'ip.ttl <' $C/ip6-esp.pcap", "--filter 'no such' $C/ip6-esp.pcap", "--packet 9-3 $C/ip6-esp.pcap",
          "--plugin /dev/null $C/ip6-esp.pcap", "head", "- <$C/sctp-s1ap-sll.pcapng")
# They take half of all the time, and compare the command with itself.
TOO_LONG = {"Jobs.giveWhatOneGives", "PlannedShards.giveTogetherWhatOneRunGives", "Export.isTheSameWithAnyNumberOfJobs",
            "Memory.staysBounded"}
PROGRAMS = ("host", "analysis", "capture", "columns", "cli")
REACHED_OCTETS = 1 << 14
JOBS = 2

Check = collections.namedtuple("Check", "stage line wanted seconds reached")
Mutant = collections.namedtuple("Mutant", "place change text environment checks")


class Runner:
    def __init__(self, tree, captures):
        self.build = tree / "build"
        self.environment = os.environ | {"C": str(captures), "LD_LIBRARY_PATH": f"{self.build}/tests/mutation"}
        self.work = tempfile.TemporaryDirectory()
        with concurrent.futures.ThreadPoolExecutor(JOBS) as pool:
            self.checks = [check for check in pool.map(lambda check: self.known(*check), self.lines()) if check]

    def lines(self):
        command = f"{self.build}/cli/netfloor"
        for line in SHOWN:
            yield "command", f"{command} {line} $C/*.pcap*", True
        for line in OTHERS:
            yield "command", f"{command} {line}", True
        for name in PROGRAMS:
            program = f"{self.build}/tests/test_{name}"
            suite = ""
            for line in subprocess.check_output([program, "--gtest_list_tests"], text=True).splitlines():
                test = suite + line.split("#")[0].strip()
                if line.startswith("  ") and test not in TOO_LONG:
                    yield f"test_{name}", f"{program} --gtest_filter='{test}'", False
                elif line.rstrip().endswith(".") or ".  #" in line:
                    suite = line.split("#")[0].strip()

    # What a check gives without a mutant, and which mutants it reaches.
    def known(self, stage, line, takes_output):
        with tempfile.NamedTemporaryFile(dir=self.work.name) as file:
            file.truncate(REACHED_OCTETS)
            start = time.monotonic()
            wanted = self.run(line, takes_output, {"NETFLOOR_MUTANTS_REACHED": file.name}, 300)
            seconds = time.monotonic() - start
            if wanted != (self.run(line, True, {}, 300) if takes_output else 0):
                print(f"left out, not the same each time or failed: {line}")
                return None
            return Check(stage, line, wanted, seconds, pathlib.Path(file.name).read_bytes())

    def run(self, line, takes_output, environment, seconds):
        process = subprocess.Popen(["bash", "-c", f"ulimit -v 4000000; {line}"], stdin=subprocess.DEVNULL, cwd=self.work.name,
                                   stdout=subprocess.PIPE if takes_output else subprocess.DEVNULL, start_new_session=True,
                                   stderr=subprocess.STDOUT if takes_output else subprocess.DEVNULL,
                                   env=self.environment | environment)
        try:
            out, _ = process.communicate(timeout=seconds)
            return (process.returncode, out) if takes_output else process.returncode
        except subprocess.TimeoutExpired:
            os.killpg(process.pid, 9)
            process.communicate()
            return "did not end"

    # The stage that notices a mutant, or None.
    def stage(self, mutant):
        for check in sorted(mutant.checks, key=lambda check: (check.stage != "command", check.seconds)):
            takes_output = check.stage == "command"
            if self.run(check.line, takes_output, mutant.environment, 10 + 10 * check.seconds) != check.wanted:
                return check.stage
        return None


def programs_of(tree):
    return [tree / "build/cli/netfloor", *(tree / f"build/tests/test_{name}" for name in PROGRAMS)]


# The numbers of the mutants that are in the programs; the compiler works the others out.
def present(tree):
    numbers = set()
    for program in programs_of(tree):
        with tempfile.NamedTemporaryFile() as file:
            subprocess.check_call(["objcopy", "--dump-section", f"mutants={file.name}", program, "/dev/null"])
            numbers.update(number for number, in struct.iter_unpack("<i", pathlib.Path(file.name).read_bytes()))
    return numbers


def expressions(tree, checks):
    numbers = present(tree)
    for line in (tree / "mutants.txt").read_text().splitlines():
        number, place, change, text = line.split("\t")
        if int(number) not in numbers:
            continue
        reaching = [check for check in checks if check.reached[int(number)]]
        yield Mutant(place, change, text, {"NETFLOOR_MUTANT": number}, reaching)


class Image:
    def __init__(self, program):
        self.octets = program.read_bytes()
        headers, = struct.unpack_from("<Q", self.octets, 32)
        size, count = struct.unpack_from("<HH", self.octets, 54)
        self.segments = []
        for i in range(count):
            kind, _, offset, address, _, length = struct.unpack_from("<IIQQQQ", self.octets, headers + i * size)
            if kind == 1:
                self.segments.append((address, offset, length))
        relocations = subprocess.check_output(["readelf", "-rW", program], text=True)
        self.pointers = {int(at, 16) for at in re.findall(r"(?m)^([0-9a-f]+) .*R_X86_64_RELATIVE", relocations)}

    # What the file has there, with zeros where it has nothing.
    def content(self, at, size):
        for address, offset, length in self.segments:
            if address <= at < address + length:
                return self.octets[offset + at - address:][:min(size, address + length - at)].ljust(size, b"\0")
        return bytes(size)


# The constants of the project in a program, outside and inside of functions: (symbol, content) -> addresses. A constant of a
# header has the same content in each source that includes it, and each has its own copy.
def tables(program, image):
    constant = {number for number, name in re.findall(
        r"\[ *(\d+)\] (\.rodata|\.data\.rel\.ro)\S* ", subprocess.check_output(["readelf", "-SW", program], text=True))}
    found = collections.defaultdict(set)
    symbols = subprocess.check_output(["readelf", "-sWC", program], text=True)
    for at, size, section, symbol in re.findall(
            r"(?m)^ *\d+: ([0-9a-f]+) +(\w+) OBJECT +\w+ +\w+ +(\d+) (netfloor::.*)$", symbols):
        if section in constant and not re.search(r"^netfloor::test::|::(start|end)Text$", symbol):  # the text of the page
            at, size = int(at, 16), int(size, 0)
            content = bytearray(image.content(at, size))
            pointers = tuple(offset for offset in range(0, size, 4) if at + offset in image.pointers)
            for offset in pointers:  # what they point to is elsewhere in each program
                content[offset:offset + 8] = bytes(8)
            found[symbol, bytes(content), pointers].add(at)
    return found


# A text is changed by its start or its length, a number by 1.
def words(tree, checks):
    programs = programs_of(tree)
    found = {program.name: tables(program, Image(program)) for program in programs}
    for table in sorted(found["netfloor"], key=lambda table: table[0]):
        symbol, content, pointers = table
        for offset in range(0, len(content), 4):
            word = content[offset:offset + 4]
            if offset in pointers or any(word):
                octet = offset + next((i for i, value in enumerate(word) if value), 0)  # one that counts
                places = ",".join(f"{name}:{at + octet:x}" for name, of in found.items() for at in of.get(table, ()))
                holding = {"command", "test_cli"} | {name for name, of in found.items() if table in of}
                yield Mutant(symbol, "table", f"octet {octet}", {"NETFLOOR_MUTANT_WORD": places},
                             [check for check in checks if check.stage in holding])


def main():
    tree, captures, explained = (pathlib.Path(name).resolve() for name in sys.argv[1:4])
    every, least = int(sys.argv[4]), float(sys.argv[5])
    known = {tuple(line.split("\t")[:3]) for line in explained.read_text().splitlines() if not line.startswith("#")}
    runner = Runner(tree, captures)
    checks = runner.checks
    print(f"{len(checks)} checks, {sum(check.seconds for check in checks):.0f} s", flush=True)
    counts = collections.Counter()

    def judge(mutant):
        stage = runner.stage(mutant)
        if stage is None:
            stage = "open" if mutant.checks else "never run"
            if (re.sub(r":\d+$", "", mutant.place), mutant.change, mutant.text) in known:
                stage = "explained"
        line = "\t".join((stage, mutant.place, mutant.change, mutant.text))
        print(line, file=report, flush=True)
        if stage in ("open", "never run"):
            print(line, flush=True)
        counts[stage] += 1

    chosen = [*expressions(tree, checks)][::every] + [*words(tree, checks)][::every]
    random.Random(every).shuffle(chosen)  # so that the first of them are a sample as well
    with concurrent.futures.ThreadPoolExecutor(JOBS) as pool, open(sys.argv[6], "w") as report:
        list(pool.map(judge, chosen))
    share = 100 * (1 - (counts["open"] + counts["never run"]) / len(chosen))
    print(f"{len(chosen)} mutants: " + ", ".join(f"{stage} {count}" for stage, count in counts.most_common()))
    print(f"{share:.1f} % noticed or explained, {least:g} wanted")
    sys.exit(share < least)


main()
