#!/usr/bin/env python3
"""catgen: writes the body classes of the component catalogue from the schema files.

Usage: catgen.py OUTDIR --wire WIRE_SCHEMA SCHEMA...

A schema is line based. '#' starts a comment. Lines:

  include <header>                 hand-written header the bodies need
  class <Name>                     following bodies nest in <Name>_Bodies
  msg <type> <Body> <field>...     a message body, known to the class's message lookup
  evt <group> <Body> <field>...    an event body, known to the class's event lookup
    elem <Elem> <field>...         (indented) element body nested in the body above
    hand <Elem> <Template>         (indented) hand-written element: <Template><Outer>
  value <Group> <NAME> <number>    a named wire value of the class (state, alarm, reason,
                                   parameter id, ...), for every layer that must write it
  op <Name> <Cmd> ...              an operation family of the class (see opgen.py)

The wire schema (wire.schema) declares the element types (name, code, width, host type and
the word that the body schemas use) and the layout of the descriptor word; see its header.

A field is <Label>:<type> with <type> one of
  u8 u16 u32 word32 i32            numbers (the wire schema's `scalar` words)
  CompDesc_t                       a contained address
  char[N] u8[N]                    fixed run of N
  u8[X] u16[X] u32[X] char[X]      run counted by the earlier field X
  u8[] char[]                      run to the end of the message
  Elem[X] Elem[]                   contained bodies, counted by X or to the end
  dcv(X)                           value shaped by the descriptor in field X
  @Ops(X)                          hand-written field: cat::Ops<Outer>::ops, argument field X

Output (deterministic, no timestamps), in <outdir>/catalogue/generated/: wire.h, the type
codes, their widths and the descriptor helpers; for each class <name>_bodies.{h,cpp} (fields,
constructors and a field table; cat::Body does the rest) and <name>_ops.{h,cpp} (the
operations, written by opgen.py); index.{h,cpp} listing every body; values.h with the named
values as tolk::wire::<Class>::<Group>::<NAME> and the bodies' message types as
tolk::wire::<Class>::MsgType::<Body> (header only: layers below the catalogue include it); and
<outdir>/catalogue/generated/vx7relay.lua, the Wireshark decoder of the relay protocol
(written by luagen.py from the same tables).
"""

import os
import re
import sys

import luagen
import opgen
from wiregen import (RUNS, SCALARS, WIRE, SchemaError, parse_value, parse_wire, values_header,
                     width, wire_header)

FORMAT_VERSION = 4


FRAMEWORK_ELEMS = {"CompDesc_t": 6, "CompAttr_t": 8}
class FieldSpec:
    def __init__(self, label, text, where):
        self.label = label
        self.text = text
        self.where = where
        self.kind = None
        self.ctype = None
        self.code = 0  # element type code, as a number (the dissector's) and by name (C++'s)
        self.code_name = None
        self.fixed = 0
        self.ref_name = None
        self.elem = None
        self.custom = None

    def resolve(self, body, index):
        t = self.text
        m = re.fullmatch(r"(\w+)\[(\w*)\]", t)
        if t in SCALARS:
            self.kind, (self.ctype, self.code_name) = "Scalar", SCALARS[t]
        elif t == "CompDesc_t":
            self.kind, self.ctype = "Contained", "CompDesc_t"
        elif t.startswith("dcv(") and t.endswith(")"):
            self.kind, self.ctype, self.ref_name = "DescValue", "cat::ValueWord", t[4:-1]
        elif t.startswith("@"):
            m2 = re.fullmatch(r"@(\w+)\((\w+)\)", t)
            if not m2:
                raise SchemaError(f"{self.where}: bad custom field {t}")
            self.kind, self.ctype = "Custom", "cat::ValueWord"
            self.custom, self.ref_name = m2.group(1), m2.group(2)
        elif m:
            base, arg = m.group(1), m.group(2)
            if base in RUNS:
                self.ctype = f"staticList<{RUNS[base][0]}>"
                self.code_name = RUNS[base][1]
                if arg.isdigit():
                    self.kind, self.fixed = "Fixed", int(arg)
                    if width(self.code_name) != 1 or not 1 <= self.fixed <= 256:
                        raise SchemaError(f"{self.where}: bad fixed run {t}")
                elif arg == "":
                    self.kind = "TrailingList"
                else:
                    self.kind, self.ref_name = "CountedList", arg
            else:
                self.elem = base
                if base not in FRAMEWORK_ELEMS and base not in body.elem_names():
                    raise SchemaError(f"{self.where}: element {base} not declared in {body.name}")
                self.ctype = f"staticList<{base}>"
                self.kind = "TrailingList" if arg == "" else "CountedList"
                if arg:
                    self.ref_name = arg
        else:
            raise SchemaError(f"{self.where}: unknown field type {t}")
        if self.code_name is not None:
            self.code = WIRE.code(self.code_name)
        self.ref = -1
        if self.ref_name is not None:
            names = [f.label for f in body.fields]
            if self.ref_name not in names[:index]:
                raise SchemaError(f"{self.where}: {self.ref_name} is not an earlier field")
            self.ref = names.index(self.ref_name)
            if self.kind == "TrailingList":
                raise SchemaError(f"{self.where}: trailing list with a count")

    def list_ops(self, outer_q):
        if self.kind not in ("CountedList", "TrailingList"):
            return "nullptr"
        if self.elem is None:
            return f"&cat::ScalarList<{self.ctype[11:-1]}, wire::{self.code_name}>::ops"
        q = self.elem if self.elem in FRAMEWORK_ELEMS else f"{outer_q}::{self.elem}"
        return f"&cat::BodyList<{q}>::ops"

    def min_wire(self):
        if self.kind == "Scalar":
            return width(self.code_name)
        if self.kind == "Contained":
            return 6
        if self.kind == "Fixed":
            return self.fixed
        return 0


class Body:
    def __init__(self, cls, role, number, name, where):
        self.cls = cls
        self.role = role  # "msg", "evt" or "elem"
        self.number = number
        self.name = name
        self.where = where
        self.fields = []
        self.elems = []  # Body (role elem)
        self.hands = []  # (name, template)

    def elem_names(self):
        return [e.name for e in self.elems] + [h[0] for h in self.hands]

    def add_fields(self, tokens, where):
        for tok in tokens:
            if ":" not in tok:
                raise SchemaError(f"{where}: field {tok} lacks a type")
            label, text = tok.split(":", 1)
            if any(f.label == label for f in self.fields):
                raise SchemaError(f"{where}: field {label} twice")
            self.fields.append(FieldSpec(label, text, where))

    def resolve(self):
        for e in self.elems:
            e.resolve()
        for i, f in enumerate(self.fields):
            f.resolve(self, i)

    def needs_owned(self):
        return any(f.kind in ("DescValue", "Custom") for f in self.fields)


class Cls:
    def __init__(self, name, schema, includes):
        self.name = name
        self.schema = schema
        self.includes = includes
        self.bodies = []
        self.values = []  # (group, name, number, where)
        self.ops = []


def parse(path):
    classes = []
    includes = []
    cls = None
    last = None
    for lineno, raw in enumerate(open(path, encoding="utf-8"), 1):
        where = f"{os.path.basename(path)}:{lineno}"
        line = raw.split("#", 1)[0].rstrip()
        if not line.strip():
            continue
        indented = line[0].isspace()
        tok = line.split()
        word = tok[0]
        if word == "include":
            includes.append(tok[1])
        elif word == "class":
            cls = Cls(tok[1], os.path.basename(path), includes)
            classes.append(cls)
            last = None
        elif word in ("msg", "evt") and not indented:
            if cls is None:
                raise SchemaError(f"{where}: body before any class")
            number = int(tok[1], 0)
            last = Body(cls, word, number, tok[2], where)
            last.add_fields(tok[3:], where)
            for b in cls.bodies:
                if b.role == word and b.number == number:
                    raise SchemaError(f"{where}: number {tok[1]} twice in {cls.name}")
            cls.bodies.append(last)
        elif word == "elem" and indented and last is not None:
            e = Body(cls, "elem", 0, tok[1], where)
            e.add_fields(tok[2:], where)
            last.elems.append(e)
        elif word == "hand" and indented and last is not None:
            last.hands.append((tok[1], tok[2]))
        elif word == "value" and not indented:
            parse_value(cls, tok, where)
        elif word == "op" and not indented:
            opgen.parse_op(cls, tok, where)
        else:
            raise SchemaError(f"{where}: cannot read '{line.strip()}'")
    for c in classes:
        c.includes = list(includes)
        for b in c.bodies:
            b.resolve()
    return classes


def snake(name):
    return re.sub(r"(?<!^)(?=[A-Z])", "_", name).lower()


# ---------------------------------------------------------------- header


def emit_decl(b, ind):
    """A body is its fields and its constructors; cat::Body walks Desc for everything else."""
    p = " " * ind
    elem = b.role == "elem"
    owns = "true" if b.needs_owned() else "false"
    out = [f"{p}class {b.name} : public cat::Body<{b.name}, {owns}> {{", f"{p}public:"]
    for h_name, tmpl in b.hands:
        out.append(f"{p}    class {h_name} : public {tmpl}<{b.name}> {{}};")
    for e in b.elems:
        out.extend(emit_decl(e, ind + 4))
    if elem:
        mw = max(1, sum(f.min_wire() for f in b.fields))
        out.append(f"{p}    static constexpr unsigned int kMinWireSize = {mw};")
    else:
        what = "MsgType" if b.role == "msg" else "EvtGroup_"
        out.append(f"{p}    static constexpr unsigned int {what} = 0x{b.number:X};")
    out.append(f"{p}    static const cat::BodyDesc Desc;")
    for f in b.fields:
        init = " = 0" if f.kind in ("Scalar", "DescValue", "Custom") else ""
        ptr = "" if elem else f" {f.ctype}* p{f.label} = &{f.label};"
        out.append(f"{p}    {f.ctype} {f.label}{init};{ptr}")
    out.append(f"{p}    {b.name}() = default;")
    if not elem:
        out.append(f"{p}    {b.name}(const {b.name}& o) : Body(o) {{ copyFrom(o); }}")
        out.append(f"{p}    {b.name}& operator=(const {b.name}&) = delete;")
        if b.fields:
            args = ", ".join(f"{f.ctype}& {f.label}_" for f in b.fields)
            inits = ", ".join(f"p{f.label}(&{f.label}_)" for f in b.fields)
            explicit = "explicit " if len(b.fields) == 1 else ""
            out.append(f"{p}    {explicit}{b.name}({args}) : {inits} {{}}")
    elif b.needs_owned():
        out.append(f"{p}    {b.name}(const {b.name}& o) : Body(o) {{ copyFrom(o); }}")
        out.append(f"{p}    {b.name}& operator=(const {b.name}& o) {{ return assign(o); }}")
    refs = ", ".join(f"&{f.label}" if elem else f"p{f.label}" for f in b.fields)
    out.append(f"{p}    cat::Refs<{len(b.fields)}> refs() {{ return {{{refs}}}; }}")
    out.append(f"{p}}};")
    return out


def header(c):
    g = f"generated from {c.schema} by catgen.py; do not edit"
    out = [f"// {g}", "#pragma once", "", '#include "catalogue/CatBody.h"']
    for inc in c.includes:
        out.append(f'#include "{inc}"')
    out += [
        "",
        f"static_assert(tolk::cat::kFormatVersion == {FORMAT_VERSION}, "
        '"catalogue tables are stale: rerun catgen.py");',
        "",
        "namespace tolk {",
        "",
        f"// Bodies of {c.name}; the operation class inherits them so that they read {c.name}::X.",
        f"struct {c.name}_Bodies {{",
    ]
    for b in c.bodies:
        out.extend(emit_decl(b, 4))
    out += [
        "    // A new default-constructed body for a number, or null if this table has none.",
        "    static MsgBody* msgLookup(unsigned int type);",
        "    static MsgBody* evtLookup(unsigned int group);",
        "    // The body's name for a number, for logs; null if this table has none.",
        "    static const char* msgTypeName(unsigned int type);",
        "    static const char* evtGroupName(unsigned int group);",
        "};",
        "",
        "}  // namespace tolk",
        "",
    ]
    return "\n".join(out)


# ---------------------------------------------------------------- source


def emit_defs(b, q, descs):
    """q: qualified class name. The field tables of b and of its elements; their Desc
    definitions go to descs."""
    out = []
    for e in b.elems:
        out.extend(emit_defs(e, f"{q}::{e.name}", descs))
    number = b.number if b.role != "elem" else 0
    table = "nullptr"
    if b.fields:
        table = "kF_" + re.sub(r"\W", "_", q)
        out.append(f"constexpr cat::Field {table}[] = {{")
        for f in b.fields:
            code = f"wire::{f.code_name}" if f.code_name else "{}"
            custom = f"&cat::{f.custom}<{q}>::ops" if f.kind == "Custom" else "nullptr"
            out.append(
                f'    {{"{f.label}", cat::Kind::{f.kind}, {code}, {f.fixed}, {f.ref}, '
                f"{f.list_ops(q)}, {custom}}},"
            )
        out.append("};")
    descs.append(f'const cat::BodyDesc {q}::Desc{{"{b.name}", 0x{number:X}, {table}, {len(b.fields)}}};')
    return out


def source(c, hname):
    g = f"generated from {c.schema} by catgen.py; do not edit"
    bq = f"{c.name}_Bodies"
    out = [f"// {g}", f'#include "catalogue/generated/{hname}"', "", "namespace tolk {", ""]
    out.append("namespace {")
    out.append("")
    descs = []
    for b in c.bodies:
        out.extend(emit_defs(b, f"{bq}::{b.name}", descs))
    out += ["", "}  // namespace", ""] + descs + ["", "namespace {", ""]
    for role in ("msg", "evt"):
        rows = sorted((b.number, b.name) for b in c.bodies if b.role == role)
        if rows:
            out.append(f"// Sorted by number for cat::findNumber.")
            out.append(f"constexpr cat::NumberedBody k{role.capitalize()}s[] = {{")
            out += [f'    {{0x{n:X}, "{name}", &cat::makeBody<{bq}::{name}>}},' for n, name in rows]
            out.append("};")
    out += ["", "}  // namespace", ""]
    for role, fn, nfn in (("msg", "msgLookup", "msgTypeName"), ("evt", "evtLookup", "evtGroupName")):
        arg = "type" if role == "msg" else "group"
        if any(b.role == role for b in c.bodies):
            found = f"cat::findNumber(k{role.capitalize()}s, {arg})"
            out.append(f"MsgBody* {bq}::{fn}(unsigned int {arg}) {{")
            out.append(f"    const cat::NumberedBody* b = {found};")
            out.append("    return b == nullptr ? nullptr : b->make();")
            out.append("}")
            out.append(f"const char* {bq}::{nfn}(unsigned int {arg}) {{")
            out.append(f"    const cat::NumberedBody* b = {found};")
            out.append("    return b == nullptr ? nullptr : b->name;")
            out.append("}")
        else:
            out.append(f"MsgBody* {bq}::{fn}(unsigned int) {{ return nullptr; }}")
            out.append(f"const char* {bq}::{nfn}(unsigned int) {{ return nullptr; }}")
    out += ["", "}  // namespace tolk", ""]
    return "\n".join(out)


def index_files(classes, headers):
    g = "generated from " + " ".join(sorted({c.schema for c in classes})) + " by catgen.py; do not edit"
    h = [
        f"// {g}",
        "#pragma once",
        "",
        '#include "catalogue/CatBody.h"',
        '#include "framework/MsgBody.h"',
        "",
        "namespace tolk::cat {",
        "",
        "// One entry per body of the catalogue, message, event or element, in schema order.",
        "struct CatalogueEntry {",
        "    const char* cls;   // operation class",
        "    const char* name;  // qualified within the class, e.g. MsgMakeCall_t::KVSet_t",
        "    char role;         // 'm' message, 'e' event, 'l' list element",
        "    unsigned int number;",
        "    MsgBody* (*make)();",
        "    MsgBody* (*copy)(const MsgBody&);  // a copy of a body of this entry",
        "    const BodyDesc* desc;  // the body's table; null for hand-written elements",
        "};",
        "",
        "extern const CatalogueEntry kCatalogue[];",
        "extern const unsigned int kCatalogueSize;",
        "",
        "}  // namespace tolk::cat",
        "",
    ]
    s = [f"// {g}", '#include "catalogue/generated/index.h"', ""]
    for hn in headers:
        s.append(f'#include "catalogue/generated/{hn}"')
    s += ["", "namespace tolk::cat {", "", "const CatalogueEntry kCatalogue[] = {"]
    count = 0

    def walk(c, b, prefix, role):
        nonlocal count
        q = f"{prefix}::{b.name}" if prefix else b.name
        full = f"{c.name}_Bodies::{q}"
        r = {"msg": "m", "evt": "e", "elem": "l"}[role]
        s.append(f'    {{"{c.name}", "{q}", \'{r}\', 0x{b.number:X}, &makeBody<{full}>, &cloneBody<{full}>, &{full}::Desc}},')
        count += 1
        for hn, _ in b.hands:
            s.append(f'    {{"{c.name}", "{q}::{hn}", \'l\', 0x0, &makeBody<{full}::{hn}>, &cloneBody<{full}::{hn}>, nullptr}},')
            count += 1
        for e in b.elems:
            walk(c, e, q, "elem")

    for c in classes:
        for b in c.bodies:
            walk(c, b, "", b.role)
    s += ["};", f"const unsigned int kCatalogueSize = {count};", "", "}  // namespace tolk::cat", ""]
    return "\n".join(h), "\n".join(s)


def write_if_changed(path, text):
    if os.path.exists(path) and open(path, encoding="utf-8").read() == text:
        return
    with open(path, "w", encoding="utf-8") as f:
        f.write(text)


def main(argv):
    if len(argv) < 3:
        print(__doc__, file=sys.stderr)
        return 2
    outdir = os.path.join(argv[1], "catalogue", "generated")
    os.makedirs(outdir, exist_ok=True)
    classes = []
    try:
        if argv[2] != "--wire" or len(argv) < 5:
            raise SchemaError("the wire schema comes first: --wire WIRE_SCHEMA")
        parse_wire(argv[3])
        argv = argv[:2] + argv[4:]
        for path in argv[2:]:
            for c in parse(path):
                c.path = path
                opgen.resolve(c)
                classes.append(c)
    except (SchemaError, opgen.OpError) as e:
        print(f"catgen: {e}", file=sys.stderr)
        return 1
    headers = []
    for c in classes:
        hname = f"{c.name.lower()}_bodies.h"
        headers.append(hname)
        write_if_changed(os.path.join(outdir, hname), header(c))
        write_if_changed(os.path.join(outdir, hname[:-2] + ".cpp"), source(c, hname))
        oname = f"{c.name.lower()}_ops"
        write_if_changed(os.path.join(outdir, oname + ".h"), opgen.fragment(c))
        write_if_changed(os.path.join(outdir, oname + ".cpp"), opgen.source(c))
    write_if_changed(os.path.join(outdir, "values.h"), values_header(classes))
    write_if_changed(os.path.join(outdir, "wire.h"), wire_header())
    ih, isrc = index_files(classes, headers)
    write_if_changed(os.path.join(outdir, "index.h"), ih)
    write_if_changed(os.path.join(outdir, "index.cpp"), isrc)
    schemas = [os.path.basename(p) for p in argv[2:]]
    write_if_changed(os.path.join(outdir, "vx7relay.lua"), luagen.dissector(classes, schemas, WIRE))
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
