#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
"""The form of the sources that a tool for all projects doesn't know. check_sources.py, in the project's
folder; prints what is amiss, and the share of comments. Exit status 1 if anything is.
"""
import os
import re
import subprocess
import sys

HOLDER = "Copyright the morvend authors"
LICENCE = "SPDX-License-Identifier: Apache-2.0"
TABLE = r"(Table|vocabulary/\w*Counters)\.cpp$"
SHARE = (12, 20)  # comments, in percent of the product's lines that aren't blank

failures = []
names = subprocess.check_output(["git", "ls-files"], text=True).split("\n")[:-1]
files = {}
for name in names:
    if re.search(r"\.(cpp|h|c|py|sh|cmake)$|(^|/)CMakeLists\.txt$|^(dev|\.ci/run)$", name):
        with open(name, encoding="utf-8") as text:
            files[name] = text.read()
product = {name: text for name, text in files.items()
           if re.match(r"(base|plist|platform|device|host|NANDInfo|report|daemon|tools)/.*\.(cpp|h)$", name)}

# Whose a file is, in its first lines.
for name, text in files.items():
    head = "\n".join(text.split("\n")[:3])
    if not (LICENCE in head and HOLDER in head):
        failures.append(f"{name}: no licence or holder on top")

# A source has a header of its own, and includes it first. Tables are declared together.
for name, text in product.items():
    folder, base = os.path.split(name)
    if not base.endswith(".cpp") or base == "main.cpp" or re.search(TABLE, name) or folder == "host/modules":
        continue
    own = [f"{folder}/{base[:-4]}.h", f"NANDInfo/include/NANDInfo/{base[:-4]}.h"]
    header = next((path for path in own if path in files), None)
    first = re.search(r'^#include "(.*)"', text, re.M)
    if header is None:
        failures.append(f"{name}: no header of its own")
    elif not first or not header.endswith(first[1]):
        failures.append(f"{name}: its own header isn't included first")

# Lines that are or carry a comment; tables speak for themselves.
lines = comments = 0
for name, text in product.items():
    if re.search(TABLE, name):
        continue
    for line in text.split("\n"):
        if line.strip() and HOLDER not in line and LICENCE not in line:
            lines += 1
            comments += "//" in re.sub(r'"(\\.|[^"\\])*"', "", line)
share = 100 * comments / lines
print(f"comments: {share:.1f} % of {lines} product lines")
if not SHARE[0] <= share <= SHARE[1]:
    failures.append(f"comments are to be {SHARE[0]} to {SHARE[1]} % of the product's lines")

print("\n".join(failures), end="\n" if failures else "")
sys.exit(bool(failures))
