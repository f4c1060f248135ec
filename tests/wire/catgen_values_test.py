#!/usr/bin/env python3
"""The value lines of the schemas: what catgen.py writes into values.h, and what it refuses;
and that the relay dissector takes the descriptor layout, the element types, the event carrier
and the components from the schemas rather than from numbers of its own.

Usage: catgen_values_test.py CATGEN_DIR
"""

import os
import subprocess
import sys
import tempfile

GOOD = """\
class LCON
msg 0x1608 MsgGetLineState_t
value LineState IN_SERVICE 0x160F   # trailing comment
value LineState OUT_OF_SERVICE 5648
value LineReason STARTUP 2
class TSC
value LineState IN_SERVICE 0x100
value InfoId CALLER_ID 0x2000007
"""

# A layout and types unlike the real ones, so that a decoder with numbers of its own shows.
ODD_WIRE = """\
type S8    0  1  "char"           s8  scalar  signed
type W16   3  2  "unsigned short" w16 scalar run hex
type U32   9  4  "unsigned int"   u32 scalar run
type TXT  12  1  "char"           txt run text
other 8 "unsigned int"
bits type  24 4
bits count  8 8
"""

ODD = """\
class StdResource
msg 0x33 MsgEvtDetected_t EvtGroup:u32 Data:txt[]
msg 0x34 MsgProbe_t A:s8 B:w16 N:u32 C:w16[N] D:dcv(N)
class LCON
value Component TYPE 41
class ClusterMgr
value Service INSTANCE 9
"""

ODD_LUA = [
    "local EVENT_TYPE = 0x33",
    "local TYPE_MASK, TYPE_SHIFT = 0xF000000, 24",
    "local COUNT_MASK, COUNT_SHIFT = 0xFF00, 8",
    "local WIDTH = {[0]=1, [3]=2, [9]=4, [12]=1}",
    "local OTHER_WIDTH = 8",
    "local SIGNED = {[0]=true}",
    'local COMPONENTS = {[41]="LCON"}',
    'ProtoField.int8("vx7relay.StdResource.MsgProbe_t.A", "A", base.DEC)',
    'ProtoField.uint16("vx7relay.StdResource.MsgProbe_t.B", "B", base.HEX)',
    '{label="C", k="run", ref=3, shape="numbers", w=2,',
    '{label="Data", k="run", ref=nil, shape="text", w=1,',
    'name="ClusterMgr", component=0, instance=9,',
]

BAD = {
    "value before any class": "value LineState IN_SERVICE 0x160F\nclass LCON\n",
    "twice in LCON": "class LCON\nvalue A X 1\nvalue A X 2\n",
    "is no number": "class LCON\nvalue A X 0x16G\n",
    "does not fit 32 bits": "class LCON\nvalue A X 0x100000000\n",
    "group is CamelCase, name CAPITALS": "class LCON\nvalue A in_service 1\n",
    "takes a group, a name and a number": "class LCON\nvalue A X\n",
}


def run(catgen, text, out, wire_text=None):
    schema = os.path.join(out, "t.schema")
    with open(schema, "w", encoding="utf-8") as f:
        f.write(text)
    wire = os.path.join(os.path.dirname(os.path.dirname(catgen)), "wire.schema")
    if wire_text is not None:
        wire = os.path.join(out, "odd_wire.schema")
        with open(wire, "w", encoding="utf-8") as f:
            f.write(wire_text)
    cmd = [sys.executable, catgen, out, "--wire", wire, schema]
    return subprocess.run(cmd, capture_output=True, text=True)


def main(argv):
    catgen = os.path.join(argv[1], "catgen.py")
    failures = []
    with tempfile.TemporaryDirectory() as out:
        r = run(catgen, GOOD, out)
        if r.returncode != 0:
            failures.append(f"good schema refused: {r.stderr.strip()}")
        else:
            h = open(os.path.join(out, "catalogue", "generated", "values.h"), encoding="utf-8").read()
            lcon = h[h.index("namespace LCON {") : h.index("}  // namespace LCON")]
            tsc = h[h.index("namespace TSC {") : h.index("}  // namespace TSC")]
            for want, where in (
                ("inline constexpr unsigned int IN_SERVICE = 0x160F;", lcon),
                ("inline constexpr unsigned int OUT_OF_SERVICE = 0x1610;", lcon),
                ("inline constexpr unsigned int STARTUP = 2;", lcon),
                ("inline constexpr unsigned int IN_SERVICE = 0x100;", tsc),
                ("inline constexpr unsigned int CALLER_ID = 0x2000007;", tsc),
                ("inline constexpr unsigned int MsgGetLineState_t = 0x1608;", lcon),
            ):
                if want not in where:
                    failures.append(f"values.h lacks {want!r} in its class")
            if lcon.index("namespace LineState {") > lcon.index("namespace LineReason {"):
                failures.append("groups are not in schema order")
            if "namespace tolk::wire {" not in h or "#include" in h:
                failures.append("values.h is not a self-contained header in tolk::wire")
        for why, text in BAD.items():
            r = run(catgen, text, out)
            if r.returncode != 1 or why not in r.stderr or "t.schema:" not in r.stderr:
                failures.append(f"{why}: exit {r.returncode}, {r.stderr.strip()!r}")
    with tempfile.TemporaryDirectory() as out:
        r = run(catgen, ODD, out, ODD_WIRE)
        if r.returncode != 0:
            failures.append(f"schema on an odd wire refused: {r.stderr.strip()}")
        else:
            lua = open(os.path.join(out, "catalogue", "generated", "vx7relay.lua"), encoding="utf-8").read()
            failures += [f"dissector lacks {want!r}" for want in ODD_LUA if want not in lua]
            if "@" in lua:
                failures.append("dissector keeps a placeholder of its template")
    for f in failures:
        print(f)
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
