"""Fails each system call of the launcher in turn, one per run, and checks what must hold for every run.

Four whole runs are watched with strace first, without a fault, to learn which calls the launcher makes. Then, for each
of these calls and each error that fits it, the run is repeated with that one call failing. The calls of the dynamic
loader, before the program's own first one, are left alone, and so are those of the programs that the launcher runs.
An error with a "+" stands for trouble that stays: that call fails and every later one of its kind.

Builds the launcher and installs what is missing. Runs in sandboxes, one for each core.
A full run takes 2 to 5 minutes on two cores, --short 10 to 20 seconds.

Exit status: 0 nothing fell short, 1 something did; nothing was run: 77 strace cannot trace here, 125 no sandbox.
"""
import argparse
import collections
import json
import os
import re
import select
import shutil
import signal
import subprocess
import sys
import tempfile
import time
from pathlib import Path
from typing import NamedTuple

CHECKOUT = Path(__file__).resolve().parent.parent
EXIT_CANNOT_TRACE = 77
BOUND = 10  # seconds that a run may take; it takes a fraction of one
KIND = 32  # characters of a line of strace; --short fails the first and the last call of those that begin alike

# The calls that fail, and with what. Calls in one row take turns, calls joined by a "," fail together.
FAULTS = (
    ("open openat", "EACCES EIO EMFILE ENOENT ENOMEM ENOSPC EROFS EINTR EMFILE+ EROFS+"),
    ("read", "EIO EINTR EAGAIN EIO+"),
    ("write", "EIO ENOSPC EINTR EAGAIN EPIPE ENOSPC+"),
    ("close", "EIO EINTR ENOSPC"),
    ("stat newfstatat statx", "EACCES EIO ENOENT ENOMEM EACCES+"),
    ("fstat", "EIO ENOMEM"),
    ("lseek", "EIO"),
    ("readlink readlinkat", "EACCES EIO ENOENT ENOMEM"),
    ("chmod fchmodat", "EACCES EIO EPERM EROFS"),
    ("clone clone3 vfork", "EAGAIN ENOMEM EAGAIN+"),
    ("wait4", "EINTR ECHILD ECHILD+"),
    ("brk mmap munmap mprotect mremap", "ENOMEM"),
    ("brk,mmap", "ENOMEM+"),
    ("rt_sigaction rt_sigprocmask", "EPERM EPERM+"),  # refused by a sandbox
    ("getrandom", "EAGAIN ENOSYS"),
    ("ioctl", "ENOTTY EIO"),
)
NO_FAULT = ("none", "-")  # in their places, for a run that falls short without any
CANNOT_FAIL = {"exit_group"}
STARTING_CALLS = {"clone", "clone3", "vfork", "mmap"}  # make a process; mmap for its stack


class Scenario(NamedTuple):
    name: str
    arguments: str
    typed: str = "y\n"  # also where no question is expected: a fault may have hidden that the machine is supported
    launches: bool = True  # whether the application is to be started
    installs: bool = True  # whether a package is, which adds an entry to the support list; without it, a question comes
    fresh: bool = False  # whether none of the launcher's directories exists yet
    portable: bool = False
    on_search_path: bool = False


SCENARIOS = (
    Scenario("package", "-v"),
    Scenario("question", "-v -d", "perhaps\ny\nrest\n", installs=False, on_search_path=True),
    Scenario("portable", "-text", fresh=True, portable=True),
    Scenario("update", "--update --proxy host:8080", "", launches=False),
)

STAND_INS = {
    "guihelper.sh": "mkdir -p /var/log/TAV_Support\n"
    r"printf 'ZEM_SYSTEM_OS=203\nZEM_SYSTEM_MT=8888\nZEM_SYSTEM_ARCH=64\n' >/var/log/TAV_Support/guihelp.dat",
    "tavtool": """case $1 in
  acquire | copy) : >/var/ZEM_Support/package ;;
  comparelocal) echo Version=2.00; if [ -e /var/ZEM_Support/package ]; then exit 21; fi ;;
  expand) mkdir -p /tmp/tav/ruv/data; cp "${0%/*}/data/copy.sh" /tmp/tav/ruv/data/ ;;
esac""",
    "data/copy.sh": "echo copied",
    "ruv": 'echo started >>"${0%/*}/starts"',
}

LAUNCHER_PATHS = ("/var/log/ZEM_Support", "/var/log/TAV_Support", "/var/ZEM_Support", "/tmp/tav")
TRACE = Path("/var/log/ZEM_Support/ruvtav.log")
OLD_TRACE = "[TAVRUV]: a line of an earlier run\n" * 3
OLD_LIST = "<list>\n" + "".join(f"<MT>{number:04}</MT>\n" for number in range(5000)) + "</list>"
NEW_ENTRY = re.compile(r"(\n(<MT>\w+</MT>)?)?")  # behind the old list; cut short where the disk was full

# The launcher may end with status 1, the application not started, where it says so and one of these calls failed.
REASONS = (
    ("ERROR: Not enough memory, RUV launcher ends.", {"brk", "mmap"}),
    ("ERROR: Unable to find the directory of the RUV launcher, RUV is not started.", {"readlink", "readlinkat"}),
)


class Outcome(NamedTuple):
    ending: str  # strace's last line, such as "exited with 0"; empty when the run had to be killed
    log: list  # strace's lines of the calls watched
    console: str
    trace: str
    support_list: str
    starts: int


class Fault(NamedTuple):
    calls: tuple
    error: str  # with "+" when it stays

    @property
    def label(self):
        return ",".join(self.calls)

    @property
    def stays(self):
        return self.error.endswith("+")

    def strace_options(self, calls, position):
        """Options that fail the call at the position of the run that was learnt: strace counts each name for itself."""
        error, stays = self.error.rstrip("+"), "+" if self.stays else ""
        options = [f"--trace={self.label}"]
        for call in self.calls:
            # The kernel refuses brk by returning a lower address than was asked for, not an error.
            result = "retval=0" if call == "brk" else f"error={error}"
            options.append(f"--inject={call}:{result}:when={calls[:position].count(call) + 1}{stays}")
        return options


def all_faults():
    for rows, errors in FAULTS:
        for row in rows.split():
            for error in errors.split():
                yield Fault(tuple(row.split(",")), error)


class Learnt(NamedTuple):
    calls: list  # the names of all calls of a run without faults, in order
    kinds: list  # and how strace's lines about them begin: alike for most lines of the trace
    own: int  # where among them the program's own begin,
    main_begins: int  # and those of its main
    wrong: list  # what fell short without a fault


class Installation:
    """The launcher with stand-ins for the other programs, laid out in the sandbox that this process runs in."""

    def __init__(self, directory):
        if "RUV_SANDBOX" not in os.environ:
            sys.exit("This part of torture.py runs in a sandbox only.")
        self.directory = Path(directory)
        self.application = self.directory / "ruv"
        (self.application / "data").mkdir(parents=True)
        (self.directory / "media/update").mkdir(parents=True)
        shutil.copy(CHECKOUT / "build/launcher", self.application)
        for name, text in STAND_INS.items():
            (self.application / name).write_text(f"#!/bin/sh\n{text}\n")
            (self.application / name).chmod(0o755)
        self.support_list = self.application / "data/supportlist.xml"
        self.starts = self.application / "starts"

    def reset(self, scenario):
        for path in LAUNCHER_PATHS:
            shutil.rmtree(path, ignore_errors=True)
        if not scenario.fresh:
            TRACE.parent.mkdir(parents=True)
            TRACE.write_text(OLD_TRACE)
        if scenario.installs and not scenario.fresh:
            Path("/var/ZEM_Support").mkdir()
            Path("/var/ZEM_Support/package").touch()
        self.support_list.write_text(OLD_LIST)
        self.starts.write_text("")
        (self.directory / "typed").write_text(scenario.typed)

    def run(self, scenario, strace_options):
        self.reset(scenario)
        log = self.directory / "strace.log"
        log.write_text("")  # what is in it afterwards is this run's
        program = str(self.application / "launcher")
        environment = {"PATH": os.environ["PATH"]}
        if scenario.portable:
            environment["ZEM_PORTABLE_EXEC_DIR"] = str(self.directory / "media")
        if scenario.on_search_path:
            environment["PATH"] = f"{self.application}:{environment['PATH']}"
            program = "launcher"
        # Every process of the run inherits the pipe's writing end: its end of file says that all are gone.
        all_gone, held_by_all = os.pipe()
        with open(self.directory / "typed") as typed, open(self.directory / "console", "w") as console:
            process = subprocess.Popen(
                ["strace", "-o", log, *strace_options, program, *scenario.arguments.split()],
                stdin=typed, stdout=console, stderr=subprocess.STDOUT, cwd=self.directory, env=environment,
                pass_fds=[held_by_all], start_new_session=True)
        os.close(held_by_all)
        in_time = []
        try:
            in_time, _, _ = select.select([all_gone], [], [], BOUND)
        finally:
            if not in_time:
                os.killpg(process.pid, signal.SIGKILL)
            process.wait()
            os.close(all_gone)
        lines = log.read_text(errors="replace").splitlines()
        told = re.match(r"\+\+\+ (.*) \+\+\+", lines[-1] if lines else "")
        ending = told[1] if told else "strace told no ending" if in_time else ""
        return Outcome(ending, lines, self.read("console"), self.read(TRACE),
                       self.read(self.support_list), self.read(self.starts).count("started"))

    def read(self, name):
        path = self.directory / name
        return path.read_text(errors="replace") if path.exists() else ""


def what_fell_short(scenario, outcome, may_not_start=False, failed_calls=()):
    """Yields what does not hold of a run, in a few words each."""
    reasons = [text for text, calls in REASONS if calls & set(failed_calls) and text in outcome.console]
    if not outcome.ending:
        yield f"did not end within {BOUND} s"
    elif outcome.ending != ("exited with 1" if reasons else "exited with 0"):
        yield outcome.ending
    if not outcome.support_list.startswith(OLD_LIST):
        yield "support list lost content"
    elif not NEW_ENTRY.fullmatch(outcome.support_list[len(OLD_LIST):]):
        yield "broken entry in the support list"
    if not outcome.trace.startswith("" if scenario.fresh else OLD_TRACE):
        yield "trace lost content"
    if outcome.starts > scenario.launches:
        yield f"application started {outcome.starts} times"
    if outcome.starts < scenario.launches and not reasons and not may_not_start:
        yield "application not started"


def may_not_start(fault, position, calls, outcome):
    """Whether the fault is one of the three that excuse a run in which the application was not started."""
    # 1. The answer to the question could not be read, which counts as "n".
    if any(line.startswith("read(0,") and "(INJECTED)" in line for line in outcome.log):
        return True
    # 2. The call that starts the application failed: the last one that starts a program,
    # 3. or there was no memory for it: the last mapping is the new process's stack.
    for call in STARTING_CALLS.intersection(fault.calls, calls):
        starts_it = len(calls) - 1 - calls[::-1].index(call)
        if position == starts_it or (fault.stays and position < starts_it):
            return True
    return False


def learn(installation, scenario):
    """Runs the scenario without a fault. When something is wrong with that run already, no call of it is failed."""
    outcome = installation.run(scenario, [])
    wrong = list(what_fell_short(scenario, outcome))
    if outcome.support_list.endswith("<MT>8888</MT>") != scenario.installs:
        wrong.append("no package installed" if scenario.installs else "package installed")
    if ("(Y/N)" in outcome.console) == scenario.installs:
        wrong.append("question asked" if scenario.installs else "question not asked")
    lines = [line for line in outcome.log if re.match(r"\w+\(", line)]
    calls = [line.split("(")[0] for line in lines]
    known = {call for fault in all_faults() for call in fault.calls} | CANNOT_FAIL
    # Preparing the signals is the first act of main; the loader's last one, before the program's static objects, is to
    # protect its data and to let go of its cache.
    main_begins = calls.index("rt_sigaction")
    own = max(at for at in range(main_begins) if calls[at] in ("mprotect", "prlimit64", "munmap")) + 1
    wrong += [f"{call} has no row in FAULTS" for call in sorted(set(calls[own:]) - known)]
    return Learnt([] if wrong else calls, [line[:KIND] for line in lines], own, main_begins, wrong)


def positions_of(fault, learnt, short, turn):
    """Where in the run the fault strikes, one run for each; the last one of a full run strikes nowhere.

    In a short run the errors of a call take turns, beginning with another one in each scenario."""
    begin = learnt.main_begins if fault.error == "ENOMEM+" else learnt.own  # nobody can say that before main
    positions = [at for at in range(begin, len(learnt.calls)) if learnt.calls[at] in fault.calls]
    if not short:
        return positions + [len(learnt.calls)] if positions else []
    first = {learnt.kinds[at]: at for at in reversed(positions)}
    last = {learnt.kinds[at]: at for at in positions}
    spread = sorted({*first.values(), *last.values()})
    errors = [other.error for other in all_faults() if other.calls == fault.calls]
    return spread[(errors.index(fault.error) + 3 * turn) % len(errors) :: len(errors)]


def run_share(options):
    """Runs every nth series (a scenario, a call, an error) and prints a line of JSON for each run."""
    share, shares = options.share
    series = [(scenario, fault) for scenario in SCENARIOS for fault in all_faults()
              if options.only in (None, *fault.calls)]
    with tempfile.TemporaryDirectory(prefix="torture.") as directory:
        installation = Installation(directory)
        learnt = {}
        for scenario, fault in series[share::shares]:
            if scenario not in learnt:
                learnt[scenario] = learn(installation, scenario)
                if learnt[scenario].wrong:
                    tell(scenario, *NO_FAULT, 0, learnt[scenario].wrong)
            calls = learnt[scenario].calls
            for position in positions_of(fault, learnt[scenario], options.short, SCENARIOS.index(scenario)):
                outcome = installation.run(scenario, fault.strace_options(calls, position))
                injected = any("(INJECTED)" in line for line in outcome.log)
                if position == len(calls) and not injected:
                    break  # a whole run had none left to fail
                wrong = list(what_fell_short(scenario, outcome, may_not_start(fault, position, calls, outcome),
                                             fault.calls))
                if injected != (position < len(calls)):
                    wrong.append("other calls than in the run without faults")
                nth = sum(call in fault.calls for call in calls[learnt[scenario].own : position + 1])
                tell(scenario, fault.label, fault.error, nth, wrong)


def tell(scenario, call, error, nth, wrong):
    # One write of less than PIPE_BUF bytes: the workers share the pipe.
    os.write(sys.stdout.fileno(), (json.dumps([scenario.name, call, error, nth, wrong]) + "\n").encode())


def collect(options):
    """Starts one worker for each core and yields what they tell, run by run."""
    told, telling = os.pipe()
    arguments = (["--short"] if options.short else []) + (["--only", options.only] if options.only else [])
    shares = os.cpu_count() or 1
    workers = [subprocess.Popen([CHECKOUT / "scripts/sandbox", sys.executable, __file__, *arguments,
                                 "--share", str(share), str(shares)], stdout=telling) for share in range(shares)]
    os.close(telling)
    with os.fdopen(told) as lines:
        for line in lines:
            yield json.loads(line)
    if any([worker.wait() for worker in workers]):
        sys.exit("A part of the runs ended early, see above.")


def prepare():
    """Builds the launcher and makes sure that strace can do its work."""
    subprocess.run(["scripts/need", "g++", "cmake", "make", "libc6-dev", "util-linux", "strace"], check=True)
    for command in (["cmake", "--preset", "release"],
                    ["cmake", "--build", "--preset", "release", "--target", "launcher"]):
        build = subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
        if build.returncode != 0:
            sys.exit(f"{build.stdout}The build failed, see above.")
    trial = ["strace", "-o", "/dev/null", "--inject=getpid:error=EPERM", "true"]
    attempt = subprocess.run(["scripts/sandbox", *trial], stderr=subprocess.PIPE, text=True)
    if attempt.returncode == 125:
        sys.stderr.write(attempt.stderr)
        sys.exit(125)
    if attempt.returncode != 0:
        sys.stderr.write(f"{attempt.stderr}strace cannot trace programs here (see above): nothing was run, which says "
                         "nothing about the launcher.\n")
        sys.exit(EXIT_CANNOT_TRACE)


def print_table(results, seconds):
    runs = collections.Counter((call, error) for _, call, error, _, _ in results)
    short = collections.defaultdict(collections.Counter)
    for _, call, error, _, wrong in results:
        short[call, error].update(wrong)
    order = [NO_FAULT] + [(fault.label, fault.error) for fault in all_faults()]
    print(f"{'call':<16}{'error':<9}{'runs':>6}  what fell short")
    for row in sorted(runs, key=order.index):
        notes = "; ".join(f"{text} ({count})" for text, count in short[row].items()) or "-"
        print(f"{row[0]:<16}{row[1]:<9}{runs[row]:>6}  {notes}")
    fallen = [result for result in results if result[4]]
    print(f"\n{len(results)} runs in {seconds:.0f} s, {len(fallen)} fell short (+: the error stays until the end)")
    findings = sorted({
        f"  {scenario}: {f'{call} no. {nth} with {error}' if nth else 'without a fault'}: {'; '.join(wrong)}"
        for scenario, call, error, nth, wrong in fallen})
    for finding in findings[:20]:
        print(finding)
    if len(findings) > 20:
        print(f"  ... and {len(findings) - 20} more")
    return 1 if fallen or not results else 0


def main():
    parser = argparse.ArgumentParser(prog="scripts/torture", description=__doc__,
                                     formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--short", action="store_true",
                        help="a selection: the first and the last one of like calls, the errors in turn")
    parser.add_argument("--only", metavar="CALL", help="fail this system call only, such as write")
    parser.add_argument("--share", nargs=2, type=int, help=argparse.SUPPRESS)  # worker: which share, of how many
    options = parser.parse_args()
    if options.only and options.only not in {call for fault in all_faults() for call in fault.calls}:
        parser.error(f"{options.only} is none of the calls that can be failed (FAULTS in {Path(__file__).name})")
    if options.share:
        return run_share(options)
    os.chdir(CHECKOUT)
    prepare()
    begin = time.monotonic()
    results = []
    for result in collect(options):
        results.append(result)
        if sys.stderr.isatty():
            print(f"\r{len(results)} runs", end="\r", file=sys.stderr)
    return print_table(results, time.monotonic() - begin)


if __name__ == "__main__":
    try:
        sys.exit(main())
    except KeyboardInterrupt:
        sys.exit(128 + signal.SIGINT)
