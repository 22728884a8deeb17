#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
"""Whether includes, targets and calls follow the order of the rooms, and no calls go in a circle.

check_rooms.py BUILD, in the project's folder: BUILD is a build whose objects are there. The order is
the block "rooms" of docs/ARCHITECTURE.md, from the ground up: a room knows those before it only, and
a main.cpp knows all. Calls are what one object leaves undefined and another defines, so that a circle
is seen that no include shows. Prints each arrow up and each circle; exit status 1 if there is one.
"""
import collections
import json
import os
import re
import subprocess
import sys

failures = []
sources = subprocess.check_output(["git", "ls-files", "--", "*.cpp", "*.h"], text=True).split()
with open("docs/ARCHITECTURE.md", encoding="utf-8") as text:
    rooms = re.search(r"^```rooms\n(.*?)^```", text.read(), re.M | re.S)[1].split()


def room_of(path):
    """The room of a file; none for tests and the like."""
    folder, name = os.path.split(path)
    return None if folder not in rooms else "main" if name == "main.cpp" else folder


def height(room):
    return len(rooms) if room == "main" else rooms.index(room)


def arrow(source, target, what):
    if source and target and height(source) < height(target):
        failures.append(f"{source} knows {target}: {what}")


for folder in sorted({os.path.dirname(path) for path in sources}):
    top = folder.split("/")[0]
    if top not in ("tests", "fuzz", "bench") and folder not in rooms:
        failures.append(f"{folder}: no room of docs/ARCHITECTURE.md")
for path in filter(room_of, sources):
    with open(path, encoding="utf-8") as text:
        for included in re.findall(r'^#include "(.*)"', text.read(), re.M):
            public = f"NANDInfo/include/{included}"
            arrow(room_of(path), room_of(public if os.path.exists(public) else included),
                  f"{path} includes {included}")

folder_of = {}
uses = []
for path in subprocess.check_output(["git", "ls-files", "--", "*CMakeLists.txt"], text=True).split():
    with open(path, encoding="utf-8") as text:
        for name, folder, rest in re.findall(r"^\s*add_room\((\S+)\s+([^\s)]+)([^)]*)", text.read(), re.M):
            folder_of[name] = folder
            used = re.search(r"USES([^A-Z]*)", rest)
            uses += [(name, target) for target in (used[1].split() if used else [])]
for name, target in uses:
    arrow(folder_of[name], folder_of.get(target), f"{name} uses {target}")

# The calls: an edge for each symbol from the object that needs it to the one that has it.
build = sys.argv[1]
objects = {}
with open(f"{build}/compile_commands.json", encoding="utf-8") as commands:
    for command in json.load(commands):
        path = os.path.relpath(command["file"])
        made = os.path.join(command["directory"], re.search(r" -o (\S+)", command["command"])[1])
        if room_of(path) and os.path.exists(made):
            objects[made] = path
if not objects:
    sys.exit(f"{build}: no objects")
defined = {}
needed = collections.defaultdict(set)
listing = subprocess.check_output(["nm", "-A", "-g", "-P", *objects], text=True)
for item, symbol, kind in re.findall(r"^(\S+): (\S+) (\S)", listing, re.M):
    if kind == "U":
        needed[symbol].add(objects[item])
    elif kind in "TDBRGSCu":
        defined[symbol] = objects[item]
calls = collections.defaultdict(set)
for symbol, callers in needed.items():
    for caller in callers:
        if symbol in defined and defined[symbol] != caller:
            calls[caller, defined[symbol]].add(symbol)


def named(symbols):
    shown = subprocess.check_output(["c++filt", *sorted(symbols)[:3]], text=True).split("\n")[:-1]
    return "; ".join(re.sub(r"\(.*", "", name) for name in shown) + ("; …" if len(symbols) > 3 else "")


def circles(edges):
    """The groups of nodes that reach each other."""
    after = collections.defaultdict(set)
    for source, target in edges:
        after[source].add(target)
    reached = {}
    for node in list(after):
        found, open_ = set(), [node]
        while open_:
            open_ += after[last] - found if (last := open_.pop()) in after else []
            found |= after.get(last, set())
        reached[node] = found
    return {frozenset(other for other in found if node in reached.get(other, ()))
            for node, found in reached.items() if node in found}


for (caller, callee), symbols in sorted(calls.items()):
    arrow(room_of(caller), room_of(callee), f"{caller} calls {named(symbols)} of {callee}")
for group in circles(calls):
    failures.append("a circle of calls:" + "".join(
        f"\n  {caller} -> {callee}: {named(symbols)}"
        for (caller, callee), symbols in sorted(calls.items()) if {caller, callee} <= group))
for group in circles((a, b) for a, b in {(room_of(x), room_of(y)) for x, y in calls} if a != b):
    failures.append("a circle of rooms: " + ", ".join(sorted(group)))

print("\n".join(failures) or f"{len(objects)} objects of {len(rooms)} rooms, no circle, no arrow up")
sys.exit(bool(failures))
