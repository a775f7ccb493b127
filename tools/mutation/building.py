"""Compiles mutants with the commands of a build tree and links them with its other objects."""

import ctypes
import json
import os
import pathlib
import re
import resource
import shlex
import signal
import subprocess
import tempfile
import threading

import schema

MEMORY = 6 << 30  # bytes of address space of a test: a mutant may ask for any size
PRINTED = 64 << 20  # bytes that it may print
PATIENCE = 30  # seconds to wait for one of processor time, on a machine with other work
LIBC = ctypes.CDLL(None)
PR_SET_PDEATHSIG = 1
NO_END = "no end"
POSITION = r"^{}:(\d+):(\d+): (?:fatal )?error:"
REQUIRED = r"^{}:(\d+):(\d+):\s+(?:required|in)"


class Failed(Exception):
    """The compiler or the linker failed."""


class Ended(Exception):
    """The run was broken off."""


class Build:
    def __init__(self, root, folder):
        self.root, self.folder = root, folder
        self.work = folder / "mutation"
        self.overlay = self.work / "overlay"
        self.overlay.mkdir(parents=True, exist_ok=True)
        self.commands = {}
        self.libraries = ["-lgtest", "-lgtest_main", "-fopenmp", "-lpthread"]
        for entry in json.loads((folder / "compile_commands.json").read_text(encoding="utf-8")):
            command = entry.get("arguments") or shlex.split(entry["command"])
            while not command[1].startswith("-"):  # a launcher
                command = command[1:]
            target = command[command.index("-o") + 1]
            if "gridmill_objects.dir" in target or "gridmill_test_objects.dir" in target:
                path = str(pathlib.Path(entry["file"]).relative_to(root))
                self.commands[path] = (command, folder / target)
        self.closures = {}
        self.includes = {path: self._includes(path) for path in self._files()}
        self._prepare()

    def _files(self):
        for top in ("basic", "processes", "tests"):
            for path in sorted((self.root / top).rglob("*")):
                if path.suffix in (".h", ".cpp"):
                    yield str(path.relative_to(self.root))

    def _includes(self, path):
        text = (self.root / path).read_text(encoding="utf-8")
        return re.findall(r'^\s*#\s*include\s*"([^"]+)"', text, re.MULTILINE)

    def _prepare(self):
        (self.work / "switch.h").write_text(schema.HEADER, encoding="utf-8")
        (self.work / "switch.cpp").write_text(schema.DEFINITION, encoding="utf-8")
        self.compiler = next(iter(self.commands.values()))[0][0]
        self.switch = self.work / "switch.o"
        subprocess.run([self.compiler, "-c", "-o", self.switch, self.work / "switch.cpp"], check=True)

    # ---- what to compile

    def reaches(self, path, header, seen=None):
        """True if a file includes a header, also by way of others."""
        seen = set() if seen is None else seen
        for target in self.includes.get(path, []):
            if target == header:
                return True
            if target not in seen:
                seen.add(target)
                if self.reaches(target, header, seen):
                    return True
        return False

    def compile_sets(self, path):
        """What to compile for the mutants of a file: a few sources, then all that the file has part in."""
        if path in self.commands:
            return [[path]]
        users = [p for p in self.commands if not p.startswith("tests/") and self.reaches(p, path)]
        own = [p for p in users if p == path.removesuffix(".h") + ".cpp"]
        size = {p: (path not in self.includes[p], os.path.getsize(self.root / p)) for p in users}
        few = own + sorted((p for p in users if p not in own), key=size.get)[: 2 - len(own)]
        # Tests have their own copies of what the file holds inline.
        tests = [p for p in self.commands if re.match(r"tests/(basic|frame|kernels)/", p)]
        tests = [p for p in tests if self.reaches(p, path)]
        tests.sort(key=lambda p: path not in self.includes[p])
        sets = [few + tests[:2]]
        if len(users) > len(few):
            sets.append(users + tests)
        return sets if sets[0] else []

    # ---- compiling and linking

    def _overlay_of(self, label, mutated):
        """A folder that holds no other mutated file."""
        return self.overlay / label / mutated.replace("/", "_")

    def compile(self, source, mutated, text, label):
        """The object of `source` where the file `mutated` has this text; raises Failed with the messages."""
        overlay = self._overlay_of(label, mutated)
        changed = overlay / mutated
        changed.parent.mkdir(parents=True, exist_ok=True)
        changed.write_text(text, encoding="utf-8")
        given, _ = self.commands[source]
        target = overlay / (source.replace("/", "_") + ".o")
        file = changed if source == mutated else self.root / source
        command = [given[0], f"-I{overlay}", f"-ffile-prefix-map={overlay}/="]
        skip = False
        for argument in given[1:]:
            if skip or argument in ("-c", "-o", given[-1], "-Werror") or re.match(r"-O.$", argument):
                skip = argument == "-o"
                continue
            command.append(argument)
        command += [
            "-O1",
            "-w",
            "-Wno-narrowing",
            "-DGRIDMILL_PINNED",
            "-D_GLIBCXX_ASSERTIONS",
            "-fmax-errors=0",
            "-fno-diagnostics-color",
        ]
        command += ["-include", str(self.work / "switch.h"), "-c", str(file), "-o", str(target)]
        code, messages, _ = CHILDREN.run(command, cwd=self.folder)
        if code != 0:
            raise Failed(messages)
        return target

    def positions(self, messages, label, mutated):
        """Where in the mutated file the compiler saw errors, or what it came from."""
        file = re.escape(str(self._overlay_of(label, mutated) / mutated))
        for pattern in (POSITION, REQUIRED):
            found = re.findall(pattern.format(file), messages, re.MULTILINE)
            if found:
                return {(int(line), int(column)) for line, column in found}
        return set()

    def link(self, objects, label):
        """The tests with these objects, by source, instead of the build's own."""
        program = self.overlay / label / "tests"
        program.parent.mkdir(parents=True, exist_ok=True)
        others = [str(target) for path, (_, target) in self.commands.items() if path not in objects]
        # The mutated objects come first: of an inline function, the linker takes the one that it sees first.
        arguments = [str(self.switch), *map(str, objects.values()), *others, *self.libraries]
        response = self.overlay / label / "link.txt"
        response.write_text("\n".join(arguments), encoding="utf-8")
        linker = ["-fuse-ld=lld"] if self._has_lld() else []
        code, messages, _ = CHILDREN.run([self.compiler, *linker, "-o", program, f"@{response}"])
        if code != 0:
            raise Failed(messages)
        return program

    def _has_lld(self):
        return any((pathlib.Path(p) / "ld.lld").exists() for p in os.environ["PATH"].split(":"))

    # ---- which tests

    def used_by(self, path):
        """All files that a file depends on: of a header also the source that belongs to it."""
        if path not in self.closures:
            seen, open_ends = {path}, [path]
            while open_ends:
                file = open_ends.pop()
                own = [file.removesuffix(".h") + ".cpp"] if file.endswith(".h") else []
                fresh = [f for f in own + self.includes[file] if f in self.includes and f not in seen]
                seen.update(fresh)
                open_ends += fresh
            self.closures[path] = seen
        return self.closures[path]

    def _suites(self, test):
        text = (self.root / test).read_text(encoding="utf-8")
        return set(re.findall(r"^(?:TYPED_)?TEST(?:_F|_P)?\(\s*(\w+)\s*,", text, re.MULTILINE))

    def reaching_tests(self, path):
        """A filter for all tests that can reach a file."""
        tests = [p for p in self.commands if p.startswith("tests/") and path in self.used_by(p)]
        return self._filter(set().union(*map(self._suites, tests)))

    def _filter(self, suites):
        return ":".join(f"{s}.*:*/{s}.*:{s}/*.*:*/{s}/*.*" for s in sorted(suites))

    def tests_of(self, path):
        """A filter for the tests that bear the name of a file, or include it where no operator is called."""
        suites = set()
        for test in (p for p in self.commands if p.startswith("tests/")):
            direct = path in self.includes[test] and re.match(r"tests/(basic|frame|kernels)/", test)
            if direct or pathlib.Path(test).stem.removesuffix("_test") == pathlib.Path(path).stem:
                suites |= self._suites(test)
        return self._filter(suites)

    def tests_of_users(self, path, members=None):
        """A filter for the tests of all sources that include a file: with members only of those."""
        header = path.removesuffix(".cpp") + ".h"
        users = {p for p in self.includes if header in self.includes[p]} if members is None else set(members)
        stems = {pathlib.Path(p).stem for p in users if not p.startswith("tests/")}
        suites = set()
        for test in (p for p in self.commands if p.startswith("tests/")):
            if pathlib.Path(test).stem.removesuffix("_test") in stems or test in users:
                suites |= self._suites(test)
        return self._filter(suites)


class Children:
    """The processes that run, each with its own children in a session. They end with this one."""

    def __init__(self):
        self.lock, self.alive, self.are_ended = threading.Lock(), set(), False

    def run(self, command, cwd=None, environment=None, cpu_seconds=None):
        """(exit code, output, seconds of processor time); the code is -SIGXCPU if that does not suffice."""
        limits = [(resource.RLIMIT_CORE, 0)]
        if cpu_seconds is not None:
            limits += [(resource.RLIMIT_AS, MEMORY), (resource.RLIMIT_FSIZE, PRINTED)]
            limits.append((resource.RLIMIT_CPU, int(cpu_seconds) + 1))

        def prepare():
            LIBC.prctl(PR_SET_PDEATHSIG, signal.SIGKILL)
            for which, amount in limits:
                resource.setrlimit(which, (amount, amount + 1 if which == resource.RLIMIT_CPU else amount))

        with tempfile.TemporaryFile() as output:
            with self.lock:
                if self.are_ended:
                    raise Ended
                process = subprocess.Popen(
                    command,
                    cwd=cwd,
                    env=environment,
                    stdout=output,
                    stderr=subprocess.STDOUT,
                    preexec_fn=prepare,
                    start_new_session=True,
                )
                self.alive.add(process.pid)
            late = threading.Event()
            timer = threading.Timer(PATIENCE * (cpu_seconds or 600), self._kill, (process.pid, late))
            timer.start()
            _, status, usage = os.wait4(process.pid, 0)
            timer.cancel()
            with self.lock:
                self.alive.discard(process.pid)
                if self.are_ended:
                    raise Ended
            process.returncode = -signal.SIGXCPU if late.is_set() else os.waitstatus_to_exitcode(status)
            output.seek(0)
            text = output.read().decode(errors="replace")
        return process.returncode, text, usage.ru_utime + usage.ru_stime

    def _kill(self, pid, late=None):
        with self.lock:
            if pid in self.alive:
                if late:
                    late.set()
                os.killpg(pid, signal.SIGKILL)

    def end(self):
        with self.lock:
            self.are_ended = True
            for pid in self.alive:
                os.killpg(pid, signal.SIGKILL)


CHILDREN = Children()


def run_tests(program, number, tests, seconds):
    """(whether all passed, the reason why not, the seconds of processor time)."""
    environment = dict(os.environ, GRIDMILL_MUTANT=str(number), GTEST_FAIL_FAST="1", GTEST_BRIEF="1")
    environment["OMP_WAIT_POLICY"] = "passive"  # other mutants run at the same time
    code, output, took = CHILDREN.run([program, f"--gtest_filter={tests}"], None, environment, seconds)
    if code == 0:
        return True, "", took
    if code == -signal.SIGXCPU:
        return False, NO_END, took
    failed = re.search(r"\[  FAILED  \] ([\w/.]+)", output)
    running = "a test" if code > 0 else f"signal {-code}"
    return False, failed[1] if failed else running, took
