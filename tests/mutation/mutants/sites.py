"""Finds what can be changed in one source file."""
import re

from clang.cindex import CursorKind as Kind
from clang.cindex import TypeKind

from mutants import clang
from mutants.mutant import Mutant, context, words

BINARY = {
    b"<": ("comparison", "<=", ">="), b"<=": ("comparison", "<", ">"),
    b">": ("comparison", ">=", "<="), b">=": ("comparison", ">", "<"),
    b"==": ("comparison", "!="), b"!=": ("comparison", "=="),
    b"+": ("arithmetic", "-"), b"-": ("arithmetic", "+"),
    b"*": ("arithmetic", "/"), b"/": ("arithmetic", "*"), b"%": ("arithmetic", "*"),
    b"<<": ("arithmetic", ">>"), b">>": ("arithmetic", "<<"),
    b"&": ("arithmetic", "|"), b"|": ("arithmetic", "&"), b"^": ("arithmetic", "&"),
    b"&&": ("logic", "||"), b"||": ("logic", "&&"),
}
ASSIGNMENT = {
    b"+=": ("arithmetic", "-=", "="), b"-=": ("arithmetic", "+=", "="), b"*=": ("arithmetic", "/="),
    b"/=": ("arithmetic", "*="), b"%=": ("arithmetic", "/="), b"<<=": ("arithmetic", ">>="),
    b">>=": ("arithmetic", "<<="), b"&=": ("arithmetic", "|=", "="), b"|=": ("arithmetic", "&=", "="),
    b"^=": ("arithmetic", "&="),
}
OPERATORS = {**BINARY, **ASSIGNMENT}
# Calls of an overloaded operator that mean what the built-in one means.
# Texts are left out: they can be added, and not subtracted.
OVERLOADED = {"operator<", "operator<=", "operator>", "operator>=", "operator==", "operator!=",
              "operator+", "operator-", "operator+=", "operator-="}
UNARY = {b"!": ("logic", "!!"), b"-": ("arithmetic", ""), b"~": ("arithmetic", ""),
         b"++": ("arithmetic", "--"), b"--": ("arithmetic", "++")}
CLEAN_UP = re.compile(r"(?i)\b\w*(close|release|erase|reset|clear|free|delete|destroy|unlink|remove|"
                      r"restore|unmap|unlock|pop|kill|join|detach|shutdown|cancel|rollback)\w*\s*\(")
FUNCTIONS = {Kind.FUNCTION_DECL, Kind.CXX_METHOD, Kind.CONSTRUCTOR, Kind.DESTRUCTOR,
             Kind.FUNCTION_TEMPLATE, Kind.CONVERSION_FUNCTION}
CONDITIONED = {Kind.IF_STMT, Kind.WHILE_STMT, Kind.CONDITIONAL_OPERATOR}
STATEMENTS = {Kind.CALL_EXPR, Kind.BINARY_OPERATOR, Kind.COMPOUND_ASSIGNMENT_OPERATOR,
              Kind.UNARY_OPERATOR, Kind.CXX_DELETE_EXPR, Kind.CXX_THROW_EXPR, Kind.CONTINUE_STMT,
              Kind.BREAK_STMT, Kind.FOR_STMT, Kind.CXX_FOR_RANGE_STMT, Kind.WHILE_STMT}
CLASSES = {Kind.CLASS_DECL, Kind.STRUCT_DECL, Kind.CLASS_TEMPLATE}
LOOPS = {Kind.FOR_STMT, Kind.CXX_FOR_RANGE_STMT, Kind.WHILE_STMT}
# From which child on a statement holds statements.
BODIES = {Kind.COMPOUND_STMT: 0, Kind.IF_STMT: 1, Kind.CASE_STMT: 1, Kind.DEFAULT_STMT: 0,
          Kind.FOR_STMT: -1, Kind.CXX_FOR_RANGE_STMT: -1, Kind.WHILE_STMT: -1}
# Of a place whose value the compiler must know.
CONSTANT = "constant"
NUMBER = re.compile(rb"(0[xX][0-9a-fA-F']+|[0-9][0-9']*)([uUlLzZ]*)")
REAL = re.compile(rb"[0-9][0-9.']*(?:[eE][-+]?[0-9]+)?[fFlL]?")
LITERAL = re.compile(rb'"(?:[^"\\\n]|\\.)*"')
# What stands for something else in a literal: escapes, conversions and fields of formats.
SPECIAL = re.compile(rb"\\(?:x[0-9a-fA-F]+|u[0-9a-fA-F]{4}|.)|%[-+ #0-9.*]*[a-zA-Z]+|\{[^}]*\}")
MACRO = re.compile(r"[A-Z][A-Z_]+\(")
# An object that is declared for what its destructor does; a missing lock shows under the thread
# sanitizer, and in no test's result, so that locks aren't taken away.
GUARD = re.compile(r"Scope|Guard|Restore|Saved|Closer|Disable|disable_interruption|OnExit|AtEnd")


def plain_letters(literal):
    """The places of the letters and blanks that stand for themselves."""
    special = [match.span() for match in SPECIAL.finditer(literal.group())]
    for letter in re.finditer(rb"[A-Za-z ]", literal.group()):
        if not any(start <= letter.start() < end for start, end in special):
            yield literal.start() + letter.start()


class Finder:
    """Collects the mutants of one file; `source` is its bytes."""

    def __init__(self, path, module, source):
        self.path, self.module, self.source = path, module, source
        self.mutants, self.seen = [], set()

    def find(self, cursors):
        for cursor in cursors:
            self.visit(cursor, "", ())
        return self.mutants

    def add(self, kind, start, end, new, form, outer, where):
        if (start, end, new) in self.seen or self.source[start:end].decode() == new:
            return
        self.seen.add((start, end, new))
        function, relaxed = where
        if relaxed is CONSTANT:
            form, relaxed = "alone", ()
        before, after = context(self.source, start, end)
        self.mutants.append(Mutant(
            self.path, self.module, self.source.count(b"\n", 0, start) + 1, kind, start, end,
            words(self.source[start:end]), new, form, outer, relaxed, function, before, after))

    def visit(self, cursor, function, relaxed):
        """`relaxed`: how the constant around the cursor becomes a variable; () where none is."""
        if cursor.kind == Kind.STATIC_ASSERT:
            return
        parent = cursor.semantic_parent
        in_class = parent is not None and parent.kind in CLASSES
        if cursor.kind in FUNCTIONS:
            function = f"{parent.spelling}::{cursor.spelling}" if in_class else cursor.spelling
        if cursor.kind in FUNCTIONS or cursor.kind == Kind.VAR_DECL:
            relaxed = self.relax(cursor, in_class) or relaxed
        if cursor.kind == Kind.ENUM_CONSTANT_DECL:
            relaxed = CONSTANT
        where = (function, relaxed)
        children = list(cursor.get_children())
        for child in children[BODIES.get(cursor.kind, len(children)):]:
            self.statement(child, where)
        self.expression(cursor, children, where)
        for index, child in enumerate(children):
            needed = self.array_needs(cursor, child) or cursor.kind == Kind.CASE_STMT and index == 0
            self.visit(child, function, CONSTANT if needed else relaxed)

    def array_needs(self, cursor, child):
        """Whether the child is the bound of an array, or the literal that gives it its size."""
        if cursor.kind not in (Kind.VAR_DECL, Kind.FIELD_DECL, Kind.PARM_DECL):
            return False
        return self.source[:clang.span(child)[0]].rstrip().endswith(b"[") or (
            child.kind == Kind.STRING_LITERAL and cursor.type.kind == TypeKind.CONSTANTARRAY)

    def relax(self, cursor, in_class):
        """Where a declaration says "constexpr", and what may stand there instead."""
        start, end = clang.span(cursor)
        head = re.split(rb"[{=]", self.source[start:end])[0]
        match = re.search(rb"\bconstexpr\b", head)
        if match is None:
            return ()
        if cursor.kind in FUNCTIONS or in_class:
            new = b"inline"
        else:
            new = b"" if re.search(rb"\b(static|inline)\b", head) else b"static"
        return (start + match.start(), new)

    def expression(self, cursor, children, where):
        place, kind = clang.span(cursor), cursor.kind
        text = self.source[slice(*place)]
        if kind == Kind.BINARY_OPERATOR or kind == Kind.COMPOUND_ASSIGNMENT_OPERATOR:
            self.operator(children, place, where)
        elif kind == Kind.CALL_EXPR and cursor.spelling in OVERLOADED and len(children) in (2, 3) \
                and "basic_string" not in cursor.type.get_canonical().spelling:
            self.operator([children[0], children[-1]], place, where)
        elif kind == Kind.UNARY_OPERATOR:
            self.unary(text, place, where)
        elif kind == Kind.INTEGER_LITERAL:
            self.number(text, place, where)
        elif kind == Kind.FLOATING_LITERAL and REAL.fullmatch(text):
            self.add("constant", *place, f"({text.decode()} + 1)", "expression", place, where)
        elif kind == Kind.CXX_BOOL_LITERAL_EXPR and text in (b"true", b"false"):
            self.add("constant", *place, "false" if text == b"true" else "true", "expression", place, where)
        elif kind == Kind.STRING_LITERAL:
            self.text(text, place, where)
        if kind in CONDITIONED and children:
            self.condition(children[0], where)

    def operator(self, operands, place, where):
        if len(operands) != 2:
            return
        left, right = (clang.span(each) for each in operands)
        match = re.fullmatch(rb"[\s)]*([-+*/%<>=!&|^]+)[\s(]*", self.source[left[1]:right[0]])
        if match is None or match.group(1) not in OPERATORS or left[0] < place[0]:
            return
        start, end = left[1] + match.start(1), left[1] + match.end(1)
        kind, *news = OPERATORS[match.group(1)]
        for new in news:
            self.add(kind, start, end, new, "expression", place, where)

    def unary(self, text, place, where):
        for old, (kind, new) in UNARY.items():
            at = None
            if text.startswith(old):
                at = place[0]
            elif old in (b"++", b"--") and text.endswith(old):
                at = place[1] - 2
            # "--" is no two signs.
            if at is not None and not (old == b"-" and text.startswith(b"--")):
                self.add(kind, at, at + len(old), new, "expression", place, where)

    def number(self, text, place, where):
        match = NUMBER.fullmatch(text)
        if match is None:
            return
        digits, suffix = match.group(1).replace(b"'", b""), match.group(2).decode()
        hexadecimal = digits[:2] in (b"0x", b"0X")
        value = int(digits, 16 if hexadecimal else 8 if digits.startswith(b"0") and len(digits) > 1 else 10)
        for other in (value + 1, value - 1):
            if other >= 0:
                new = f"{other:#x}" if hexadecimal else str(other)
                self.add("constant", *place, new + suffix, "expression", place, where)

    def text(self, text, place, where):
        if not text.endswith(b'"') or b"R\"" in text:
            return
        letters = [at for part in LITERAL.finditer(text) for at in plain_letters(part)]
        if letters:
            at = letters[len(letters) // 2]
            other = b"_" if text[at:at + 1] != b"_" else b"-"
            self.add("text", *place, (text[:at] + other + text[at + 1:]).decode(), "expression", place, where)
        if len(text) > 2:
            prefix = text[:text.index(b'"')].decode()
            self.add("text", *place, f'{prefix}""', "expression", place, where)

    def condition(self, cursor, where):
        place = clang.span(cursor)
        text = self.source[slice(*place)].decode()
        if cursor.kind == Kind.VAR_DECL or MACRO.match(text):
            return
        self.add("logic", *place, f"!({text})", "condition", place, where)
        if text not in ("true", "false"):
            self.add("logic", *place, "true", "condition", place, where)
            self.add("logic", *place, "false", "condition", place, where)

    def statement(self, cursor, where):
        inner = clang.inside(cursor)
        logs = cursor.kind == Kind.DO_STMT
        if cursor.kind == Kind.DECL_STMT:
            self.guard(cursor, where)
        elif inner.kind in STATEMENTS or logs or (
                cursor.kind == Kind.RETURN_STMT and not list(cursor.get_children())):
            self.delete(cursor, "statement", where, cursor.kind in LOOPS)

    def delete(self, cursor, kind, where, block=False):
        start, end = clang.span(cursor)
        if cursor.kind == Kind.DO_STMT and not MACRO.match(self.source[start:end].decode()):
            return
        if not block or self.source[end - 1:end] != b"}":
            rest = re.match(rb"\s*;", self.source[end:])
            if rest is None:
                if not self.source[:end].endswith(b";"):
                    return
            else:
                end += rest.end()
        text = self.source[start:end].decode()
        if kind == "statement" and not block and (CLEAN_UP.search(text) or "::~" in where[0] or where[0].startswith("~")):
            kind = "clean-up"
        self.add(kind, start, end, ";", "statement", (start, end), where)

    def guard(self, cursor, where):
        """A declaration that only its destructor gives a meaning."""
        variables = list(cursor.get_children())
        if len(variables) != 1 or variables[0].kind != Kind.VAR_DECL:
            return
        variable = variables[0]
        if not GUARD.search(variable.type.spelling):
            return
        start, end = clang.span(cursor)
        name = variable.spelling.encode()
        if len(re.findall(rb"\b" + name + rb"\b", self.source[end:end + 3000].split(b"\n}\n")[0])) == 0:
            self.add("clean-up", start, end, ";", "alone", (start, end), where)
