#!/usr/bin/env python3
"""The work of tools/faults, which starts it, in a directory for throw-away roots. See there."""

import collections
import concurrent.futures
import os
import pathlib
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
ON_SYSTEM, ON_DOWNLOAD = "-> " + SYSTEM_TREE, f"-> {DOWNLOAD}/zoneinfo"
TREES = {ON_SYSTEM, ON_DOWNLOAD, f"-> {OLDER_DOWNLOAD}/zoneinfo"}
ABSENT = "(absent)"

ERRORS = ("EIO", "EACCES", "ENOSPC", "EROFS", "ENOMEM", "EMFILE", "EINTR")
# What a call can fail with, where that isn't each of these.
POSSIBLE = {"brk": (), "mmap": ("ENOMEM",), "munmap": ("ENOMEM",), "rt_sigaction": (), "futex": (),
            "exit_group": ()}
TIME_LIMIT = "20"  # seconds

# A whole line of warn(3), and a primitive's, whose cause the next line repeats.
WARNING = re.compile("olmboot: .+: (%s)" % "|".join(
    re.escape(text) for text in {os.strerror(number) for number in range(134)}))
PRIMITIVE = re.compile("olmboot: (read_symlink|remove|create_symlink): ")


def active(data_set):
    return {ZONEINFO: f"-> {data_set}/zoneinfo", ICUTZ: f"-> {data_set}/icutz"}


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
    LATEST: "-> " + DOWNLOAD,
    LOCALTIME: f"-> {ZONEINFO}/Europe/Paris",
}
UPDATED = {**COMMON, **active(DOWNLOAD), RECORD: "2016b.1.0_2016c.1.0"}
# What stands on the device before a boot, and what the boot must make of it.
BOOTS = {
    "new device": ({path: what for path, what in COMMON.items() if not path.startswith(STORAGE)}
                   | {STORAGE + "tz/none": ""}, {ZONEINFO: ON_SYSTEM}),
    "update": ({**COMMON, ZONEINFO: ON_SYSTEM}, UPDATED),
    "newer download": ({**COMMON, **active(OLDER_DOWNLOAD), RECORD: "2016b.1.0_2016b.2.0"},
                       {**UPDATED, RECORD: "2016b.2.0_2016c.1.0"}),
    "nothing new": (UPDATED, UPDATED),
    "system upgrade": ({**UPDATED, SYSTEM_TREE + "/+VERSION": "2016d\n"},
                       {ZONEINFO: ON_SYSTEM, ICUTZ: ABSENT}),
    "older entries": (
        {**UPDATED, ICUTZ: ABSENT, OLD_ICUTZ: f"-> {DOWNLOAD}/icutz", OLD_ICU: "",
         LOCALTIME: "-> /usr/share/zoneinfo/Europe/Paris"},
        {**UPDATED, OLD_ICUTZ: ABSENT, OLD_ICU: ABSENT}),
}


class Device:
    """A throw-away root with the program and the entries in it."""

    program = None  # a copy: one that is still written, by any thread, could not be started

    def __init__(self, entries):
        self.folder = tempfile.TemporaryDirectory()  # goes with the device
        self.root = pathlib.Path(self.folder.name)
        self.trace = self.root / "trace"
        (self.root / "sbin").mkdir()
        os.link(Device.program, self.root / "sbin/olmboot")
        for name, what in entries.items():
            path = self.root / name[1:]
            if what == ABSENT:
                continue
            path.parent.mkdir(parents=True, exist_ok=True)
            if what.startswith("-> "):
                path.symlink_to(what[3:])
            else:
                path.write_text(what)

    def look(self):
        return {f"/{path.relative_to(self.root)}":
                f"-> {os.readlink(path)}" if path.is_symlink() else
                "(directory)" if path.is_dir() else path.read_text()
                for path in self.root.glob("[uv]*/**/*")}

    def boot(self, *injection):
        """Runs the program. Returns its status, a signal's negated, and the lines that it printed;
        one on standard output says so. Kills it at the time limit."""
        command = ["setarch", "-R", "chroot", self.root, "/sbin/olmboot"]
        if injection:
            command = ["strace", "-o", self.trace, *injection, *command]
        run = subprocess.run(["timeout", "-s", "KILL", TIME_LIMIT, *command],
                             capture_output=True, check=False, text=True)
        # strace has a word to say about an address that 32 bits don't hold.
        return run.returncode, [
            line for line in run.stderr.splitlines() if not line.startswith("strace: ")
        ] + ["on standard output: " + line for line in run.stdout.splitlines()]


# A call's name and line in the trace, and what happens to it: an error, or a kill.
Fault = collections.namedtuple("Fault", "name line kind injection")


def faults_of(trace):
    """The faults at each call of the trace after the C library's start."""
    faults, seen = [], collections.Counter()
    for line in trace.read_text().splitlines()[:-1]:  # without the line that tells the status
        name = line.split("(")[0]
        seen[name] += 1
        # What prepare_process() calls first.
        if faults or line.startswith("rt_sigaction(SIGPIPE"):
            for kind in (*POSSIBLE.get(name, ERRORS), "kill"):
                how = "signal=SIGKILL" if kind == "kill" else f"error={kind}"
                faults.append(Fault(name, line, kind, f"inject={name}:{how}:when={seen[name]}"))
    return faults


class Boot:
    """A boot of a device: its faults, and what one and two undisturbed runs leave."""

    def __init__(self, name):
        self.start, purpose = BOOTS[name]
        device = Device(self.start)
        self.before = device.look()
        device.boot("-e", "trace=all")
        self.faults = faults_of(device.trace)
        if not self.faults:
            sys.exit("faults: a run must begin with SIGPIPE")
        once = device.look()
        for path, what in purpose.items():
            if once.get(path, ABSENT) != what:
                sys.exit(f"faults: the boot '{name}' leaves {path} {once.get(path, ABSENT)!r}")
        device.boot()
        self.after = device.look()


def caveat(run, path, was, found):
    """Returns the case under CAVEATS in olmboot(8) which explains that the boot after a run leaves
    `found` at a path where `was` stood before the fault; None if there is none."""
    def at(*paths):
        return any(f'"{name}"' in run.fault.line for name in paths)

    killed = run.fault.kind == "kill"
    on_download = run.left.get(ZONEINFO) == ON_DOWNLOAD
    if path == RECORD and found == UPDATED[RECORD]:
        return "record names the system"
    if path == RECORD and found in (was, "") and on_download and (
            killed or at(RECORD) or run.fault.name in ("ftruncate", "fstat", "newfstatat")
            or run.fault.name == "write" and "_" in run.fault.line):
        return "record not written"
    if path == ICUTZ and found in (was, ABSENT) and on_download and killed:
        return "ICU link missing or old"
    if (path == ICUTZ and found == was == ABSENT and not killed and OLD_ICUTZ not in run.left
            and at(OLD_ICUTZ, ICUTZ)):
        return "old ICU link lost"
    if (path == ICUTZ and found == was != ABSENT and run.left.get(ZONEINFO) == ON_SYSTEM
            and (killed or at(ICUTZ))):
        return "ICU link left over"
    if path == LOCALTIME and found == f"-> {ZONEINFO}/America/Los_Angeles" and (
            LOCALTIME not in run.left if killed
            else at(LOCALTIME) or ZONEINFO + "/" in run.fault.line):
        return "zone lost"
    return None


class Run:
    """One fault of a boot: what the run left, what the next boot did, and what was wrong."""

    def __init__(self, boot, fault):
        self.boot, self.fault = boot, fault
        self.exceptions, self.violations = [], []
        device = Device(boot.start)
        self.status, self.lines = device.boot("-e", f"trace={fault.name}", "-e", fault.injection)
        if fault.kind != "kill" and "INJECTED" not in device.trace.read_text():
            self.violations.append("the fault did not strike")
        self.left = device.look()
        self.next_status, _ = device.boot()
        self.after = device.look()
        self.check_end()
        self.check_links()
        self.check_next_boot()

    def check_end(self):
        if self.fault.kind == "kill":
            if self.status != -signal.SIGKILL:
                self.violations.append(f"not killed, but status {self.status}")
            return
        if not self.fault.line.startswith("write(2,"):
            self.violations += [f"this line is not a warning: {line}" for line in self.lines
                                if not WARNING.fullmatch(line)]
            for line, later in zip(self.lines, self.lines[1:]):
                if PRIMITIVE.match(line) and not later.endswith(line.split(": ")[-1]):
                    self.violations.append(f"another cause than in the line before: {later}")
        if self.status == 1 and re.match(f'symlink.*"{LOCALTIME}"', self.fault.line):
            self.exceptions.append("status 1")
        elif self.status != 0:
            self.violations.append(f"status {self.status}")
        elif (self.left.get(ZONEINFO) not in TREES
              or not self.left.get(LOCALTIME, "").startswith("-> " + ZONEINFO)):
            self.violations.append("links that can't be used")

    def check_links(self):
        before = self.boot.before
        self.violations += [f"{path} has changed" for path in before.keys() | self.left.keys()
                            if path not in OWN and before.get(path) != self.left.get(path)]
        installed = {path: self.left.get(path) for path in (ZONEINFO, ICUTZ)}
        if self.left.get(RECORD) != before.get(RECORD) and installed != active(DOWNLOAD):
            self.violations.append("a record of an update that is not installed")

    def check_next_boot(self):
        if self.next_status != 0:
            self.violations.append(f"the next boot has status {self.next_status}")
        expected = self.boot.after
        for path in sorted(expected.keys() | self.after.keys()):
            found = self.after.get(path, ABSENT)
            if found == expected.get(path, ABSENT):
                continue
            name = caveat(self, path, self.boot.before.get(path, ABSENT), found)
            if name:
                self.exceptions.append(name)
            else:
                self.violations.append(f"the next boot leaves {path} {found!r}")

    def show(self):
        print(f"  fault: {self.fault.kind} at {self.fault.line}", *self.violations,
              f"status: {self.status}", *self.lines, sep="\n  ")
        for title, earlier, later in (("changed", self.boot.before, self.left),
                                      ("the next boot changed", self.left, self.after)):
            for path in sorted(earlier.keys() | later.keys()):
                if earlier.get(path) != later.get(path):
                    print(f"  {title}: {path} {later.get(path, ABSENT)}")


def disturb(name):
    """Makes the faults of a boot happen, prints its row, shows violations, returns the runs."""
    boot, runs = Boot(name), []
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        for run in pool.map(lambda fault: Run(boot, fault), boot.faults):
            runs.append(run)
            if sys.stdout.isatty():
                print(f"{name}: {len(runs)} of {len(boot.faults)} runs", end="\r", flush=True)
    print_row(name, runs)
    for run in runs:
        if run.violations:
            run.show()
    return runs


def print_row(name, runs):
    wrong = sum(len(run.violations) for run in runs)
    print(f"{name:24}{len(runs):10,}{wrong:12,}", flush=True)


def main():
    names = sys.argv[1:] or list(BOOTS)
    if set(names) - BOOTS.keys():
        print("faults: there is no such boot; --help tells more", file=sys.stderr)
        return 2
    if "OLMBOOT_PROGRAM" not in os.environ:
        return 0  # asked about the arguments alone
    Device.program = shutil.copy(os.environ["OLMBOOT_PROGRAM"], tempfile.mkdtemp())
    print("boot                          runs  violations")
    runs = [run for name in names for run in disturb(name)]
    print_row("all", runs)
    exceptions = collections.Counter(name for run in runs for name in run.exceptions)
    if exceptions:
        print("olmboot(8) explains under EXIT STATUS or CAVEATS what these runs left:")
    for exception, count in sorted(exceptions.items()):
        print(f"{exception:24}{count:10,}")
    return 1 if any(run.violations for run in runs) else 0


if __name__ == "__main__":
    for ending in (signal.SIGINT, signal.SIGPIPE):
        signal.signal(ending, signal.SIG_DFL)  # at once, without a traceback
    sys.exit(main())
