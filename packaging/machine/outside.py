#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
"""What the virtual machine's days have left, seen from outside it.

outside.py manifest TREE      every file of a tree: whose it is, when it was changed, and what it holds
outside.py look WORK UNITS    the checks, of what machine.sh leaves in WORK and of the 512,000-byte units
                              that were written to the spare drive; "ok" or "not ok" and what, a line each
"""
import hashlib
import json
import math
import os
import plistlib
import re
import stat
import sys

DATA = "var/lib/morvend"
SPOOL = f"{DATA}/var/spool/morvend"
# What holds no state, and the trial itself.
NOT_LOOKED_AT = re.compile(r"(dev|lost\+found|proc|run|sys|tmp|trial|var/tmp)(/|$)")
# What an installation changes beside the packages' files: the packages' and the system's own records.
INSTALLING = re.compile("|".join([
    r"etc/(passwd|group|shadow|gshadow)-?", r"etc/ld\.so\.cache", r"etc/\.pwd\.lock",
    r"etc/systemd/system/timers\.target\.wants/morvend-[a-z-]+\.timer", f"{DATA}(/.*)?",
    r"var/cache/(apt|debconf|ldconfig)/.*", r"var/lib/(apt|dpkg)/.*", r"var/log/.*",
    r"var/lib/systemd/deb-systemd-helper-enabled/.*"]))
# What days change: systemd's records, its journal, and the nightly copy of dpkg's.
DAYS = re.compile("|".join([
    f"{DATA}/.*", r"etc/\.(pwd\.lock|updated)", r"etc/machine-id", r"var/\.updated", r"var/backups/.*",
    r"var/lib/dbus/machine-id", r"var/lib/private(/.*)?",
    r"var/lib/systemd/(catalog|coredump|network|pstore|random-seed|timers|timesync|linger|rfkill|backlight|ephemeral-trees)(/.*)?",
    r"var/log/(journal/.*|btmp|lastlog|wtmp)"]))

failures = 0


def check(what, wrong):
    """Nothing is wrong if it is empty; else its lines say what."""
    global failures
    print(f"{'not ok' if wrong else 'ok'} - {what}")
    failures += bool(wrong)
    for line in wrong[:40]:
        print(f"    {line}")


def manifest(tree):
    for folder, folders, files in os.walk(tree):
        folders[:] = [name for name in folders
                      if not NOT_LOOKED_AT.match(os.path.relpath(os.path.join(folder, name), tree))]
        for name in folders + files:
            path = os.path.join(folder, name)
            about = os.lstat(path)
            content = when = "-"
            if stat.S_ISLNK(about.st_mode):
                content = os.readlink(path)
            elif stat.S_ISREG(about.st_mode):
                with open(path, "rb") as file:
                    content = hashlib.file_digest(file, "sha256").hexdigest()
                when = int(about.st_mtime)
            # debugfs hands out files without what would be dangerous: setuid and setgid.
            mode = about.st_mode & ~(stat.S_ISUID | stat.S_ISGID)
            print(os.path.relpath(path, tree), f"{mode:o} {about.st_uid}:{about.st_gid} {when} {content}", sep="\t")


def changed(before, after):
    """The paths that only one of two manifests has, or that aren't the same in both."""
    states = []
    for name in (before, after):
        with open(f"{name}.manifest", encoding="utf-8", errors="surrogateescape") as lines:
            states.append(dict(line.rstrip("\n").split("\t") for line in lines))
    return sorted(path for path in states[0].keys() | states[1].keys()
                  if states[0].get(path) != states[1].get(path))


def files_of_new_packages(before, after):
    """As the packages' lists name them, below /usr where / leads there."""
    info = "var/lib/dpkg/info"
    paths = set()
    for name in set(os.listdir(f"{after}/{info}")) - set(os.listdir(f"{before}/{info}")):
        if name.endswith(".list"):
            with open(f"{after}/{info}/{name}", encoding="utf-8") as lines:
                paths |= {re.sub("^/(?=(bin|lib|lib64|sbin)/)", "/usr/", line.strip())[1:] for line in lines}
    return paths


def read_json(path):
    with open(path, encoding="utf-8") as file:
        return json.load(file)


# A figure of `nandinfo drives` and what nvme-cli calls it.
SAME_FIGURES = {
    "criticalWarning": "critical_warning", "temperature": "temperature", "availableSpare": "avail_spare",
    "availableSpareThreshold": "spare_thresh", "percentageUsed": "percent_used",
    "enduranceGroupWarning": "endurance_grp_critical_warning_summary", "dataUnitsRead": "data_units_read",
    "dataUnitsWritten": "data_units_written", "hostReadCommands": "host_read_commands",
    "hostWriteCommands": "host_write_commands", "controllerBusyMinutes": "controller_busy_time",
    "powerCycles": "power_cycles", "powerOnHours": "power_on_hours", "unsafeShutdowns": "unsafe_shutdowns",
    "mediaErrors": "media_errors", "errorLogEntries": "num_err_log_entries",
    "warningTemperatureMinutes": "warning_temp_time", "criticalTemperatureMinutes": "critical_comp_time",
    "thermalTransitions1": "thm_temp1_trans_count", "thermalTransitions2": "thm_temp2_trans_count",
    "thermalSeconds1": "thm_temp1_total_time", "thermalSeconds2": "thm_temp2_total_time",
    **{f"temperatureSensor{i}": f"temperature_sensor_{i}" for i in range(1, 9)}}


def disagreements(figures, before, after):
    """Figures that aren't what the other tool read just before and after, or that only one of them has."""
    names = {ours: theirs for ours, theirs in SAME_FIGURES.items() if ours in figures or theirs in before}
    wrong = [f"{name}: nobody else has it" for name in figures.keys() - names.keys()]
    wrong += [f"{name}: nvme-cli alone has it" for name in before.keys() - set(names.values())]
    for ours, theirs in names.items():
        value, least, most = (int(all.get(name, 0)) for all, name in (
            (figures, ours), (before, theirs), (after, theirs)))
        if not least <= value <= most:
            wrong.append(f"{ours}: {value}, by nvme-cli {least} to {most}")
    return wrong


def rounded(value, figures):
    """To so many significant figures, halves away from 0."""
    unit = 10 ** max(0, len(str(abs(value))) - figures)
    return int(math.copysign((abs(value) + unit // 2) // unit * unit, value))


def look_at_changes(work):
    own = files_of_new_packages(f"{work}/bootable", f"{work}/machine")
    check("the installation changed nothing but the packages' files and the system's records",
          [path for path in changed(f"{work}/plain", f"{work}/installed")
           if path not in own and not INSTALLING.fullmatch(path)])
    check("the days changed nothing but what is the device's, systemd's and the log's",
          [path for path in changed(f"{work}/installed", f"{work}/after") if not DAYS.fullmatch(path)])

    with open(f"{work}/after/etc/passwd", encoding="utf-8") as lines:
        user = next(int(line.split(":")[2]) for line in lines if line.startswith("_morvend:"))
    foreign, count = [], 0
    for folder, folders, files in os.walk(f"{work}/after/{DATA}"):
        for name in folders + files:
            path = os.path.join(folder, name)
            count += 1
            if os.lstat(path).st_uid != user:
                foreign.append(os.path.relpath(path, work))
    check(f"all that is below /{DATA}, {count} names, is _morvend's", foreign if count else ["there is nothing"])


def look_at_drives(work, units):
    kept = f"{work}/after/trial/kept"
    looks = {}
    for look in ("first", "second"):
        with open(f"{kept}/{look}.sectors_written", encoding="utf-8") as lines:
            sectors = dict(line.split() for line in lines)
        for drive in read_json(f"{kept}/{look}.drives.json"):
            looks[look, drive["serial"]] = drive, int(sectors[drive["name"]])
    drives = read_json(f"{kept}/second.drives.json")
    check("the drives are there, the system's first", [] if [
        (drive["serial"], drive["holdsRoot"]) for drive in drives] == [("system", True), ("scratch", False)]
        else [json.dumps(drives)])

    for drive in drives:
        wrong = disagreements(drive["figures"], *(
            read_json(f"{kept}/{drive['name']}.{when}.json") for when in ("before", "after")))
        check(f"nandinfo and nvme-cli agree on {len(drive['figures'])} figures of {drive['name']}, "
              f"the {drive['serial']} drive", wrong)

    def growth(serial):
        (before, sectors_before), (after, sectors_after) = (looks[look, serial] for look in ("first", "second"))
        return (after["figures"]["dataUnitsWritten"] - before["figures"]["dataUnitsWritten"],
                sectors_after - sectors_before)

    written, sectors = growth("scratch")
    check(f"the spare drive's host writes grew by {written} units, {units} written",
          [] if (written, sectors) == (units, units * 1000) else [f"{sectors} sectors by the kernel"])
    # Rounded up to a unit each time, and the kernel was asked a moment later.
    written, sectors = growth("system")
    check(f"the system drive's grew by {written} units, {sectors} sectors by the kernel",
          [] if abs(written * 1000 - sectors) <= 2000 else ["too far apart"])
    with open(f"{work}/scratch.img", "rb") as image:
        content, rest = image.read(units * 512000), image.read()
    expected = (b"morvend\n" * (units * 64000))[:len(content)]
    check("the spare drive holds what was written and nothing else",
          [] if content == expected and not rest.strip(b"\0") else ["other bytes"])


def look_at_report(work, units):
    kept = f"{work}/after/trial/kept"
    with open(f"{kept}/report", "rb") as file:
        report = plistlib.load(file)
    scalars, distributions = report.get("PLScalars", {}), report.get("PLDistributions", {})
    counted, measured = {}, set()
    with open(f"{kept}/counters.jsonl", encoding="utf-8") as lines:
        for line in map(json.loads, lines):
            if "samples" in line:
                measured.add(line["key"])
            else:
                counted[line["key"]] = line["value"]

    # What the whitelist of the package names, of what this machine has.
    listed = r"host\.(vmstat|disk)\.|com\.norba\.(NANDInfo\.|tarvenn\.DiskUsageUser)"
    due = {key: rounded(value, 2) for key, value in counted.items() if key.startswith(("host.vmstat.", "host.disk."))}
    check(f"the report holds the day's {len(due)} counts, rounded to two figures",
          [f"{key}: {scalars.get(key)}, of {counted[key]}" for key, value in due.items()
           if scalars.get(key) != value] if due else ["nothing was counted"])
    check("no other count", [key for key in scalars if not re.match(listed, key)])
    due = {key for key in measured if re.match(r"host\.(loadavg\.15m$|pressure\.|thermal\.)", key)}
    check(f"the day's {len(due)} distributions, and no other", sorted(due ^ distributions.keys())
          if due else ["nothing was measured"])
    name = next(drive["name"] for drive in read_json(f"{kept}/second.drives.json") if drive["serial"] == "scratch")
    key = f"host.disk.{name}n1.sectors_written"
    check(f"what was written to the spare drive, {units * 1000} sectors, as {scalars.get(key)}",
          [] if counted.get(key) == units * 1000 else [f"counted were {counted.get(key)}"])

    with open(f"{work}/after/{SPOOL}/events.jsonl", encoding="utf-8") as lines:
        events = [json.loads(line) for line in lines]
    writes = [event["payload"].get("hostWrites") for event in events if event["event"].endswith("FTLCounters_1")]
    check(f"the storage's event tells the system drive's writes, {writes} sectors of 4,096 bytes",
          [] if writes and all(count and count % 125 == 0 for count in writes) else ["none"])


def main():
    if sys.argv[1] == "manifest":
        manifest(sys.argv[2])
        return 0
    work, units = sys.argv[2], int(sys.argv[3])
    look_at_changes(work)
    look_at_drives(work, units)
    look_at_report(work, units)
    return 1 if failures else 0


sys.exit(main())
