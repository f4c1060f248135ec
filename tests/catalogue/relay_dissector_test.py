#!/usr/bin/env python3
"""The generated Wireshark decoder of the relay protocol, run by real tshark.

Usage: relay_dissector_test.py DISSECTOR.lua VX7SIM FARM

A scripted client talks to a real vx7sim (open, a subscription to call states, MakeCall, a
refused GetParm, close), keeps every byte in both directions and writes them as a pcap of two
TCP connections on port 6554; the second connection holds hand-made malformed frames. tshark
decodes the capture with the dissector, and the decoded fields are checked against what the
client sent and received. Exit 77 (skipped) only when tshark is not installed.
"""

import os
import random
import select
import shutil
import socket
import struct
import subprocess
import sys
import tempfile
import time
import xml.etree.ElementTree as ET

SKIP = 77
RELAY_PORT = 6554

OPEN, ASSIGNED, MESSAGE, CLOSE, CLOSE_ACK = 1003, 1002, 1001, 2000, 2001
TSC_1_1_1 = dict(node=0, board=1, processor=1, component=18, instance=1 * 32 + 1)
SUBSCRIPTION_ID = 1000
MAKECALL_TRANS = 10000
GETPARM_TRANS = 10001
REFUSAL_CODE = 0x2A
PARM_NUM = 7
CALL_STATE_GROUP = 0x1230

failures = []


def check(cond, what):
    if not cond:
        failures.append(what)


def frame(ftype, body=b"", ex=b""):
    return struct.pack(">5I", ftype, 0, len(body), len(ex), 0) + body + ex


def message(mtype, trans, src, tgt, body):
    words = [0, trans, mtype, src["node"], src["board"], src["processor"], tgt["node"],
             tgt["board"], tgt["processor"], src["instance"], src["component"],
             tgt["instance"], tgt["component"], len(body)]
    return frame(MESSAGE, struct.pack(">14I", *words), body)


def compdesc(a):
    return struct.pack(">HBBBB", a["instance"], a["board"], a["processor"], a["component"],
                       a["node"])


def text(s, n):
    return s.encode().ljust(n, b"\0")


class Client:
    """One connection to vx7sim that keeps what went each way, segment by segment."""

    def __init__(self, port):
        self.sock = socket.create_connection(("127.0.0.1", port), timeout=10)
        self.sent = []  # client -> relay segments, as sent
        self.received = b""
        self.pending = b""

    def send(self, data, split=None):
        parts = [data] if split is None else [data[:split], data[split:]]
        for p in parts:
            self.sock.sendall(p)
            self.sent.append(p)
            if split is not None:
                time.sleep(0.05)

    def next_frame(self, deadline):
        while True:
            if len(self.pending) >= 20:
                _, _, size, ex_size, _ = struct.unpack(">5I", self.pending[:20])
                total = 20 + size + ex_size
                if len(self.pending) >= total:
                    f = self.pending[:total]
                    self.pending = self.pending[total:]
                    return f
            left = deadline - time.monotonic()
            if left <= 0:
                raise TimeoutError("no frame from vx7sim in time")
            self.sock.settimeout(left)
            chunk = self.sock.recv(65536)
            if not chunk:
                raise ConnectionError("vx7sim closed the connection")
            self.received += chunk
            self.pending += chunk

    def wait_for(self, pred, what, seconds=10):
        deadline = time.monotonic() + seconds
        while True:
            f = self.next_frame(deadline)
            if pred(f):
                return f


def msg_fields(f):
    words = struct.unpack(">14I", f[20:76])
    return words[2], words[1], f[76:]


class Sim:
    def __init__(self, binary, farm):
        env = dict(os.environ)
        env.pop("VX7_FARM", None)
        self.p = subprocess.Popen([binary, "--farm", farm, "--port", "0", "--bind", "127.0.0.1"],
                                  stdin=subprocess.PIPE, stdout=subprocess.PIPE,
                                  stderr=subprocess.DEVNULL, env=env, text=True, bufsize=1)
        first = self.readline()
        if not first.startswith("listening on "):
            raise RuntimeError(f"vx7sim did not start: {first!r}")
        self.port = int(first.split()[-1])

    def readline(self, seconds=15):
        ready, _, _ = select.select([self.p.stdout], [], [], seconds)
        return self.p.stdout.readline().strip() if ready else ""

    def control(self, line):
        self.p.stdin.write(line + "\n")
        self.p.stdin.flush()
        return self.readline()

    def stop(self):
        self.p.terminate()
        self.p.wait(timeout=10)


def exchange(sim):
    """The scripted session; returns the client's segments, the relay's bytes and what the
    checks compare with."""
    c = Client(sim.port)
    seen = {}
    c.send(frame(OPEN, struct.pack(">7I", 0, 0, 0, 0, 0, 512, 5)))  # any address
    f = c.wait_for(lambda f: struct.unpack(">I", f[:4])[0] == ASSIGNED, "assigned address")
    me = dict(zip(("node", "board", "processor", "component", "instance"),
                  struct.unpack(">5I", f[20:40])))
    seen["assigned"] = me

    def reply_to(trans, mtype):
        return lambda f: (struct.unpack(">I", f[:4])[0] == MESSAGE
                          and msg_fields(f)[1] == trans and msg_fields(f)[0] in (mtype, 0))

    detect = compdesc(me) + struct.pack(">II", CALL_STATE_GROUP, CALL_STATE_GROUP)
    c.send(message(0x16, SUBSCRIPTION_ID, me, TSC_1_1_1, detect))
    f = c.wait_for(reply_to(SUBSCRIPTION_ID, 0x17), "subscription completion")
    check(msg_fields(f)[0] == 0x17, "vx7sim refused the subscription")

    # The MakeCall frame goes out in two segments, so that the decoder has to reassemble it.
    makecall = text("5551234", 128) + text("5551212", 128) + bytes([1])
    c.send(message(0x1214, MAKECALL_TRANS, me, TSC_1_1_1, makecall), split=30)
    events = []
    deadline = time.monotonic() + 10
    cmplt = None
    while cmplt is None or not events:
        f = c.next_frame(deadline)
        if struct.unpack(">I", f[:4])[0] != MESSAGE:
            continue
        mtype, trans, body = msg_fields(f)
        if trans == MAKECALL_TRANS and mtype in (0x1215, 0):
            cmplt = (mtype, body)
        elif mtype == 0x20 and struct.unpack(">I", body[:4])[0] == CALL_STATE_GROUP:
            events.append(struct.unpack(">6I", body[:24]))
    check(cmplt[0] == 0x1215, f"MakeCall was answered with type {cmplt[0]:#x}")
    seen["callid"] = struct.unpack(">I", cmplt[1][:4])[0]
    seen["event"] = events[0]

    answer = sim.control(f"refuse 12 {REFUSAL_CODE:x}")
    check(answer.startswith("ok"), f"vx7sim did not take the refusal: {answer!r}")
    c.send(message(0x12, GETPARM_TRANS, me, TSC_1_1_1, struct.pack(">I", PARM_NUM)))
    f = c.wait_for(reply_to(GETPARM_TRANS, 0x13), "GetParm answer")
    check(msg_fields(f)[0] == 0, "GetParm was not refused")

    c.send(frame(CLOSE))
    c.wait_for(lambda f: struct.unpack(">I", f[:4])[0] == CLOSE_ACK, "close acknowledged")
    c.sock.close()
    return c.sent, c.received, seen


# ---------------------------------------------------------------- pcap


class Pcap:
    def __init__(self):
        self.out = struct.pack("<IHHiIII", 0xA1B2C3D4, 2, 4, 0, 0, 262144, 1)
        self.t = 0

    def packet(self, src, dst, sport, dport, seq, ack, flags, payload=b""):
        tcp = struct.pack(">HHIIBBHHH", sport, dport, seq, ack, 5 << 4, flags, 65535, 0, 0)
        # Checksums stay 0: tshark does not verify them unless told to.
        ip = struct.pack(">BBHHHBBH4s4s", 0x45, 0, 40 + len(payload), 0, 0x4000, 64, 6, 0,
                         socket.inet_aton(src), socket.inet_aton(dst))
        pkt = b"\0\0\0\0\0\2" + b"\0\0\0\0\0\1" + b"\x08\x00" + ip + tcp + payload
        self.t += 1000
        self.out += struct.pack("<IIII", 1700000000 + self.t // 1000000, self.t % 1000000,
                                len(pkt), len(pkt)) + pkt

    def write(self, path):
        with open(path, "wb") as f:
            f.write(self.out)
        return path

    def connection(self, cport, sport, segs):
        """A whole connection: the handshake, then each side's segments in order."""
        cli, srv = "127.0.0.1", "127.0.0.2"
        cseq, sseq = 1000, 5000
        self.packet(cli, srv, cport, sport, cseq, 0, 0x02)
        self.packet(srv, cli, sport, cport, sseq, cseq + 1, 0x12)
        cseq += 1
        sseq += 1
        self.packet(cli, srv, cport, sport, cseq, sseq, 0x10)
        for who, seg in segs:
            if who == "c":
                self.packet(cli, srv, cport, sport, cseq, sseq, 0x18, seg)
                cseq += len(seg)
            else:
                self.packet(srv, cli, sport, cport, sseq, cseq, 0x18, seg)
                sseq += len(seg)


def segments(sent, received):
    """The client's segments as sent, then the relay's bytes cut into 97-byte segments, so
    that frames span segments and segments hold several frames whatever the timing was."""
    segs = [("c", s) for s in sent]
    step = 97
    segs += [("s", received[i:i + step]) for i in range(0, len(received), step)]
    return segs


def malformed_segments():
    me = dict(node=0, board=0, processor=0, component=0, instance=9)
    cut_open = frame(OPEN, struct.pack(">3I", 0, 1, 2))
    full = text("5551234", 128) + text("5551212", 128) + bytes([1])
    short = message(0x1214, 4242, me, TSC_1_1_1, full)
    # The header still announces 257 bytes of body; the frame carries 40 of them.
    short = struct.pack(">5I", MESSAGE, 0, 56, 40, 0) + short[20:76] + full[:40]
    oversize = struct.pack(">5I", MESSAGE, 0, 56, 200000, 0) + b"\0" * 56
    return [("c", cut_open), ("c", short), ("c", oversize)]


def on1(comp, inst):
    return dict(node=0, board=1, processor=1, component=comp, instance=inst)


LCON_1, CLUSTER_1, RMGR_1 = on1(22, 1), on1(2, 33), on1(0, 5)
LCON_ALARMS = "vx7relay.LCON.MsgGetAlarmsCmplt_t.AlarmInfo_t."
LCON_VPARMS = "vx7relay.LCON.Std_MsgGetVParmCmplt_t.Parms_t."

# One message for each shape of field that the exchange with vx7sim does not show: type,
# target, body, the name it must be decoded as, and fields (a list: every value of the field).
SHAPES = [
    ("counted element bodies", 0x1603, LCON_1, struct.pack(">IIBIB", 2, 0x1A, 1, 0x1B, 0),
     "MsgGetAlarmsCmplt_t",
     {LCON_ALARMS + "Type": ["26", "27"], LCON_ALARMS + "State": ["1", "0"]}),
    # A LCON's own 0x2E, with values shaped by their descriptors: one u32, three u16.
    ("descriptor-shaped values", 0x2E, LCON_1,
     struct.pack(">HIII", 2, 4, 0x380000, 77)
     + struct.pack(">II3H", 5, 0x280000 | (2 << 11), 1, 2, 3),
     "Std_MsgGetVParmCmplt_t",
     {LCON_VPARMS + "Parm": ["4", "5"], LCON_VPARMS + "Val": ["77", "1", "2", "3"]}),
    ("counted addresses", 0x800028, CLUSTER_1,
     compdesc(CLUSTER_1) + bytes([2]) + compdesc(on1(18, 33)) + compdesc(on1(20, 33)),
     "ClusterCompInfoResult_t", {"vx7relay.compdesc.component": ["2", "18", "20"],
                                 "vx7relay.Cluster.ClusterCompInfoResult_t.count": ["2"]}),
    ("counted attributes", 0x80003D, RMGR_1, compdesc(on1(18, 0)) + struct.pack(">IIi", 1, 3, -2),
     "CompFind_t", {"vx7relay.compattr.key": ["3"], "vx7relay.compattr.value": ["-2"]}),
    ("a u16 run counted by a field of another name", 0x800030, CLUSTER_1,
     compdesc(CLUSTER_1) + struct.pack(">IBBBHH", 7, 2, 0, 0xFF, 5, 6),
     "ClusterSlotAssign_t", {"vx7relay.Cluster.ClusterSlotAssign_t.slotIds": ["5", "6"]}),
    ("characters to the end of the body", 0x13, TSC_1_1_1,
     struct.pack(">III", 4, 1, 5) + b"hello", "MsgGetParmCmplt_t",
     {"vx7relay.StdResource.MsgGetParmCmplt_t.Text": ["hello"]}),
    # A hand-written shape that the decoder does not follow is shown as bytes.
    ("a KVSet as bytes", 0x1201, TSC_1_1_1, struct.pack(">II", 9, 2) + bytes(12),
     "MsgAnswerCall_t", {"vx7relay.TSC.MsgAnswerCall_t.CallId": ["9"],
                         "vx7relay.TSC.MsgAnswerCall_t.KVSet": [":".join(["00"] * 12)]}),
]


def shape_segments():
    me = dict(node=0, board=0, processor=0, component=0, instance=9)
    return [("c", message(t, 5000 + i, me, tgt, body))
            for i, (_, t, tgt, body, _, _) in enumerate(SHAPES)]


def check_shapes(frames):
    check(not [f for f in frames if "vx7relay.malformed" in f], "a good shape marked malformed")
    check(len(frames) == len(SHAPES), f"{len(frames)} of {len(SHAPES)} shapes decoded")
    for f, (what, _, _, _, name, fields) in zip(frames, SHAPES):
        expect(f, what, {"vx7relay.msg.name": name, **fields})


RANDOM_FRAMES = 300


def random_segments():
    """Random bodies of every catalogue number range, to any kind of resource, events among
    them: the decoder has to stop at each body's end without a Lua error."""
    rnd = random.Random(6554)
    types = [*range(0, 0x31), *range(0x1200, 0x1250), *range(0x1400, 0x1420),
             *range(0x1600, 0x161A), *range(0x800000, 0x800064)]
    groups = [0x1200, 0x1201, 0x1217, 0x121B, 0x121C, 0x121D, 0x1230, 0x1250, 0x1260, 0x126B,
              0x1402, 0x1405, 0x1600, 0x1611, 0x1616, 5, 6]
    me = dict(node=0, board=0, processor=0, component=0, instance=1)
    segs = []
    for i in range(RANDOM_FRAMES):
        res = on1(rnd.choice([0, 2, 18, 19, 20, 22]), rnd.choice([1, 5, 8, 33]))
        body = bytes(rnd.randrange(256) for _ in range(rnd.choice([0, 1, 3, 4, 8, 14, 40, 300])))
        mtype = 0x20 if rnd.random() < 0.3 else rnd.choice(types)
        if mtype == 0x20 and len(body) >= 4:
            body = struct.pack(">I", rnd.choice(groups)) + body[4:]
        src, tgt = (me, res) if rnd.random() < 0.5 else (res, me)
        segs.append(("c", message(mtype, i, src, tgt, body)))
    return segs


# ---------------------------------------------------------------- decoding


def decode(tshark, lua, cap, extra=()):
    cmd = [tshark, "-n", "-X", f"lua_script:{lua}", *extra, "-r", cap, "-T", "pdml"]
    # tshark cuts long labels inside a UTF-8 sequence, so random text can end in half of one.
    r = subprocess.run(cmd, capture_output=True, text=True, errors="replace", timeout=240)
    if r.returncode != 0:
        raise RuntimeError(f"tshark failed ({r.returncode}): {r.stderr}")
    check("Lua Error" not in r.stdout + r.stderr, "tshark reports a Lua error")
    frames = []
    for pkt in ET.fromstring(r.stdout).iter("packet"):
        stream = [f.get("show") for f in pkt.iter("field") if f.get("name") == "tcp.stream"]
        for proto in pkt.iter("proto"):
            if proto.get("name") != "vx7relay":
                continue
            fields = {"stream": stream}
            for fl in proto.iter("field"):
                fields.setdefault(fl.get("name"), []).append(fl.get("show"))
            frames.append(fields)
    return frames


def one(fr, name):
    v = fr.get(name)
    return v[0] if v else None


def expect(fr, what, fields):
    """Each field shows the wanted value (a list: every value it takes, in order)."""
    for name, want in fields.items():
        got = fr.get(name) if isinstance(want, list) else one(fr, name)
        check(got == want, f"{what}: {name} is {got!r}, not {want!r}")


def only(frames, what, field, value):
    got = [f for f in frames if one(f, field) == value]
    check(len(got) == 1, f"{len(got)} {what} decoded")
    return got[0] if got else {}


def check_session(frames, seen):
    me = seen["assigned"]
    expect(only(frames, "open frames", "vx7relay.type", str(OPEN)), "open",
           {"vx7relay.open.max_reply_size": "512", "vx7relay.open.depth": "5",
            "vx7relay.open.instance": "0"})
    expect(only(frames, "assigned-address frames", "vx7relay.type", str(ASSIGNED)), "assigned",
           {f"vx7relay.assigned.{k}": str(v) for k, v in me.items()})
    # The subscription to a TSC is the standard one.
    expect(only(frames, "MsgDetectEvt_t", "vx7relay.msg.name", "MsgDetectEvt_t"), "subscription",
           {"vx7relay.StdResource.MsgDetectEvt_t.EvtGroup": str(CALL_STATE_GROUP),
            "vx7relay.compdesc.instance": str(me["instance"])})
    p = "vx7relay.TSC.MsgMakeCall_t."
    expect(only(frames, "MsgMakeCall_t (split across two segments)", "vx7relay.msg.name",
                "MsgMakeCall_t"), "MakeCall",
           {p + "DestAddr": "5551234", p + "OrigAddr": "5551212", p + "CallProgress": "1",
            "vx7relay.msg.trans": str(MAKECALL_TRANS), "vx7relay.msg.type": "0x00001214",
            **{f"vx7relay.msg.tgt.{k}": str(v) for k, v in TSC_1_1_1.items()},
            **{f"vx7relay.msg.src.{k}": str(v) for k, v in me.items()}})
    expect(only(frames, "MsgMakeCallCmplt_t", "vx7relay.msg.name", "MsgMakeCallCmplt_t"),
           "completion", {"vx7relay.TSC.MsgMakeCallCmplt_t.CallId": str(seen["callid"]),
                          "vx7relay.msg.trans": str(MAKECALL_TRANS)})
    p = "vx7relay.StdResource.MsgError_t."
    expect(only(frames, "MsgError_t", "vx7relay.msg.name", "MsgError_t"), "refusal",
           {p + "ErrorMsg": str(0x12), p + "ErrorCode": str(REFUSAL_CODE),
            p + "Data_ErrorMsg_0x12_t.Num": str(PARM_NUM), p + "Data_ErrorMsg_0x12_t.Val": "0",
            "vx7relay.msg.trans": str(GETPARM_TRANS)})
    evs = [f for f in frames if one(f, "vx7relay.msg.event") == "EvtCallState_t"]
    check(len(evs) >= 1, "no EvtCallState_t decoded")
    group, typ, stamp, callid, state, reason = seen["event"][:6]
    p = "vx7relay.TSC.EvtCallState_t."
    expect(evs[0] if evs else {}, "event",
           {"vx7relay.msg.name": "MsgEvtDetected_t", "vx7relay.msg.event_group": "0x00001230",
            p + "EvtGroup": str(group), p + "CallId": str(callid), p + "CallState": str(state),
            p + "Reason": str(reason), p + "Timestamp": str(stamp),
            "vx7relay.msg.trans": str(SUBSCRIPTION_ID)})
    only(frames, "close frames", "vx7relay.type", str(CLOSE))
    only(frames, "close acknowledgements", "vx7relay.type", str(CLOSE_ACK))
    bad = [f for f in frames if "vx7relay.malformed" in f]
    check(not bad, f"{len(bad)} frames of the good session marked malformed")


def check_malformed(frames):
    bad = [f for f in frames if "vx7relay.malformed" in f]
    check(len(bad) == 3, f"{len(bad)} of the 3 bad frames marked malformed")
    mc = [f for f in bad if one(f, "vx7relay.msg.name") == "MsgMakeCall_t"]
    check(len(mc) == 1, "the cut MakeCall is not decoded as far as it goes")
    if mc:
        check(one(mc[0], "vx7relay.TSC.MsgMakeCall_t.DestAddr") is None,
              "a DestAddr is shown from 40 bytes")


def main(argv):
    if len(argv) != 4:
        print(__doc__, file=sys.stderr)
        return 2
    lua, vx7sim, farm = argv[1:]
    tshark = shutil.which("tshark")
    if tshark is None:
        print("tshark is not installed (scripts/deps installs it); skipped")
        return SKIP
    sim = Sim(vx7sim, farm)
    try:
        sent, received, seen = exchange(sim)
    finally:
        sim.stop()

    session = segments(sent, received)
    with tempfile.TemporaryDirectory() as tmp:
        p = Pcap()
        for i, segs in enumerate((session, malformed_segments(), shape_segments(),
                                  random_segments())):
            p.connection(40000 + i, RELAY_PORT, segs)
        frames = decode(tshark, lua, p.write(os.path.join(tmp, "relay.pcap")))
        check_session([f for f in frames if one(f, "stream") == "0"], seen)
        check_malformed([f for f in frames if one(f, "stream") == "1"])
        check_shapes([f for f in frames if one(f, "stream") == "2"])
        decoded = len([f for f in frames if one(f, "stream") == "3"])
        check(decoded == RANDOM_FRAMES, f"{decoded} of {RANDOM_FRAMES} random frames decoded")

        # The same session on another port: decoded only once the preference names it.
        p = Pcap()
        p.connection(40000, 7000, session)
        moved = p.write(os.path.join(tmp, "moved.pcap"))
        check(not decode(tshark, lua, moved), "port 7000 decoded without the preference")
        frames = decode(tshark, lua, moved, ["-o", "vx7relay.port:7000"])
        only(frames, "MakeCall on port 7000 with the preference", "vx7relay.msg.name",
             "MsgMakeCall_t")

    for f in failures:
        print("FAILED:", f)
    print(f"{'ok' if not failures else 'failed'}: {len(failures)} failed checks")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
