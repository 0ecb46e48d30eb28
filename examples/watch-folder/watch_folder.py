#!/usr/bin/env python3
"""Counts the files below a folder as counters of a device, and prints a set of its storage.

    watch_folder.py DEVICE FOLDER

The library is loaded as it is; nothing is built. `vespctl init DEVICE` makes a device to try.
"""

import ctypes
import json
import os
import sys


class Device:
    """A device directory, open in a `with` block."""

    def __init__(self, directory):
        library = ctypes.CDLL("libvesprun.so.0")
        text, device = ctypes.c_char_p, ctypes.c_void_p
        for name, result, *arguments in (
            ("last_error", text),
            ("open", device, text),
            ("close", None, device),
            ("set_scalar", ctypes.c_int, device, text, ctypes.c_int64),
            ("add_to_scalar", ctypes.c_int, device, text, ctypes.c_int64),
            ("add_to_distribution", ctypes.c_int, device, text, ctypes.c_double),
            ("checkpoint", ctypes.c_int, device),
            # Not c_char_p: the text has to be given back.
            ("call", ctypes.c_void_p, device, text, text),
            ("free", None, ctypes.c_void_p),
        ):
            function = getattr(library, "vesprun_" + name)
            function.restype, function.argtypes = result, arguments
        self._library = library
        self._device = library.vesprun_open(os.fsencode(directory))
        self._check(self._device)

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self._library.vesprun_close(self._device)

    def _check(self, good):
        if not good:
            raise OSError(self._library.vesprun_last_error().decode())

    def set(self, key, value):
        self._check(self._library.vesprun_set_scalar(self._device, key.encode(), value) == 0)

    def add(self, key, value):
        self._check(self._library.vesprun_add_to_scalar(self._device, key.encode(), value) == 0)

    def sample(self, key, value):
        self._check(
            self._library.vesprun_add_to_distribution(self._device, key.encode(), value) == 0
        )

    def checkpoint(self):
        self._check(self._library.vesprun_checkpoint(self._device) == 0)

    def call(self, entry_point, **arguments):
        text = self._library.vesprun_call(
            self._device, entry_point.encode(), json.dumps(arguments).encode()
        )
        self._check(text)
        try:
            return json.loads(ctypes.string_at(text))
        finally:
            self._library.vesprun_free(text)


def main():
    if len(sys.argv) != 3:
        sys.exit("usage: watch_folder.py DEVICE FOLDER")
    with Device(sys.argv[1]) as device:
        device.set("folder.files", 0)
        for folder, _, files in os.walk(sys.argv[2]):
            device.add("folder.files", len(files))
            for name in files:
                size = os.lstat(os.path.join(folder, name)).st_size
                device.sample("folder.fileBytes", size)
        device.checkpoint()
        for key, value in device.call("ftl", round=True)["result"].items():
            print(f"{key}: {value}")


if __name__ == "__main__":
    try:
        main()
    except OSError as failure:
        sys.exit(f"watch_folder.py: {failure}")
