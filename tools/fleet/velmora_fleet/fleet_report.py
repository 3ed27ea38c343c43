"""The fleet's offline HTML report (one file, nothing fetched): totals per configuration, the
distribution of the per-session energy and saturation deltas per domain, the sessions that
regress most with links to their own replay reports, the warnings only B gave, and the sessions
that failed. Same look as velmora-replay's --report."""
import html
import os

from velmora_fleet.session_delta import SessionDelta

STYLE = (
    "body{font:13px sans-serif;margin:16px;color:#222;background:#fff}"
    "h1{font-size:20px}h2{font-size:16px;margin-top:24px}h3{font-size:13px;margin:10px 0 2px}"
    "svg.hist{display:block;background:#fff}svg .frame{fill:none;stroke:#bbb}"
    "svg rect.bin{fill:#1f6fb4}svg line.zero{stroke:#b00;stroke-dasharray:3 2}"
    "svg text{font-size:11px;fill:#555}table{border-collapse:collapse}"
    "td,th{border-bottom:1px solid #eee;padding:2px 8px;text-align:left;vertical-align:top}"
    "td.num{text-align:right}.warn{color:#b00}.better{color:#070}"
    ".row{display:flex;gap:24px}.same{color:#777;width:440px}")
# Counts the drawn histograms and their bars once laid out, for the browser check.
SELF_CHECK = (
    "window.addEventListener('load',function(){var out=[];"
    "document.querySelectorAll('svg.hist').forEach(function(s){var r=s.getBoundingClientRect();"
    "out.push({x:r.left+window.scrollX,y:r.top+window.scrollY,w:r.width,h:r.height,"
    "bars:s.querySelectorAll('rect.bin').length});});"
    "document.body.setAttribute('data-hists',JSON.stringify(out));});")
BINS = 20
WIDTH, HEIGHT, LEFT, BOTTOM = 440, 120, 40, 18
MOST_REGRESSED = 15


def esc(text):
    return html.escape(str(text), quote=True)


def num(value, digits=1):
    return "%.*f" % (digits, value)


def signed(value, digits=1):
    cls = "warn" if value > 0 else ("better" if value < 0 else "")
    return '<td class="num %s">%+.*f</td>' % (cls, digits, value)


class FleetReport:
    def __init__(self, fleet, report_links):
        """fleet: the fleet.json object; report_links: session -> {"a": href, "b": href}."""
        self.fleet = fleet
        self.links = report_links
        self.deltas = SessionDelta.of(fleet["sessions"])
        # Sessions are named relative to the directory they share.
        paths = [s["session"] for s in fleet["sessions"]]
        self.base = os.path.commonpath([os.path.dirname(p) for p in paths]) if paths else ""

    def name(self, session):
        return os.path.relpath(session, self.base) if self.base else session

    def html(self):
        sessions = self.fleet["sessions"]
        failed = [s for s in sessions if s["status"] != "ok"]
        out = ['<!DOCTYPE html>\n<html><head><meta charset="utf-8"><title>Fleet report</title>'
               "<style>%s</style></head>\n<body>\n<h1>Fleet report</h1>\n" % STYLE,
               "<p>%d sessions in %s, %d failed. A: %s%s</p>\n" % (
                   len(sessions), esc(self.base), len(failed), esc(self.fleet.get("config_a", "")),
                   ("; B: " + esc(self.fleet["config_b"])) if self.fleet.get("config_b") else "")]
        out.append(self._totals())
        if self.deltas:
            out.append(self._distributions())
            out.append(self._regressions())
            out.append(self._new_warnings())
        out.append(self._failed(failed))
        out.append("<script>%s</script>\n</body></html>\n" % SELF_CHECK)
        return "".join(out)

    def _totals(self):
        totals = self.fleet["totals"]
        a, b = totals["a"], totals.get("b")
        out = ["<h2>Totals</h2>\n<table>\n<tr><th></th><th>A</th>"]
        out.append("<th>B</th><th>B &minus; A</th></tr>\n" if b else "</tr>\n")
        rows = [("sessions replayed", "sessions", 0), ("calls", "calls", 0),
                ("left applied (warnings)", "left_applied", 0)]
        for label, key, digits in rows:
            out.append(self._total_row(label, a[key], b[key] if b else None, digits))
        for domain in sorted(set(a["energy"]) | set(b["energy"] if b else ())):
            for label, key in (("energy (mJ)", "mJ"), ("saturated (ms)", "saturated_ms")):
                va = a["energy"].get(domain, {}).get(key, 0.0)
                vb = b["energy"].get(domain, {}).get(key, 0.0) if b else None
                out.append(self._total_row("%s %s" % (domain, label), va, vb, 1))
        if not a["energy"]:
            out.append('<tr><td colspan="4">The sessions have no load lines: no energy to '
                       "add up.</td></tr>\n")
        return "".join(out) + "</table>\n"

    @staticmethod
    def _total_row(label, a, b, digits):
        row = "<tr><th>%s</th><td class=\"num\">%s</td>" % (esc(label), num(a, digits))
        if b is not None:
            row += '<td class="num">%s</td>%s' % (num(b, digits), signed(b - a, digits))
        return row + "</tr>\n"

    def _distributions(self):
        domains = sorted({d for delta in self.deltas for d in delta.energy})
        if not domains:
            return "<h2>Energy and saturation per session</h2>\n<p>No load lines.</p>\n"
        out = ["<h2>Energy and saturation per session (B &minus; A)</h2>\n"]
        for domain in domains:
            out.append('<div class="row">')
            for index, label in ((0, "energy (mJ)"), (1, "saturated time (ms)")):
                values = [delta.energy.get(domain, (0.0, 0.0))[index] for delta in self.deltas]
                out.append("<div><h3>%s %s</h3>\n" % (esc(domain), label))
                if any(values):
                    out.append(histogram(values))
                else:
                    out.append('<p class="same">the same in every session</p>\n')
                out.append("</div>")
            out.append("</div>\n")
        return "".join(out)

    def _regressions(self):
        worst = sorted(self.deltas, key=SessionDelta.regression)[:MOST_REGRESSED]
        domains = sorted({d for delta in self.deltas for d in delta.energy})
        out = ["<h2>Sessions that regress most</h2>\n<table>\n<tr><th>session</th>"
               "<th>energy &Delta; (mJ)</th><th>saturated &Delta; (ms)</th>"]
        out += ["<th>%s &Delta; mJ</th>" % esc(d) for d in domains]
        out.append("<th>new warnings</th><th>reports</th></tr>\n")
        for delta in worst:
            out.append("<tr><td>%s</td>%s%s" % (esc(self.name(delta.session)),
                                                signed(delta.energy_mj()),
                                                signed(delta.saturated_ms())))
            out += [signed(delta.energy.get(d, (0.0, 0.0))[0]) for d in domains]
            out.append('<td class="num">%d</td><td>%s</td></tr>\n' % (
                len(delta.new_warnings), self._report_links(delta.session)))
        return "".join(out) + "</table>\n"

    def _report_links(self, session):
        links = self.links.get(session, {})
        return " ".join('<a href="%s">%s</a>' % (esc(links[side]), side.upper())
                        for side in ("a", "b") if side in links)

    def _new_warnings(self):
        rows = [(delta.session, w) for delta in self.deltas for w in delta.new_warnings]
        out = ["<h2>Left applied only under B</h2>\n"]
        if not rows:
            return out[0] + "<p>None: B leaves nothing applied that A does not.</p>\n"
        out.append("<table>\n<tr><th>session</th><th>kind</th><th>warning</th></tr>\n")
        for session, warning in rows:
            out.append('<tr><td>%s</td><td>%s</td><td class="warn">%s</td></tr>\n' % (
                esc(self.name(session)), esc(warning.get("kind", "")),
                esc(warning.get("message", ""))))
        return "".join(out) + "</table>\n"

    def _failed(self, failed):
        if not failed:
            return ""
        out = ["<h2>Failed sessions</h2>\n<ul>\n"]
        out += ['<li>%s: <span class="warn">%s</span></li>\n' % (esc(self.name(s["session"])),
                                                                  esc(s["error"]))
                for s in failed]
        return "".join(out) + "</ul>\n"


def histogram(values):
    """An SVG histogram of `values` in BINS bins, a dashed line at zero."""
    lo, hi = min(values + [0.0]), max(values + [0.0])
    if hi == lo:
        hi = lo + 1.0
    counts = [0] * BINS
    for value in values:
        counts[min(BINS - 1, int((value - lo) / (hi - lo) * BINS))] += 1
    top = max(counts)
    plot_w, plot_h = WIDTH - LEFT - 4, HEIGHT - BOTTOM - 4

    def x(value):
        return LEFT + (value - lo) / (hi - lo) * plot_w

    out = ['<svg class="hist" width="%d" height="%d" viewBox="0 0 %d %d">\n'
           '<rect class="frame" x="%d" y="2" width="%d" height="%d"/>\n' % (
               WIDTH, HEIGHT, WIDTH, HEIGHT, LEFT, plot_w, plot_h)]
    bin_w = plot_w / BINS
    for i, count in enumerate(counts):
        if count == 0:
            continue
        h = max(1.0, plot_h * count / top)
        out.append('<rect class="bin" x="%.1f" y="%.1f" width="%.1f" height="%.1f">'
                   "<title>%d sessions</title></rect>\n" % (
                       LEFT + i * bin_w + 1, 2 + plot_h - h, bin_w - 2, h, count))
    out.append('<line class="zero" x1="%.1f" x2="%.1f" y1="2" y2="%d"/>\n' % (
        x(0.0), x(0.0), 2 + plot_h))
    out.append('<text x="2" y="12">%d</text><text x="%d" y="%d">%s</text>'
               '<text x="%d" y="%d" text-anchor="end">%s</text>\n</svg>\n' % (
                   top, LEFT, HEIGHT - 4, num(lo), WIDTH - 4, HEIGHT - 4, num(hi)))
    return "".join(out)
