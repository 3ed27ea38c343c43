#!/usr/bin/env python3
"""Writes the seed corpora under fuzz/corpus/<target>/ in the input encodings of the targets
(see the comment at the top of each fuzz_<target>.cpp). Run from anywhere; rewrites the seeds.

The loader seeds are the example configuration and small configurations like those of the
tests; the event, config and dump seeds replay the calls of examples/minute.trace and the cases
the tests exercise (edges of the payload check, negative counts, over-long dump options).
"""
import os
import shutil
import struct

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(HERE)
CORPUS = os.path.join(HERE, "corpus")


def integer(v):
    """FuzzInput::integer: one signed byte, or 0x80 and four raw bytes."""
    if -127 <= v <= 127:
        return struct.pack("<b", v)
    return b"\x80" + struct.pack("<i", v)


def raw_id(v):
    return b"\x01" + struct.pack("<i", v)


def event(cmd, payload=None, msg=None, count=None):
    flags = (1 if msg is not None else 0) | (2 if payload is not None else 0)
    n = count if count is not None else (len(payload) if payload is not None else 0)
    out = raw_id(cmd) + bytes([flags, n])
    if payload is not None:
        out += b"".join(integer(v) for v in payload)
    if msg is not None:
        data = msg.encode()
        out += bytes([len(data)]) + data
    return out


def setconfig(client, pairs, null_arrays=False, count=None):
    op = 0 | (2 if null_arrays else 0)
    n = len(pairs) if count is None else count
    out = bytes([op]) + integer(client) + bytes([n & 0xFF])
    if n > 0:
        out += b"".join(integer(t) for t, _ in pairs)
        out += b"".join(integer(v) for _, v in pairs)
    return out


def getconfig(tags, null_arrays=False, count=None):
    op = 1 | (2 if null_arrays else 0)
    n = len(tags) if count is None else count
    out = bytes([op, n & 0xFF])
    if n > 0:
        out += b"".join(integer(t) for t in tags)
    return out


def dump(args, fd_sel=0):
    out = bytes([0, fd_sel, len(args)])
    for a in args:
        data = a.encode()
        out += b"\x01" + struct.pack("<H", len(data)) + data
    return out


def write(target, name, data):
    d = os.path.join(CORPUS, target)
    os.makedirs(d, exist_ok=True)
    with open(os.path.join(d, name), "wb") as f:
        f.write(data)


def trace_calls():
    """(kind, fields) of every call in examples/minute.trace."""
    calls = []
    with open(os.path.join(ROOT, "examples", "minute.trace")) as f:
        for line in f:
            line = line.split("#", 1)[0].strip()
            if line.startswith("@"):
                line = line.split(None, 1)[1] if " " in line else ""
            if line:
                calls.append(line)
    return calls


def trace_events():
    out = []
    for call in trace_calls():
        if call.startswith("reload"):
            out.append(event(20230, [0]))
            continue
        if not call.startswith("event "):
            continue
        msg = None
        if 'msg="' in call:
            call, m = call.split('msg="', 1)
            msg = m.rstrip('"')
        fields = call.split()[1:]
        cmd = int(fields[0], 0)
        payload = [int(v, 0) for v in fields[1:]] or None
        out.append(event(cmd, payload, msg))
    return out


def main():
    if os.path.isdir(CORPUS):
        shutil.rmtree(CORPUS)

    # Loader: the example configuration and small ones shaped like the tests'.
    os.makedirs(os.path.join(CORPUS, "loader"))
    shutil.copy(os.path.join(ROOT, "examples", "xml", "velmora_config_cust.xml"),
                os.path.join(CORPUS, "loader", "example.xml"))
    small = {
        "vocabulary.xml": '<policy><cmd id="4099" name="cold"><act type="1"><duration>1500'
                          '</duration><little_min>1804800</little_min><big_max>2419200</big_max>'
                          '<gpu_min>500</gpu_min><ddr_min>800</ddr_min><priority>150</priority>'
                          '<tag_33>7</tag_33></act></cmd></policy>',
        "strings.xml": '<policy><cmd id="4230" name="gov"><act><priority>40</priority>'
                       '<gpu_governor>performance</gpu_governor></act></cmd><cmd id="20481">'
                       '<act><mem_latency_ratio_b>0.6</mem_latency_ratio_b></act></cmd></policy>',
        "three_actions.xml": '<policy><cmd id="4100"><a><duration>10</duration></a><a><duration>'
                             '20</duration></a><a/><a><duration>5</duration></a></cmd></policy>',
        "bad_values.xml": '<policy><cmd id="4101" name="scroll"><act><duration>soon</duration>'
                          '<little_min>1.5GHz</little_min><tag_x>3</tag_x><bad></bad></act></cmd>'
                          '</policy>',
        "ids.xml": '<policy><cmd id="0x10"><a/></cmd><cmd id="abc"><a/></cmd><cmd id=" -7 ">'
                   '<a type="fast"><k>1</k></a></cmd><cmd id="4400"/><cmd id="4400"/></policy>',
        "not_policy.xml": '<config><cmd id="4500"/></config>',
        "unclosed.xml": '<policy><cmd id="1"></policy>',
    }
    for name, text in small.items():
        write("loader", name, ('<?xml version="1.0" encoding="utf-8"?>\n' + text).encode())

    # Events: the example trace in one input and in pieces, and the edges of the checks.
    events = trace_events()
    write("event", "minute_trace", b"".join(events[:32]))
    for i in range(0, len(events), 6):
        write("event", "trace_%02d" % (i // 6), b"".join(events[i:i + 6]))
    write("event", "payload_edges", b"".join([
        event(4118, [1]), event(4118, [0, 0]), event(4118, None, count=1), event(12288, []),
        event(4116, [0], "pid=1|tid=0"), event(4116, [0], "pid=1"), event(4116, [0], None),
        event(4116, [5], "pid=-1|tid=-1"), event(20480, [0], "pid=1|tid=2|ratio_b=" + "9" * 200 +
                                                  " ratio_l=1"),
        event(20480, [0], None), event(20225, [0x10000]), event(20225, [1, 2]),
        event(20224, [0]), event(-5, [0]), event(0x7fffffff, [0]), event(20230, None)]))
    write("event", "scenes", b"".join([
        event(4119, [0]), event(4224, [0]), event(4230, [0]), event(4118, [0]), event(4119, [-1]),
        event(4230, [-1]), event(4224, [-1]), event(4118, [-1]), event(4121, [0]),
        event(20224, [0])]))

    # Config: the trace's requests, the client paths and the malformed counts.
    write("config", "trace_requests", b"".join([
        setconfig(1, [(42, 196618)]), setconfig(1, [(2, 1497600), (5, 2016000), (8, 700000000)]),
        getconfig([22, 24, 26]), setconfig(1, [(2, 0), (5, 0), (8, 0)]),
        setconfig(3, [(40, 2)]), setconfig(2, [(20, 1), (17, 60000)])]))
    write("config", "clients", b"".join([
        setconfig(0, [(10000, 0x50000)]), setconfig(2, [(4, 1804800), (5, 2016000)]),
        setconfig(3, [(51, 10), (42, 1)]), setconfig(-1, [(2, 5)]), setconfig(4, [(1, 1)]),
        setconfig(1, [(22, 3), (42, 0x30009)]), getconfig([1, 2, 4, 5, 7, 8, 999])]))
    write("config", "counts", b"".join([
        setconfig(1, [], count=0), setconfig(1, [], count=0xFF), setconfig(1, [], True, 0xF0),
        getconfig([], count=0x80), getconfig([], True, 0xFF), getconfig([], count=0)]))

    # Dump: every option, the argument-count and length checks, tables filled in between.
    write("dump", "options", b"".join(
        dump([o]) for o in ["--help", "--logon", "--logoff", "--freqlist", "--easgrouplist",
                            "--HELP"]))
    write("dump", "checks", b"".join([
        dump([]), dump(["--help", "--help"]), dump(["x" * 512]), dump(["x" * 513]),
        dump(["--help"], 1), dump(["--freqlist"], 2)]))
    write("dump", "tables", b"".join([
        b"\x02\x01\x02" + integer(1497600), b"\x02\x02\x05" + integer(2016000),
        b"\x03\x01\x00", b"\x03\x03\x00", dump(["--freqlist"]), dump(["--easgrouplist"])]))


if __name__ == "__main__":
    main()
