"""The parts of libclang that finding places to change takes: where a cursor's text lies in its file."""
import ctypes

from clang import cindex
from clang.cindex import CursorKind

cindex.Config.set_library_file("/usr/lib/llvm-14/lib/libclang-14.so.1")

# libclang maps a place in a macro's argument to where the argument is written; the Python module
# offers only where the macro is called.
_PLACE = [cindex.SourceLocation, ctypes.POINTER(ctypes.c_void_p), ctypes.POINTER(ctypes.c_uint),
          ctypes.POINTER(ctypes.c_uint), ctypes.POINTER(ctypes.c_uint)]


def _offset(location):
    function = cindex.conf.lib.clang_getFileLocation
    function.argtypes, function.restype = _PLACE, None
    file, line, column, offset = ctypes.c_void_p(), ctypes.c_uint(), ctypes.c_uint(), ctypes.c_uint()
    function(location, file, line, column, offset)
    return offset.value


def span(cursor):
    """The (start, end) of the cursor's text in its file. What a macro's body supplies lies where the
    macro is called: the text must be looked at."""
    return _offset(cursor.extent.start), _offset(cursor.extent.end)


def parse(path, arguments):
    """The declarations at the top of one file. Raises ValueError if something that it includes is not
    found; what the compiler of the build takes and clang doesn't is left out."""
    unit = cindex.Index.create().parse(str(path), args=arguments)
    errors = [str(each) for each in unit.diagnostics if each.severity >= cindex.Diagnostic.Fatal]
    if errors:
        raise ValueError(f"{path}: {errors[0]}")
    return unit, [cursor for cursor in unit.cursor.get_children()
                  if cursor.location.file and cursor.location.file.name == str(path)]


def inside(cursor):
    """The cursor without the conversions around it."""
    while cursor.kind == CursorKind.UNEXPOSED_EXPR:
        children = list(cursor.get_children())
        if len(children) != 1:
            break
        cursor = children[0]
    return cursor
