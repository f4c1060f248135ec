"""luagen: the Wireshark Lua decoder of the relay socket protocol, from the parsed schemas.

catgen.py calls dissector(classes, schemas, wire) with the classes and the wire schema it has
read; the result is the text of one Lua file. The descriptor layout, the element types' widths
and the numbers that pick a table come from there too, never from numbers of its own. Bodies
are decoded from the same field tables as the C++ bodies, so a schema change changes the
decoder. Hand-written shapes that the decoder cannot delimit are shown
as the bytes left in the body, with their length, and decoding of that body stops there.
"""

import os

# The decoder's fixed part, around the catalogue tables written here.
TEMPLATE = os.path.join(os.path.dirname(os.path.abspath(__file__)), "vx7relay.lua.in")

# Components and service instances of the classes, which pick the table for a message: the
# same type number means different bodies on different resources (0x16 on a TSC, 0x2D on a
# LCON, 0x800000 at either service). A class declares its component type (value Component TYPE)
# or, for a board service, its instance (value Service INSTANCE) on component 0; the clusters'
# component is the only one that no schema declares. A class without either is looked up by
# number only.
SERVICE_COMPONENT = 0
UNDECLARED_COMPONENTS = {"Cluster": 2}

# The body that carries every event: its type selects the event tables by group.
EVENT_CARRIER = ("StdResource", "MsgEvtDetected_t")


def class_address(c):
    """(component, instance or None) of a class, or (None, None)."""
    vals = {(g, n): v for g, n, v, _ in c.values}
    if ("Component", "TYPE") in vals:
        return vals[("Component", "TYPE")], None
    if ("Service", "INSTANCE") in vals:
        return SERVICE_COMPONENT, vals[("Service", "INSTANCE")]
    if c.name in UNDECLARED_COMPONENTS:
        return UNDECLARED_COMPONENTS[c.name], None
    return None, None


class WireTypes:
    """What the decoder needs of the wire schema's element types, by code."""

    def __init__(self, wire):
        self.wire = wire
        self.by_code = {code: (name, w, ctype) for name, code, w, ctype in wire.types}

    def width(self, code):
        return self.by_code[code][1] if code in self.by_code else self.wire.other[0]

    def signed(self, code):
        return code in self.by_code and "signed" in self.wire.flags[self.by_code[code][0]]

    def hex(self, code):
        return code in self.by_code and "hex" in self.wire.flags[self.by_code[code][0]]

    def text(self, code):
        return code in self.by_code and "text" in self.wire.flags[self.by_code[code][0]]

    def scalar_pf(self, code):
        """ProtoField constructor and display base of a one-number field of a type code."""
        bits = 8 * self.width(code)
        ctor = f"{'int' if self.signed(code) else 'uint'}{bits}"
        return ctor, "base.HEX" if self.hex(code) else "base.DEC"

    def run_shape(self, code):
        """How a run of elements of a code is shown: as text, as bytes or as numbers."""
        if self.text(code):
            return "text"
        return "bytes" if self.width(code) == 1 and not self.signed(code) else "numbers"

    def lua_tables(self):
        """The Lua tables and constants of the descriptor word and the element types."""
        tshift, tbits = self.wire.bits["type"]
        cshift, cbits = self.wire.bits["count"]
        codes = sorted(self.by_code)
        widths = ", ".join(f"[{c}]={self.width(c)}" for c in codes)
        signed = ", ".join(f"[{c}]=true" for c in codes if self.signed(c))
        return {
            "@TYPE_MASK@": f"0x{((1 << tbits) - 1) << tshift:X}",
            "@TYPE_SHIFT@": str(tshift),
            "@COUNT_MASK@": f"0x{((1 << cbits) - 1) << cshift:X}",
            "@COUNT_SHIFT@": str(cshift),
            "@WIDTHS@": widths,
            "@OTHER_WIDTH@": str(self.wire.other[0]),
            "@SIGNED@": signed,
        }


def lua_str(s):
    return '"' + s.replace("\\", "\\\\").replace('"', '\\"') + '"'


class Emitter:
    def __init__(self, types):
        self.types = types
        self.fields = []  # ProtoField constructor expressions, in order
        self.abbrevs = set()

    def pf(self, ctor, abbrev, label, *rest):
        if abbrev in self.abbrevs:
            raise ValueError(f"luagen: field {abbrev} twice")
        self.abbrevs.add(abbrev)
        args = ", ".join([lua_str(abbrev), lua_str(label)] + list(rest))
        self.fields.append(f"ProtoField.{ctor}({args})")
        return f"PF[{len(self.fields)}]"

    def field(self, f, body, prefix):
        """The Lua table of one field of `body`; prefix is the abbreviation of the body."""
        ab = f"{prefix}.{f.label}"
        lab = f"label={lua_str(f.label)}"
        ref = f"ref={f.ref + 1}" if f.ref >= 0 else "ref=nil"
        if f.kind == "Scalar":
            ctor, base = self.types.scalar_pf(f.code)
            pf = self.pf(ctor, ab, f.label, base)
            signed = "true" if self.types.signed(f.code) else "false"
            return f'{{{lab}, k="scalar", w={self.types.width(f.code)}, signed={signed}, f={pf}}}'
        if f.kind == "Contained":
            return f'{{{lab}, k="compdesc", f={self.pf("bytes", ab, f.label)}}}'
        if f.kind == "Fixed":
            if self.types.text(f.code):
                return f'{{{lab}, k="text", n={f.fixed}, f={self.pf("string", ab, f.label)}}}'
            return f'{{{lab}, k="bytes", n={f.fixed}, f={self.pf("bytes", ab, f.label)}}}'
        if f.kind in ("CountedList", "TrailingList"):
            if f.elem is None:
                shape = self.types.run_shape(f.code)
                if shape == "text":
                    pf = self.pf("string", ab, f.label)
                elif shape == "bytes":
                    pf = self.pf("bytes", ab, f.label)
                else:
                    ctor, base = self.types.scalar_pf(f.code)
                    pf = self.pf(ctor, ab, f.label, base)
                w = self.types.width(f.code)
                return f'{{{lab}, k="run", {ref}, shape="{shape}", w={w}, f={pf}}}'
            if f.elem == "CompDesc_t":
                return f'{{{lab}, k="list", {ref}, elem="compdesc"}}'
            if f.elem == "CompAttr_t":
                return f'{{{lab}, k="list", {ref}, elem="compattr"}}'
            decl = next((e for e in body.elems if e.name == f.elem), None)
            if decl is None:  # hand-written element: its shape is not in the tables
                pf = self.pf("bytes", ab, f.label)
                return f'{{{lab}, k="opaque", what={lua_str(f.text)}, f={pf}}}'
            elem = self.desc(decl, f"{prefix}.{decl.name}")
            return f'{{{lab}, k="list", {ref}, elem={elem}}}'
        if f.kind == "DescValue":
            return f'{{{lab}, k="dcv", {ref}, f={self.pf("uint32", ab, f.label, "base.DEC")}}}'
        if f.kind == "Custom" and f.custom == "ErrorData":
            # A {Num, Val} record for the numbers that have an element named after them, else
            # the rest of the body as 32-bit words.
            recs = []
            for e in body.elems:
                tail = e.name[len(f"{f.label}_{f.ref_name}_") : -2]
                if e.name.startswith(f"{f.label}_{f.ref_name}_0x") and e.name.endswith("_t"):
                    recs.append(f"[{int(tail, 16)}]={self.desc(e, f'{prefix}.{e.name}')}")
            pf = self.pf("uint32", ab, f.label, "base.DEC")
            return f'{{{lab}, k="errordata", {ref}, records={{{", ".join(recs)}}}, f={pf}}}'
        return f'{{{lab}, k="opaque", what={lua_str(f.text)}, f={self.pf("bytes", ab, f.label)}}}'

    def desc(self, b, prefix):
        fields = ",\n    ".join(self.field(f, b, prefix) for f in b.fields)
        mw = sum(f.min_wire() for f in b.fields)
        return f"{{name={lua_str(b.name)}, min={mw}, fields={{\n    {fields}}}}}"


def dissector(classes, schemas, wire):
    types = WireTypes(wire)
    em = Emitter(types)
    tables = []
    for c in classes:
        comp, inst = class_address(c)
        comp_s = "nil" if comp is None else str(comp)
        inst_s = "nil" if inst is None else str(inst)
        msgs = []
        evts = []
        for b in c.bodies:
            d = em.desc(b, f"vx7relay.{c.name}.{b.name}")
            (msgs if b.role == "msg" else evts).append(f"[0x{b.number:X}]={d}")
        sep = ",\n  "
        tables.append(
            f"{{name={lua_str(c.name)}, component={comp_s}, instance={inst_s},\n"
            f"  msg={{\n  {sep.join(msgs)}}},\n"
            f"  evt={{\n  {sep.join(evts)}}}}}"
        )
    addresses = [(class_address(c), c.name) for c in classes]
    named = sorted((a[0], name) for a, name in addresses if a[0] is not None and a[1] is None)
    comps = ", ".join(f"[{comp}]={lua_str(name)}" for comp, name in named)
    carrier = next(
        (b for c in classes if c.name == EVENT_CARRIER[0] for b in c.bodies if b.name == EVENT_CARRIER[1]),
        None,
    )
    subst = dict(types.lua_tables())
    # Without the carrier (a partial set of schemas) no message is read as an event.
    subst["@EVENT_TYPE@"] = "nil" if carrier is None else f"0x{carrier.number:X}"
    subst["@COMPONENTS@"] = comps
    catalogue = ["-- Fields of the bodies, in schema order.", "local PF = {"]
    catalogue += [f"  {x}," for x in em.fields]
    catalogue += ["}", "for _, f in ipairs(PF) do ALL_FIELDS[#ALL_FIELDS + 1] = f end", ""]
    catalogue += [
        "-- The catalogue: one table per class, its messages by type and its events by group."
    ]
    catalogue += ["local CLASSES = {"] + [t + "," for t in tables] + ["}"]
    with open(TEMPLATE, encoding="utf-8") as f:
        template = f.read()
    head = [
        f"-- generated from {' '.join(schemas)} by catgen.py; do not edit",
        "-- Wireshark decoder of the relay socket protocol of lineprobe and vx7sim.",
        "",
    ]
    body = template
    for key, text in subst.items():
        if key not in body:
            raise ValueError(f"luagen: {key} is not in {TEMPLATE}")
        body = body.replace(key, text)
    body = body.replace("@CATALOGUE@", "\n".join(catalogue))
    return "\n".join(head + [body])
