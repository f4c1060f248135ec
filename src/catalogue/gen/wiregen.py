"""wiregen: what the wire schema and the `value` lines declare, for catgen.py.

The wire schema (wire.schema) gives the element types (name, code, width, host type and the
word that the body schemas use) and the layout of the descriptor word; wire_header() writes
them as catalogue/generated/wire.h. The `value` lines of the body schemas name the values that
several layers share; values_header() writes them as catalogue/generated/values.h. Both
headers are code-free, so that the layers below the catalogue can include them.
"""

import os
import re


class SchemaError(Exception):
    pass


# Filled from the wire schema before any body schema is read: the numbers and widths of the
# element types live there, not here.
SCALARS = {}  # schema word -> (C type, code name)
RUNS = {}


class Wire:
    """The element types and the descriptor layout read from the wire schema."""

    def __init__(self):
        self.types = []  # (name, code, width, ctype)
        self.other = None  # (width, ctype)
        self.bits = {}  # part -> (shift, bits)
        self.flags = {}  # name -> set of the type line's flags
        self.schema = None

    def code(self, name):
        return next(t[1] for t in self.types if t[0] == name)

    def width(self, name):
        return next((t[2] for t in self.types if t[0] == name), self.other[0])


WIRE = Wire()


def width(name):
    return WIRE.width(name)


TYPE_FLAGS = ("scalar", "run", "signed", "hex", "text")


def type_word_and_flags(tok, where):
    """The schema word and the flags behind a type line's C type, in any order."""
    flags = {t for t in tok if t in TYPE_FLAGS}
    words = [t for t in tok if t not in TYPE_FLAGS]
    if len(words) > 1 or ({"scalar", "run"} & flags and not words):
        raise SchemaError(f"{where}: a type has at most one word, and needs it for scalar or run")
    return (words[0] if words else None), flags


def parse_wire(path):
    """Reads the wire schema into WIRE, SCALARS and RUNS."""
    import shlex

    WIRE.schema = os.path.basename(path)
    for lineno, raw in enumerate(open(path, encoding="utf-8"), 1):
        where = f"{WIRE.schema}:{lineno}"
        tok = shlex.split(raw.split("#", 1)[0])
        if not tok:
            continue
        try:
            if tok[0] == "type":
                name, code, w, ctype = tok[1], int(tok[2]), int(tok[3]), tok[4]
                word, flags = type_word_and_flags(tok[5:], where)
                if any(t[0] == name or t[1] == code for t in WIRE.types):
                    raise SchemaError(f"{where}: type {name} or code {code} twice")
                WIRE.types.append((name, code, w, ctype))
                WIRE.flags[name] = flags
                if "scalar" in flags:
                    SCALARS[word] = (ctype, name)
                if "run" in flags:
                    RUNS[word] = (ctype, name)
            elif tok[0] == "other":
                WIRE.other = (int(tok[1]), tok[2])
            elif tok[0] == "bits":
                WIRE.bits[tok[1]] = (int(tok[2]), int(tok[3]))
            else:
                raise SchemaError(f"{where}: cannot read '{raw.strip()}'")
        except (IndexError, ValueError):
            raise SchemaError(f"{where}: cannot read '{raw.strip()}'") from None
    if WIRE.other is None or set(WIRE.bits) != {"type", "count"}:
        raise SchemaError(f"{WIRE.schema}: needs an 'other' line and the bits of type and count")


def wire_header():
    tshift, tbits = WIRE.bits["type"]
    cshift, cbits = WIRE.bits["count"]
    ncodes = 1 << tbits
    widths = [WIRE.other[0]] * ncodes
    for _, code, w, _ in WIRE.types:
        widths[code] = w
    out = [
        f"// generated from {WIRE.schema} by catgen.py; do not edit",
        "#pragma once",
        "",
        "// Element types of a field descriptor and the layout of the descriptor word: the one place",
        "// that the build knows their numbers and widths.",
        "",
        "namespace tolk::wire {",
        "",
        "enum TypeCode : unsigned int {",
    ]
    out += [f"    {n} = {c},  // {w} byte(s), {ct}" for n, c, w, ct in WIRE.types]
    out += [
        "};",
        "",
        f"inline constexpr unsigned int kTypeShift = {tshift};",
        f"inline constexpr unsigned int kTypeMask = 0x{((1 << tbits) - 1) << tshift:X};",
        f"inline constexpr unsigned int kCountShift = {cshift};",
        f"inline constexpr unsigned int kCountMask = 0x{((1 << cbits) - 1) << cshift:X};",
        "// Elements that one descriptor can count.",
        f"inline constexpr unsigned int kMaxCount = {1 << cbits};",
        "",
        f"// Element width in bytes of every type code; a code not named above counts {WIRE.other[0]}.",
        f"inline constexpr unsigned char kWidth[{ncodes}] = {{{', '.join(map(str, widths))}}};",
        "",
        "constexpr unsigned int width(unsigned int code) {",
        f"    return code < {ncodes} ? kWidth[code] : {WIRE.other[0]};",
        "}",
        "",
        "// The descriptor of `count` elements (1 to kMaxCount) of a type.",
        "constexpr unsigned int pack(unsigned int code, unsigned int count = 1) {",
        "    return ((code << kTypeShift) & kTypeMask) | (((count - 1) << kCountShift) & kCountMask);",
        "}",
        "constexpr unsigned int typeOf(unsigned int desc) {",
        "    return (desc & kTypeMask) >> kTypeShift;",
        "}",
        "constexpr unsigned int countOf(unsigned int desc) {",
        "    return ((desc & kCountMask) >> kCountShift) + 1;",
        "}",
        "// More than one element: the value is a list, not a number.",
        "constexpr bool isList(unsigned int desc) {",
        "    return (desc & kCountMask) != 0;",
        "}",
        "// Bytes that the elements of a descriptor take in a body.",
        "constexpr unsigned int bytesOf(unsigned int desc) {",
        "    return width(typeOf(desc)) * countOf(desc);",
        "}",
        "",
        "// The host type of an element of each type code.",
        "template <TypeCode C>",
        "struct CType {",
        f"    using type = {WIRE.other[1]};",
        "};",
    ]
    for n, _, _, ct in WIRE.types:
        if ct != WIRE.other[1]:
            out += ["template <>", f"struct CType<{n}> {{", f"    using type = {ct};", "};"]
    out += [
        "",
        "// Calls f with a null pointer of the host element type of a type code.",
        "template <class F>",
        "void withCType(unsigned int code, F&& f) {",
        "    switch (code) {",
    ]
    for n, c, _, ct in WIRE.types:
        if ct != WIRE.other[1]:
            out += [f"        case {c}:", f"            return f(static_cast<{ct}*>(nullptr));"]
    out += [
        "        default:",
        f"            return f(static_cast<{WIRE.other[1]}*>(nullptr));",
        "    }",
        "}",
        "",
        "}  // namespace tolk::wire",
        "",
    ]
    return "\n".join(out)


VALUE_NAME = re.compile(r"[A-Z][A-Z0-9_]*")
VALUE_GROUP = re.compile(r"[A-Z][A-Za-z0-9]*")


def parse_value(cls, tok, where):
    """value <Group> <NAME> <number>: one named wire value in the class's namespace."""
    if cls is None:
        raise SchemaError(f"{where}: value before any class")
    if len(tok) != 4:
        raise SchemaError(f"{where}: value takes a group, a name and a number")
    group, name, text = tok[1], tok[2], tok[3]
    if not VALUE_GROUP.fullmatch(group) or not VALUE_NAME.fullmatch(name):
        raise SchemaError(f"{where}: value {group} {name}: group is CamelCase, name CAPITALS")
    try:
        number = int(text, 0)
    except ValueError:
        raise SchemaError(f"{where}: value {name}: {text} is no number") from None
    if not 0 <= number <= 0xFFFFFFFF:
        raise SchemaError(f"{where}: value {name}: {text} does not fit 32 bits")
    if any(v[0] == group and v[1] == name for v in cls.values):
        raise SchemaError(f"{where}: value {group} {name} twice in {cls.name}")
    cls.values.append((group, name, number, where))


# values.h names the message type of every body in this group of its class; a value line may
# add types that have no body.
MSG_TYPES = "MsgType"


def values_header(classes):
    g = "generated from " + " ".join(sorted({c.schema for c in classes})) + " by catgen.py; do not edit"
    out = [f"// {g}", "#pragma once", "", "namespace tolk::wire {", ""]
    for c in classes:
        msgs = [(b.name, b.number) for b in c.bodies if b.role == "msg"]
        if not c.values and not msgs:
            continue
        out.append(f"namespace {c.name} {{")
        if msgs:
            # The message types of the class's bodies, for layers that cannot include the bodies.
            out.append(f"namespace {MSG_TYPES} {{")
            out += [f"inline constexpr unsigned int {n} = 0x{t:X};" for n, t in msgs]
            out.append(f"}}  // namespace {MSG_TYPES}")
        groups = []
        for v in c.values:
            if v[0] not in groups:
                groups.append(v[0])
        for group in groups:
            out.append(f"namespace {group} {{")
            for g_, name, number, _ in c.values:
                if g_ == group:
                    text = str(number) if number < 0x100 else f"0x{number:X}"
                    out.append(f"inline constexpr unsigned int {name} = {text};")
            out.append(f"}}  // namespace {group}")
        out.append(f"}}  // namespace {c.name}")
        out.append("")
    out += ["}  // namespace tolk::wire", ""]
    return "\n".join(out)
