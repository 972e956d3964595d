#!/usr/bin/env python3
"""A host that runs the child by libassay-host, and prints what it was given as JSON.

usage: library_host.py LIBRARY TIMEOUT PROGRAM [argument...]
"""

import ctypes
import json
import os
import sys

INTERFACES = {"opengl": 0, "opencl": 1}


def main():
    library = ctypes.CDLL(sys.argv[1])

    def text(name, *arguments):
        function = library["assay_host_" + name]
        function.restype = ctypes.c_char_p
        return function(*arguments).decode(errors="replace")

    library.assay_host_options_new.restype = ctypes.c_void_p
    options = ctypes.c_void_p(library.assay_host_options_new())
    library.assay_host_options_set_timeout(options, ctypes.c_double(float(sys.argv[2])))
    library.assay_host_options_set_program(options, os.fsencode(sys.argv[3]))
    for word in sys.argv[4:]:
        library.assay_host_options_add_argument(options, os.fsencode(word))
    result = ctypes.c_void_p()
    error = library.assay_host_run(options, None, ctypes.byref(result))
    print(json.dumps({
        "error": text("error_text", error),
        "verdict": text("verdict_name", library.assay_host_result_verdict(result)),
        "usable": {name: [text("usability_name", library.assay_host_result_usable(result, number)),
                          text("result_usable_reason", result, number),
                          text("result_usable_device", result, number) or None]
                   for name, number in INTERFACES.items()},
        "left_behind": library.assay_host_result_left_behind(result),
        "document": text("result_document", result, None),
    }))
    library.assay_host_result_free(result)
    library.assay_host_options_free(options)


if __name__ == "__main__":
    main()
