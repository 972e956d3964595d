#!/usr/bin/env python3
# SPDX-FileCopyrightText: 2026 the assay authors
# SPDX-License-Identifier: MIT

"""Decides whether an application uses OpenGL, by libassay-host and ctypes.

usage: decide.py [PROGRAM [argument...]]    PROGRAM replaces the assay beside the library

ASSAY_HOST_LIBRARY: the path of the library, if the system doesn't find it by its name.
"""

import ctypes
import json
import os
import sys

NAME = "assay-host.dll" if os.name == "nt" else "libassay-host.so.0"
LIBRARY = ctypes.CDLL(os.environ.get("ASSAY_HOST_LIBRARY", NAME))
POINTER, TEXT = ctypes.c_void_p, ctypes.c_char_p
OPENGL = 0


def function(name, returns, *takes):
    found = LIBRARY["assay_host_" + name]
    found.restype, found.argtypes = returns, takes
    return found


options_new = function("options_new", POINTER)
options_free = function("options_free", None, POINTER)
set_program = function("options_set_program", ctypes.c_int, POINTER, TEXT)
add_argument = function("options_add_argument", ctypes.c_int, POINTER, TEXT)
set_timeout = function("options_set_timeout", ctypes.c_int, POINTER, ctypes.c_double)
run = function("run", ctypes.c_int, POINTER, POINTER, ctypes.POINTER(POINTER))
result_free = function("result_free", None, POINTER)
usable = function("result_usable", ctypes.c_int, POINTER, ctypes.c_int)
usable_text = function("result_usable_text", TEXT, POINTER, ctypes.c_int)
usability_name = function("usability_name", TEXT, ctypes.c_int)
document = function("result_document", TEXT, POINTER, POINTER)
error_text = function("error_text", TEXT, ctypes.c_int)


def check(error):
    if error != 0:
        raise RuntimeError(error_text(error).decode())


def main():
    options, result = options_new(), POINTER()
    try:
        check(set_timeout(options, 20))
        for index, word in enumerate(sys.argv[1:]):
            check((add_argument if index else set_program)(options, os.fsencode(word)))
        check(run(options, None, ctypes.byref(result)))
        name = usability_name(usable(result, OPENGL)).decode()
        print(f"OpenGL {name}: {usable_text(result, OPENGL).decode()}")
        # The whole result as JSON, for hosts that don't need every function.
        report = json.loads(document(result, None))
        print(report["outcome"]["verdict"])
        devices = [device for device in report["devices"] if device["kind"] == "OpenGL"]
        if devices and "number" in devices[0]["keys"]["GLMemoryMB"]:
            print(devices[0]["keys"]["GLMemoryMB"]["number"], "MiB")
    finally:
        result_free(result)
        options_free(options)


if __name__ == "__main__":
    main()
