#!/usr/bin/env python3
"""A host that asks libassay-host for an advice, and prints its JSON document.

usage: advice_host.py LIBRARY FOLDER PROGRAM

The child has no timeout, and the wait for another one has no end.
"""

import ctypes
import os
import sys

FOREVER = 1e9


def main():
    library = ctypes.CDLL(sys.argv[1])
    library.assay_host_options_new.restype = ctypes.c_void_p
    library.assay_host_advice_document.restype = ctypes.c_char_p
    options = ctypes.c_void_p(library.assay_host_options_new())
    library.assay_host_options_set_program(options, os.fsencode(sys.argv[3]))
    library.assay_host_options_set_timeout(options, ctypes.c_double(0))
    library.assay_host_options_set_wait(options, ctypes.c_double(FOREVER))
    advice = ctypes.c_void_p()
    error = library.assay_host_advise(options, os.fsencode(sys.argv[2]), None,
                                      ctypes.byref(advice))
    document = library.assay_host_advice_document(advice, None)
    sys.stdout.buffer.write(document)
    library.assay_host_advice_free(advice)
    library.assay_host_options_free(options)
    return error


if __name__ == "__main__":
    sys.exit(main())
