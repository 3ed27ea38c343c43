"""velmora-synth: the same seed gives the same sessions, sessions are plausible (the calls the
model makes, load lines in [0, 1] every period, the length asked for) and replay as they are."""
import os
import re

import pytest

from conftest import EXAMPLES, run, tool


def synth(out, *args):
    result = run([tool("velmora-synth"), "-o", str(out)] + list(args))
    assert result.returncode == 0, result.stderr
    return {f: open(os.path.join(str(out), f)).read() for f in sorted(os.listdir(str(out)))}


def test_a_seed_gives_the_same_sessions_and_session_i_has_seed_n_plus_i(tmp_path):
    first = synth(tmp_path / "a", "--seed", "5", "--count", "3", "--duration-ms", "60000")
    again = synth(tmp_path / "b", "--seed", "5", "--count", "3", "--duration-ms", "60000")
    shifted = synth(tmp_path / "c", "--seed", "6", "--count", "1", "--duration-ms", "60000")
    assert list(first) == ["session-0001.trace", "session-0002.trace", "session-0003.trace"]
    assert first == again
    assert shifted["session-0001.trace"] == first["session-0002.trace"]
    assert first["session-0001.trace"] != first["session-0002.trace"]


def test_a_ten_minute_session_is_a_user_s_mix_of_activities(tmp_path):
    text = synth(tmp_path, "--seed", "11")["session-0001.trace"]
    times = [int(t) for t in re.findall(r"^@(\d+)", text, re.M)]
    assert times == sorted(times) and 540000 < times[-1] < 600000 + 240000
    for call in ("event 4099 0", "event 4116 0", "event 4105 0", "event 4119 0", "setconfig 2",
                 "getconfig", "event 4101 0"):
        assert call in text, call
    loads = re.findall(r"^@(\d+) load (.*)$", text, re.M)
    assert [int(t) for t, _ in loads] == [1000 * i for i in range(len(loads))]
    for _, pairs in loads:
        values = dict(p.split("=") for p in pairs.split())
        assert sorted(values) == ["cpu.big", "cpu.little", "gpu"]
        assert all(0.0 <= float(v) <= 1.0 for v in values.values())


@pytest.mark.parametrize("args, loads", [([], True), (["--no-load"], False)])
def test_sessions_replay_as_they_are(tmp_path, args, loads):
    synth(tmp_path, "--seed", "2", "--duration-ms", "30000", *args)
    trace = str(tmp_path / "session-0001.trace")
    assert (" load " in open(trace).read()) == loads
    result = run([tool("velmora-replay"), "--fast", "--quiet", "--config-dir", EXAMPLES, trace])
    assert result.returncode == 0, result.stderr
    assert ("no energy estimate" in result.stdout) != loads


@pytest.mark.parametrize("args, message", [
    ([], "no output directory"),
    (["-o", "X", "--count", "many"], "not a count"),
    (["-o", "X", "--seed"], "needs a value"),
    (["-o", "X", "--colour", "red"], "unknown option"),
    (["-o", "/proc/no/such/dir"], "cannot make"),
])
def test_usage_errors_exit_2(tmp_path, args, message):
    args = [str(tmp_path / "x") if a == "X" else a for a in args]
    result = run([tool("velmora-synth")] + args)
    assert result.returncode == 2 and message in result.stderr, result.stderr
