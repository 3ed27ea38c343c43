#!/usr/bin/env python3
"""The replay's HTML report as a person sees it: replays the example minute with --report, loads
the report in headless chromium, and checks that every plot was drawn by the inlined plotting
library: the expected number of plots and step lines, each with its unit on the value axis,
ticks in seconds on the time axis and no colour twice, each plot area holding drawn pixels in the
screenshot, and nothing on the browser console. Exits 77 (skipped) when chromium is not
installed.

    report_in_browser.py VELMORA_REPLAY TRACE OUT_DIR [SCREENSHOT_COPY]
"""
import html
import json
import os
import re
import shutil
import struct
import subprocess
import sys
import zlib

# Plots of the report, their step lines and units for the default node map (HtmlReport::groups()),
# then the energy model's: per domain with an energy table (the example device's clusters and
# GPU) its effective and needed frequency, and its power with and without limits.
EXPECTED_SERIES = [2, 2, 2, 1, 2, 1, 9, 1] + [2, 2] * 3
EXPECTED_UNITS = (["MHz", "MHz", "MHz", "MHz", "\u00b0C", "mW", "level", "boosted threads"] +
                  ["MHz", "mW"] * 3)
MIN_TIME_TICKS = 4
MIN_DRAWN_PIXELS = 150  # saturated pixels per plot: a step line across the plot has far more
WIDTH = 1100


def chromium(out_dir, *args):
    cmd = [BROWSER, "--headless", "--no-sandbox", "--disable-gpu", "--disable-quic",
           "--no-first-run", "--disable-background-networking", "--disable-component-update",
           "--disable-sync", "--user-data-dir=" + os.path.join(out_dir, "profile"),
           "--enable-logging=stderr", "--v=0", "--hide-scrollbars",
           "--force-device-scale-factor=1"] + list(args)
    run = subprocess.run(cmd, capture_output=True, text=True, timeout=120)
    console = [line for line in run.stderr.splitlines() if ":CONSOLE" in line]
    return run, console


def read_png(path):
    """RGB rows of an 8-bit RGB or RGBA PNG (what chromium writes)."""
    data = open(path, "rb").read()
    pos, idat, width, height, channels = 8, b"", 0, 0, 0
    while pos < len(data):
        length, kind = struct.unpack(">I4s", data[pos:pos + 8])
        body = data[pos + 8:pos + 8 + length]
        if kind == b"IHDR":
            width, height, depth, colour = struct.unpack(">IIBB", body[:10])
            assert depth == 8 and colour in (2, 6), "unexpected PNG format"
            channels = 3 if colour == 2 else 4
        elif kind == b"IDAT":
            idat += body
        pos += 12 + length
    raw = zlib.decompress(idat)
    stride = width * channels
    rows, prev = [], bytearray(stride)
    for y in range(height):
        kind = raw[y * (stride + 1)]
        line = bytearray(raw[y * (stride + 1) + 1:(y + 1) * (stride + 1)])
        for i in range(stride):
            left = line[i - channels] if i >= channels else 0
            up = prev[i]
            ul = prev[i - channels] if i >= channels else 0
            if kind == 1:
                line[i] = (line[i] + left) & 255
            elif kind == 2:
                line[i] = (line[i] + up) & 255
            elif kind == 3:
                line[i] = (line[i] + (left + up) // 2) & 255
            elif kind == 4:
                p = left + up - ul
                pa, pb, pc = abs(p - left), abs(p - up), abs(p - ul)
                pred = left if pa <= pb and pa <= pc else (up if pb <= pc else ul)
                line[i] = (line[i] + pred) & 255
        rows.append(line)
        prev = line
    return width, height, channels, rows


def drawn_pixels(png, box):
    width, height, channels, rows = png
    count = 0
    for y in range(max(0, int(box["y"])), min(height, int(box["y"] + box["h"]))):
        row = rows[y]
        for x in range(max(0, int(box["x"])), min(width, int(box["x"] + box["w"]))):
            r, g, b = row[x * channels:x * channels + 3]
            if max(r, g, b) - min(r, g, b) > 80:  # a line colour, not white, grey or shading
                count += 1
    return count


def main():
    replay, trace, out_dir = sys.argv[1:4]
    copy = sys.argv[4] if len(sys.argv) > 4 else None
    if BROWSER is None:
        print("skipped: chromium is not installed (scripts/setup installs it)")
        return 77
    shutil.rmtree(out_dir, ignore_errors=True)
    os.makedirs(out_dir)
    report = os.path.join(out_dir, "report.html")
    subprocess.run([replay, "--fast", "--quiet", "--root", os.path.join(out_dir, "device"),
                    "--timeline", os.path.join(out_dir, "timeline.json"),
                    "--event-log", os.path.join(out_dir, "events.log"), "--report", report, trace],
                   check=True, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
    text = open(report).read()
    assert not re.search(r"(src|href)\s*=\s*\"(https?:)?//", text), "report refers to the network"

    run, console = chromium(out_dir, "--window-size=%d,1000" % WIDTH, "--dump-dom",
                            "file://" + report)
    assert not console, "browser console: %s" % console
    found = re.search(r'data-plots="([^"]*)"', run.stdout)
    assert found, "the report's script did not run"
    plots = json.loads(html.unescape(found.group(1)))
    series = [plot["series"] for plot in plots]
    assert series == EXPECTED_SERIES, "plots and lines: %s" % series
    assert [plot["ylabel"] for plot in plots] == EXPECTED_UNITS, plots
    for plot in plots:
        assert plot["w"] > 500 and plot["h"] > 100 and plot["rows"] >= 2, plot
        assert plot["colours"] == plot["series"], "a colour repeats: %s" % plot
        assert plot["xticks"] >= MIN_TIME_TICKS, "too few time ticks: %s" % plot

    height = int(max(p["y"] + p["h"] for p in plots)) + 40
    shot = os.path.join(out_dir, "report.png")
    run, console = chromium(out_dir, "--window-size=%d,%d" % (WIDTH, height),
                            "--screenshot=" + shot, "file://" + report)
    assert not console, "browser console: %s" % console
    png = read_png(shot)
    for i, plot in enumerate(plots):
        drawn = drawn_pixels(png, plot)
        assert drawn >= MIN_DRAWN_PIXELS, "plot %d is blank (%d drawn pixels)" % (i, drawn)
    if copy:
        shutil.copyfile(shot, copy)
    print("report rendered: %d plots, %d lines, screenshot %s" % (len(plots), sum(series), shot))
    return 0


BROWSER = shutil.which("chromium")

if __name__ == "__main__":
    sys.exit(main())
