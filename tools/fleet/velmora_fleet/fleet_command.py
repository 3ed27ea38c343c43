"""velmora-fleet's command line: finds the sessions, runs them on this machine's cores or on a
Dask cluster, writes OUT/fleet.json and OUT/fleet.html.

Exit status: 0 when every session ran under every configuration, 1 when one or more failed
(each is recorded with its error, the others go on), 2 on a usage error (no session, unknown
option, a configuration directory without xml/velmora_config_cust.xml, an output directory that
cannot be made, a scheduler that cannot be reached)."""
import argparse
import hashlib
import json
import os
import sys
import time

from velmora_fleet.fleet_report import FleetReport
from velmora_fleet.fleet_totals import FleetTotals
from velmora_fleet.progress_line import ProgressLine
from velmora_fleet.session_pool import ClusterError, SessionPool

CONFIG_FILE = os.path.join("xml", "velmora_config_cust.xml")


class UsageError(Exception):
    pass


def parser():
    p = argparse.ArgumentParser(
        prog="velmora-fleet",
        description="Replay recorded sessions under configuration A (and B) and report the "
                    "difference: OUT/fleet.json, OUT/fleet.html.")
    p.add_argument("--config-dir", required=True, metavar="A",
                   help="configuration A: the directory holding xml/velmora_config_cust.xml")
    p.add_argument("--against", metavar="B", help="configuration B, compared with A")
    p.add_argument("--device", metavar="PROFILE", help="device profile for every replay")
    where = p.add_mutually_exclusive_group()
    where.add_argument("-j", "--jobs", type=int, metavar="N",
                       help="replays at a time on this machine (default: every core)")
    where.add_argument("--scheduler", metavar="tcp://HOST:PORT",
                       help="submit the sessions to this Dask scheduler instead")
    p.add_argument("--reports", action="store_true",
                   help="also write each session's replay reports under OUT/sessions/")
    p.add_argument("--replay", metavar="PATH",
                   help="velmora-replay to run (default: the one beside velmora-fleet)")
    p.add_argument("-o", "--out", required=True, metavar="OUT", help="output directory")
    p.add_argument("--version", action="version", version="velmora-fleet @PROJECT_VERSION@")
    p.add_argument("sessions", nargs="+", metavar="SESSION_OR_DIR",
                   help="a trace, or a directory searched for *.trace")
    return p


def find_sessions(paths):
    """Absolute paths of the traces named or found under the directories named, sorted."""
    found = set()
    for path in paths:
        if os.path.isdir(path):
            for root, _, files in os.walk(path):
                found.update(os.path.abspath(os.path.join(root, f))
                             for f in files if f.endswith(".trace"))
        elif os.path.exists(path):
            found.add(os.path.abspath(path))
        else:
            raise UsageError("%s: no such file or directory" % path)
    if not found:
        raise UsageError("no sessions (*.trace) in %s" % " ".join(paths))
    return sorted(found)


def config_dir(path):
    if not os.path.isfile(os.path.join(path, CONFIG_FILE)):
        raise UsageError("%s: no %s" % (path, CONFIG_FILE))
    return os.path.abspath(path)


def report_name(session):
    """The file name stem of a session's own reports: its name and a hash of its path."""
    stem = os.path.splitext(os.path.basename(session))[0]
    return "%s-%s" % (stem, hashlib.sha1(session.encode("utf-8")).hexdigest()[:8])


def make_jobs(args, sessions, configs, replay, out):
    device = os.path.abspath(args.device) if args.device else None
    jobs = []
    for session in sessions:
        reports = None
        if args.reports:
            stem = os.path.join(out, "sessions", report_name(session))
            reports = {"a": stem + ".a.html", "b": stem + ".b.html"}
        jobs.append({"session": session, "replay": replay, "config": configs,
                     "device": device, "reports": reports})
    return jobs


def write_atomically(path, text):
    scratch = path + ".part"
    with open(scratch, "w", encoding="utf-8") as out:
        out.write(text)
    os.replace(scratch, path)


def print_totals(totals):
    """One line per domain: energy and saturated time under A, B and the change."""
    a, b = totals["a"], totals["b"]
    for domain, fa in a["energy"].items():
        line = "  %-11s A: %11.1f mJ, %9.0f ms saturated" % (domain, fa["mJ"], fa["saturated_ms"])
        fb = b["energy"].get(domain) if b else None
        if fb:
            change = 100.0 * (fb["mJ"] - fa["mJ"]) / fa["mJ"] if fa["mJ"] else 0.0
            line += "; B: %11.1f mJ (%+.2f %%), %9.0f ms saturated (%+.0f ms)" % (
                fb["mJ"], change, fb["saturated_ms"], fb["saturated_ms"] - fa["saturated_ms"])
        print(line)
    left = "  left applied A: %d warnings" % a["left_applied"]
    print(left + ("; B: %d" % b["left_applied"] if b else ""))


def fleet_json(fleet):
    """fleet.json's text: compact (the summaries are large; Python's indenting encoder is
    several times slower than the compact one), one session per line."""
    def compact(value):
        return json.dumps(value, separators=(",", ":"))

    head = ",\n".join('"%s":%s' % (key, compact(fleet[key])) for key in ("config_a", "config_b"))
    sessions = ",\n".join(compact(session) for session in fleet["sessions"])
    return '{%s,\n"sessions":[\n%s\n],\n"totals":%s}\n' % (head, sessions,
                                                             compact(fleet["totals"]))


def run(args, replay):
    sessions = find_sessions(args.sessions)
    if args.jobs is not None and args.jobs < 1:
        raise UsageError("-j needs a count of 1 or more")
    if not os.access(replay, os.X_OK):
        raise UsageError("%s: velmora-replay not found (--replay PATH)" % replay)
    configs = {"a": config_dir(args.config_dir),
               "b": config_dir(args.against) if args.against else None}
    if args.device and not os.path.isfile(args.device):
        raise UsageError("%s: no such device profile" % args.device)
    out = os.path.abspath(args.out)
    try:
        os.makedirs(os.path.join(out, "sessions") if args.reports else out, exist_ok=True)
    except OSError as err:
        raise UsageError("cannot make %s: %s" % (args.out, err.strerror))
    jobs = make_jobs(args, sessions, configs, replay, out)

    started = time.monotonic()
    progress = ProgressLine(len(jobs), sys.stderr)
    try:
        if args.scheduler:
            results = SessionPool.dask(jobs, args.scheduler, progress.step)
        else:
            workers = args.jobs or len(os.sched_getaffinity(0))
            results = SessionPool.local(jobs, workers, progress.step)
    except ClusterError as err:
        raise UsageError(str(err))
    progress.finish()
    elapsed = time.monotonic() - started

    results.sort(key=lambda r: r["session"])
    fleet = {"config_a": configs["a"], "config_b": configs["b"],
             "sessions": results,
             "totals": {"a": FleetTotals.of(results, "a"),
                        "b": FleetTotals.of(results, "b") if configs["b"] else None}}
    write_atomically(os.path.join(out, "fleet.json"), fleet_json(fleet))
    links = {}
    if args.reports:
        for job in jobs:
            links[job["session"]] = {side: os.path.relpath(path, out)
                                     for side, path in job["reports"].items()
                                     if os.path.exists(path)}
    write_atomically(os.path.join(out, "fleet.html"), FleetReport(fleet, links).html())

    failed = sum(1 for r in results if r["status"] != "ok")
    print("velmora-fleet: %d sessions, %d failed, %.1f s; %s, %s" % (
        len(results), failed, elapsed, os.path.join(args.out, "fleet.json"),
        os.path.join(args.out, "fleet.html")))
    print_totals(fleet["totals"])
    for r in results:
        if r["status"] != "ok":
            print("velmora-fleet: %s: %s" % (r["session"], r["error"]), file=sys.stderr)
    return 1 if failed else 0


def main(argv, here):
    args = parser().parse_args(argv)
    replay = os.path.abspath(args.replay) if args.replay else os.path.join(here, "velmora-replay")
    try:
        return run(args, replay)
    except UsageError as err:
        print("velmora-fleet: %s" % err, file=sys.stderr)
        return 2
    except OSError as err:
        # The outputs could not be written (a full disk, a directory taken away meanwhile).
        print("velmora-fleet: %s: %s" % (err.filename or args.out, err.strerror),
              file=sys.stderr)
        return 2
    except KeyboardInterrupt:
        print("velmora-fleet: interrupted; nothing written", file=sys.stderr)
        return 130
