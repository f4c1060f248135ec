"""luagen: the Wireshark Lua decoder of the relay socket protocol, from the parsed schemas.

catgen.py calls dissector(classes, schemas) with the classes it has read; the result is the
text of one Lua file. Bodies are decoded from the same field tables as the C++ bodies, so a
schema change changes the decoder. Hand-written shapes that the decoder cannot delimit are shown
as the bytes left in the body, with their length, and decoding of that body stops there.
"""

import os

# The decoder's fixed part, around the catalogue tables written here.
TEMPLATE = os.path.join(os.path.dirname(os.path.abspath(__file__)), "vx7relay.lua.in")

# Components and service instances of the classes, which pick the table for a message: the
# same type number means different bodies on different resources (0x16 on a TSC, 0x2D on a
# LCON, 0x800000 at either service). A class without an entry is looked up by number only.
CLASS_ADDRESS = {
    "ResourceMgr": (0, 5),
    "ClusterMgr": (0, 8),
    "Cluster": (2, None),
    "TSC": (18, None),
    "CHP": (19, None),
    "CAS": (20, None),
    "LCON": (22, None),
}

SCALAR_PF = {
    4: ("uint8", "base.DEC"),
    5: ("uint16", "base.DEC"),
    7: ("uint32", "base.DEC"),
    6: ("uint32", "base.HEX"),
    3: ("int32", "base.DEC"),
}


def width(code):
    return 1 if code in (0, 4, 10) else 2 if code in (1, 5) else 4


def lua_str(s):
    return '"' + s.replace("\\", "\\\\").replace('"', '\\"') + '"'


class Emitter:
    def __init__(self):
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
            ctor, base = SCALAR_PF[f.code]
            pf = self.pf(ctor, ab, f.label, base)
            signed = "true" if f.code in (0, 1, 3) else "false"
            return f'{{{lab}, k="scalar", w={width(f.code)}, signed={signed}, f={pf}}}'
        if f.kind == "Contained":
            return f'{{{lab}, k="compdesc", f={self.pf("bytes", ab, f.label)}}}'
        if f.kind == "Fixed":
            if f.code == 10:
                return f'{{{lab}, k="text", n={f.fixed}, f={self.pf("string", ab, f.label)}}}'
            return f'{{{lab}, k="bytes", n={f.fixed}, f={self.pf("bytes", ab, f.label)}}}'
        if f.kind in ("CountedList", "TrailingList"):
            if f.elem is None:
                if f.code == 10:
                    pf = self.pf("string", ab, f.label)
                elif f.code == 4:
                    pf = self.pf("bytes", ab, f.label)
                else:
                    ctor, base = SCALAR_PF[f.code]
                    pf = self.pf(ctor, ab, f.label, base)
                return f'{{{lab}, k="run", {ref}, code={f.code}, w={width(f.code)}, f={pf}}}'
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


def dissector(classes, schemas):
    em = Emitter()
    tables = []
    for c in classes:
        comp, inst = CLASS_ADDRESS.get(c.name, (None, None))
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
    comps = ", ".join(
        f"[{v[0]}]={lua_str(k)}" for k, v in CLASS_ADDRESS.items() if v[1] is None
    )
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
    body = template.replace("@COMPONENTS@", comps).replace("@CATALOGUE@", "\n".join(catalogue))
    return "\n".join(head + [body])
