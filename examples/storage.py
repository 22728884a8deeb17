#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
"""What the storage counts, as JSON: storage.py [--root ROOT] [--decode KIND FILE] [NAME...]. Without a
name or a file, the names that there are."""
import argparse
import ctypes
import json
import sys
from ctypes import POINTER, byref, c_char, c_char_p, c_int, c_size_t, c_uint32, c_void_p

ROUND, ALL = 1, 2
SIGNATURES = {
    "name": (c_char_p, c_size_t, POINTER(c_char_p)),
    "kind": (c_char_p, c_size_t, POINTER(c_char_p)),
    "open": (c_int, c_char_p, POINTER(c_void_p), c_void_p),
    "close": (None, c_void_p),
    "collect": (c_int, c_void_p, c_char_p, c_void_p, POINTER(c_void_p), c_void_p),
    "decode": (c_int, c_char_p, c_char_p, c_size_t, c_void_p, POINTER(c_void_p), c_void_p),
    "free": (None, c_void_p),
    "json": (c_void_p, c_void_p, c_int),
    "free_text": (None, c_void_p),
}


class Error(ctypes.Structure):
    _fields_ = [("code", c_int), ("text", c_char * 508)]


class Options(ctypes.Structure):
    _fields_ = [("size", c_size_t), ("code", c_char_p), ("layout", c_char_p), ("flags", c_uint32),
                ("hours", c_uint32), ("channels", c_uint32), ("reserved", c_uint32)]

    def __init__(self, **fields):
        super().__init__(size=ctypes.sizeof(Options), **fields)


class StorageError(Exception):
    """`code` is the library's; `value` is what there was beside the failure, or None."""

    def __init__(self, error, value):
        super().__init__(error.text.decode(errors="replace"))
        self.code, self.value = error.code, value


class Library:
    def __init__(self, path="libNANDInfo.so.0"):
        library = ctypes.CDLL(path)
        for name, (result, *arguments) in SIGNATURES.items():
            function = getattr(library, "nandinfo_" + name)
            function.restype, function.argtypes = result, arguments
            setattr(self, name, function)

    def names(self):
        index = 0
        while (name := self.name(index, None)) is not None:
            yield name.decode()
            index += 1

    def value(self, function, *arguments):
        """The result of collect or decode, in Python's own types."""
        value, error = c_void_p(), Error()
        code = function(*arguments, byref(value), byref(error))
        try:
            text = self.json(value, 0)
            result = json.loads(ctypes.string_at(text))
            self.free_text(text)
        finally:
            self.free(value)
        if code != 0:
            raise StorageError(error, result)
        return result


class Device:
    """`with Device(library, root) as device: device.collect("ftl", flags=ROUND)`"""

    def __init__(self, library, root=None):
        self.library, self.handle = library, c_void_p()
        error = Error()
        if library.open(root.encode() if root else None, byref(self.handle), byref(error)) != 0:
            raise StorageError(error, None)

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self.library.close(self.handle)

    def collect(self, name, **options):
        return self.library.value(self.library.collect, self.handle, name.encode(), byref(Options(**options)))


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--root")
    parser.add_argument("--round", action="store_const", const=ROUND, default=0)
    parser.add_argument("--decode", nargs=2, metavar=("KIND", "FILE"))
    parser.add_argument("names", nargs="*", metavar="NAME")
    given = parser.parse_args()
    library = Library()
    if given.decode:
        with open(given.decode[1], "rb") as file:
            content = file.read()
        print(json.dumps(library.value(library.decode, given.decode[0].encode(), content, len(content), None)))
    elif not given.names:
        print("\n".join(library.names()))
    with Device(library, given.root) as device:
        for name in given.names:
            print(json.dumps(device.collect(name, flags=given.round)))


if __name__ == "__main__":
    try:
        main()
    except StorageError as failure:
        if failure.value is not None:
            print(json.dumps(failure.value))
        sys.exit(f"storage.py: {failure} ({failure.code})")
