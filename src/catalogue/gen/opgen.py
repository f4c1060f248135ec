"""opgen: the operation families of the component classes, from the `op` lines of the schemas.

catgen.py hands each `op` line to parse_op() while it reads a schema, and calls fragment() and
source() for each class once the bodies are resolved. An operation line reads

  op <Name> <Cmd> [-> <Cmplt> | waits <Cmplt>] [<flag>...] [: <param>...]

  <Cmd>            the command body, declared in the same class
  -> <Cmplt>       a request: the caller's completion body gets the answer
  waits <Cmplt>    a request whose answer is awaited but handed to nobody
                   (<Cmplt> is a body of this class or its bases, or the number of a
                   completion that has no body)
                   without either, the command is one-way
  <param>          a field of <Cmd> that the caller gives, in the caller's order:
    Name             passed by value (a list or an address by reference; a text is copied
                     before it is sent, so the caller's stays as it was)
    Name&            a number passed by reference
    Name=<default>   may be left out from the end: a number, "" (an empty text), [] (an
                     empty list) or &[] (the address of an empty byte list)
    Name:=<expr>     not a parameter: the field always takes <expr>
  flags:
    virtual          the overloads are virtual
    ownid            the request carries this object's id as its transaction id
    target           the field overloads end in `Addressable* target`, whose id the request
                     carries (eventId); the body overload carries this object's id
    anysource        the answer is accepted from any address
    hand             only the body overload is generated; the others are hand-written
    fieldsonly       no body overload
  op <Name> hand   an operation written by hand entirely, named here for the record

Every field of <Cmd> is a parameter or fixed. The body overload is `Name(Cmd* body[, Cmplt*
ret])`; the field overloads take the parameters (and `Cmplt* ret` for `->`), one overload
for each number of trailing defaults left out. A one-way family gives its defaults that need
no storage as C++ default arguments instead, as far as the language allows.

Output: <Class>_ops.h, the member declarations, included inside the class's body, and
<Class>_ops.cpp, their definitions; the hand-written class header is
catalogue/<schema directory>/<Class>.h.
"""

import os
import re


class OpError(Exception):
    pass


class Param:
    def __init__(self, text, where):
        self.where = where
        self.byref = False
        self.default = None
        self.fixed = None
        m = re.fullmatch(r"(\w+)(:=(\S+)|=(\S+)|&)?", text)
        if not m:
            raise OpError(f"{where}: cannot read parameter {text}")
        self.name = m.group(1)
        if m.group(3) is not None:
            self.fixed = m.group(3)
        elif m.group(4) is not None:
            self.default = m.group(4)
        elif m.group(2) == "&":
            self.byref = True
        self.field = None


class Op:
    def __init__(self, name, where):
        self.name = name
        self.where = where
        self.cmd = None
        self.cmplt = None
        self.returns = False
        self.flags = set()
        self.params = []  # caller's parameters, in order
        self.fixed = []  # fields that always take an expression

    def is_hand_only(self):
        return self.cmd is None


FLAGS = {"virtual", "ownid", "target", "anysource", "hand", "fieldsonly"}


def parse_op(cls, tok, where):
    """tok: the words of one `op` line, `op` included."""
    if cls is None:
        raise OpError(f"{where}: operation before any class")
    if len(tok) < 3:
        raise OpError(f"{where}: an operation needs a name and a body")
    op = Op(tok[1], where)
    rest = tok[2:]
    if rest == ["hand"]:
        cls.ops.append(op)
        return
    op.cmd = rest.pop(0)
    if rest and rest[0] in ("->", "waits"):
        if len(rest) < 2:
            raise OpError(f"{where}: {rest[0]} without a completion")
        op.returns = rest[0] == "->"
        op.cmplt = rest[1]
        rest = rest[2:]
    while rest and rest[0] != ":":
        if rest[0] not in FLAGS:
            raise OpError(f"{where}: unknown flag {rest[0]}")
        op.flags.add(rest.pop(0))
    if rest:
        for text in rest[1:]:
            p = Param(text, where)
            (op.fixed if p.fixed is not None else op.params).append(p)
    if "hand" in op.flags and "fieldsonly" in op.flags:
        raise OpError(f"{where}: hand and fieldsonly leave nothing to generate")
    if any(o.name == op.name for o in cls.ops):
        raise OpError(f"{where}: operation {op.name} twice in {cls.name}")
    cls.ops.append(op)


# ---------------------------------------------------------------- checks


def resolve(cls):
    """Ties each parameter to its field; every field must be given or fixed."""
    bodies = {b.name: b for b in cls.bodies if b.role == "msg"}
    for op in cls.ops:
        if op.is_hand_only():
            continue
        body = bodies.get(op.cmd)
        if body is None:
            raise OpError(f"{op.where}: {op.cmd} is not a message of {cls.name}")
        op.body = body
        fields = {f.label: f for f in body.fields}
        seen = set()
        for p in op.params + op.fixed:
            if p.name not in fields:
                raise OpError(f"{op.where}: {op.cmd} has no field {p.name}")
            if p.name in seen:
                raise OpError(f"{op.where}: field {p.name} given twice")
            seen.add(p.name)
            p.field = fields[p.name]
            if p.byref and p.field.kind != "Scalar":
                raise OpError(f"{op.where}: only a number is marked as passed by reference")
        missing = [f.label for f in body.fields if f.label not in seen]
        if missing and "hand" not in op.flags:
            raise OpError(f"{op.where}: {op.name} neither gives nor fixes {', '.join(missing)}")
        defaulted = False
        for p in op.params:
            if p.default is None and defaulted:
                raise OpError(f"{op.where}: {p.name} without a default after one with")
            defaulted = defaulted or p.default is not None
            if p.default is not None:
                check_default(op, p)


def check_default(op, p):
    d, kind = p.default, p.field.kind
    ok = {
        '""': kind == "Fixed" and p.field.ctype == "staticList<char>",
        "[]": kind in ("CountedList", "TrailingList"),
        "&[]": kind == "Custom",
    }
    if d in ok:
        if not ok[d]:
            raise OpError(f"{op.where}: default {d} does not suit field {p.name}")
    elif not re.fullmatch(r"(0x[0-9A-Fa-f]+|\d+)", d) or kind not in ("Scalar", "Custom", "DescValue"):
        raise OpError(f"{op.where}: default {d} does not suit field {p.name}")


# ---------------------------------------------------------------- C++ text


def elem_type(op, f):
    """The staticList element type as seen from inside the class."""
    inner = f.ctype[len("staticList<") : -1]
    if f.elem is not None and f.elem not in ("CompDesc_t", "CompAttr_t"):
        return f"{op.body.name}::{inner}"
    return inner


def param_type(op, p):
    f = p.field
    if f.kind == "Scalar":
        return f"{f.ctype}&" if p.byref else f.ctype
    if f.kind == "Contained":
        return "CompDesc_t&"
    if f.kind == "Fixed":
        return f"const {f.ctype}&"
    if f.kind in ("CountedList", "TrailingList"):
        return f"staticList<{elem_type(op, f)}>&"
    return f.ctype  # cat::ValueWord


def cheap(p):
    """A default that a declaration can carry: it needs no storage of its own."""
    return p.default not in ("[]", "&[]")


def cxx_default(p):
    return "cat::emptyText()" if p.default == '""' else p.default


def cmplt_type(op):
    """The completion's body class; a completion given by its number has none."""
    if re.fullmatch(r"0x[0-9A-Fa-f]+|\d+", op.cmplt):
        if op.returns:
            raise OpError(f"{op.where}: a completion without a body cannot be handed back")
        return None
    return op.cmplt


def cmplt_number(op):
    t = cmplt_type(op)
    return f"{t}::MsgType" if t is not None else op.cmplt


def overloads(op):
    """Lists of (params, number of trailing C++ defaults), one per field overload."""
    params = op.params
    n = len(params)
    first = next((i for i, p in enumerate(params) if p.default is not None), n)
    out = []
    k = n
    while k >= first:
        j = k
        if not op.returns and "target" not in op.flags:
            while j > first and cheap(params[j - 1]):
                j -= 1
        out.append((params[:k], k - j))
        k = j - 1
    return out


def signature(op, params, defaults, with_defaults):
    args = []
    for i, p in enumerate(params):
        a = f"{param_type(op, p)} {p.name}"
        if with_defaults and i >= len(params) - defaults:
            a += f" = {cxx_default(p)}"
        args.append(a)
    if "target" in op.flags:
        args.append("Addressable* target")
    if op.returns:
        args.append(f"{cmplt_type(op)}* ret")
    return ", ".join(args)


def request_call(op, body_expr, trans):
    cmd = f"{op.cmd}::MsgType"
    if op.cmplt is None:
        extra = [trans] if trans != "0" or "anysource" in op.flags else []
        if "anysource" in op.flags:
            extra.append("1")
        return f"request({', '.join([cmd, body_expr] + extra)});"
    ret = "ret" if op.returns else "nullptr"
    args = [cmd, body_expr, cmplt_number(op), ret]
    if trans != "0" or "anysource" in op.flags:
        args.append(trans)
    if "anysource" in op.flags:
        args.append("1")
    return f"request({', '.join(args)});"


def body_trans(op):
    return "getId()" if "ownid" in op.flags or "target" in op.flags else "0"


def field_trans(op):
    if "target" in op.flags:
        return "eventId(target)"
    return body_trans(op)


def body_lines(op, given):
    """Locals for the fields, then the body; `given`: names of the parameters present."""
    lines = []
    args = []
    fixed = {p.name: p for p in op.fixed}
    params = {p.name: p for p in op.params}
    for f in op.body.fields:
        name = f.label
        if name in fixed:
            lines.append(f"{f.ctype} {name} = {fixed[name].fixed};")
            args.append(name)
            continue
        p = params[name]
        if name in given:
            if f.kind == "Fixed":
                lines.append(f"{f.ctype} {name}_copy({name});")
                args.append(f"{name}_copy")
            else:
                args.append(name)
            continue
        if p.default == '""':
            lines.append(f"{f.ctype} {name} = cat::emptyText();")
        elif p.default == "[]":
            lines.append(f"staticList<{elem_type(op, f)}> {name};")
        elif p.default == "&[]":
            lines.append(f"staticList<unsigned char> {name}_list;")
            lines.append(f"{f.ctype} {name} = reinterpret_cast<{f.ctype}>(&{name}_list);")
        else:
            lines.append(f"{f.ctype} {name} = {p.default};")
        args.append(name)
    lines.append(f"{op.cmd} body({', '.join(args)});" if args else f"{op.cmd} body;")
    return lines


def fragment(c):
    """Declarations, to be included inside the class body."""
    out = [f"// generated from {c.schema} by catgen.py; do not edit", ""]
    out.append(f"// The operations of {c.name}, included inside the class.")
    for op in c.ops:
        if op.is_hand_only():
            out.append(f"// {op.name}: hand-written")
            continue
        v = "virtual " if "virtual" in op.flags else ""
        if "fieldsonly" not in op.flags:
            ret = f", {cmplt_type(op)}* ret" if op.returns else ""
            out.append(f"{v}void {op.name}({op.cmd}* body{ret});")
        if "hand" in op.flags:
            out.append(f"// {op.name}: the other overloads are hand-written")
            continue
        for params, defaults in overloads(op):
            out.append(f"{v}void {op.name}({signature(op, params, defaults, True)});")
    out.append("")
    return "\n".join(out)


def class_header(c):
    return f"catalogue/{os.path.basename(os.path.dirname(c.path))}/{c.name}.h"


def source(c):
    out = [f"// generated from {c.schema} by catgen.py; do not edit"]
    out += [f'#include "{class_header(c)}"', '#include "catalogue/OpText.h"', ""]
    out += ["namespace tolk {", ""]
    for op in c.ops:
        if op.is_hand_only():
            continue
        q = f"{c.name}::{op.name}"
        if "fieldsonly" not in op.flags:
            ret = f", {cmplt_type(op)}* ret" if op.returns else ""
            out.append(f"void {q}({op.cmd}* body{ret}) {{")
            out.append(f"    {request_call(op, 'body', body_trans(op))}")
            out.append("}")
            out.append("")
        if "hand" in op.flags:
            continue
        for params, defaults in overloads(op):
            out.append(f"void {q}({signature(op, params, defaults, False)}) {{")
            given = {p.name for p in params}
            for line in body_lines(op, given):
                out.append(f"    {line}")
            out.append(f"    {request_call(op, '&body', field_trans(op))}")
            out.append("}")
            out.append("")
    out += ["}  // namespace tolk", ""]
    return "\n".join(out)
