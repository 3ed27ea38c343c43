"""The fleet report as a person sees it: loaded in headless chromium, nothing on the console,
every histogram drawn with its bars, the regressions table and the links to the per-session
reports in place. The screenshot is kept (docs/fleet-report.png is one). Skipped without
chromium."""
import html
import json
import os
import re
import shutil
import subprocess

import pytest

from conftest import EXAMPLES, config_b, run, synth, tool

BROWSER = shutil.which("chromium")


def chromium(profile, *args):
    cmd = [BROWSER, "--headless", "--no-sandbox", "--disable-gpu", "--no-first-run",
           "--disable-background-networking", "--disable-component-update", "--disable-sync",
           "--user-data-dir=" + profile, "--enable-logging=stderr", "--v=0",
           "--hide-scrollbars", "--force-device-scale-factor=1"] + list(args)
    done = subprocess.run(cmd, capture_output=True, text=True, timeout=120)
    return done, [line for line in done.stderr.splitlines() if ":CONSOLE" in line]


@pytest.mark.skipif(BROWSER is None, reason="chromium is not installed (scripts/setup)")
def test_the_fleet_report_renders(tmp_path):
    sessions = tmp_path / "sessions"
    synth(sessions, 6, 30000, seed=3)
    out = tmp_path / "out"
    result = run([tool("velmora-fleet"), "--config-dir", EXAMPLES, "--against",
                  config_b(tmp_path / "b"), "--reports", "-o", str(out), str(sessions)])
    assert result.returncode == 0, result.stderr
    report = str(out / "fleet.html")
    text = open(report).read()
    assert not re.search(r"(src|href)\s*=\s*\"(https?:)?//", text), "report refers to the network"
    # A histogram per domain and figure that changed in some session.
    data = json.loads((out / "fleet.json").read_text())
    changed = 0
    for domain in data["totals"]["a"]["energy"]:
        for figure in ("mJ", "saturated_ms"):
            changed += any(s["a"]["energy"][domain][figure] != s["b"]["energy"][domain][figure]
                           for s in data["sessions"])
    assert changed >= 1

    done, console = chromium(str(tmp_path / "profile"), "--window-size=1000,1000",
                             "--dump-dom", "file://" + report)
    assert not console, console
    found = re.search(r'data-hists="([^"]*)"', done.stdout)
    assert found, "the report's script did not run"
    hists = json.loads(html.unescape(found.group(1)))
    assert len(hists) == changed
    for hist in hists:
        assert hist["bars"] >= 1 and hist["w"] > 300 and hist["h"] > 80, hist
    assert done.stdout.count("<tr>") >= 6 + 1  # the regressions, and the totals
    for link in re.findall(r'href="(sessions/[^"]+)"', done.stdout):
        assert os.path.isfile(os.path.join(str(out), link)), link

    shot = str(tmp_path / "fleet-report.png")
    done, console = chromium(str(tmp_path / "profile"), "--window-size=1000,1400",
                             "--screenshot=" + shot, "file://" + report)
    assert not console and os.path.getsize(shot) > 10000
    copy = os.environ.get("VELMORA_FLEET_SCREENSHOT")
    if copy:
        shutil.copyfile(shot, copy)
