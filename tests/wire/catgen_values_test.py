#!/usr/bin/env python3
"""The value lines of the schemas: what catgen.py writes into values.h, and what it refuses.

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

BAD = {
    "value before any class": "value LineState IN_SERVICE 0x160F\nclass LCON\n",
    "twice in LCON": "class LCON\nvalue A X 1\nvalue A X 2\n",
    "is no number": "class LCON\nvalue A X 0x16G\n",
    "does not fit 32 bits": "class LCON\nvalue A X 0x100000000\n",
    "group is CamelCase, name CAPITALS": "class LCON\nvalue A in_service 1\n",
    "takes a group, a name and a number": "class LCON\nvalue A X\n",
}


def run(catgen, text, out):
    schema = os.path.join(out, "t.schema")
    with open(schema, "w", encoding="utf-8") as f:
        f.write(text)
    return subprocess.run([sys.executable, catgen, out, schema], capture_output=True, text=True)


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
    for f in failures:
        print(f)
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
