#!/usr/bin/env python3
"""The work of tools/faults, which starts it, in a directory for throw-away roots. See there."""

import argparse
import collections
import concurrent.futures
import os
import queue
import re
import shutil
import signal
import subprocess
import sys
import tempfile

STORAGE = "/var/db/timezone/"
ZONEINFO, ICUTZ, LOCALTIME, LATEST, RECORD = (
    STORAGE + name for name in ("zoneinfo", "icutz", "localtime", "tz_latest",
                                "TZVersionDiffRecord"))
OLD_ICUTZ, OLD_ICU = "/var/db/icutz", "/var/db/icu"
OWN = {ZONEINFO, ICUTZ, LOCALTIME, RECORD, OLD_ICUTZ, OLD_ICU}
SYSTEM_TREE = "/usr/share/zoneinfo.default"
OLDER_DOWNLOAD, DOWNLOAD = STORAGE + "tz/2016b.2.0", STORAGE + "tz/2016c.1.0"
DEFAULT_ZONE = ZONEINFO + "/America/Los_Angeles"
ABSENT = "(absent)"

ERRORS = ("EIO", "EACCES", "ENOSPC", "EROFS", "ENOMEM", "EMFILE", "EINTR")
# What a call can fail with, where that isn't each of these.
POSSIBLE = {"brk": ("ENOMEM",), "mmap": ("ENOMEM",), "munmap": ("ENOMEM",), "rt_sigaction": (),
            "futex": (), "exit_group": ()}
TIME_LIMIT = 20  # seconds

# A whole line of warn(3).
WARNING = re.compile("olmboot: .+: (%s)" % "|".join(
    re.escape(text) for text in {os.strerror(number) for number in range(134)}))


def link(target):
    return "-> " + target


def active(data_set):
    return {ZONEINFO: link(data_set + "/zoneinfo"), ICUTZ: link(data_set + "/icutz")}


COMMON = {
    SYSTEM_TREE + "/+VERSION": "2016b\n",
    SYSTEM_TREE + "/America/Los_Angeles": "zone",
    SYSTEM_TREE + "/Europe/Paris": "zone",
    "/usr/share/icu/icutzformat.txt": "44l\n",
    DOWNLOAD + "/zoneinfo/+VERSION": "2016c\n",
    DOWNLOAD + "/zoneinfo/America/Los_Angeles": "zone",
    DOWNLOAD + "/zoneinfo/Europe/Paris": "zone",
    DOWNLOAD + "/icutz/icutz44l.dat": "data",
    OLDER_DOWNLOAD + "/zoneinfo/Europe/Paris": "zone",
    OLDER_DOWNLOAD + "/icutz/icutz44l.dat": "data",
    LATEST: link(DOWNLOAD),
    LOCALTIME: link(ZONEINFO + "/Europe/Paris"),
}
UPDATED = {**COMMON, **active(DOWNLOAD), RECORD: "2016b.1.0_2016c.1.0"}
BOOTS = {
    "new device": {path: what for path, what in COMMON.items()
                   if not path.startswith(STORAGE)} | {STORAGE + "tz/none": ""},
    "update": {**COMMON, ZONEINFO: link(SYSTEM_TREE)},
    "newer download": {**COMMON, **active(OLDER_DOWNLOAD), RECORD: "2016b.1.0_2016b.2.0"},
    "nothing new": UPDATED,
    "system upgrade": {**UPDATED, SYSTEM_TREE + "/+VERSION": "2016d\n"},
    "older entries": {**UPDATED, ICUTZ: ABSENT, OLD_ICUTZ: link(DOWNLOAD + "/icutz"), OLD_ICU: "",
                      LOCALTIME: link("/usr/share/zoneinfo/Europe/Paris")},
}


class Device:
    """A throw-away root with the program in it."""

    def __init__(self):
        self.root = tempfile.mkdtemp()
        os.mkdir(self.root + "/sbin")
        shutil.copy(os.environ["OLMBOOT_PROGRAM"], self.root + "/sbin/olmboot")
        self.trace = self.root + "/trace"

    def put(self, entries):
        for top in ("/usr", "/var"):
            shutil.rmtree(self.root + top, ignore_errors=True)
        for path, what in entries.items():
            if what == ABSENT:
                continue
            os.makedirs(os.path.dirname(self.root + path), exist_ok=True)
            if what.startswith("-> "):
                os.symlink(what[3:], self.root + path)
            else:
                with open(self.root + path, "w", encoding="ascii") as file:
                    file.write(what)

    def look(self):
        found = {}
        for top in ("/usr", "/var"):
            for directory, names, files in os.walk(self.root + top):
                for name in names + files:
                    path = os.path.join(directory, name)
                    if os.path.islink(path):
                        what = link(os.readlink(path))
                    elif os.path.isdir(path):
                        what = "(directory)"
                    else:
                        with open(path, encoding="ascii") as file:
                            what = file.read()
                    found[path[len(self.root):]] = what
        return found

    def boot(self, *injection):
        """Runs the program. Returns its status, a signal's negated, and the lines that it printed;
        one on standard output says so."""
        command = ["setarch", "-R", "chroot", self.root, "/sbin/olmboot"]
        if injection:
            command = ["strace", "-o", self.trace, *injection, *command]
        run = subprocess.run(command, capture_output=True, check=False, timeout=TIME_LIMIT)
        # strace has a word to say about an address that 32 bits don't hold.
        lines = [line for line in run.stderr.decode().splitlines()
                 if not line.startswith("strace: ")]
        return run.returncode, lines + [
            "on standard output: " + line for line in run.stdout.decode().splitlines()]


def resolves(state, path):
    """Whether the path, through the links in it, leads to something."""
    for _ in range(10):
        for start in (path[:at.start()] for at in re.finditer("/", path + "/")):
            what = state.get(start, "")
            if what.startswith("-> "):
                path = what[3:] + path[len(start):]
                break
        else:
            return path in state
    return False


class Call:
    """A system call of a run: its name, which of that name it is in the trace, and its line."""

    def __init__(self, name, nth, line, old_end):
        self.name, self.nth, self.line, self.old_end = name, nth, line, old_end

    @property
    def writes_line(self):
        return self.line.startswith("write(2,")

    @property
    def writes_record(self):
        return self.name == "ftruncate" or self.name == "write" and "_" in self.line

    def errors(self):
        return POSSIBLE.get(self.name, ERRORS)

    def injection(self, fault):
        if fault == "kill":
            what = "signal=SIGKILL"
        elif self.name == "brk":
            what = "retval=" + self.old_end  # that is how this call fails
        else:
            what = "error=" + fault
        return "-e", f"trace={self.name}", "-e", f"inject={self.name}:{what}:when={self.nth}"


def calls_of(device, start):
    """The calls that the program makes on the device after the C library's start."""
    device.put(start)
    device.boot("-e", "trace=all")
    calls, seen, old_end, started = [], {}, "0", False
    with open(device.trace, encoding="utf-8") as trace:
        for line in trace:
            name = line.split("(")[0]
            if line.startswith("+++"):
                break
            seen[name] = seen.get(name, 0) + 1
            # What prepare_process() calls first.
            started = started or line.startswith("rt_sigaction(SIGPIPE")
            if started:
                calls.append(Call(name, seen[name], line.strip(), old_end))
            if name == "brk":
                old_end = line.split("= ")[-1].strip()
    if not calls:
        sys.exit("faults: the trace doesn't show where the program starts")
    return calls


class History:
    """A device, what an undisturbed boot leaves of it, and what a second one does."""

    def __init__(self, device, start):
        self.start = start
        device.put(start)
        self.before = device.look()
        device.boot()
        self.middle = device.look()
        device.boot()
        self.after = device.look()


class Outcome:
    """What one fault led to: what the run left, and what the next boot did."""

    def __init__(self, call, fault):
        self.call, self.fault, self.killed = call, fault, fault == "kill"
        self.status, self.lines, self.left = None, [], {}
        self.next_status, self.after = None, {}
        self.exceptions, self.violations = [], []

    def names(self, path):
        return f'"{path}"' in self.call.line


# The exceptions that olmboot(8) names under CAVEATS: each says whether it explains that the next
# boot leaves `found` at a path. `was` is what stood there before the fault.

def record_not_written(outcome, path, was, found):
    return (path == RECORD and found in (was, "")
            and outcome.left.get(ZONEINFO) == link(DOWNLOAD + "/zoneinfo")
            and (outcome.killed or outcome.names(RECORD) or outcome.call.writes_record))


def record_names_system(_outcome, path, _was, found):
    return path == RECORD and found == UPDATED[RECORD]


def icu_link_not_new(outcome, path, was, found):
    return (path == ICUTZ and found in (was, ABSENT) and outcome.killed
            and outcome.left.get(ZONEINFO) == link(DOWNLOAD + "/zoneinfo"))


def old_icu_link_lost(outcome, path, was, found):
    return (path == ICUTZ and found == was == ABSENT and not outcome.killed
            and OLD_ICUTZ not in outcome.left
            and (outcome.names(OLD_ICUTZ) or outcome.names(ICUTZ)))


def icu_link_left_over(outcome, path, was, found):
    return (path == ICUTZ and found == was != ABSENT
            and outcome.left.get(ZONEINFO) == link(SYSTEM_TREE)
            and (outcome.killed or outcome.names(ICUTZ)))


def zone_lost(outcome, path, _, found):
    return (path == LOCALTIME and found == link(DEFAULT_ZONE)
            and (LOCALTIME not in outcome.left if outcome.killed
                 else outcome.names(LOCALTIME) or ZONEINFO + "/" in outcome.call.line))


RULES = (record_not_written, record_names_system, icu_link_not_new, old_icu_link_lost,
         icu_link_left_over, zone_lost)


def ended_early(outcome):
    """The one early end that a single fault leads to: the default local time link can't be made."""
    return outcome.status == 1 and outcome.call.name == "symlink" and outcome.names(LOCALTIME)


def make_fault(device, history, call, fault):
    """Makes one fault happen on the device and returns its Outcome."""
    outcome = Outcome(call, fault)
    device.put(history.start)
    try:
        outcome.status, outcome.lines = device.boot(*call.injection(fault))
        outcome.left = device.look()
        outcome.next_status, _ = device.boot()
    except subprocess.TimeoutExpired:
        outcome.violations.append(f"no end after {TIME_LIMIT} s")
        return outcome
    outcome.after = device.look()
    check(device, history, outcome)
    return outcome


def check(device, history, outcome):
    """Fills in the outcome's exceptions and violations."""
    left, violations = outcome.left, outcome.violations
    if outcome.killed:
        if outcome.status != -signal.SIGKILL:
            violations.append(f"not killed, but status {outcome.status}")
    else:
        with open(device.trace, encoding="utf-8") as trace:
            if "INJECTED" not in trace.read():
                violations.append("the fault did not strike")
        if ended_early(outcome):
            outcome.exceptions.append("ended early")
        elif outcome.status != 0:
            violations.append(f"status {outcome.status}")
        elif not (resolves(left, ZONEINFO)
                  and left.get(LOCALTIME, "").startswith(link(ZONEINFO))):
            violations.append("links that can't be used")
    if not outcome.killed and not outcome.call.writes_line:
        violations += [f"this line is not a warning: {line}" for line in outcome.lines
                       if not WARNING.fullmatch(line)]
    for path in sorted(left.keys() | history.before.keys()):
        if left.get(path) != history.before.get(path) and path not in OWN:
            violations.append(f"{path} has changed")
    if left.get(RECORD) != history.before.get(RECORD) and {
            ZONEINFO: left.get(ZONEINFO), ICUTZ: left.get(ICUTZ)} != active(DOWNLOAD):
        violations.append("a record of an update that is not installed")
    if outcome.next_status != 0:
        violations.append(f"the next boot has status {outcome.next_status}")
    for path in sorted(history.after.keys() | outcome.after.keys()):
        expected = history.after.get(path, ABSENT)
        found = outcome.after.get(path, ABSENT)
        if expected == found:
            continue
        was = history.before.get(path, ABSENT)
        allowed = [rule.__name__.replace("_", " ") for rule in RULES
                   if rule(outcome, path, was, found)]
        if allowed:
            outcome.exceptions += allowed
        else:
            violations.append(f"the next boot leaves {path} {found!r} instead of {expected!r}")


def show(outcome, history):
    """Shows one fault to a person."""
    print(outcome.call.line)
    print(f"fault: {outcome.fault}; status: {outcome.status}")
    for line in outcome.lines:
        print("printed:", line)
    for title, earlier, later in (("changed", history.before, outcome.left),
                                  ("the next boot changed", outcome.left, outcome.after)):
        for path in sorted(earlier.keys() | later.keys()):
            if earlier.get(path) != later.get(path):
                print(f"{title}: {path} {later.get(path, ABSENT)}")
    for name in outcome.exceptions:
        print("exception:", name)
    for violation in outcome.violations:
        print("violation:", violation)


def run_boot(name, devices):
    """Makes every fault of one boot happen, prints its row, and returns its violations."""
    free = queue.SimpleQueue()
    for device in devices:
        free.put(device)
    history = History(devices[0], BOOTS[name])
    calls = calls_of(devices[0], BOOTS[name])
    faults = [(n, call, fault) for n, call in enumerate(calls, 1)
              for fault in (*call.errors(), "kill")]

    def work(numbered):
        n, call, fault = numbered
        device = free.get()
        try:
            return n, make_fault(device, history, call, fault)
        finally:
            free.put(device)

    exceptions, violations = collections.Counter(), []
    with concurrent.futures.ThreadPoolExecutor(len(devices)) as workers:
        for done, (n, outcome) in enumerate(workers.map(work, faults), 1):
            exceptions.update(outcome.exceptions)
            violations += [(n, outcome.fault, violation) for violation in outcome.violations]
            if sys.stderr.isatty():
                print(f"\r{name}: {done} of {len(faults)}\033[K", end="\r", file=sys.stderr)
    kills = len(calls)
    row = ", ".join(f"{exception} {count}" for exception, count in sorted(exceptions.items()))
    print(f"{name:15} {len(calls):5} {len(faults) - kills:6} {kills:5} {len(violations):10}  {row}",
          flush=True)
    return [f"{violation}; see it: tools/faults --boot '{name}' --call {n} --fault {fault}"
            for n, fault, violation in violations]


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("--boot", choices=BOOTS)
    parser.add_argument("--call", type=int)
    parser.add_argument("--fault", choices=(*ERRORS, "kill"))
    options = parser.parse_args()
    if options.boot and options.call and options.fault:
        device = Device()
        history = History(device, BOOTS[options.boot])
        call = calls_of(device, BOOTS[options.boot])[options.call - 1]
        outcome = make_fault(device, history, call, options.fault)
        show(outcome, history)
        return 1 if outcome.violations else 0
    print("boot            calls faults kills violations  exceptions")
    devices = [Device() for _ in range(os.cpu_count() or 1)]
    violations = []
    for name in [options.boot] if options.boot else BOOTS:
        violations += run_boot(name, devices)
    for violation in violations:
        print(violation)
    print(f"{len(violations)} violations")
    return 1 if violations else 0


if __name__ == "__main__":
    sys.exit(main())
