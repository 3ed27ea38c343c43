#!/usr/bin/env python3
"""Writes the seeds of the host tools' targets (trace, logcat, profile, lint) into a staging
directory, one sub-directory per target; they are then minimised into fuzz/corpus/<target>/:

    fuzz/make_tool_seeds.py build/fuzz/seeds
    build/fuzz/fuzz/fuzz_trace -merge=1 fuzz/corpus/trace build/fuzz/seeds/trace   (and so on)

The seeds are the examples, the test data and the bad files of the tests (the lint findings
table), plus small edge cases of every text: empty, one byte, a byte-order mark, CRLF line ends,
a line past the trace reader's 64 KiB limit, deep XML nesting.
"""
import os
import re
import sys

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(HERE)
BOM = b"\xef\xbb\xbf"


def read(path):
    with open(os.path.join(ROOT, path), "rb") as f:
        return f.read()


def crlf(data):
    return data.replace(b"\n", b"\r\n")


def nested(depth, tag=b"a"):
    return b"<" + tag + b">" * 1 + (b"<" + tag + b">") * (depth - 1) + (b"</" + tag + b">") * depth


def edge_cases(sample):
    """The shapes every text format must survive, around one sample of it."""
    return {
        "empty": b"",
        "one_byte": b"<",
        "newline": b"\n",
        "bom": BOM + sample,
        "crlf": crlf(sample),
        "nul": sample[:40] + b"\x00" + sample[40:80],
        "no_final_newline": sample.rstrip(b"\n"),
    }


def trace_seeds():
    seeds = {
        "minute": read("examples/minute.trace"),
        "probes": read("tests/host/data/probes.trace"),
        "sleeps": read("tests/host/data/sleeps.trace"),
        "bad": read("tests/host/data/bad.trace"),
        "every_call": b"\n".join([
            b"# every call once",
            b"@0 event 4099 0 # a comment after a call",
            b"@10",
            b"sleep 0x10",
            b"event 4116 1 msg=\"pid=12|tid=34\"",
            b"event 20480 msg=\"pid=1|tid=2|ratio_b=0.5 ratio_l=0.7\"",
            b"event -2147483648 4294967295 -1",
            b"reload",
            b"setconfig 1 2=1497600 5=0x1EC300",
            b"getconfig 22 24 26",
            b"dump --freqlist",
            b"dump \"--help me\"",
            b"policy cold 300",
            b"policy winswitch -1",
            b"@9223372036854775 reload",
            b"",
        ]),
        "bad_lines": b"\n".join([
            b"evnt 4098 0", b"event 40x9 0", b"@-5 reload", b"sleep 2.5", b"sleep \" 5\"",
            b"event 99999999999 0", b"setconfig 1 2:1497600", b"event 4116 0 msg=\"pid=1",
            b"policy cold", b"\"\" 1", b"@", b"@@1", b"",
        ]),
        "long_line": b"event 4099 " + b"1 " * 33000 + b"\nreload\n",
        "many_payloads": b"event 4099" + b" 0" * 63 + b"\nevent 4099" + b" 0" * 64 + b"\n",
    }
    seeds.update(edge_cases(seeds["minute"][:400]))
    return seeds


def logcat_line(layout, stamp, pid, tid, message, prio=b"I", tag=b"velmora server", uid=None):
    if layout == "threadtime":
        u = (b" " + uid + b":") if uid else b""
        return b"%s %s %5d %5d %s %s: %s" % (stamp, u, pid, tid, prio, tag, message)
    inner = (uid + b": " if uid else b" ") + b"%d" % pid
    return b"%s %s/%s(%s): %s" % (stamp, prio, tag, inner, message)


def logcat_seeds():
    messages = [
        b"velmoraEvent cmdId=4099, payload=0",
        b"velmoraEvent cmdId=20230",
        b"setConfig clientId=1, tagLen=2, tags[0]=2, configs[0]=1497600",
        b"setConfig clientId=1, tagLen=2, tags[1]=5, configs[1]=2016000",
        b"velmoraGetConfig tagLen=3",
        b"client may rebooted, clean special scene set, cmdId is 20224",
        b"velmoraEvent cmdId=4116, payload=1",
        b"there is too many dump parameter!",
        b"init mPlatPtr failed!",
    ]
    stamps = {
        "date": [b"11-23 18:09:30.100", b"11-23 18:09:31.600000"],
        "year": [b"2026-11-23 18:09:30.100", b"2026-11-23 18:09:31.600"],
        "epoch": [b"1795457370.100000000", b"1795457371.600"],
        "monotonic": [b"  5123.100", b"  5124.600"],
        "newyear": [b"12-31 23:59:59.100", b"01-01 00:00:00.600"],
    }
    seeds = {}
    for layout in ("threadtime", "time"):
        for clock, pair in stamps.items():
            for uid in (None, b"1000"):
                lines = [b"--------- beginning of main"]
                for k, m in enumerate(messages):
                    lines.append(logcat_line(layout, pair[k % 2], 1234, 1250 + k % 2, m, uid=uid))
                lines.append(logcat_line(layout, pair[1], 99, 99, b"x", tag=b"ActivityManager"))
                lines.append(logcat_line(layout, pair[1], 4321, 4321, messages[0]))
                name = "%s_%s%s" % (layout, clock, "_uid" if uid else "")
                seeds[name] = b"\n".join(lines) + b"\n"
    seeds["unjoined"] = b"\n".join(logcat_line("threadtime", b"11-23 18:09:30.100", 1, 2, m) for m in [
        b"setConfig clientId=1, tagLen=3, tags[0]=2, configs[0]=1",
        b"setConfig clientId=1, tagLen=3, tags[2]=5, configs[2]=1",
        b"setConfig clientId=2, tagLen=2147483647, tags[0]=5, configs[0]=1",
        b"velmoraGetConfig tagLen=256",
        b"velmoraEvent cmdId=-2147483648, payload=2147483647"]) + b"\n"
    seeds["empty_message"] = b"11-23 18:09:30.100  1234  1250 I velmora server:\n" \
        b"11-23 18:09:30.100 I/velmora server( 1234):\n"
    seeds["not_logcat"] = b"velmora server I 11-23 18:14:04 17979 17979 velmoraEvent\n"
    seeds["long_line"] = logcat_line("threadtime", b"11-23 18:09:30.100", 1, 2,
                                     b"velmoraEvent cmdId=" + b"9" * 9000) + b"\n"
    seeds.update(edge_cases(seeds["threadtime_date"]))
    return seeds


def profile_seeds():
    example = read("examples/device/example-device.xml")
    node = b'<node key="a" kind="%s" path="x/%d" allowed="%s" seed="%s"/>'
    seeds = {
        "example": example,
        "rules": b"<device name=\"d\">\n"
                 b"<frequencies id=\"f\" unit=\"kHz\">300 100 200 200</frequencies>\n"
                 b"<governors id=\"g\">schedutil performance</governors>\n"
                 b"<levels min=\"-9223372036854775808\" max=\"9223372036854775807\"/>\n" +
                 b"\n".join(node % (k, i, a, s) for i, (k, a, s) in enumerate([
                     (b"floor", b"frequencies:f", b"150"), (b"cap", b"frequencies:f", b"250"),
                     (b"value", b"frequencies:f", b"300"), (b"text", b"governors:g", b"x"),
                     (b"value", b"levels", b"0"), (b"value", b"decimal", b"0.5"),
                     (b"value", b"-5..5", b"9"), (b"value", b"", b"")])).replace(
                         b'key="a"', b'key="k"') + b"\n</device>\n",
        "bad_absolute": b"<device>\n<node key=\"a\" kind=\"value\" path=\"/sys/x\"/>\n</device>\n",
        "bad_kind": b"<device>\n<node key=\"a\" kind=\"max\" path=\"x\"/>\n</device>\n",
        "bad_twice": b"<device><node key=\"a\" kind=\"value\" path=\"x\"/>"
                     b"<node key=\"a\" kind=\"value\" path=\"y\"/></device>",
        "deep": b"<device>" + nested(2000, b"node") + b"</device>",
    }
    # Keys must differ for the rules seed to load.
    rules = seeds["rules"].split(b"\n")
    seeds["rules"] = b"\n".join(
        l.replace(b'key="k"', b'key="k%d"' % i) for i, l in enumerate(rules))
    seeds.update(edge_cases(example[:600]))
    return seeds


def lint_seeds():
    base = (b"<policy>\n<cmd id=\"5376\" name=\"defaults\"><a><duration>0</duration>"
            b"<group_hmp>10</group_hmp></a></cmd>\n<cmd id=\"4116\" name=\"probe\"><a>"
            b"<duration>50</duration><big_min>1497600</big_min></a></cmd>\n")
    seeds = {"example": read("examples/xml/velmora_config_cust.xml")}
    # Every row of the checker's findings table: a configuration up to its "--" line.
    text = read("tests/lint/findings.txt").decode()
    for m in re.finditer(r"^== (\w+) \d+\n(.*?)^--\n", text, re.S | re.M):
        body = m.group(2).encode()
        if body.startswith(b"@base\n"):
            body = base + body[len(b"@base\n"):] + b"</policy>\n"
        seeds["row_" + m.group(1)] = body
    seeds["deep"] = base + nested(5000) + b"</policy>\n"
    seeds["long_text"] = base + b"<cmd id=\"4099\"><a><duration>" + b"9" * 9000 + \
        b"</duration></a></cmd></policy>\n"
    seeds.update(edge_cases(seeds["example"][:800]))
    return seeds


def main():
    out = sys.argv[1] if len(sys.argv) > 1 else os.path.join(ROOT, "build", "fuzz", "seeds")
    for target, seeds in (("trace", trace_seeds()), ("logcat", logcat_seeds()),
                          ("profile", profile_seeds()), ("lint", lint_seeds())):
        d = os.path.join(out, target)
        os.makedirs(d, exist_ok=True)
        for name, data in seeds.items():
            with open(os.path.join(d, name), "wb") as f:
                f.write(data)
        print("%s: %d seeds" % (target, len(seeds)))


if __name__ == "__main__":
    main()
