#!/usr/bin/env python3
"""Fails when a number the schemas declare (a message type, an event group, a named value) is
written as a literal in the sources instead of being taken from the generated headers.

Usage: wire_literals.py DIR... SCHEMA...    check the DIRs, list what it finds, exit 1 if any
       wire_literals.py --self-test          check the scanner against planted literals

What counts as a literal, in code (comments do not count, string literals do):
  - any number the schemas declare from 0x1000 up, in hex or in decimal (below, numbers are
    mostly sizes, counts, error codes and ids of the emulation's own, 256 above all, and
    would drown the rest);
  - a declared message type or event group of any size written in hex as a case label, as
    the first argument of a request, a registration or a lookup, or as the value given to a
    name that says it is a type (the standard operations have numbers below 0x100 that are too
    common to look for anywhere else).
"""

import os
import re
import sys

SOURCE_EXT = (".h", ".hpp", ".c", ".cc", ".cpp")
# Below this, hex or decimal, numbers are mostly sizes, counts and codes: only the positions
# that say "a type" are looked at.
LOOK_EVERYWHERE_FROM = 0x1000

NUMBER = re.compile(r"(?<![\w.])(0[xX][0-9A-Fa-f]+|[0-9]+)(?:[uU][lL]{0,2}|[lL]{1,2}[uU]?)?(?![\w.])")
CALL_FIRST_ARG = re.compile(
    r"(?:\bcase\s+|\b\w*(?:request|Request|Register\w*|Lookup|lookup|Msg|Evt)\w*\s*\(\s*"
    r"|\b\w*(?:Type|TYPE)\w*\s*(?:=|\{)\s*)$")


def schema_numbers(paths):
    """(all declared numbers, declared message types and event groups)."""
    declared, types = set(), set()
    for path in paths:
        for raw in open(path, encoding="utf-8"):
            line = raw.split("#", 1)[0]
            tok = line.split()
            if not tok or line[0].isspace():
                continue
            if tok[0] in ("msg", "evt") and len(tok) >= 3:
                n = int(tok[1], 0)
                declared.add(n)
                types.add(n)
            elif tok[0] == "value" and len(tok) == 4:
                declared.add(int(tok[3], 0))
    return declared, types


def strip_comments(text):
    """The text with comments blanked out (line breaks kept), string literals left alone."""
    out = []
    i, n = 0, len(text)
    while i < n:
        c = text[i]
        if c in "\"'":
            j = i + 1
            while j < n and text[j] != c and text[j] != "\n":
                j += 2 if text[j] == "\\" else 1
            out.append(text[i : j + 1])
            i = j + 1
        elif text.startswith("//", i):
            j = text.find("\n", i)
            j = n if j < 0 else j
            i = j
        elif text.startswith("/*", i):
            j = text.find("*/", i + 2)
            j = n if j < 0 else j + 2
            out.append("\n" * text.count("\n", i, j))
            i = j
        else:
            out.append(c)
            i += 1
    return "".join(out)


def scan_text(text, declared, types):
    """[(line number, literal, line)] for every literal of a declared number in code."""
    found = []
    for lineno, line in enumerate(strip_comments(text).split("\n"), 1):
        for m in NUMBER.finditer(line):
            lit = m.group(1)
            is_hex = lit[:2] in ("0x", "0X")
            value = int(lit, 16) if is_hex else int(lit, 10 if lit == "0" or lit[0] != "0" else 8)
            if value not in declared:
                continue
            if value >= LOOK_EVERYWHERE_FROM or (
                is_hex and value in types and CALL_FIRST_ARG.search(line[: m.start()])
            ):
                found.append((lineno, lit, line.strip()))
    return found


def scan_tree(src, declared, types):
    found = []
    for root, dirs, files in os.walk(src):
        dirs[:] = sorted(d for d in dirs if d != "gen")
        for name in sorted(files):
            if not name.endswith(SOURCE_EXT):
                continue
            path = os.path.join(root, name)
            rel = os.path.relpath(path, os.path.dirname(os.path.abspath(src)))
            text = open(path, encoding="utf-8", errors="replace").read()
            found += [f"{rel}:{n}: {lit}: {line}" for n, lit, line in scan_text(text, declared, types)]
    return found


def self_test():
    declared = {0x16, 0x20, 0x100, 0x101, 0x1214, 0x160F, 0x2000007}
    types = {0x16, 0x20, 0x1214}
    planted = {
        "case 0x1214:": 1,
        "constexpr unsigned int IN_SERVICE = 0x160Fu;": 1,
        "if (state == 5647) {": 1,
        "request(0x16, body, 0x17, ret);": 1,
        "static constexpr unsigned int Type = 0x20;": 1,
        "constexpr unsigned int TYPE_EVENT{0x20};": 1,
        "unsigned int evtType = 0x16;": 1,
        "unsigned int mask = 0x20;": 0,
        "    case 0x20: return x;": 1,
        "std::uint32_t nextCallId_ = 0x100;": 0,
        "id = 33554439UL;": 1,
        'printf("id 0x2000007\\n");': 1,
        "// 0x1214 is MakeCall": 0,
        "/* case 0x1214:\n 5647 */ int x;": 0,
        "class T : Pub<T, tolk::LCON::Evt_0x160F_t> {};": 0,
        "char text[256] = {};": 0,
        "x = y & 0x20;": 0,
        "unsigned v = 0x1215;": 0,
        "double d = 5647.5;": 0,
    }
    bad = []
    for text, want in planted.items():
        got = len(scan_text(text, declared, types))
        if got != want:
            bad.append(f"{text!r}: {got} found, {want} expected")
    if strip_comments('a = "//x"; // y\n') != 'a = "//x"; \n':
        bad.append("a comment marker inside a string literal ended the code")
    for b in bad:
        print(f"self-test: {b}")
    return 1 if bad else 0


def main(argv):
    if argv[1:] == ["--self-test"]:
        return self_test()
    if len(argv) < 3:
        print(__doc__, file=sys.stderr)
        return 2
    schemas = [a for a in argv[1:] if a.endswith(".schema")]
    dirs = [a for a in argv[1:] if not a.endswith(".schema")]
    declared, types = schema_numbers(schemas)
    if len(declared) < 50:
        print(f"only {len(declared)} numbers read from the schemas: wrong arguments?")
        return 2
    found = [f for d in dirs for f in scan_tree(d, declared, types)]
    for f in found:
        print(f)
    print(f"{len(found)} wire literals outside the schemas ({len(declared)} numbers declared)")
    return 1 if found else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
