# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors

"""The report in Python: the same rows, whitelist, rounding and statistics, with sqlite3 and plistlib.

python_report.py DATABASE DAY WHITELIST OUTPUT
"""

import bisect
import datetime
import math
import os
import plistlib
import sqlite3
import struct
import sys


def options_for(keys, prefixes, sizes, key):
    options = keys.get(key)
    if options is not None:
        return options
    for size in sizes:
        options = prefixes.get(key[:size])
        if options is not None:
            return options
    return None


def rounded(value, options):
    bucket = options.get("bucket_interval")
    if bucket is not None:
        value = (value + bucket // 2) // bucket * bucket if bucket else 0
    figures = options.get("sig_fig")
    if figures is not None and value:
        excess = math.ceil(math.log10(abs(value))) - figures
        if excess >= 1:
            value = int(10.0**excess * round(value / 10.0**excess))
    return value


def summary(blob, bounds):
    minimum = maximum = mean = squares = 0.0
    count = 0
    counts = [0] * (len(bounds) + 1)
    for x, _ in struct.iter_unpack("<di", blob):
        if count == 0:
            minimum = maximum = mean = x
            count = 1
        else:
            if x < minimum:
                minimum = x
            elif x > maximum:
                maximum = x
            count += 1
            delta = x - mean
            mean += delta / count
            squares += delta * (x - mean)
        if bounds:
            counts[bisect.bisect_left(bounds, x)] += 1
    ends = ["-inf"] + [format(bound, ".16g") for bound in bounds] + ["inf"]
    histogram = {
        f"({ends[i]}, {ends[i + 1]}" + (")" if i == len(bounds) else "]"): n
        for i, n in enumerate(counts)
        if n
    }
    return [minimum, maximum, mean, squares, count], histogram


def main():
    database, day, whitelist, output = sys.argv[1:5]
    day = int(day)
    tables = {name: {} for name in ("ScalarKeys", "ScalarKeyPrefixes", "DistributionKeys",
                                    "DistributionKeyPrefixes")}
    with open(whitelist, "rb") as file:
        for group in plistlib.load(file).values():
            for name, entries in group.items():
                tables[name].update(entries)
    sizes = {name: sorted({len(key) for key in tables[name]}, reverse=True) for name in tables}
    connection = sqlite3.connect(database)
    scalars, distributions, histograms = {}, {}, {}
    where = "WHERE day BETWEEN ? AND ? ORDER BY day, key"
    for key, value in connection.execute(f"SELECT key, value FROM scalars {where}", (day - 1, day)):
        options = options_for(tables["ScalarKeys"], tables["ScalarKeyPrefixes"],
                              sizes["ScalarKeyPrefixes"], key)
        if options is not None:
            scalars[key] = rounded(value, options)
    for key, blob in connection.execute(f"SELECT key, samples FROM packed {where}", (day - 1, day)):
        options = options_for(tables["DistributionKeys"], tables["DistributionKeyPrefixes"],
                              sizes["DistributionKeyPrefixes"], key)
        if options is not None:
            distributions[key], histogram = summary(blob, options.get("intervals", []))
            if histogram and "intervals" in options:
                histograms[key] = histogram
    log = {"PLCrashLogVersion": 1, "PLLogCreationDate": datetime.datetime.now(),
           "PLScalars": scalars, "PLDistributions": distributions,
           "PLDistributionsHistogram": histograms}
    with open(output, "wb") as file:
        file.write(plistlib.dumps(log, sort_keys=False))
        file.flush()
        os.fsync(file.fileno())


main()
