"""The work of one session: velmora-replay --fast --summary-json under configuration A and,
when given, under B, each a process of its own on a fresh simulated device.

This module is the only code that runs on a Dask worker: it is shipped to the workers by value
and needs nothing but the standard library there, and velmora-replay, the sessions and the
configurations at the same paths as on the machine that submits the work. The local pool calls
the same function, so a session gives the same result wherever it ran.
"""
import json
import os
import subprocess
import tempfile

SIDES = ("a", "b")


def run_session(job):
    """Replays job["session"] under each configuration of the job.

    job: {"session": absolute trace path, "replay": velmora-replay, "config": {"a": DIR,
    "b": DIR or None}, "device": PROFILE or None, "reports": {"a": FILE, "b": FILE} or None}.
    Returns {"session", "status": "ok"|"failed", "error", "a", "b"} where "a" and "b" are the
    replays' --summary-json objects (None for a side not replayed or failed) and "error" the
    first failure, one line, prefixed with its side.
    """
    result = {"session": job["session"], "status": "ok", "error": ""}
    for side in SIDES:
        result[side] = None
        config = job["config"].get(side)
        if config is None:
            continue
        report = job["reports"][side] if job.get("reports") else None
        summary, error = _replay(job, config, report)
        if error:
            if result["status"] == "ok":
                result["status"] = "failed"
                result["error"] = "%s: %s" % (side.upper(), error)
            continue
        result[side] = summary
    return result


def _replay(job, config, report):
    """(summary, None) or (None, one line saying what went wrong)."""
    with tempfile.TemporaryDirectory(prefix="velmora-fleet-") as scratch:
        summary_path = os.path.join(scratch, "summary.json")
        cmd = [job["replay"], "--fast", "--quiet", "--config-dir", config,
               "--root", os.path.join(scratch, "device"), "--summary-json", summary_path]
        if job.get("device"):
            cmd += ["--device", job["device"]]
        if report:
            cmd += ["--report", report]
        cmd.append(job["session"])
        try:
            run = subprocess.run(cmd, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                                 stderr=subprocess.PIPE, check=False)
        except OSError as err:
            return None, "cannot run %s: %s" % (job["replay"], err.strerror)
        if run.returncode != 0:
            return None, _last_line(run.stderr) or "velmora-replay exit status %d" % run.returncode
        try:
            with open(summary_path, encoding="utf-8") as summary:
                return json.load(summary), None
        except (OSError, ValueError) as err:
            return None, "no summary from velmora-replay: %s" % err


def _last_line(stderr):
    """The replay's last error line (its own messages only: the server log is not shown)."""
    lines = [line.strip() for line in stderr.decode("utf-8", "replace").splitlines()]
    errors = [line for line in lines if line and "warning:" not in line]
    return (errors or [""])[-1]
