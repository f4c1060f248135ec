#!/usr/bin/env python3
"""The generator of operations refuses a schema whose operation lines cannot make a call."""

import os
import sys
import tempfile
import unittest

sys.dont_write_bytecode = True
CATALOGUE = os.path.join(os.path.dirname(__file__), "..", "..", "src", "catalogue")
sys.path.insert(0, os.path.join(CATALOGUE, "gen"))
import catgen  # noqa: E402
import opgen  # noqa: E402

# The field types of the schemas come from the wire schema, as in the build.
catgen.parse_wire(os.path.join(CATALOGUE, "wire.schema"))

HEAD = "class X\nmsg 0x10 MsgDo_t Id:u32 Count:u32 Ids:u32[Count] Name:char[8]\nmsg 0x11 MsgDoCmplt_t\n"


def read(ops):
    with tempfile.NamedTemporaryFile("w", suffix=".schema", delete=False) as f:
        f.write(HEAD + ops)
    try:
        (c,) = catgen.parse(f.name)
        opgen.resolve(c)
        return c
    finally:
        os.unlink(f.name)


class Refusals(unittest.TestCase):
    def test_each_fault_names_its_cause(self):
        cases = {
            "op Do MsgDo_t : Id Ids Name\n": "neither gives nor fixes Count",
            "op Do MsgDo_t : Id=0 Count:=1 Ids Name\n": "without a default after one with",
            "op Do MsgDo_t : Id Count:=1 Ids=0 Name\n": "does not suit field Ids",
            "op Do MsgDo_t : Id Count:=1 Ids Name Age\n": "has no field Age",
            "op Do MsgGone_t\n": "not a message of X",
            "op Do MsgDo_t -> 0x11 : Id Count:=1 Ids Name\n": None,
        }
        for line, cause in cases.items():
            with self.subTest(line=line):
                if cause is None:
                    with self.assertRaisesRegex(opgen.OpError, "cannot be handed back"):
                        opgen.fragment(read(line))
                else:
                    with self.assertRaisesRegex(opgen.OpError, cause):
                        read(line)


class OneWayDefaults(unittest.TestCase):
    def test_defaults_that_need_storage_get_an_overload_of_their_own(self):
        c = read('op Do MsgDo_t : Id=0 Count:=0xFFFFFFFF Ids=[] Name=""\n')
        lines = [ln for ln in opgen.fragment(c).splitlines() if ln.startswith("void")]
        self.assertEqual(
            lines,
            [
                "void Do(MsgDo_t* body);",
                "void Do(unsigned int Id, staticList<unsigned int>& Ids,"
                " const staticList<char>& Name = cat::emptyText());",
                "void Do(unsigned int Id = 0);",
            ],
        )


if __name__ == "__main__":
    unittest.main()
