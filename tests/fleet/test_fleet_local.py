"""velmora-fleet on this machine: a few generated sessions and a corrupt one under the example
configuration and a what-if copy of it; what reached fleet.json, the exit status, what was
printed, the per-session reports, and usage errors."""
import json
import os
import pty
import subprocess

import pytest

from conftest import EXAMPLES, config_b, run, synth, tool

SESSIONS = 3


@pytest.fixture(scope="module")
def fleet_input(tmp_path_factory):
    root = tmp_path_factory.mktemp("fleet")
    sessions = root / "sessions"
    synth(sessions, SESSIONS, 60000)
    (sessions / "corrupt.trace").write_text("@100 event 20225 0\n@200 frobnicate 3\n")
    return {"root": root, "sessions": str(sessions), "b": config_b(root / "b")}


def fleet(inp, out, *extra):
    return run([tool("velmora-fleet"), "--config-dir", EXAMPLES, "--against", inp["b"],
                "-o", str(out)] + list(extra) + [inp["sessions"]])


@pytest.fixture(scope="module")
def j2(fleet_input):
    out = fleet_input["root"] / "j2"
    result = fleet(fleet_input, out, "-j", "2", "--reports")
    return result, out, json.loads((out / "fleet.json").read_text())


def test_every_session_is_recorded_and_a_corrupt_one_fails_the_run(j2, fleet_input):
    result, _, data = j2
    assert result.returncode == 1, result.stderr
    paths = [s["session"] for s in data["sessions"]]
    assert paths == sorted(paths) and len(paths) == SESSIONS + 1
    statuses = {os.path.basename(s["session"]): s["status"] for s in data["sessions"]}
    assert statuses.pop("corrupt.trace") == "failed"
    assert set(statuses.values()) == {"ok"}
    corrupt = [s for s in data["sessions"] if s["status"] == "failed"][0]
    assert "corrupt.trace:2" in corrupt["error"] and "\n" not in corrupt["error"]
    assert corrupt["a"] is None and corrupt["b"] is None
    # In a pipe: no progress, the failed session named once on stderr, the outputs on stdout.
    assert result.stderr.count("velmora-fleet:") == 1 and "sessions, " not in result.stderr
    assert "corrupt.trace" in result.stderr
    assert "fleet.json" in result.stdout and "1 failed" in result.stdout


def test_summaries_are_those_of_velmora_replay_itself(j2, fleet_input, tmp_path):
    _, _, data = j2
    first = [s for s in data["sessions"] if s["status"] == "ok"][0]
    for side, config in (("a", EXAMPLES), ("b", fleet_input["b"])):
        summary = tmp_path / ("%s.json" % side)
        subprocess.run([tool("velmora-replay"), "--fast", "--quiet", "--config-dir", config,
                        "--summary-json", str(summary), first["session"]],
                       check=True, capture_output=True)
        assert first[side] == json.loads(summary.read_text()), side


def test_totals_add_up_the_sessions_that_ran(j2):
    _, _, data = j2
    ok = [s for s in data["sessions"] if s["status"] == "ok"]
    for side in ("a", "b"):
        totals = data["totals"][side]
        assert totals["sessions"] == len(ok)
        assert totals["calls"] == sum(s[side]["calls"] for s in ok)
        assert totals["left_applied"] == sum(len(s[side]["warnings"]) for s in ok)
        for domain, figures in totals["energy"].items():
            assert figures["mJ"] == pytest.approx(
                sum(s[side]["energy"][domain]["mJ"] for s in ok))


def test_the_what_if_configuration_changes_what_the_device_did(j2):
    _, _, data = j2

    def at_raised_floor(summary):
        node = [n for n in summary["nodes"] if n["key"] == "cpu.big.min"][0]
        return sum(r["ms"] for r in node["residency"] if r["value"] == "2419200")

    ok = [s for s in data["sessions"] if s["status"] == "ok"]
    assert sum(at_raised_floor(s["b"]) - at_raised_floor(s["a"]) for s in ok) > 0
    for session in ok:
        assert at_raised_floor(session["b"]) >= at_raised_floor(session["a"])
    def big_mj(summary):
        return summary["energy"]["cpu.big"]["mJ"]

    assert any(big_mj(s["b"]) > big_mj(s["a"]) for s in ok)
    assert data["totals"]["b"]["energy"]["cpu.big"]["mJ"] > data["totals"]["a"]["energy"]["cpu.big"]["mJ"]


def test_one_or_two_jobs_give_the_same_bytes(j2, fleet_input):
    out = fleet_input["root"] / "j1"
    result = fleet(fleet_input, out, "-j", "1", "--reports")
    assert result.returncode == 1
    assert (out / "fleet.json").read_bytes() == (j2[1] / "fleet.json").read_bytes()


def test_reports_are_written_per_session_and_linked(j2):
    _, out, data = j2
    reports = sorted(os.listdir(out / "sessions"))
    assert len(reports) == 2 * SESSIONS  # none for the corrupt session
    html = (out / "fleet.html").read_text()
    assert html.count('href="sessions/') == 2 * SESSIONS
    assert "corrupt.trace" in html and "frobnicate" in html


def test_progress_shows_on_a_terminal(fleet_input, tmp_path):
    leader, follower = pty.openpty()
    proc = subprocess.Popen([tool("velmora-fleet"), "--config-dir", EXAMPLES, "-j", "2", "-o",
                             str(tmp_path / "out"), fleet_input["sessions"]],
                            stdout=subprocess.DEVNULL, stderr=follower)
    os.close(follower)
    seen = b""
    while True:
        try:
            chunk = os.read(leader, 4096)
        except OSError:
            break
        if not chunk:
            break
        seen += chunk
    proc.wait(timeout=120)
    os.close(leader)
    text = seen.decode()
    assert "%d/%d sessions" % (SESSIONS + 1, SESSIONS + 1) in text and "/s" in text


@pytest.mark.parametrize("args, message", [
    ([], "required"),
    (["--config-dir", "/nonexistent", "-o", "OUT", "SESSIONS"],
     "/nonexistent: no xml/velmora_config"),
    (["--config-dir", EXAMPLES, "-o", "OUT", "/no/such/session"], "/no/such/session: no such"),
    (["--config-dir", EXAMPLES, "-o", "OUT", "-j", "0", "SESSIONS"], "-j needs"),
    (["--config-dir", EXAMPLES, "-o", "OUT", "-j", "2", "--scheduler", "tcp://x:1",
      "SESSIONS"], "not allowed with"),
    (["--config-dir", EXAMPLES, "-o", "OUT", "--frobnicate", "SESSIONS"], "unrecognized"),
    (["--config-dir", EXAMPLES, "-o", "OUT", "EMPTY"], "no sessions"),
    (["--config-dir", EXAMPLES, "-o", "/proc/version/out", "SESSIONS"], "cannot make"),
    (["--config-dir", EXAMPLES, "-o", "OUT", "--scheduler", "tcp://127.0.0.1:9",
      "SESSIONS"], "cannot reach the Dask scheduler"),
])
def test_usage_errors_exit_2_with_one_message(fleet_input, tmp_path, args, message):
    (tmp_path / "empty").mkdir()
    args = [str(tmp_path / "empty") if a == "EMPTY" else
            fleet_input["sessions"] if a == "SESSIONS" else
            str(tmp_path / "out") if a == "OUT" else a for a in args]
    if "--scheduler" in args:
        pytest.importorskip("distributed")
    result = run([tool("velmora-fleet")] + args)
    assert result.returncode == 2, result.stderr
    assert message in result.stderr
    assert not (tmp_path / "out" / "fleet.json").exists()
