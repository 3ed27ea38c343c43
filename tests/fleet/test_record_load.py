"""scripts/record-load on this machine's own /proc/stat: the header, one line per sample, every
value in [0, 1], times going forward by about the interval; the domains made of the cpufreq
policies of a sysfs tree (named by order, or by --map), one domain without cpufreq; usage
errors."""
import os
import re

import pytest

from conftest import SOURCE, run

RECORD_LOAD = os.path.join(SOURCE, "scripts", "record-load")
LINE = re.compile(r"^@(\d+) load((?: [a-z0-9._]+=\d\.\d\d)+)$")


def record(*args):
    result = run(["/bin/sh", RECORD_LOAD] + list(args))
    assert result.returncode == 0, result.stderr
    lines = result.stdout.splitlines()
    assert lines[0].startswith("# record-load: clock=")
    samples = []
    for line in lines[1:]:
        match = LINE.match(line)
        assert match, line
        pairs = dict(p.split("=") for p in match.group(2).split())
        assert all(0.0 <= float(v) <= 1.0 for v in pairs.values()), line
        samples.append((int(match.group(1)), pairs))
    return samples, result.stderr


def sysfs(root, policies):
    for policy, cpus in policies.items():
        path = root / "devices" / "system" / "cpu" / "cpufreq" / policy
        path.mkdir(parents=True)
        (path / "related_cpus").write_text(cpus + "\n")
    return str(root)


def test_samples_of_this_machine():
    samples, _ = record("-i", "100", "-n", "4", "--clock", "monotonic")
    assert len(samples) == 4
    times = [t for t, _ in samples]
    assert all(60 <= b - a <= 5000 for a, b in zip(times, times[1:])), times


def test_epoch_times_are_milliseconds_since_1970():
    samples, _ = record("-i", "100", "-n", "1")
    assert 1.6e12 < samples[0][0] < 4e12


@pytest.mark.parametrize("policies, args, ids", [
    ({"policy0": "0", "policy4": "1"}, [], ["cpu.little", "cpu.big"]),
    ({"policy0": "0"}, [], ["cpu"]),
    ({"policy0": "0", "policy2": "1", "policy4": "1", "policy6": "0"}, [],
     ["cpu.little", "cpu.mid", "cpu.mid2", "cpu.big"]),
    ({"policy0": "0", "policy4": "1"}, ["--map", "policy4=cpu.prime,policy0=cpu.small"],
     ["cpu.small", "cpu.prime"]),
    ({"policy0": "0 1", "policy10": "1"}, ["--map", "policy10=cpu.big"], ["cpu.little",
                                                                           "cpu.big"]),
    ({}, [], ["cpu"]),
    ({}, ["--map", "all=cpu.big"], ["cpu.big"]),
])
def test_domains_come_from_the_cpufreq_policies(tmp_path, policies, args, ids):
    root = sysfs(tmp_path, policies)
    samples, stderr = record("-i", "50", "-n", "2", "--sys", root, *args)
    assert [list(pairs) for _, pairs in samples] == [ids, ids]
    assert ("no cpufreq policies" in stderr) == (not policies)


@pytest.mark.parametrize("args, message", [
    (["-i", "fast"], "-i needs a whole number"),
    (["-i", "0"], "positive interval"),
    (["--clock", "wall"], "epoch or monotonic"),
    (["--colour", "red"], "unknown option"),
    (["-n"], "without its value"),
    (["--proc", "/nonexistent"], "cannot read /nonexistent/stat"),
])
def test_bad_options(args, message):
    result = run(["/bin/sh", RECORD_LOAD, "-n", "1"] + args)
    assert result.returncode in (1, 2) and message in result.stderr, result.stderr
    assert result.returncode == (1 if "cannot read" in message else 2)
