"""luagen: the Wireshark Lua decoder of the relay socket protocol, from the parsed schemas.

catgen.py calls dissector(classes, schemas) with the classes it has read; the result is the
text of one Lua file. Bodies are decoded from the same field tables as the C++ bodies, so a
schema change changes the decoder. Hand-written shapes that the decoder cannot delimit are shown
as the bytes left in the body, with their length, and decoding of that body stops there.
"""

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
    head = [
        f"-- generated from {' '.join(schemas)} by catgen.py; do not edit",
        "-- Wireshark decoder of the relay socket protocol of lineprobe and vx7sim.",
        "",
        PRELUDE.replace("@COMPONENTS@", comps),
        "-- Fields of the bodies, in schema order.",
        "local PF = {",
    ]
    head += [f"  {x}," for x in em.fields]
    head += ["}", "for _, f in ipairs(PF) do ALL_FIELDS[#ALL_FIELDS + 1] = f end", ""]
    head += ["-- The catalogue: one table per class, its messages by type and its events by group."]
    head += ["local CLASSES = {"]
    head += [t + "," for t in tables]
    head += ["}", "", DECODER]
    return "\n".join(head)


PRELUDE = r"""local relay = Proto("vx7relay", "VX7 relay protocol")

local DEFAULT_PORT = 6554
local HEADER_LEN = 20
local MAX_PART = 102400
local MSG_HEADER_LEN = 56
local OPEN_LEN = 28
local ASSIGNED_LEN = 20
local EVENT_TYPE = 0x20

local FRAME_TYPES = {
  [1001] = "message", [1002] = "assigned address", [1003] = "open",
  [2000] = "close", [2001] = "close acknowledged",
}
local COMPONENTS = {@COMPONENTS@}

local function addr_fields(prefix)
  return {
    node = ProtoField.uint32(prefix .. ".node", "Node", base.DEC),
    board = ProtoField.uint32(prefix .. ".board", "Board", base.DEC),
    processor = ProtoField.uint32(prefix .. ".processor", "Processor", base.DEC),
    component = ProtoField.uint32(prefix .. ".component", "Component", base.DEC, COMPONENTS),
    instance = ProtoField.uint32(prefix .. ".instance", "Instance", base.DEC),
  }
end

local H = {
  type = ProtoField.uint32("vx7relay.type", "Frame type", base.DEC, FRAME_TYPES),
  tran = ProtoField.uint32("vx7relay.tran", "Tran", base.DEC),
  size = ProtoField.uint32("vx7relay.size", "Size", base.DEC),
  ex_size = ProtoField.uint32("vx7relay.ex_size", "Ex size", base.DEC),
  ptr = ProtoField.uint32("vx7relay.ptr", "Sender's body pointer (ignored)", base.HEX),
  max_reply = ProtoField.uint32("vx7relay.open.max_reply_size", "Largest reply size", base.DEC),
  depth = ProtoField.uint32("vx7relay.open.depth", "Queue depth", base.DEC),
  tag = ProtoField.uint32("vx7relay.msg.tag", "Tag byte", base.HEX),
  trans = ProtoField.uint32("vx7relay.msg.trans", "Transaction id", base.DEC),
  mtype = ProtoField.uint32("vx7relay.msg.type", "Message type", base.HEX),
  mname = ProtoField.string("vx7relay.msg.name", "Message"),
  body_size = ProtoField.uint32("vx7relay.msg.body_size", "Body size", base.DEC),
  group = ProtoField.uint32("vx7relay.msg.event_group", "Event group", base.HEX),
  event = ProtoField.string("vx7relay.msg.event", "Event"),
  body = ProtoField.bytes("vx7relay.body", "Body"),
  ex = ProtoField.bytes("vx7relay.ex", "Ex"),
  attr_key = ProtoField.uint32("vx7relay.compattr.key", "key", base.DEC),
  attr_value = ProtoField.int32("vx7relay.compattr.value", "value", base.DEC),
}
local A = {
  open = addr_fields("vx7relay.open"),
  assigned = addr_fields("vx7relay.assigned"),
  src = addr_fields("vx7relay.msg.src"),
  tgt = addr_fields("vx7relay.msg.tgt"),
  body = addr_fields("vx7relay.compdesc"),
}

local ALL_FIELDS = {}
for _, f in pairs(H) do ALL_FIELDS[#ALL_FIELDS + 1] = f end
for _, set in pairs(A) do
  for _, f in pairs(set) do ALL_FIELDS[#ALL_FIELDS + 1] = f end
end

local E_MALFORMED = ProtoExpert.new("vx7relay.malformed", "Malformed relay frame",
                                    expert.group.MALFORMED, expert.severity.ERROR)
local E_UNKNOWN = ProtoExpert.new("vx7relay.unknown", "Not in the catalogue",
                                  expert.group.UNDECODED, expert.severity.NOTE)
relay.experts = {E_MALFORMED, E_UNKNOWN}
"""

DECODER = r"""relay.fields = ALL_FIELDS

local STD = nil
for _, c in ipairs(CLASSES) do
  if c.name == "StdResource" then STD = c end
end

local function malformed(item, text)
  item:add_proto_expert_info(E_MALFORMED, text)
end

local function addr_text(a)
  return string.format("{Node %d Board %d Processor %d Component %d Instance %d}",
                       a.node, a.board, a.processor, a.component, a.instance)
end

local function class_of(a)
  for _, c in ipairs(CLASSES) do
    if c.component ~= nil and c.component == a.component
        and (c.instance == nil or c.instance == a.instance) then
      return c
    end
  end
  return nil
end

-- The body for a number: the resource's own class first, then the other address's, then the
-- standard messages, then any class; the first whose fixed part fits the body wins.
local function choose(kind, number, len, first, second)
  local order = {}
  for _, c in ipairs({class_of(first) or false, class_of(second) or false, STD or false}) do
    if c then order[#order + 1] = c end
  end
  for _, c in ipairs(CLASSES) do order[#order + 1] = c end
  local fallback = nil
  for i = 1, #order do
    local c = order[i]
    local d = c[kind][number]
    if d then
      if d.min <= len then return d, c end
      if not fallback then fallback = {d, c} end
    end
  end
  if fallback then return fallback[1], fallback[2] end
  return nil, nil
end

local function cut_text(range)
  local s = range:string()
  local nul = s:find("\0", 1, true)
  if nul then s = s:sub(1, nul - 1) end
  return s
end

local function elem_value(range, w, signed)
  if signed then return range:int() end
  return range:uint()
end

-- Decodes the fields of desc from off in the body tvb; returns the offset behind them and
-- false once the body ran out or a shape could not be followed, so that the caller stops.
local decode_body

local function need(tree, tvb, off, n, label)
  if off + n <= tvb:len() then return true end
  malformed(tree, string.format("truncated: %s needs %d bytes, %d left", label, n,
                                math.max(tvb:len() - off, 0)))
  return false
end

local function add_compdesc(tree, tvb, off, pf, label)
  if not need(tree, tvb, off, 6, label) then return off, false end
  local r = tvb(off, 6)
  local a = {instance = tvb(off, 2):uint(), board = tvb(off + 2, 1):uint(),
             processor = tvb(off + 3, 1):uint(), component = tvb(off + 4, 1):uint(),
             node = tvb(off + 5, 1):uint()}
  local t
  if pf then t = tree:add(pf, r) else t = tree:add(r, label) end
  t:set_text(label .. ": " .. addr_text(a))
  t:add(A.body.instance, tvb(off, 2), a.instance)
  t:add(A.body.board, tvb(off + 2, 1), a.board)
  t:add(A.body.processor, tvb(off + 3, 1), a.processor)
  t:add(A.body.component, tvb(off + 4, 1), a.component)
  t:add(A.body.node, tvb(off + 5, 1), a.node)
  return off + 6, true
end

local function add_rest(tree, tvb, off, f, why)
  local left = tvb:len() - off
  if left <= 0 then return end
  local it = tree:add(f.f, tvb(off, left))
  it:set_text(string.format("%s: %d bytes (%s, not decoded)", f.label, left, why))
end

local function decode_list(tree, tvb, off, f, vals)
  local count = f.ref and vals[f.ref] or nil
  local t = tree:add(tvb(math.min(off, tvb:len()), 0), f.label)
  local start = off
  local i = 0
  while (count == nil and off < tvb:len()) or (count ~= nil and i < count) do
    local ok
    if f.elem == "compdesc" then
      off, ok = add_compdesc(t, tvb, off, nil, string.format("[%d]", i))
    elseif f.elem == "compattr" then
      ok = need(t, tvb, off, 8, string.format("%s[%d]", f.label, i))
      if ok then
        local e = t:add(tvb(off, 8), string.format("[%d]", i))
        e:add(H.attr_key, tvb(off, 4))
        e:add(H.attr_value, tvb(off + 4, 4))
        off = off + 8
      end
    else
      if not need(t, tvb, off, 1, string.format("%s[%d]", f.label, i)) then
        ok = false
      else
        local e = t:add(tvb(off, 0), string.format("[%d] %s", i, f.elem.name))
        local from = off
        off, ok = decode_body(e, tvb, off, f.elem)
        if off > from then e:set_len(off - from) end
      end
    end
    if not ok then break end
    i = i + 1
  end
  if off > start then t:set_len(off - start) end
  t:append_text(string.format(" (%d elements)", i))
  return off, i == count or count == nil
end

local function decode_run(tree, tvb, off, f, vals)
  local left = math.max(tvb:len() - off, 0)
  local n
  local ok = true
  if f.ref then
    n = vals[f.ref]
    if n * f.w > left then
      malformed(tree, string.format("truncated: %s counts %d elements, %d fit", f.label, n,
                                    math.floor(left / f.w)))
      n = math.floor(left / f.w)
      ok = false
    end
  else
    n = math.floor(left / f.w)
  end
  local bytes = n * f.w
  local r = tvb(off, bytes)
  if f.code == 10 then
    tree:add(f.f, r, cut_text(r))
  elseif f.code == 4 then
    tree:add(f.f, r)
  else
    local t = tree:add(r, string.format("%s (%d elements)", f.label, n))
    for i = 0, n - 1 do
      t:add(f.f, tvb(off + i * f.w, f.w), tvb(off + i * f.w, f.w):uint())
    end
  end
  return off + bytes, ok
end

local function decode_dcv(tree, tvb, off, f, vals)
  local word = vals[f.ref] or 0
  local t = bit32.rshift(bit32.band(word, 0xF80000), 19)
  local n = bit32.rshift(bit32.band(word, 0x7F800), 11) + 1
  local w = (t == 0 or t == 4 or t == 10) and 1 or ((t == 1 or t == 5) and 2 or 4)
  local signed = (t == 0 or t == 1 or t == 3)
  if not need(tree, tvb, off, n * w, f.label) then return off, false end
  if n == 1 then
    local it = tree:add(f.f, tvb(off, w), tvb(off, w):uint())
    if signed then
      it:append_text(string.format(" (signed %d)", elem_value(tvb(off, w), w, true)))
    end
    return off + w, true
  end
  local st = tree:add(tvb(off, n * w), string.format("%s (%d elements of type %d)", f.label, n, t))
  for i = 0, n - 1 do
    st:add(f.f, tvb(off + i * w, w), tvb(off + i * w, w):uint())
  end
  return off + n * w, true
end

decode_body = function(tree, tvb, off, desc)
  local vals = {}
  for i, f in ipairs(desc.fields) do
    local k = f.k
    local ok = true
    if k == "scalar" then
      if not need(tree, tvb, off, f.w, f.label) then return off, false end
      local v = elem_value(tvb(off, f.w), f.w, f.signed)
      vals[i] = v
      tree:add(f.f, tvb(off, f.w), v)
      off = off + f.w
    elseif k == "compdesc" then
      off, ok = add_compdesc(tree, tvb, off, f.f, f.label)
    elseif k == "text" or k == "bytes" then
      if not need(tree, tvb, off, f.n, f.label) then return off, false end
      if k == "text" then tree:add(f.f, tvb(off, f.n), cut_text(tvb(off, f.n)))
      else tree:add(f.f, tvb(off, f.n)) end
      off = off + f.n
    elseif k == "run" then
      off, ok = decode_run(tree, tvb, off, f, vals)
    elseif k == "list" then
      off, ok = decode_list(tree, tvb, off, f, vals)
    elseif k == "dcv" then
      off, ok = decode_dcv(tree, tvb, off, f, vals)
    elseif k == "errordata" then
      local rec = f.records[vals[f.ref]]
      if rec then
        local e = tree:add(tvb(off, 0), f.label .. ": " .. rec.name)
        local from = off
        off, ok = decode_body(e, tvb, off, rec)
        if off > from then e:set_len(off - from) end
      else
        local n = math.floor(math.max(tvb:len() - off, 0) / 4)
        local t = tree:add(tvb(off, n * 4), string.format("%s (%d words)", f.label, n))
        for j = 0, n - 1 do t:add(f.f, tvb(off + j * 4, 4)) end
        off = off + n * 4
      end
    else
      add_rest(tree, tvb, off, f, f.what)
      return tvb:len(), true
    end
    if not ok then return off, false end
  end
  return off, true
end

local function add_words(tree, tvb, off, fields, count)
  for i = 1, count do
    local o = off + (i - 1) * 4
    if o + 4 > tvb:len() then return false end
    tree:add(fields[i], tvb(o, 4))
  end
  return true
end

local function read_addr(tvb, off)
  return {node = tvb(off, 4):uint(), board = tvb(off + 4, 4):uint(),
          processor = tvb(off + 8, 4):uint(), component = tvb(off + 12, 4):uint(),
          instance = tvb(off + 16, 4):uint()}
end

local function dissect_address_frame(tvb, pinfo, tree, size, want, set, extra)
  local fields = {set.node, set.board, set.processor, set.component, set.instance}
  for _, f in ipairs(extra) do fields[#fields + 1] = f end
  if size ~= want then
    malformed(tree, string.format("body of %d bytes, %d expected", size, want))
  end
  local complete = add_words(tree, tvb, HEADER_LEN, fields, #fields)
  if complete and size >= ASSIGNED_LEN then
    tree:append_text(" " .. addr_text(read_addr(tvb, HEADER_LEN)))
  end
end

local function msg_word(tvb, i)
  return tvb(HEADER_LEN + i * 4, 4):uint()
end

local function dissect_message(tvb, pinfo, tree, size, ex_size, to_relay)
  if size ~= MSG_HEADER_LEN then
    malformed(tree, string.format("message header of %d bytes, 56 expected", size))
  end
  if size < MSG_HEADER_LEN or tvb:len() < HEADER_LEN + MSG_HEADER_LEN then
    if tvb:len() > HEADER_LEN then tree:add(H.body, tvb(HEADER_LEN, tvb:len() - HEADER_LEN)) end
    return "message (malformed)"
  end
  local w = function(i) return msg_word(tvb, i) end
  local r = function(i) return tvb(HEADER_LEN + i * 4, 4) end
  local src = {node = w(3), board = w(4), processor = w(5), component = w(10), instance = w(9)}
  local tgt = {node = w(6), board = w(7), processor = w(8), component = w(12), instance = w(11)}
  local mtype = w(2)
  local trans = w(1)
  local body_size = w(13)
  local resource, other = src, tgt
  if to_relay then resource, other = tgt, src end

  local h = tree:add(tvb(HEADER_LEN, MSG_HEADER_LEN), "Message header")
  h:add(H.tag, r(0))
  h:add(H.trans, r(1))
  local type_item = h:add(H.mtype, r(2))
  for _, side in ipairs({{"Source", A.src, src, {3, 4, 5, 10, 9}},
                         {"Target", A.tgt, tgt, {6, 7, 8, 12, 11}}}) do
    local t = h:add(tvb(HEADER_LEN + 12, 44), side[1] .. ": " .. addr_text(side[3]))
    local set, idx = side[2], side[4]
    t:add(set.node, r(idx[1]))
    t:add(set.board, r(idx[2]))
    t:add(set.processor, r(idx[3]))
    t:add(set.component, r(idx[4]))
    t:add(set.instance, r(idx[5]))
  end
  h:add(H.body_size, r(13))

  local ex_off = HEADER_LEN + size
  local have = math.min(ex_size, math.max(tvb:len() - ex_off, 0))
  if body_size ~= ex_size then
    malformed(h, string.format("body size %d in the header, %d bytes in the frame", body_size,
                               ex_size))
  end

  local desc, cls, name
  local body_tvb = nil
  if have > 0 then body_tvb = tvb(ex_off, have):tvb() end
  local blen = have
  local summary
  if mtype == EVENT_TYPE and blen >= 4 then
    local group = body_tvb(0, 4):uint()
    local mdesc = choose("msg", mtype, blen, resource, other)
    name = mdesc and mdesc.name or "event"
    desc, cls = choose("evt", group, blen, resource, other)
    h:add(H.group, body_tvb(0, 4))
    if desc then
      h:add(H.event, desc.name):set_generated()
      summary = string.format("%s %s (group 0x%x)", name, desc.name, group)
    else
      desc = mdesc
      summary = string.format("%s (group 0x%x)", name, group)
    end
  else
    desc, cls = choose("msg", mtype, blen, resource, other)
    name = desc and desc.name or string.format("type 0x%x", mtype)
    summary = name
  end
  type_item:append_text(" (" .. name .. ")")
  h:add(H.mname, name):set_generated()

  local b = tree:add(H.body, body_tvb and body_tvb() or tvb(math.min(ex_off, tvb:len()), 0))
  b:set_text(string.format("Body: %s (%d bytes)", desc and desc.name or name, blen))
  if desc == nil then
    b:add_proto_expert_info(E_UNKNOWN, string.format("message type 0x%x", mtype))
  elseif body_tvb ~= nil then
    local off, ok = decode_body(b, body_tvb, 0, desc)
    if ok and off < blen then
      b:add(body_tvb(off, blen - off), string.format("%d bytes behind the fields", blen - off))
    end
  elseif #desc.fields > 0 and desc.min > 0 then
    malformed(b, "truncated: the body is empty")
  end
  return string.format("%s trans %d", summary, trans)
end

local function dissect_frame(tvb, pinfo, tree)
  local len = tvb:len()
  local st = tree:add(relay, tvb())
  if len < HEADER_LEN then
    malformed(st, "frame shorter than its 20-byte header")
    return len
  end
  local ftype = tvb(0, 4):uint()
  local size = tvb(8, 4):uint()
  local ex_size = tvb(12, 4):uint()
  st:add(H.type, tvb(0, 4))
  st:add(H.tran, tvb(4, 4))
  st:add(H.size, tvb(8, 4))
  st:add(H.ex_size, tvb(12, 4))
  st:add(H.ptr, tvb(16, 4))
  local what = FRAME_TYPES[ftype] or string.format("unknown frame type %d", ftype)
  st:append_text(": " .. what)
  if size > MAX_PART or ex_size > MAX_PART then
    malformed(st, string.format("part over the limit of %d bytes", MAX_PART))
    pinfo.cols.protocol = "VX7RELAY"
    pinfo.cols.info:append(" " .. what .. " (malformed)")
    return len
  elseif HEADER_LEN + size + ex_size > len then
    malformed(st, string.format("truncated: %d bytes announced, %d present",
                                HEADER_LEN + size + ex_size, len))
  end
  local to_relay = (pinfo.dst_port == relay.prefs.port)
  local info = what
  if ftype == 1003 then
    dissect_address_frame(tvb, pinfo, st, size, OPEN_LEN, A.open, {H.max_reply, H.depth})
  elseif ftype == 1002 then
    dissect_address_frame(tvb, pinfo, st, size, ASSIGNED_LEN, A.assigned, {})
  elseif ftype == 1001 then
    info = dissect_message(tvb, pinfo, st, size, ex_size, to_relay)
  elseif ftype == 2000 or ftype == 2001 then
    if size ~= 0 or ex_size ~= 0 then malformed(st, "a close carries no content") end
  else
    st:add_proto_expert_info(E_UNKNOWN, what)
  end
  if ftype ~= 1001 and ex_size > 0 and len > HEADER_LEN + size then
    st:add(H.ex, tvb(HEADER_LEN + size, math.min(ex_size, len - HEADER_LEN - size)))
  end
  if tostring(pinfo.cols.protocol) ~= "VX7RELAY" then
    pinfo.cols.protocol = "VX7RELAY"
    pinfo.cols.info = info
  else
    pinfo.cols.info:append(", " .. info)
  end
  return len
end

-- A frame announces its length in the first 16 bytes; one over the limit can never be
-- reassembled, so it takes what is there and is reported as malformed.
local function frame_len(tvb, pinfo, off)
  local size = tvb(off + 8, 4):uint()
  local ex_size = tvb(off + 12, 4):uint()
  if size > MAX_PART or ex_size > MAX_PART then return tvb:len() - off end
  return HEADER_LEN + size + ex_size
end

function relay.dissector(tvb, pinfo, tree)
  dissect_tcp_pdus(tvb, tree, HEADER_LEN, frame_len, dissect_frame, true)
  return tvb:len()
end

relay.prefs.port = Pref.uint("TCP port", DEFAULT_PORT, "TCP port of the relay host")
local registered_port = DEFAULT_PORT
DissectorTable.get("tcp.port"):add(DEFAULT_PORT, relay)

function relay.prefs_changed()
  if relay.prefs.port == registered_port then return end
  local tcp = DissectorTable.get("tcp.port")
  if registered_port ~= 0 then tcp:remove(registered_port, relay) end
  registered_port = relay.prefs.port
  if registered_port ~= 0 then tcp:add(registered_port, relay) end
end
"""
